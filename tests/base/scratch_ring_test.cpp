#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <thread>

#include "base/scratch_ring.h"
#include "base/short_text.h"
#include "platform/platform.h"

namespace vox {
namespace {

size_t OffsetIn(const char* p) {
  return static_cast<size_t>(reinterpret_cast<const uint8_t*>(p) - ScratchRingBlock());
}

TEST(ScratchRing, TakesWrapToTheStartWhenTheRequestDoesNotFit) {
  TakeFromRing(1);
  const char* first = TakeFromRing(10000);
  EXPECT_EQ(OffsetIn(first), kScratchRingFirstOffset + 1);
  const char* second = TakeFromRing(10000);
  EXPECT_EQ(OffsetIn(second), kScratchRingFirstOffset);
  EXPECT_EQ(ScratchRingOffset(ScratchRingBlock()), kScratchRingFirstOffset + 10000);
  // Exactly filling the ring does not wrap.
  const char* rest = TakeFromRing(kScratchRingBytes - 10004);
  EXPECT_EQ(OffsetIn(rest), 10004u);
  EXPECT_EQ(OffsetIn(TakeFromRing(1)), kScratchRingFirstOffset);
  // A request larger than the whole ring is refused instead of running past the block.
  EXPECT_EQ(TakeFromRing(kScratchRingBytes), nullptr);
  EXPECT_NE(TakeFromRing(kScratchRingMaxTake), nullptr);
}

TEST(ShortText, CopyAndFormatAreCutTo255Bytes) {
  const std::string long_text(300, 'x');
  const char* copy = ShortCopy(long_text.c_str());
  EXPECT_EQ(ShortTextLength(copy), 255u);
  EXPECT_EQ(std::string(copy), long_text.substr(0, 255));

  const std::string wide(400, 'y');
  const char* formatted = ShortFormat("%s|", wide.c_str());
  EXPECT_EQ(ShortTextLength(formatted), 255u);
  EXPECT_EQ(std::string(formatted), wide.substr(0, 255));

  const char* small = ShortFormat("%d-%s", 42, "ab");
  EXPECT_STREQ(small, "42-ab");
  EXPECT_EQ(ShortTextLength(small), 5u);
  EXPECT_STREQ(ShortCopy(nullptr), "");
  EXPECT_EQ(ShortFormat(nullptr)[0], '\0');
}

TEST(ShortText, FormatWrapsWhenLessThanItsReserveIsLeft) {
  // Leave 999 bytes: the format wraps to the start although its text is short.
  TakeFromRing(kScratchRingBytes);  // refused, changes nothing
  const char* fill = TakeFromRing(1);
  const size_t at = OffsetIn(fill);
  TakeFromRing(kScratchRingBytes - 999 - at - 1);
  EXPECT_EQ(ScratchRingOffset(ScratchRingBlock()), kScratchRingBytes - 999);
  const char* text = ShortFormat("abc");
  EXPECT_EQ(OffsetIn(text), kScratchRingFirstOffset + 1);
  EXPECT_EQ(ScratchRingOffset(ScratchRingBlock()), kScratchRingFirstOffset + 5);
  // With exactly 1000 left it stays in place.
  TakeFromRing(kScratchRingBytes - 1000 - (kScratchRingFirstOffset + 5));
  EXPECT_EQ(OffsetIn(ShortFormat("x")), kScratchRingBytes - 1000 + 1);
}

TEST(ShortText, ThreadsFormatIntoTheirOwnRings) {
  auto work = [](char letter, bool* ok) {
    *ok = true;
    for (int i = 0; i < 20000; ++i) {
      const char* text = ShortFormat("%c%d%c", letter, i, letter);
      const std::string expected = letter + std::to_string(i) + letter;
      std::this_thread::yield();
      if (expected != text) *ok = false;
    }
  };
  bool ok_a = false, ok_b = false;
  std::thread a(work, 'a', &ok_a);
  std::thread b(work, 'b', &ok_b);
  a.join();
  b.join();
  EXPECT_TRUE(ok_a);
  EXPECT_TRUE(ok_b);
}

TEST(ShortText, SystemErrorTexts) {
  EXPECT_EQ(SystemErrorText(0), nullptr);
  platform::SetLastSystemError(0);
  EXPECT_EQ(LastErrorText(), nullptr);
  EXPECT_EQ(LastErrorString(), "");
  const std::string expected = platform::SystemErrorText(2);
  const char* text = SystemErrorText(2);
  ASSERT_NE(text, nullptr);
  EXPECT_EQ(std::string(text), expected.substr(0, 255));
  platform::SetLastSystemError(2);
  EXPECT_EQ(LastErrorString(), expected.substr(0, 255));
}

}  // namespace
}  // namespace vox
