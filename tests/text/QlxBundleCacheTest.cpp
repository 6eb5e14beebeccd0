// Patterns of held bundles against the reference: opening the bundle anew for every call.
#include "text/QlxFormatCache.h"
#include "text/QlxBundleCache.h"
#include "text/QlxDateCache.h"

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <functional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <unicode/putil.h>
#include <unicode/uclean.h>
#include <unicode/umsg.h>
#include <unicode/ures.h>
#include <unicode/ustdio.h>
#include <unicode/ustring.h>

#include <qlx/buffers.h>
#include <qlx/toolkit.h>

#include "support/Child.h"
#include "support/FailingMemory.h"
#include "support/FormatResult.h"
#include "support/IcuDefaults.h"
#include "support/OpenToolkit.h"
#include "support/ResourceBundles.h"
#include "support/WhileLocaleChanges.h"

namespace {

constexpr UChar kArgument[] = u"value";

uint32_t appendArgument(CxUStringBuff *text, const MessageName *message, UErrorCode *status, ...) {
  va_list args;
  va_start(args, status);
  const uint32_t units = qlxAppendBundleMessage(text, *message, &args, status);
  va_end(args);
  return units;
}

FormatResult held(const MessageName &message) {
  CxUStringBuff text{};
  UErrorCode status = U_ZERO_ERROR;
  const uint32_t units = appendArgument(&text, &message, &status, kArgument);
  const FormatResult result{text.data ? std::u16string(text.data, text.length) : u"",
                            U_FAILURE(status) ? status : 0};
  EXPECT_EQ(units, result.text.size());
  CxUStringBuffDiscard(&text);
  return result;
}

FormatResult anew(const MessageName &message) {
  UErrorCode status = U_ZERO_ERROR;
  icu::LocalUResourceBundlePointer bundle{ures_open(message.bundle, message.locale, &status)};
  const char *const separator = std::strrchr(message.bundle, '/');
  if (U_FAILURE(status) && separator) {
    status = U_ZERO_ERROR;
    bundle.adoptInstead(ures_open(separator + 1, message.locale, &status));
  }
  if (U_FAILURE(status)) return {u"", status};
  status = U_ZERO_ERROR;
  int32_t length = 0;
  const UChar *pattern = ures_getStringByKey(bundle.getAlias(), message.key, &length, &status);
  if (U_FAILURE(status)) return {u"", status};
  std::vector<UChar> text(4096);
  status = U_ZERO_ERROR;
  u_formatMessage(message.locale, pattern, u_strlen(pattern), text.data(), 4096, &status,
                  kArgument);
  if (U_FAILURE(status)) return {u"", status};
  return {text.data(), 0};
}

// Called once, by the next opening of a bundle.
std::function<void()> beforeOpening;

// ICU looks for a bundle's bare name here.
class DataDirectory {
 public:
  explicit DataDirectory(const std::string &path) : before_(u_getDataDirectory()) {
    u_setDataDirectory(path.c_str());
  }
  ~DataDirectory() { u_setDataDirectory(before_.c_str()); }
  DataDirectory(const DataDirectory &) = delete;
  DataDirectory &operator=(const DataDirectory &) = delete;

 private:
  std::string before_;
};

constexpr int kMostHeld = 16;

class BundleCacheTest : public ::testing::Test {
 protected:
  void SetUp() override {
    qlxDropCachedFormats();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(bundles_.add("root", R"(
      hello { "root {0}" }
      bare { "bare root" }
      plain { "only in the root" }
      empty { "" }
      zero { "before {0}\u0000{1} behind" }
      alsoZero { "before {0}\u0000{1} other" }
      plainZero { "before\u0000behind" }
      broken { "{0" }
      table { inner { "x" } }
      number:int { 5 }
      same:alias { "/LOCALE/hello" }
      lost:alias { "/LOCALE/nothing" }
    )"));
    ASSERT_TRUE(bundles_.add("de", R"(hello { "deutsch {0}" } bare { "bare deutsch" })"));
    ASSERT_TRUE(bundles_.add("de_AT", R"(bare { "bare austria" })"));
  }
  void TearDown() override { qlxDropCachedFormats(); }

  MessageName message(const char *key, const char *locale = nullptr) const {
    return {path_.c_str(), key, locale};
  }
  FormatResult of(const char *key, const char *locale = nullptr) const {
    return held(message(key, locale));
  }
  void compare(const char *key, const char *locale = nullptr) const {
    const MessageName name = message(key, locale);
    const FormatResult expected = anew(name);
    for (int round = 0; round < 3; ++round) {
      const FormatResult got = held(name);
      EXPECT_EQ(got.text, expected.text)
          << (key ? key : "null") << " in " << (locale ? locale : "null");
      EXPECT_EQ(got.error, expected.error) << (key ? key : "null");
    }
  }
  // Allocations of a text without arguments; the text itself is one.
  int64_t allocationsOf(const char *locale) const {
    const FailingMemory memory;
    of("bare", locale);
    return static_cast<int64_t>(memory.attempts());
  }

  ResourceBundles bundles_;
  const std::string path_ = bundles_.path();
  IcuDefaults defaults_;
};

const char *const kKeys[] = {"hello",    "bare",      "plain",   "empty", "zero",
                             "alsoZero", "plainZero", "broken",  "table", "number",
                             "same",     "lost",      "nothing", "",      nullptr};

}  // namespace

// In place of ICU's own, for the whole program.
extern "C" UResourceBundle *ures_open(const char *name, const char *locale, UErrorCode *status) {
#define QLX_NAME_OF(function) QLX_NAME_OF_RENAMED(function)
#define QLX_NAME_OF_RENAMED(function) #function
  static void *const open = dlsym(RTLD_NEXT, QLX_NAME_OF(ures_open));
  if (beforeOpening) std::exchange(beforeOpening, nullptr)();
  return reinterpret_cast<decltype(&ures_open)>(open)(name, locale, status);
}

TEST_F(BundleCacheTest, EveryKeyIsInEveryLocaleWhatOpeningAnewGives) {
  for (const char *defaultLocale : {"en_US", "de_DE", "fr"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(defaultLocale));
    for (const char *locale : {static_cast<const char *>(nullptr), "", "root", "de", "de_AT",
                               "de_CH", "fr", "en_US", "xx", "not a locale", "de@numbers=arab"})
      for (const char *key : kKeys) compare(key, locale);
  }
}

TEST_F(BundleCacheTest, APatternEndsAtItsFirstZero) {
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(of("zero"), (FormatResult{u"before value", 0}));
    EXPECT_EQ(of("alsoZero"), (FormatResult{u"before value", 0}));
    EXPECT_EQ(of("plainZero"), (FormatResult{u"before", 0}));
  }
}

TEST_F(BundleCacheTest, AnAliasIsTheTextThatItNames) {
  EXPECT_EQ(of("same"), (FormatResult{u"root value", 0}));
  EXPECT_EQ(of("same", "de"), (FormatResult{u"deutsch value", 0}));
  EXPECT_NE(of("lost").error, 0);
}

TEST_F(BundleCacheTest, AKeyThatIsMissingDoesNotSpoilTheBundle) {
  EXPECT_EQ(of("nothing").error, U_MISSING_RESOURCE_ERROR);
  EXPECT_EQ(of("hello"), (FormatResult{u"root value", 0}));
  EXPECT_EQ(of("table").error, U_RESOURCE_TYPE_MISMATCH);
  EXPECT_EQ(of("hello"), (FormatResult{u"root value", 0}));
}

// ---- What a held bundle depends on

TEST_F(BundleCacheTest, ALocaleThatIsMissingFallsBackToTheDefaultOneOfTheMoment) {
  for (int round = 0; round < 3; ++round) {
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    for (const char *locale : {static_cast<const char *>(nullptr), "fr"})
      EXPECT_EQ(of("hello", locale), (FormatResult{u"root value", 0}));
    ASSERT_TRUE(IcuDefaults::setLocale("de_AT"));
    for (const char *locale : {static_cast<const char *>(nullptr), "fr"}) {
      EXPECT_EQ(of("hello", locale), (FormatResult{u"deutsch value", 0}));
      EXPECT_EQ(of("bare", locale), (FormatResult{u"bare austria", 0}));
    }
    EXPECT_EQ(of("hello", "root"), (FormatResult{u"root value", 0}));
  }
}

TEST_F(BundleCacheTest, ABundleFoundInADefaultLocaleThatChangedMeanwhileIsNotHeld) {
  IcuDefaults::setLocale("de");
  beforeOpening = [] { IcuDefaults::setLocale("en_US"); };
  EXPECT_EQ(of("hello", "fr").text, u"root value");
  IcuDefaults::setLocale("de");
  EXPECT_EQ(of("hello", "fr").text, u"deutsch value");
}

TEST_F(BundleCacheTest, TheSameBundleInSeveralLocalesIsToldApart) {
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(of("bare", "de"), (FormatResult{u"bare deutsch", 0}));
    EXPECT_EQ(of("bare", "de_AT"), (FormatResult{u"bare austria", 0}));
    EXPECT_EQ(of("bare", "root"), (FormatResult{u"bare root", 0}));
    EXPECT_EQ(of("bare", ""), (FormatResult{u"bare root", 0}));
    EXPECT_EQ(of("bare"), (FormatResult{u"bare root", 0}));
  }
}

TEST_F(BundleCacheTest, ABareNameIsWhatIcuFindsInItsDataDirectories) {
  const ResourceBundles first("places"), second("places"), third("elsewhere");
  ASSERT_TRUE(first.add("root", "hello { \"first {0}\" }"));
  ASSERT_TRUE(second.add("root", "hello { \"second {0}\" }"));
  ASSERT_TRUE(third.add("root", "hello { \"third {0}\" }"));
  for (int round = 0; round < 2; ++round)
    for (const ResourceBundles *bundles : {&first, &second, &third})
      for (const char *name : {"places", "elsewhere", "/no/such/places"}) {
        const DataDirectory directory(bundles->folder());
        const MessageName hello{name, "hello", nullptr};
        const FormatResult got = held(hello);
        EXPECT_EQ(got, anew(hello)) << round << name;
      }
}

TEST_F(BundleCacheTest, ABundleIsSearchedAgainAsLongAsItIsMissing) {
  const ResourceBundles late("late");
  const std::string path = late.folder() + "/late";
  const MessageName hello{path.c_str(), "hello", nullptr};
  EXPECT_EQ(held(hello), (FormatResult{u"", U_MISSING_RESOURCE_ERROR}));
  ASSERT_TRUE(late.add("root", "hello { \"late {0}\" }"));
  EXPECT_EQ(held(hello), anew(hello));
  const std::string other =
      late.folder() + "//late";  // unknown to ICU, which remembers the missing
  const MessageName again{other.c_str(), "hello", nullptr};
  EXPECT_EQ(held(again), (FormatResult{u"late value", 0}));
}

TEST_F(BundleCacheTest, AReopenedToolkitReadsTheBundleAgain) {
  for (const char *locale : {"en_US", "de", "en_US"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(locale));
    const OpenToolkit toolkit;
    compare("hello");
  }
}

TEST_F(BundleCacheTest, IcuMayCleanUpAfterTheToolkitIsClosed) {
  Child child([&] {
    for (int round = 0; round < 4; ++round) {
      if (round % 2 == 0) {
        EXPECT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);
      }
      EXPECT_EQ(of("hello", "de"), (FormatResult{u"deutsch value", 0}));
      CxUStringBuff text{};
      CxUStringBuffAppendUDouble(&text, 1.5);
      qlxAppendCachedDate(&text, {nullptr, false}, 0);
      CxUStringBuffDiscard(&text);
      const FailingMemory memory;
      QlxCloseToolkit();
      EXPECT_LT(memory.live(), 0) << "also what was held without an open toolkit is given back";
      u_cleanup();
    }
  });
  EXPECT_EQ(child.end(), 0);
}

// ---- How many

TEST_F(BundleCacheTest, ABundleIsOpenedOnce) {
  EXPECT_EQ(allocationsOf(nullptr), 3) << "text, name and default locale";
  EXPECT_EQ(allocationsOf(nullptr), 1);
  EXPECT_EQ(allocationsOf("de"), 4);
  EXPECT_EQ(allocationsOf("de"), 1);
  EXPECT_EQ(allocationsOf(nullptr), 1);
}

TEST_F(BundleCacheTest, TheBundleNotUsedForLongestGoesFirst) {
  const auto locale = [](int number) { return "de_V" + std::to_string(number); };
  allocationsOf(locale(0).c_str());
  for (int number = 1; number < kMostHeld; ++number)
    EXPECT_EQ(allocationsOf(locale(number).c_str()), 4);
  EXPECT_EQ(allocationsOf(locale(0).c_str()), 1);  // makes number 1 the oldest
  {
    const FailingMemory memory;
    EXPECT_EQ(of("bare", locale(kMostHeld).c_str()), (FormatResult{u"bare deutsch", 0}));
    EXPECT_EQ(memory.live(), 0) << "one more is held, one less is";
  }
  EXPECT_EQ(allocationsOf(locale(0).c_str()), 1);
  EXPECT_EQ(allocationsOf(locale(2).c_str()), 1);
  EXPECT_EQ(allocationsOf(locale(1).c_str()), 4);
}

TEST_F(BundleCacheTest, ManyMoreBundlesThanAreHeldGiveTheirOwnTexts) {
  for (int round = 0; round < 3; ++round)
    for (int number = 0; number < 3 * kMostHeld; ++number) {
      const std::string locale = (number % 2 ? "de_V" : "fr_V") + std::to_string(number);
      EXPECT_EQ(of("hello", locale.c_str()).text, number % 2 ? u"deutsch value" : u"root value");
    }
}

// ---- Without memory, and with threads

TEST_F(BundleCacheTest, WithoutMemoryThereIsTheWholeTextOrNone) {
  for (const auto fail : {&FailingMemory::failOnce, &FailingMemory::failFrom})
    for (uint64_t nth = 1;; ++nth) {
      qlxDropCachedFormats();
      FailingMemory memory;
      (memory.*fail)(nth);
      for (const char *locale : {"de", static_cast<const char *>(nullptr), "de"})
        for (const char *key : {"hello", "bare"}) {
          const FormatResult got = of(key, locale);
          const std::u16string whole = std::string(key) == "bare"
                                           ? (locale ? u"bare deutsch" : u"bare root")
                                           : (locale ? u"deutsch value" : u"root value");
          EXPECT_EQ(got, got.error ? (FormatResult{u"", U_MEMORY_ALLOCATION_ERROR})
                                   : (FormatResult{whole, 0}));
        }
      const uint64_t failures = memory.failures();
      memory.failNone();
      EXPECT_EQ(of("hello", "de"), (FormatResult{u"deutsch value", 0}));
      qlxDropCachedFormats();
      EXPECT_EQ(memory.live(), 0) << nth;
      if (failures == 0) break;
    }
}

TEST_F(BundleCacheTest, ThreadsUseBundlesWhileAnotherOneChangesTheDefaultLocale) {
  std::atomic<bool> stop{false};
  std::atomic<int> wrong{0}, formatted{0};
  std::thread readers[2];
  for (std::thread &reader : readers)
    reader = std::thread([&] {
      for (; !stop; ++formatted) {
        const std::u16string text = of("hello", "fr").text;
        if (text != u"root value" && text != u"deutsch value") ++wrong;
        if (of("hello", "de").text != u"deutsch value") ++wrong;
      }
    });
  for (int round = 0; round < 400 || formatted < 400; ++round)
    IcuDefaults::setLocale(round % 2 ? "de" : "en_US");
  stop = true;
  for (std::thread &reader : readers) reader.join();
  EXPECT_EQ(wrong, 0);
}

TEST_F(BundleCacheTest, ABundleOpenedWhileAThreadChangesTheLocaleIsNotKeptForAnotherOne) {
  for (int round = 0; round < 100; ++round) {
    qlxDropCachedFormats();
    whileLocaleChanges("de", "de_AT", [&] { of("bare"); });
    ASSERT_EQ(of("bare").text, u"bare deutsch") << round;
  }
}

TEST_F(BundleCacheTest, AChildReadsInTheLocaleThatItSets) {
  EXPECT_EQ(of("hello"), (FormatResult{u"root value", 0}));
  Child child([&] {
    EXPECT_EQ(of("hello"), (FormatResult{u"root value", 0}));
    EXPECT_TRUE(IcuDefaults::setLocale("de"));
    EXPECT_EQ(of("hello"), (FormatResult{u"deutsch value", 0}));
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(of("hello"), (FormatResult{u"root value", 0}));
}

// ---- Scanning

TEST_F(BundleCacheTest, APatternIsScannedInTheMessagesLocale) {
  ArgTypes types{};
  EXPECT_TRUE(qlxScanBundlePattern(message("hello", "de"), &types));
  EXPECT_TRUE(qlxScanBundlePattern(message("zero"), &types));
  EXPECT_FALSE(qlxScanBundlePattern(message("nothing"), &types));
  EXPECT_FALSE(qlxScanBundlePattern({"/no/such/bundle", "hello", nullptr}, &types));
}
