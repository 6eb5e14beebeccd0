#include <qlx/class/filter.h>

#include <cmath>
#include <limits>

#include "support/ChainTest.h"
#include "support/FailingMemory.h"
#include "support/Status.h"

namespace {

class MsgIdFilterTest : public ChainTest {
 protected:
  using EventPtr = Owned<Event, QlxFreeEvent>;

  void SetUp() override {
    ChainTest::SetUp();
    make("filter");
  }
  void TearDown() override {
    filter.reset();
    ChainTest::TearDown();
  }

  void make(const char *name) { use(get(name, "qlx_msgidfilter")); }

  // Tests a filter from now on, in front of a recording handler.
  void use(Handle object) {
    filter = std::move(object);
    ASSERT_NE(filter, nullptr);
    const Handle handler = get("recording", RecordingHandler::kClass);
    QlxAddListener(filter.get(), handler.get());
  }

  static EventPtr makeEvent(const char16_t *text) {
    return EventPtr{QlxVaAllocUEvent(INFO, nullptr, nullptr, text)};
  }

  void set(const char *key, const char *value) {
    EXPECT_EQ(QlxSetObjProp(filter.get(), key, value), 1);
  }

  // Whether the filter's test passes an event.
  bool says(const EventPtr &event) {
    const ApiLock lock;
    return QlxMsgIdFilterFIsLoggable(filter.get(), event.get(), nullptr) == 1;
  }

  // Whether an event with an identifier, null for none, comes through.
  bool passes(const char *id, double time = 0) {
    const EventPtr event = makeEvent(u"a text without one");
    QlxSetEventMessageId(event.get(), id);
    event->time = time;
    recorder->records.clear();
    const ApiLock lock;
    filter->objClass->op1.fProcess(filter.get(), event.get(), nullptr);
    return recorder->records.size() == 1;
  }

  bool passesText(const char16_t *text) {
    recorder->records.clear();
    process(filter, INFO, text);
    return recorder->records.size() == 1;
  }

  // Whether an identifier repeats just so many milliseconds after it has passed.
  bool repeatsFor(int64_t milliseconds) {
    static int used;
    const std::string id = "id" + std::to_string(++used);
    const double end = static_cast<double>(milliseconds);
    return passes(id.c_str(), 0) && !passes(id.c_str(), end - 1) && passes(id.c_str(), end);
  }

  // The patterns in order, each with "|" behind it.
  static std::string join(StringList *list) {
    std::string all;
    for (const StringListNode *it = list ? list->head : nullptr; it; it = it->next) {
      all += std::string(it->value) + "|";
    }
    return all;
  }

  Handle filter;
};

// ---- Patterns

TEST_F(MsgIdFilterTest, BlocksWarningsAndInformationAtFirst) {
  EXPECT_FALSE(passes("KBB0001W"));
  EXPECT_FALSE(passes("KBB0001I"));
  EXPECT_TRUE(passes("KBB0001E"));
  EXPECT_TRUE(passes("W1"));
}

TEST_F(MsgIdFilterTest, HasAFormatterOfTheDocumentedNameAndClass) {
  EXPECT_STREQ(get("msgFormatter")->objClass->name, "qlx_xmlformatter");
}

TEST_F(MsgIdFilterTest, ReadsTheIdentifierOffTheTextOfAnEventWithoutOne) {
  EXPECT_FALSE(passesText(u"KBB0001W careful"));
  EXPECT_TRUE(passesText(u"KBB0001E wrong"));
  EXPECT_TRUE(passesText(u"not an identifier: KBB0001W"));
}

TEST_F(MsgIdFilterTest, StoresTheIdentifierItReadOnTheEvent) {
  const EventPtr event = makeEvent(u"KBB0001E wrong"), other = makeEvent(u"nothing");
  EXPECT_TRUE(says(event));
  EXPECT_STREQ(event->messageId, "KBB0001E");
  EXPECT_TRUE(says(other));
  EXPECT_STREQ(other->messageId, "");
}

TEST_F(MsgIdFilterTest, BindsTheTextWithTheArgumentsOfTheCall) {
  QlxAddListener(logger.get(), filter.get());
  QlxLogUText(logger.get(), u"{0}0001W", u"KBB");
  QlxLogUText(logger.get(), u"{0}0001E", u"KBB");
  EXPECT_RECORDED(u"KBB0001E|");
}

TEST_F(MsgIdFilterTest, AnIdentifierThatTheEventCarriesCountsAndNotItsText) {
  const EventPtr event = makeEvent(u"KBB0001W careful");
  QlxSetEventMessageId(event.get(), "KBB0001E");
  EXPECT_TRUE(says(event));
  EXPECT_STREQ(event->messageId, "KBB0001E");
  QlxSetEventMessageId(event.get(), "");
  EXPECT_TRUE(says(event));
  EXPECT_STREQ(event->messageId, "");
}

TEST_F(MsgIdFilterTest, TakesOtherPatternsInPlaceOfTheOnesItHas) {
  set("msgIds", "ABC*");
  EXPECT_TRUE(passes("KBB0001W"));
  EXPECT_FALSE(passes("ABC0001E"));
  set("msgIds", "XYZ* *E");
  EXPECT_TRUE(passes("ABC0001I"));
  EXPECT_FALSE(passes("ABC0001E"));
}

TEST_F(MsgIdFilterTest, SplitsPatternsAtBlanksTabsAndLineEndsOnly) {
  set("msgIds", "\t A*\n\r\nB*  C*\r");
  for (const char *id : {"A1", "B1", "C1"}) EXPECT_FALSE(passes(id)) << id;
  EXPECT_TRUE(passes("D1"));
  set("msgIds", "A*\vB*\fC*,D*;E*");
  for (const char *id : {"A1", "B1", "C1", "D1", "E1"}) EXPECT_TRUE(passes(id)) << id;
  EXPECT_FALSE(passes("A1\vB1\fC1,D1;E"));
}

TEST_F(MsgIdFilterTest, WithAnEmptyListOfPatternsNothingMatches) {
  set("msgIds", " \t ");
  EXPECT_TRUE(passes("KBB0001W"));
  set("mode", "PASSTHRU");
  EXPECT_FALSE(passes("KBB0001W"));
}

TEST_F(MsgIdFilterTest, APatternListIsMadeOfTheWordsOfAText) {
  StringList *list = QlxMsgIdFilterGetStringList(" one two\tthree ");
  EXPECT_EQ(join(list), "one|two|three|");
  EXPECT_EQ(list->count, 3);
  qlxIntlFreeStringList(list);
  for (const char *text : {static_cast<const char *>(nullptr), "", " \t\n\r"}) {
    StringList *empty = QlxMsgIdFilterGetStringList(text);
    ASSERT_NE(empty, nullptr);
    EXPECT_EQ(empty->count, 0);
    qlxIntlFreeStringList(empty);
  }
}

TEST_F(MsgIdFilterTest, AListMatchesWhenOneOfItsPatternsDoes) {
  StringList *list = QlxMsgIdFilterGetStringList("A* *Z");
  EXPECT_EQ(QlxMsgIdFilterMatchMsgId(list, "A1"), 1);
  EXPECT_EQ(QlxMsgIdFilterMatchMsgId(list, "1Z"), 1);
  EXPECT_EQ(QlxMsgIdFilterMatchMsgId(list, "B1"), 0);
  EXPECT_EQ(QlxMsgIdFilterMatchMsgId(list, ""), 0);
  EXPECT_EQ(QlxMsgIdFilterMatchMsgId(list, nullptr), 0);
  EXPECT_EQ(QlxMsgIdFilterMatchMsgId(nullptr, "A1"), 0);
  qlxIntlFreeStringList(list);
}

TEST_F(MsgIdFilterTest, AStarMatchesEveryIdentifierTheEmptyOneToo) {
  set("msgIds", "*");
  EXPECT_FALSE(passes("KBB0001E"));
  EXPECT_FALSE(passes(""));
}

TEST_F(MsgIdFilterTest, AnEmptyIdentifierIsMatchedAsText) {
  EXPECT_TRUE(passes(""));
  set("msgIds", "*W");
  EXPECT_TRUE(passes(""));
}

TEST_F(MsgIdFilterTest, AnIdentifierThatCannotBeStoredMatchesNothing) {
  set("msgIds", "*");
  const EventPtr event = makeEvent(u"");
  const auto saysWithoutMemory = [&] {
    FailingMemory memory;
    memory.failFrom(1);
    return says(event);
  };
  EXPECT_TRUE(saysWithoutMemory());
  set("mode", "PASSTHRU");
  EXPECT_FALSE(saysWithoutMemory());
  EXPECT_EQ(event->messageId, nullptr);
}

// ---- Mode

TEST_F(MsgIdFilterTest, PassesOnlyWhatMatchesInPassthruMode) {
  set("mode", "PASSTHRU");
  set("msgIds", "KBB*");
  EXPECT_TRUE(passes("KBB0001W"));
  EXPECT_TRUE(passes("KBB0001E"));
  EXPECT_FALSE(passes("ABC0001E"));
  EXPECT_FALSE(passes(nullptr));  // its text has none either
}

TEST_F(MsgIdFilterTest, TakesTheModeInAnyCaseAndBlocksForAnyOtherWord) {
  for (const char *word : {"PASSTHRU", "passthru", "PassThru"}) {
    set("mode", word);
    EXPECT_TRUE(passes("KBB0001W")) << word;
    EXPECT_FALSE(passes("KBB0001E")) << word;
    for (const char *other : {"BLOCK", "block", "OPEN", "PASS", "PASSTHRU ", ""}) {
      set("mode", "PASSTHRU");
      set("mode", other);
      EXPECT_FALSE(passes("KBB0001W")) << other;
      EXPECT_TRUE(passes("KBB0001E")) << other;
    }
  }
}

TEST_F(MsgIdFilterTest, AKeyWithoutAValueLeavesItsSetting) {
  set("mode", "PASSTHRU");
  set("msgIds", "KBB*");
  set("msgIdRepeatTime", "60");
  for (const char *key : {"mode", "msgIds", "msgIdRepeatTime"}) clear(filter, key);
  EXPECT_FALSE(passes("ABC0001E"));
  EXPECT_TRUE(passes("KBB0001E", 100));
  EXPECT_FALSE(passes("KBB0001E", 159));
  EXPECT_TRUE(passes("KBB0001E", 160));
}

TEST_F(MsgIdFilterTest, TakesItsKeysOnlyAsTheyAreWritten) {
  set("Mode", "PASSTHRU");
  set("MSGIDS", "*E");
  set("msgidrepeattime", "60");
  EXPECT_FALSE(passes("KBB0001W"));
  for (int i = 0; i < 2; ++i) EXPECT_TRUE(passes("KBB0001E"));
}

TEST_F(MsgIdFilterTest, HandsOtherKeysToTheOnesThatAllObjectsShare) {
  set("logging", "off");
  EXPECT_FALSE(passes("KBB0001E"));
  set("logging", "on");
  EXPECT_TRUE(passes("KBB0001E"));
  set("listenerNames", "");
  EXPECT_EQ(QlxGetListeners(filter.get()), nullptr);
}

TEST_F(MsgIdFilterTest, HasNoThresholdOfLevels) {
  set("level", "OFF");
  EXPECT_EQ(loadLevel(filter.get()), ALL);
  EXPECT_TRUE(passes("KBB0001E"));
}

TEST_F(MsgIdFilterTest, IsConfiguredByItsConfiguration) {
  configure("configured", "className", "qlx_msgidfilter");
  configure("configured", "mode", "passthru");
  configure("configured", "msgIds", "KBB*");
  use(get("configured"));
  EXPECT_TRUE(passes("KBB0001W"));
  EXPECT_FALSE(passes("ABC0001W"));
}

// ---- Repeats

TEST_F(MsgIdFilterTest, PassesAnIdentifierOnceInItsRepeatTime) {
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
  EXPECT_FALSE(passes("KBB0001E", 159));
  EXPECT_TRUE(passes("KBB0001E", 160));
}

TEST_F(MsgIdFilterTest, ABlockedRepeatDoesNotExtendTheInterval) {
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
  for (const double time : {101, 130, 159}) EXPECT_FALSE(passes("KBB0001E", time));
  EXPECT_TRUE(passes("KBB0001E", 160));
  EXPECT_FALSE(passes("KBB0001E", 219));
  EXPECT_TRUE(passes("KBB0001E", 220));
}

TEST_F(MsgIdFilterTest, EveryIdentifierHasAnIntervalOfItsOwn) {
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
  EXPECT_TRUE(passes("KBB0002E", 120));
  EXPECT_TRUE(passes("kbb0001E", 120));
  EXPECT_TRUE(passes("KBB0001E", 160));
  EXPECT_FALSE(passes("KBB0002E", 160));
}

TEST_F(MsgIdFilterTest, WithoutARepeatTimeEveryRepeatPassesAndIsNotNoted) {
  for (int i = 0; i < 3; ++i) EXPECT_TRUE(passes("KBB0001E", 100));
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
}

TEST_F(MsgIdFilterTest, ANegativeRepeatTimeSwitchesSuppressionOffAsZeroDoes) {
  for (const char *off : {"0", "-1", "-9223372036854775808"}) {
    set("msgIdRepeatTime", "60");
    EXPECT_TRUE(passes(off, 100));
    EXPECT_FALSE(passes(off, 100));
    set("msgIdRepeatTime", off);
    EXPECT_TRUE(passes(off, 100)) << off;
    EXPECT_TRUE(passes(off, 50)) << off;  // also when the clock was set back
  }
}

TEST_F(MsgIdFilterTest, ARepeatTimeThatIsNoNumberLeavesThePreviousOne) {
  set("msgIdRepeatTime", "60");
  for (const char *garbage : {"", "soon", "x60", "  "}) {
    set("msgIdRepeatTime", garbage);
    EXPECT_TRUE(repeatsFor(60)) << garbage;
  }
  set("msgIdRepeatTime", " 70 seconds");
  EXPECT_TRUE(repeatsFor(70));
  set("msgIdRepeatTime", "4294967296");
  EXPECT_TRUE(repeatsFor(4294967296));
}

TEST_F(MsgIdFilterTest, AnEmptyIdentifierIsNeverARepeat) {
  set("msgIdRepeatTime", "60");
  for (int i = 0; i < 2; ++i) EXPECT_TRUE(passes("", 100));
  for (int i = 0; i < 2; ++i) EXPECT_TRUE(passes(nullptr, 100));
}

TEST_F(MsgIdFilterTest, WhatThePatternsBlockIsNotNoted) {
  set("msgIdRepeatTime", "60");
  EXPECT_FALSE(passes("KBB0001W", 100));
  set("msgIds", "nothing");
  EXPECT_TRUE(passes("KBB0001W", 101));
}

TEST_F(MsgIdFilterTest, SuppressesRepeatsInPassthruModeToo) {
  set("mode", "PASSTHRU");
  set("msgIds", "KBB*");
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
  EXPECT_FALSE(passes("KBB0001E", 159));
  EXPECT_FALSE(passes("ABC0001E", 100));
  set("msgIds", "ABC*");
  EXPECT_TRUE(passes("ABC0001E", 101));  // it was not noted
}

TEST_F(MsgIdFilterTest, NotesTheTimeWithoutItsFraction) {
  set("msgIdRepeatTime", "60");
  const struct {
    double time, end;
  } cases[] = {{1155718135123.0, 1155718135183.0}, {99.9, 159}, {-99.9, -39}, {-0.5, 60}};
  for (const auto &[time, end] : cases) {
    const std::string id = "id" + std::to_string(time);
    EXPECT_TRUE(passes(id.c_str(), time)) << time;
    EXPECT_FALSE(passes(id.c_str(), end - 1)) << time;
    EXPECT_TRUE(passes(id.c_str(), end)) << time;
  }
}

TEST_F(MsgIdFilterTest, AFractionOfAMillisecondDoesNotEndTheInterval) {
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100.9));
  EXPECT_FALSE(passes("KBB0001E", 159.9));
  EXPECT_TRUE(passes("KBB0001E", 160.0));
}

TEST_F(MsgIdFilterTest, AClockThatWasSetBackMakesRepeats) {
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 1000));
  EXPECT_FALSE(passes("KBB0001E", 10));
  EXPECT_FALSE(passes("KBB0001E", -1000));
}

// What the filter itself never notes: its variables are written into.
TEST_F(MsgIdFilterTest, ANotedTimeThatIsNoNumberIsZero) {
  struct Vars {
    uint32_t mode;
    StringList *patterns;
    QlxObject *idFormatter;
    int64_t repeatTime;
    StringToStringMap *lastTimes;
  };
  set("msgIdRepeatTime", "60");
  for (const char *garbage : {"", "then", "x100"}) {
    StringToStringMap *noted = static_cast<Vars *>(filter->vars)->lastTimes;
    qlxIntlStringToStringMapPut(noted, "KBB0001E", garbage);
    EXPECT_FALSE(passes("KBB0001E", 59)) << garbage;
    EXPECT_TRUE(passes("KBB0001E", 60)) << garbage;
    EXPECT_FALSE(passes("KBB0001E", 119)) << garbage;
  }
}

TEST_F(MsgIdFilterTest, ARepeatTimeBeyondTheEndOfTimeNeverEnds) {
  set("msgIdRepeatTime", "9223372036854775807");
  EXPECT_TRUE(passes("KBB0001E", 1000));
  EXPECT_FALSE(passes("KBB0001E", 9e18));
  EXPECT_FALSE(passes("KBB0001E", -9e18));
  EXPECT_TRUE(passes("KBB0001E", 1e19));  // the last time there is, at which the interval ends
  set("msgIdRepeatTime", "1");
  EXPECT_FALSE(passes("KBB0001E", 9e18)) << "the last time is noted";
}

TEST_F(MsgIdFilterTest, TimesOutOfRangeAreTheNearestAndNoNumberIsZero) {
  set("msgIdRepeatTime", "1");
  const double infinity = std::numeric_limits<double>::infinity();
  const double kPastMax = 9223372036854775808.0;    // 2 to the power 63: the largest time
  const double kBelowMax = 9223372036854774784.0;   // the next smaller number
  const double kAboveMin = -9223372036854774784.0;  // the next to the smallest time
  const struct {
    double time, repeatsAt, passesAt;
  } cases[] = {
      {kBelowMax, kBelowMax, kPastMax},
      {kPastMax, kBelowMax, kPastMax},
      {1e300, kBelowMax, kPastMax},
      {infinity, kBelowMax, kPastMax},
      {kAboveMin, kAboveMin, -9223372036854773760.0},
      {-kPastMax, -kPastMax, kAboveMin},
      {-1e300, -kPastMax, kAboveMin},
      {-infinity, -kPastMax, kAboveMin},
      {std::nan(""), 0.5, 1},
  };
  for (const auto &[time, repeatsAt, passesAt] : cases) {
    const std::string id = "id" + std::to_string(time);
    EXPECT_TRUE(passes(id.c_str(), time)) << time;
    EXPECT_FALSE(passes(id.c_str(), repeatsAt)) << time;
    EXPECT_TRUE(passes(id.c_str(), passesAt)) << time;
  }
}

TEST_F(MsgIdFilterTest, EachFilterKeepsTimesOfItsOwn) {
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
  const Handle first = std::move(filter);
  make("second");
  set("msgIdRepeatTime", "60");
  EXPECT_TRUE(passes("KBB0001E", 100));
}

// ---- In the chain

TEST_F(MsgIdFilterTest, PassesNothingOnWhileItIsDisabledAndNotesNothing) {
  set("msgIdRepeatTime", "60");
  QlxSetObjectEnabled(filter.get(), 0);
  EXPECT_FALSE(passes("KBB0001E", 100));
  QlxSetObjectEnabled(filter.get(), 1);
  EXPECT_TRUE(passes("KBB0001E", 101));
}

TEST_F(MsgIdFilterTest, IsAskedWithoutALogCall) {
  const EventPtr event = makeEvent(u"KBB0001W careful");
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event.get(), nullptr), 0);
  set("mode", "PASSTHRU");
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event.get(), nullptr), 1);
}

TEST_F(MsgIdFilterTest, SaysNoWithoutFilterOrEvent) {
  const EventPtr event = makeEvent(u"KBB0001E");
  const ApiLock lock;
  EXPECT_EQ(QlxMsgIdFilterFIsLoggable(nullptr, event.get(), nullptr), 0);
  EXPECT_EQ(QlxMsgIdFilterFIsLoggable(filter.get(), nullptr, nullptr), 0);
  EXPECT_EQ(event->messageId, nullptr);
}

TEST_F(MsgIdFilterTest, IgnoresNull) {
  {
    const ApiLock lock;
    QlxMsgIdFilterFFreeVars(nullptr);
    QlxMsgIdFilterFCfgChange(nullptr, "mode");
    QlxMsgIdFilterFCfgChange(filter.get(), nullptr);
  }
  EXPECT_FALSE(passes("KBB0001W"));
}

TEST_F(MsgIdFilterTest, WithoutVariablesEverythingPassesAndNoKeyIsTaken) {
  use(getWithoutVariables("other", "qlx_msgidfilter"));
  EXPECT_TRUE(passes("KBB0001W"));
  set("mode", "PASSTHRU");
  set("logging", "off");
  EXPECT_TRUE(passes("KBB0001W"));
}

// ---- The formatter that all filters of the class share

TEST_F(MsgIdFilterTest, FiltersShareOneFormatterThatGoesWithTheLast) {
  const Handle formatter = get("msgFormatter");
  EXPECT_EQ(formatter->refCount, 3u);  // registry, filter, test
  Handle second = get("second", "qlx_msgidfilter");
  EXPECT_EQ(formatter->refCount, 4u);
  second.reset();
  EXPECT_EQ(formatter->refCount, 3u);
  filter.reset();
  EXPECT_EQ(formatter->refCount, 2u);
}

TEST_F(MsgIdFilterTest, TheFormatterIsMadeForTheFirstAndGoneAfterTheLast) {
  EXPECT_NE(get("msgFormatter"), nullptr);
  filter.reset();
  EXPECT_EQ(get("msgFormatter"), nullptr);
  filter = get("filter", "qlx_msgidfilter");
  EXPECT_NE(get("msgFormatter"), nullptr);
}

TEST_F(MsgIdFilterTest, AnObjectOfAnotherClassInTheFormattersPlaceStaysAndTheFilterWorks) {
  filter.reset();
  const Handle other = get("msgFormatter", "qlx_basiclogger");
  make("filter");
  EXPECT_EQ(other->refCount, 2u);  // registry, test
  EXPECT_FALSE(passesText(u"KBB0001W careful"));
  EXPECT_TRUE(passesText(u"KBB0001E wrong"));
  EXPECT_STREQ(other->objClass->name, "qlx_basiclogger");
}

// The filter that is asked for makes the formatter of that name before it is registered itself.
TEST_F(MsgIdFilterTest, CannotHaveTheNameOfItsFormatter) {
  filter.reset();
  ASSERT_EQ(get("msgFormatter"), nullptr);
  {
    const FailingMemory memory;
    const int64_t before = memory.live();
    EXPECT_EQ(get("msgFormatter", "qlx_msgidfilter"), nullptr);
    EXPECT_EQ(get("msgFormatter"), nullptr);  // gone with the only one that held it
    EXPECT_EQ(memory.live(), before);
  }
  filter = get("filter", "qlx_msgidfilter");
  EXPECT_EQ(get("msgFormatter", "qlx_msgidfilter"), nullptr);
  EXPECT_EQ(get("msgFormatter")->refCount, 3u);  // registry, filter, this
}

// ---- Memory

TEST_F(MsgIdFilterTest, WithoutMemoryThereAreNoVariablesAndNoHalfListOfPatterns) {
  const Handle formatter = get("msgFormatter");
  FailingMemory memory;
  const ApiLock lock;
  for (uint64_t n = 1;; ++n) {
    memory.failOnce(n);
    void *made = QlxMsgIdFilterFAllocVars();
    const bool failed = memory.failures() > 0;
    EXPECT_EQ(made == nullptr, failed) << n;
    QlxMsgIdFilterFFreeVars(made);
    if (!failed) break;
  }
  EXPECT_EQ(memory.live(), 0);
  EXPECT_EQ(formatter->refCount, 3u);
}

TEST_F(MsgIdFilterTest, PatternsThatFindNoMemoryLeaveTheOnesThatAreThere) {
  bool failed = true;
  for (uint64_t n = 1; failed; ++n) {
    set("msgIds", "OLD*");
    {
      FailingMemory memory;
      memory.failOnce(n);
      QlxSetObjProp(filter.get(), "msgIds", "ABC* XYZ*");
      failed = memory.failures() > 0;
    }
    EXPECT_EQ(passes("OLD1"), !failed) << n;
    for (const char *id : {"ABC1", "XYZ1"}) EXPECT_EQ(passes(id), failed) << id << n;
  }
}

TEST_F(MsgIdFilterTest, ATimeThatFindsNoMemoryStillPasses) {
  set("msgIdRepeatTime", "60");
  const EventPtr event = makeEvent(u"");
  QlxSetEventMessageId(event.get(), "KBB0001E");
  event->time = 100;
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_TRUE(says(event));
  memory.failNone();
  EXPECT_TRUE(passes("KBB0001E", 101)) << "it was not noted";
}

}  // namespace
