// The table of docs/architecture.md against the sources: every module has its place there. And
// src/file/README.md: what the modules of that folder include.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <string>

#include <fnmatch.h>

namespace {

std::filesystem::path root() {
  return std::filesystem::path(QLX_HEADERS).parent_path().parent_path();
}

// What stands between grave accents in the table's rows.
std::set<std::string> namesOfTheTable() {
  std::ifstream in(root() / "docs/architecture.md");
  static const std::regex name("`(Qlx[A-Za-z0-9*]*)`");
  std::set<std::string> names;
  for (std::string line; std::getline(in, line);) {
    if (!line.starts_with("| ")) continue;
    for (std::sregex_iterator it(line.begin(), line.end(), name), end; it != end; ++it)
      names.insert((*it)[1]);
  }
  return names;
}

// But those of the two rows that stand there by the starts of their names.
std::set<std::string> modules() {
  std::set<std::string> names;
  for (const auto &entry : std::filesystem::recursive_directory_iterator(root() / "src")) {
    const std::string name = entry.path().stem();
    const bool isUtil = entry.path().parent_path().filename() == "util";
    if (name.starts_with("Qlx") && !isUtil) names.insert(name);
  }
  return names;
}

// Some stand there by a part of their names.
bool isIn(const std::set<std::string> &names, const std::string &module) {
  return std::any_of(names.begin(), names.end(), [&](const std::string &name) {
    return fnmatch(name.c_str(), module.c_str(), 0) == 0;
  });
}

TEST(ArchitecturePageTest, HasEveryModuleInItsTableAndNoOther) {
  const std::set<std::string> names = namesOfTheTable(), there = modules();
  for (const std::string &module : there) EXPECT_TRUE(isIn(names, module)) << module;
  for (const std::string &name : names)
    EXPECT_TRUE(there.contains(name) || name.find('*') != name.npos) << name;
}

// Headers of the project that are included with their folder, or stand beside the source.
std::set<std::string> includesOf(const std::filesystem::path &source) {
  std::ifstream in(source);
  static const std::regex include("#include \"(.+)\"");
  std::set<std::string> found;
  std::smatch match;
  for (std::string line; std::getline(in, line);) {
    if (std::regex_match(line, match, include)) found.insert(match[1]);
  }
  return found;
}

TEST(ArchitecturePageTest, HasNothingAboveThemInWhatTheFilesOfSrcFileInclude) {
  int sources = 0;
  for (const auto &entry : std::filesystem::directory_iterator(root() / "src/file")) {
    if (entry.path().extension() == ".md") continue;
    ++sources;
    for (const std::string &name : includesOf(entry.path())) {
      const bool isBeside = name.find('/') == std::string::npos &&
                            std::filesystem::exists(entry.path().parent_path() / name);
      EXPECT_TRUE(isBeside || name.starts_with("util/")) << entry.path() << " includes " << name;
    }
  }
  EXPECT_GT(sources, 10);
}

}  // namespace
