// Held formats against the reference: opening every format anew for every call.
#include "text/QlxFormatCache.h"

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cmath>
#include <string>
#include <thread>
#include <vector>

#include <unicode/udat.h>
#include <unicode/umsg.h>
#include <unicode/ustdio.h>
#include <unicode/ustring.h>

#include <qlx/memory.h>
#include <qlx/ustring.h>

#include "object/QlxLocked.h"
#include "util/CxOwned.h"
#include "text/QlxMessageCache.h"
#include "text/QlxDateCache.h"

#include "support/FailingMemory.h"
#include "support/FormatResult.h"
#include "support/IcuDefaults.h"
#include "support/WhileLocaleChanges.h"

namespace {

// ---- Messages

// Two calls of u_vformatMessage(): one for the length, one for the text.
FormatResult anewMessage(const char *locale, const UChar *pattern, va_list *args) {
  va_list first;
  va_copy(first, *args);
  UErrorCode status = U_ZERO_ERROR;
  const int32_t needed =
      u_vformatMessage(locale, pattern, u_strlen(pattern), nullptr, 0, first, &status);
  va_end(first);
  if (status != U_BUFFER_OVERFLOW_ERROR) return {u"", U_FAILURE(status) ? status : 0};
  std::vector<UChar> room(static_cast<size_t>(needed) + 1);
  va_list second;
  va_copy(second, *args);
  status = U_ZERO_ERROR;
  u_vformatMessage(locale, pattern, u_strlen(pattern), room.data(), needed + 1, second, &status);
  va_end(second);
  if (U_FAILURE(status)) return {u"", status};
  return {room.data(), 0};
}

FormatResult heldMessage(const char *locale, const UChar *pattern, va_list *args) {
  CxUStringBuff text{};
  UErrorCode status = U_ZERO_ERROR;
  const uint32_t units = qlxAppendCachedMessage(&text, locale, pattern, args, &status);
  const FormatResult result{text.data ? text.data : u"", U_FAILURE(status) ? status : 0};
  EXPECT_EQ(units, result.text.size());
  CxUStringBuffDiscard(&text);
  return result;
}

FormatResult held(const char *locale, const UChar *pattern, ...) {
  va_list args;
  va_start(args, pattern);
  const FormatResult result = heldMessage(locale, pattern, &args);
  va_end(args);
  return result;
}

// Formats three times held, so that a format just made and one made before are both seen.
void compare(const char *locale, const UChar *pattern, ...) {
  va_list args;
  va_start(args, pattern);
  const FormatResult expected = anewMessage(locale, pattern, &args);
  for (int round = 0; round < 3; ++round)
    EXPECT_EQ(heldMessage(locale, pattern, &args), expected)
        << toUtf8(pattern) << " in " << (locale ? locale : "null") << ", default "
        << uloc_getDefault() << ", round " << round;
  va_end(args);
}

using Compare = void (*)(const char *locale);

// One row a pattern, with arguments of the types that it reads.
const Compare kMessages[] = {
    [](const char *l) { compare(l, u""); },
    [](const char *l) { compare(l, u"no arguments # | at all"); },
    [](const char *l) { compare(l, u"\xD800 alone"); },
    [](const char *l) { compare(l, u"it's"); },
    [](const char *l) { compare(l, u"it''s '{0}' {0}", u"x"); },
    [](const char *l) { compare(l, u"an open 'quote {0}", u"x"); },
    [](const char *l) { compare(l, u"{0}", u""); },
    [](const char *l) { compare(l, u"{0}", u"{1} it's #"); },
    [](const char *l) { compare(l, u"{0}", nullptr); },
    [](const char *l) { compare(l, u"{2} {0} {1} {0}", u"a", u"b", u"c"); },
    [](const char *l) { compare(l, u"{ 1 }", u"unused", u"b"); },
    [](const char *l) { compare(l, u"{0,number}", 1234567.891); },
    [](const char *l) { compare(l, u"{0,number,integer} {1,number,percent}", 42, 0.25); },
    [](const char *l) { compare(l, u"{0,number,currency}", -12.5); },
    [](const char *l) { compare(l, u"{0,number,#,##0.0#;(#)}", -1234.567); },
    [](const char *l) { compare(l, u"{0,number,::compact-short}", 123456.0); },
    [](const char *l) { compare(l, u"{0,number}", std::nan("")); },
    [](const char *l) { compare(l, u"{0,number}", 1e300); },
    [](const char *l) { compare(l, u"{0,date} {0,time}", 1155725335123.0); },
    [](const char *l) { compare(l, u"{0,DATE,full} {0,Time,full}", 1155725335123.0); },
    [](const char *l) { compare(l, u"{0,date,yyyy-MM-dd HH:mm:ss.SSS Z}", -1.0); },
    [](const char *l) { compare(l, u"{0,date,::yMMMMd} {0,time,::jms}", 1e12); },
    [](const char *l) { compare(l, u"{0,choice,0#none|1#one|1<more than {0,number}}", 3.0); },
    [](const char *l) { compare(l, u"{0,choice,0#{1}|1#one {1}}", 1.0, u"x"); },
    [](const char *l) { compare(l, u"{0,plural,=0{none}one{# file}other{# files}}", 1.0); },
    [](const char *l) { compare(l, u"{0,plural,one{# file}few{# f}many{# m}other{# o}}", 2.0); },
    [](const char *l) {
      compare(l, u"{0,plural,offset:1 one{{1} and #}other{{1}, #}}", 5.0, u"x");
    },
    [](const char *l) {
      compare(l, u"{0,selectordinal,one{#st}two{#nd}few{#rd}other{#th}}", 22.0);
    },
    [](const char *l) { compare(l, u"{0,select,a{first}other{rest}}", u"a"); },
    [](const char *l) { compare(l, u"{0,select,a{}other{}}", u"a"); },
    [](const char *l) { compare(l, u"{0,spellout}", 1234.0); },
    [](const char *l) { compare(l, u"{0,ordinal} {1,duration}", 3.0, 3661.0); },
    [](const char *l) { compare(l, u"{name}", u"x"); },
    [](const char *l) { compare(l, u"{0", u"x"); },
    [](const char *l) { compare(l, u"}{0}", u"x"); },
    [](const char *l) { compare(l, u"{}", u"x"); },
    [](const char *l) { compare(l, u"{-1}", u"x"); },
    [](const char *l) { compare(l, u"{99999999999}", u"x"); },
    [](const char *l) { compare(l, u"{0,nonsense}", u"x"); },
    [](const char *l) { compare(l, u"{0,number,#.#.#}", 1.0); },
    [](const char *l) { compare(l, u"{0,plural,one{x}}", 1.0); },
    [](const char *l) { compare(l, u"{0} {0,number}", u"x"); },
    [](const char *l) { compare(l, u"{0,number,{1}}", 1.0, u"x"); },
    [](const char *l) {
      static const std::u16string text(700, u'x');
      compare(l, u"{0}-{0}-{0}-{0}", text.c_str());
    },
    [](const char *l) {
      static const std::u16string text(511, u'x');
      compare(l, u"{0}", text.c_str());
    },
    [](const char *l) {
      static const std::u16string text(100'000, u'y');
      compare(l, text.c_str());
    },
};

const char *const kLocales[] = {nullptr,
                                "",
                                "en_US",
                                "de_DE",
                                "ar_EG",
                                "fr_CA",
                                "hi_IN@numbers=deva",
                                "th_TH@calendar=buddhist",
                                "ja_JP@calendar=japanese",
                                "pl",
                                "xx_YY",
                                "abcdefghijk",
                                "not-a-locale",
                                "de@numbers=roman",
                                "en_US_POSIX"};

// ---- Dates

std::u16string anewDate(const char *pattern, double time) {
  UErrorCode status = U_ZERO_ERROR;
  const OwnedUStr own{CxUStringDupStrToUChar(pattern ? pattern : "yyyy-MM-dd HH:mm:ss.SSS")};
  UDateFormat *format =
      udat_open(UDAT_PATTERN, UDAT_PATTERN, nullptr, nullptr, -1, own.get(), -1, &status);
  std::vector<UChar> room(136);
  const int32_t needed = udat_format(format, time, nullptr, 0, nullptr, &status);
  if (status == U_BUFFER_OVERFLOW_ERROR) {
    status = U_ZERO_ERROR;
    room.resize(static_cast<size_t>(std::max(needed + 1, 136)));
    udat_format(format, time, room.data(), needed + 1, nullptr, &status);
  }
  udat_close(format);
  if (pattern) return room.data();

  status = U_ZERO_ERROR;
  UCalendar *calendar = ucal_open(nullptr, -1, nullptr, UCAL_TRADITIONAL, &status);
  ucal_setMillis(calendar, time, &status);
  const int32_t offset =
      ucal_get(calendar, UCAL_ZONE_OFFSET, &status) + ucal_get(calendar, UCAL_DST_OFFSET, &status);
  ucal_close(calendar);
  const int32_t hours = offset / 3600000;
  const int32_t minutes = offset / 60000 % 60;
  UChar suffix[64];
  if (hours >= 0) {
    u_sprintf(suffix, "+%02d:%02d", hours, minutes);
  } else {
    u_sprintf(suffix, "-%02d:%02d", -hours, minutes);
  }
  return std::u16string(room.data()) + suffix;
}

std::u16string heldDate(const char *pattern, double time) {
  CxUStringBuff text{};
  EXPECT_EQ(qlxAppendCachedDate(&text, {pattern, false}, time), 1);
  const std::u16string result = text.data ? text.data : u"<null>";
  CxUStringBuffDiscard(&text);
  return result;
}

const char *const kDatePatterns[] = {
    nullptr,
    "yyyy-MM-dd HH:mm:ss.SSS",
    "HH:mm",
    "HH:mm:ss",
    "",
    "'only text'",
    "SSS",
    "S",
    "SS",
    "SSSS",
    "SSSSSS",
    "S'00'",
    "SS'0'",
    "ss.SSS ss.SSS",
    "A",
    "HH:mm:ss.SSS A",
    "'SSS' ss 'SSS' SSS",
    "ss.'000'",
    "yyyy-MM-dd'T'HH:mm:ss.SSSXXX",
    "EEEE d. MMMM yyyy G HH:mm:ss.SSS zzzz",
    "HH:mm:ss.SSS vvvv",
    "W w D F g e c Q k K h a b B",
    "HH 'open quote SSS",
    "HH P ss.SSS",
    "ss.SSS P",
    "HH\xC3\xA9SSS",
    ("EEEEEEE MMMMM "
     "yyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyyy"
     "'a text that makes the date longer than one hundred and thirty-six units of text' ss.SSS"),
};

const double kTimes[] = {0,
                         -1,
                         -999,
                         -1000,
                         -1001,
                         999,
                         1000,
                         1155725335123.0,
                         1155725335999.0,
                         1155725335000.0,
                         1155725336000.0,
                         1142730000000.0 - 1,
                         1143334800000.0 - 1,  // one millisecond before Berlin's summer time
                         1143334800000.0,
                         -62135596800001.0,
                         -12219292800001.0,
                         -12219292800000.0,
                         1556636399999.0,  // before and in Japan's era Reiwa
                         1556636400000.0,
                         0.5,
                         -0.5,
                         1155725335123.75,
                         4503599627370495.0,
                         4503599627370496.0,
                         -4503599627370496.0,
                         9007199254740991.0,
                         9007199254740992.0,
                         9007199254740994.0,
                         -9007199254740991.0,
                         1e17,
                         1e300,
                         -1e300};

const UChar *const kZones[] = {u"UTC",       u"Europe/Berlin",   u"America/St_Johns", u"GMT-05:30",
                               u"GMT-00:30", u"Africa/Monrovia", u"Asia/Kolkata"};

class FormatCacheTest : public ::testing::Test {
 protected:
  void SetUp() override { qlxDropCachedFormats(); }
  void TearDown() override { qlxDropCachedFormats(); }

  // Allocations of one formatting: a format that is held needs none but the result's.
  static int64_t allocationsOf(const char *locale, const UChar *pattern) {
    const FailingMemory memory;
    held(locale, pattern, u"x");
    return static_cast<int64_t>(memory.attempts());
  }
  static int64_t allocationsOf(const char *datePattern) {
    const FailingMemory memory;
    heldDate(datePattern, 5.0);
    return static_cast<int64_t>(memory.attempts());
  }

  IcuDefaults defaults_;
};

TEST_F(FormatCacheTest, EveryMessageIsWhatParsingAnewGives) {
  for (const char *defaultLocale : {"en_US_POSIX", "de_DE", "ar_EG@numbers=arab"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(defaultLocale));
    for (const char *locale : kLocales)
      for (const Compare row : kMessages) row(locale);
  }
}

TEST_F(FormatCacheTest, AMessageFollowsTheDefaultsFromCallToCall) {
  for (int round = 0; round < 2; ++round)
    for (const char *defaultLocale : {"en_US", "de_DE", "ar_EG"})
      for (const UChar *zone : kZones) {
        ASSERT_TRUE(IcuDefaults::setLocale(defaultLocale));
        ASSERT_TRUE(IcuDefaults::setZone(zone));
        for (const char *locale : {static_cast<const char *>(nullptr), "fr", "xx"}) {
          compare(locale, u"{0,number}", 1234.5);
          compare(locale, u"{0,date,full} {0,TIME,full}", 1155725335123.0);
          compare(locale, u"{0,plural,other{{1,time,z}}}", 1.0, 1155725335123.0);
        }
      }
}

TEST_F(FormatCacheTest, EveryWayToWriteADateOrTimeFollowsTheZone) {
  for (const UChar *pattern :
       {u"{0,date,full z}", u"{0,DATE,z}", u"{0, Time ,full}", u"{0,tIMe}"}) {
    qlxDropCachedFormats();
    for (const UChar *zone : kZones) {
      ASSERT_TRUE(IcuDefaults::setZone(zone));
      compare("en", pattern, 1155725335123.0);
    }
  }
}

TEST_F(FormatCacheTest, AMessageParsedInAnotherZoneIsNotForTheFirstOne) {
  const auto inZone = [](const UChar *zone, const UChar *pattern) {
    EXPECT_TRUE(IcuDefaults::setZone(zone));
    return held("en_GB", pattern, 1155725335123.0).text;
  };
  for (int round = 0; round < 3; ++round) EXPECT_EQ(inZone(u"UTC", u"{0,time,HH:mm}"), u"10:48");
  EXPECT_EQ(inZone(u"Asia/Kolkata", u"at {0,time,HH:mm}"), u"at 16:18");
  EXPECT_EQ(inZone(u"UTC", u"at {0,time,HH:mm}"), u"at 10:48");
}

TEST_F(FormatCacheTest, PatternsThatDifferInOneUnitAreToldApart) {
  const std::u16string whole = u"{0} and a text that is long enough to have a middle: {0}";
  for (int round = 0; round < 2; ++round)
    for (size_t at = 3; at < whole.size() - 3; ++at) {
      std::u16string other = whole;
      other[at] = u'\x3b1';
      compare("en", other.c_str(), u"x");
      compare("en", whole.c_str(), u"x");
    }
}

TEST_F(FormatCacheTest, PatternsOfEveryLengthAreToldApart) {
  for (int round = 0; round < 2; ++round) {
    for (const UChar *pattern : {u"'", u"''", u"'a", u"'b", u"''a", u"'{'", u"{0}", u"a{0}", u"{"})
      compare("en", pattern, u"x");
    std::u16string longer = u"{0}";
    for (int length = 0; length < 40; ++length) compare("en", (longer += u'a').c_str(), u"x");
  }
}

TEST_F(FormatCacheTest, OnePatternInSeveralLocalesIsToldApart) {
  for (int round = 0; round < 3; ++round)
    for (const char *locale : {"en", "de", static_cast<const char *>(nullptr), "", "de_CH", "hi"})
      compare(locale, u"{0,number}", 1234567.5);
}

TEST_F(FormatCacheTest, NumbersFollowTheDefaultLocaleFromCallToCall) {
  for (const char *locale : {"en", "de", "ar_EG", "en", "hi@numbers=deva"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(locale));
    compare(nullptr, u"{0,number} {1,number,integer}", -1234.5, 7654321);
    compare("fr", u"{0,number} {1,number,integer}", -1234.5, 7654321);
  }
}

TEST_F(FormatCacheTest, NoLocaleIsTheDefaultOneAndAnEmptyLocaleIsNot) {
  ASSERT_TRUE(IcuDefaults::setLocale("de_DE"));
  EXPECT_EQ(held(nullptr, u"{0,number}", 1234.5).text, u"1.234,5");
  EXPECT_EQ(held("", u"{0,number}", 1234.5).text, u"1,234.5");
  EXPECT_EQ(held(nullptr, u"{0,number}", 1234.5).text, u"1.234,5");
}

TEST_F(FormatCacheTest, APatternThatIsRefusedGivesTheSameErrorEachTime) {
  EXPECT_EQ(held(nullptr, u"{0", u"x").error, U_UNMATCHED_BRACES);
  EXPECT_EQ(held(nullptr, u"{0", u"x").error, U_UNMATCHED_BRACES);
  EXPECT_EQ(held(nullptr, u"{0,nonsense}", u"x").error, U_ILLEGAL_ARGUMENT_ERROR);
  EXPECT_EQ(held(nullptr, u"{0,nonsense}", u"x").error, U_ILLEGAL_ARGUMENT_ERROR);
}

TEST_F(FormatCacheTest, ALocaleWithALanguageThatIsTooLongHasNoDatesAndPlurals) {
  for (const char *locale : {"abcdefghijkl", "no locale at all", "abcdefghijkl_DE"}) {
    for (const UChar *pattern : {u"{0,date}", u"{0,TIME,short}", u"{0,plural,other{#}}",
                                 u"{0,Plural,one{#}other{#}}", u"{0,selectOrdinal,other{#}}"})
      EXPECT_EQ(held(locale, pattern, 0.0).error, U_ILLEGAL_ARGUMENT_ERROR)
          << locale << toUtf8(pattern);
    compare(locale, u"{0,select,x{#}other{y}}", u"x");
    compare(locale, u"{0,number} {1}", 1.5, u"x");
  }
}

TEST_F(FormatCacheTest, AMessageIsAppendedBehindWhatIsThere) {
  CxUStringBuff text{};
  CxUStringBuffAppendStr(&text, "before ");
  va_list *none = nullptr;
  UErrorCode status = U_ZERO_ERROR;
  EXPECT_EQ(qlxAppendCachedMessage(&text, nullptr, u"'{'after'}'", none, &status), 7U);
  EXPECT_EQ(std::u16string(text.data), u"before {after}");
  EXPECT_EQ(qlxAppendCachedMessage(&text, nullptr, u"{0", none, &status), 0U);
  EXPECT_EQ(status, U_UNMATCHED_BRACES);
  EXPECT_EQ(std::u16string(text.data), u"before {after}");
  EXPECT_EQ(text.length, 14U);
  CxUStringBuffDiscard(&text);
}

TEST_F(FormatCacheTest, MessagesOfEveryLengthFitTheBuffer) {
  for (const size_t before : {0, 1, 2, 505, 509, 510, 511})
    for (size_t length = 1; length < 1100; length += length < 8 ? 1 : 97) {
      CxUStringBuff text{};
      const std::u16string prefix(before, u'p');
      const std::u16string value(length, u'v');
      CxUStringBuffAppendUStr(&text, prefix.c_str());
      const auto append = [&](va_list *args) {
        UErrorCode status = U_ZERO_ERROR;
        return qlxAppendCachedMessage(&text, nullptr, u"{0}", args, &status);
      };
      const auto call = [](const decltype(append) *run, ...) {
        va_list args;
        va_start(args, run);
        const uint32_t units = (*run)(&args);
        va_end(args);
        return units;
      };
      ASSERT_EQ(call(&append, value.c_str()), length);
      ASSERT_EQ(std::u16string(text.data), prefix + value);
      ASSERT_LT(text.length * sizeof(UChar), text.capacity);
      CxUStringBuffDiscard(&text);
    }
}

TEST_F(FormatCacheTest, ArgumentsThatAreMissingReadAsZeros) {
  const auto bind = [](const UChar *pattern) { return heldMessage("en", pattern, nullptr); };
  EXPECT_EQ(bind(u"none '{0}'"), (FormatResult{u"none {0}", 0}));
  EXPECT_EQ(bind(u"{0,number} {1,number,integer}"), (FormatResult{u"0 0", 0}));
  EXPECT_EQ(bind(u"{0,number}{1,number}{2,number}{3,number}{4,number}{5,number}{6,number}"
                 u"{7,number}{8,number}{9,number}{10,number}"),
            (FormatResult{u"00000000000", 0}));
  EXPECT_EQ(bind(u"{0,number,integer} {12,number} {9,number,integer} {63,number,integer}"),
            (FormatResult{u"0 0 0 0", 0}));
  std::u16string most;
  for (const char16_t tens : u"0123456")
    for (const char16_t ones : u"0123456789") {
      if (tens == 0 || ones == 0 || (tens == u'6' && ones > u'3')) continue;
      most += u"{";
      if (tens != u'0') most += tens;
      most += ones;
      most += u",number,integer}";
    }
  EXPECT_EQ(bind(most.c_str()), (FormatResult{std::u16string(64, u'0'), 0}));
  ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
  EXPECT_EQ(bind(u"{0,date,yyyy}"), (FormatResult{u"1970", 0}));
  EXPECT_EQ(bind(u"{0}"), (FormatResult{u"", U_ILLEGAL_ARGUMENT_ERROR}));
  EXPECT_EQ(bind(u"{0,number} { 9 }"), (FormatResult{u"", U_ILLEGAL_ARGUMENT_ERROR}));
  EXPECT_EQ(bind(u"{64,number}"), (FormatResult{u"", U_ILLEGAL_ARGUMENT_ERROR}));
  EXPECT_EQ(bind(u"{ \t30000}"), (FormatResult{u"", U_ILLEGAL_ARGUMENT_ERROR}));
}

TEST_F(FormatCacheTest, AFormattedPatternIsParsedOnce) {
  const int64_t first = allocationsOf("de", u"{0} held");
  EXPECT_EQ(allocationsOf("de", u"{0} held"), 1);  // the text itself
  EXPECT_EQ(first, 3);                             // and the pattern and the locale
  EXPECT_EQ(allocationsOf("fr", u"{0} held"), 3);
  EXPECT_EQ(allocationsOf("de", u"{0} held too"), 3);
  EXPECT_EQ(allocationsOf("de", u"{0} held"), 1);
  ASSERT_TRUE(IcuDefaults::setLocale("pl"));
  EXPECT_EQ(allocationsOf("de", u"{0} held"), 3);
}

TEST_F(FormatCacheTest, OnlyMessagesWithDatesOrTimesAreParsedAnewInAnotherZone) {
  ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
  allocationsOf(nullptr, u"{0} '{,tImE}'");
  allocationsOf(nullptr, u"{0}");
  ASSERT_TRUE(IcuDefaults::setZone(u"Asia/Kolkata"));
  EXPECT_EQ(allocationsOf(nullptr, u"{0}"), 1);
  EXPECT_EQ(allocationsOf(nullptr, u"{0} '{,tImE}'"), 2);
}

TEST_F(FormatCacheTest, TheMessageNotUsedForLongestGoesFirst) {
  const auto pattern = [](int number) {
    return u"{0} " + std::u16string(1, static_cast<char16_t>(0x100 + number));
  };
  for (int number = 0; number < kMaxCachedMessages; ++number)
    EXPECT_EQ(allocationsOf(nullptr, pattern(number).c_str()), 2);
  EXPECT_EQ(allocationsOf(nullptr, pattern(0).c_str()), 1);  // makes number 1 the oldest
  const FailingMemory memory;
  held(nullptr, pattern(kMaxCachedMessages).c_str(), u"x");
  EXPECT_EQ(memory.live(), 0) << "one more is held, one less is";
  EXPECT_EQ(allocationsOf(nullptr, pattern(0).c_str()), 1);
  EXPECT_EQ(allocationsOf(nullptr, pattern(2).c_str()), 1);
  EXPECT_EQ(allocationsOf(nullptr, pattern(1).c_str()), 2);
}

void compareDates(const char *locale, const UChar *zone) {
  ASSERT_TRUE(IcuDefaults::setLocale(locale));
  ASSERT_TRUE(IcuDefaults::setZone(zone));
  for (const char *pattern : kDatePatterns)
    for (const double time : kTimes)
      ASSERT_EQ(heldDate(pattern, time), anewDate(pattern, time))
          << (pattern ? pattern : "null") << " at " << time << " in " << locale << " "
          << toUtf8(zone);
}

TEST_F(FormatCacheTest, EveryDateOfALocaleIsWhatOpeningAnewGives) {
  for (const char *locale :
       {"en_US_POSIX", "de_DE", "ar_EG", "fa_IR", "hi_IN@numbers=deva", "th_TH",
        "ja_JP@calendar=japanese", "he_IL@calendar=hebrew", "zh@calendar=chinese",
        "zh@numbers=hanidec", "ccp", "en@numbers=roman", "xx_YY"})
    compareDates(locale, u"Europe/Berlin");
}

TEST_F(FormatCacheTest, EveryDateOfAZoneIsWhatOpeningAnewGives) {
  for (const UChar *zone : kZones) compareDates("en", zone);
}

TEST_F(FormatCacheTest, EveryMillisecondOfASecondHasItsOwnText) {
  ASSERT_TRUE(IcuDefaults::setLocale("ar_EG"));
  for (const double second : {1155725335000.0, -1000.0})
    for (int millis = 0; millis < 1000; ++millis)
      for (const char *pattern : {static_cast<const char *>(nullptr), "SSS ss"})
        ASSERT_EQ(heldDate(pattern, second + millis), anewDate(pattern, second + millis)) << millis;
}

TEST_F(FormatCacheTest, ADateFollowsTheDefaultsFromCallToCall) {
  const double time = 1155725335123.0;
  for (int round = 0; round < 2; ++round)
    for (const char *locale : {"en_US", "ar_EG", "th_TH"})
      for (const UChar *zone : kZones)
        for (const char *pattern : {static_cast<const char *>(nullptr), "EEEE HH:mm zzzz"}) {
          ASSERT_TRUE(IcuDefaults::setLocale(locale));
          ASSERT_TRUE(IcuDefaults::setZone(zone));
          EXPECT_EQ(heldDate(pattern, time), anewDate(pattern, time)) << locale << toUtf8(zone);
        }
}

TEST_F(FormatCacheTest, ADateFollowsTheDefaultLocaleAlone) {
  for (const char *locale : {"en_US", "ar_EG", "th_TH", "en_US"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(locale));
    EXPECT_EQ(heldDate("yyyy MMMM SSS", 123.0), anewDate("yyyy MMMM SSS", 123.0)) << locale;
  }
}

TEST_F(FormatCacheTest, ADatePatternIsReadInTheDefaultCodePageOfTheCall) {
  for (const char *codePage : {"UTF-8", "ISO-8859-1", "UTF-8"}) {
    if (!IcuDefaults::setCodePage(codePage)) GTEST_SKIP() << "this ICU's is always UTF-8";
    EXPECT_EQ(heldDate("HH'\xC3\xA9'", 0), anewDate("HH'\xC3\xA9'", 0)) << codePage;
  }
}

TEST_F(FormatCacheTest, ADateFormatIsOpenedOnceAndAsksForNothingInItsSecond) {
  EXPECT_GT(allocationsOf("HH:mm:ss"), 1);
  EXPECT_EQ(allocationsOf("HH:mm:ss"), 1);  // the text itself
  EXPECT_GT(allocationsOf(nullptr), 1);
  EXPECT_EQ(allocationsOf(nullptr), 1);
}

TEST_F(FormatCacheTest, TheDateNotUsedForLongestGoesFirst) {
  const auto pattern = [](int number) { return "ss 'p" + std::to_string(number) + "'"; };
  for (int number = 0; number < kMaxCachedDates; ++number)
    EXPECT_GT(allocationsOf(pattern(number).c_str()), 1);
  EXPECT_EQ(allocationsOf(pattern(0).c_str()), 1);
  EXPECT_GT(allocationsOf(pattern(kMaxCachedDates).c_str()), 1);
  EXPECT_EQ(allocationsOf(pattern(0).c_str()), 1);
  EXPECT_EQ(allocationsOf(pattern(2).c_str()), 1);
  EXPECT_GT(allocationsOf(pattern(1).c_str()), 1);
}

TEST_F(FormatCacheTest, DroppingLeavesNothingAndMayBeRepeated) {
  const FailingMemory memory;
  held("de", u"{0}", u"x");
  held(nullptr, u"{0}", u"x");
  heldDate(nullptr, 5);
  heldDate("HH", 5);
  EXPECT_GT(memory.live(), 0);
  qlxDropCachedFormats();
  EXPECT_EQ(memory.live(), 0);
  qlxDropCachedFormats();
  EXPECT_EQ(memory.live(), 0);
  EXPECT_EQ(held("de", u"{0}", u"x").text, u"x");
  EXPECT_EQ(heldDate("HH", 0), anewDate("HH", 0));
  qlxDropCachedFormats();
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(FormatCacheTest, WithoutMemoryThereIsTheWholeTextOrNone) {
  const std::u16string date = anewDate(nullptr, 1155725335123.0);
  const std::u16string longValue(2000, u'x');
  for (const auto fail : {&FailingMemory::failOnce, &FailingMemory::failFrom})
    for (uint64_t nth = 1;; ++nth) {
      qlxDropCachedFormats();
      FailingMemory memory;
      (memory.*fail)(nth);
      for (const UChar *value : {u"x", longValue.c_str()}) {
        const FormatResult message = held("de", u"{0}", value);
        EXPECT_EQ(message, message.error ? (FormatResult{u"", U_MEMORY_ALLOCATION_ERROR})
                                         : (FormatResult{value, 0}));
      }
      for (const double fraction : {0.0, 0.5})
        for (const char *pattern : {static_cast<const char *>(nullptr), "HH:mm:ss.SSS"}) {
          CxUStringBuff text{};
          const uint8_t appended =
              qlxAppendCachedDate(&text, {pattern, false}, 1155725335123.0 + fraction);
          const std::u16string whole = pattern ? date.substr(11, 12) : date;
          EXPECT_EQ(appended ? std::u16string(text.data) : whole, whole);
          CxUStringBuffDiscard(&text);
        }
      qlxDropCachedFormats();
      EXPECT_EQ(memory.live(), 0);
      if (memory.failures() == 0) break;
    }
}

TEST_F(FormatCacheTest, ThreadsShareTheCachedFormats) {
  const std::u16string date = anewDate(nullptr, 1155725335123.0);
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int number = 0; number < 4; ++number)
    threads.emplace_back([&, number] {
      const std::string pattern = "ss.SSS 'thread " + std::to_string(number) + "'";
      const std::u16string own = anewDate(pattern.c_str(), 1155725335123.0);
      for (int round = 0; round < 300; ++round) {
        if (round % 100 == number) qlxDropCachedFormats();
        if (heldDate(nullptr, 1155725335123.0) != date) ++wrong;
        if (heldDate(pattern.c_str(), 1155725335123.0) != own) ++wrong;
        if (held("en", u"{0,number} {1}", 1000.0, u"x").text != u"1,000 x") ++wrong;
      }
    });
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ(wrong, 0);
}

TEST_F(FormatCacheTest, AMessageParsedWhileAThreadChangesTheLocaleIsNotKeptForAnotherOne) {
  for (int round = 0; round < 100; ++round) {
    qlxDropCachedFormats();
    whileLocaleChanges("en", "de", [] { held(nullptr, u"{0,number}", 1234.5); });
    ASSERT_EQ(held(nullptr, u"{0,number}", 1234.5).text, u"1,234.5") << round;
  }
}

TEST_F(FormatCacheTest, AChildForkedUnderTheLockFormats) {
  { const ApiLock made; }  // the handlers of forks come with the API lock
  std::atomic<bool> stop{false};
  std::thread busy([&] {
    while (!stop) const FormatCacheLock held;
  });
  for (int round = 0; round < 20; ++round) {
    const pid_t child = fork();
    if (child == 0) {
      alarm(20);
      _exit(held("en", u"'{'{0}'}'", u"x").text == u"{x}" ? 0 : 1);
    }
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
  }
  stop = true;
  busy.join();
}

}  // namespace
