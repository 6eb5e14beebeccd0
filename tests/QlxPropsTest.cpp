#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <string>

#include <qlx/class/containers/StringToStringMap.h>
#include <qlx/memory.h>

#include "QlxProps.h"
#include "support/FailingMemory.h"
#include "support/Take.h"

namespace {

// A conversion's input, which may be null, and what comes out: the value and the success flag.
template <typename T>
struct Case {
  const char *text;
  T value;
  uint8_t ok;
};

template <typename T, typename Convert, size_t count>
void check(Convert convert, const Case<T> (&cases)[count]) {
  for (const Case<T> &c : cases) {
    const std::string shown = c.text ? c.text : "<null>";
    uint8_t ok = 7;
    EXPECT_EQ(convert(c.text, &ok), c.value) << shown;
    EXPECT_EQ(ok, c.ok) << shown;
    EXPECT_EQ(convert(c.text, nullptr), c.value) << shown;
  }
}

TEST(QlxPropsTest, OnlyTheTwoWordsAreBooleans) {
  check<uint8_t>(qlxPropStrToBool, {{"true", 1, 1},
                                    {"TRUE", 1, 1},
                                    {"tRuE", 1, 1},
                                    {"false", 0, 1},
                                    {"False", 0, 1},
                                    {" true", 0, 0},
                                    {"true ", 0, 0},
                                    {"yes", 0, 0},
                                    {"1", 0, 0},
                                    {"0", 0, 0},
                                    {"", 0, 0},
                                    {nullptr, 0, 0}});
}

TEST(QlxPropsTest, TheFirstByteIsTheCharacterAndAnEmptyTextHasTheCharacterZero) {
  check<char>(
      qlxPropStrToChar,
      {{"abc", 'a', 1}, {" ", ' ', 1}, {"\xC3\xBC", '\xC3', 1}, {"", 0, 1}, {nullptr, 0, 0}});
}

TEST(QlxPropsTest, IntegersAreReadAsAScannerReadsThem) {
  check<int32_t>(qlxPropStrToInt32, {{"  42 ", 42, 1},
                                     {"4 2", 4, 1},
                                     {"12abc", 12, 1},
                                     {"0x10", 0, 1},
                                     {"-7", -7, 1},
                                     {"+7", 7, 1},
                                     {"007", 7, 1},
                                     {"\t\n1", 1, 1},
                                     {"2147483647", INT32_MAX, 1},
                                     {"-2147483648", INT32_MIN, 1},
                                     {"3000000000", -1294967296, 1},  // the low 32 bits
                                     {"99999999999999999999", -1, 1},
                                     {"-99999999999999999999", 0, 1},
                                     {"3.9", 3, 1},
                                     {"abc", 0, 0},
                                     {"-", 0, 0},
                                     {"", 0, 0},
                                     {" ", 0, 0},
                                     {nullptr, 0, 0}});
  check<int64_t>(qlxPropStrToInt64, {{" 9223372036854775807x", INT64_MAX, 1},
                                     {"-9223372036854775808", INT64_MIN, 1},
                                     {"0x10", 0, 1},
                                     {"", 0, 0},
                                     {"x1", 0, 0},
                                     {nullptr, 0, 0}});
}

// Around the most digits that are read without a scanner, and all that it takes beside digits.
TEST(QlxPropsTest, IntegersOfAnyLengthAreReadAsAScannerReadsThem) {
  for (const char *before : {"", " ", "\t\n", "+", "-", "- ", "00", "x"}) {
    for (const char *after : {"", " ", "x", ".5", "-", "\xc3\xa4"}) {
      std::string digits;
      for (int count = 0; count < 24; ++count, digits += static_cast<char>('0' + count % 10)) {
        const std::string text = before + digits + after;
        long long wide = 0;
        int narrow = 0;
        const bool isWide = sscanf(text.c_str(), "%lld", &wide) == 1;
        const bool isNarrow = sscanf(text.c_str(), "%d", &narrow) == 1;
        check<int64_t>(qlxPropStrToInt64, {{text.c_str(), isWide ? wide : 0, isWide}});
        check<int32_t>(qlxPropStrToInt32, {{text.c_str(), isNarrow ? narrow : 0, isNarrow}});
      }
    }
  }
}

TEST(QlxPropsTest, FloatsAreReadAsAScannerReadsThem) {
  check<float>(qlxPropStrToFloat32, {{" 1.5e3 ", 1500.0F, 1},
                                     {"0.1", 0.1F, 1},
                                     {"-.5x", -0.5F, 1},
                                     {"7", 7.0F, 1},
                                     {"x", 0.0F, 0},
                                     {"", 0.0F, 0},
                                     {nullptr, 0.0F, 0}});
  check<double>(qlxPropStrToFloat64, {{" 1.5e300 ", 1.5e300, 1},
                                      {"0.1", 0.1, 1},
                                      {"inf", INFINITY, 1},
                                      {".", 0.0, 0},
                                      {nullptr, 0.0, 0}});
}

class QlxMapPropTest : public ::testing::Test {
 protected:
  ~QlxMapPropTest() override { qlxIntlFreeStringToStringMap(map); }

  std::string stored(const char *key) {
    const char *value = qlxPeekMapProp(map, key);
    return value ? value : "<null>";
  }

  StringToStringMap *map = qlxIntlAllocStringToStringMap();
  uint8_t ok = 7;
};

TEST_F(QlxMapPropTest, AStringComesBackAsACopy) {
  EXPECT_EQ(QlxSetMapProp(map, "key", "value"), 1);
  char *copy = QlxGetMapProp(map, "key", &ok);
  EXPECT_NE(copy, qlxPeekMapProp(map, "key"));
  EXPECT_EQ(take(copy), "value");
  EXPECT_EQ(ok, 1);
  EXPECT_EQ(QlxGetMapProp(map, "Key", &ok), nullptr);
  EXPECT_EQ(ok, 0);
  EXPECT_EQ(take(QlxGetMapProp(map, "key", nullptr)), "value");
}

TEST_F(QlxMapPropTest, ANullValueIsStoredAndReadsAsAbsent) {
  EXPECT_EQ(QlxSetMapProp(map, "key", nullptr), 1);
  EXPECT_EQ(qlxIntlStringToStringMapHasKey(map, "key"), 1);
  EXPECT_EQ(QlxGetMapProp(map, "key", &ok), nullptr);
  EXPECT_EQ(ok, 0);
}

TEST_F(QlxMapPropTest, OnlyExactlyOneIsStoredAsTrue) {
  EXPECT_EQ(QlxSetMapPropBool(map, "one", 1), 1);
  EXPECT_EQ(QlxSetMapPropBool(map, "two", 2), 1);
  EXPECT_EQ(QlxSetMapPropBool(map, "none", 0), 1);
  EXPECT_EQ(stored("one"), "true");
  EXPECT_EQ(stored("two"), "false");
  EXPECT_EQ(stored("none"), "false");
  EXPECT_EQ(QlxGetMapPropBool(map, "two", &ok), 0);
  EXPECT_EQ(ok, 1);
}

TEST_F(QlxMapPropTest, TypedValuesAreStoredAsText) {
  QlxSetMapPropChar(map, "char", 'x');
  QlxSetMapPropInt(map, "int", -2147483647 - 1);
  QlxSetMapPropFloat(map, "float", 0.1F);
  QlxSetMapPropDouble(map, "double", -2.5);
  EXPECT_EQ(stored("char"), "x");
  EXPECT_EQ(stored("int"), "-2147483648");
  EXPECT_EQ(stored("float"), "0.100000");
  EXPECT_EQ(stored("double"), "-2.500000");
}

TEST_F(QlxMapPropTest, OfALongOnlyTheLowWordIsStored) {
  QlxSetMapPropLong(map, "long", 0x700000005);
  EXPECT_EQ(stored("long"), "5");
  QlxSetMapPropLong(map, "long", -1);
  EXPECT_EQ(stored("long"), "-1");
}

TEST_F(QlxMapPropTest, TheCharacterZeroIsStoredAsAnEmptyText) {
  QlxSetMapPropChar(map, "char", 0);
  EXPECT_EQ(stored("char"), "");
  EXPECT_EQ(QlxGetMapPropChar(map, "char", &ok), 0);
  EXPECT_EQ(ok, 1);
}

TEST_F(QlxMapPropTest, TypedValuesAreReadFromText) {
  QlxSetMapProp(map, "key", "42.5 of them");
  EXPECT_EQ(QlxGetMapPropChar(map, "key", nullptr), '4');
  EXPECT_EQ(QlxGetMapPropInt(map, "key", nullptr), 42);
  EXPECT_EQ(QlxGetMapPropLong(map, "key", nullptr), 42);
  EXPECT_EQ(QlxGetMapPropFloat(map, "key", nullptr), 42.5F);
  EXPECT_EQ(QlxGetMapPropDouble(map, "key", &ok), 42.5);
  EXPECT_EQ(ok, 1);
  QlxSetMapProp(map, "key", "5000000000");
  EXPECT_EQ(QlxGetMapPropLong(map, "key", &ok), 5000000000);
}

// Runs each typed getter; all must fail.
void expectAbsent(StringToStringMap *map, const char *key) {
  uint8_t flags[6] = {7, 7, 7, 7, 7, 7};
  EXPECT_EQ(QlxGetMapPropBool(map, key, &flags[0]), 0);
  EXPECT_EQ(QlxGetMapPropChar(map, key, &flags[1]), 0);
  EXPECT_EQ(QlxGetMapPropInt(map, key, &flags[2]), 0);
  EXPECT_EQ(QlxGetMapPropLong(map, key, &flags[3]), 0);
  EXPECT_EQ(QlxGetMapPropFloat(map, key, &flags[4]), 0.0F);
  EXPECT_EQ(QlxGetMapPropDouble(map, key, &flags[5]), 0.0);
  for (const uint8_t flag : flags) EXPECT_EQ(flag, 0);
}

TEST_F(QlxMapPropTest, AMissingKeyFailsEveryConversion) {
  expectAbsent(map, "none");
  expectAbsent(map, nullptr);
  expectAbsent(nullptr, "key");
}

TEST_F(QlxMapPropTest, AValueOfAnotherFormCountsAsAbsent) {
  QlxSetMapProp(map, "maxFiles", "abc");
  EXPECT_EQ(QlxGetMapPropInt(map, "maxFiles", &ok), 0);
  EXPECT_EQ(ok, 0);
}

TEST_F(QlxMapPropTest, NullMapsAndKeysStoreNothing) {
  EXPECT_EQ(QlxSetMapProp(nullptr, "key", "v"), 0);
  EXPECT_EQ(QlxSetMapProp(map, nullptr, "v"), 0);
  EXPECT_EQ(QlxSetMapPropBool(nullptr, "key", 1), 0);
  EXPECT_EQ(QlxSetMapPropBool(map, nullptr, 1), 0);
  QlxSetMapPropInt(nullptr, "key", 1);
  QlxSetMapPropInt(map, nullptr, 1);
  QlxSetMapPropChar(nullptr, "key", 'a');
  QlxSetMapPropLong(nullptr, "key", 1);
  QlxSetMapPropFloat(nullptr, "key", 1);
  QlxSetMapPropDouble(nullptr, "key", 1);
  EXPECT_EQ(qlxIntlStringToStringMapIterator(map), nullptr);
  EXPECT_EQ(QlxGetMapProp(nullptr, "key", &ok), nullptr);
  EXPECT_EQ(ok, 0);
  EXPECT_EQ(qlxPeekMapProp(map, nullptr), nullptr);
}

TEST_F(QlxMapPropTest, PeekingAndTypedReadsCopyNothing) {
  QlxSetMapProp(map, "key", "1");
  const FailingMemory memory;
  EXPECT_STREQ(qlxPeekMapProp(map, "key"), "1");
  EXPECT_EQ(QlxGetMapPropInt(map, "key", nullptr), 1);
  EXPECT_EQ(memory.attempts(), 0u);
}

TEST_F(QlxMapPropTest, WithoutMemoryNothingIsStored) {
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(QlxSetMapProp(map, "key", "v"), 0);
  EXPECT_EQ(QlxSetMapPropBool(map, "key", 1), 0);
  QlxSetMapPropInt(map, "key", 1);
  EXPECT_EQ(qlxIntlStringToStringMapIterator(map), nullptr);
}

TEST_F(QlxMapPropTest, AValueWithoutMemoryForItsCopyReadsAsAbsent) {
  QlxSetMapProp(map, "key", "v");
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(QlxGetMapProp(map, "key", &ok), nullptr);
  EXPECT_EQ(ok, 0);
}

}  // namespace
