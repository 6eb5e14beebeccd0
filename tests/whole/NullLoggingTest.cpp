// Null arguments of the way of a log call: events, messages, loggers, filters, handlers,
// formatters.
#include <cstdio>

#include <unicode/utypes.h>

#include <qlx/class.h>
#include <qlx/qlx.h>

#include "QlxFileHandler.h"
#include "support/CaptureStdout.h"
#include "support/NullCalls.h"
#include "support/OpenToolkit.h"
#include "support/ResourceBundles.h"
#include "support/SemaphoreKey.h"
#include "support/TempDir.h"

namespace {

// The result that a log call starts with and keeps where nothing fails.
void isPlain(QlxLogResult result) {
  EXPECT_EQ(result.statusKind, '-');
  EXPECT_EQ(result.statusCode, 0);
  EXPECT_EQ(result.msgStatus, 0);
}

NULL_GROUP(Events) {
  const auto isEvent = [](Event *event) {
    ASSERT_NE(event, nullptr);
    EXPECT_EQ(event->level, INFO);
    QlxFreeEvent(event);
  };
  NULLS(QlxVaAllocUEvent, with(INFO, "bundle", "key", u"text"), isEvent);
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  NULLS(QlxFreeEvent, with(nullptr), nothing);
  NULLS(QlxGetEventTime, with(nullptr), isZero);
  NULLS(QlxGetEventLevel, with(nullptr), is(UNSPECIFIED));
  NULLS(QlxGetEventIsMessage, with(nullptr), isZero);
  NULLS(QlxSetEventIsMessage, with(nullptr, 1), nothing);
  NULLS(QlxGetEventMessageId, with(nullptr), isZero);
  QlxSetEventMessageId(event, "id");
  NULLS(
      QlxSetEventMessageId, with(event, "other"),
      [&] { EXPECT_EQ(take(QlxGetEventMessageId(event)), "id"); },
      [&] { EXPECT_EQ(QlxGetEventMessageId(event), nullptr); });
  HELD(qlxGetEventLocale, with(nullptr), isZero);
  qlxSetEventLocale(event, "de");
  HELD(
      qlxSetEventLocale, with(event, "ja"),
      [&] { EXPECT_EQ(take(qlxGetEventLocale(event)), "de"); },
      [&] { EXPECT_EQ(qlxGetEventLocale(event), nullptr); });
  NULLS(QlxBindEventUMsg, with(event, qlxIntlBindUI18Msg, nullptr), isZero, isZero,
        givesText(u"text"));
  QlxFreeEvent(event);
}

NULL_GROUP(EventProperties) {
  uint8_t found = 7;
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, nullptr);
  ASSERT_EQ(QlxSetEventProp(event, "key", "true"), 1);
  NULLS_OF_GETTER(NULLS, QlxGetEventProp, event, givesText("true"));
  NULLS_OF_GETTER(NULLS, QlxGetEventPropBool, event, is(1));
  ASSERT_EQ(QlxSetEventProp(event, "key", "1"), 1);
  NULLS_OF_GETTER(NULLS, QlxGetEventPropInt, event, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetEventPropLong, event, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetEventPropFloat, event, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetEventPropDouble, event, is(1));
  NULLS(QlxSetEventProp, with(event, "null", "1"), isZero, isZero, is(1));
  NULLS(QlxSetEventPropBool, with(event, "other", 1), isZero);
  NULLS(QlxSetEventPropInt, with(event, "other", 1), nothing);
  NULLS(QlxSetEventPropLong, with(event, "other", 1), nothing);
  NULLS(QlxSetEventPropFloat, with(event, "other", 1), nothing);
  NULLS(QlxSetEventPropDouble, with(event, "other", 1), nothing);
  HELD(qlxFetchEventPropMap, with(nullptr), isZero);
  EXPECT_EQ(QlxStringToStringMapHasKey(event->props, "null"), 1);
  EXPECT_EQ(QlxStringToStringMapHasKey(event->props, "other"), 0);
  QlxFreeEvent(event);
}

NULL_GROUP(Messages) {
  const auto isMessage = [](I18Msg *message) {
    ASSERT_NE(message, nullptr);
    EXPECT_EQ(message->error, 0);
    QlxFreeI18Msg(message);
  };
  NULLS_OF_BOTH(AllocUI18Msg, with("bundle", "key", u"text"), isMessage);
  NULLS_OF_BOTH(CopyI18Msg, with(nullptr), isZero);
  NULLS_OF_BOTH(FreeI18Msg, with(nullptr), nothing);
  I18Msg *message = QlxAllocUI18Msg(nullptr, nullptr, u"text");
  NULLS_OF_BOTH(BindUI18Msg, with(message, nullptr), isZero, givesText(u"text"));
  HELD(qlxGetI18MsgParmList, with(nullptr), isZero);
  qlxSetI18MsgLocale(message, "de");
  HELD(
      qlxSetI18MsgLocale, with(message, "ja"), [&] { EXPECT_STREQ(message->locale, "de"); },
      [&] { EXPECT_EQ(message->locale, nullptr); });
  QlxFreeI18Msg(message);
  FILE *stream = std::tmpfile();
  HELD(qlxI18PrintUCharAsLocal, with(stream, u"text"), [&] { EXPECT_EQ(std::ftell(stream), 0); });
  std::fclose(stream);
}

// A bundle that is there, so that a null key is looked up in it.
NULL_GROUP(MessagesOfABundle) {
  const ResourceBundles bundles;
  ASSERT_TRUE(bundles.add("root", R"(key { "text" })"));
  const OpenToolkit toolkit;
  I18Msg *message = QlxAllocUI18Msg(bundles.path().c_str(), nullptr, nullptr);
  EXPECT_EQ(QlxBindUI18Msg(message, nullptr), nullptr);
  EXPECT_GT(message->error, 0);
  QlxFreeI18Msg(message);
}

// ---- Loggers

NULL_GROUP(LogCalls) {
  const OpenToolkit toolkit;
  QlxObject *logger = QlxGetObject("logger", "qlx_basiclogger");
  NULLS(QlxIsLoggable, with(nullptr, INFO), isZero);
  NULLS(QlxLogInfo, with(logger, "bundle", "key"), isPlain);
  NULLS(QlxLogWarn, with(logger, "bundle", "key"), isPlain);
  NULLS(QlxLogError, with(logger, "bundle", "key"), isPlain);
  NULLS(QlxLogFatal, with(logger, "bundle", "key"), isPlain);
  NULLS(QlxLogUMsg, with(logger, "bundle", "key"), isPlain);
  NULLS(QlxLogDebugMin, with(logger, "file", "function", 1, u"text"), isPlain);
  QlxSetObjProp(logger, "level", "ALL");
  NULLS(QlxLogDebugMid, with(logger, "file", "function", 1, u"text"), isPlain);
  NULLS(QlxLogDebugMax, with(logger, "file", "function", 1, u"text"), isPlain);
  NULLS(QlxLogUText, with(logger, u"text"), isPlain);
  NULLS_OF_BOTH(LoggerGetFLog, with(nullptr), isZero);
  HELD(qlxIntlIsLoggable, with(nullptr, INFO), isZero);
  QlxReleaseObject(logger);
}

void callWithLists(QlxObject *logger, ...) {
  va_list list;
  va_start(list, logger);
  NULLS(QlxLogInfoVA, with(logger, "bundle", "key", list), isPlain);
  NULLS(QlxLogWarnVA, with(logger, "bundle", "key", list), isPlain);
  NULLS(QlxLogErrorVA, with(logger, "bundle", "key", list), isPlain);
  NULLS(QlxLogFatalVA, with(logger, "bundle", "key", list), isPlain);
  NULLS(QlxLogUMsgVA, with(logger, "bundle", "key", list), isPlain);
  NULLS(QlxLogDebugMinVA, with(logger, "file", "function", 1, u"text", list), isPlain);
  NULLS(QlxLogDebugMidVA, with(logger, "file", "function", 1, u"text", list), isPlain);
  NULLS(QlxLogDebugMaxVA, with(logger, "file", "function", 1, u"text", list), isPlain);
  NULLS(QlxLogUTextVA, with(logger, u"text", list), isPlain);
  va_end(list);
}

NULL_GROUP(LogCallsWithLists) {
  const OpenToolkit toolkit;
  QlxObject *logger = QlxGetObject("logger", "qlx_basiclogger");
  QlxSetObjProp(logger, "level", "ALL");
  callWithLists(logger);
  QlxReleaseObject(logger);
}

// Only a null logger logs nothing: an event goes its way without what is null, also when there is
// nowhere to put the result.
NULL_GROUP(LogEntries) {
  static int events;
  QlxAddHandlerClass(
      "test_counter", nullptr, nullptr, nullptr, nullptr,
      [](QlxObject *, Event *, va_list *) { ++events; }, nullptr, nullptr);
  const OpenToolkit toolkit;
  QlxObject *logger = qlxToolkitLogger();
  QlxObject *counter = QlxGetObject("counter", "test_counter");
  QlxSetObjProp(logger, "listenerNames", "counter");
  QlxLogResult result{};
  events = 0;
  HELD(qlxLogUMessageEntry, with(&result, logger, INFO, "bundle", "key", nullptr), nothing);
  EXPECT_EQ(events, 4);
  HELD(qlxLogUDebugEntry, with(&result, logger, INFO, "file", "function", 1, u"text", nullptr),
       nothing);
  EXPECT_EQ(events, 9);
  HELD(qlxIntlLogVA, with(&result, INFO, "bundle", "key"), nothing);
  EXPECT_EQ(events, 12);
  isPlain(result);
  QlxReleaseObject(counter);
}

// ---- Filters, handlers and formatters

NULL_GROUP(Filters) {
  const OpenToolkit toolkit;
  QlxObject *filter = QlxGetObject("filter", "qlx_levelfilter");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  HELD(QlxBasicFilterFProcess, with(filter, event, nullptr), nothing);
  HELD(QlxLevelFilterFIsLoggable, with(filter, event, nullptr), isZero, isZero, is(1));
  QlxFreeEvent(event);
  QlxReleaseObject(filter);
}

NULL_GROUP(Handlers) {
  const OpenToolkit toolkit;
  QlxObject *handler = QlxGetObject("quill.defaultConsole", nullptr);
  QlxObject *formatter = QlxGetObject("quill.defaultFormatter", nullptr);
  QlxSetObjProp(formatter, "dateTimeFormat", "''");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  NULLS_OF_BOTH(HandlerGetFormatter, with(nullptr), isZero);
  NULLS_OF_BOTH(
      HandlerSetFormatter, with(handler, formatter),
      [&] { EXPECT_EQ(handler->kind2.formatter, formatter); },
      [&] {
        EXPECT_EQ(handler->kind2.formatter, nullptr);
        QlxHandlerSetFormatter(handler, formatter);
      });
  NULLS_OF_BOTH(HandlerGetFmtHeader, with(nullptr), isZero);
  NULLS_OF_BOTH(HandlerGetFmtTrailer, with(nullptr), isZero);
  NULLS_OF_BOTH(UHandlerDoFmt, with(handler, event, nullptr), isZero, isZero,
                givesText(u"' text\n"));
  HELD(QlxBasicHandlerFProcess, with(handler, event, nullptr), nothing);
  HELD(QlxBasicHandlerFOpen, with(nullptr), nothing);
  HELD(QlxBasicHandlerFClose, with(nullptr), nothing);
  for (QlxObject *held : {handler, formatter}) QlxReleaseObject(held);
  QlxFreeEvent(event);
}

NULL_GROUP(ConsoleHandlers) {
  const OpenToolkit toolkit;
  QlxObject *handler = QlxGetObject("quill.defaultConsole", nullptr);
  QlxSetObjProp(handler->kind2.formatter, "dateTimeFormat", "''");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  CaptureStdout out;
  HELD(QlxConsoleHandlerFFreeVars, with(nullptr), nothing);
  HELD(QlxConsoleUHandlerFProcess, with(handler, event, nullptr), nothing);
  HELD(QlxConsoleHandlerFOpen, with(nullptr), nothing);
  HELD(QlxConsoleHandlerFClose, with(nullptr), nothing);
  EXPECT_EQ(out.bytes(), "' text\n\n");  // without arguments an event has its text
  QlxFreeEvent(event);
  QlxReleaseObject(handler);
}

NULL_GROUP(FileHandlers) {
  const TempDir dir;
  const OpenToolkit toolkit;
  QlxObject *handler = QlxGetObject("file", "qlx_filehandler");
  QlxSetObjProp(handler->kind2.formatter, "dateTimeFormat", "''");
  QlxSetObjProp(handler, "fileName", dir.path("app.log").c_str());
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  HELD(QlxFileHandlerFFreeVars, with(nullptr), nothing);
  HELD(QlxFileHandlerFCfgChange, with(handler, "fileName"), nothing);
  HELD(QlxFileUHandlerFProcess, with(handler, event, nullptr), nothing);
  HELD(QlxFileHandlerFOpen, with(nullptr), nothing);
  HELD(QlxFileHandlerFOpenWithErr, with(nullptr), is(kSuccess));
  HELD(QlxFileHandlerFClose, with(nullptr), nothing);
  EXPECT_EQ(event->status, kSuccess);
  EXPECT_EQ(dir.read("app.log"), "' text\n");
  QlxFreeEvent(event);
  QlxReleaseObject(handler);
}

NULL_GROUP(MultiProcessFileHandlers) {
  const TempDir dir;
  const OpenToolkit toolkit;
  QlxObject *handler = QlxGetObject("file", "qlx_multiproc_filehandler");
  QlxSetObjProp(handler->kind2.formatter, "dateTimeFormat", "''");
  const SemaphoreKey key;
  QlxSetObjProp(handler, "MPFileSemKey", key.text().c_str());
  QlxSetObjProp(handler, "fileName", dir.path("app.log").c_str());
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  HELD(QlxMultiProcFileUHandlerFProcess, with(handler, event, nullptr), nothing);
  HELD(QlxMultiProcFileHandlerFOpen, with(nullptr), nothing);
  HELD(QlxMultiProcFileHandlerFOpenWithErr, with(nullptr), is(kSuccess));
  HELD(QlxMultiProcFileHandlerFClose, with(nullptr), nothing);
  HELD(qlxIntlGetHandlerProblems, with(nullptr), nothing);
  EXPECT_EQ(event->status, kSuccess);
  EXPECT_EQ(dir.read("app.log"), "' text\n");
  QlxFreeEvent(event);
  QlxReleaseObject(handler);
}

NULL_GROUP(Formatters) {
  const OpenToolkit toolkit;
  QlxObject *formatter = QlxGetObject("quill.defaultFormatter", nullptr);
  QlxSetObjProp(formatter, "dateTimeFormat", "''");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  HELD(QlxBasicUFormatterFFormat, with(formatter, event, nullptr), isZero, isZero,
       givesText(u"' text\n"));
  HELD(QlxBasicFormatterFGetHeader, with(nullptr), isZero);
  HELD(QlxBasicFormatterFGetTrailer, with(nullptr), isZero);
  HELD(QlxBasicUFormatterFormatDate, with(formatter, 86400000.0 * 365),
       [](UChar *date) { EXPECT_EQ(take(date).substr(0, 8), u"1971-01-"); });
  QlxFreeEvent(event);
  QlxReleaseObject(formatter);
}

}  // namespace
