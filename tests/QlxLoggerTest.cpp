#include <functional>

#include <qlx/class/logger.h>

#include "record/QlxLoggedEvent.h"
#include "support/ChainTest.h"
#include "support/FailingMemory.h"
#include "support/HostClasses.h"
#include "support/Status.h"

namespace {

constexpr QlxLogResult kNothing = {'-', 0, 0};
constexpr QlxLogResult kNoMemory = {'p', ENOMEM, 0};
constexpr QlxLogResult kNotTouched = {'x', 7, 7};

// Calls with a started list in the place of the parameters.
QlxLogResult callVA(QlxLogResult (*call)(QlxObject *, const char *, const char *, va_list),
                    QlxObject *logger, const char *bundle, const char *key, ...) {
  va_list args;
  va_start(args, key);
  const QlxLogResult result = call(logger, bundle, key, args);
  va_end(args);
  return result;
}
QlxLogResult callVA(QlxLogResult (*call)(QlxObject *, const char *, const char *, int32_t,
                                         const UChar *, va_list),
                    QlxObject *logger, const char *file, const char *function, int32_t line,
                    const UChar *text, ...) {
  va_list args;
  va_start(args, text);
  const QlxLogResult result = call(logger, file, function, line, text, args);
  va_end(args);
  return result;
}
QlxLogResult callVA(QlxLogResult (*call)(QlxObject *, const UChar *, va_list), QlxObject *logger,
                    const UChar *text, ...) {
  va_list args;
  va_start(args, text);
  const QlxLogResult result = call(logger, text, args);
  va_end(args);
  return result;
}

class LoggerTest : public HandledChainTest {
 protected:
  void setLevel(const char *level) { QlxSetObjProp(logger.get(), "level", level); }

  // The levels of the events since the last look.
  std::vector<int32_t> levels() {
    std::vector<int32_t> all;
    for (const RecordingHandler::Record &record : recorder->records) all.push_back(record.level);
    recorder->records.clear();
    return all;
  }

  // Every log call once, from the least severe one up.
  void callAll() {
    QlxObject *l = logger.get();
    QlxLogDebugMax(l, nullptr, nullptr, 0, u"x");
    QlxLogDebugMid(l, nullptr, nullptr, 0, u"x");
    QlxLogDebugMin(l, nullptr, nullptr, 0, u"x");
    QlxLogInfo(l, "b", "k");
    QlxLogWarn(l, "b", "k");
    QlxLogError(l, "b", "k");
    QlxLogFatal(l, "b", "k");
    QlxLogUMsg(l, "b", "k");
    QlxLogUText(l, u"x");
  }
};

// ---- The threshold

TEST_F(LoggerTest, ANewLoggerPassesDebugMinAndUp) {
  callAll();
  EXPECT_EQ(levels(), (std::vector{3000, 4000, 5000, 6000, 7000, -9999, -9999}));
}

TEST_F(LoggerTest, EveryCallHasItsLevel) {
  setLevel("ALL");
  callAll();
  EXPECT_EQ(levels(), (std::vector{1000, 2000, 3000, 4000, 5000, 6000, 7000, -9999, -9999}));
}

TEST_F(LoggerTest, AtOffOnlyTheCallsWithoutALevelPass) {
  setLevel("OFF");
  callAll();
  EXPECT_EQ(levels(), (std::vector{-9999, -9999}));
}

TEST_F(LoggerTest, AMisspeltLevelPassesEverything) {
  setLevel("LOUD");
  EXPECT_EQ(logger->kind1.level, -9999);
  EXPECT_EQ(QlxIsLoggable(logger.get(), INT32_MIN), 1);
  callAll();
  EXPECT_EQ(levels().size(), 9u);
}

TEST_F(LoggerTest, AnEmptyLevelIsAllAndAMissingOnePassesEverything) {
  setLevel("");
  EXPECT_EQ(logger->kind1.level, 0);
  const Handle other = get("other", "qlx_basiclogger");
  const ApiLock lock;
  QlxBasicLoggerFCfgChange(other.get(), "level");
  EXPECT_EQ(other->kind1.level, -9999);
}

TEST_F(LoggerTest, IsLoggableAtItsThresholdAndAbove) {
  setLevel("4500");
  QlxObject *l = logger.get();
  EXPECT_EQ(QlxIsLoggable(l, 4499), 0);
  EXPECT_EQ(QlxIsLoggable(l, 4500), 1);
  EXPECT_EQ(QlxIsLoggable(l, INT32_MAX), 1);
  EXPECT_EQ(QlxIsLoggable(l, -9998), 0);
  EXPECT_EQ(QlxIsLoggable(l, UNSPECIFIED), 1);
  EXPECT_EQ(QlxIsLoggable(nullptr, FATAL), 0);
  EXPECT_EQ(QlxIsLoggable(nullptr, UNSPECIFIED), 0);
}

TEST_F(LoggerTest, NothingIsLoggableWhileItIsDisabled) {
  for (const char *level : {"ALL", "LOUD"}) {
    setLevel(level);
    QlxSetObjectEnabled(logger.get(), 0);
    EXPECT_EQ(QlxIsLoggable(logger.get(), FATAL), 0);
    EXPECT_EQ(QlxIsLoggable(logger.get(), UNSPECIFIED), 0);
    QlxSetObjectEnabled(logger.get(), 1);
  }
}

TEST_F(LoggerTest, TestingTakesNoLockAndNoMemory) {
  const ApiLock lock;  // not recursive
  const FailingMemory memory;
  EXPECT_EQ(QlxIsLoggable(logger.get(), INFO), 1);
  EXPECT_EQ(QlxLogDebugMid(logger.get(), "f", "g", 1, u"x"), kNothing);
  EXPECT_EQ(memory.attempts(), 0u);
}

TEST_F(LoggerTest, ASuppressedCallTakesNoLockInAnyForm) {
  setLevel("OFF");
  QlxObject *l = logger.get();
  const ApiLock lock;  // not recursive
  EXPECT_EQ(QlxLogInfo(l, "b", "k"), kNothing);
  EXPECT_EQ(QlxLogWarn(l, "b", "k"), kNothing);
  EXPECT_EQ(QlxLogError(l, "b", "k"), kNothing);
  EXPECT_EQ(QlxLogFatal(l, "b", "k"), kNothing);
  EXPECT_EQ(QlxLogUMsg(nullptr, "b", "k"), kNothing);
  EXPECT_EQ(QlxLogDebugMin(l, nullptr, nullptr, 0, u"x"), kNothing);
  EXPECT_EQ(QlxLogDebugMid(l, nullptr, nullptr, 0, u"x"), kNothing);
  EXPECT_EQ(QlxLogDebugMax(l, nullptr, nullptr, 0, u"x"), kNothing);
  EXPECT_EQ(QlxLogUText(nullptr, u"x"), kNothing);
  for (const auto call : {QlxLogInfoVA, QlxLogWarnVA, QlxLogErrorVA, QlxLogFatalVA}) {
    EXPECT_EQ(callVA(call, l, "b", "k"), kNothing);
  }
  EXPECT_EQ(callVA(QlxLogUMsgVA, nullptr, "b", "k"), kNothing);
  for (const auto call : {QlxLogDebugMinVA, QlxLogDebugMidVA, QlxLogDebugMaxVA}) {
    EXPECT_EQ(callVA(call, l, nullptr, nullptr, 0, u"x"), kNothing);
  }
  EXPECT_EQ(callVA(QlxLogUTextVA, nullptr, u"x"), kNothing);
}

TEST_F(LoggerTest, TheInternalTestIsAPlaceholder) {
  const ApiLock lock;
  for (const int32_t level : {+OFF, +FATAL, +UNSPECIFIED, 0}) {
    EXPECT_EQ(qlxIntlIsLoggable(logger.get(), level), 0);
    EXPECT_EQ(qlxIntlIsLoggable(nullptr, level), 0);
  }
}

// ---- What a call logs

TEST_F(LoggerTest, ADebugTextIsAPatternWithItsArguments) {
  QlxLogDebugMin(logger.get(), nullptr, nullptr, 0, u"{0} and {1}", u"a", u"b");
  QlxLogUText(logger.get(), u"it''s {0}", u"{0}");
  callVA(QlxLogDebugMinVA, logger.get(), nullptr, nullptr, 0, u"{0} and {1}", u"c", u"d");
  callVA(QlxLogUTextVA, logger.get(), u"{0}", u"e");
  EXPECT_RECORDED(u"a and b|it's {0}|c and d|e|");
}

TEST_F(LoggerTest, EveryFormHandsOnItsArgumentsAndItsLevel) {
  setLevel("ALL");
  recorder->alsoDo = [](Event *event) {
    EXPECT_EQ(event->isMessage, event->message->bundle != nullptr);
  };
  QlxObject *l = logger.get();
  for (const auto call : {QlxLogDebugMaxVA, QlxLogDebugMidVA, QlxLogDebugMinVA}) {
    callVA(call, l, nullptr, nullptr, 0, u"{0}", u"x");
  }
  for (const auto call : {QlxLogInfoVA, QlxLogWarnVA, QlxLogErrorVA, QlxLogFatalVA, QlxLogUMsgVA}) {
    callVA(call, l, "b", "k", u"x");
  }
  callVA(QlxLogUTextVA, l, u"{0}", u"x");
  EXPECT_RECORDED(u"x|x|x|<null>|<null>|<null>|<null>|<null>|x|");
  EXPECT_EQ(levels(), (std::vector{1000, 2000, 3000, 4000, 5000, 6000, 7000, -9999, -9999}));
}

TEST_F(LoggerTest, AMessageCarriesItsBundleAndItsKey) {
  recorder->alsoDo = [](Event *event) {
    EXPECT_EQ(event->isMessage, 1);
    EXPECT_STREQ(event->message->bundle, "bundle");
    EXPECT_STREQ(event->message->key, "key");
    EXPECT_EQ(event->message->text, nullptr);
    EXPECT_EQ(event->props, nullptr);
  };
  QlxLogInfo(logger.get(), "bundle", "key");
  EXPECT_EQ(recorder->records.size(), 1u);
}

TEST_F(LoggerTest, AMessageIsOneEvenWithoutABundle) {
  recorder->alsoDo = [](Event *event) {
    EXPECT_EQ(event->isMessage, 1);
    EXPECT_EQ(event->message->bundle, nullptr);
  };
  QlxLogInfo(logger.get(), nullptr, "key");
  EXPECT_EQ(recorder->records.size(), 1u);
}

TEST_F(LoggerTest, ADebugCallTellsItsSource) {
  recorder->alsoDo = [](Event *event) {
    EXPECT_EQ(event->isMessage, 0);
    EXPECT_EQ(take(QlxGetEventProp(event, "qlx_prop_srcfile", nullptr)), "file.c");
    EXPECT_EQ(QlxGetEventPropInt(event, "qlx_prop_srcline", nullptr), -12);
    EXPECT_EQ(take(QlxGetEventProp(event, "qlx_prop_srcfunction", nullptr)), "main");
  };
  QlxLogDebugMin(logger.get(), "file.c", "main", -12, u"x");
  callVA(QlxLogDebugMinVA, logger.get(), "file.c", "main", -12, u"x");
  EXPECT_EQ(recorder->records.size(), 2u);
}

TEST_F(LoggerTest, ALineWithoutAFileIsDropped) {
  setLevel("ALL");
  recorder->alsoDo = [](Event *event) {
    uint8_t found = 7;
    EXPECT_EQ(QlxGetEventProp(event, "qlx_prop_srcfile", &found), nullptr);
    EXPECT_EQ(found, 0);
    QlxGetEventPropInt(event, "qlx_prop_srcline", &found);
    EXPECT_EQ(found, 0);
    EXPECT_EQ(take(QlxGetEventProp(event, "qlx_prop_srcfunction", nullptr)), "main");
  };
  QlxLogDebugMax(logger.get(), nullptr, "main", 12, u"x");
  EXPECT_EQ(recorder->records.size(), 1u);
}

TEST_F(LoggerTest, AFileWithoutAFunctionIsKept) {
  recorder->alsoDo = [](Event *event) {
    EXPECT_EQ(take(QlxGetEventProp(event, "qlx_prop_srcfile", nullptr)), "file.c");
    EXPECT_EQ(QlxGetEventPropInt(event, "qlx_prop_srcline", nullptr), 12);
    EXPECT_EQ(QlxGetEventProp(event, "qlx_prop_srcfunction", nullptr), nullptr);
  };
  QlxLogDebugMin(logger.get(), "file.c", nullptr, 12, u"x");
  EXPECT_EQ(recorder->records.size(), 1u);
}

TEST_F(LoggerTest, APlainTextHasNoSource) {
  recorder->alsoDo = [](Event *event) { EXPECT_EQ(event->props, nullptr); };
  QlxLogUText(logger.get(), u"x");
  EXPECT_EQ(recorder->records.size(), 1u);
}

TEST_F(LoggerTest, ATextMayBeMissing) {
  EXPECT_EQ(QlxLogUText(logger.get(), nullptr), kNothing);
  EXPECT_RECORDED(u"<null>|");
}

// ---- The result

TEST_F(LoggerTest, TheResultIsTheStatusThatAHandlerLeft) {
  recorder->alsoDo = [](Event *event) { event->status = failure(28); };
  EXPECT_EQ(QlxLogUText(logger.get(), u"x"), (QlxLogResult{'p', 28, 0}));
  EXPECT_EQ(QlxLogDebugMin(logger.get(), "f", "g", 1, u"x"), (QlxLogResult{'p', 28, 0}));
  EXPECT_EQ(callVA(QlxLogUTextVA, logger.get(), u"x"), (QlxLogResult{'p', 28, 0}));
}

TEST_F(LoggerTest, TheResultTellsTheLastBindsError) {
  const QlxLogResult result = QlxLogError(logger.get(), "no such bundle", "key");
  EXPECT_EQ(result, (QlxLogResult{'-', 0, U_MISSING_RESOURCE_ERROR}));
  recorder->alsoDo = [](Event *event) { event->message->error = 5; };
  EXPECT_EQ(QlxLogUText(logger.get(), u"x"), (QlxLogResult{'-', 0, 5}));
}

TEST_F(LoggerTest, ACallWithoutListenersMakesAndFreesItsEvent) {
  const Handle lonely = get("lonely", "qlx_basiclogger");
  const FailingMemory memory;
  EXPECT_EQ(QlxLogInfo(lonely.get(), "bundle", "key"), kNothing);
  EXPECT_GT(memory.attempts(), 0u);
  qlxDropCachedEvent();  // its blocks wait for the next call
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(LoggerTest, ADisabledLoggerMakesNoEvent) {
  QlxSetObjProp(logger.get(), "logging", "off");
  const FailingMemory memory;
  EXPECT_EQ(QlxLogFatal(logger.get(), "bundle", "key"), kNothing);
  EXPECT_EQ(QlxLogUText(logger.get(), u"x"), kNothing);
  callAll();
  EXPECT_EQ(memory.attempts(), 0u);
  EXPECT_EQ(recorder->records.size(), 0u);
}

TEST_F(LoggerTest, AHandlerIsNoLogger) {
  const FailingMemory memory;
  const Handle other = get("other", RecordingHandler::kClass);
  // Its first field reads as a threshold; without listeners that is 0.
  EXPECT_EQ(QlxIsLoggable(other.get(), 0), 1);
  EXPECT_EQ(QlxIsLoggable(other.get(), -1), 0);
  const uint64_t before = memory.attempts();
  EXPECT_EQ(QlxLogUText(other.get(), u"x"), kNothing);
  EXPECT_EQ(QlxLogFatal(other.get(), "bundle", "key"), kNothing);
  EXPECT_EQ(memory.attempts(), before);
  EXPECT_EQ(recorder->records.size(), 0u);
}

TEST_F(LoggerTest, ACallThatFindsNoMemoryTellsIt) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(QlxLogUText(logger.get(), u"x"), kNoMemory);
  EXPECT_EQ(recorder->records.size(), 0u);
  memory.failOnce(2);  // the event has no message
  EXPECT_EQ(QlxLogUText(logger.get(), u"x"), kNoMemory);
  EXPECT_RECORDED(u"<null>|");
  EXPECT_EQ(recorder->records[0].status, failure(ENOMEM)) << "listeners see it too";
}

TEST_F(LoggerTest, EveryFormTellsThatItFoundNoMemory) {
  setLevel("ALL");
  QlxObject *l = logger.get();
  FailingMemory memory;
  memory.failFrom(1);
  for (const auto call : {QlxLogUMsg, QlxLogInfo, QlxLogWarn, QlxLogError, QlxLogFatal}) {
    EXPECT_EQ(call(l, "b", "k"), kNoMemory);
  }
  for (const auto call : {QlxLogUMsgVA, QlxLogInfoVA, QlxLogWarnVA, QlxLogErrorVA, QlxLogFatalVA}) {
    EXPECT_EQ(callVA(call, l, "b", "k"), kNoMemory);
  }
  for (const auto call : {QlxLogDebugMax, QlxLogDebugMid, QlxLogDebugMin}) {
    EXPECT_EQ(call(l, "f", "g", 1, u"x"), kNoMemory);
  }
  for (const auto call : {QlxLogDebugMaxVA, QlxLogDebugMidVA, QlxLogDebugMinVA}) {
    EXPECT_EQ(callVA(call, l, "f", "g", 1, u"x"), kNoMemory);
  }
  EXPECT_EQ(QlxLogUText(l, u"x"), kNoMemory);
  EXPECT_EQ(callVA(QlxLogUTextVA, l, u"x"), kNoMemory);
}

TEST_F(LoggerTest, AnEventThatIsNotMadeWholeAgainIsToldToo) {
  QlxLogInfo(logger.get(), "b", "k");  // its blocks are kept for the next
  FailingMemory memory;
  memory.failOnce(1);
  const std::string longKey(1000, 'k');
  EXPECT_EQ(QlxLogInfo(logger.get(), "b", longKey.c_str()).statusKind, '-') << "made anew";
  memory.failFrom(1);
  EXPECT_EQ(QlxLogInfo(logger.get(), "b", (longKey + longKey).c_str()), kNoMemory);
}

TEST_F(LoggerTest, TheEntriesTellThatThereIsNoMemory) {
  const ApiLock lock;
  FailingMemory memory;
  memory.failFrom(1);
  QlxLogResult result = kNotTouched;
  qlxLogUMessageEntry(&result, logger.get(), INFO, "b", "k", nullptr);
  EXPECT_EQ(result, kNoMemory);
  result = kNotTouched;
  qlxLogUDebugEntry(&result, logger.get(), INFO, "f", "g", 1, u"x", nullptr);
  EXPECT_EQ(result, kNoMemory);
  qlxLogUMessageEntry(nullptr, logger.get(), INFO, "b", "k", nullptr);
  qlxLogUDebugEntry(nullptr, logger.get(), INFO, "f", "g", 1, u"x", nullptr);
}

// ---- The entries

TEST_F(LoggerTest, HandsOutTheOperationOfItsClass) {
  EXPECT_EQ(QlxLoggerGetFLog(logger.get()), QlxBasicObjectFLog);
  EXPECT_EQ(QlxLoggerGetFLog(nullptr), nullptr);
  EXPECT_EQ(QlxLoggerGetFLog(handler.get()), nullptr);
  const Handle filter = get("filter", "qlx_levelfilter");
  EXPECT_EQ(QlxLoggerGetFLog(filter.get()), nullptr);
  QlxSetObjectEnabled(logger.get(), 0);
  EXPECT_EQ(QlxLoggerGetFLog(logger.get()), nullptr);
}

TEST_F(LoggerTest, TheEntriesLogAtAnyLevelWithoutTestingIt) {
  setLevel("OFF");
  const ApiLock lock;
  QlxLogResult result = kNotTouched;
  qlxLogUDebugEntry(&result, logger.get(), 123, "f", "g", 1, u"x", nullptr);
  EXPECT_EQ(result, kNothing);
  result = kNotTouched;
  qlxLogUMessageEntry(&result, logger.get(), 456, nullptr, nullptr, nullptr);
  EXPECT_EQ(result, kNothing);
  EXPECT_EQ(levels(), (std::vector{123, 456}));
}

TEST_F(LoggerTest, TheEntriesSetTheResultWhenNothingIsLogged) {
  QlxSetObjectEnabled(logger.get(), 0);
  const ApiLock lock;
  for (QlxObject *object : {logger.get(), handler.get(), static_cast<QlxObject *>(nullptr)}) {
    QlxLogResult result = kNotTouched;
    qlxLogUDebugEntry(&result, object, INFO, "f", "g", 1, u"x", nullptr);
    EXPECT_EQ(result, kNothing);
    result = kNotTouched;
    qlxLogUMessageEntry(&result, object, INFO, "b", "k", nullptr);
    EXPECT_EQ(result, kNothing);
  }
  EXPECT_EQ(recorder->records.size(), 0u);
}

TEST_F(LoggerTest, TheEntriesLogAlsoWithoutAPlaceForTheResult) {
  const ApiLock lock;
  qlxLogUDebugEntry(nullptr, logger.get(), INFO, nullptr, nullptr, 0, u"x", nullptr);
  qlxLogUMessageEntry(nullptr, logger.get(), INFO, "b", "k", nullptr);
  qlxIntlLogVA(nullptr, DEBUG_MAX, "b", "k");
  EXPECT_EQ(recorder->records.size(), 2u);
}

TEST_F(LoggerTest, AClassWithItsOwnOperationGetsTheEventAndTheArguments) {
  HostClasses host;
  const Handle own = get("own", HostClasses::kLogger);
  QlxAddListener(own.get(), handler.get());
  EXPECT_EQ(QlxLogUText(own.get(), u"{0}", u"a"), kNothing);
  EXPECT_EQ(host.count("log own"), 1);
  EXPECT_RECORDED(u"a|");
  QlxCloseToolkit();  // before the host goes; what is left of the handles is inert
}

// ---- The library's own reports

TEST_F(LoggerTest, ReportsGoThroughTheToolkitLoggerAfterItsThreshold) {
  const Handle errors = get("quill.errorLogger");
  QlxSetObjProp(errors.get(), "listenerNames", "recording");
  const ApiLock lock;
  QlxLogResult result = kNotTouched;
  qlxIntlLogVA(&result, WARN, "b", "k");
  EXPECT_EQ(result, (QlxLogResult{'-', 0, U_MISSING_RESOURCE_ERROR}));
  result = kNotTouched;
  qlxIntlLogVA(&result, DEBUG_MID, "b", "k");
  EXPECT_EQ(result, kNothing);
  EXPECT_EQ(levels(), (std::vector<int32_t>{WARN}));
}

TEST_F(LoggerTest, ReportsAreDroppedWhileTheToolkitIsClosed) {
  const Handle errors = get("quill.errorLogger");
  QlxCloseToolkit();
  const ApiLock lock;
  QlxLogResult result = kNotTouched;
  qlxIntlLogVA(&result, FATAL, "b", "k");
  EXPECT_EQ(result, kNothing);
}

// ---- Configuration

TEST_F(LoggerTest, ALoggersKeysAreItsLevelAndTheCommonOnes) {
  configure("made", "level", "warning");
  configure("made", "logging", "off");
  configure("made", "listenerNames", "recording");
  const Handle made = get("made", "qlx_basiclogger");
  EXPECT_EQ(made->kind1.level, WARN);
  EXPECT_EQ(made->enabled, 0);
  EXPECT_EQ(QlxGetListeners(made.get())->value, handler.get());
}

TEST_F(LoggerTest, NoKeyAndNoLoggerDoNothing) {
  const ApiLock lock;
  QlxBasicLoggerFCfgChange(nullptr, "level");
  QlxBasicLoggerFCfgChange(logger.get(), nullptr);
  EXPECT_EQ(logger->kind1.level, 3000);
}

TEST_F(LoggerTest, ALevelIsNotWrittenWhereAnotherKindKeepsAPointer) {
  const Handle formatter = get("f", "qlx_basicformatter");
  QlxSetObjProp(formatter.get(), "separator", ";");
  QlxSetObjProp(formatter.get(), "level", "ALL");
  const ApiLock lock;
  QlxBasicLoggerFCfgChange(formatter.get(), "level");
  QlxLevelFilterFCfgChange(formatter.get(), "level");
  EXPECT_STREQ(formatter->kind1.separator, ";");
}

}  // namespace
