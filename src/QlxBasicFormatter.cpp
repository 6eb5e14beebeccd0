// The basic formatter: an event as one line of text: time, source location, product properties and
// message. Its operations are the defaults of every formatter class.
#include "QlxBasicFormatter.h"

#include <string_view>

#include <qlx/class/formatter.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxEvent.h"
#include "object/QlxClasses.h"
#include "object/QlxConfigKeys.h"
#include "object/QlxObjClass.h"
#include "object/QlxObjectFields.h"
#include "object/QlxOperation.h"
#include "record/QlxEventValues.h"
#include "record/QlxFormatted.h"
#include "record/QlxRecordText.h"
#include "util/CxOwned.h"

static constexpr std::string_view kDefaultSeparator = " ";

// Properties of an event, in the order in which a line has them.
static constexpr EventKey kLineKeys[] = {
    EventKey::kSourceFile,   EventKey::kSourceFunction, EventKey::kSourceLine,
    EventKey::kOrganization, EventKey::kProduct,        EventKey::kComponent,
    EventKey::kClient,       EventKey::kServer,
};

// ---- Settings

// Null for a host's class, which may have variables of its own, and for an object of another kind.
static QlxFormatterVars *varsOf(const QlxObject *formatter) {
  const bool isOwn = isKind(formatter, Formatter) && formatter->objClass->own;
  return isOwn ? static_cast<QlxFormatterVars *>(formatter->vars) : nullptr;
}

static void *allocVars(void) {
  return OslMemoryCalloc(1, sizeof(QlxFormatterVars));
}

static void applyUtc(QlxObject *formatter, const char *key) {
  if (QlxFormatterVars *vars = varsOf(formatter))
    vars->isUtc = qlxIntlGetObjPropBool(formatter, key, nullptr);  // absent: 0
}

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
    {"utc", applyUtc},
};

void QlxBasicFormatterFCfgChange(QlxObject *formatter, const char *key) {
  if (!formatter || !key) return;
  // Objects of other kinds keep other things where a formatter has its settings.
  if (isKind(formatter, Formatter) && qlxApplyConfigKey(kFormatterKeys, formatter, key)) return;
  QlxBasicObjectFCfgChange(formatter, key);
}

DateStyle qlxDateStyleOf(const QlxObject *formatter) {
  if (!isKind(formatter, Formatter)) return {};
  const QlxFormatterVars *vars = varsOf(formatter);
  return {formatter->kind2.dateTimeFormat, vars && vars->isUtc == 1};
}

// ---- A line

static void appendProperties(RecordText &line, const Event *event, std::string_view separator) {
  const EventValues values = qlxFindEventValues(event);
  for (const EventKey key : kLineKeys) {
    if (key == EventKey::kSourceLine) {
      if (values.sourceLine) line.number(*values.sourceLine).value(separator);
    } else if (values[key]) {
      line.value(values[key]).value(separator);
    }
  }
}

// By the class's own binder, where a host's class has one.
static void appendMessage(RecordText &line, const ObjClass *objClass, Event *event, va_list *args) {
  if (objClass->own) {
    line.message(event, args);
    return;
  }
  qlxUseEventLocale(event);
  const OwnedUStr text{
      qlxCall({objClass, "fBindMsg"}, objClass->op4.fBindMsg, event->message, args)};
  if (text) line << std::u16string_view{text.get()};
}

static bool appendEvent(QlxObject *formatter, Event *event, va_list *args, RecordText &line) {
  if (!event || !isKind(formatter, Formatter) || !formatter->objClass->op4.fBindMsg) return false;
  const char *own = separatorOf(formatter);
  const std::string_view separator = own ? std::string_view{own} : kDefaultSeparator;
  qlxUseFormatterLocale(event, localeOf(formatter));
  line.leaveOutFor(event);
  line.date(qlxDateStyleOf(formatter), event->time).value(separator);
  appendProperties(line, event, separator);
  appendMessage(line, formatter->objClass, event, args);
  line << "\n";
  return line.isWhole() && !line.isEmpty();
}

UChar *QlxBasicUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  return qlxFormatNew(formatter, event, args, appendEvent);
}

char *QlxBasicFormatterFGetHeader(QlxObject *) {
  return nullptr;
}

char *QlxBasicFormatterFGetTrailer(QlxObject *) {
  return nullptr;
}

UChar *QlxBasicUFormatterFormatDate(QlxObject *formatter, double time) {
  CxUStringBuff text{};
  if (qlxAppendCachedDate(&text, qlxDateStyleOf(formatter), time))
    return CxUStringBuffTakeUStr(&text);
  CxUStringBuffDiscard(&text);
  return nullptr;
}

static constexpr QlxOwnClass kOwn = {.takesNotes = true, .append = appendEvent};

const ObjClass qlxBasicFormatterClass = {
    .kind = Formatter,
    .name = "qlx_basicformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxBasicUFormatterFFormat},
    .op2 = {.fGetHeader = QlxBasicFormatterFGetHeader},
    .op3 = {.fGetTrailer = QlxBasicFormatterFGetTrailer},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
    .fAllocVars = allocVars,
    .fFreeVars = OslMemoryFree,
    .fCfgChange = QlxBasicFormatterFCfgChange,
    .own = &kOwn,
};
