#include "base/buf_file.h"

#include <gtest/gtest.h>
#ifndef _WIN32
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>
#endif

#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>
#include <vector>

namespace vox {
namespace {

namespace fs = std::filesystem;

class BufFileTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string pattern = (fs::temp_directory_path() / "buf_file_test_XXXXXX").string();
    ASSERT_NE(mkdtemp(pattern.data()), nullptr);
    dir_ = pattern;
  }
  void TearDown() override { fs::remove_all(dir_); }

  std::string Path(const char* name) const { return (dir_ / name).string(); }

  std::string MakeFile(const char* name, const std::string& bytes) const {
    std::ofstream(Path(name), std::ios::binary) << bytes;
    return Path(name);
  }
  static std::string Slurp(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
  }
  static std::string RandomBytes(size_t n) {
    std::mt19937 rng(12345);
    std::string s(n, '\0');
    for (auto& c : s)
      c = static_cast<char>(rng());
    return s;
  }

  fs::path dir_;
};

// Reads the file back in a mix of chunk sizes, single bytes and lines, then seeks back into
// the data already read and before it; returns everything read in order.
std::string ReadPattern(TBufFile& file) {
  std::string out;
  const uint32_t chunks[] = {1, 7, 4095, 4097, 333, 9000, 2};
  size_t i = 0;
  for (;;) {
    std::vector<char> chunk(chunks[i++ % std::size(chunks)]);
    const uint32_t n = file.Read(chunk.data(), static_cast<uint32_t>(chunk.size()));
    out.append(chunk.data(), n);
    if (n < chunk.size()) break;
    const int byte = file.ReadByte();
    if (byte < 0) break;
    out.push_back(static_cast<char>(byte));
  }
  return out;
}

TEST_F(BufFileTest, MappedAndBufferedReadingDeliverTheSameBytes) {
  const std::string data = RandomBytes(50000);
  const std::string path = MakeFile("data.bin", data);

  for (bool mapping : {true, false}) {
    SCOPED_TRACE(mapping ? "mapped" : "buffered");
    TBufFile file;
    file.set_mapping_allowed(mapping);
    ASSERT_TRUE(file.OpenRead(path));
    EXPECT_EQ(file.mapped(), mapping);
    EXPECT_EQ(file.file_size(), data.size());
    if (!mapping) {
      EXPECT_GE(file.buffer_size(), 4096u);
      EXPECT_LE(file.buffer_size(), 65536u);
    }
    EXPECT_EQ(ReadPattern(file), data);
    EXPECT_EQ(file.status(), kFileEof);
  }

  // Seeks: into the current buffer, to a block behind it, to the start, and skipping reads.
  for (bool mapping : {true, false}) {
    SCOPED_TRACE(mapping ? "mapped" : "buffered");
    TBufFile file;
    file.set_mapping_allowed(mapping);
    ASSERT_TRUE(file.OpenRead(path));
    char buf[600];
    ASSERT_EQ(file.Read(nullptr, 30000), 30000u);  // null destination skips
    ASSERT_EQ(file.Read(buf, 100), 100u);
    EXPECT_EQ(std::string(buf, 100), data.substr(30000, 100));
    // With 4 KiB blocks, 30050 and 29000 lie in the current block; 100 and 0 re-read block 0.
    const int32_t offsets[] = {30050, 29000, 100, 0, 4095, 4096, 49990};
    for (int32_t offset : offsets) {
      file.Seek(offset);
      EXPECT_EQ(file.tell(), offset);
      const uint32_t want = std::min<uint32_t>(600, static_cast<uint32_t>(data.size() - offset));
      ASSERT_EQ(file.Read(buf, want), want) << offset;
      EXPECT_EQ(std::string(buf, want), data.substr(offset, want)) << offset;
      EXPECT_EQ(file.ReadByte(),
                offset + want < data.size() ? static_cast<uint8_t>(data[offset + want]) : -1);
    }
  }
}

TEST_F(BufFileTest, ShortReadSetsEndOfFileAndStopsFurtherReads) {
  const std::string path = MakeFile("ten.bin", "0123456789");
  for (bool mapping : {true, false}) {
    SCOPED_TRACE(mapping ? "mapped" : "buffered");
    TBufFile file;
    file.set_mapping_allowed(mapping);
    ASSERT_TRUE(file.OpenRead(path));
    char buf[6];
    EXPECT_EQ(file.Read(buf, 6), 6u);
    EXPECT_EQ(file.status(), 0);
    EXPECT_EQ(file.Read(buf, 6), 4u);
    EXPECT_EQ(std::string(buf, 4), "6789");
    EXPECT_EQ(file.status(), kFileEof);
    EXPECT_EQ(file.last_count(), 4u);
    // The end is sticky: even a seek back reads nothing until the file is opened again.
    file.Seek(0);
    EXPECT_EQ(file.Read(buf, 6), 0u);
    EXPECT_EQ(file.ReadByte(), -1);
  }
}

TEST_F(BufFileTest, ReadLine) {
  const std::string path = MakeFile("lines.txt", "first\nsecond line\n\nlast");
  for (bool mapping : {true, false}) {
    SCOPED_TRACE(mapping ? "mapped" : "buffered");
    TBufFile file;
    file.set_mapping_allowed(mapping);
    ASSERT_TRUE(file.OpenRead(path));
    char line[8];
    EXPECT_EQ(file.ReadLine(line, sizeof line, '\n'), 6u);  // terminator consumed
    EXPECT_STREQ(line, "first");
    EXPECT_EQ(file.ReadLine(line, sizeof line, '\n'), 7u);  // capacity - 1 bytes, no terminator
    EXPECT_STREQ(line, "second ");
    EXPECT_EQ(file.ReadLine(line, sizeof line, '\n'), 5u);
    EXPECT_STREQ(line, "line");
    EXPECT_EQ(file.ReadLine(line, sizeof line, '\n'), 1u);
    EXPECT_STREQ(line, "");
    EXPECT_EQ(file.ReadLine(line, sizeof line, '\n'), 4u);  // last line without terminator
    EXPECT_STREQ(line, "last");
    EXPECT_EQ(file.ReadLine(line, sizeof line, '\n'), 0u);
    EXPECT_STREQ(line, "");
  }
}

TEST_F(BufFileTest, OpenFailureStopsEveryLaterOperation) {
  TBufFile reader;
  EXPECT_FALSE(reader.OpenRead(Path("missing.bin")));
  EXPECT_EQ(reader.status(), kFileOpenFailed);
  char buf[16] = "x";
  EXPECT_EQ(reader.Read(buf, sizeof buf), 0u);
  EXPECT_EQ(reader.ReadByte(), -1);
  EXPECT_EQ(reader.ReadLine(buf, sizeof buf, '\n'), 0u);
  EXPECT_STREQ(buf, "");
  EXPECT_FALSE(reader.Close());
  EXPECT_EQ(reader.status(), 0);  // back to the created state

  TBufFile folder;
  EXPECT_FALSE(folder.OpenRead(dir_.string()));
  EXPECT_EQ(folder.status(), kFileOpenFailed);

  TBufFile writer;
  EXPECT_FALSE(writer.OpenWrite(Path("no/such/folder.bin")));
  EXPECT_EQ(writer.status(), kFileOpenFailed);
  EXPECT_EQ(writer.Write("abc", 3), 0u);
  EXPECT_EQ(writer.WriteByte('a'), 0u);
  EXPECT_FALSE(writer.Close());
}

TEST_F(BufFileTest, WriteModes) {
  const std::string path = MakeFile("out.txt", "old content");

  TBufFile file;
  ASSERT_TRUE(file.OpenWrite(path, 130));  // plain write with a carried bit: starts empty
  EXPECT_EQ(file.mode(), 130u);
  EXPECT_EQ(file.file_size(), 0u);
  file.WriteText("hello world");
  file.Seek(0);
  file.WriteByte('J');
  EXPECT_TRUE(file.Close());
  EXPECT_EQ(Slurp(path), "Jello world");

  ASSERT_TRUE(file.OpenWrite(path, kFileWrite | kFileAtEnd));
  EXPECT_EQ(file.tell(), 11);
  file.WriteText("!!");
  file.Seek(0);  // continuing at the end is where it starts, not a rule for every write
  file.Write("M", 1);
  EXPECT_TRUE(file.Close());
  EXPECT_EQ(Slurp(path), "Mello world!!");

  ASSERT_TRUE(file.OpenWrite(path, kFileWrite | kFileAppend));
  file.Write("ab", 2);
  file.Seek(0);
  file.Write("cd", 2);
  file.Seek(3);
  file.WriteByte('e');
  EXPECT_EQ(file.file_size(), 18u);
  EXPECT_TRUE(file.Close());
  EXPECT_EQ(Slurp(path), "Mello world!!abcde");

  // Writes larger than the buffer, then a rewrite across a buffer boundary.
  const std::string big = RandomBytes(100000);
  ASSERT_TRUE(file.OpenWrite(path));
  EXPECT_EQ(file.Write(big.data(), 70000), 70000u);
  EXPECT_EQ(file.Write(big.data() + 70000, 30000), 30000u);
  file.Seek(4090);
  file.WriteText("0123456789ABCDEF");
  EXPECT_TRUE(file.Close());
  std::string expected = big;
  expected.replace(4090, 16, "0123456789ABCDEF");
  EXPECT_EQ(ReadWholeFile(path), expected);
}

// Writes of a buffer or more skip the buffer; the bytes waiting before them must still come
// first, and seeks back over data written either way must rewrite the right bytes.
TEST_F(BufFileTest, LargeWritesBetweenSmallOnesKeepTheirPlace) {
  const std::string bytes = RandomBytes(8 * 65536 + 1000);
  const std::string path = Path("mixed.bin");
  for (const uint32_t buffer : {0u, 4096u, 65536u}) {
    SCOPED_TRACE("buffer " + std::to_string(buffer));
    TBufFile file;
    file.set_write_buffer_size(buffer);
    ASSERT_TRUE(file.OpenWrite(path));
    if (buffer != 0) {
      EXPECT_EQ(file.buffer_size(), buffer);
    }
    const uint32_t size = file.buffer_size();
    // Small, exactly one buffer, small, just over a buffer, one byte, a large piece while
    // the buffer is nearly full, then the rest.
    const uint32_t pieces[] = {10, size, 3, size + 1, 1, size - 20, 10, 3 * size + 5};
    uint32_t at = 0;
    for (const uint32_t n : pieces) {
      ASSERT_EQ(file.Write(bytes.data() + at, n), n);
      at += n;
      EXPECT_EQ(file.tell(), static_cast<int32_t>(at));
    }
    file.Write(bytes.data() + at, static_cast<uint32_t>(bytes.size()) - at);
    EXPECT_EQ(file.file_size(), bytes.size());
    std::string expected = bytes;
    // Back into the middle of a large write, a rewrite longer than the buffer, then small.
    file.Seek(static_cast<int32_t>(size + 7));
    const std::string patch = RandomBytes(size + 100).substr(50);
    file.Write(patch.data(), static_cast<uint32_t>(patch.size()));
    expected.replace(size + 7, patch.size(), patch);
    file.Seek(5);
    file.WriteText("xyz");
    expected.replace(5, 3, "xyz");
    EXPECT_TRUE(file.Close());
    EXPECT_TRUE(ReadWholeFile(path) == expected);
  }
}

// A file size limit makes the OS accept only part of a write, as a full disk would (set in a
// forked child: POSIX only).
#ifndef _WIN32
TEST_F(BufFileTest, ShortWriteSetsTheErrorStatus) {
  const std::string path = Path("limited.bin");
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    signal(SIGXFSZ, SIG_IGN);
    rlimit limit{10000, 10000};
    if (setrlimit(RLIMIT_FSIZE, &limit) != 0) _exit(10);
    std::string bytes(30000, 'x');
    TBufFile file;
    if (!file.OpenWrite(path)) _exit(11);
    file.Write(bytes.data(), static_cast<uint32_t>(bytes.size()));
    file.Flush();
    if ((file.status() & kFileIoFailed) == 0) _exit(12);
    if (file.Write("more", 4) != 0) _exit(13);  // nothing happens after a failure
    if (file.Close()) _exit(14);                // and closing reports it
    // A write larger than the buffer, which goes to the OS in one call, fails the same way
    // and counts only the bytes the OS took.
    if (!file.OpenWrite(path)) _exit(15);
    if (file.Write(bytes.data(), static_cast<uint32_t>(bytes.size())) != 10000) _exit(16);
    if ((file.status() & kFileIoFailed) == 0) _exit(17);
    if (file.Write(bytes.data(), static_cast<uint32_t>(bytes.size())) != 0) _exit(18);
    if (file.Close()) _exit(19);
    _exit(0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), 0);
  EXPECT_LE(fs::file_size(path), 10000u);
}
#endif  // _WIN32

TEST(BufferSizeRule, VolumesAndPaths) {
  platform::VolumeInfo info;
  EXPECT_EQ(BufferSizeForVolume(info), 4096u);  // unknown volume
  info.known = true;
  info.cluster_bytes = 512 * 8;
  EXPECT_EQ(BufferSizeForVolume(info), 4096u);
  info.cluster_bytes = 1024;
  EXPECT_EQ(BufferSizeForVolume(info), 4096u);
  info.cluster_bytes = 16384;
  EXPECT_EQ(BufferSizeForVolume(info), 16384u);
  info.cluster_bytes = 128 * 1024;
  EXPECT_EQ(BufferSizeForVolume(info), 65536u);
  info.remote = true;
  EXPECT_EQ(BufferSizeForVolume(info), 1500u);

  EXPECT_EQ(BufferSizeForPath(""), 4096u);
  EXPECT_EQ(BufferSizeForPath("\\\\server\\share\\job.txt"), 1500u);
}

TEST_F(BufFileTest, ReadWholeFile) {
  const std::string data = RandomBytes(70000);
  EXPECT_EQ(ReadWholeFile(MakeFile("job.txt", data)), data);
  EXPECT_EQ(ReadWholeFile(MakeFile("empty.txt", "")), "");
  EXPECT_EQ(ReadWholeFile(Path("missing.txt")), "");
}

}  // namespace
}  // namespace vox
