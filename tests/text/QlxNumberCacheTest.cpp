// The numbers that the buffers write, against a message pattern that is parsed for every call.
// QLX_NUMBER_VALUES is how many values each locale gets in a longer campaign.
#include "text/QlxFormatCache.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <thread>

#include <unicode/uloc.h>
#include <unicode/ustdio.h>
#include <unicode/ustring.h>
#include <unicode/umsg.h>

#include <qlx/buffers.h>

#include "object/QlxLocked.h"
#include "text/QlxMessageCache.h"

#include "support/Child.h"
#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/OpenToolkit.h"
#include "support/WhileLocaleChanges.h"

namespace {

constexpr double kTwoTo53 = 9007199254740992.0;

const double kValues[] = {0.0,
                          -0.0,
                          1,
                          -1,
                          9,
                          10,
                          1234567890,
                          1e15,
                          1e15 + 0.5,
                          1700000000123.0,
                          kTwoTo53 - 2,
                          kTwoTo53 - 1,
                          kTwoTo53,
                          kTwoTo53 + 2,
                          -kTwoTo53,
                          1e17,
                          9223372036854775808.0,
                          18446744073709551616.0,
                          1e21,
                          1e300,
                          DBL_MAX,
                          -DBL_MAX,
                          DBL_MIN,
                          DBL_TRUE_MIN,
                          -DBL_TRUE_MIN,
                          0.5,
                          1.5,
                          2.5,
                          -0.5,
                          -2.5,
                          0.000005,
                          0.000015,
                          0.000025,
                          0.0000049,
                          0.999995,
                          0.9999949,
                          123456.123456,
                          -1234.56789,
                          99999.999999,
                          4503599627370495.5,
                          std::nan(""),
                          -std::nan(""),
                          HUGE_VAL,
                          -HUGE_VAL};

using Append = uint8_t (*)(CxUStringBuff *, double);

struct Form {
  Append append;
  const UChar *pattern;
};

const Form kForms[] = {{CxUStringBuffAppendUDate, u"{0,number,#}"},
                       {CxUStringBuffAppendUDouble, u"{0,number,#.#####}"}};

std::u16string appended(Append append, double value) {
  CxUStringBuff text{};
  EXPECT_EQ(append(&text, value), 1);
  std::u16string made(text.data, text.length);
  CxUStringBuffDiscard(&text);
  return made;
}

std::u16string parsed(const UChar *pattern, double value) {
  UChar text[1024];
  UErrorCode status = U_ZERO_ERROR;
  const int32_t units =
      u_formatMessage(nullptr, pattern, u_strlen(pattern), text, 1024, &status, value);
  EXPECT_TRUE(U_SUCCESS(status)) << u_errorName(status);
  return U_SUCCESS(status) ? std::u16string(text, static_cast<size_t>(units)) : u"";
}

void compare(double value) {
  for (const Form &form : kForms)
    EXPECT_EQ(appended(form.append, value), parsed(form.pattern, value))
        << value << " in " << uloc_getDefault();
}

size_t valuesALocale() {
  const char *const wanted = std::getenv("QLX_NUMBER_VALUES");
  return wanted ? static_cast<size_t>(std::max(1, std::atoi(wanted))) : 4;
}

class NumberCacheTest : public ::testing::Test {
 protected:
  void TearDown() override { qlxDropCachedFormats(); }

  static void setLocale(const char *name) { ASSERT_TRUE(IcuDefaults::setLocale(name)) << name; }

  IcuDefaults defaults_;
};

}  // namespace

TEST_F(NumberCacheTest, EveryValueIsWrittenAsAParsedPatternWritesIt) {
  for (const char *locale :
       {"en_US_POSIX", "de", "ar_EG", "en@numbers=arab", "zh@numbers=hans", "hi@numbers=native",
        "sv", "he", "fa", "en@numbers=roman", "ccp", "ja@numbers=jpanyear"}) {
    setLocale(locale);
    for (const double value : kValues) compare(value);
  }
}

TEST_F(NumberCacheTest, EveryLocaleWritesWhatAParsedPatternWrites) {
  std::mt19937 random(53);
  for (int32_t i = 0; i < uloc_countAvailable(); ++i) {
    setLocale(uloc_getAvailable(i));
    compare(-1234567890.5);
    compare(1234567890);
    for (size_t sample = 0; sample < valuesALocale(); ++sample)
      compare(kValues[random() % std::size(kValues)]);
    if (HasFailure()) return;
  }
}

TEST_F(NumberCacheTest, RandomValuesAreWrittenAsAParsedPatternWritesThem) {
  std::mt19937_64 random(1);
  setLocale("en");
  for (size_t sample = 0; sample < 500 * valuesALocale() && !HasFailure(); ++sample) {
    const uint64_t bits = random();
    double any;
    std::memcpy(&any, &bits, sizeof any);
    compare(any);
    compare(static_cast<double>(bits >> random() % 64));                  // whole
    compare(static_cast<double>(static_cast<int64_t>(bits) >> 30) / 64);  // halves to 64ths
    compare(static_cast<double>(bits >> 40) / 1e6);                       // half of the last digit
  }
}

TEST_F(NumberCacheTest, EachCallFollowsTheDefaultLocaleOfItsMoment) {
  for (int round = 0; round < 3; ++round)
    for (const char *locale : {"en", "ar_EG", "de", "zh@numbers=hans", "ne"}) {
      setLocale(locale);
      for (const double value : {42.0, 1.5, -42.0, -0.0}) compare(value);
    }
  setLocale("ar_EG");
  EXPECT_EQ(appended(CxUStringBuffAppendUDate, 42), u"\x0664\x0662");
  setLocale("en");
  EXPECT_EQ(appended(CxUStringBuffAppendUDate, 42), u"42");
}

TEST_F(NumberCacheTest, ANewLocaleIsFollowedAlsoByAMessageBetweenTheNumbers) {
  const auto message = [] {
    CxUStringBuff text{};
    UErrorCode status = U_ZERO_ERROR;
    qlxAppendCachedMessage(&text, nullptr, u"{0,number}", nullptr, &status);
    CxUStringBuffDiscard(&text);
  };
  for (const char *locale : {"en", "ar_EG", "en"}) {
    setLocale(locale);
    message();  // the first one to find the locale changed
    compare(42.5);
  }
}

TEST_F(NumberCacheTest, AReopenedToolkitWritesInTheNewLocale) {
  for (const char *locale : {"en", "ar_EG", "en"}) {
    setLocale(locale);
    const OpenToolkit toolkit;
    compare(42);
    compare(-1.5);
  }
}

TEST_F(NumberCacheTest, ANumberIsWholeOrLeavesTheTextWithoutMemory) {
  setLocale("ar_EG");
  for (const Form &form : kForms)
    for (const size_t room : {0, 1, 5, 300}) {
      CxUStringBuff text{};
      const std::u16string before(511 - room, u'x');
      ASSERT_EQ(CxUStringBuffAppendUStr(&text, before.c_str()), 1);
      FailingMemory memory;
      memory.failFrom(1);
      const uint8_t whole = form.append(&text, -1e300);
      EXPECT_EQ(whole, 0);
      EXPECT_EQ(std::u16string(text.data, text.length), before);
      memory.failNone();
      EXPECT_EQ(form.append(&text, -1e300), 1);
      EXPECT_EQ(std::u16string(text.data, text.length), before + parsed(form.pattern, -1e300));
      CxUStringBuffDiscard(&text);
    }
}

TEST_F(NumberCacheTest, AChildWritesInTheLocaleThatItSets) {
  setLocale("en");
  compare(42);
  Child child([] {
    compare(42);
    setLocale("ar_EG");
    for (const double value : kValues) compare(value);
  });
  EXPECT_EQ(child.end(), 0);
  compare(42);
}

TEST_F(NumberCacheTest, AChildForkedDuringAWriteWritesToo) {
  { const ApiLock made; }  // the handlers of forks come with the API lock
  setLocale("en");
  std::atomic<bool> stop{false};
  std::thread busy([&] {
    while (!stop) appended(CxUStringBuffAppendUDouble, 42);
  });
  for (int round = 0; round < 20; ++round) {
    Child child([] { EXPECT_EQ(appended(CxUStringBuffAppendUDouble, 42), u"42"); });
    EXPECT_EQ(child.end(), 0);
  }
  stop = true;
  busy.join();
}

TEST_F(NumberCacheTest, AFormatOpenedWhileAThreadChangesTheLocaleIsNotKeptForAnotherOne) {
  for (int round = 0; round < 100; ++round) {
    qlxDropCachedFormats();
    whileLocaleChanges("en", "de", [] { appended(CxUStringBuffAppendUDouble, 1.5); });
    ASSERT_EQ(appended(CxUStringBuffAppendUDouble, 1.5), u"1.5") << round;
  }
}

TEST_F(NumberCacheTest, ThreadsWriteInOneOfTheLocalesThatAnotherThreadSets) {
  setLocale("en");
  std::atomic<bool> stop{false};
  std::atomic<int> wrong{0};
  std::atomic<int> written{0};
  std::thread writers[2];
  for (std::thread &writer : writers)
    writer = std::thread([&] {
      for (; !stop; ++written) {
        const std::u16string text = appended(CxUStringBuffAppendUDouble, 42.5);
        if (text != u"42.5" && text != u"\x0664\x0662\x066B\x0665") ++wrong;
      }
    });
  for (int round = 0; round < 400 || written < 400; ++round)
    IcuDefaults::setLocale(round % 2 ? "en" : "ar_EG");
  stop = true;
  for (std::thread &writer : writers) writer.join();
  EXPECT_EQ(wrong, 0);
  setLocale("en");
  compare(42.5);
}
