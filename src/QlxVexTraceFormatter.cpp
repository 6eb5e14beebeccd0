// The trace formatter: each event as one line of seven fields for tools that read trace files. Its
// class has no configuration change, so no key reaches its objects.
#include <qlx/class/formatter.h>

#include <algorithm>
#include <iterator>

#include <qlx/buffers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxClasses.h"
#include "QlxFormatted.h"
#include "QlxHeldFormats.h"
#include "QlxMsgId.h"
#include "QlxObject.h"
#include "QlxProps.h"
#include "QlxRecordText.h"
#include "util/CxOwned.h"

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

static void appendTime(RecordText &line, const Record &record) {
  line << u"[";
  line.by(qlxAppendHeldDate, record.formatter->kind2.dateTimeFormat, record.event->time) << u"]";
}

static void appendLevel(RecordText &line, const Record &record) {
  const auto *row = std::ranges::find(kLevelWords, record.event->level, &LevelWord::level);
  line << (row != std::end(kLevelWords) ? row->word : u"OTHER");
}

// Up to the first dot.
static void appendShortHost(RecordText &line, const Record &record) {
  const char *server = qlxPeekMapProp(record.event->props, "server");
  if (!server) return;
  line.by(CxUStringBuffAppendStrN, server, static_cast<int32_t>(OslStringStrcspn(server, ".")));
}

// Deliberate: the thread is an unsigned 32-bit number, the process has the buffer's unsigned form.
static void appendProcessAndThread(RecordText &line, const Record &record) {
  uint8_t hasProcess = 0, hasThread = 0;
  const int32_t process = QlxGetEventPropLong(record.event, "processId", &hasProcess);
  const int32_t thread = QlxGetEventPropLong(record.event, "threadId", &hasThread);
  if (hasProcess) (line << u"p").by(CxUStringBuffAppendInt32, process);
  if (hasProcess && hasThread) line << u":";
  if (hasThread) (line << u"t").by(CxUStringBuffAppendUInt64, static_cast<uint32_t>(thread));
}

static void appendSource(RecordText &line, const Record &record) {
  const char *file = qlxPeekMapProp(record.event->props, "qlx_prop_srcfile");
  const char *function = qlxPeekMapProp(record.event->props, "qlx_prop_srcfunction");
  line << file << (file && function ? u":" : u"") << function;
  uint8_t hasLine = 0;
  const int32_t number = QlxGetEventPropInt(record.event, "qlx_prop_srcline", &hasLine);
  if (hasLine) (line << u"(").by(CxUStringBuffAppendInt32, number) << u")";
}

// An event that has an identifier, be it empty, is not looked at for one.
static void appendMessageId(RecordText &line, const Record &record) {
  const char *own = record.event->messageId;
  line << (own ? own : qlxMessageIdOf(record.text).text);
}

static void appendText(RecordText &line, const Record &record) {
  line << record.text;
}

// The fields of every line, empty or not, in their order.
static constexpr void (*kFields[])(RecordText &line, const Record &record) = {
    appendTime,   appendLevel,     appendShortHost, appendProcessAndThread,
    appendSource, appendMessageId, appendText,
};

uint8_t qlxVexTraceFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                   CxUStringBuff *record) {
  if (!isKind(formatter, Formatter) || !event) return 0;
  if (formatter->kind3.locale) qlxSetEventLocale(event, formatter->kind3.locale);
  const BoundText text{event, args};
  RecordText line(record);
  const UChar *before = u"\x1e";  // a record separator (U+001E), then what stands between fields
  for (const auto append : kFields) {
    line << before;
    append(line, {formatter, event, text.get()});
    before = u" - ";
  }
  line << u"\n";
  return record->data != nullptr;
}

UChar *QlxVexTraceUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  return qlxFormatNew(qlxVexTraceFormatterAppend, formatter, event, args);
}

const ObjClass qlxVexTraceFormatterClass = {
    .kind = Formatter,
    .name = "qlx_vextraceformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxVexTraceUFormatterFFormat},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
};
