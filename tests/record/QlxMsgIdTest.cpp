#include "record/QlxMsgId.h"

#include <gtest/gtest.h>

#include <string>

#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/event.h>

#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/Take.h"
#include "util/CxOwned.h"

namespace {

using EventPtr = Owned<Event, QlxFreeEvent>;

EventPtr makeEvent(const UChar *text) {
  return EventPtr{QlxVaAllocUEvent(INFO, nullptr, nullptr, text)};
}

void cacheWith(Event *event, ...) {
  va_list args;
  va_start(args, event);
  qlxPDXMLUFormatterCacheMessageID(nullptr, event, &args);
  va_end(args);
}

std::string idOf(const EventPtr &event) {
  return take(QlxGetEventMessageId(event.get()));
}

// ---- Of a text

TEST(MsgIdTest, TheIdentifierIsCopiedByItsLength) {
  EXPECT_EQ(take(qlxPDXMLGetMessageID("ABC123E and more")), "ABC123E");
  EXPECT_EQ(take(qlxPDXMLGetMessageID("ABCDEF123Eand more")), "ABCDEF123E")
      << "one of ten characters has no terminator of its own";
}

TEST(MsgIdTest, ATextWithoutAnIdentifierGivesNull) {
  for (const char *text : {"", "no identifier", "ABC123X", "ABC"}) {
    EXPECT_EQ(take(qlxPDXMLGetMessageID(text)), "<null>") << text;
  }
}

TEST(MsgIdTest, AWideTextIsReadAsItsNarrowForm) {
  EXPECT_EQ(take(qlxPDXMLUGetMessageID(u"ABC123E and more")), "ABC123E");
  EXPECT_EQ(take(qlxPDXMLUGetMessageID(u"ABC123E\u00FC\u4E00")), "ABC123E");
  EXPECT_EQ(take(qlxPDXMLUGetMessageID(u"ABCDEF123E\u00FC")), "ABCDEF123E");
  EXPECT_EQ(take(qlxPDXMLUGetMessageID(u"ABCDEF123Eand more")), "ABCDEF123E");
  EXPECT_EQ(take(qlxPDXMLUGetMessageID(u"")), "<null>");
  EXPECT_EQ(take(qlxPDXMLUGetMessageID(u"no identifier")), "<null>");
}

TEST(MsgIdTest, AWideLetterIsNotTakenForTheOneInItsLowByte) {
  for (const UChar *text : {u"\u0141BC123E", u"ABC12\u0133E", u"ABC123\u0145", u"\u00C1BC123E"})
    EXPECT_EQ(take(qlxPDXMLUGetMessageID(text)), "<null>");
}

TEST(MsgIdTest, NullHasNoIdentifier) {
  EXPECT_EQ(qlxPDXMLGetMessageID(nullptr), nullptr);
  EXPECT_EQ(qlxPDXMLUGetMessageID(nullptr), nullptr);
  EXPECT_STREQ(qlxMessageIdOf(nullptr).text, "");
}

// ---- Kept on an event

TEST(MsgIdTest, TheBoundTextsIdentifierIsKeptOnTheEvent) {
  const EventPtr event = makeEvent(u"{0}123E {1}");
  cacheWith(event.get(), u"XYZ", u"text");
  EXPECT_EQ(idOf(event), "XYZ123E");
}

TEST(MsgIdTest, AnEventWithoutOneIsMarkedWithAnEmptyOne) {
  const EventPtr event = makeEvent(u"no identifier");
  cacheWith(event.get());
  EXPECT_EQ(idOf(event), "");
}

TEST(MsgIdTest, AMessageThatCannotBeBoundHasAnEmptyOne) {
  const EventPtr event = makeEvent(u"ABC123E {0");
  cacheWith(event.get());
  EXPECT_EQ(idOf(event), "");
  EXPECT_EQ(event->message->error, U_UNMATCHED_BRACES) << "which stays on the message";
}

TEST(MsgIdTest, AnIdentifierThatIsThereStaysAndNothingIsBound) {
  for (const char *there : {"OWN", ""}) {
    const EventPtr event = makeEvent(u"ABC123E {0");
    QlxSetEventMessageId(event.get(), there);
    cacheWith(event.get());
    EXPECT_EQ(idOf(event), there);
    EXPECT_EQ(event->message->error, 0);
  }
}

TEST(MsgIdTest, TheArgumentsStayUnread) {
  const EventPtr first = makeEvent(u"{0}123E");
  const EventPtr second = makeEvent(u"{0}456W");
  const auto both = [](Event *one, Event *other, ...) {
    va_list args;
    va_start(args, other);
    qlxPDXMLUFormatterCacheMessageID(nullptr, one, &args);
    qlxPDXMLUFormatterCacheMessageID(nullptr, other, &args);
    va_end(args);
  };
  both(first.get(), second.get(), u"ABC", u"DEF");
  EXPECT_EQ(idOf(first), "ABC123E");
  EXPECT_EQ(idOf(second), "ABC456W");
}

TEST(MsgIdTest, TheEventsLocaleCounts) {
  const ResourceBundles bundles;
  ASSERT_TRUE(bundles.add("root", R"(hello { "ABC001I Hello" })"));
  ASSERT_TRUE(bundles.add("de", R"(hello { "DEF001I Hallo" })"));
  const IcuDefaults defaults;
  ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
  const struct { const char *locale, *id; } kCases[] = {{nullptr, "ABC001I"}, {"de", "DEF001I"}};
  for (const auto &[locale, id] : kCases) {
    const EventPtr event{QlxVaAllocUEvent(INFO, bundles.path().c_str(), "hello", nullptr)};
    qlxSetEventLocale(event.get(), locale);
    cacheWith(event.get());
    EXPECT_EQ(idOf(event), id);
  }
}

TEST(MsgIdTest, AnEventWithoutAMessageHasAnEmptyOne) {
  const EventPtr event = makeEvent(u"ABC123E");
  qlxIntlFreeI18Msg(event->message);
  event->message = nullptr;
  cacheWith(event.get());
  EXPECT_EQ(idOf(event), "");
}

}  // namespace
