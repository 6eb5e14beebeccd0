#include <gtest/gtest.h>

#include <cmath>

#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/event.h>
#include <qlx/props.h>
#include <qlx/system.h>
#include <qlx/ustring.h>

#include "util/CxOwned.h"

#include "object/QlxLocked.h"
#include "support/FailingMemory.h"
#include "support/Take.h"

namespace {

class EventTest : public testing::Test {
 protected:
  using EventPtr = Owned<Event, QlxFreeEvent>;

  static EventPtr make(int32_t level = INFO, const char16_t *text = u"text") {
    return EventPtr{QlxVaAllocUEvent(level, nullptr, nullptr, text)};
  }

  // Binds to the locale that the message would be formatted in.
  static UChar *bindLocale(I18Msg *message, va_list *) {
    return CxUStringDupStrToUChar(message->locale);
  }
};

// ---- The record

TEST_F(EventTest, IsAMessageExactlyWhenItHasABundle) {
  const EventPtr message{QlxVaAllocUEvent(WARN, "bundle", "key", nullptr)}, text = make();
  EXPECT_EQ(QlxGetEventIsMessage(message.get()), 1);
  EXPECT_STREQ(message->message->bundle, "bundle");
  EXPECT_STREQ(message->message->key, "key");
  EXPECT_EQ(message->message->text, nullptr);
  EXPECT_EQ(QlxGetEventIsMessage(text.get()), 0);
  EXPECT_EQ(text->message->bundle, nullptr);
  EXPECT_EQ(std::u16string(text->message->text), u"text");
}

TEST_F(EventTest, StartsWithNothingButItsMessageLevelAndTime) {
  const double before = CxSystemGetTimestamp();
  const EventPtr event = make(4500);
  const double after = CxSystemGetTimestamp();
  EXPECT_EQ(QlxGetEventLevel(event.get()), 4500);
  EXPECT_LE(before, QlxGetEventTime(event.get()));
  EXPECT_LE(QlxGetEventTime(event.get()), after);
  EXPECT_EQ(std::floor(event->time), event->time);
  EXPECT_EQ(QlxGetEventMessageId(event.get()), nullptr);
  EXPECT_EQ(qlxGetEventLocale(event.get()), nullptr);
  EXPECT_EQ(event->props, nullptr);
  EXPECT_EQ(event->status.kind, '-');
  EXPECT_EQ(event->status.code, 0);
}

TEST_F(EventTest, MayBeMadeOfNothing) {
  const EventPtr event{QlxVaAllocUEvent(UNSPECIFIED, nullptr, nullptr, nullptr)};
  ASSERT_NE(event, nullptr);
  EXPECT_EQ(event->level, -9999);
  EXPECT_NE(event->message, nullptr);
}

TEST_F(EventTest, TheFlagIsStoredAsItIsSet) {
  const EventPtr event = make();
  QlxSetEventIsMessage(event.get(), 2);
  EXPECT_EQ(QlxGetEventIsMessage(event.get()), 2);
  QlxSetEventIsMessage(event.get(), 0);
  EXPECT_EQ(QlxGetEventIsMessage(event.get()), 0);
}

TEST_F(EventTest, NullIsAnEventWithoutAnything) {
  EXPECT_EQ(QlxGetEventLevel(nullptr), -9999);
  EXPECT_EQ(QlxGetEventTime(nullptr), 0.0);
  EXPECT_EQ(QlxGetEventMessageId(nullptr), nullptr);
  EXPECT_EQ(qlxGetEventLocale(nullptr), nullptr);
  EXPECT_EQ(QlxGetEventIsMessage(nullptr), 0);
  EXPECT_EQ(qlxFetchEventPropMap(nullptr), nullptr);
  EXPECT_EQ(QlxSetEventProp(nullptr, "key", "value"), 0);
  EXPECT_EQ(QlxBindEventUMsg(nullptr, bindLocale, nullptr), nullptr);
  uint8_t found = 7;
  EXPECT_EQ(QlxGetEventPropInt(nullptr, "key", &found), 0);
  EXPECT_EQ(found, 0);
  QlxSetEventMessageId(nullptr, "id");
  qlxSetEventLocale(nullptr, "de");
  QlxSetEventIsMessage(nullptr, 1);
  QlxFreeEvent(nullptr);
}

TEST_F(EventTest, TakesNoLock) {
  const ApiLock lock;  // not recursive
  const EventPtr event = make();
  QlxSetEventProp(event.get(), "key", "value");
  EXPECT_EQ(take(QlxGetEventProp(event.get(), "key", nullptr)), "value");
  OslMemoryFree(QlxBindEventUMsg(event.get(), qlxIntlBindUI18Msg, nullptr));
}

// ---- Identifier and locale

TEST_F(EventTest, TheIdentifierIsCopiedReplacedAndFreed) {
  const EventPtr event = make();
  const FailingMemory memory;
  char id[] = "ID1";
  QlxSetEventMessageId(event.get(), id);
  id[2] = '9';
  EXPECT_EQ(take(QlxGetEventMessageId(event.get())), "ID1");
  QlxSetEventMessageId(event.get(), "ID2");
  EXPECT_EQ(take(QlxGetEventMessageId(event.get())), "ID2");
  EXPECT_EQ(memory.live(), 1);
  QlxSetEventMessageId(event.get(), nullptr);
  EXPECT_EQ(QlxGetEventMessageId(event.get()), nullptr);
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(EventTest, TheLocaleIsCopiedReplacedAndFreed) {
  const EventPtr event = make();
  const FailingMemory memory;
  qlxSetEventLocale(event.get(), "de");
  qlxSetEventLocale(event.get(), "fr");
  EXPECT_EQ(take(qlxGetEventLocale(event.get())), "fr");
  EXPECT_EQ(memory.live(), 1);
  qlxSetEventLocale(event.get(), nullptr);
  EXPECT_EQ(qlxGetEventLocale(event.get()), nullptr);
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(EventTest, ItsOwnStringMayBeSetAgain) {
  const EventPtr event = make();
  QlxSetEventMessageId(event.get(), "ID1");
  QlxSetEventMessageId(event.get(), event->messageId);
  EXPECT_EQ(take(QlxGetEventMessageId(event.get())), "ID1");
  qlxSetEventLocale(event.get(), "de");
  qlxSetEventLocale(event.get(), event->locale);
  EXPECT_EQ(take(qlxGetEventLocale(event.get())), "de");
}

TEST_F(EventTest, FreesAllItHolds) {
  const FailingMemory memory;
  Event *event = QlxVaAllocUEvent(INFO, "bundle", "key", u"text");
  QlxSetEventMessageId(event, "ID1");
  qlxSetEventLocale(event, "de");
  QlxSetEventProp(event, "key", "value");
  qlxSetI18MsgLocale(event->message, "fr");
  QlxFreeEvent(event);
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(EventTest, LeavesTheLocaleToACopyOfItsMessage) {
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  qlxSetI18MsgLocale(event->message, "fr");
  I18Msg *copy = qlxIntlCopyI18Msg(event->message);
  QlxFreeEvent(event);
  EXPECT_STREQ(copy->locale, "fr");
  OslMemoryFree(copy->locale);
  qlxIntlFreeI18Msg(copy);
}

// ---- Binding

TEST_F(EventTest, BindsWithTheGivenOperation) {
  const EventPtr event = make();
  EXPECT_EQ(take(QlxBindEventUMsg(event.get(), qlxIntlBindUI18Msg, nullptr)), u"text");
  EXPECT_EQ(QlxBindEventUMsg(event.get(), nullptr, nullptr), nullptr);
}

TEST_F(EventTest, BindsInItsOwnLocaleEvenWhenTheMessageHadAnother) {
  const EventPtr event = make();
  qlxSetI18MsgLocale(event->message, "fr");
  qlxSetEventLocale(event.get(), "de");
  EXPECT_EQ(take(QlxBindEventUMsg(event.get(), bindLocale, nullptr)), u"de");
}

TEST_F(EventTest, BindsInTheMessagesLocaleWhenItHasNone) {
  const EventPtr event = make();
  EXPECT_EQ(take(QlxBindEventUMsg(event.get(), bindLocale, nullptr)), u"<null>");
  qlxSetI18MsgLocale(event->message, "fr");
  EXPECT_EQ(take(QlxBindEventUMsg(event.get(), bindLocale, nullptr)), u"fr");
}

TEST_F(EventTest, HandsItsMessageAndTheArgumentsToTheOperation) {
  const EventPtr event = make();
  static const I18Msg *message;
  static const va_list *passed;
  va_list args = {};
  QlxBindEventUMsg(
      event.get(),
      [](I18Msg *bound, va_list *list) {
        message = bound;
        passed = list;
        return static_cast<UChar *>(nullptr);
      },
      &args);
  EXPECT_EQ(message, event->message);
  EXPECT_EQ(passed, &args);
}

// ---- Properties

TEST_F(EventTest, EveryTypeReadsWhatItWrote) {
  const EventPtr event = make();
  EXPECT_EQ(QlxSetEventProp(event.get(), "string", "s"), 1);
  EXPECT_EQ(QlxSetEventPropBool(event.get(), "bool", 1), 1);
  QlxSetEventPropInt(event.get(), "int", INT32_MIN);
  QlxSetEventPropLong(event.get(), "long", -1);
  QlxSetEventPropFloat(event.get(), "float", 0.5f);
  QlxSetEventPropDouble(event.get(), "double", -0.25);
  uint8_t found[6] = {7, 7, 7, 7, 7, 7};
  EXPECT_EQ(take(QlxGetEventProp(event.get(), "string", &found[0])), "s");
  EXPECT_EQ(QlxGetEventPropBool(event.get(), "bool", &found[1]), 1);
  EXPECT_EQ(QlxGetEventPropInt(event.get(), "int", &found[2]), INT32_MIN);
  EXPECT_EQ(QlxGetEventPropLong(event.get(), "long", &found[3]), -1);
  EXPECT_EQ(QlxGetEventPropFloat(event.get(), "float", &found[4]), 0.5f);
  EXPECT_EQ(QlxGetEventPropDouble(event.get(), "double", &found[5]), -0.25);
  for (const uint8_t flag : found) EXPECT_EQ(flag, 1);
}

TEST_F(EventTest, ALongIsReadWithItsLowThirtyTwoBits) {
  const EventPtr event = make();
  QlxSetMapPropLong(qlxFetchEventPropMap(event.get()), "long", int64_t{1} << 32);
  EXPECT_EQ(QlxGetEventPropLong(event.get(), "long", nullptr), 0);
  QlxSetEventProp(event.get(), "long", "4294967301");  // 2 to the power 32, and 5
  EXPECT_EQ(QlxGetMapPropLong(event->props, "long", nullptr), 4294967301);
  EXPECT_EQ(QlxGetEventPropLong(event.get(), "long", nullptr), 5);
  QlxSetEventProp(event.get(), "long", "2147483648");
  EXPECT_EQ(QlxGetEventPropLong(event.get(), "long", nullptr), INT32_MIN);
}

TEST_F(EventTest, AMissingKeyAndAnotherTypeAreAbsent) {
  const EventPtr event = make();
  uint8_t found = 7;
  EXPECT_EQ(QlxGetEventProp(event.get(), "key", &found), nullptr);
  EXPECT_EQ(found, 0);
  QlxSetEventProp(event.get(), "key", "abc");
  found = 7;
  EXPECT_EQ(QlxGetEventPropInt(event.get(), "key", &found), 0);
  EXPECT_EQ(found, 0);
}

TEST_F(EventTest, TheMapIsMadeOnFirstUseOnly) {
  const EventPtr event = make();
  OslMemoryFree(QlxGetEventProp(event.get(), "key", nullptr));
  EXPECT_EQ(event->props, nullptr);
  StringToStringMap *map = qlxFetchEventPropMap(event.get());
  EXPECT_NE(map, nullptr);
  EXPECT_EQ(qlxFetchEventPropMap(event.get()), map);
}

TEST_F(EventTest, IsMadeWithoutAMessageOrNotAtAllWhenMemoryRanOut) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(make(), nullptr);
  memory.failOnce(2);
  {
    const EventPtr event = make();
    ASSERT_NE(event, nullptr);
    EXPECT_EQ(event->message, nullptr);
    qlxSetEventLocale(event.get(), "de");
    EXPECT_EQ(QlxBindEventUMsg(event.get(), qlxIntlBindUI18Msg, nullptr), nullptr);
    memory.failOnce(1);
    QlxSetEventMessageId(event.get(), "ID1");
    EXPECT_EQ(event->messageId, nullptr);
    memory.failFrom(1);
    EXPECT_EQ(QlxSetEventProp(event.get(), "key", "value"), 0);
  }
  EXPECT_EQ(memory.live(), 0);
}

}  // namespace
