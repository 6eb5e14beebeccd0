// The basic formatter: an event as one line of text: time, source location, product properties and
// message. Its operations are the defaults of every formatter class.
#include <qlx/class/formatter.h>

#include <qlx/buffers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxClasses.h"
#include "QlxConfigKeys.h"
#include "QlxHeldFormats.h"
#include "QlxI18Msg.h"
#include "QlxObject.h"
#include "QlxProps.h"

static constexpr const char *kDefaultSeparator = " ";

// Properties of an event, in the order in which a line has them; the line number stands between.
static constexpr const char *kSourceKeys[] = {"qlx_prop_srcfile", "qlx_prop_srcfunction"};
static constexpr const char *kSourceLineKey = "qlx_prop_srcline";
static constexpr const char *kProductKeys[] = {"organization", "product", "component", "client",
                                               "server"};

// Replaces a setting by the object's property; an empty value is kept as such.
template <auto Setting>
static void applySetting(QlxObject *formatter, const char *key) {
  char *&setting = Setting(formatter);
  OslMemoryFree(setting);
  setting = qlxIntlGetObjProp(formatter, key, nullptr);
}

static char *&separatorOf(QlxObject *formatter) {
  return formatter->kind1.separator;
}
static char *&dateTimeFormatOf(QlxObject *formatter) {
  return formatter->kind2.dateTimeFormat;
}
static char *&localeOf(QlxObject *formatter) {
  return formatter->kind3.locale;
}

static constexpr ConfigKey kFormatterKeys[] = {
    {"separator", applySetting<separatorOf>},
    {"dateTimeFormat", applySetting<dateTimeFormatOf>},
    {"locale", applySetting<localeOf>},
};

void QlxBasicFormatterFCfgChange(QlxObject *formatter, const char *key) {
  if (!formatter || !key) return;
  // Objects of other kinds keep other things where a formatter has its settings.
  if (isKind(formatter, Formatter) && qlxApplyConfigKey(kFormatterKeys, formatter, key)) return;
  QlxBasicObjectFCfgChange(formatter, key);
}

// Appends a value, unless it is absent, and the separator after it.
static void appendField(CxUStringBuff *line, const char *value, const char *separator) {
  if (!value) return;
  CxUStringBuffAppendStr(line, value);
  CxUStringBuffAppendStr(line, separator);
}

static void appendLineNumber(CxUStringBuff *line, const char *value, const char *separator) {
  uint8_t isNumber = 0;
  const int32_t number = qlxPropStrToInt32(value, &isNumber);
  if (!isNumber) return;
  CxUStringBuffAppendInt32(line,
                           number);  // Deliberate: a negative one has its unsigned 64-bit form
  CxUStringBuffAppendStr(line, separator);
}

static void appendProperties(CxUStringBuff *line, const Event *event, const char *separator) {
  const StringToStringMap *props = event->props;
  if (!props) return;
  for (const char *key : kSourceKeys) appendField(line, qlxPeekMapProp(props, key), separator);
  appendLineNumber(line, qlxPeekMapProp(props, kSourceLineKey), separator);
  for (const char *key : kProductKeys) appendField(line, qlxPeekMapProp(props, key), separator);
}

// Binds the event's message; the library's own binder writes straight into the line.
static void appendMessage(CxUStringBuff *line, Event *event, fBindMsg bind, va_list *args) {
  if (bind != qlxIntlBindUI18Msg) {
    const OwnedUStr text{QlxBindEventUMsg(event, bind, args)};
    if (text) CxUStringBuffAppendUStr(line, text.get());
    return;
  }
  if (event->locale) qlxSetI18MsgLocale(event->message, event->locale);
  qlxIntlBindI18MsgTo(event->message, args, line);
}

// Null for an object of another kind, which keeps something else in the same place.
static const char *datePatternOf(const QlxObject *formatter) {
  const bool isOther = formatter && formatter->objClass && formatter->objClass->kind != Formatter;
  return formatter && !isOther ? formatter->kind2.dateTimeFormat : nullptr;
}

UChar *QlxBasicUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  if (!event || !isKind(formatter, Formatter)) return nullptr;
  const fBindMsg bind = formatter->objClass->op4.fBindMsg;
  if (!bind) return nullptr;
  const char *separator = separatorOf(formatter) ? separatorOf(formatter) : kDefaultSeparator;

  CxUStringBuff line{};
  qlxAppendHeldDate(&line, datePatternOf(formatter), event->time);
  CxUStringBuffAppendStr(&line, separator);
  appendProperties(&line, event, separator);
  // Deliberate: the locale stays on the event, and what formats the event later binds in it too.
  if (localeOf(formatter)) qlxSetEventLocale(event, localeOf(formatter));
  appendMessage(&line, event, bind, args);
  CxUStringBuffAppendStr(&line, "\n");
  return CxUStringBuffTakeUStr(&line);
}

char *QlxBasicFormatterFGetHeader(QlxObject *) {
  return nullptr;
}

char *QlxBasicFormatterFGetTrailer(QlxObject *) {
  return nullptr;
}

UChar *QlxBasicUFormatterFormatDate(QlxObject *formatter, double time) {
  CxUStringBuff text{};
  if (qlxAppendHeldDate(&text, datePatternOf(formatter), time)) return CxUStringBuffTakeUStr(&text);
  CxUStringBuffDiscard(&text);
  return nullptr;
}

const ObjClass qlxBasicFormatterClass = {
    .kind = Formatter,
    .name = "qlx_basicformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxBasicUFormatterFFormat},
    .op2 = {.fGetHeader = QlxBasicFormatterFGetHeader},
    .op3 = {.fGetTrailer = QlxBasicFormatterFGetTrailer},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
    .fCfgChange = QlxBasicFormatterFCfgChange,
};
