#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <string>

#include "platform/platform.h"

namespace vox::platform {
namespace {

TEST(SystemError, TextIsOneLineAndEmptyForNoErrorOrAnUnknownCode) {
  EXPECT_EQ(SystemErrorText(0), "");
  EXPECT_EQ(SystemErrorText(ENOENT), "No such file or directory");
  EXPECT_EQ(SystemErrorText(999999), "");
  EXPECT_EQ(SystemErrorText(0xFFFFFFFFu), "");

  SetLastSystemError(EACCES);
  EXPECT_EQ(LastSystemError(), static_cast<uint32_t>(EACCES));
  SetLastSystemError(0);
  EXPECT_EQ(LastSystemError(), 0u);
}

TEST(PathFromWide, EncodesEveryPlaneAsUtf8AndReplacesWhatIsNoCharacter) {
  EXPECT_EQ(PathFromWide(nullptr), "");
  EXPECT_EQ(PathFromWide(L"job.txt"), "job.txt");
  EXPECT_EQ(PathFromWide(L"\u00e9\u20ac\U0001F600"),
            "\xC3\xA9"
            "\xE2\x82\xAC"
            "\xF0\x9F\x98\x80");
  const wchar_t broken[] = {L'a', static_cast<wchar_t>(0xD800), static_cast<wchar_t>(0x110000),
                            L'b', 0};
  EXPECT_EQ(PathFromWide(broken), "a??b");
}

TEST(Clock, LocalTimeLagsUtcByTheTimeZoneValue) {
  const char* saved = getenv("TZ");
  std::string saved_value = saved != nullptr ? saved : "";
  setenv("TZ", "EST5", 1);  // five hours west, no daylight saving
  long zone = TimeZoneSeconds();
  UtcDateTime utc = UtcClock();
  LocalDateTime local = LocalClock();
  if (saved != nullptr) {
    setenv("TZ", saved_value.c_str(), 1);
  } else {
    unsetenv("TZ");
  }
  TimeZoneSeconds();

  EXPECT_EQ(zone, 5 * 3600);
  int utc_minutes = utc.hour * 60 + utc.minute;
  int local_minutes = local.hour * 60 + local.minute;
  int lag = ((utc_minutes - local_minutes) % 1440 + 1440) % 1440;
  // A minute may tick between the two readings.
  EXPECT_TRUE(lag == 300 || lag == 299 || lag == 301) << lag;
  EXPECT_GE(local.month, 1);
  EXPECT_LE(local.month, 12);
}

}  // namespace
}  // namespace vox::platform
