// Names of locales, as hosts and environments may give them: ICU ends the process for some.
#include "text/QlxFormatCache.h"
#include "text/QlxMessageCache.h"
#include "text/QlxBundleCache.h"
#include "text/QlxDateCache.h"
#include "text/QlxNumberCache.h"

#include <gtest/gtest.h>

#include <random>
#include <span>
#include <string>
#include <vector>

#include <unicode/locid.h>
#include <unicode/uloc.h>
#include <unicode/umsg.h>

#include "support/CachedFormatsTest.h"
#include "support/Child.h"
#include "support/FormatResult.h"
#include "support/RandomWords.h"

namespace {

FormatResult bindArgs(const char *locale, const UChar *pattern, va_list *args) {
  CxUStringBuff text{};
  UErrorCode status = U_ZERO_ERROR;
  qlxAppendCachedMessage(&text, locale, pattern, args, &status);
  const FormatResult bound{text.data ? text.data : u"", U_FAILURE(status) ? status : 0};
  CxUStringBuffDiscard(&text);
  return bound;
}

// By ICU itself.
FormatResult byIcu(const char *locale, const UChar *pattern, ...) {
  UErrorCode status = U_ZERO_ERROR;
  const icu::LocalUMessageFormatPointer format{umsg_open(pattern, -1, locale, nullptr, &status)};
  UChar room[500] = {};
  va_list args;
  va_start(args, pattern);
  if (U_SUCCESS(status)) umsg_vformat(format.getAlias(), room, 500, args, &status);
  va_end(args);
  return {U_SUCCESS(status) ? room : u"", U_FAILURE(status) ? status : 0};
}

FormatResult bind(const char *locale, const UChar *pattern, ...) {
  va_list args;
  va_start(args, pattern);
  const FormatResult bound = bindArgs(locale, pattern, &args);
  va_end(args);
  return bound;
}

std::u16string date(const char *pattern) {
  CxUStringBuff text{};
  EXPECT_EQ(qlxAppendCachedDate(&text, {pattern, false}, 1155725335123.0), 1);
  const std::u16string made = text.data ? text.data : u"";
  CxUStringBuffDiscard(&text);
  return made;
}

// Of one double, and of a class whose formats ICU makes by more of the locale than its numbers.
constexpr const UChar *kDelicate[] = {u"{0,date}",
                                      u"{0,time,HH:mm}",
                                      u"{0,date,::yMMMd}",
                                      u"{0, TIME ,short}",
                                      u"{0,plural,one{# one}other{# many}}",
                                      u"{0,selectordinal,one{#st}other{#th}}",
                                      u"{0,select,other{{0,Plural,other{#}}}}",
                                      u"{0,ordinal}",
                                      u"{0,spellout}",
                                      u"{0,duration}",
                                      u"{0,number,\u00a4\u00a4\u00a4 #}",
                                      u"{0,number, ::compact-short}",
                                      u"{0,number,::unit/meter}",
                                      u"{0,number,::currency/EUR unit-width-full-name}"};

constexpr const UChar *kOthers[] = {u"{0,number}", u"{0,number,percent}", u"{0,number,currency}",
                                    u"{0,number,#,##0.0 \u00a4\u00a4}",
                                    u"{0,choice,0#none|1#{0,number}}"};

std::string repeated(size_t count, const char *text = "k") {
  std::string all;
  while (all.size() < count) all += text;
  return all.substr(0, count);
}

using CachedLocalesTest = CachedFormatsTest;

// ---- Which names are good

TEST_F(CachedLocalesTest, EveryLocaleOfIcuIsGoodInEveryUsualSpelling) {
  for (int32_t i = 0; i < uloc_countAvailable(); ++i) {
    const std::string name = uloc_getAvailable(i);
    std::string dashed = name;
    for (char &c : dashed)
      if (c == '_') c = '-';
    for (const std::string &spelling :
         {name, dashed, name + ".UTF-8", name + ".utf8@euro", name + "@calendar=buddhist",
          name + "@numbers=arab", name + "@collation=phonebook",
          name + "@calendar=islamic-umalqura;collation=standard;currency=EUR;numbers=latn",
          dashed + "-u-ca-buddhist-nu-thai"})
      ASSERT_TRUE(qlxIsGoodLocale(spelling.c_str())) << spelling;
  }
}

TEST_F(CachedLocalesTest, UsualNamesOfNoLocaleAreGoodToo) {
  for (const char *name : {"",
                           "C",
                           "C.UTF-8",
                           "POSIX",
                           "root",
                           "und",
                           "de_DE",
                           "de-DE",
                           "en_US_POSIX",
                           "sr_Latn_RS",
                           "ca_ES_VALENCIA",
                           "de__PHONEBOOK",
                           "de@collation=phonebook",
                           "es__TRADITIONAL",
                           "no_NO_NY",
                           "sr_RS@latin",
                           "de_DE.ISO-8859-1@euro",
                           "en-GB-oed",
                           "i-klingon",
                           "zh-min-nan",
                           "x-private",
                           "x_RS",
                           "sl-rozaj-biske-1994",
                           "de-CH-x-phonebk",
                           "xx_YY",
                           "certainly",
                           "e",
                           "*"})
    EXPECT_TRUE(qlxIsGoodLocale(name)) << name;
}

TEST_F(CachedLocalesTest, WhatIcuCannotReadOrHasNoRoomForIsNotGood) {
  EXPECT_TRUE(qlxIsGoodLocale("abcdefghijk"));
  EXPECT_FALSE(qlxIsGoodLocale("abcdefghijkl"));
  EXPECT_FALSE(qlxIsGoodLocale("no locale at all"));
  EXPECT_TRUE(qlxIsGoodLocale(("de@" + repeated(24) + "=v").c_str()));
  EXPECT_FALSE(qlxIsGoodLocale(("de@" + repeated(25) + "=v").c_str()));
  EXPECT_FALSE(qlxIsGoodLocale("de@=v"));
  EXPECT_FALSE(qlxIsGoodLocale("de@k="));
}

TEST_F(CachedLocalesTest, TheLengthsAreThoseOfIcu) {
  const auto variant = [](size_t length) { return repeated(length, "VARIANT1_"); };
  const std::string start = "de_DE_";
  const size_t room = ULOC_FULLNAME_CAPACITY - start.size();
  EXPECT_TRUE(qlxIsGoodLocale((start + variant(room - 1)).c_str()));
  EXPECT_FALSE(qlxIsGoodLocale((start + variant(room)).c_str()));
  const auto keywords = [](size_t length) { return "de@k=" + repeated(length - 2, "v"); };
  EXPECT_TRUE(qlxIsGoodLocale(keywords(ULOC_KEYWORD_AND_VALUES_CAPACITY - 1).c_str()));
  EXPECT_FALSE(qlxIsGoodLocale(keywords(ULOC_KEYWORD_AND_VALUES_CAPACITY).c_str()));
}

// ---- What becomes of messages and dates

TEST_F(CachedLocalesTest, ANameThatIsNotGoodHasNoDatesAndPluralsButTheRest) {
  const std::string names[] = {"no locale at all", "zz_ZZ@" + repeated(150) + "=v",
                               "de_DE_" + repeated(200, "VARIANT1_"),
                               "de@calendar=" + repeated(300, "v")};
  for (const std::string &name : names) {
    for (const UChar *pattern : kDelicate)
      EXPECT_EQ(bind(name.c_str(), pattern, 1.0).error, U_ILLEGAL_ARGUMENT_ERROR) << name;
    for (const UChar *pattern : kOthers)
      EXPECT_EQ(bind(name.c_str(), pattern, 1.0), byIcu(name.c_str(), pattern, 1.0)) << name;
    EXPECT_EQ(bind(name.c_str(), u"{0}, the ordinal date", u"x").text, u"x, the ordinal date");
    EXPECT_EQ(bind(name.c_str(), u"'{'", u"x").text, u"{");
  }
}

TEST_F(CachedLocalesTest, DatesAndPluralsOfGoodNamesAreThoseOfTheirLocales) {
  EXPECT_EQ(bind("de-DE", u"{0,date,EEEE}", 0.0).text, u"Donnerstag");
  EXPECT_EQ(bind("de__PHONEBOOK", u"{0,date,EEEE}", 0.0).text, u"Donnerstag");
  EXPECT_EQ(bind("de_DE.UTF-8", u"{0,date,EEEE}", 0.0).text, u"Donnerstag");
  EXPECT_EQ(bind("th@calendar=buddhist", u"{0,date,yyyy}", 0.0).text, u"2513");
  EXPECT_EQ(bind("en_US_POSIX", u"{0,selectordinal,one{#st}other{#th}}", 1.0).text, u"1st");
  EXPECT_EQ(bind("xx_YY", u"{0,plural,one{# one}other{# many}}", 1.0).text, u"1 many");
}

TEST_F(CachedLocalesTest, UnderADefaultNameThatIsNotGoodThereAreDatesAllTheSame) {
  Child child([] {
    for (const std::string &name :
         {"de_DE_" + repeated(200, "VARIANT1_"), "de@calendar=" + repeated(300, "v")}) {
      IcuDefaults::setLocale(name.c_str());
      EXPECT_EQ(date("yyyy-MM-dd HH:mm"), u"2006-08-16 10:48") << uloc_getDefault();
      EXPECT_EQ(date(nullptr), u"2006-08-16 10:48:55.123+00:00");
      for (const char *locale : {static_cast<const char *>(nullptr), "zz", "de"})
        for (const auto &patterns : {std::span<const UChar *const>(kDelicate), {kOthers}})
          for (const UChar *pattern : patterns)
            EXPECT_EQ(bind(locale, pattern, 1.0).error, U_ILLEGAL_ARGUMENT_ERROR);
      EXPECT_EQ(bind("zz", u"{0}", u"x").text, u"x");
      UErrorCode status = U_ZERO_ERROR;
      CxUStringBuff text{};
      EXPECT_EQ(qlxAppendBundleMessage(&text, {"/no/such/bundle", "k", "zz"}, nullptr, &status),
                0U);
      EXPECT_EQ(status, U_ILLEGAL_ARGUMENT_ERROR);
      EXPECT_EQ(qlxAppendCachedNumber(&text, kFraction, 1.5), 1);
      CxUStringBuffDiscard(&text);
    }
  });
  EXPECT_EQ(child.end(), 0);
}

// ---- Any names at all

class Names : RandomWords<char> {
 public:
  Names() : RandomWords(19961121) {}

  std::string next() {
    std::string name = oneOf({"en", "de", "zz", "sr", "root", "und", "x", "i", "C", "", "th"});
    if (below(5) == 0) name = word();
    for (size_t subtags = below(5); subtags > 0; --subtags)
      name += oneOf({"_", "-", "__", "_", ".", " "}) +
              (below(2) ? word() : oneOf({"US", "DE", "001", "Latn", "POSIX", "VALENCIA", "1996"}));
    if (below(2)) name += "@";
    for (size_t keys = name.ends_with('@') ? below(6) + 1 : 0; keys > 0; --keys)
      name += (below(2) ? word() : oneOf({"calendar", "numbers", "collation", "ca", "nu"})) +
              oneOf({"=", "=", "=", ""}) +
              (below(2) ? word() : oneOf({"buddhist", "arab", "japanese", "phonebook", ""})) + ";";
    if (below(6) == 0) name += oneOf({"-u-ca-buddhist", "-x-y", "_u_nu_arab", "-t-de"});
    return name;
  }

 private:
  std::string word() {
    constexpr size_t kLengths[] = {0, 1, 2, 3, 4, 8, 11, 12, 24, 25, 95, 100, 149, 151, 157, 300};
    std::string letters(below(3) ? below(12) : kLengths[below(std::size(kLengths))], ' ');
    for (char &c : letters) c = static_cast<char>('a' + below(26));
    return letters;
  }
};

TEST_F(CachedLocalesTest, NoNameEndsTheProcess) {
  Child child([] {
    Names names;
    int good = 0;
    for (int i = 0; i < 600; ++i) {
      const std::string name = names.next();
      good += qlxIsGoodLocale(name.c_str());
      for (const UChar *pattern : kDelicate) bind(name.c_str(), pattern, 1.0);
      for (const UChar *pattern : kOthers) bind(name.c_str(), pattern, 1.0);
    }
    EXPECT_GT(good, 100);
    EXPECT_LT(good, 500);
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(CachedLocalesTest, NoDefaultNameEndsTheProcess) {
  Child child([] {
    Names names;
    for (int i = 0; i < 300; ++i) {
      if (!IcuDefaults::setLocale(names.next().c_str())) continue;
      for (const char *pattern : {"'x'", static_cast<const char *>(nullptr)}) {
        CxUStringBuff text{};
        qlxAppendCachedDate(&text, {pattern, false}, 0.0);
        CxUStringBuffDiscard(&text);
      }
      for (const UChar *pattern : kDelicate) bind(nullptr, pattern, 1.0);
      bind("zz", kDelicate[5], 1.0);
    }
  });
  EXPECT_EQ(child.end(), 0);
}

}  // namespace
