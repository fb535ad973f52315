// Job texts that announce more than they hold: the readers must finish in time bounded by
// the text, not by the numbers written in it.
#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "job/job_section.h"
#include "job/leap_seconds.h"

namespace vox {
namespace {

class LeapSectionFaultTest : public ::testing::Test {
 protected:
  void SetUp() override { ResetLeapTableForTesting(); }
  void TearDown() override { ResetLeapTableForTesting(); }
};

// Found by the job fuzz target: "Num=31980980" kept the job thread looking up (and tracing)
// millions of absent entries.
TEST_F(LeapSectionFaultTest, AHugeEntryCountIsReadInTimeBoundedByTheSection) {
  for (const char* num : {"31980980", "2147483647"}) {
    SCOPED_TRACE(num);
    const std::string text =
        std::string("[JOB]\nName=x\n[LEAP_SEC]\nNum=") + num + "\n0=2006.0\n1=1981.5\n2=abc\n";
    JobSection reader(text);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_TRUE(ReadLeapSection(reader));
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
    // The entries that are there are read as ever.
    const std::vector<LeapRow> rows = LeapTableRows();
    ASSERT_EQ(rows.size(), 2u);
    EXPECT_EQ(rows[0].leap_seconds, 0u);
    EXPECT_EQ(rows[1].leap_seconds, 1u);
  }
}

// The last entry of a section at the very end of the text, with no line feed after it.
TEST_F(LeapSectionFaultTest, AnEntryAtTheEndOfTheTextIsStillRead) {
  JobSection reader("[LEAP_SEC]\nNum=1\n0=2006.0");
  EXPECT_TRUE(ReadLeapSection(reader));
  ASSERT_EQ(LeapTableRows().size(), 1u);
}

}  // namespace
}  // namespace vox
