#include <gtest/gtest.h>

#include <qlx/level.h>

namespace {

struct LevelCase {
  const char *text;
  int32_t level;
};

void PrintTo(const LevelCase &given, std::ostream *out) {
  *out << (given.text ? given.text : "<null>") << " -> " << given.level;
}

class LevelWordTest : public testing::TestWithParam<LevelCase> {};

TEST_P(LevelWordTest, IsReadAsItsLevel) {
  EXPECT_EQ(QlxGetLevelFromString(GetParam().text), GetParam().level);
}

INSTANTIATE_TEST_SUITE_P(Words, LevelWordTest,
                         testing::Values(LevelCase{"FATAL", 7000}, LevelCase{"ERROR", 6000},
                                         LevelCase{"WARN", 5000}, LevelCase{"INFO", 4000},
                                         LevelCase{"DEBUG_MIN", 3000}, LevelCase{"MIN", 3000},
                                         LevelCase{"DEBUG_MID", 2000}, LevelCase{"MID", 2000},
                                         LevelCase{"DEBUG_MAX", 1000}, LevelCase{"MAX", 1000},
                                         LevelCase{"ALL", 0}, LevelCase{"OFF", 9999}));

INSTANTIATE_TEST_SUITE_P(AnyCase, LevelWordTest,
                         testing::Values(LevelCase{"info", 4000}, LevelCase{"debug_mid", 2000},
                                         LevelCase{"mid", 2000}, LevelCase{"oFf", 9999}));

INSTANTIATE_TEST_SUITE_P(StartsOfTexts, LevelWordTest,
                         testing::Values(LevelCase{"Info messages", 4000},
                                         LevelCase{"Informational", 4000},
                                         LevelCase{"warning", 5000}, LevelCase{"fatal error", 7000},
                                         LevelCase{"OFFICIAL", 9999}, LevelCase{"ALLOW", 0},
                                         LevelCase{"maximum", 1000}, LevelCase{"minus", 3000}));

INSTANTIATE_TEST_SUITE_P(Numbers, LevelWordTest,
                         testing::Values(LevelCase{"0", 0}, LevelCase{"7000", 7000},
                                         LevelCase{"+3000", 3000}, LevelCase{"4500", 4500},
                                         LevelCase{" -5", -5}, LevelCase{"12abc", 12},
                                         LevelCase{"\t\n\v\f\r 7", 7}, LevelCase{"0x10", 0},
                                         LevelCase{"5000 INFO", 5000}, LevelCase{"-9999", -9999}));

INSTANTIATE_TEST_SUITE_P(NothingIsAll, LevelWordTest,
                         testing::Values(LevelCase{"", 0}, LevelCase{"   ", 0},
                                         LevelCase{"\t\n\v\f\r", 0}));

INSTANTIATE_TEST_SUITE_P(AnythingElseIsNoLevel, LevelWordTest,
                         testing::Values(LevelCase{nullptr, -9999}, LevelCase{"DEBUG", -9999},
                                         LevelCase{"WAR", -9999}, LevelCase{" INFO", -9999},
                                         LevelCase{"-", -9999}, LevelCase{"+", -9999},
                                         LevelCase{"-INFO", -9999}, LevelCase{"LOUD", -9999},
                                         LevelCase{"DEBUG MIN", -9999}));

TEST(LevelTest, HasTheValuesThatEveryHostWritesIntoItsFiles) {
  EXPECT_EQ(OFF, 9999);
  EXPECT_EQ(FATAL, 7000);
  EXPECT_EQ(ERROR, 6000);
  EXPECT_EQ(WARN, 5000);
  EXPECT_EQ(INFO, 4000);
  EXPECT_EQ(DEBUG_MIN, 3000);
  EXPECT_EQ(DEBUG_MID, 2000);
  EXPECT_EQ(DEBUG_MAX, 1000);
  EXPECT_EQ(ALL, 0);
  EXPECT_EQ(UNSPECIFIED, -9999);
}

}  // namespace
