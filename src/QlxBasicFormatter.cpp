// The basic formatter: an event as one line of text: time, source location, product properties and
// message. Its operations are the defaults of every formatter class.
#include <qlx/class/formatter.h>

#include <string_view>

#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "object/QlxClasses.h"
#include "object/QlxConfigKeys.h"
#include "record/QlxEventValues.h"
#include "record/QlxFormatted.h"
#include "text/QlxFormatCache.h"
#include "QlxI18Msg.h"
#include "record/QlxLoggedEvent.h"
#include "QlxObject.h"
#include "object/QlxOperation.h"
#include "util/CxDecimal.h"
#include "util/CxUStringBuff.h"
#include "util/CxUnits.h"

static constexpr std::string_view kDefaultSeparator = " ";

// Properties of an event, in the order in which a line has them.
static constexpr EventKey kLineKeys[] = {
    EventKey::kSourceFile,   EventKey::kSourceFunction, EventKey::kSourceLine,
    EventKey::kOrganization, EventKey::kProduct,        EventKey::kComponent,
    EventKey::kClient,       EventKey::kServer,
};

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

// ---- A line, written in one of two ways: as UTF-16, or straight as bytes while all of it is ASCII

namespace {

// What cannot be appended, for want of memory, is left out, and the event tells of it.
class WideLine {
 public:
  WideLine(CxUStringBuff *text, Event *event) : text_(text), event_(event) {}

  bool append(std::string_view text) { return orMiss(cxUStringBuffAppend(text_, text)); }

  bool appendDate(const char *pattern, double time) {
    return orMiss(qlxAppendCachedDate(text_, pattern, time));
  }

  bool appendNumber(uint64_t number) { return orMiss(CxUStringBuffAppendUInt64(text_, number)); }

  // The library's own binder writes straight into the line.
  bool appendMessage(Event *event, const ObjClass *binder, va_list *args) {
    const fBindMsg bind = binder->op4.fBindMsg;
    if (bind != qlxIntlBindUI18Msg) {
      qlxSettleEvent(event);
      qlxUseEventLocale(event);
      const OwnedUStr text{qlxCall({binder, "fBindMsg"}, bind, event->message, args)};
      return !text || orMiss(CxUStringBuffAppendUStr(text_, text.get()));
    }
    qlxUseEventLocale(event);
    qlxIntlBindI18MsgTo(event->message, args, text_);
    return true;
  }

 private:
  bool orMiss(uint8_t appended) {
    if (!appended) qlxMissMemory(event_);
    return true;
  }

  CxUStringBuff *text_;
  Event *event_;
};

class AsciiLine {
 public:
  explicit AsciiLine(CxAsciiLine *line) : line_(line) {}

  bool append(std::string_view text) { return line_->append(text); }

  bool appendDate(const char *pattern, double time) {
    return qlxAppendCachedDateAscii(line_, pattern, time);
  }

  bool appendNumber(uint64_t number) {
    char digits[kMaxDecimalDigits];
    char *const end = digits + kMaxDecimalDigits;
    const char *first = cxDecimalBefore(end, number, '0');
    return line_->append({first, static_cast<size_t>(end - first)});
  }

  bool appendMessage(Event *event, const ObjClass *binder, va_list *args) {
    if (binder->op4.fBindMsg != qlxIntlBindUI18Msg) return false;
    I18Msg *message = event->message;
    qlxUseEventLocale(event);
    if (message && !message->bundle && message->text) {
      const size_t units = cxUnitsLength(message->text);
      if (line_->append(message->text, units, QlxPatternSyntax{})) return true;
    }
    CachedBuffer text;
    qlxIntlBindI18MsgTo(message, args, text.get());
    return line_->append(text.get()->data, text.get()->length);
  }

 private:
  CxAsciiLine *line_;
};

}  // namespace

template <typename Line>
static bool appendProperties(Line &line, const Event *event, std::string_view separator) {
  const EventValues values = qlxFindEventValues(event);
  for (const EventKey key : kLineKeys) {
    const bool isLine = key == EventKey::kSourceLine;
    if (isLine ? !values.sourceLine : !values[key]) continue;
    // Deliberate: a negative number has its unsigned 64-bit form.
    const bool appended =
        isLine ? line.appendNumber(static_cast<uint64_t>(int64_t{*values.sourceLine}))
               : line.append(values[key]);
    if (!appended || !line.append(separator)) return false;
  }
  return true;
}

// Null for an object of another kind, which keeps something else in the same place.
static const char *datePatternOf(const QlxObject *formatter) {
  const bool isOther = formatter && formatter->objClass && formatter->objClass->kind != Formatter;
  return formatter && !isOther ? formatter->kind2.dateTimeFormat : nullptr;
}

template <typename Line>
static bool appendEvent(Line line, QlxObject *formatter, Event *event, va_list *args) {
  if (!event || !isKind(formatter, Formatter)) return false;
  const ObjClass *binder = formatter->objClass;
  if (!binder->op4.fBindMsg) return false;
  const char *own = separatorOf(formatter);
  const std::string_view separator = own ? std::string_view{own} : kDefaultSeparator;
  qlxUseFormatterLocale(event, localeOf(formatter));
  return line.appendDate(datePatternOf(formatter), event->time) && line.append(separator) &&
         appendProperties(line, event, separator) && line.appendMessage(event, binder, args) &&
         line.append("\n");
}

uint8_t qlxBasicFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                CxUStringBuff *text) {
  return appendEvent(WideLine{text, event}, formatter, event, args) && text->length > 0;
}

bool qlxBasicFormatterAppendAscii(QlxObject *formatter, Event *event, va_list *args,
                                  CxAsciiLine *line) {
  return appendEvent(AsciiLine{line}, formatter, event, args);
}

UChar *QlxBasicUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  return qlxFormatNew(qlxBasicFormatterAppend, formatter, event, args);
}

char *QlxBasicFormatterFGetHeader(QlxObject *) {
  return nullptr;
}

char *QlxBasicFormatterFGetTrailer(QlxObject *) {
  return nullptr;
}

UChar *QlxBasicUFormatterFormatDate(QlxObject *formatter, double time) {
  CxUStringBuff text{};
  if (qlxAppendCachedDate(&text, datePatternOf(formatter), time))
    return CxUStringBuffTakeUStr(&text);
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
