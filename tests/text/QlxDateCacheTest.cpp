// Dates as bytes, against opening the format anew for every call.
#include "text/QlxFormatCache.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <optional>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include <unicode/dtrule.h>
#include <unicode/rbtz.h>
#include <unicode/simpletz.h>
#include <unicode/timezone.h>
#include <unicode/tzrule.h>
#include <unicode/udat.h>
#include <unicode/uloc.h>

#include "util/CxAsciiLine.h"
#include "text/QlxMessageCache.h"
#include "text/QlxDateCache.h"
#include "util/CxLook.h"

#include "support/CachedFormatsTest.h"
#include "support/Child.h"
#include "support/FailingMemory.h"
#include "support/OpenToolkit.h"
#include "support/WhileLocaleChanges.h"

namespace {

constexpr double kTime = 1155725335123.0;  // 2006-08-16 10:48:55.123 UTC

std::u16string anew(const char *pattern, double time) {
  UErrorCode status = U_ZERO_ERROR;
  const std::u16string own(pattern, pattern + std::char_traits<char>::length(pattern));
  const icu::LocalUDateFormatPointer format{
      udat_open(UDAT_PATTERN, UDAT_PATTERN, nullptr, nullptr, -1, own.c_str(), -1, &status)};
  std::vector<UChar> room(1024);
  udat_format(format.getAlias(), time, room.data(), 1024, nullptr, &status);
  EXPECT_TRUE(U_SUCCESS(status)) << u_errorName(status);
  return room.data();
}

bool isAscii(const std::u16string &text) {
  return std::ranges::all_of(text, [](char16_t unit) { return unit < 0x80; });
}

std::optional<std::string> bytesOf(const char *pattern, double time) {
  CxAsciiLine line;
  EXPECT_TRUE(line.append("[")) << "dates stand behind other text";
  if (!qlxAppendCachedDateAscii(&line, {pattern, false}, time)) return std::nullopt;
  return std::string(line.data() + 1, line.length() - 1);
}

std::u16string unitsOf(const char *pattern, double time) {
  CxUStringBuff text{};
  EXPECT_EQ(qlxAppendCachedDate(&text, {pattern, false}, time), 1);
  const std::u16string made(text.data, text.length);
  CxUStringBuffDiscard(&text);
  return made;
}

// Bytes and units are both what a new format gives; bytes exist for ASCII that fits.
void compare(const char *pattern, double time) {
  const std::u16string expected = anew(pattern, time);
  const std::optional<std::string> bytes = bytesOf(pattern, time);
  if (bytes) {
    EXPECT_EQ(std::u16string(bytes->begin(), bytes->end()), expected)
        << pattern << " at " << time << " in " << uloc_getDefault();
  }
  EXPECT_EQ(unitsOf(pattern, time), expected)
      << pattern << " at " << time << " in " << uloc_getDefault();
  if (!isAscii(expected)) {
    EXPECT_FALSE(bytes);
  }
}

const char *const kPatterns[] = {"yyyy-MM-dd HH:mm:ss.SSS",
                                 "yyyy-MM-dd'T'HH:mm:ss.SSSXXX",
                                 "hh:mm:ss.SSS a",
                                 "K:mm:ss,SSS aaa zzz",
                                 "EEE MMM d HH:mm:ss yyyy",
                                 "MM/dd/yy hh:mm:ss B",
                                 "ss.SSS SSS",
                                 "A"};

const double kTimes[] = {kTime, kTime + 876, kTime + 877,       kTime,
                         -1,    -1000,       -62135596800001.0, 253402300799999.0,
                         0,     0.5,         1162080000000.0};

using DateCacheTest = CachedFormatsTest;

}  // namespace

TEST_F(DateCacheTest, BytesAndUnitsAreInEveryLocaleWhatOpeningAnewGives) {
  std::mt19937 random(16);
  ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
  for (int32_t i = 0; i < uloc_countAvailable() && !HasFailure(); ++i) {
    ASSERT_TRUE(IcuDefaults::setLocale(uloc_getAvailable(i)));
    compare(kPatterns[random() % std::size(kPatterns)], kTimes[random() % std::size(kTimes)]);
  }
  for (const char *locale : {"en_US", "ar_EG", "fa", "hi@numbers=deva", "zh@numbers=hanidec", "de",
                             "th_TH@calendar=buddhist", "ja_JP@calendar=japanese", "my", "ne"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(locale));
    for (const char *pattern : kPatterns)
      for (const double time : kTimes) compare(pattern, time);
  }
}

TEST_F(DateCacheTest, AsciiDatesComeAsBytesAndOthersDoNot) {
  EXPECT_EQ(bytesOf("yyyy-MM-dd HH:mm:ss.SSS", kTime), "2006-08-16 10:48:55.123");
  EXPECT_EQ(bytesOf("hh:mm:ss a", kTime), "10:48:55 AM");
  EXPECT_EQ(bytesOf(nullptr, kTime), "2006-08-16 10:48:55.123+00:00");
  EXPECT_EQ(bytesOf("SSS SSS", kTime), std::nullopt) << "not kept for its second";
  EXPECT_EQ(bytesOf("HH:mm", kTime + 0.5), std::nullopt) << "no whole millisecond";
  ASSERT_TRUE(IcuDefaults::setLocale("ar_EG"));
  EXPECT_EQ(bytesOf("HH:mm:ss", kTime), std::nullopt);
}

TEST_F(DateCacheTest, EveryMillisecondHasItsOwnBytes) {
  for (int millis = 0; millis < 1000; ++millis) {
    const std::string digits = std::to_string(1000 + millis).substr(1);
    ASSERT_EQ(bytesOf("ss.SSS'x'", 5000.0 + millis), "05." + digits + "x");
    ASSERT_EQ(bytesOf("SSS", -1000.0 + millis), digits);
  }
}

TEST_F(DateCacheTest, BytesEndAt64AndUnitsDoNot) {
  for (const size_t length : {60, 61, 62, 63, 64, 65, 200}) {
    const std::string text(length - 4, 'x');
    const std::string pattern = "'" + text + "'.SSS";
    const std::optional<std::string> bytes = bytesOf(pattern.c_str(), kTime);
    if (length <= 64)
      EXPECT_EQ(bytes, text + ".123");
    else
      EXPECT_FALSE(bytes) << length;
    compare(pattern.c_str(), kTime);
  }
}

TEST_F(DateCacheTest, ALineWithoutRoomRefusesTheDate) {
  for (const uint32_t room : {0, 11, 12}) {
    CxAsciiLine line;
    ASSERT_TRUE(line.append(std::string(4096 - room, 'x')));
    EXPECT_EQ(qlxAppendCachedDateAscii(&line, {"HH:mm:ss.SSS", false}, kTime), room == 12);
    EXPECT_EQ(line.length(), room == 12 ? 4096U : 4096 - room);
  }
}

// ---- What a held date depends on

TEST_F(DateCacheTest, TheSameMillisecondFollowsTheZoneOfTheCall) {
  for (int round = 0; round < 3; ++round) {
    ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
    EXPECT_EQ(bytesOf("HH:mm:ss.SSS", kTime), "10:48:55.123");
    EXPECT_EQ(bytesOf(nullptr, kTime), "2006-08-16 10:48:55.123+00:00");
    ASSERT_TRUE(IcuDefaults::setZone(u"Asia/Kolkata"));
    EXPECT_EQ(bytesOf("HH:mm:ss.SSS", kTime), "16:18:55.123");
    EXPECT_EQ(bytesOf(nullptr, kTime), "2006-08-16 16:18:55.123+05:30");
  }
}

TEST_F(DateCacheTest, ZonesThatDifferInSummerAloneAreToldApart) {
  for (int round = 0; round < 3; ++round) {
    ASSERT_TRUE(IcuDefaults::setZone(u"Africa/Lagos"));
    EXPECT_EQ(bytesOf("HH", kTime), "11");
    ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
    EXPECT_EQ(bytesOf("HH", kTime), "12");
  }
}

TEST_F(DateCacheTest, TwoZonesOfOneNameAreToldApart) {
  for (int round = 0; round < 3; ++round)
    for (const int32_t hours : {1, 2}) {
      icu::TimeZone::adoptDefault(new icu::SimpleTimeZone(hours * 3'600'000, u"Same"));
      cxLookRestart();
      const std::string hour = std::to_string(10 + hours);
      EXPECT_EQ(bytesOf("HH:mm", kTime), hour + ":48");
      EXPECT_EQ(unitsOf("HH:mm", kTime), anew("HH:mm", kTime));
      CxUStringBuff text{};
      UErrorCode status = U_ZERO_ERROR;
      qlxAppendCachedMessage(&text, nullptr, u"{0,time,yyyy HH}", nullptr, &status);
      EXPECT_EQ(std::u16string(text.data), u"1970 0" + std::u16string(1, u'0' + hours));
      CxUStringBuffDiscard(&text);
    }
}

TEST_F(DateCacheTest, TheHourChangesAtTheMillisecondOfTheTransition) {
  ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
  constexpr double kBackToWinter = 1162083600000.0;  // 2006-10-29 01:00 UTC
  constexpr double kToSummer = 1143334800000.0;      // 2006-03-26 01:00 UTC
  for (int round = 0; round < 2; ++round) {
    EXPECT_EQ(bytesOf("HH:mm:ss.SSS", kBackToWinter - 1), "02:59:59.999");
    EXPECT_EQ(bytesOf("HH:mm:ss.SSS", kBackToWinter), "02:00:00.000");
    EXPECT_EQ(bytesOf(nullptr, kBackToWinter - 1), "2006-10-29 02:59:59.999+02:00");
    EXPECT_EQ(bytesOf(nullptr, kBackToWinter), "2006-10-29 02:00:00.000+01:00");
    EXPECT_EQ(bytesOf("HH:mm:ss.SSS", kToSummer - 1), "01:59:59.999");
    EXPECT_EQ(bytesOf("HH:mm:ss.SSS", kToSummer), "03:00:00.000");
  }
}

// Patterns whose text of a second says nothing of its milliseconds, and one that does.
constexpr const char *kWithinASecond[] = {"HH:mm:ss",     "ss",       "HH:mm",
                                          "HH:mm:ss.SSS", "ss XXXXX", "yyyy-MM-dd HH:mm:ss zzzz"};

TEST_F(DateCacheTest, AZoneWithAPartOfASecondTellsTheTimeAtItsMilliseconds) {
  for (const int32_t offset : {500, -1, 3'600'001, -17'999'500, 999, 1'234'567})
    for (const bool inSummer : {false, true}) {
      auto *zone = new icu::SimpleTimeZone(inSummer ? 0 : offset, u"Odd");
      UErrorCode status = U_ZERO_ERROR;
      if (inSummer) {
        zone->setStartRule(0, 1, 0, status);
        zone->setEndRule(11, 31, 0, status);
        zone->setDSTSavings(std::abs(offset) % 1000 + 3'600'000, status);
      }
      ASSERT_TRUE(U_SUCCESS(status));
      icu::TimeZone::adoptDefault(zone);
      cxLookRestart();
      for (const char *pattern : kWithinASecond)
        for (const double millis : {0, 1, 499, 500, 876, 999, 0, 877})
          compare(pattern, kTime - 123 + millis);
    }
}

// A zone whose offset from UTC is another one at each of two moments.
void setZoneThatChanges(int32_t first, UDate at, int32_t second, UDate again, int32_t third) {
  UErrorCode status = U_ZERO_ERROR;
  auto *zone =
      new icu::RuleBasedTimeZone(u"Changing", new icu::InitialTimeZoneRule(u"first", first, 0));
  zone->addTransitionRule(
      new icu::TimeArrayTimeZoneRule(u"second", second, 0, &at, 1, icu::DateTimeRule::UTC_TIME),
      status);
  zone->addTransitionRule(
      new icu::TimeArrayTimeZoneRule(u"third", third, 0, &again, 1, icu::DateTimeRule::UTC_TIME),
      status);
  zone->complete(status);
  ASSERT_TRUE(U_SUCCESS(status)) << u_errorName(status);
  icu::TimeZone::adoptDefault(zone);
  cxLookRestart();
}

TEST_F(DateCacheTest, AnOffsetThatChangesWithinASecondDoesSoAtItsMillisecond) {
  constexpr UDate kSecond = kTime - 123, kLater = kSecond + 60'000;
  constexpr int32_t kHour = 3'600'000;
  for (const UDate again : {kLater, kSecond + 700, kSecond + 999, kSecond + 401}) {
    setZoneThatChanges(0, kSecond + 400, kHour, again, again == kLater ? 2 * kHour : 0);
    for (const char *pattern : kWithinASecond)
      for (int round = 0; round < 2; ++round)
        for (const double millis : {-1000, 0, 399, 400, 401, 699, 700, 998, 999, 1000, 0, 60'000})
          compare(pattern, kSecond + millis);
    EXPECT_EQ(unitsOf(nullptr, kSecond + 399), u"2006-08-16 10:48:55.399+00:00");
    EXPECT_EQ(unitsOf(nullptr, kSecond + 400), u"2006-08-16 11:48:55.400+01:00");
  }
}

TEST_F(DateCacheTest, AfterAnOddSecondTextsAreKeptAgain) {
  constexpr UDate kSecond = kTime - 123;
  setZoneThatChanges(0, kSecond + 400, 3'600'000, kSecond + 60'000, 0);
  EXPECT_EQ(bytesOf("HH:mm:ss", kSecond), std::nullopt) << "not kept";
  EXPECT_EQ(bytesOf("HH:mm:ss", kSecond + 1000), "11:48:56");
  EXPECT_EQ(bytesOf("HH:mm:ss", kSecond + 60'000), "10:49:55") << "a change at the full second";
}

TEST_F(DateCacheTest, TheSameSecondFollowsTheLocaleOfTheCall) {
  for (int round = 0; round < 3; ++round) {
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    EXPECT_EQ(bytesOf("EEE hh a", kTime), "Wed 10 AM");
    ASSERT_TRUE(IcuDefaults::setLocale("nl"));
    EXPECT_EQ(bytesOf("EEE hh a", kTime), "wo 10 a.m.");
    ASSERT_TRUE(IcuDefaults::setLocale("ar_EG"));
    EXPECT_EQ(bytesOf("EEE hh a", kTime), std::nullopt);
  }
}

TEST_F(DateCacheTest, AReopenedToolkitWritesInTheNewZone) {
  for (const auto &[zone, hour] :
       {std::pair{u"UTC", "10"}, {u"Asia/Tokyo", "19"}, {u"UTC", "10"}}) {
    ASSERT_TRUE(IcuDefaults::setZone(zone));
    const OpenToolkit toolkit;
    EXPECT_EQ(bytesOf("HH", kTime), hour);
  }
}

TEST_F(DateCacheTest, AChildWritesInTheZoneThatItSets) {
  EXPECT_EQ(bytesOf("HH", kTime), "10");
  Child child([] {
    EXPECT_EQ(bytesOf("HH", kTime), "10");
    EXPECT_TRUE(IcuDefaults::setZone(u"Asia/Tokyo"));
    EXPECT_EQ(bytesOf("HH", kTime), "19");
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(bytesOf("HH", kTime), "10");
}

// ---- Without memory, and with threads

TEST_F(DateCacheTest, WithoutMemoryThereAreTheWholeBytesOrNone) {
  for (const auto fail : {&FailingMemory::failOnce, &FailingMemory::failFrom})
    for (uint64_t nth = 1;; ++nth) {
      qlxDropCachedFormats();
      FailingMemory memory;
      (memory.*fail)(nth);
      for (int second = 0; second < 2; ++second)
        for (const char *pattern : {static_cast<const char *>(nullptr), "HH:mm:ss.SSS"}) {
          const std::string whole =
              pattern ? "10:48:5" + std::to_string(5 + second) + ".123"
                      : "2006-08-16 10:48:5" + std::to_string(5 + second) + ".123+00:00";
          EXPECT_EQ(bytesOf(pattern, kTime + second * 1000).value_or(whole), whole);
        }
      const uint64_t failures = memory.failures();
      memory.failNone();
      EXPECT_EQ(bytesOf(nullptr, kTime), "2006-08-16 10:48:55.123+00:00");
      qlxDropCachedFormats();
      EXPECT_EQ(memory.live(), 0);
      if (failures == 0) break;
    }
}

TEST_F(DateCacheTest, AFormatOpenedWhileAThreadChangesTheLocaleIsNotKeptForAnotherOne) {
  for (int round = 0; round < 100; ++round) {
    qlxDropCachedFormats();
    whileLocaleChanges("en", "de", [] { bytesOf("EEEE", kTime); });
    ASSERT_EQ(bytesOf("EEEE", kTime), "Wednesday") << round;
  }
}

TEST_F(DateCacheTest, ThreadsWriteInOneOfTheZonesThatAnotherThreadSets) {
  std::atomic<bool> stop{false};
  std::atomic<int> wrong{0}, written{0};
  std::thread writers[2];
  for (std::thread &writer : writers)
    writer = std::thread([&] {
      for (; !stop; ++written) {
        const std::optional<std::string> text = bytesOf("HH:mm:ss.SSS", kTime);
        if (text != "10:48:55.123" && text != "16:18:55.123") ++wrong;
      }
    });
  for (int round = 0; round < 400 || written < 400; ++round)
    IcuDefaults::setZone(round % 2 ? u"UTC" : u"Asia/Kolkata");
  stop = true;
  for (std::thread &writer : writers) writer.join();
  EXPECT_EQ(wrong, 0);
}
