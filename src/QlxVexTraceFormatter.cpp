// The trace formatter: each event as one line of seven fields for tools that read trace files. Its
// class has no configuration change, so no key reaches its objects.
#include <qlx/class/formatter.h>

#include <cstring>

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
  const char *word;  // five characters
};

constexpr LevelWord kLevelWords[] = {
    {DEBUG_MAX, " MAX "}, {DEBUG_MID, " MID "}, {DEBUG_MIN, " MIN "}, {INFO, "INFO "},
    {WARN, "WARN "},      {ERROR, "ERROR"},     {FATAL, "ERROR"},
};

constexpr const char *kBetweenFields = " - ";
constexpr const char *kRecordSeparator = "\x1e";

}  // namespace

static const char *levelWord(int32_t level) {
  for (const LevelWord &row : kLevelWords) {
    if (row.level == level) return row.word;
  }
  return "OTHER";
}

static void appendShortHost(CxUStringBuff *line, const char *server) {
  if (!server) return;
  CxUStringBuffAppendStrN(line, server, static_cast<int32_t>(OslStringStrcspn(server, ".")));
}

// Deliberate: the thread is an unsigned 32-bit number, the process has the buffer's unsigned form.
static void appendProcessAndThread(CxUStringBuff *line, Event *event) {
  uint8_t hasProcess = 0, hasThread = 0;
  const int32_t process = QlxGetEventPropLong(event, "processId", &hasProcess);
  const int32_t thread = QlxGetEventPropLong(event, "threadId", &hasThread);
  if (hasProcess) {
    CxUStringBuffAppendStr(line, "p");
    CxUStringBuffAppendInt32(line, process);
  }
  if (hasProcess && hasThread) CxUStringBuffAppendStr(line, ":");
  if (hasThread) {
    CxUStringBuffAppendStr(line, "t");
    CxUStringBuffAppendUInt64(line, static_cast<uint32_t>(thread));
  }
}

static void appendSource(CxUStringBuff *line, Event *event) {
  const char *file = qlxPeekMapProp(event->props, "qlx_prop_srcfile");
  const char *function = qlxPeekMapProp(event->props, "qlx_prop_srcfunction");
  if (file) CxUStringBuffAppendStr(line, file);
  if (file && function) CxUStringBuffAppendStr(line, ":");
  if (function) CxUStringBuffAppendStr(line, function);
  uint8_t hasLine = 0;
  const int32_t number = QlxGetEventPropInt(event, "qlx_prop_srcline", &hasLine);
  if (!hasLine) return;
  CxUStringBuffAppendStr(line, "(");
  CxUStringBuffAppendInt32(line, number);
  CxUStringBuffAppendStr(line, ")");
}

static void appendMessageId(CxUStringBuff *line, const Event *event, const UChar *text) {
  const OwnedStr parsed{event->messageId ? nullptr : qlxPDXMLUGetMessageID(text)};
  CxUStringBuffAppendStr(line, event->messageId ? event->messageId : parsed.get());
}

UChar *QlxVexTraceUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  if (!isKind(formatter, Formatter) || !event) return nullptr;
  CxUStringBuff line{};
  CxUStringBuffAppendStr(&line, kRecordSeparator);
  CxUStringBuffAppendStr(&line, "[");
  qlxAppendHeldDate(&line, formatter->kind2.dateTimeFormat, event->time);
  CxUStringBuffAppendStr(&line, "]");
  CxUStringBuffAppendStr(&line, kBetweenFields);
  CxUStringBuffAppendStr(&line, levelWord(event->level));
  CxUStringBuffAppendStr(&line, kBetweenFields);
  appendShortHost(&line, qlxPeekMapProp(event->props, "server"));
  CxUStringBuffAppendStr(&line, kBetweenFields);
  appendProcessAndThread(&line, event);
  CxUStringBuffAppendStr(&line, kBetweenFields);
  appendSource(&line, event);
  CxUStringBuffAppendStr(&line, kBetweenFields);
  if (formatter->kind3.locale) qlxSetEventLocale(event, formatter->kind3.locale);
  const OwnedUStr text{QlxBindEventUMsg(event, qlxIntlBindUI18Msg, args)};
  appendMessageId(&line, event, text.get());
  CxUStringBuffAppendStr(&line, kBetweenFields);
  CxUStringBuffAppendUStr(&line, text.get());
  CxUStringBuffAppendStr(&line, "\n");
  return CxUStringBuffTakeUStr(&line);
}

const ObjClass qlxVexTraceFormatterClass = {
    .kind = Formatter,
    .name = "qlx_vextraceformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxVexTraceUFormatterFFormat},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
};
