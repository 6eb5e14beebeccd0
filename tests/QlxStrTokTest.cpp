#include <gtest/gtest.h>

#include <string>

#include <qlx/props.h>

#include "support/FailingMemory.h"
#include "support/Take.h"

namespace {

struct Tokens {
  const char *string, *delims, *expected;  // the expected tokens, each in brackets
};

class QlxStrTokTest : public ::testing::TestWithParam<Tokens> {};

TEST_P(QlxStrTokTest, FindsTheTokens) {
  const auto &[string, delims, expected] = GetParam();
  std::string found;
  QlxStrTok state = QlxStrTokIterator(string, delims);
  while (QlxStrTokIterHasNext(state)) {
    found += "[" + take(QlxStrTokIterGet(state)) + "]";
    state = QlxStrTokIterNext(state);
  }
  EXPECT_EQ(found, expected);
  EXPECT_EQ(QlxStrTokIterGet(state), nullptr);
}

INSTANTIATE_TEST_SUITE_P(
    Strings, QlxStrTokTest,
    ::testing::Values(Tokens{"a,,b", ",", "[a][b]"}, Tokens{"ab", nullptr, "[a][b]"},
                      Tokens{"ab", "", "[a][b]"}, Tokens{",,,", ",", ""}, Tokens{"", ",", ""},
                      Tokens{"", nullptr, ""}, Tokens{nullptr, ",", ""},
                      Tokens{nullptr, nullptr, ""}, Tokens{" one \t two ", " \t", "[one][two]"},
                      Tokens{"one", ",", "[one]"}, Tokens{",one", ",", "[one]"},
                      Tokens{"one,", ",", "[one]"}, Tokens{", ,", nullptr, "[,][ ][,]"}));

TEST(QlxStrTokIterTest, GettingDoesNotMove) {
  const QlxStrTok state = QlxStrTokIterator("a b", " ");
  EXPECT_EQ(take(QlxStrTokIterGet(state)), "a");
  EXPECT_EQ(take(QlxStrTokIterGet(state)), "a");
}

TEST(QlxStrTokIterTest, TheStateIsThePlaceInTheCallersString) {
  const char *string = ",,one,two";
  const char *delims = ",";
  QlxStrTok state = QlxStrTokIterator(string, delims);
  EXPECT_EQ(state.cursor, string);
  EXPECT_EQ(state.delims, delims);
  state = QlxStrTokIterNext(state);
  EXPECT_EQ(state.cursor, string + 5);
  EXPECT_EQ(state.delims, delims);
}

TEST(QlxStrTokIterTest, AtTheEndTheStateStays) {
  const char *string = "a,";
  QlxStrTok state = QlxStrTokIterNext(QlxStrTokIterator(string, ","));
  EXPECT_EQ(QlxStrTokIterHasNext(state), 0);
  state = QlxStrTokIterNext(state);
  EXPECT_EQ(state.cursor, string + 2);
  state = QlxStrTokIterNext(state);
  EXPECT_EQ(state.cursor, string + 2);
  EXPECT_EQ(QlxStrTokIterNext(QlxStrTokIterator(nullptr, ",")).cursor, nullptr);
}

TEST(QlxStrTokIterTest, ATokenWithoutMemoryIsNull) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(QlxStrTokIterGet(QlxStrTokIterator("a", nullptr)), nullptr);
  EXPECT_EQ(memory.failures(), 1u);
}

}  // namespace
