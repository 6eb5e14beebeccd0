// The elements of an XML record that are made of an event's properties and of its message's bundle.
// Deliberate: nothing is escaped, values stand as they are.
#include "QlxPDXMLFormatter.h"

#include <unicode/localpointer.h>
#include <unicode/ures.h>

#include <qlx/buffers.h>
#include <qlx/class/event.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxI18Msg.h"
#include "QlxPatternTypes.h"
#include "QlxProps.h"

// ---- Words

namespace {

struct LevelWord {
  int32_t level;
  const char *word;
};

constexpr LevelWord kLevelWords[] = {
    {DEBUG_MAX, "MAX"}, {DEBUG_MID, "MID"}, {DEBUG_MIN, "MIN"}, {INFO, "INFO"},
    {WARN, "WARN"},     {ERROR, "ERROR"},   {FATAL, "ERROR"},  // Deliberate: no word of its own
};

constexpr const char *kReservedKeys[] = {
    "threadId",         "correlationId",    "client",
    "qlx_prop_srcfile", "qlx_prop_srcline", "qlx_prop_srcfunction",
    "server",           "serverFormat",     "product",
    "component",        "productInstance",  "processId",
};

}  // namespace

void qlxPDXMLEmitULevel(CxUStringBuff *record, int32_t level) {
  const char *word = "OTHER";
  for (const LevelWord &row : kLevelWords) {
    if (row.level == level) word = row.word;
  }
  CxUStringBuffAppendStr(record, word);
}

uint8_t qlxPDXMLCheckKey(const char *key) {
  for (const char *reserved : kReservedKeys) {
    if (OslStringCmp(reserved, key) == 0) return 0;
  }
  return 1;
}

// ---- Product and source

static const char *peek(const Event *event, const char *key) {
  return event ? qlxPeekMapProp(event->props, key) : nullptr;
}

static void emitAll(CxUStringBuff *record, std::initializer_list<const char *> texts) {
  for (const char *text : texts) CxUStringBuffAppendStr(record, text);
}

static void emitServer(CxUStringBuff *record, const Event *event) {
  const char *server = peek(event, "server");
  if (!server) return;
  const char *format = peek(event, "serverFormat");
  emitAll(record, {" <Server Format=\"", format ? format : "", "\">", server, "</Server>\n"});
}

void qlxPDXMLEmitUProductInfo(CxUStringBuff *record, Event *event, uint8_t component,
                              uint8_t product, uint8_t instance, uint8_t server) {
  struct Element {
    uint8_t selected;
    const char *key;
    const char *name;
  };
  const Element elements[] = {{product, "product", "ProductId"},
                              {component, "component", "Component"},
                              {instance, "productInstance", "ProductInstance"}};
  if (server) emitServer(record, event);
  for (const Element &element : elements) {
    const char *value = element.selected ? peek(event, element.key) : nullptr;
    if (value) emitAll(record, {" <", element.name, ">", value, "</", element.name, ">\n"});
  }
}

uint8_t qlxPDXMLEmitUSource(CxUStringBuff *record, Event *event) {
  const char *file = peek(event, "qlx_prop_srcfile");
  if (!file) return 0;
  emitAll(record, {" <Source FileName=\"", file});
  if (const char *function = peek(event, "qlx_prop_srcfunction")) {
    emitAll(record, {"\" Method=\"", function});
  }
  uint8_t found = 0;
  const int32_t line = QlxGetEventPropInt(event, "qlx_prop_srcline", &found);
  if (found) {
    CxUStringBuffAppendStr(record, "\" Line=\"");
    CxUStringBuffAppendInt32(record, line);
  }
  CxUStringBuffAppendStr(record, "\"/>\n");
  return 1;
}

// ---- Translation

// Takes the next argument from the list and appends its value.
static void emitValue(CxUStringBuff *record, ArgType type, va_list *args) {
  if (type == ArgType::kString) {
    if (const UChar *text = va_arg(*args, const UChar *)) CxUStringBuffAppendUStr(record, text);
  } else if (type == ArgType::kInteger) {
    const int64_t value = va_arg(*args, int32_t);
    if (value < 0) CxUStringBuffAppendStr(record, "-");
    CxUStringBuffAppendUInt64(record, static_cast<uint64_t>(value < 0 ? -value : value));
  } else {
    CxUStringBuffAppendUDouble(record, va_arg(*args, double));
  }
}

// Deliberate: ends at the first index without a type, whatever comes after it.
static void emitParameters(CxUStringBuff *record, const UChar *pattern, va_list *args) {
  ArgTypes types;
  if (!args || !qlxScanPatternTypes(pattern, &types)) return;
  va_list copy;
  va_copy(copy, *args);
  for (const ArgType type : types) {
    if (type == ArgType::kNone) break;
    CxUStringBuffAppendStr(record, "<Param><![CDATA[");
    emitValue(record, type, &copy);
    CxUStringBuffAppendStr(record, "]]></Param>");
  }
  va_end(copy);
}

static void emitBundleParameters(CxUStringBuff *record, const I18Msg *message, const char *bundle,
                                 va_list *args) {
  if (!bundle) return;
  UErrorCode status = U_ZERO_ERROR;
  const icu::LocalUResourceBundlePointer opened{
      qlxOpenMessageBundle(bundle, message->locale, &status)};
  if (U_FAILURE(status)) return;
  status = U_ZERO_ERROR;
  int32_t length = 0;
  const UChar *pattern = ures_getStringByKey(opened.getAlias(), message->key, &length, &status);
  if (U_SUCCESS(status)) emitParameters(record, pattern, args);
}

void qlxPDXMLEmitUTranslationInfo(CxUStringBuff *record, Event *event, const char *bundle,
                                  va_list *args) {
  if (!event || !event->message) return;
  const char *key = event->message->key;
  // Deliberate: the attribute's name has a blank in it.
  emitAll(record, {" <TranslationInfo", " Resource Bundle=\"", bundle ? bundle : "", "\" MsgKey=\"",
                   key ? key : "", "\">"});
  emitBundleParameters(record, event->message, bundle, args);
  CxUStringBuffAppendStr(record, "</TranslationInfo>\n");
}
