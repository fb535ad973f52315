// The result file when the disk misbehaves under it: the disk fills up part-way (a file-size
// limit in a child process), or its folder disappears before the job closes it; and thread
// files that cannot be created. In every case the writer must say it failed, and what is left
// on disk must be a clean run of complete records.
#include <gtest/gtest.h>
#ifndef _WIN32
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>
#endif

#include <filesystem>
#include <string>
#include <vector>

#include "platform/platform.h"
#include "results/result_file.h"
#include "run/engine_threads.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"

namespace vox {
namespace {

namespace fs = std::filesystem;

std::vector<uint8_t> ReadAll(const std::string& path) {
  const std::string text = test::ReadFile(path);
  return {text.begin(), text.end()};
}

uint16_t Load16(const uint8_t* p) {
  return static_cast<uint16_t>(p[0] | p[1] << 8);
}

// The records of a result file's bytes; fails the test on anything that is not a clean
// sequence of whole frames from the header on.
std::vector<uint8_t> FramedKinds(const std::vector<uint8_t>& bytes) {
  std::vector<uint8_t> kinds;
  size_t at = 0;
  while (at < bytes.size()) {
    EXPECT_GE(bytes.size() - at, 5u) << "a cut frame at " << at;
    if (bytes.size() - at < 5) break;
    const uint16_t length = Load16(&bytes[at + 1]);
    EXPECT_TRUE(length >= 5 && length <= bytes.size() - at) << "a cut frame at " << at;
    if (length < 5 || length > bytes.size() - at) break;
    EXPECT_EQ(Load16(&bytes[at + length - 2]), length) << "a broken frame at " << at;
    kinds.push_back(bytes[at]);
    at += length;
  }
  if (!kinds.empty()) {
    EXPECT_EQ(kinds.front(), kKindHeader);
  }
  return kinds;
}

class ResultFileFaultTest : public ::testing::Test {
 protected:
  test::ScratchDir scratch_;
};

// A full disk is simulated with a file-size limit in a forked child, and a folder holding an
// open file cannot be removed on Windows: both cases run on POSIX only.
#ifndef _WIN32
// Runs body in a child process whose files may not grow beyond limit bytes (writes beyond it
// fail as on a full disk); returns the child's exit status.
template <typename Body>
int WithFileSizeLimit(rlim_t limit, Body body) {
  const pid_t child = fork();
  if (child == 0) {
    signal(SIGXFSZ, SIG_IGN);
    const rlimit r{limit, limit};
    setrlimit(RLIMIT_FSIZE, &r);
    _exit(body());
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

TEST_F(ResultFileFaultTest, AFullDiskFailsTheCloseAndLeavesOnlyWholeRecords) {
  const std::string path = scratch_.File("full.res");
  std::vector<uint8_t> payload(997);
  for (size_t i = 0; i < payload.size(); ++i)
    payload[i] = static_cast<uint8_t>(i);
  // Limits that fall inside the header, inside a record, on a record's end, and beyond the
  // first buffer's worth of data.
  for (rlim_t limit :
       {rlim_t{7}, rlim_t{15 + 500}, rlim_t{15 + 2 * 1002}, rlim_t{70001}, rlim_t{300007}}) {
    SCOPED_TRACE("file size limit " + std::to_string(limit));
    const int status = WithFileSizeLimit(limit, [&] {
      TResultFile f(path);
      if (!f.Open()) return 3;
      for (int i = 0; i < 400; ++i)
        f.WriteRecord(kKindVector, payload.data(), payload.size());
      return f.Close() ? 0 : 1;
    });
    EXPECT_EQ(status, 1) << "the close must report the lost records";
    const std::vector<uint8_t> bytes = ReadAll(path);
    EXPECT_LE(bytes.size(), limit);
    const std::vector<uint8_t> kinds = FramedKinds(bytes);
    // No end record: the file is incomplete and says so.
    EXPECT_TRUE(kinds.empty() || kinds.back() != kKindEnd);
  }
}

TEST_F(ResultFileFaultTest, AFileWhoseFolderIsGoneIsNotReportedAsWritten) {
  const fs::path folder = scratch_.path() / "results";
  fs::create_directories(folder);
  TResultFile f((folder / "job.res").string());
  ASSERT_TRUE(f.Open());
  ASSERT_TRUE(f.WriteMessage("before the folder went", 1));
  fs::remove_all(folder);
  f.WriteMessage("after the folder went", 1);
  EXPECT_FALSE(f.Close());
  EXPECT_FALSE(fs::exists(folder / "job.res"));
}
#endif  // _WIN32

TEST_F(ResultFileFaultTest, AThreadFileThatIsCutShortGivesOnlyItsWholeRecords) {
  const std::string thread_path = scratch_.File("thread.tmp");
  {
    TResultFile t(thread_path);
    ASSERT_TRUE(t.Open());
    for (int i = 0; i < 10; ++i)
      t.WriteMessage(("thread record " + std::to_string(i)).c_str(), 1);
    ASSERT_TRUE(t.Close());
  }
  const std::vector<uint8_t> whole = ReadAll(thread_path);
  const std::vector<uint8_t> kinds = FramedKinds(whole);
  ASSERT_EQ(kinds.size(), 12u);  // header, ten messages, end

  // Cut at every byte: the merge copies exactly the records that are whole before the cut.
  size_t previous = 0;
  for (size_t cut = 0; cut <= whole.size(); ++cut) {
    test::WriteFile(thread_path, std::string(whole.begin(), whole.begin() + cut));
    TResultFile job(scratch_.File("job.res"));
    ASSERT_TRUE(job.Open());
    const size_t copied = job.Append(thread_path);
    ASSERT_TRUE(job.Close());
    const std::vector<uint8_t> merged = FramedKinds(ReadAll(scratch_.File("job.res")));
    ASSERT_EQ(merged.size(), copied + 2) << "cut at " << cut;
    EXPECT_GE(copied, previous);
    EXPECT_LE(copied, 10u);
    previous = copied;
  }
  EXPECT_EQ(previous, 10u);
}

// A thread writer whose temporary file cannot be created (its folder is gone) loses its own
// records and nothing else: the task's records and another thread's stay whole.
TEST_F(ResultFileFaultTest, AThreadFileThatCannotBeCreatedCostsOnlyItsOwnRecords) {
  test::TempDirEnv temp(scratch_, false);
  TTask task;
  task.result_file.set_path(scratch_.File("job.res"));
  ASSERT_TRUE(task.result_file.Open());
  TheRun().current_task.store(&task);

  vox_ThreadContext good = MakeThreadContext(task, 4, 1);
  ASSERT_EQ(InitNewThread(task, &good), 1u);
  // The temporary folder is gone while the second thread registers.
  setenv("TMPDIR", scratch_.File("gone").c_str(), 1);
  vox_ThreadContext lost = MakeThreadContext(task, 4, 1);
  ASSERT_EQ(InitNewThread(task, &lost), 1u);
  setenv("TMPDIR", temp.temp_folder().c_str(), 1);

  good.message(good.writer, 1, "from the good thread");
  lost.message(lost.writer, 1, "from the thread without a file");
  good.progress(good.writer, 50);
  lost.progress(lost.writer, 50);
  task.result_file.WriteMessage("from the job thread", 1);
  DeleteThread(task, &lost);
  DeleteThread(task, &good);
  platform::RestoreDefaultFloatingPointMode();
  ASSERT_TRUE(task.result_file.Close());
  TheRun().current_task.store(nullptr);

  std::vector<std::string> texts;
  for (const auto& r : test::ReadResultRecords(scratch_.File("job.res")))
    if (r.kind == kKindMessage) texts.push_back(test::MessageText(r));
  EXPECT_EQ(texts, (std::vector<std::string>{"from the job thread", "from the good thread"}));
  EXPECT_TRUE(temp.TempFiles("VOX").empty());
}

}  // namespace
}  // namespace vox
