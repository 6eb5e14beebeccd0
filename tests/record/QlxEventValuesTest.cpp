#include "record/QlxEventValues.h"

#include <gtest/gtest.h>

#include <string>

#include <qlx/event.h>

#include "util/CxOwned.h"

namespace {

using EventPtr = Owned<Event, QlxFreeEvent>;

constexpr const char *kKeys[] = {
    "qlx_prop_srcfile", "qlx_prop_srcfunction",
    "qlx_prop_srcline", "organization",
    "product",          "component",
    "productInstance",  "client",
    "server",           "serverFormat",
    "correlationId",    "processId",
    "threadId",
};

EventPtr makeEvent() {
  return EventPtr{QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text")};
}

TEST(EventValuesTest, EachKeyIsKnownByItsWholeName) {
  for (size_t i = 0; i < std::size(kKeys); ++i) {
    const std::string key = kKeys[i];
    EXPECT_EQ(qlxEventKeyOf(key.c_str()), static_cast<EventKey>(i)) << key;
    for (size_t at = 0; at < key.size(); ++at) {
      std::string other = key;
      other[at] ^= 1;
      EXPECT_EQ(qlxEventKeyOf(other.c_str()), EventKey::kNone) << other;
    }
    EXPECT_EQ(qlxEventKeyOf((key + "x").c_str()), EventKey::kNone) << key;
    EXPECT_EQ(qlxEventKeyOf(key.substr(1).c_str()), EventKey::kNone) << key;
  }
}

TEST(EventValuesTest, ShortAndStrangeKeysAreOthers) {
  for (const char *key : {"", "x", "xy", "\xff\xff", "Server", "a key of a host's own"})
    EXPECT_EQ(qlxEventKeyOf(key), EventKey::kNone) << key;
}

TEST(EventValuesTest, EachValueIsFoundWhereverItStands) {
  const EventPtr event = makeEvent();
  for (size_t i = std::size(kKeys); i-- > 0;) {
    QlxSetEventProp(event.get(), kKeys[i], kKeys[i]);
  }
  const EventValues values = qlxFindEventValues(event.get());
  for (size_t i = 0; i < std::size(kKeys); ++i) {
    EXPECT_STREQ(values[static_cast<EventKey>(i)], kKeys[i]);
    EXPECT_TRUE(values.has(static_cast<EventKey>(i))) << kKeys[i];
  }
  EXPECT_FALSE(values.has(EventKey::kNone));
}

TEST(EventValuesTest, AKeyWithoutAValueIsThereAllTheSame) {
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "organization", nullptr);
  QlxSetEventProp(event.get(), "another", "value");
  const EventValues values = qlxFindEventValues(event.get());
  EXPECT_EQ(values[EventKey::kOrganization], nullptr);
  EXPECT_TRUE(values.has(EventKey::kOrganization));
  EXPECT_FALSE(values.has(EventKey::kProduct));
  EXPECT_TRUE(values.has(EventKey::kNone));
}

TEST(EventValuesTest, NumbersAreThereWhenTheyAreNumbers) {
  const EventPtr event = makeEvent();
  const auto set = [&](const char *value) {
    for (const char *key : {"qlx_prop_srcline", "threadId", "processId"})
      QlxSetEventProp(event.get(), key, value);
    return qlxFindEventValues(event.get());
  };
  EventValues values = set(" 12x");
  EXPECT_EQ(values.sourceLine, 12);
  EXPECT_EQ(qlxThreadOf(values), 12U);
  EXPECT_EQ(qlxProcessOf(values), 12);
  values = set("8589934591");  // 2 to the power 33, less one
  EXPECT_EQ(qlxThreadOf(values), 4294967295U);
  EXPECT_EQ(qlxProcessOf(values), -1);
  values = set("none");
  EXPECT_EQ(values.sourceLine, std::nullopt);
  EXPECT_EQ(qlxThreadOf(values), std::nullopt);
  EXPECT_EQ(qlxProcessOf(values), std::nullopt);
}

TEST(EventValuesTest, AnEventWithoutPropertiesHasNone) {
  const EventPtr event = makeEvent();
  for (const Event *each : {static_cast<const Event *>(event.get()), (const Event *)nullptr}) {
    const EventValues values = qlxFindEventValues(each);
    EXPECT_EQ(values.keys, 0U);
    EXPECT_EQ(values.sourceLine, std::nullopt);
    for (const char *text : values.texts) EXPECT_EQ(text, nullptr);
  }
}

}  // namespace
