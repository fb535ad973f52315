#include <gtest/gtest.h>

#include <string>

#include "platform/platform.h"

namespace vox::platform {
namespace {

bool EndsWith(const std::string& text, const std::string& tail) {
  return text.size() >= tail.size() &&
         text.compare(text.size() - tail.size(), tail.size(), tail) == 0;
}

TEST(Library, LoadsResolvesAndUnloads) {
  Library* library = LoadLibrary(VOX_TEST_MODULE);
  ASSERT_NE(library, nullptr) << LastLibraryError();
  auto answer = reinterpret_cast<int (*)()>(ResolveSymbol(library, "test_module_answer"));
  ASSERT_NE(answer, nullptr);
  EXPECT_EQ(answer(), 42);
  EXPECT_EQ(ResolveSymbol(library, "no_such_function"), nullptr);
  EXPECT_EQ(ResolveSymbol(nullptr, "test_module_answer"), nullptr);
  UnloadLibrary(library);
}

TEST(Library, MissingFileFailsWithTheLoadersText) {
  std::string path = "/nonexistent/vox_no_such_library.eng";
  EXPECT_EQ(LoadLibrary(path), nullptr);
  std::string text = LastLibraryError();
  EXPECT_NE(text.find("vox_no_such_library.eng"), std::string::npos) << text;
  EXPECT_EQ(text.find('\n'), std::string::npos);
}

TEST(OwnModulePath, NamesTheExecutableOrTheLibraryTheCodeCameFrom) {
  std::string own = OwnModulePath();
  EXPECT_EQ(own.front(), '/');
  EXPECT_TRUE(EndsWith(own, "/platform_test")) << own;

  Library* library = LoadLibrary(VOX_TEST_MODULE);
  ASSERT_NE(library, nullptr) << LastLibraryError();
  auto module_path =
      reinterpret_cast<size_t (*)(char*, size_t)>(ResolveSymbol(library, "test_module_path"));
  ASSERT_NE(module_path, nullptr);
  char buffer[4096];
  module_path(buffer, sizeof buffer);
  EXPECT_EQ(buffer[0], '/');
  EXPECT_TRUE(EndsWith(buffer, "/platform_test_module.so")) << buffer;
  UnloadLibrary(library);
}

}  // namespace
}  // namespace vox::platform
