// ICU's defaults in a burst of records, by a clock of the test's own: the first records of a tick
// look at them, the rest share the last look.
#include <gtest/gtest.h>

#include <string>

#include <unicode/ucal.h>
#include <unicode/uloc.h>

#include <qlx/buffers.h>

#include "object/QlxLocked.h"
#include "support/Child.h"
#include "support/IcuDefaults.h"
#include "support/TestClock.h"
#include "text/QlxDateCache.h"
#include "text/QlxFormatCache.h"
#include "text/QlxMessageCache.h"
#include "text/QlxNumberCache.h"
#include "util/CxLook.h"

namespace {

constexpr int kFirstLooks = 1024;  // of a process
constexpr int kLooksATick = 16;

std::u16string take(CxUStringBuff *text) {
  const std::u16string taken = text->data ? text->data : u"";
  CxUStringBuffDiscard(text);
  return taken;
}

uint32_t append(CxUStringBuff *text, const UChar *pattern, ...) {
  va_list args;
  va_start(args, pattern);
  UErrorCode status = U_ZERO_ERROR;
  const uint32_t appended = qlxAppendCachedMessage(text, nullptr, pattern, &args, &status);
  va_end(args);
  return appended;
}

std::u16string hour() {
  CxUStringBuff text{};
  qlxAppendCachedDate(&text, {"HH", false}, 0);
  return take(&text);
}
std::u16string hourOfAMessage() {
  CxUStringBuff text{};
  append(&text, u"{0,date,HH}", 0.0);
  return take(&text);
}
std::u16string number() {
  CxUStringBuff text{};
  qlxAppendCachedNumber(&text, kFraction, 0.5);
  return take(&text);
}
std::u16string numberOfAMessage() {
  CxUStringBuff text{};
  append(&text, u"{0,number}", 0.5);
  return take(&text);
}

class DefaultsInABurstTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(IcuDefaults::setLocale("en"));
    ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
    qlxDropCachedFormats();
    { const ApiLock lock; }  // with it come the fork's handlers
    CxLook look = {};
    for (int i = 0; i < kFirstLooks; ++i) cxLookAgain(&look);
  }
  void TearDown() override { qlxDropCachedFormats(); }

  // As a host does it: nobody is told.
  static void setZone(const UChar *zone) {
    UErrorCode status = U_ZERO_ERROR;
    ucal_setDefaultTimeZone(zone, &status);
  }
  static void setLocale(const char *locale) {
    UErrorCode status = U_ZERO_ERROR;
    uloc_setDefault(locale, &status);
  }

  static void useUp(std::u16string (*record)()) {
    for (int i = 0; i < 2 * kLooksATick; ++i) record();
  }

  IcuDefaults defaults_;
  TestClock clock_;
};

struct Way {
  std::u16string (*record)();
  const char *locale;
  const UChar *zone;
  const UChar *before, *after;
};

const Way kWays[] = {
    {hour, "en", u"Asia/Tokyo", u"00", u"09"},
    {hourOfAMessage, "en", u"Asia/Tokyo", u"00", u"09"},
    {number, "de", u"UTC", u"0.5", u"0,5"},
    {numberOfAMessage, "de", u"UTC", u"0.5", u"0,5"},
};

TEST_F(DefaultsInABurstTest, AreSeenByTheFirstRecordsOfATick) {
  for (const Way &way : kWays) {
    SetUp();
    EXPECT_EQ(way.record(), way.before);
    setLocale(way.locale);
    setZone(way.zone);
    EXPECT_EQ(way.record(), way.after);
  }
}

TEST_F(DefaultsInABurstTest, AreSeenWithTheNextTickByRecordsThatShareALook) {
  for (const Way &way : kWays) {
    SetUp();
    useUp(way.record);
    setLocale(way.locale);
    setZone(way.zone);
    EXPECT_EQ(way.record(), way.before) << "looked";
    ++TestClock::tick;
    EXPECT_EQ(way.record(), way.after);
  }
}

TEST_F(DefaultsInABurstTest, AreSeenAtOnceAfterAFork) {
  for (const Way &way : kWays) {
    SetUp();
    useUp(way.record);
    Child child([&] {
      setLocale(way.locale);
      setZone(way.zone);
      EXPECT_EQ(way.record(), way.after);
    });
    EXPECT_EQ(child.end(), 0);
  }
}

// Two defaults in one text would be worse than the one of a moment ago.
TEST_F(DefaultsInABurstTest, CountTogetherForAFormatThatIsNew) {
  useUp(hour);
  setZone(u"Asia/Tokyo");
  CxUStringBuff text{};
  qlxAppendCachedDate(&text, {nullptr, false}, 0);
  EXPECT_EQ(take(&text), u"1970-01-01 09:00:00.000+09:00");
  EXPECT_EQ(hour(), u"09");
}

}  // namespace
