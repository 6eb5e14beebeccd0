// The table of docs/architecture.md against the sources: every module has its place there.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <string>

namespace {

std::filesystem::path root() {
  return std::filesystem::path(QLX_HEADERS).parent_path().parent_path();
}

// What stands between grave accents in the table's rows.
std::set<std::string> namesOfTheTable() {
  std::ifstream in(root() / "docs/architecture.md");
  static const std::regex name("`(Qlx[A-Za-z0-9]*[*]?)`");
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

TEST(ArchitecturePageTest, HasEveryModuleInItsTableAndNoOther) {
  EXPECT_EQ(namesOfTheTable(), modules());
}

}  // namespace
