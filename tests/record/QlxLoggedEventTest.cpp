#include "record/QlxLoggedEvent.h"

#include <functional>
#include <malloc.h>
#include <string>
#include <vector>

#include <qlx/class/containers.h>
#include <qlx/class/event.h>
#include <qlx/class/logger.h>
#include <qlx/class/message.h>

#include "record/QlxFormatted.h"
#include "text/QlxFormatCache.h"
#include "record/QlxCachedBuffer.h"
#include "support/ChainTest.h"
#include "support/Child.h"
#include "support/EveryFailure.h"

namespace {

std::string orNull(const char *text) {
  return text ? text : "<null>";
}

std::string propsOf(const Event *event) {
  std::string all;
  for (const auto *it = event->props ? event->props->head : nullptr; it; it = it->next) {
    all += std::string(it->key) + "=" + orNull(it->value) + "|";
  }
  return all;
}

// All of an event but its time.
std::string describe(const Event *event) {
  const I18Msg *message = event->message;
  if (!message) return "no message";
  std::string text;
  for (const UChar *c = message->text; c && *c; ++c) text += static_cast<char>(*c);
  return (event->isMessage ? "message " : "text ") + std::to_string(event->level) + " " +
         orNull(message->bundle) + " " + orNull(message->key) + " '" + text + "' " +
         (message->parms ? "parms " : "") + orNull(message->locale) + " " +
         std::to_string(message->error) + " " + std::to_string(message->shared) + " " +
         orNull(event->messageId) + " " + orNull(event->locale) + " " + event->status.kind +
         std::to_string(event->status.code) + " " + propsOf(event);
}

class LoggedEventTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    attach("recording", RecordingHandler::kClass);
    QlxSetObjProp(logger.get(), "level", "DEBUG_MAX");
    recorder->alsoDo = [this](Event *event) {
      seen.push_back(describe(event));
      // Moved out, so that what it does may set another.
      if (const auto act = std::exchange(onNext, nullptr)) act(event);
    };
  }

  void debug(const char16_t *text = u"text") {
    QlxLogDebugMin(logger.get(), "file.c", "function", 7, text);
  }

  // A logger whose listener is a host's that takes no memory.
  static Handle getSilent() {
    QlxAddHandlerClass("test_silent", nullptr, nullptr, nullptr, nullptr, ignore, nullptr, nullptr);
    Handle silent = get("silent", "qlx_basiclogger");
    QlxSetObjProp(silent.get(), "level", "DEBUG_MAX");
    const Handle listener = get("ignoring", "test_silent");
    QlxAddListener(silent.get(), listener.get());
    return silent;
  }
  static void ignore(QlxObject *, Event *event, va_list *) { EXPECT_TRUE(event); }

  // A text of the length of a log line's takes part in all that is measured.
  static size_t usedBytes() {
    const struct mallinfo2 info = mallinfo2();
    return info.uordblks + info.hblkhd;
  }

  std::vector<std::string> seen;        // each event, when it came
  std::function<void(Event *)> onNext;  // done to the next one, once
};

constexpr const char *kDebugProps =
    "qlx_prop_srcfile=file.c|qlx_prop_srcline=7|qlx_prop_srcfunction=function|";

// ---- From one call to the next

TEST_F(LoggedEventTest, HasNothingOfTheCallBefore) {
  debug();
  onNext = [](Event *event) {
    QlxSetEventProp(event, "more", "value");
    QlxSetEventProp(event, "qlx_prop_srcfile", "other.c");
    QlxSetEventMessageId(event, "ID");
    qlxSetEventLocale(event, "de");
    qlxSetI18MsgLocale(event->message, "fr");
    qlxGetI18MsgParmList(event->message);
    event->message->error = 5;
    event->status = {'p', 9};
    event->isMessage = 1;
    event->level = 3;
    event->time = 0;
  };
  debug();
  double time = 0;
  onNext = [&](Event *event) { time = event->time; };
  debug();
  ASSERT_EQ(seen.size(), 3U);
  EXPECT_EQ(seen[2], seen[0]);
  EXPECT_GT(time, 1e12);
}

TEST_F(LoggedEventTest, OfAnotherKindHasNothingOfTheCallBefore) {
  const auto each = [&] {
    debug();
    QlxLogInfo(logger.get(), "bundle", "key");
    QlxLogUText(logger.get(), u"plain");
    QlxLogError(logger.get(), nullptr, "only");
    QlxLogUText(logger.get(), nullptr);
    QlxLogDebugMax(logger.get(), nullptr, "f", 1, u"");
  };
  each();
  EXPECT_EQ(seen.at(1).find("message " + std::to_string(INFO) + " bundle key '' <null> "), 0U);
  EXPECT_EQ(seen.at(2), "text " + std::to_string(UNSPECIFIED) +
                            " <null> <null> 'plain' <null> 0 0 <null> <null> -0 ");
  const std::vector<std::string> first = std::exchange(seen, {});
  each();
  EXPECT_EQ(seen, first);
}

TEST_F(LoggedEventTest, TakesTheValuesOfItsOwnCall) {
  for (const int line : {1, -1, 2147483647, -2147483647 - 1, 0}) {
    QlxLogDebugMin(logger.get(), "a rather long name of a file.c", "f", line, u"x");
    QlxLogDebugMin(logger.get(), "s", "a rather long name of a function", line, u"longer text");
    EXPECT_NE(seen.end()[-2].find("'x' <null> 0 0 <null> <null> -0 qlx_prop_srcfile=a rather long "
                                  "name of a file.c|qlx_prop_srcline=" +
                                  std::to_string(line) + "|qlx_prop_srcfunction=f|"),
              std::string::npos)
        << seen.end()[-2];
    EXPECT_NE(seen.back().find("'longer text' <null> 0 0 <null> <null> -0 qlx_prop_srcfile=s|"
                               "qlx_prop_srcline=" +
                               std::to_string(line) +
                               "|qlx_prop_srcfunction=a rather long name of a function|"),
              std::string::npos)
        << seen.back();
  }
}

// ---- What a class's operations do with it

TEST_F(LoggedEventTest, MayGetManyPropertiesAndLoseThem) {
  debug();
  for (int round = 0; round < 3; ++round) {
    std::string after, expected = kDebugProps;
    onNext = [&](Event *event) {
      for (int i = 0; i < 40; ++i) {
        const std::string name = "key" + std::to_string(i);
        QlxSetEventProp(event, name.c_str(), "first");
        QlxSetEventProp(event, name.c_str(), ("value" + std::to_string(i)).c_str());
      }
      for (int i = 0; i < 40; i += 2) {
        qlxIntlStringToStringMapRem(event->props, ("key" + std::to_string(i)).c_str());
      }
      qlxIntlStringToStringMapRem(event->props, "qlx_prop_srcline");
      after = propsOf(event);
      EXPECT_EQ(qlxIntlStringToStringMapHasKey(event->props, "key39"), 1);
      EXPECT_EQ(qlxIntlStringToStringMapHasKey(event->props, "key38"), 0);
    };
    debug();
    expected = "qlx_prop_srcfile=file.c|qlx_prop_srcfunction=function|";
    for (int i = 1; i < 40; i += 2) {
      expected += "key" + std::to_string(i) + "=value" + std::to_string(i) + "|";
    }
    EXPECT_EQ(after, expected);
    debug();
    EXPECT_EQ(seen.back(), seen.front());
    EXPECT_NE(seen.back().find(kDebugProps), std::string::npos);
  }
}

TEST_F(LoggedEventTest, MayGetAPropertyWithoutAValue) {
  onNext = [](Event *event) { QlxSetEventProp(event, "qlx_prop_srcfile", nullptr); };
  debug();
  debug();
  EXPECT_EQ(seen[1], seen[0]);
}

TEST_F(LoggedEventTest, LeavesACopyOfItsMessageItsLocale) {
  debug();
  I18Msg *copy = nullptr;
  onNext = [&](Event *event) {
    qlxSetI18MsgLocale(event->message, "de_DE");
    copy = qlxIntlCopyI18Msg(event->message);
  };
  debug(u"copied");
  onNext = [](Event *event) { qlxSetI18MsgLocale(event->message, "ja"); };
  debug();
  debug();
  ASSERT_NE(copy, nullptr);
  EXPECT_STREQ(copy->locale, "de_DE");
  EXPECT_EQ(std::u16string(copy->text), u"copied");
  EXPECT_EQ(seen[3], seen[0]);
  OslMemoryFree(copy->locale);  // shared ones are nobody's
  QlxFreeI18Msg(copy);
}

TEST_F(LoggedEventTest, LeavesTheEventOfACallInItsWayAlone) {
  debug();                    // blocks are kept from here on
  std::vector<Handle> inner;  // an object is not handed an event while it has one
  for (const char *name : {"one", "two", "three"}) {
    inner.push_back(get(name, "qlx_basiclogger"));
    const Handle own = get((std::string(name) + "recording").c_str(), RecordingHandler::kClass);
    QlxAddListener(inner.back().get(), own.get());
  }
  int depth = 0;
  std::function<void(Event *)> nest = [&](Event *event) {
    const std::string mine = describe(event);
    if (++depth < 4) {
      QlxObject *const next = inner[static_cast<size_t>(depth - 1)].get();
      onNext = nest;
      qlxLogUDebugEntry(nullptr, next, INFO, "nested.c", "inside", depth, u"nested", nullptr);
      qlxLogUMessageEntry(nullptr, next, INFO, "bundle", "key", nullptr);
    }
    EXPECT_EQ(describe(event), mine);
  };
  FailingMemory memory;
  int64_t live = 0;
  for (int round = 0; round < 5; ++round) {
    depth = 0;
    seen.clear();
    onNext = nest;
    debug(u"outer");
    ASSERT_EQ(seen.size(), 7U);
    EXPECT_NE(seen[0].find("'outer'"), std::string::npos);
    for (const int i : {1, 2, 3}) {
      EXPECT_NE(seen.at(i).find("'nested' <null> 0 0 <null> <null> -0 qlx_prop_srcfile=nested.c|"
                                "qlx_prop_srcline=" +
                                std::to_string(i) + "|qlx_prop_srcfunction=inside|"),
                std::string::npos)
          << seen[i];
    }
    for (const int i : {4, 5, 6})
      EXPECT_EQ(seen.at(i).find("message " + std::to_string(INFO) + " bundle key"), 0U);
    if (round == 2) live = memory.live();
    if (round > 2) {
      EXPECT_EQ(memory.live(), live);
    }
  }
  debug();
  EXPECT_NE(seen.back().find(kDebugProps), std::string::npos);
}

// ---- Of a host's own

TEST_F(LoggedEventTest, StampsAHostsEventThatHasManyProperties) {
  debug();
  debug();  // nodes are kept
  const Handle pd = get("pd", "qlx_pdlogger");
  QlxSetObjProp(pd.get(), "organization", "stamped");
  QlxSetObjProp(pd.get(), "product", "new");
  const ApiLock lock;
  for (const int count : {14, 15, 16, 17, 18, 40}) {
    Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"own");
    QlxSetEventProp(event, "organization", "host's");
    for (int i = 1; i < count; ++i) {
      QlxSetEventProp(event, ("key" + std::to_string(i)).c_str(), "value");
    }
    QlxPDLoggerFLog(pd.get(), event, nullptr);
    int found = 0;
    for (const auto *it = event->props->head; it; it = it->next, ++found) {
      EXPECT_EQ(qlxIntlStringToStringMapHasKey(event->props, it->key), 1) << it->key;
      EXPECT_EQ(it->owner, event->props);
    }
    EXPECT_GE(found, count + 3);
    EXPECT_EQ(take(QlxGetEventProp(event, "organization", nullptr)), "stamped");
    EXPECT_EQ(take(QlxGetEventProp(event, "product", nullptr)), "new");
    QlxFreeEvent(event);
  }
}

TEST_F(LoggedEventTest, StampsAnEventWithoutAndWithTheKey) {
  debug();
  const ApiLock lock;
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"own");
  qlxStampEvent(event, EventKey::kServer, "first");
  qlxStampEventInt(event, EventKey::kThreadId, -2147483647 - 1);
  qlxStampEvent(event, EventKey::kServer, "second");
  EXPECT_EQ(propsOf(event), "server=second|threadId=-2147483648|");
  QlxFreeEvent(event);
}

// ---- Memory

TEST_F(LoggedEventTest, NeedsNoMemoryOnceItsKindWasLogged) {
  const Handle silent = getSilent();
  const auto each = [&] {
    QlxLogDebugMin(silent.get(), "file.c", "function", 7, u"text");
    QlxLogInfo(silent.get(), "bundle", "key");
  };
  for (int i = 0; i < 5; ++i) each();
  FailingMemory memory;
  for (int i = 0; i < 100; ++i) each();
  EXPECT_EQ(memory.attempts(), 0U);
}

TEST_F(LoggedEventTest, NeedsNoMemoryForItsStampsOnceItsKindWasLogged) {
  const Handle pd = get("pd", "qlx_pdlogger");
  const auto each = [&] {
    QlxLogDebugMin(pd.get(), "file.c", "function", 7, u"ABC123E text");
    QlxLogDebugMin(pd.get(), "file.c", "function", 7, u"text");
  };
  QlxSetObjProp(pd.get(), "level", "DEBUG_MIN");
  for (int i = 0; i < 5; ++i) each();
  FailingMemory memory;
  for (int i = 0; i < 100; ++i) each();
  EXPECT_EQ(memory.attempts(), 0U);
}

TEST_F(LoggedEventTest, KeepsNoLargeBlocks) {
  const std::u16string text(1 << 20, u'x');
  const std::string name(1 << 20, 'y');
  const Handle silent = getSilent();
  const auto plain = [&] { QlxLogDebugMin(silent.get(), "file.c", "function", 7, u"text"); };
  for (int i = 0; i < 3; ++i) plain();
  const size_t before = usedBytes();
  for (int i = 0; i < 3; ++i) {
    QlxLogDebugMin(silent.get(), name.c_str(), name.c_str(), 7, text.c_str());
    QlxLogInfo(silent.get(), name.c_str(), name.c_str());
  }
  EXPECT_LT(usedBytes(), before + 200000);
}

TEST_F(LoggedEventTest, KeepsNoMorePropertiesThanItNeeds) {
  FailingMemory memory;
  debug();
  const int64_t before = memory.live();
  int64_t most = 0;
  for (int i = 0; i < 200; ++i) {
    onNext = [&](Event *event) {
      for (int k = 0; k < 20; ++k) {
        QlxSetEventProp(event, ("key" + std::to_string(i * 20 + k)).c_str(), "value");
      }
    };
    debug();
    most = std::max(most, memory.live());
  }
  EXPECT_LE(most, before + 3 * 40);  // a node, its key and its value each
}

TEST_F(LoggedEventTest, IsWholeOrWithoutWhatNoMemoryWasFor) {
  seen.reserve(1000);
  withEveryFailure([&](Tries &tries) {
    seen.clear();
    for (const char16_t *text : {u"short", u"a longer text than before"}) {
      QlxLogDebugMin(logger.get(), "file.c", "function", 7, text);
      onNext = [](Event *event) {
        qlxSetEventLocale(event, "de");
        QlxSetEventProp(event, "more", "value");
      };
      QlxLogInfo(logger.get(), "bundle", "key");
    }
    {
      const ApiLock lock;
      qlxDropCachedEvent();
      qlxDropCachedBuffers();
      qlxDropCachedFormats();
    }
    onNext = nullptr;
    recorder->records.clear();
    if (!tries.nothingFailed()) return;
    ASSERT_EQ(seen.size(), 4U);
    EXPECT_NE(seen[2].find(kDebugProps), std::string::npos);
  });
}

// ---- Processes

TEST_F(LoggedEventTest, IsKeptInAChildOnItsOwn) {
  debug();
  Child child([&] {
    debug(u"child");
    debug();
    EXPECT_EQ(seen.at(2), seen.at(0));
  });
  debug();
  debug();
  EXPECT_EQ(seen.at(2), seen.at(0));
  EXPECT_EQ(child.end(), 0);
}

}  // namespace
