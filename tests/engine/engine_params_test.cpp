// Parameter blocks: creation through the engine, and the job text reaching _eng_SetParam.
#include <gmock/gmock.h>

#include <cstring>

#include "engine/engine.h"
#include "engine/engine_params.h"
#include "engine/job_engines.h"
#include "engine_fixture.h"

namespace vox {
namespace {

using ::testing::ElementsAre;
using testing::EngineFixture;
using ::testing::IsEmpty;

class EngineParams : public EngineFixture {
 protected:
  std::unique_ptr<TEngine> LoadParamsEngine() {
    auto engine = TEngine::Load(EngineFile("test_params.eng"));
    EXPECT_TRUE(engine->loaded());
    return engine;
  }
  // The record without the load-time line.
  std::vector<std::string> CallsAfterLoad() const {
    std::vector<std::string> lines = RecordLines();
    if (!lines.empty() && lines.front().starts_with("init_engine")) lines.erase(lines.begin());
    return lines;
  }
};

TEST_F(EngineParams, BlockIsZeroFilledWithItsSizeAndInitialisedInPlace) {
  ::setenv("VOX_TEST_BLOCK_SIZE", "24", 1);
  auto engine = LoadParamsEngine();
  std::unique_ptr<ParamBlock> block;
  ASSERT_TRUE(CreateParamBlock(block, engine.get()));
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(block->allocated(), 24);
  // The engine saw the header (0, 24) and wrote its meaningful size into this very block.
  EXPECT_EQ(block->data()[0], 24);
  const uint8_t zeros[20] = {};
  EXPECT_EQ(std::memcmp(block->data() + 4, zeros, sizeof zeros), 0);
  EXPECT_THAT(CallsAfterLoad(), ElementsAre("init_block 0 24"));
}

TEST_F(EngineParams, SizeZeroGivesNoBlockAndNoEnumeration) {
  ::setenv("VOX_TEST_BLOCK_SIZE", "0", 1);
  JobEngines engines;
  ASSERT_TRUE(engines.LoadEngine(EngineRole::kProcessing, EngineFile("test_params.eng")));
  EXPECT_EQ(engines.CreateJobBlock(EngineRole::kProcessing), nullptr);

  // A field holding an older block loses it.
  std::unique_ptr<ParamBlock> field = ParamBlock::Create(8);
  EXPECT_FALSE(CreateParamBlock(field, engines.processing()));
  EXPECT_EQ(field, nullptr);
  JobSection section("[JOB]\nMode=fast\n");
  ASSERT_TRUE(section.FindSection("JOB"));
  EXPECT_TRUE(FillParams(engines.processing(), section, field.get()));
  EXPECT_THAT(CallsAfterLoad(), IsEmpty());
}

TEST_F(EngineParams, BlockTooLargeForItsHeaderIsRefused) {
  ::setenv("VOX_TEST_BLOCK_SIZE", "70000", 1);
  auto engine = LoadParamsEngine();
  std::unique_ptr<ParamBlock> block;
  EXPECT_FALSE(CreateParamBlock(block, engine.get()));
  EXPECT_EQ(block, nullptr);
  EXPECT_THAT(CallsAfterLoad(), IsEmpty());
}

TEST_F(EngineParams, SectionValuesReachTheEngineWithStartPointAsPointIdentifier) {
  ::setenv("VOX_TEST_PARAM_NAMES", "StartPoint,Mode,Empty,Missing,Comment,Mode2", 1);
  JobEngines engines;
  ASSERT_TRUE(engines.LoadEngine(EngineRole::kProcessing, EngineFile("test_params.eng")));
  std::unique_ptr<ParamBlock> block = engines.CreateJobBlock(EngineRole::kProcessing);
  ASSERT_NE(block, nullptr);
  const char* text =
      "[JOB]\nStartPoint=5\nMode=fast \nEmpty=\nComment=x ; note\n"
      "[VECTOR:1]\nMode2=other section\n";
  JobSection section(text);
  ASSERT_TRUE(section.FindSection("JOB"));
  EXPECT_TRUE(engines.FillParameters(EngineRole::kProcessing, section, *block));
  EXPECT_THAT(CallsAfterLoad(), ElementsAre("init_block 0 16", "enum", "set 16 StartPoint=16777221",
                                            "set 16 Mode=fast ", "set 16 Comment=x"));
}

TEST_F(EngineParams, StartPointZeroOrNotANumberPassesUnchanged) {
  ::setenv("VOX_TEST_PARAM_NAMES", "StartPoint", 1);
  auto engine = LoadParamsEngine();
  std::unique_ptr<ParamBlock> block;
  ASSERT_TRUE(CreateParamBlock(block, engine.get()));
  for (const char* text : {"[A]\nStartPoint=0\n", "[A]\nStartPoint=P7\n", "[A]\nStartPoint=-2\n"}) {
    JobSection section(text);
    ASSERT_TRUE(section.FindSection("A"));
    EXPECT_TRUE(FillParams(engine.get(), section, block.get()));
  }
  EXPECT_THAT(CallsAfterLoad(),
              ElementsAre("init_block 0 16", "enum", "set 16 StartPoint=0", "enum",
                          "set 16 StartPoint=P7", "enum", "set 16 StartPoint=4294967294"));
}

TEST_F(EngineParams, EnginesThatAreNotLoadedAreNeitherAskedNorFilled) {
  JobEngines engines;
  EXPECT_FALSE(engines.LoadEngine(EngineRole::kStatic, EngineFile("test_v23.eng")));
  ASSERT_NE(engines.static_engine(), nullptr);
  EXPECT_EQ(engines.processing(), nullptr);
  EXPECT_EQ(engines.CreateJobBlock(EngineRole::kStatic), nullptr);
  EXPECT_EQ(engines.CreateJobBlock(EngineRole::kProcessing), nullptr);
  std::unique_ptr<ParamBlock> block = ParamBlock::Create(16);
  JobSection section("[STATIC]\nMode=x\n");
  EXPECT_FALSE(engines.FillParameters(EngineRole::kStatic, section, *block));
  EXPECT_FALSE(engines.FillParameters(EngineRole::kProcessing, section, *block));
}

TEST_F(EngineParams, JobEnginesReplaceAndReleaseTheirEnginesWithUnloadLines) {
  const std::string params = EngineFile("test_params.eng");
  const std::string bare = EngineFile("test_bare.dll");
  {
    JobEngines engines;
    ASSERT_TRUE(engines.LoadEngine(EngineRole::kProcessing, bare));
    ASSERT_TRUE(engines.LoadEngine(EngineRole::kProcessing, params));
    ASSERT_TRUE(engines.LoadEngine(EngineRole::kStatic, bare));
    EXPECT_EQ(engines.engine(EngineRole::kProcessing)->file_name(), params);
    EXPECT_EQ(engines.engine(EngineRole::kStatic)->file_name(), bare);
  }
  EXPECT_THAT(LogLines(), ElementsAre(bare + ": load", bare + ": unload", params + ": load",
                                      bare + ": load", bare + ": unload", params + ": unload"));
}

}  // namespace
}  // namespace vox
