// The XML formatter: each event as one Message or Trace element.
#include "QlxPDXMLFormatter.h"

#include <qlx/buffers.h>
#include <qlx/class/containers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/class/msgid.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxClasses.h"
#include "QlxConfigKeys.h"
#include "QlxHeldFormats.h"
#include "QlxObject.h"
#include "QlxProps.h"

namespace {

struct PDXMLVars {
  uint8_t firstRecord;      // 1 at first and after each header: the next record has the preamble
  uint8_t singleComponent;  // the four: 1 writes the element once, in the preamble
  uint8_t singleProduct;
  uint8_t singleProductId;
  uint8_t singleServer;
  uint8_t forceAsMessage;  // one alone decides the kind of every record
  uint8_t forceAsTrace;
};

}  // namespace

static PDXMLVars *varsOf(QlxObject *formatter) {
  return formatter ? static_cast<PDXMLVars *>(formatter->vars) : nullptr;
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

static void emitPreamble(CxUStringBuff *record, PDXMLVars *vars, Event *event) {
  if (vars->firstRecord != 1) return;
  qlxPDXMLEmitUProductInfo(record, event, vars->singleComponent, vars->singleProduct,
                           vars->singleProductId, vars->singleServer);
  vars->firstRecord = 0;
}

static bool isMessage(const PDXMLVars *vars, const Event *event) {
  if (vars->forceAsMessage == vars->forceAsTrace) return event->isMessage;
  return vars->forceAsMessage;
}

static void emitId(CxUStringBuff *record, const Event *event, const UChar *text) {
  // An event that carries an identifier, even an empty one, is not looked at again.
  const OwnedStr parsed{event->messageId ? nullptr : qlxPDXMLUGetMessageID(text)};
  const char *id = event->messageId ? event->messageId : parsed.get();
  CxUStringBuffAppendStr(record, id && *id ? id : "None");
}

static void emitStart(CxUStringBuff *record, const Event *event, const UChar *text,
                      bool asMessage) {
  const bool hasLevel = event->level != UNSPECIFIED;
  if (!asMessage && !hasLevel) {
    CxUStringBuffAppendStr(record, "<Trace>\n");
    return;
  }
  CxUStringBuffAppendStr(record, asMessage ? "<Message Id=\"" : "<Trace Level=\"");
  if (asMessage) emitId(record, event, text);
  if (asMessage && hasLevel) CxUStringBuffAppendStr(record, "\" Severity=\"");
  if (hasLevel) qlxPDXMLEmitULevel(record, event->level);
  CxUStringBuffAppendStr(record, "\">\n");
}

static void emitTime(CxUStringBuff *record, QlxObject *formatter, const Event *event) {
  CxUStringBuffAppendStr(record, " <Time Millis=\"");
  CxUStringBuffAppendUDate(record, event->time);
  CxUStringBuffAppendStr(record, "\">");
  qlxAppendHeldDate(record, formatter->kind2.dateTimeFormat, event->time);
  CxUStringBuffAppendStr(record, "</Time>\n");
}

static void emitFreeAttributes(CxUStringBuff *record, const Event *event) {
  bool any = false;
  for (auto *it = event->props ? event->props->head : nullptr; it; it = it->next) {
    if (!qlxPDXMLCheckKey(it->key)) continue;
    if (!any) CxUStringBuffAppendStr(record, " <LogAttribs>");
    any = true;
    CxUStringBuffAppendStr(record, "<Key>");
    CxUStringBuffAppendStr(record, it->key);
    CxUStringBuffAppendStr(record, "</Key><Value>");
    CxUStringBuffAppendStr(record, it->value);
    CxUStringBuffAppendStr(record, "</Value>");
  }
  if (any) CxUStringBuffAppendStr(record, "</LogAttribs>\n");
}

// Deliberate: the thread is an unsigned 32-bit number, the process has the buffer's unsigned form.
static void emitThreadAndProcess(CxUStringBuff *record, Event *event) {
  uint8_t found = 0;
  const int32_t thread = QlxGetEventPropLong(event, "threadId", &found);
  if (found) {
    CxUStringBuffAppendStr(record, " <Thread>");
    CxUStringBuffAppendUInt64(record, static_cast<uint32_t>(thread));
    CxUStringBuffAppendStr(record, "</Thread>\n");
  }
  const int32_t process = QlxGetEventPropLong(event, "processId", &found);
  if (found) {
    CxUStringBuffAppendStr(record, " <Process>");
    CxUStringBuffAppendInt32(record, process);
    CxUStringBuffAppendStr(record, "</Process>\n");
  }
}

static void emitProperty(CxUStringBuff *record, const Event *event, const char *key,
                         const char *start, const char *end) {
  const char *value = qlxPeekMapProp(event->props, key);
  if (!value) return;
  CxUStringBuffAppendStr(record, start);
  CxUStringBuffAppendStr(record, value);
  CxUStringBuffAppendStr(record, end);
}

static void emitOrigin(CxUStringBuff *record, Event *event, bool asMessage, va_list *args) {
  const uint8_t hasSource = qlxPDXMLEmitUSource(record, event);
  if (asMessage) {
    const char *bundle = event->message ? event->message->bundle : nullptr;
    return qlxPDXMLEmitUTranslationInfo(record, event, bundle, args);
  }
  if (!hasSource) {
    CxUStringBuffAppendStr(record, " <Source FileName=\"None\" Method=\"None\"/>\n");
  }
  emitThreadAndProcess(record, event);
}

UChar *QlxPDXMLUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args) {
  PDXMLVars *vars = isKind(formatter, Formatter) ? varsOf(formatter) : nullptr;
  if (!vars || !event) return nullptr;
  const bool asMessage = isMessage(vars, event);
  if (formatter->kind3.locale) qlxSetEventLocale(event, formatter->kind3.locale);
  const OwnedUStr text{QlxBindEventUMsg(event, qlxIntlBindUI18Msg, args)};

  CxUStringBuff record{};
  emitPreamble(&record, vars, event);
  emitStart(&record, event, text.get(), asMessage);
  emitTime(&record, formatter, event);
  qlxPDXMLEmitUProductInfo(&record, event, !vars->singleComponent, !vars->singleProduct,
                           !vars->singleProductId, !vars->singleServer);
  CxUStringBuffAppendStr(&record, " <LogText><![CDATA[");
  CxUStringBuffAppendUStr(&record, text.get());
  CxUStringBuffAppendStr(&record, "]]></LogText>\n");
  emitFreeAttributes(&record, event);
  emitOrigin(&record, event, asMessage, args);
  emitProperty(&record, event, "correlationId", " <CorrelationId>", "</CorrelationId>\n");
  emitProperty(&record, event, "client", " <Principal>", "</Principal>\n");
  CxUStringBuffAppendStr(&record, asMessage ? "</Message>\n" : "</Trace>\n");
  return CxUStringBuffTakeUStr(&record);
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
