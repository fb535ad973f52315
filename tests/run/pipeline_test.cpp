// The pipeline on the job thread's side, run directly on the test thread.
#include <gtest/gtest.h>

#include <vector>

#include "base/engine_log.h"
#include "run/control_channel.h"
#include "run/current_task.h"
#include "run/pipeline.h"
#include "run/run_context.h"
#include "run/run_state.h"
#include "support/scratch.h"

namespace vox {
namespace {

std::vector<uint32_t> g_progress;
void Record(void*, uint32_t code, uint32_t value) {
  if (code == kCallbackProgress) g_progress.push_back(value);
}

class PipelineTest : public ::testing::Test {
 protected:
  void SetUp() override {
    RegisterHostCallback(Record, nullptr);
    g_progress.clear();
    TheRun().progress.store(0);
    TheRun().break_flag.store(0);
  }

  // Runs a job text the way a text run does; returns the exit code.
  uint32_t RunText(const std::string& text, const std::string& job_path = "") {
    OpenEngineLog();
    auto* context = new TRunContext;
    context->job_path = job_path;
    context->job_text = text;
    context->window = OpenControlWindow();
    window_ = context->window;
    context->AddRef();
    return RunPipeline(context);
  }

  uint32_t RunFile(const std::string& path, const std::string& variable = "") {
    OpenEngineLog();
    auto* context = new TRunContext;
    context->job_path = path;
    if (!variable.empty()) context->variables.Add(variable);
    context->window = OpenControlWindow();
    window_ = context->window;
    context->AddRef();
    return ReadJobFileAndRun(context);
  }

  test::ScratchDir scratch_;
  test::TempDirEnv temp_{scratch_, true};
  uint64_t window_ = 0;
};

TEST_F(PipelineTest, FinishedJobReadsProgress99WithoutTellingTheHost) {
  const std::string result = scratch_.File("a.res");
  EXPECT_EQ(RunText(test::JobText("A", result)), 0u);
  EXPECT_EQ(TheRun().progress.load(), 99u);
  EXPECT_TRUE(g_progress.empty());
  EXPECT_EQ(CurrentTask(), nullptr);
  EXPECT_FALSE(ControlWindowIsOpen(window_));
  EXPECT_FALSE(EngineLogIsOpen());
}

TEST_F(PipelineTest, BreakRequestedDuringTheRunEndsWith10AfterAProperClose) {
  TheRun().break_flag.store(1);
  const std::string result = scratch_.File("b.res");
  EXPECT_EQ(RunText(test::JobText("B", result)), 10u);
  const auto records = test::ReadResultRecords(result);
  ASSERT_FALSE(records.empty());
  EXPECT_EQ(records.back().kind, 0);
  TheRun().break_flag.store(0);
}

TEST_F(PipelineTest, FileJobsWithCrLfAndLfLineEndsRunAlike) {
  const std::string lf = test::WriteFile(scratch_.File("lf.job"), test::JobText("L", "lf.res"));
  const std::string crlf =
      test::WriteFile(scratch_.File("crlf.job"), "[JOB]\r\nName=L\r\nResultPath=crlf.res\r\n");
  EXPECT_EQ(RunFile(lf), 0u);
  EXPECT_EQ(RunFile(crlf), 0u);
  EXPECT_EQ(test::ReadFile(scratch_.File("lf.res")), test::ReadFile(scratch_.File("crlf.res")));
  EXPECT_EQ(LastJobLabels().name, "L");
}

TEST_F(PipelineTest, UnreadableOrUnsubstitutableJobFileEndsWith5AndLeavesWindowAndLogOpen) {
  const std::string missing = scratch_.File("missing.job");
  EXPECT_EQ(RunFile(missing), 5u);
  EXPECT_TRUE(ControlWindowIsOpen(window_));
  EXPECT_TRUE(EngineLogIsOpen());
  CloseEngineLog();
  auto logs = temp_.EngineLogTexts();
  ASSERT_FALSE(logs.empty());
  EXPECT_EQ(logs.back().rfind("Process fault: " + missing + " (", 0), 0u) << logs.back();

  const std::string open =
      test::WriteFile(scratch_.File("open.job"), test::JobText("O", "$(OUT.res"));
  EXPECT_EQ(RunFile(open), 5u);
  CloseEngineLog();
  logs = temp_.EngineLogTexts();
  EXPECT_EQ(logs.back(), "Process fault: " + open + " (Cannot substitute variables)\n");
  EXPECT_FALSE(std::filesystem::exists(scratch_.File("O.res")));
  CloseControlWindow(window_);
}

TEST_F(PipelineTest, EmptyJobFileEndsWith5) {
  const std::string empty = test::WriteFile(scratch_.File("empty.job"), "");
  EXPECT_EQ(RunFile(empty), 5u);
  CloseEngineLog();
  CloseControlWindow(window_);
}

}  // namespace
}  // namespace vox
