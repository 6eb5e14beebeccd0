#include <gtest/gtest.h>

#include <string>
#include <vector>

#include <qlx/class/filter.h>

#include "support/WildcardRule.h"

namespace {

// All words of up to so many letters.
std::vector<std::string> words(const std::string &alphabet, size_t maxLength) {
  std::vector<std::string> all{""};
  for (size_t i = 0; i < all.size(); ++i) {
    if (all[i].size() == maxLength) break;  // the longest come last
    for (const char letter : alphabet) all.push_back(all[i] + letter);
  }
  return all;
}

TEST(PatternMatchTest, FollowsItsRuleForEveryShortPatternAndText) {
  const std::vector<std::string> patterns = words("*ab", 6);
  const std::vector<std::string> texts = words("*ab", 6);
  ASSERT_EQ(patterns.size(), 1093u);
  int matched = 0;
  for (const std::string &pattern : patterns) {
    for (const std::string &text : texts) {
      const int expected = matchesByTheRule(pattern, text);
      ASSERT_EQ(QlxPatternMatch(pattern.c_str(), text.c_str()), expected)
          << '"' << pattern << "\" on \"" << text << '"';
      matched += expected;
    }
  }
  EXPECT_GT(matched, 10000);  // both answers are well represented
  EXPECT_LT(matched, static_cast<int>(patterns.size() * texts.size() / 2));
}

// ---- What the rule means

struct Case {
  const char *pattern, *text;
  int matches;
};

void expectAll(std::initializer_list<Case> cases) {
  for (const auto &[pattern, text, matches] : cases) {
    EXPECT_EQ(QlxPatternMatch(pattern, text), matches) << pattern << " on " << text;
  }
}

TEST(PatternMatchTest, AStarMatchesEverythingAlsoTheEmptyText) {
  expectAll({{"*", "", 1}, {"*", "KBB0001W", 1}, {"***", "", 1}, {"***", "x", 1}, {"*", "*", 1}});
}

TEST(PatternMatchTest, AnEmptyPatternMatchesEverythingToo) {
  expectAll({{"", "", 1}, {"", "KBB0001W", 1}});
}

TEST(PatternMatchTest, APatternWithoutAStarIsTheWholeText) {
  expectAll({{"KBB", "KBB", 1}, {"KBB", "KBB1", 0}, {"KBB", "KB", 0}, {"KBB", "", 0}});
}

TEST(PatternMatchTest, AStarAfterTheOnlyPieceTakesAnyEnd) {
  expectAll({{"KBB*", "KBB0001W", 1},
             {"KBB*", "KBB", 1},
             {"KBB**", "KBBKBB", 1},
             {"KBB*", "KB", 0},
             {"KBB*", "AKBB", 0}});
}

TEST(PatternMatchTest, AStarBeforeTheOnlyPieceTakesAnyStart) {
  expectAll({{"*W", "KBB0001W", 1}, {"*W", "W", 1}, {"*W", "KBB0001I", 0}, {"*W", "", 0}});
}

TEST(PatternMatchTest, PiecesComeInOrderAndDoNotOverlap) {
  expectAll({{"A*B*C", "AxxBxxC", 1},
             {"A*B*C", "ABC", 1},
             {"A*B*C", "AxxCxxB", 0},
             {"A*B*C", "xABC", 0},
             {"AB*BA", "ABA", 0},
             {"AB*BA", "ABBA", 1},
             {"*AA*AA", "AAA", 0}});
}

TEST(PatternMatchTest, TakesTheFirstOccurrenceWithoutGoingBack) {
  expectAll({{"*W", "AWBW", 0}, {"A*W", "AWBW", 0}, {"*AB*B", "ABBB", 0}, {"*WW", "WWW", 0}});
}

TEST(PatternMatchTest, AStarAfterTheLastOfManyPiecesDoesNotCount) {
  expectAll({{"*W*", "AW", 1},
             {"*W*", "WA", 0},
             {"*W*", "AWBW", 0},
             {"A*W*", "AxW", 1},
             {"A*W*", "AxWx", 0},
             {"A*W***", "AxWx", 0}});
}

TEST(PatternMatchTest, RunsOfStarsAreOneStar) {
  expectAll({{"A***C", "AC", 1}, {"A***C", "AxC", 1}, {"***C", "xC", 1}});
}

TEST(PatternMatchTest, KnowsNoOtherSpecialCharacterAndNoEscape) {
  expectAll({{"K?B", "KBB", 0},
             {"K?B", "K?B", 1},
             {"[KB]", "K", 0},
             {"\\*", "*", 0},
             {"\\*", "\\x", 1},
             {"K.*", "KBB", 0}});
}

TEST(PatternMatchTest, TellsLettersApartByCase) {
  expectAll({{"kbb*", "KBB0001W", 0}, {"*w", "KBB0001W", 0}});
}

TEST(PatternMatchTest, BytesAbove127AreBytesLikeOthers) {
  expectAll({{"\xC3*\xFF", "\xC3\xA4\xFF", 1}, {"\xC3*", "\xC4", 0}});
}

TEST(PatternMatchTest, NullMatchesNothing) {
  EXPECT_EQ(QlxPatternMatch(nullptr, "x"), 0);
  EXPECT_EQ(QlxPatternMatch("*", nullptr), 0);
  EXPECT_EQ(QlxPatternMatch(nullptr, nullptr), 0);
}

}  // namespace
