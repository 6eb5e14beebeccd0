// docs/configuration.md against the key tables of the sources: each section has the rows of one
// table.
#include <gtest/gtest.h>

#include <cctype>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <regex>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include <qlx/proplist.h>

#include "support/TempDir.h"

namespace {

using Keys = std::map<std::string, std::set<std::string>>;  // of a section, or of a table

// The tables of sources that have no class; any other's section has the name of the source's class.
const std::map<std::string, std::string> kSectionOfTable = {
    {"kCommonKeys", "Every class"},
    {"kHandlerKeys", "Every handler"},
};

std::filesystem::path projectFile(const char *name) {
  return std::filesystem::path(QLX_HEADERS).parent_path().parent_path() / name;
}

std::string contents(const std::filesystem::path &path) {
  std::ifstream in(path);
  EXPECT_TRUE(in.is_open()) << path;
  return {std::istreambuf_iterator<char>(in), {}};
}

std::set<std::string> firstGroups(const std::string &text, const char *pattern) {
  const std::regex row(pattern);
  std::set<std::string> found;
  for (std::sregex_iterator it(text.begin(), text.end(), row), end; it != end; ++it) {
    found.insert((*it)[1]);
  }
  return found;
}

// A row begins with the key as a text, or with its name in the enumeration of events' keys.
std::set<std::string> keysOfRows(const std::string &rows) {
  std::set<std::string> keys = firstGroups(rows, R"re(\{"(\w+)",)re");
  for (std::string key : firstGroups(rows, R"re(\{EventKey::k(\w+),)re")) {
    key[0] = static_cast<char>(std::tolower(key[0]));
    keys.insert(key);
  }
  return keys;
}

// The names in the class records of a source.
std::set<std::string> classesOf(const std::string &source) {
  return firstGroups(source, R"re(const ObjClass \w+ = \{[^;]*\.name = "(\w+)")re");
}

std::vector<std::string> sources() {
  std::vector<std::string> texts;
  for (const auto &entry : std::filesystem::recursive_directory_iterator(projectFile("src"))) {
    if (entry.path().extension() == ".cpp") texts.push_back(contents(entry.path()));
  }
  return texts;
}

// "" when there is none.
std::string sectionOf(const std::string &table, const std::string &source) {
  if (kSectionOfTable.contains(table)) return kSectionOfTable.at(table);
  const std::set<std::string> classes = classesOf(source);
  return classes.size() == 1 ? *classes.begin() : "";
}

// By their sections.
Keys keysOfTables() {
  static const std::regex table(R"((?:ConfigKey|Stamp) (k\w+)\[\] = \{([^;]*)\};)");
  Keys keys;
  for (const std::string &source : sources()) {
    for (std::sregex_iterator it(source.begin(), source.end(), table), end; it != end; ++it) {
      const std::string section = sectionOf((*it)[1], source);
      EXPECT_NE(section, "") << (*it)[1] << " has no section";
      EXPECT_FALSE(keysOfRows((*it)[2]).empty()) << (*it)[1];
      keys[section].merge(keysOfRows((*it)[2]));
    }
  }
  return keys;
}

// The first cells in code type below each heading that are keys: "logging", but not "FATAL".
Keys keysOfSections() {
  const std::string page = contents(projectFile("docs/configuration.md"));
  Keys keys;
  for (size_t at = page.find("\n## "); at != std::string::npos;) {
    const size_t next = page.find("\n## ", at + 1);
    const size_t headingEnd = page.find('\n', at + 1);
    const std::string heading = page.substr(at + 4, headingEnd - at - 4);
    const std::string section = page.substr(headingEnd, next - headingEnd);
    keys[heading] = firstGroups(section, R"(\n\| `(\w+)` \|)");
    at = next;
  }
  return keys;
}

TEST(ConfigurationPage, HasTheKeysOfEveryTable) {
  Keys sections = keysOfSections();
  const Keys tables = keysOfTables();
  EXPECT_GE(tables.size(), 9U);
  for (const auto &[section, keys] : tables) EXPECT_EQ(sections[section], keys) << section;
}

TEST(ConfigurationPage, HasNoKeysBesideThem) {
  const Keys tables = keysOfTables();
  for (const auto &[section, keys] : keysOfSections()) {
    if (tables.contains(section)) continue;
    EXPECT_EQ(keys, std::set<std::string>{}) << section;
  }
}

TEST(ConfigurationPage, HasASectionForEveryClassAndForNoOther) {
  std::set<std::string> classes, told;
  for (const std::string &source : sources()) classes.merge(classesOf(source));
  for (const auto &[section, keys] : keysOfSections()) {
    if (section.starts_with("qlx_")) told.insert(section);
  }
  EXPECT_EQ(told, classes);
}

// A table's cells in code type; "" for other ones.
std::vector<std::string> cellsOf(const std::string &row) {
  static const std::regex cell(R"(\| (?:`([^`]*)`|[^|]*?) ?(?=\|))");
  std::vector<std::string> cells;
  for (std::sregex_iterator it(row.begin(), row.end(), cell), end; it != end; ++it) {
    cells.push_back((*it)[1]);
  }
  return cells;
}

// The pair that a line gives, as a row of the page has it.
std::vector<std::string> readLine(const std::string &line) {
  const TempDir dir;
  CxPropList list{};
  const bool good = CxPropListRead(dir.write("file", line).c_str(), &list, nullptr) == 1;
  std::vector<std::string> cells = {line, "", ""};
  if (good) cells = {line, list.entries[0].key, list.entries[0].value};
  CxPropListDiscard(&list);
  return cells;
}

TEST(ConfigurationPage, ShowsWhatLinesOfAFileGive) {
  const std::string page = contents(projectFile("docs/configuration.md"));
  std::istringstream table(page.substr(page.find("| Line | Left side | Value |\n|---")));
  int rows = 0;
  std::string row;
  std::getline(table, row), std::getline(table, row);
  while (std::getline(table, row) && !row.empty()) {
    const std::vector<std::string> cells = cellsOf(row);
    ASSERT_EQ(cells.size(), 3u) << row;
    EXPECT_EQ(readLine(cells[0]), cells);
    ++rows;
  }
  EXPECT_GT(rows, 15);
}

}  // namespace
