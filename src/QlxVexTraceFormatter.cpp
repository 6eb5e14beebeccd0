// The trace formatter: each event as one line of seven fields for tools that read trace files. Its
// class has no configuration change, so no key reaches its objects.
#include <qlx/class/formatter.h>

#include <cstring>
#include <string_view>

#include <qlx/class/message.h>
#include <qlx/event.h>

#include "QlxEvent.h"
#include "QlxLevel.h"
#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "object/QlxObjectFields.h"
#include "record/QlxBoundText.h"
#include "record/QlxEventValues.h"
#include "record/QlxFormatted.h"
#include "record/QlxMsgId.h"
#include "record/QlxRecordText.h"

using namespace std::string_view_literals;

namespace {

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
  line.date({record.formatter->kind2.dateTimeFormat, false}, record.event->time) << "]"sv;
}

// In a column of five characters.
static void appendLevel(RecordText &line, const Record &record) {
  const std::string_view word = qlxLevelWord(record.event->level);
  if (word.size() == 3) line << " "sv;
  line << word;
  if (word.size() < 5) line << " "sv;
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

static bool appendLine(QlxObject *formatter, Event *event, va_list *args, RecordText &line) {
  if (!isKind(formatter, Formatter) || !event) return false;
  qlxUseFormatterLocale(event, formatter->kind3.locale);
  BoundText bound;
  const std::u16string_view text = bound.bind(event, args);
  const Record record{formatter, event, text, qlxFindEventValues(event)};
  std::string_view before = "\x1e";  // a record separator (U+001E), then what is between fields
  for (const auto append : kFields) {
    line << before;
    append(line, record);
    before = " - ";
  }
  line << "\n"sv;
  return line.isWholeFor(event);
}

UChar *QlxVexTraceUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  return qlxFormatNew(formatter, event, args, appendLine);
}

static constexpr QlxOwnClass kOwn = {.takesNotes = true, .append = appendLine};

const ObjClass qlxVexTraceFormatterClass = {
    .kind = Formatter,
    .name = "qlx_vextraceformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxVexTraceUFormatterFFormat},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
    .own = &kOwn,
};
