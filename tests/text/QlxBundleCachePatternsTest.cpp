// What is remembered of the keys of a held bundle: their patterns, and where the messages of these
// are held, against parsing the pattern anew for every call.
#include "text/QlxFormatCache.h"
#include "text/QlxMessageCache.h"
#include "text/QlxBundleCache.h"

#include <gtest/gtest.h>

#include <string>

#include <unicode/utypes.h>

#include <qlx/buffers.h>

#include "support/IcuDefaults.h"
#include "support/OpenToolkit.h"
#include "support/ResourceBundles.h"

namespace {

constexpr int kManyKeys = 200;
constexpr double kTime = 1700000000000.0;

// Longer than what is remembered, and the same up to their ends.
std::string longKey(int number) {
  return std::string(60, 'k') + std::to_string(number);
}

std::string shortKey(int number) {
  return "key" + std::to_string(number);
}

class BundleCachePatternsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    qlxDropCachedFormats();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    std::string many;
    for (int number = 0; number < kManyKeys; ++number) {
      const std::string text = std::to_string(number);
      many += shortKey(number) + " { \"short " + text + " {0,number}\" }\n";
      many += longKey(number) + " { \"long " + text + " {0,number}\" }\n";
    }
    ASSERT_TRUE(bundles_.add("root", many + R"(
      count { "{0,number} of {1,number,integer}" }
      when { "{0,date,yyyy-MM-dd HH:mm}" }
      bare { "bare" }
    )"));
    ASSERT_TRUE(bundles_.add("de", R"(count { "{0,number} von {1,number,integer}" })"));
  }
  void TearDown() override { qlxDropCachedFormats(); }

  std::u16string of(const char *key, const char *locale, ...) const {
    CxUStringBuff text{};
    UErrorCode status = U_ZERO_ERROR;
    va_list args;
    va_start(args, locale);
    qlxAppendBundleMessage(&text, {path_.c_str(), key, locale}, &args, &status);
    va_end(args);
    EXPECT_EQ(status, U_ZERO_ERROR) << key;
    const std::u16string made(text.data ? text.data : u"", text.length);
    CxUStringBuffDiscard(&text);
    return made;
  }

  std::u16string count(const char *locale = nullptr) const {
    return of("count", locale, 1234.5, 1000);
  }

  // More patterns than are held.
  void takeAllPlaces() const {
    for (int number = 0; number < 2 * kMaxCachedMessages; ++number)
      of(shortKey(number).c_str(), nullptr, 1.0);
  }

  ArgTypes typesOf(const char *key) const {
    ArgTypes types{};
    EXPECT_TRUE(qlxScanBundlePattern({path_.c_str(), key, nullptr}, &types)) << key;
    return types;
  }

  ResourceBundles bundles_;
  std::string path_ = bundles_.path();
  IcuDefaults defaults_;
};

std::u16string widened(const std::string &text) {
  return {text.begin(), text.end()};
}

}  // namespace

TEST_F(BundleCachePatternsTest, EveryKeyHasItsOwnText) {
  for (int round = 0; round < 3; ++round)
    for (int number = 0; number < kManyKeys; ++number) {
      const std::u16string text = widened(std::to_string(number));
      for (int again = 0; again < 3; ++again) {
        ASSERT_EQ(of(shortKey(number).c_str(), nullptr, 2.75), u"short " + text + u" 2.75");
        ASSERT_EQ(of(longKey(number).c_str(), nullptr, 2.75), u"long " + text + u" 2.75");
      }
    }
}

TEST_F(BundleCachePatternsTest, AKeyKeepsItsTextWhenAnotherMessageTookThePlaceOfItsOwn) {
  for (int round = 0; round < 3; ++round) {
    for (int again = 0; again < 3; ++again) EXPECT_EQ(count(), u"1,234.5 of 1,000");
    takeAllPlaces();
  }
}

TEST_F(BundleCachePatternsTest, NumbersFollowTheDefaultLocaleFromCallToCall) {
  for (int round = 0; round < 3; ++round) {
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    EXPECT_EQ(count(), u"1,234.5 of 1,000");
    EXPECT_EQ(count("de"), u"1.234,5 von 1.000");
    EXPECT_EQ(count("root"), u"1,234.5 of 1,000");
    ASSERT_TRUE(IcuDefaults::setLocale("de_DE"));
    EXPECT_EQ(count(), u"1.234,5 von 1.000");
    EXPECT_EQ(count("de"), u"1.234,5 von 1.000");
    EXPECT_EQ(count("root"), u"1,234.5 of 1,000");
    ASSERT_TRUE(IcuDefaults::setLocale("de_CH"));
    EXPECT_EQ(count(), u"1’234.5 von 1’000");
  }
}

TEST_F(BundleCachePatternsTest, DatesFollowTheDefaultZoneFromCallToCall) {
  for (int round = 0; round < 3; ++round) {
    ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
    for (int again = 0; again < 2; ++again)
      EXPECT_EQ(of("when", nullptr, kTime), u"2023-11-14 22:13");
    EXPECT_EQ(count(), u"1,234.5 of 1,000");
    ASSERT_TRUE(IcuDefaults::setZone(u"Asia/Kolkata"));
    EXPECT_EQ(count(), u"1,234.5 of 1,000");
    for (int again = 0; again < 2; ++again)
      EXPECT_EQ(of("when", nullptr, kTime), u"2023-11-15 03:43");
  }
}

TEST_F(BundleCachePatternsTest, EveryBundleHasItsOwnTextOfAKey) {
  const ResourceBundles other("messages");
  ASSERT_TRUE(other.add("root", R"(count { "{0,number}/{1,number,integer}" })"));
  for (int round = 0; round < 3; ++round) {
    path_ = bundles_.path();
    EXPECT_EQ(count(), u"1,234.5 of 1,000");
    path_ = other.path();
    EXPECT_EQ(count(), u"1,234.5/1,000");
  }
}

TEST_F(BundleCachePatternsTest, AReopenedToolkitStartsAnew) {
  for (const char *locale : {"en_US", "de_DE", "en_US"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(locale));
    const OpenToolkit toolkit;
    const bool german = std::string(locale) == "de_DE";
    for (int again = 0; again < 3; ++again)
      EXPECT_EQ(count(), german ? u"1.234,5 von 1.000" : u"1,234.5 of 1,000");
  }
}

TEST_F(BundleCachePatternsTest, APatternIsScannedAndFormattedInAnyOrder) {
  using enum ArgType;
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(count(), u"1,234.5 of 1,000");
    EXPECT_EQ(typesOf("count"), (ArgTypes{kDouble, kInteger}));
    EXPECT_EQ(typesOf("bare"), ArgTypes{});
    EXPECT_EQ(of("bare", nullptr), u"bare");
    EXPECT_EQ(typesOf(longKey(7).c_str()), ArgTypes{kDouble});
    takeAllPlaces();
  }
}
