#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <string>
#include <vector>

#include <unicode/ustdio.h>
#include <unicode/ustring.h>

#include "CxUString.h"
#include "support/CaptureStdout.h"
#include "support/FailingMemory.h"
#include "support/Status.h"
#include "support/Take.h"

namespace {

std::string parmText(const Parm &parm) {
  return take(CxUStringParmToStr(&parm));
}

Parm int64Parm(int64_t value) {
  return {.type = ParmInt64, .value = {.l = value}};
}

std::string parmText(double value) {
  return parmText(Parm{.type = ParmFloat64, .value = {.d = value}});
}

TEST(CxUStringTest, AnEmptyTextBecomesATerminatorOnly) {
  EXPECT_EQ(take(CxUStringDupStrToUChar("")), u"");
  EXPECT_EQ(take(CxUStringDupUCharToStr(u"")), "");
  EXPECT_EQ(take(CxUStringDup(u"")), u"");
}

TEST(CxUStringTest, NullGivesNull) {
  EXPECT_EQ(CxUStringDupStrToUChar(nullptr), nullptr);
  EXPECT_EQ(CxUStringDupUCharToStr(nullptr), nullptr);
  EXPECT_EQ(CxUStringDup(nullptr), nullptr);
  EXPECT_EQ(CxUStringParmToStr(nullptr), nullptr);
}

TEST(CxUStringTest, ConvertsBetweenUtf8AndUtf16) {
  EXPECT_EQ(take(CxUStringDupStrToUChar("Gr\xC3\xBC\xC3\x9F"
                                        "e \xF0\x9F\x98\x80")),
            u"Grüße 😀");
  EXPECT_EQ(take(CxUStringDupUCharToStr(u"Grüße 😀")),
            "Gr\xC3\xBC\xC3\x9F"
            "e \xF0\x9F\x98\x80");
}

// Around the eight bytes and four units that are looked at together, too.
TEST(CxUStringTest, GivesWhatTheConverterGivesForEveryByteInEveryPlace) {
  for (size_t place = 0; place < 20; ++place) {
    for (int byte = 1; byte < 256; ++byte) {
      std::string text(20, 'x');
      text[place] = static_cast<char>(byte);
      UChar expected[64];
      u_uastrcpy(expected, text.c_str());
      EXPECT_EQ(take(CxUStringDupStrToUChar(text.c_str())), expected) << place << ' ' << byte;
    }
  }
}

TEST(CxUStringTest, GivesWhatTheConverterGivesForEveryUnit) {
  for (int unit = 1; unit < 0x10000; ++unit) {
    std::u16string text(11, u'x');
    text[static_cast<size_t>(unit) % text.size()] = static_cast<UChar>(unit);
    char expected[64];
    u_austrcpy(expected, text.c_str());
    EXPECT_EQ(take(CxUStringDupUCharToStr(text.c_str())), expected) << unit;
  }
}

TEST(CxUStringTest, ConvertsTextsOfAnyLength) {
  for (size_t length = 0; length < 70; ++length) {
    const std::u16string units = std::u16string(length, u'a') + u"ü";
    const std::string bytes = std::string(length, 'a') + "\xC3\xBC";
    EXPECT_EQ(take(CxUStringDupUCharToStr(units.c_str())), bytes);
    EXPECT_EQ(take(CxUStringDupStrToUChar(bytes.c_str())), units);
    EXPECT_EQ(take(CxUStringDupUCharToStr(units.substr(0, length).c_str())),
              bytes.substr(0, length));
    EXPECT_EQ(take(CxUStringDupStrToUChar(bytes.substr(0, length).c_str())),
              units.substr(0, length));
  }
}

TEST(CxUStringTest, DupCopies) {
  const std::u16string text = u"Grüße 😀";
  UChar *copy = CxUStringDup(text.c_str());
  EXPECT_NE(copy, text.c_str());
  EXPECT_EQ(take(copy), text);
}

TEST(CxUStringTest, ExhaustedMemoryGivesNull) {
  const Parm number = {.type = ParmInt32, .value = {.i = 1}};
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxUStringDupStrToUChar("a"), nullptr);
  EXPECT_EQ(CxUStringDupUCharToStr(u"a"), nullptr);
  EXPECT_EQ(CxUStringDup(u"a"), nullptr);
  EXPECT_EQ(CxUStringParmToStr(&number), nullptr);
  EXPECT_EQ(memory.failures(), 4u);
}

TEST(CxUStringTest, WritesParametersByTheirType) {
  char name[] = "n\xC3\xA4me";
  EXPECT_EQ(parmText({.type = ParmByte, .value = {.c = 'b'}}), "b");
  EXPECT_EQ(parmText({.type = ParmChar, .value = {.c = 'c'}}), "c");
  EXPECT_EQ(parmText({.type = ParmInt32, .value = {.i = -42}}), "-42");
  EXPECT_EQ(parmText({.type = ParmFloat32, .value = {.f = 0.5F}}), "0.500000");
  EXPECT_EQ(parmText({.type = ParmFloat64, .value = {.d = 1.5}}), "1.500000");
  EXPECT_EQ(parmText({.type = ParmString, .value = {.s = name}}), name);
}

TEST(CxUStringTest, OfA64BitParameterOnlyTheLowWordIsText) {
  EXPECT_EQ(parmText(int64Parm(5)), "5");
  EXPECT_EQ(parmText(int64Parm(0x700000005)), "5");
  EXPECT_EQ(parmText(int64Parm(0x100000000)), "0");
  EXPECT_EQ(parmText(int64Parm(0xFFFFFFFF)), "-1");
}

TEST(CxUStringTest, WritesIntegersAsIcuDoes) {
  for (const int32_t value : {0, 7, -7, 1000, 123456789, INT32_MAX, INT32_MIN}) {
    char expected[64];
    UChar units[64];
    u_snprintf(units, 64, "%d", value);
    u_austrcpy(expected, units);
    EXPECT_EQ(parmText({.type = ParmInt32, .value = {.i = value}}), expected);
  }
}

TEST(CxUStringTest, WritesFloatsByTheRulesOfIcuNotOfC) {
  EXPECT_EQ(parmText(-1234567.25), "-1234567.250000");
  EXPECT_EQ(parmText(std::nan("")), "NaN");
  char c[64];
  std::snprintf(c, sizeof c, "%f", 1.0000005);
  EXPECT_STREQ(c, "1.000001");
  EXPECT_EQ(parmText(1.0000005), "1.000000");
}

TEST(CxUStringTest, TextsOfParametersAreCutAt256Units) {
  std::string longText(300, 'x');
  EXPECT_EQ(parmText({.type = ParmString, .value = {.s = longText.data()}}),
            longText.substr(0, 256));
  std::string fitting(256, 'y');
  EXPECT_EQ(parmText({.type = ParmString, .value = {.s = fitting.data()}}), fitting);
  EXPECT_EQ(parmText(1e300).size(), 256u);
}

TEST(CxUStringTest, AParameterOfAnUnknownTypeHasNoText) {
  for (const int32_t type : {0, 500, 508, -1}) EXPECT_EQ(parmText(Parm{type, {}}), "<null>");
}

// What a function writes to the standard output stream.
template <typename Function>
std::string printed(Function function) {
  CaptureStdout capture;
  function();
  return capture.bytes();
}

TEST(CxUStringTest, PrintsTheTextAndALineFeed) {
  CxStatus status{'x', 1};
  EXPECT_EQ(printed([&] { status = CxUStringToStdout(u"Grüße"); }),
            "Gr\xC3\xBC\xC3\x9F"
            "e\n");
  EXPECT_EQ(status, kSuccess);
  EXPECT_EQ(printed([] { CxUStringToStdout(u""); }), "\n");
}

TEST(CxUStringTest, PrintsNothingForNull) {
  CxStatus status{'x', 1};
  EXPECT_EQ(printed([&] { status = CxUStringToStdout(nullptr); }), "");
  EXPECT_EQ(status, kSuccess);
}

TEST(CxUStringTest, PrintsInOrderWithTheProcessesOwnOutput) {
  EXPECT_EQ(printed([] {
              std::fputs("1", stdout);
              CxUStringToStdout(u"2");
              std::fputs("3", stdout);
              CxUStringToStdout(u"4");
            }),
            "12\n34\n");
}

TEST(CxUStringTest, HalfACharacterAtTheEndDoesNotReachTheNextText) {
  const char16_t half[] = {u'a', 0xD83D, 0};
  EXPECT_EQ(printed([&] { CxUStringToStdout(half); }), "a\xEF\xBF\xBD\n");
  EXPECT_EQ(printed([] {
              CxUStringToStdout(
                  u"\xDE00"
                  "b");
            }),
            "\xEF\xBF\xBD"
            "b\n");
}

TEST(CxUStringTest, PrintsALongText) {
  const std::u16string text(5000, u'x');
  EXPECT_EQ(printed([&] { CxUStringToStdout(text.c_str()); }), std::string(5000, 'x') + "\n");
}

}  // namespace
