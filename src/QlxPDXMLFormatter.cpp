// The XML formatter: each event as one Message or Trace element.
#include "QlxPDXMLFormatter.h"

#include <qlx/buffers.h>
#include <qlx/class/containers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxClasses.h"
#include "QlxConfigKeys.h"
#include "QlxFormatted.h"
#include "QlxHeldFormats.h"
#include "QlxMsgId.h"
#include "QlxObject.h"
#include "QlxProps.h"
#include "QlxRecordText.h"
#include "util/CxOwned.h"

namespace {

struct PDXMLVars {
  uint8_t firstRecord;      // 1 at first and after each header: the next record has the preamble
  uint8_t singleComponent;  // these four: 1 writes the element once, in the preamble
  uint8_t singleProduct;
  uint8_t singleProductId;
  uint8_t singleServer;
  uint8_t forceAsMessage;  // one alone decides the kind of every record
  uint8_t forceAsTrace;
};

}  // namespace

// Null for an object of another kind, which keeps something else in the same place.
static PDXMLVars *varsOf(QlxObject *formatter) {
  return isKind(formatter, Formatter) ? static_cast<PDXMLVars *>(formatter->vars) : nullptr;
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
  varsOf(formatter)->*Flag = qlxIntlGetObjPropBool(formatter, key, nullptr);  // absent: 0
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
  if (!key || !varsOf(formatter)) return;
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
static void emitProducts(CxUStringBuff *record, const PDXMLVars *vars, Event *event,
                         uint8_t single) {
  qlxPDXMLEmitUProductInfo(record, event, vars->singleComponent == single,
                           vars->singleProduct == single, vars->singleProductId == single,
                           vars->singleServer == single);
}

static void emitId(CxUStringBuff *record, const Event *event, const UChar *text) {
  const MessageId parsed = qlxMessageIdOf(text);
  // An empty identifier of the event's own says that there is none.
  const char *id = event->messageId ? event->messageId : parsed.text;
  RecordText(record) << (*id ? id : "None");
}

static void emitStart(CxUStringBuff *record, const Event *event, const UChar *text,
                      bool asMessage) {
  const bool hasLevel = event->level != UNSPECIFIED;
  RecordText out(record);
  if (asMessage) {
    out << u"<Message Id=\"";
    emitId(record, event, text);
    out << (hasLevel ? u"\" Severity=\"" : u"");
  } else {
    out << (hasLevel ? u"<Trace Level=\"" : u"<Trace");
  }
  if (hasLevel) qlxPDXMLEmitULevel(record, event->level);
  out << (asMessage || hasLevel ? u"\">\n" : u">\n");
}

static void emitTime(CxUStringBuff *record, const QlxObject *formatter, double time) {
  RecordText out(record);
  out << u" <Time Millis=\"";
  out.by(CxUStringBuffAppendUDate, time) << u"\">";
  out.by(qlxAppendHeldDate, formatter->kind2.dateTimeFormat, time) << u"</Time>\n";
}

static void emitFreeAttributes(CxUStringBuff *record, const Event *event) {
  RecordText out(record);
  const UChar *before = u" <LogAttribs>";  // only in front of the first
  for (auto *it = event->props ? event->props->head : nullptr; it; it = it->next) {
    if (!qlxPDXMLCheckKey(it->key)) continue;
    out << before << u"<Key>" << it->key << u"</Key><Value>" << it->value << u"</Value>";
    before = u"";
  }
  if (!*before) out << u"</LogAttribs>\n";
}

// Deliberate: the thread is an unsigned 32-bit number, the process has the buffer's unsigned form.
static void emitThreadAndProcess(CxUStringBuff *record, Event *event) {
  RecordText out(record);
  uint8_t found = 0;
  const int32_t thread = QlxGetEventPropLong(event, "threadId", &found);
  if (found) {
    out << u" <Thread>";
    out.by(CxUStringBuffAppendUInt64, static_cast<uint32_t>(thread)) << u"</Thread>\n";
  }
  const int32_t process = QlxGetEventPropLong(event, "processId", &found);
  if (found) {
    out << u" <Process>";
    out.by(CxUStringBuffAppendInt32, process) << u"</Process>\n";
  }
}

// Where the event is from: a message by its source and its bundle, a trace by source and thread.
static void emitOrigin(CxUStringBuff *record, Event *event, bool asMessage, va_list *args) {
  const uint8_t hasSource = qlxPDXMLEmitUSource(record, event);
  if (asMessage) {
    const char *bundle = event->message ? event->message->bundle : nullptr;
    return qlxPDXMLEmitUTranslationInfo(record, event, bundle, args);
  }
  if (!hasSource) RecordText(record) << u" <Source FileName=\"None\" Method=\"None\"/>\n";
  emitThreadAndProcess(record, event);
}

static void emitProperty(CxUStringBuff *record, const Event *event, const char *key,
                         const UChar *start, const UChar *end) {
  const char *value = qlxPeekMapProp(event->props, key);
  if (value) RecordText(record) << start << value << end;
}

uint8_t qlxPDXMLFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                CxUStringBuff *record) {
  PDXMLVars *vars = varsOf(formatter);
  if (!vars || !event) return 0;
  const bool asMessage = isMessage(vars, event);
  if (formatter->kind3.locale) qlxSetEventLocale(event, formatter->kind3.locale);
  const BoundText text{event, args};

  if (vars->firstRecord) emitProducts(record, vars, event, 1);
  emitStart(record, event, text.get(), asMessage);
  emitTime(record, formatter, event->time);
  emitProducts(record, vars, event, 0);
  RecordText(record) << u" <LogText><![CDATA[" << text.get() << u"]]></LogText>\n";
  emitFreeAttributes(record, event);
  emitOrigin(record, event, asMessage, args);
  emitProperty(record, event, "correlationId", u" <CorrelationId>", u"</CorrelationId>\n");
  emitProperty(record, event, "client", u" <Principal>", u"</Principal>\n");
  RecordText(record) << (asMessage ? u"</Message>\n" : u"</Trace>\n");
  if (!record->data) return 0;  // a lost record leaves its preamble to the next one
  vars->firstRecord = 0;
  return 1;
}

UChar *QlxPDXMLUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  return qlxFormatNew(qlxPDXMLFormatterAppend, formatter, event, args);
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
};
