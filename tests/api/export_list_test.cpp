// The library's dynamic symbol table against the one list of exports: nothing missing,
// nothing internal leaking, and every export declared in the public headers.
#include <gtest/gtest.h>

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <set>
#include <sstream>
#include <string>

namespace {

std::set<std::string> ListedExports() {
  std::ifstream in(VOX_EXPORT_LIST);
  std::set<std::string> names;
  std::string line;
  while (std::getline(in, line)) {
    line.erase(0, line.find_first_not_of(" \t"));
    line.erase(line.find_last_not_of(" \t\r") + 1);
    if (!line.empty() && line[0] != '#') names.insert(line);
  }
  return names;
}

// The library under test: VOX_LIBRARY when set (an installed copy), else the one just built.
std::string LibraryPath() {
  const char* installed = std::getenv("VOX_LIBRARY");
  return installed != nullptr ? installed : VOX_LIBRARY_PATH;
}

std::set<std::string> DynamicSymbols(const std::string& library) {
  std::set<std::string> names;
  const std::string command = "nm -D --defined-only '" + library + "'";
  FILE* pipe = ::popen(command.c_str(), "r");
  if (pipe == nullptr) return names;
  char line[4096];
  while (std::fgets(line, sizeof line, pipe) != nullptr) {
    std::istringstream fields(line);
    std::string address, type, name;
    if (fields >> address >> type >> name) names.insert(name.substr(0, name.find('@')));
  }
  ::pclose(pipe);
  return names;
}

std::string Join(const std::set<std::string>& names) {
  std::string text;
  for (const std::string& n : names)
    text += "  " + n + "\n";
  return text;
}

TEST(ExportList, LibraryExportsExactlyTheList) {
  const std::set<std::string> listed = ListedExports();
  ASSERT_GT(listed.size(), 100u);
  const std::set<std::string> exported = DynamicSymbols(LibraryPath());
  ASSERT_FALSE(exported.empty()) << "cannot read the symbols of " << LibraryPath();
  std::set<std::string> missing, leaking;
  for (const std::string& n : listed)
    if (!exported.count(n)) missing.insert(n);
  for (const std::string& n : exported)
    if (!listed.count(n)) leaking.insert(n);
  EXPECT_TRUE(missing.empty()) << missing.size() << " listed functions are not exported:\n"
                               << Join(missing);
  EXPECT_TRUE(leaking.empty()) << leaking.size() << " exported symbols are not listed:\n"
                               << Join(leaking);
}

bool IsNameChar(char c) {
  return std::isalnum(static_cast<unsigned char>(c)) || c == '_';
}

// True when text holds name as a whole word followed by an opening parenthesis.
bool Declares(const std::string& text, const std::string& name) {
  for (size_t p = text.find(name); p != std::string::npos; p = text.find(name, p + 1)) {
    if (p > 0 && IsNameChar(text[p - 1])) continue;
    size_t q = p + name.size();
    while (q < text.size() && (text[q] == ' ' || text[q] == '\n'))
      ++q;
    if (q < text.size() && text[q] == '(') return true;
  }
  return false;
}

TEST(ExportList, EveryExportIsDeclaredInThePublicHeaders) {
  std::string headers;
  for (const auto& entry : std::filesystem::directory_iterator(VOX_INCLUDE_DIR)) {
    std::ifstream in(entry.path());
    std::stringstream text;
    text << in.rdbuf();
    headers += text.str();
  }
  std::set<std::string> undeclared;
  for (std::string name : ListedExports()) {
    if (name == "_Z16RunMultiSiteTaskPKc") name = "RunMultiSiteTask";  // C++ linkage
    if (!Declares(headers, name)) undeclared.insert(name);
  }
  EXPECT_TRUE(undeclared.empty()) << "not declared in include/vox:\n" << Join(undeclared);
}

}  // namespace
