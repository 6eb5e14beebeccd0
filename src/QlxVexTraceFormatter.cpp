// The trace formatter: each event as one line of seven fields for tools that read trace files. Its
// class has no configuration change, so no key reaches its objects.
#include <qlx/class/formatter.h>

#include <algorithm>
#include <iterator>

#include <qlx/buffers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/class/msgid.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxClasses.h"
#include "QlxHeldFormats.h"
#include "QlxObject.h"
#include "QlxProps.h"

namespace {

struct LevelWord {
  int32_t level;
  const UChar *word;  // five characters
};

constexpr LevelWord kLevelWords[] = {
    {DEBUG_MAX, u" MAX "}, {DEBUG_MID, u" MID "}, {DEBUG_MIN, u" MIN "}, {INFO, u"INFO "},
    {WARN, u"WARN "},      {ERROR, u"ERROR"},     {FATAL, u"ERROR"},
};

// What a line is made from.
struct Record {
  QlxObject *formatter;
  Event *event;
  const UChar *text;  // the bound message, or null
};

}  // namespace

static void appendTime(CxUStringBuff *line, const Record &record) {
  CxUStringBuffAppendUStr(line, u"[");
  qlxAppendHeldDate(line, record.formatter->kind2.dateTimeFormat, record.event->time);
  CxUStringBuffAppendUStr(line, u"]");
}

static void appendLevel(CxUStringBuff *line, const Record &record) {
  const auto *row = std::ranges::find(kLevelWords, record.event->level, &LevelWord::level);
  CxUStringBuffAppendUStr(line, row != std::end(kLevelWords) ? row->word : u"OTHER");
}

// Up to the first dot.
static void appendShortHost(CxUStringBuff *line, const Record &record) {
  const char *server = qlxPeekMapProp(record.event->props, "server");
  if (!server) return;
  CxUStringBuffAppendStrN(line, server, static_cast<int32_t>(OslStringStrcspn(server, ".")));
}

// Deliberate: the thread is an unsigned 32-bit number, the process has the buffer's unsigned form.
static void appendProcessAndThread(CxUStringBuff *line, const Record &record) {
  uint8_t hasProcess = 0, hasThread = 0;
  const int32_t process = QlxGetEventPropLong(record.event, "processId", &hasProcess);
  const int32_t thread = QlxGetEventPropLong(record.event, "threadId", &hasThread);
  if (hasProcess) {
    CxUStringBuffAppendUStr(line, u"p");
    CxUStringBuffAppendInt32(line, process);
  }
  if (hasProcess && hasThread) CxUStringBuffAppendUStr(line, u":");
  if (hasThread) {
    CxUStringBuffAppendUStr(line, u"t");
    CxUStringBuffAppendUInt64(line, static_cast<uint32_t>(thread));
  }
}

static void appendSource(CxUStringBuff *line, const Record &record) {
  const char *file = qlxPeekMapProp(record.event->props, "qlx_prop_srcfile");
  const char *function = qlxPeekMapProp(record.event->props, "qlx_prop_srcfunction");
  if (file) CxUStringBuffAppendStr(line, file);
  if (file && function) CxUStringBuffAppendUStr(line, u":");
  if (function) CxUStringBuffAppendStr(line, function);
  uint8_t hasLine = 0;
  const int32_t number = QlxGetEventPropInt(record.event, "qlx_prop_srcline", &hasLine);
  if (!hasLine) return;
  CxUStringBuffAppendUStr(line, u"(");
  CxUStringBuffAppendInt32(line, number);
  CxUStringBuffAppendUStr(line, u")");
}

// An event that has an identifier, be it empty, is not looked at for one.
static void appendMessageId(CxUStringBuff *line, const Record &record) {
  const char *own = record.event->messageId;
  const OwnedStr parsed{own ? nullptr : qlxPDXMLUGetMessageID(record.text)};
  CxUStringBuffAppendStr(line, own ? own : parsed.get());
}

static void appendText(CxUStringBuff *line, const Record &record) {
  CxUStringBuffAppendUStr(line, record.text);
}

// The fields of every line, empty or not, in their order.
static constexpr void (*kFields[])(CxUStringBuff *line, const Record &record) = {
    appendTime,   appendLevel,     appendShortHost, appendProcessAndThread,
    appendSource, appendMessageId, appendText,
};

UChar *QlxVexTraceUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  if (!isKind(formatter, Formatter) || !event) return nullptr;
  if (formatter->kind3.locale) qlxSetEventLocale(event, formatter->kind3.locale);
  const OwnedUStr text{QlxBindEventUMsg(event, qlxIntlBindUI18Msg, args)};

  CxUStringBuff line{};
  const UChar *before = u"\x1e";  // a record separator (U+001E), then what stands between fields
  for (const auto append : kFields) {
    CxUStringBuffAppendUStr(&line, before);
    append(&line, {formatter, event, text.get()});
    before = u" - ";
  }
  CxUStringBuffAppendUStr(&line, u"\n");
  return CxUStringBuffTakeUStr(&line);
}

const ObjClass qlxVexTraceFormatterClass = {
    .kind = Formatter,
    .name = "qlx_vextraceformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxVexTraceUFormatterFFormat},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
};
