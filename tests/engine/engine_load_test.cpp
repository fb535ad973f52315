// Loading, checking and unloading engine libraries, as the engine log shows them.
#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>

#include "engine/engine.h"
#include "engine/engine_params.h"
#include "engine_fixture.h"
#include "platform/platform.h"

namespace vox {
namespace {

using ::testing::ElementsAre;
using testing::EngineFixture;

class EngineLoad : public EngineFixture {};

struct Failure {
  const char* file;    // under the test engine folder, or "scratch:" + name for a made-up file
  const char* reason;  // expected error text; null: the loader's own text
  bool mapped;         // stays mapped until destroyed
};

TEST_F(EngineLoad, EveryFailureWritesTwoLinesAndUnloadsOnlyWhatWasMapped) {
  std::ofstream(scratch() / "not_a_library.eng") << "plain text, not a library\n";
  const Failure failures[] = {
      {"no_such_engine.eng", nullptr, false},
      {"scratch:not_a_library.eng", nullptr, false},
      {"test_nocap.eng", "INVALID_ENGINE eng_GetEngineCapability", true},
      {"test_v21.eng", "OBSOLETE", true},
      {"test_v23.eng", "UNEXPECTED_VERSION", true},
      {"test_throw.eng", "UNKNOWN_ERROR", true},
  };
  std::vector<std::string> expected;
  for (const Failure& failure : failures) {
    const std::string name = failure.file;
    const std::string path =
        name.starts_with("scratch:") ? (scratch() / name.substr(8)).string() : EngineFile(name);
    std::unique_ptr<TEngine> engine = TEngine::Load(path);
    ASSERT_NE(engine, nullptr);
    EXPECT_FALSE(engine->loaded()) << path;
    EXPECT_EQ(engine->mapped(), failure.mapped) << path;
    EXPECT_EQ(engine->GetParamBlockSize(), 0u) << "a refused engine is never called";
    std::string reason = failure.reason ? failure.reason : "";
    if (!failure.reason) {
      // The loader's text: whatever it is, both lines must carry the same one.
      reason = platform::LoadLibrary(path) ? "" : platform::LastLibraryError();
      EXPECT_FALSE(reason.empty());
    }
    expected.push_back("EXCEPTION: " + path + ": " + reason);
    expected.push_back(path + ": " + reason);
    engine.reset();
    if (failure.mapped) expected.push_back(path + ": unload");
  }
  EXPECT_EQ(LogLines(), expected);
}

TEST_F(EngineLoad, RefusedVersionsStayMappedUntilDestroyed) {
  const std::string v21 = EngineFile("test_v21.eng");
  const std::string v23 = EngineFile("test_v23.eng");
  std::unique_ptr<TEngine> old_engine = TEngine::Load(v21);
  std::unique_ptr<TEngine> new_engine = TEngine::Load(v23);
  EXPECT_TRUE(old_engine->mapped());
  EXPECT_TRUE(new_engine->mapped());
  new_engine.reset();
  old_engine.reset();
  EXPECT_THAT(LogLines(),
              ElementsAre("EXCEPTION: " + v21 + ": OBSOLETE", v21 + ": OBSOLETE",
                          "EXCEPTION: " + v23 + ": UNEXPECTED_VERSION",
                          v23 + ": UNEXPECTED_VERSION", v23 + ": unload", v21 + ": unload"));
}

TEST_F(EngineLoad, CompleteEngineLoadsInitialisesWithTheModuleAndUnloads) {
  const std::string path = EngineFile("test_params.eng");
  {
    std::unique_ptr<TEngine> engine = TEngine::Load(path);
    ASSERT_TRUE(engine->loaded());
    EXPECT_EQ(engine->use_count(), 1u);
    EXPECT_EQ(engine->file_name(), path);
    for (size_t i = 0; i < kEngineFunctionCount; ++i) {
      const auto f = static_cast<EngineFunction>(i);
      const bool exported =
          f == EngineFunction::kGetEngineVOXVersion || f == EngineFunction::kGetEngineDLLVersion ||
          f == EngineFunction::kGetEngineInternalName ||
          f == EngineFunction::kGetEngineCapability || f == EngineFunction::kGetParamBlockSize ||
          f == EngineFunction::kInitParamBlock || f == EngineFunction::kEnumParamName ||
          f == EngineFunction::kSetParam || f == EngineFunction::kProcessGroup ||
          f == EngineFunction::kBreakProcess;
      EXPECT_EQ(engine->function(f) != nullptr, exported) << EngineFunctionName(f);
    }
    vox_ThreadContext context{};
    context.id = 1;
    EXPECT_EQ(engine->ProcessGroup(&context), 7u);
    EXPECT_EQ(engine->BreakProcess(), 5u);
    EXPECT_EQ(engine->ProcessGroupMT(&context), 0u);
    EXPECT_EQ(engine->use_count(), 1u) << "counted calls give their reference back";
  }
  // Only the module-taking initialisation runs, and it receives this library's path.
  EXPECT_THAT(RecordLines(),
              ElementsAre("init_engine " + platform::OwnModulePath(), "group 1", "break"));
  EXPECT_EQ(static_cast<const char*>(EngineModuleInstance()), platform::OwnModulePath());
  EXPECT_THAT(LogLines(), ElementsAre(path + ": load", path + ": unload"));
}

TEST_F(EngineLoad, FourFunctionsWithoutUnderscoresSufficeAndOptionalCallsYieldZero) {
  std::unique_ptr<TEngine> engine = TEngine::Load(EngineFile("test_bare.dll"));
  ASSERT_TRUE(engine->loaded());
  vox_ThreadContext context{};
  EXPECT_EQ(engine->GetParamBlockSize(), 0u);
  EXPECT_EQ(engine->ProcessGroup(&context), 0u);
  EXPECT_EQ(engine->ProcessGroupMT(&context), 0u);
  EXPECT_EQ(engine->ProcessOccupation(&context), 0u);
  EXPECT_EQ(engine->BreakProcess(), 0u);
  EXPECT_FALSE(engine->Exports(EngineFunction::kProcessGroup));
  EXPECT_TRUE(engine->Exports(EngineFunction::kGetEngineVOXVersion));
  std::unique_ptr<ParamBlock> block = ParamBlock::Create(8);
  EXPECT_FALSE(CreateParamBlock(block, engine.get()));
  EXPECT_EQ(block, nullptr);
  EXPECT_EQ(engine->use_count(), 1u);
  // Without _eng_InitEngine, the path-taking initialisation gets this library's path.
  EXPECT_THAT(RecordLines(), ElementsAre("init_dll " + platform::OwnModulePath()));
}

TEST_F(EngineLoad, FolderPartDecidesWhichFileOfTheNameIsLoaded) {
  // A file of the same name in the current folder must not shadow the one in the library
  // folder, and a relative path with a folder part is taken against the current folder.
  std::filesystem::copy_file(EngineFile("test_v21.eng"), scratch() / "test_v22.eng");
  const std::filesystem::path previous = std::filesystem::current_path();
  std::filesystem::current_path(scratch());
  std::unique_ptr<TEngine> beside_library = TEngine::Load(EngineFile("test_v22.eng"));
  std::unique_ptr<TEngine> relative = TEngine::Load("./test_v22.eng");
  std::filesystem::current_path(previous);
  EXPECT_TRUE(beside_library->loaded());
  EXPECT_FALSE(relative->loaded());
  EXPECT_TRUE(relative->mapped()) << "the obsolete copy was the one mapped";
}

}  // namespace
}  // namespace vox
