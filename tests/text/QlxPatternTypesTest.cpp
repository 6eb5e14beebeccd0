#include "text/QlxPatternTypes.h"

#include <gtest/gtest.h>

#include <iterator>
#include <string>

#include <unicode/datefmt.h>
#include <unicode/decimfmt.h>
#include <unicode/messagepattern.h>
#include <unicode/msgfmt.h>

#include "support/RandomWords.h"

namespace {

char letterOf(ArgType type) {
  return "-SID"[static_cast<int>(type)];
}

// One letter for each index up to the last that has a type: string, integer, double, "-" for none.
// "error" when the pattern cannot be read.
std::string typesOf(const std::u16string &pattern) {
  ArgTypes types;
  types.fill(ArgType::kDouble);
  if (!qlxScanPatternTypes(pattern.c_str(), &types)) return "error";
  std::string letters;
  for (const ArgType type : types) letters += letterOf(type);
  return letters.substr(0, letters.find_last_not_of('-') + 1);
}

struct Case {
  const char16_t *pattern;
  const char *types;
};

void expectTypes(std::initializer_list<Case> cases) {
  for (const auto &[pattern, types] : cases) {
    EXPECT_EQ(typesOf(pattern), types) << ::testing::PrintToString(std::u16string(pattern));
  }
}

// ---- Types

TEST(PatternTypesTest, AnArgumentWithoutATypeIsAString) {
  expectTypes({{u"", ""}, {u"text", ""}, {u"{0}", "S"}, {u"{1} and {0}", "SS"}});
}

TEST(PatternTypesTest, ANumberIsADoubleUnlessItsStyleIsInteger) {
  expectTypes({{u"{0,number}", "D"},
               {u"{0,number,integer}", "I"},
               {u"{0,number,percent}", "D"},
               {u"{0,number,#,##0.00}", "D"},
               {u"{0,number,}", "D"},
               {u"{0,number,integers}", "D"},
               {u"{0,number,integer,}", "D"}});
}

TEST(PatternTypesTest, AChoiceIsADouble) {
  expectTypes({{u"{0,choice,0#none|1#one}", "D"}, {u"{0,choice}", "D"}});
}

TEST(PatternTypesTest, OtherTypesAreNone) {
  expectTypes({{u"{0,date}", ""},
               {u"{0,time,short}", ""},
               {u"{0,plural,other{x}}", ""},
               {u"{0,}", ""},
               {u"{0} {1,date}", "S"},
               {u"{0,date} {1}", "-S"}});
}

TEST(PatternTypesTest, WordsAreComparedExactly) {
  expectTypes({{u"{0,Number}", ""},
               {u"{0,numbers}", ""},
               {u"{0,numbe}", ""},
               {u"{0,Choice,0#x}", ""},
               {u"{0,number,Integer}", "D"}});
}

TEST(PatternTypesTest, AnIndexThatIsNotThereHasNoType) {
  expectTypes({{u"{0} {2}", "S-S"}, {u"{9}", "---------S"}});
}

TEST(PatternTypesTest, TheLastTypeOfAnIndexCounts) {
  expectTypes({{u"{0} {0,number}", "D"}, {u"{0,number} {0}", "S"}, {u"{0,number} {0,date}", ""}});
}

// ---- Indexes

TEST(PatternTypesTest, IndexesAboveNineAreIgnored) {
  expectTypes({{u"{10}", ""},
               {u"{0} {10,number} {11}", "S"},
               {u"{4294967296}", ""},
               {u"{9999999999}", ""},
               {u"{0000000003}", "---S"}});
}

TEST(PatternTypesTest, AnIndexHasOneToTenDecimalDigits) {
  expectTypes({{u"{}", "error"},
               {u"{,number}", "error"},
               {u"{name}", "error"},
               {u"{-1}", "error"},
               {u"{0x}", "error"},
               {u"{\u0660}", "error"},
               {u"{00000000000}", "error"},
               {u"{10000000000}", "error"}});
}

// ---- Quotes

TEST(PatternTypesTest, AnApostropheTogglesQuoting) {
  expectTypes({{u"'{0}'", ""}, {u"'{0}' {1}", "-S"}, {u"'{'{0}'}'", "S"}, {u"'{0", ""}});
}

TEST(PatternTypesTest, TwoApostrophesAreALiteralOneEverywhereOutsideAnArgument) {
  expectTypes({{u"it''s {0}", "S"}, {u"'{0}'' {1}", ""}, {u"'''{0}", ""}, {u"''''{0}", "S"}});
}

TEST(PatternTypesTest, InsideAnArgumentQuotedCharactersAreLiteral) {
  expectTypes({{u"{'0'}", "S"},
               {u"{0'}'}", "error"},
               {u"{0,number,'}'}", "D"},
               {u"{0,number,'{'}", "D"},
               {u"{0,number,'integer'}", "I"},
               {u"{0,number,''integer}", "I"},
               {u"{0,'number,integer'}", ""},
               {u"{0' '}", "error"},
               {u"{0,number,'", "error"}});
}

// ---- White space, braces, the end

TEST(PatternTypesTest, WhiteSpaceOfAnArgumentIsDropped) {
  expectTypes({{u"{ 0 }", "S"},
               {u"{\t0\n,\r number ,\u0085 int eger }", "I"},
               {u"{\u200E0\u2028}", "S"},
               {u"{0\u00A0}", "error"}});
}

TEST(PatternTypesTest, BracesNestOnlyInTheStyle) {
  expectTypes({{u"{0,choice,0#{1}|1#{2,number}}", "D"},
               {u"{0,choice,0#{1}", "error"},
               {u"{0,number,{{x}{y}}} {1}", "DS"},
               {u"{0,number,{integer}}", "D"},
               {u"{{0}}", "error"},
               {u"{0{}}", "error"},
               {u"{0,num{ber}}", "error"}});
}

TEST(PatternTypesTest, AClosingBraceOutsideAnArgumentIsText) {
  expectTypes({{u"} {0} }}", "S"}});
}

TEST(PatternTypesTest, AnArgumentThatIsOpenAtTheEndIsAnError) {
  expectTypes({{u"{", "error"},
               {u"{0", "error"},
               {u"{0,", "error"},
               {u"{0,number,integer", "error"},
               {u"{0} {1", "error"}});
}

// ---- Beside ICU

// The types with which ICU reads a pattern's arguments, each by the format that it made for it (a
// choice has none: it compares doubles); "error" when it cannot be read. Letters as above, where a
// date is "-".
std::string typesByIcu(const std::u16string &pattern) {
  UErrorCode status = U_ZERO_ERROR;
  UParseError where;
  const icu::UnicodeString text(pattern.c_str());
  const icu::MessageFormat format(text, icu::Locale::getUS(), where, status);
  const icu::MessagePattern parts(text, &where, status);
  if (U_FAILURE(status)) return "error";
  int32_t count = 0;
  const icu::Format **formats = format.getFormats(count);
  std::string letters(10, '-');
  int32_t at = 0;
  for (int32_t i = 1; i < parts.countParts(); i = parts.getLimitPartIndex(i) + 1) {
    if (parts.getPartType(i) != UMSGPAT_PART_TYPE_ARG_START) continue;
    const icu::Format *made = formats[at++];
    const auto *number = dynamic_cast<const icu::NumberFormat *>(made);
    const int32_t index = parts.getPart(i + 1).getValue();
    if (index > 9) continue;
    char &letter = letters[static_cast<size_t>(index)];
    const bool isChoice = parts.getPart(i).getArgType() == UMSGPAT_ARG_TYPE_CHOICE;
    letter = isChoice                       ? 'D'
             : !made                        ? 'S'
             : !number                      ? '-'
             : number->isParseIntegerOnly() ? 'I'
                                            : 'D';
  }
  EXPECT_EQ(at, count);
  return letters.substr(0, letters.find_last_not_of('-') + 1);
}

// Patterns without quotes that both sides claim to read.
class Patterns : RandomWords<char16_t> {
 public:
  Patterns() : RandomWords(20060816) {}

  std::u16string next() {
    std::u16string pattern;
    for (size_t pieces = below(7); pieces > 0; --pieces) pattern += below(2) ? argument() : text();
    return pattern;
  }

 private:
  std::u16string space() { return oneOf({u"", u"", u" ", u"\t", u"\n ", u"\u200F"}); }

  std::u16string text() {
    return oneOf({u"", u"text ", u"0", u",", u"#", u"|", u"} ", u"number", u"\u00FC\u4E00 "});
  }

  std::u16string argument() {
    const std::u16string index = oneOf({u"0", u"1", u"2", u"3", u"4", u"9", u"10", u"31"});
    std::u16string argument = u"{" + space() + index + space();
    switch (below(6)) {
      case 0:
      case 1:
        break;
      case 2:
      case 3:
        argument += u"," + space() + u"number" + space() + numberStyle();
        break;
      case 4:
        argument += u"," + space() + u"choice," + oneOf({u"0#no|1#one|1<many", u"0#x"});
        break;
      default:
        argument += oneOf({u",date", u", time", u",date,short", u",time,HH:mm", u" , date, yyyy"});
    }
    return argument + u"}";
  }

  std::u16string numberStyle() {
    const std::u16string style =
        oneOf({u"", u"integer", u"integer", u"percent", u"currency", u"#,##0.00", u"0.###"});
    return style.empty() ? style : u"," + space() + style + space();
  }
};

TEST(PatternTypesTest, AnApostropheThatIcuPrintsTogglesToo) {
  EXPECT_EQ(typesByIcu(u"it's {0}"), "S");
  expectTypes({{u"it's {0}", ""}, {u"it's {0} and it's {1}", "-S"}});
}

TEST(PatternTypesTest, TheTypesAreThoseWithWhichIcuReadsTheArguments) {
  Patterns patterns;
  size_t compared[2] = {};  // of one argument at most, of several
  for (int i = 0; i < 4000; ++i) {
    const std::u16string pattern = patterns.next();
    const std::string expected = typesByIcu(pattern);
    ASSERT_EQ(typesOf(pattern), expected) << ::testing::PrintToString(pattern);
    ASSERT_NE(expected, "error") << ::testing::PrintToString(pattern);
    ++compared[expected.size() > 1];
  }
  EXPECT_GT(compared[0], 1000U);
  EXPECT_GT(compared[1], 1000U);
}

TEST(PatternTypesTest, WhatIcuReadsOfADamagedPatternIsReadAlike) {
  Patterns patterns;
  std::mt19937 random(811);
  size_t read = 0;
  for (int i = 0; i < 4000; ++i) {
    std::u16string pattern = patterns.next();
    if (pattern.empty()) continue;
    const size_t at = random() % pattern.size();
    if (i % 2) {
      pattern.resize(at);
    } else {
      pattern.erase(at, 1);
    }
    const std::string byIcu = typesByIcu(pattern);
    const std::string found = typesOf(pattern);
    if (byIcu == "error" || found == "error") continue;
    ++read;
    EXPECT_EQ(found, byIcu) << ::testing::PrintToString(pattern);
  }
  EXPECT_GT(read, 1000U);
}

}  // namespace
