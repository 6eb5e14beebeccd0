#include <gtest/gtest.h>

#include <string>

#include <qlx/memory.h>

#include "support/FailingMemory.h"

namespace {

int sign(int32_t result) {
  return (result > 0) - (result < 0);
}

struct Comparison {
  const char *name;
  int32_t (*compare)(const char *, const char *);
};

class StringComparison : public ::testing::TestWithParam<Comparison> {};

TEST_P(StringComparison, NullFirstIsGreaterAlsoAgainstNull) {
  EXPECT_EQ(GetParam().compare(nullptr, nullptr), 1);
  EXPECT_EQ(GetParam().compare(nullptr, "a"), 1);
  EXPECT_EQ(GetParam().compare(nullptr, ""), 1);
  EXPECT_EQ(GetParam().compare("a", nullptr), -1);
  EXPECT_EQ(GetParam().compare("", nullptr), -1);
}

TEST_P(StringComparison, OrdersStrings) {
  EXPECT_EQ(GetParam().compare("abc", "abc"), 0);
  EXPECT_EQ(sign(GetParam().compare("abc", "abd")), -1);
  EXPECT_EQ(sign(GetParam().compare("b", "abc")), 1);
  EXPECT_EQ(sign(GetParam().compare("ab", "abc")), -1);
  EXPECT_EQ(sign(GetParam().compare("\xC4", "z")), 1) << "bytes are unsigned";
}

INSTANTIATE_TEST_SUITE_P(
    All, StringComparison,
    ::testing::Values(
        Comparison{"Cmp", OslStringCmp}, Comparison{"ICmp", OslStringICmp},
        Comparison{"NCmp", [](const char *a, const char *b) { return OslStringNCmp(a, b, 10); }},
        Comparison{"NICmp", [](const char *a, const char *b) { return OslStringNICmp(a, b, 10); }}),
    [](const auto &info) { return info.param.name; });

TEST(CxStringsTest, OnlyTheICmpsIgnoreCase) {
  EXPECT_NE(OslStringCmp("Abc", "aBC"), 0);
  EXPECT_NE(OslStringNCmp("Abc", "aBC", 3), 0);
  EXPECT_EQ(OslStringICmp("Abc", "aBC"), 0);
  EXPECT_EQ(OslStringNICmp("Abc", "aBC", 3), 0);
}

TEST(CxStringsTest, TheCountedComparisonsStopAtTheCount) {
  EXPECT_EQ(OslStringNCmp("abcX", "abcY", 3), 0);
  EXPECT_NE(OslStringNCmp("abcX", "abcY", 4), 0);
  EXPECT_EQ(OslStringNICmp("abcX", "ABCY", 3), 0);
  EXPECT_NE(OslStringNICmp("abcX", "ABCY", 4), 0);
  EXPECT_EQ(OslStringNCmp("a", "b", 0), 0);
  EXPECT_EQ(OslStringNICmp("a", "b", 0), 0);
}

TEST(CxStringsTest, TheNullRuleHoldsForACountOfZero) {
  for (const auto compare : {OslStringNCmp, OslStringNICmp}) {
    EXPECT_EQ(compare(nullptr, nullptr, 0), 1);
    EXPECT_EQ(compare(nullptr, "a", 0), 1);
    EXPECT_EQ(compare("a", nullptr, 0), -1);
  }
}

TEST(CxStringsTest, CatAppends) {
  char text[10] = "ab";
  EXPECT_EQ(OslStringCat(text, "cd"), text);
  EXPECT_STREQ(text, "abcd");
}

TEST(CxStringsTest, CatOfNullChangesNothing) {
  char text[10] = "ab";
  EXPECT_EQ(OslStringCat(text, nullptr), text);
  EXPECT_STREQ(text, "ab");
  EXPECT_EQ(OslStringCat(nullptr, "cd"), nullptr);
  EXPECT_EQ(OslStringCat(nullptr, nullptr), nullptr);
}

TEST(CxStringsTest, NCatAppendsAShortSourceAndItsTerminatorOnly) {
  std::string text("ab\0......", 9);
  EXPECT_EQ(OslStringNCat(text.data(), "cde", 10), text.data());
  EXPECT_EQ(text, std::string("abcde\0...", 9));
}

TEST(CxStringsTest, NCatCutsALongSourceAndTerminates) {
  std::string text("ab\0......", 9);
  EXPECT_EQ(OslStringNCat(text.data(), "cdefgh", 2), text.data());
  EXPECT_EQ(text, std::string("abcd\0....", 9));
  OslStringNCat(text.data(), "xyz", 0);
  EXPECT_STREQ(text.c_str(), "abcd");
}

TEST(CxStringsTest, NCatOfNullChangesNothing) {
  char text[10] = "ab";
  EXPECT_EQ(OslStringNCat(text, nullptr, 3), text);
  EXPECT_STREQ(text, "ab");
  EXPECT_EQ(OslStringNCat(nullptr, "cd", 2), nullptr);
}

TEST(CxStringsTest, CpyCopies) {
  char text[10] = "abcdef";
  EXPECT_EQ(OslStringCpy(text, "xy"), text);
  EXPECT_STREQ(text, "xy");
  EXPECT_EQ(OslStringCpy(nullptr, "xy"), nullptr);
}

TEST(CxStringsTest, CpyOfNullEmpties) {
  char text[10] = "ab";
  EXPECT_EQ(OslStringCpy(text, nullptr), text);
  EXPECT_STREQ(text, "");
  EXPECT_EQ(OslStringCpy(nullptr, nullptr), nullptr);
}

TEST(CxStringsTest, NCpyFillsTheRestWithZeroBytes) {
  std::string text = "......";
  EXPECT_EQ(OslStringNCpy(text.data(), "ab", 4), text.data());
  EXPECT_EQ(text, std::string("ab\0\0..", 6));
}

TEST(CxStringsTest, NCpyAddsNoTerminatorWhenTheSourceFillsTheCount) {
  std::string text = "......";
  OslStringNCpy(text.data(), "abcd", 4);
  EXPECT_EQ(text, "abcd..");
  OslStringNCpy(text.data(), "wxyz", 2);
  EXPECT_EQ(text, "wxcd..");
}

TEST(CxStringsTest, NCpyOfNullWritesATerminatorWhateverTheCount) {
  for (const uint32_t count : {0u, 1u, 5u}) {
    std::string text = "abcdef";
    EXPECT_EQ(OslStringNCpy(text.data(), nullptr, count), text.data());
    EXPECT_EQ(text, std::string("\0bcdef", 6)) << count;
  }
  EXPECT_EQ(OslStringNCpy(nullptr, "a", 1), nullptr);
  EXPECT_EQ(OslStringNCpy(nullptr, nullptr, 1), nullptr);
}

TEST(CxStringsTest, DupMakesABlockOfTheLibrary) {
  const FailingMemory memory;
  const char *const source = "some text";
  char *const copy = OslStringDup(source);
  EXPECT_STREQ(copy, source);
  EXPECT_NE(copy, source);
  EXPECT_EQ(memory.live(), 1);
  OslMemoryFree(copy);
  EXPECT_EQ(memory.live(), 0);
}

TEST(CxStringsTest, DupOfTheEmptyStringIsABlockToo) {
  char *const copy = OslStringDup("");
  EXPECT_STREQ(copy, "");
  OslMemoryFree(copy);
}

TEST(CxStringsTest, DupOfNullOrWithoutMemoryGivesNull) {
  EXPECT_EQ(OslStringDup(nullptr), nullptr);
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(OslStringDup("text"), nullptr);
}

TEST(CxStringsTest, LenCountsBytesAndIsZeroForNull) {
  EXPECT_EQ(OslStringLen("abc"), 3u);
  EXPECT_EQ(OslStringLen(""), 0u);
  EXPECT_EQ(OslStringLen(nullptr), 0u);
}

TEST(CxStringsTest, ChrAndRChrFindTheFirstAndTheLastPlace) {
  const char *const text = "a.b.c";
  EXPECT_EQ(OslStringChr(text, '.'), text + 1);
  EXPECT_EQ(OslStringRChr(text, '.'), text + 3);
  EXPECT_EQ(OslStringChr(text, 0), text + 5);
  EXPECT_EQ(OslStringRChr(text, 0), text + 5);
  EXPECT_EQ(OslStringChr(text, 'x'), nullptr);
  EXPECT_EQ(OslStringRChr(text, 'x'), nullptr);
  EXPECT_EQ(OslStringChr(nullptr, '.'), nullptr);
  EXPECT_EQ(OslStringRChr(nullptr, '.'), nullptr);
}

TEST(CxStringsTest, StrFindsANeedle) {
  const char *const text = "one two two";
  EXPECT_EQ(OslStringStr(text, "two"), text + 4);
  EXPECT_EQ(OslStringStr(text, ""), text);
  EXPECT_EQ(OslStringStr(text, "three"), nullptr);
  EXPECT_EQ(OslStringStr(nullptr, "two"), nullptr);
  EXPECT_EQ(OslStringStr(text, nullptr), nullptr);
  EXPECT_EQ(OslStringStr(nullptr, nullptr), nullptr);
}

TEST(CxStringsTest, StrpbrkFindsAnyByteOfASet) {
  const char *const text = "key=value";
  EXPECT_EQ(OslStringStrpbrk(text, ":="), text + 3);
  EXPECT_EQ(OslStringStrpbrk(text, "#"), nullptr);
  EXPECT_EQ(OslStringStrpbrk(nullptr, "="), nullptr);
  EXPECT_EQ(OslStringStrpbrk(text, nullptr), nullptr);
}

TEST(CxStringsTest, StrcspnCountsTheBytesOutsideASet) {
  EXPECT_EQ(OslStringStrcspn("key=value", ":="), 3u);
  EXPECT_EQ(OslStringStrcspn("abc", nullptr), 3u);
  EXPECT_EQ(OslStringStrcspn(nullptr, "abc"), 0xFFFFFFFFu);
  EXPECT_EQ(OslStringStrcspn(nullptr, nullptr), 0xFFFFFFFFu);
}

TEST(CxStringsTest, StrspnCountsTheBytesInsideASet) {
  EXPECT_EQ(OslStringStrspn("aabbc", "ab"), 4u);
  EXPECT_EQ(OslStringStrspn("abc", nullptr), 0u);
  EXPECT_EQ(OslStringStrspn(nullptr, "abc"), 0xFFFFFFFFu);
  EXPECT_EQ(OslStringStrspn(nullptr, nullptr), 0xFFFFFFFFu);
}

TEST(CxStringsTest, SprintfPrintsAndCounts) {
  char text[40];
  EXPECT_EQ(OslStringSprintf(text, "%s has %d of %c", "it", 12, 'x'), 14);
  EXPECT_STREQ(text, "it has 12 of x");
}

}  // namespace
