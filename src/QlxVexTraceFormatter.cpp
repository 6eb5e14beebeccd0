// The trace formatter: each event as one line of seven fields for tools that read trace files. Its
// class has no configuration change, so no key reaches its objects.
#include <qlx/class/formatter.h>

#include <algorithm>
#include <cstring>
#include <iterator>
#include <string_view>

#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/event.h>

#include "object/QlxClasses.h"
#include "record/QlxEventValues.h"
#include "record/QlxFormatted.h"
#include "QlxI18Msg.h"
#include "record/QlxMsgId.h"
#include "QlxObject.h"
#include "record/QlxRecordText.h"

using namespace std::string_view_literals;

namespace {

struct LevelWord {
  int32_t level;
  std::string_view word;  // five characters
};

constexpr LevelWord kLevelWords[] = {
    {DEBUG_MAX, " MAX "}, {DEBUG_MID, " MID "}, {DEBUG_MIN, " MIN "}, {INFO, "INFO "},
    {WARN, "WARN "},      {ERROR, "ERROR"},     {FATAL, "ERROR"},
};

// What a line is made from.
struct Record {
  const QlxObject *formatter;
  const Event *event;
  std::u16string_view text;  // the bound message
  EventValues values;
};

}  // namespace

static void appendTime(RecordText &line, const Record &record) {
  line << "["sv;
  line.date(record.formatter->kind2.dateTimeFormat, record.event->time) << "]"sv;
}

static void appendLevel(RecordText &line, const Record &record) {
  const auto *row = std::ranges::find(kLevelWords, record.event->level, &LevelWord::level);
  line << (row != std::end(kLevelWords) ? row->word : "OTHER"sv);
}

// Up to the first dot.
static void appendShortHost(RecordText &line, const Record &record) {
  const char *server = record.values[EventKey::kServer];
  if (server) line.value(std::string_view{server, std::strcspn(server, ".")});
}

static void appendProcessAndThread(RecordText &line, const Record &record) {
  const auto process = qlxProcessOf(record.values);
  const auto thread = qlxThreadOf(record.values);
  if (process) (line << "p"sv).number(*process);
  if (process && thread) line << ":"sv;
  if (thread) (line << "t"sv).number(*thread);
}

static void appendSource(RecordText &line, const Record &record) {
  const char *file = record.values[EventKey::kSourceFile];
  const char *function = record.values[EventKey::kSourceFunction];
  line.value(file);
  if (file && function) line << ":"sv;
  line.value(function);
  if (record.values.sourceLine) (line << "("sv).number(*record.values.sourceLine) << ")"sv;
}

// An event that has an identifier, be it empty, is not looked at for one.
static void appendMessageId(RecordText &line, const Record &record) {
  const char *own = record.event->messageId;
  line.value(own ? own : qlxMessageIdOfText(record.text).text);
}

static void appendText(RecordText &line, const Record &record) {
  line << record.text;
}

// The fields of every line, empty or not, in their order.
static constexpr void (*kFields[])(RecordText &line, const Record &record) = {
    appendTime,   appendLevel,     appendShortHost, appendProcessAndThread,
    appendSource, appendMessageId, appendText,
};

static bool appendLine(RecordText line, QlxObject *formatter, Event *event, va_list *args) {
  if (!isKind(formatter, Formatter) || !event) return false;
  qlxUseFormatterLocale(event, formatter->kind3.locale);
  const BoundText text{event, args};
  const Record record{formatter, event, text.get(), qlxFindEventValues(event)};
  std::string_view before = "\x1e";  // a record separator (U+001E), then what is between fields
  for (const auto append : kFields) {
    line << before;
    append(line, record);
    before = " - ";
  }
  line << "\n"sv;
  return line.isWholeFor(event);
}

uint8_t qlxVexTraceFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                   CxUStringBuff *record) {
  return appendLine(RecordText{record}, formatter, event, args);
}

bool qlxVexTraceFormatterAppendAscii(QlxObject *formatter, Event *event, va_list *args,
                                     CxAsciiLine *line) {
  return appendLine(RecordText{line}, formatter, event, args);
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
