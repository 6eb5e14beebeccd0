// The XML formatter: each event as one Message or Trace element.
#include <qlx/class/containers.h>
#include <qlx/class/formatter.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxBasicFormatter.h"
#include "QlxEvent.h"
#include "QlxLevel.h"
#include "object/QlxClasses.h"
#include "object/QlxConfigKeys.h"
#include "object/QlxObjClass.h"
#include "object/QlxObjectFields.h"
#include "record/QlxBoundText.h"
#include "record/QlxFormatted.h"
#include "record/QlxMsgId.h"
#include "record/QlxPDXMLElements.h"

using namespace std::string_view_literals;

namespace {

struct PDXMLVars : QlxFormatterVars {
  uint8_t firstRecord;      // 1 at first and after each header: the next record has the preamble
  uint8_t singleComponent;  // these four: 1 writes the element once, in the preamble
  uint8_t singleProduct;
  uint8_t singleProductId;
  uint8_t singleServer;
  uint8_t forceAsMessage;  // one alone decides the kind of every record
  uint8_t forceAsTrace;
};

}  // namespace

static bool appendRecord(QlxObject *formatter, Event *event, va_list *args, RecordText &out);

static constexpr QlxOwnClass kOwn = {.takesNotes = true, .append = appendRecord};

// Null for an object of another kind or class of the library, which has something else in the same
// place.
static PDXMLVars *varsOf(QlxObject *formatter) {
  if (!isKind(formatter, Formatter)) return nullptr;
  const QlxOwnClass *own = formatter->objClass->own;
  return own && own != &kOwn ? nullptr : static_cast<PDXMLVars *>(formatter->vars);
}

void *QlxPDXMLFormatterFAllocVars(void) {
  auto *vars = static_cast<PDXMLVars *>(OslMemoryCalloc(1, sizeof(PDXMLVars)));
  if (vars) vars->firstRecord = 1;
  return vars;
}

void QlxPDXMLFormatterFFreeVars(void *vars) {
  OslMemoryFree(vars);
}

template <uint8_t PDXMLVars::*Flag>
static void applyFlag(QlxObject *formatter, const char *key) {
  if (PDXMLVars *vars = varsOf(formatter))
    vars->*Flag = qlxIntlGetObjPropBool(formatter, key, nullptr);  // absent: 0
}

static constexpr ConfigKey kXmlFormatterKeys[] = {
    {"singleComponent", applyFlag<&PDXMLVars::singleComponent>},
    {"singleProduct", applyFlag<&PDXMLVars::singleProduct>},
    {"singleProductId", applyFlag<&PDXMLVars::singleProductId>},
    {"singleServer", applyFlag<&PDXMLVars::singleServer>},
    {"forceAsMessage", applyFlag<&PDXMLVars::forceAsMessage>},
    {"forceAsTrace", applyFlag<&PDXMLVars::forceAsTrace>},
};

void QlxPDXMLFormatterFCfgChange(QlxObject *formatter, const char *key) {
  if (!formatter || !key) return;
  if (!qlxApplyConfigKey(kXmlFormatterKeys, formatter, key)) {
    QlxBasicFormatterFCfgChange(formatter, key);
  }
}

char *QlxPDXMLFormatterFGetHeader(QlxObject *formatter) {
  if (PDXMLVars *vars = varsOf(formatter)) vars->firstRecord = 1;
  return nullptr;
}

char *QlxPDXMLFormatterFGetTrailer(QlxObject *) {
  return nullptr;
}

// ---- A record

static bool isMessage(const PDXMLVars *vars, const Event *event) {
  if (vars->forceAsMessage == vars->forceAsTrace) return event->isMessage;
  return vars->forceAsMessage;
}

// The product elements whose flags say `single`: 1 for the preamble, 0 for each record.
static ProductElements productsOf(const PDXMLVars *vars, uint8_t single) {
  return {vars->singleComponent == single, vars->singleProduct == single,
          vars->singleProductId == single, vars->singleServer == single};
}

static void appendId(RecordText &out, const Event *event, std::u16string_view text) {
  const MessageId parsed = event->messageId ? MessageId{} : qlxMessageIdOfText(text);
  // An empty identifier of the event's own says that there is none.
  const char *id = event->messageId ? event->messageId : parsed.text;
  if (*id) {
    out.value(id);
  } else {
    out << "None"sv;
  }
}

static void appendStart(RecordText &out, const Event *event, std::u16string_view text,
                        bool asMessage) {
  const bool hasLevel = event->level != UNSPECIFIED;
  if (asMessage) {
    out << "<Message Id=\""sv;
    appendId(out, event, text);
    if (hasLevel) out << "\" Severity=\""sv;
  } else {
    out << (hasLevel ? "<Trace Level=\""sv : "<Trace"sv);
  }
  if (hasLevel) out << qlxLevelWord(event->level);
  out << (asMessage || hasLevel ? "\">\n"sv : ">\n"sv);
}

static void appendTime(RecordText &out, const QlxObject *formatter, double time) {
  out << " <Time Millis=\""sv;
  out.number(kWholeNumber, time) << "\">"sv;
  out.date(qlxDateStyleOf(formatter), time) << "</Time>\n"sv;
}

static void appendFreeAttributes(RecordText &out, const Event *event, const EventValues &values) {
  if (!values.has(EventKey::kNone) && !values.has(EventKey::kOrganization)) return;
  out << " <LogAttribs>"sv;
  for (const auto *it = event->props->head; it; it = it->next) {
    if (!qlxPDXMLIsFree(qlxEventKeyOf(it->key))) continue;
    (out << "<Key>"sv).value(it->key) << "</Key><Value>"sv;
    out.value(it->value) << "</Value>"sv;
  }
  out << "</LogAttribs>\n"sv;
}

static void appendThreadAndProcess(RecordText &out, const EventValues &values) {
  if (const auto thread = qlxThreadOf(values)) {
    (out << " <Thread>"sv).number(*thread) << "</Thread>\n"sv;
  }
  if (const auto process = qlxProcessOf(values)) {
    (out << " <Process>"sv).number(*process) << "</Process>\n"sv;
  }
}

// Where the event is from: a message by its source and its bundle, a trace by source and thread.
static void appendOrigin(RecordText &out, const Event *event, const EventValues &values,
                         bool asMessage, va_list *args) {
  const bool hasSource = qlxPDXMLAppendSource(out, values);
  if (asMessage) {
    const char *bundle = event->message ? event->message->bundle : nullptr;
    return qlxPDXMLAppendTranslation(out, event, bundle, args);
  }
  if (!hasSource) out << " <Source FileName=\"None\" Method=\"None\"/>\n"sv;
  appendThreadAndProcess(out, values);
}

static void appendElement(RecordText &out, std::string_view start, const char *value,
                          std::string_view end) {
  if (value) (out << start).value(value) << end;
}

static bool appendRecord(QlxObject *formatter, Event *event, va_list *args, RecordText &out) {
  PDXMLVars *vars = varsOf(formatter);
  if (!vars || !event) return false;
  const bool asMessage = isMessage(vars, event);
  qlxUseFormatterLocale(event, formatter->kind3.locale);
  BoundText bound;
  const std::u16string_view text = bound.bind(event, args);
  const EventValues values = qlxFindEventValues(event);

  if (vars->firstRecord) qlxPDXMLAppendProducts(out, values, productsOf(vars, 1));
  appendStart(out, event, text, asMessage);
  appendTime(out, formatter, event->time);
  qlxPDXMLAppendProducts(out, values, productsOf(vars, 0));
  out << " <LogText><![CDATA["sv << text << "]]></LogText>\n"sv;
  appendFreeAttributes(out, event, values);
  appendOrigin(out, event, values, asMessage, args);
  appendElement(out, " <CorrelationId>"sv, values[EventKey::kCorrelationId],
                "</CorrelationId>\n"sv);
  appendElement(out, " <Principal>"sv, values[EventKey::kClient], "</Principal>\n"sv);
  out << (asMessage ? "</Message>\n"sv : "</Trace>\n"sv);
  if (!out.isWholeFor(event)) return false;  // a lost record leaves its preamble to the next one
  vars->firstRecord = 0;
  return true;
}

UChar *QlxPDXMLUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  return qlxFormatNew(formatter, event, args, appendRecord);
}

const ObjClass qlxPDXMLFormatterClass = {
    .kind = Formatter,
    .name = "qlx_xmlformatter",
    .description = nullptr,
    .op1 = {.fFormat = QlxPDXMLUFormatterFFormat},
    .op2 = {.fGetHeader = QlxPDXMLFormatterFGetHeader},
    .op3 = {.fGetTrailer = QlxPDXMLFormatterFGetTrailer},
    .op4 = {.fBindMsg = qlxIntlBindUI18Msg},
    .fAllocVars = QlxPDXMLFormatterFAllocVars,
    .fFreeVars = QlxPDXMLFormatterFFreeVars,
    .fCfgChange = QlxPDXMLFormatterFCfgChange,
    .own = &kOwn,
};
