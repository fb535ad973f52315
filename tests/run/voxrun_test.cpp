// voxrun as a user runs it: output lines, exit status, Ctrl-C.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "support/scratch.h"

namespace {

// voxrun started with its output on a pipe.
class VoxRun {
 public:
  explicit VoxRun(std::vector<std::string> args) {
    int fds[2];
    EXPECT_EQ(pipe(fds), 0);
    pid_ = fork();
    if (pid_ == 0) {
      dup2(fds[1], STDOUT_FILENO);
      close(fds[0]);
      close(fds[1]);
      std::vector<char*> argv{const_cast<char*>("voxrun")};
      for (auto& a : args)
        argv.push_back(a.data());
      argv.push_back(nullptr);
      execv(VOX_VOXRUN, argv.data());
      _exit(127);
    }
    close(fds[1]);
    out_ = fds[0];
  }
  ~VoxRun() { close(out_); }

  // Reads output until text has appeared (or the output ends); true when it has.
  bool ReadUntil(const std::string& text) {
    char buffer[512];
    while (output_.find(text) == std::string::npos) {
      const ssize_t n = read(out_, buffer, sizeof buffer);
      if (n <= 0) return false;
      output_.append(buffer, static_cast<size_t>(n));
    }
    return true;
  }
  int Finish() {
    ReadUntil("\x01never");
    int status = 0;
    waitpid(pid_, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  // Waits until voxrun catches SIGINT (its handler is installed before the job starts), then
  // sends it.
  void Interrupt() {
    for (int i = 0; i < 1000 && !CatchesInterrupt(); ++i)
      usleep(10000);
    kill(pid_, SIGINT);
  }
  const std::string& output() const { return output_; }

 private:
  bool CatchesInterrupt() const {
    const std::string status = vox::test::ReadFile("/proc/" + std::to_string(pid_) + "/status");
    const size_t at = status.find("SigCgt:");
    if (at == std::string::npos) return false;
    const unsigned long long mask = std::stoull(status.substr(at + 7), nullptr, 16);
    return (mask & (1ull << (SIGINT - 1))) != 0;
  }

  pid_t pid_ = -1;
  int out_ = -1;
  std::string output_;
};

class VoxRunTest : public ::testing::Test {
 protected:
  vox::test::ScratchDir scratch_;
  vox::test::TempDirEnv temp_{scratch_, false};
};

TEST_F(VoxRunTest, ShowsTheJobAndClosesWithExitCodeMeaningAndResultPath) {
  const std::string job =
      vox::test::WriteFile(scratch_.File("a.job"), vox::test::JobText("$(N) run", "$(N).res"));
  VoxRun run({"--var", "N=first", "--var", "N=second", job});
  EXPECT_EQ(run.Finish(), 0);
  EXPECT_NE(run.output().find("job: second run\n"), std::string::npos) << run.output();
  const std::string last =
      "exit code 0: job done, result file complete; result: " + scratch_.File("second.res") + "\n";
  ASSERT_GE(run.output().size(), last.size());
  EXPECT_EQ(run.output().substr(run.output().size() - last.size()), last);
}

TEST_F(VoxRunTest, QuietPrintsOnlyTheClosingLineAndExitsWithTheJobsCode) {
  VoxRun run({"--quiet", scratch_.File("missing.job")});
  EXPECT_EQ(run.Finish(), 5);
  EXPECT_EQ(run.output(),
            "exit code 5: job file cannot be read, or a $( is not closed; result: (none)\n");
}

TEST_F(VoxRunTest, CtrlCBreaksTheJob) {
  const std::string job = scratch_.File("slow.job");
  ASSERT_EQ(mkfifo(job.c_str(), 0600), 0);
  VoxRun run({job});
  run.Interrupt();  // the job is waiting for its file meanwhile
  ASSERT_TRUE(run.ReadUntil("break requested"));
  vox::test::WriteFile(job, vox::test::JobText("Slow", "slow.res"));
  EXPECT_EQ(run.Finish(), 10);
  EXPECT_NE(run.output().find("exit code 10: stopped by a break"), std::string::npos);
}

}  // namespace
