// Null for every pointer argument of every function that the public headers export. The calls stand
// in groups in the Null...Test.cpp files beside this one; here they are run, and compared with what
// the headers declare.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>

#include "support/FailingMemory.h"
#include "support/NullCalls.h"

namespace {

class NullArgumentTest : public ::testing::TestWithParam<NullGroup> {};

std::string groupName(const ::testing::TestParamInfo<NullGroup> &info) {
  return info.param.name;
}

// The names of the exported functions of a header with a parameter that is a pointer: one with a
// star, or of an operation's type (fOpen).
std::set<std::string> functionsWithPointers(const std::filesystem::path &header) {
  std::ifstream in(header);
  std::string text{std::istreambuf_iterator<char>(in), {}};
  text = std::regex_replace(text, std::regex(R"(/\*[^*]*\*+(?:[^/*][^*]*\*+)*/)"), "");
  static const std::regex declaration(R"(\bQLX_API\b[^;({]*?\b(\w+)\s*\(([^;]*)\);)");
  static const std::regex pointer(R"(\*|\bf[A-Z]\w+\b)");
  std::set<std::string> names;
  for (std::sregex_iterator it(text.begin(), text.end(), declaration), end; it != end; ++it) {
    if (std::regex_search((*it)[2].str(), pointer)) names.insert((*it)[1]);
  }
  return names;
}

std::set<std::string> exportedFunctionsWithPointers() {
  std::set<std::string> names;
  for (const auto &entry : std::filesystem::recursive_directory_iterator(QLX_HEADERS)) {
    if (entry.path().extension() == ".h") names.merge(functionsWithPointers(entry.path()));
  }
  return names;
}

// The names of the one set that the other has not.
std::string missing(const std::set<std::string> &names, const std::set<std::string> &others) {
  std::string all;
  for (const std::string &name : names) {
    if (!others.contains(name)) all += name + " ";
  }
  return all;
}

TEST_P(NullArgumentTest, AnswersByItsRuleAndKeepsNothing) {
  { const ApiLock made; }
  const FailingMemory counting;
  GetParam().calls();
  EXPECT_EQ(counting.live(), 0);
}

INSTANTIATE_TEST_SUITE_P(Group, NullArgumentTest, ::testing::ValuesIn(NullGroup::all()), groupName);

TEST(NullArgumentTest, CoversEveryExportedFunction) {
  for (const NullGroup &group : NullGroup::all()) group.calls();
  // No check for null is made here, deliberately.
  std::set<std::string> covered = NullGroup::called();
  covered.insert("OslStringSprintf");
  const std::set<std::string> exported = exportedFunctionsWithPointers();
  EXPECT_GT(exported.size(), 500U);
  EXPECT_EQ(missing(exported, covered), "");
  EXPECT_EQ(missing(covered, exported), "");
}

}  // namespace
