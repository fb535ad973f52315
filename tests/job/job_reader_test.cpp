#include <gtest/gtest.h>

#include <clocale>
#include <locale>
#include <string>

#include "job/job_section.h"
#include "job/job_text.h"

namespace vox {
namespace {

TEST(JobSection, HeadersOnlyCountAtTheStartOfALine) {
  JobSection r("[JOB]\nName=first\n[FILE:1]\nName=a [POINT:1]\n[POINT:1]\nName=p\n");
  ASSERT_TRUE(r.FindSection("JOB"));
  EXPECT_EQ(r.start(), 5);
  EXPECT_EQ(r.GetString("Name"), "first");
  ASSERT_TRUE(r.FindSection("POINT:1"));
  EXPECT_EQ(r.GetString("Name"), "p");
  EXPECT_EQ(r.end(), -1);
  EXPECT_FALSE(r.FindSection("POINT:2"));
  EXPECT_EQ(r.GetString("Name"), "");
  EXPECT_EQ(r.GetInt("Name", 7), 7);
}

TEST(JobSection, KeysAreExactAndTheFirstLineWins) {
  JobSection r(
      "[JOB]\nName =blank\nName=one\nName=two\n;Type=5\nTypeX=9\n[NEXT]\nType=3\nOther=1\n");
  ASSERT_TRUE(r.FindSection("JOB"));
  EXPECT_EQ(r.GetString("Name"), "one");
  EXPECT_EQ(r.GetInt("Type", -1), -1);  // commented, and the next section's key is not ours
  EXPECT_EQ(r.GetString("Other"), "");
  EXPECT_EQ(r.GetString("name"), "");  // no case folding
}

TEST(JobSection, SemicolonCutsAndTrimsExceptOnAnUnterminatedLastLine) {
  JobSection r("[JOB]\nResultPath=r.bin ; remark\nPath2= r.bin   \nLast=x.bin ; kept");
  ASSERT_TRUE(r.FindSection("JOB"));
  EXPECT_EQ(r.GetString("ResultPath"), "r.bin");
  EXPECT_EQ(r.GetString("Path2"), " r.bin   ");
  EXPECT_EQ(r.GetString("Last"), "x.bin ; kept");
}

TEST(JobSection, IntegerDigitRule) {
  JobSection r("[JOB]\nA= 3\nB=\nC=-12abc\nD=+5\nE=-\nF=4294967297\nG=x\n");
  ASSERT_TRUE(r.FindSection("JOB"));
  EXPECT_EQ(r.GetInt("A", 9), 0);  // a leading blank is no digit
  EXPECT_EQ(r.GetInt("B", 9), 9);  // empty value: the default
  EXPECT_EQ(r.GetInt("C", 9), -12);
  EXPECT_EQ(r.GetInt("D", 9), 0);
  EXPECT_EQ(r.GetInt("E", 9), 0);
  EXPECT_EQ(r.GetInt("F", 9), 1);  // wraps in 32 bits
  EXPECT_EQ(r.GetInt("G", 9), 0);
  EXPECT_EQ(r.GetInt("Missing", 9), 9);
}

TEST(JobSection, BlankTolerantRule) {
  EXPECT_EQ(ParseIntBlankTolerant(" \t-12x"), -12);
  EXPECT_EQ(ParseIntBlankTolerant("+7"), 7);
  EXPECT_EQ(ParseIntBlankTolerant("   "), 0);
  EXPECT_EQ(ParseIntBlankTolerant(""), 0);
}

// Restores the process locale (C and C++) when a test changed it.
class LocaleGuard {
 public:
  LocaleGuard() : cpp_(std::locale()), c_(std::setlocale(LC_ALL, nullptr)) {}
  ~LocaleGuard() {
    std::locale::global(cpp_);
    std::setlocale(LC_ALL, c_.c_str());
  }

 private:
  std::locale cpp_;
  std::string c_;
};

struct CommaDecimal : std::numpunct<char> {
  char do_decimal_point() const override { return ','; }
};

TEST(JobSection, DoublesIgnoreTheProcessLocale) {
  LocaleGuard guard;
  const bool named = std::setlocale(LC_ALL, "de_DE.UTF-8") != nullptr ||
                     std::setlocale(LC_ALL, "de_DE") != nullptr ||
                     std::setlocale(LC_ALL, "fr_FR.UTF-8") != nullptr;
  if (!named) std::locale::global(std::locale(std::locale::classic(), new CommaDecimal));

  JobSection r("[POINT:1]\nPosX=1.5e3\nPosY=1,5\nPosZ=  -2.5e1m\nPosRms=abc\nTiny=1e-39\n");
  ASSERT_TRUE(r.FindSection("POINT:1"));
  EXPECT_EQ(r.GetDouble("PosX", 0), 1500.0);
  EXPECT_EQ(r.GetDouble("PosY", 0), 1.0);
  EXPECT_EQ(r.GetDouble("PosZ", 0), -25.0);
  EXPECT_EQ(r.GetDouble("PosRms", 7), 0.0);
  EXPECT_EQ(r.GetDouble("Missing", 7), 7.0);
  EXPECT_EQ(r.GetFloat("Tiny", 5), 0.0f);  // below the smallest normal float
  EXPECT_EQ(r.GetFloat("PosX", 0), 1500.0f);
}

TEST(JobSection, DoubleLimits) {
  size_t consumed = 0;
  EXPECT_EQ(ParseDouble("1.25,2", &consumed), 1.25);
  EXPECT_EQ(consumed, 4u);
  EXPECT_EQ(ParseDouble("1e400"), std::numeric_limits<double>::infinity());
  EXPECT_EQ(ParseDouble("-1e99999"), -std::numeric_limits<double>::infinity());
  EXPECT_EQ(ParseDouble("1e-99999"), 0.0);
  EXPECT_EQ(ParseDouble("--1"), 0.0);
  EXPECT_EQ(ParseDouble("-0x1.8p1"), -3.0);
  EXPECT_EQ(ParseDouble("0x"), 0.0);
  // Only the first 63 bytes count.
  EXPECT_EQ(ParseDouble(std::string(62, '0') + "12"), 1.0);
}

TEST(JobSection, TimeSyntax) {
  TimeMs t{1, 2};
  EXPECT_TRUE(ParseTimeMs("10:5000", t));
  EXPECT_EQ(t.seconds, 864005u);
  EXPECT_EQ(t.ms, 0);
  EXPECT_TRUE(ParseTimeMs(" 10 : 5250", t));
  EXPECT_EQ(t.seconds, 864005u);
  EXPECT_EQ(t.ms, 250);
  EXPECT_FALSE(ParseTimeMs("10", t));
  EXPECT_EQ(t.seconds, 864005u);
}

TEST(JobSection, CommaLists) {
  const auto items = SplitCommaList("1, 2,,3");
  ASSERT_EQ(items.size(), 4u);
  EXPECT_EQ(ParseIntDigits(items[1]), 0);  // a blank after a comma makes the item 0
  EXPECT_EQ(items[2], "");
  EXPECT_EQ(SplitCommaList("").size(), 1u);
}

TEST(JobText, CarriageReturnsAreRemoved) {
  std::string text = "[JOB]\r\nName=x\r\n\r";
  RemoveCarriageReturns(text);
  EXPECT_EQ(text, "[JOB]\nName=x\n");
}

TEST(JobText, SubstitutionUsesTheNewestVariable) {
  VarList vars;
  vars.Add("DIR=/old");
  vars.Add("DIR=/data=1");
  vars.Add("LOOP=$(DIR)");
  vars.Add("EMPTY");
  std::string text = "Name=$(DIR)\\base.raw\nA=$(NONE)\\b.raw\nB=$(LOOP)$(EMPTY)!";
  ASSERT_TRUE(SubstituteVariables(text, vars));
  EXPECT_EQ(text, "Name=/data=1\\base.raw\nA=\\b.raw\nB=$(DIR)!");
}

TEST(JobText, UnterminatedReferenceFails) {
  VarList vars;
  vars.Add("DIR=x");
  std::string text = "A=$(DIR)\nB=$(DIR\n";
  EXPECT_FALSE(SubstituteVariables(text, vars));
  EXPECT_EQ(text, "A=$(DIR)\nB=$(DIR\n");
  std::string plain = "A=$DIR)";
  EXPECT_TRUE(SubstituteVariables(plain, vars));
  EXPECT_EQ(plain, "A=$DIR)");
}

}  // namespace
}  // namespace vox
