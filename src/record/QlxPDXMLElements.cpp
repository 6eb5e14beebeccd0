// The elements of an XML record that are made of an event's properties and of its message's bundle.
// Deliberate: nothing is escaped, values stand as they are.
#include "QlxPDXMLElements.h"

#include <algorithm>

#include <qlx/event.h>

#include "QlxLevel.h"
#include "text/QlxBundleCache.h"
#include "text/QlxPatternTypes.h"

using namespace std::string_view_literals;

// ---- Product and source

static void appendServer(RecordText &out, const EventValues &values) {
  const char *server = values[EventKey::kServer];
  if (!server) return;
  (out << " <Server Format=\""sv).value(values[EventKey::kServerFormat]);
  (out << "\">"sv).value(server) << "</Server>\n"sv;
}

void qlxPDXMLAppendProducts(RecordText &out, const EventValues &values,
                            const ProductElements &selected) {
  const struct {
    bool selected;
    EventKey key;
    std::string_view start, end;
  } elements[] = {
      {selected.product, EventKey::kProduct, " <ProductId>"sv, "</ProductId>\n"sv},
      {selected.component, EventKey::kComponent, " <Component>"sv, "</Component>\n"sv},
      {selected.instance, EventKey::kProductInstance, " <ProductInstance>"sv,
       "</ProductInstance>\n"sv},
  };
  if (selected.server) appendServer(out, values);
  for (const auto &element : elements) {
    const char *value = element.selected ? values[element.key] : nullptr;
    if (value) (out << element.start).value(value) << element.end;
  }
}

bool qlxPDXMLAppendSource(RecordText &out, const EventValues &values) {
  const char *file = values[EventKey::kSourceFile];
  if (!file) return false;
  (out << " <Source FileName=\""sv).value(file);
  const char *function = values[EventKey::kSourceFunction];
  if (function) (out << "\" Method=\""sv).value(function);
  if (values.sourceLine) (out << "\" Line=\""sv).number(*values.sourceLine);
  out << "\"/>\n"sv;
  return true;
}

// ---- Translation

static void appendSigned(RecordText &out, int64_t value) {
  if (value < 0) out << "-"sv;
  out.number(cxMagnitude(value));
}

// Takes the next argument from the list and appends its value.
static void appendValue(RecordText &out, ArgType type, va_list *args) {
  if (type == ArgType::kString) {
    if (const UChar *text = va_arg(*args, const UChar *)) out << std::u16string_view{text};
  } else if (type == ArgType::kInteger) {
    appendSigned(out, va_arg(*args, int32_t));
  } else {
    out.number(kFraction, va_arg(*args, double));
  }
}

// Without a list a number is zero, as in the text.
static void appendZero(RecordText &out, ArgType type, va_list *) {
  if (type == ArgType::kInteger) return appendSigned(out, 0);
  out.number(kFraction, 0);
}

// Deliberate: ends at the first index without a type, whatever comes after it.
static void appendParametersBy(decltype(appendValue) *append, RecordText &out,
                               const ArgTypes &types, va_list *args) {
  for (const ArgType type : types) {
    if (type == ArgType::kNone) break;
    out << "<Param><![CDATA["sv;
    append(out, type, args);
    out << "]]></Param>"sv;
  }
}

// Deliberate: without a list a pattern with a string has no text, and no parameters.
static void appendParameters(RecordText &out, const ArgTypes &types, va_list *args) {
  if (args) {
    va_list copy;
    va_copy(copy, *args);
    appendParametersBy(appendValue, out, types, &copy);
    va_end(copy);
  } else if (std::ranges::find(types, ArgType::kString) == types.end()) {
    appendParametersBy(appendZero, out, types, nullptr);
  }
}

void qlxPDXMLAppendTranslation(RecordText &out, const Event *event, const char *bundle,
                               va_list *args) {
  const I18Msg *message = event ? event->message : nullptr;
  if (!message) return;
  // Deliberate: the attribute's name has a blank in it.
  (out << " <TranslationInfo Resource Bundle=\""sv).value(bundle);
  (out << "\" MsgKey=\""sv).value(message->key) << "\">"sv;
  ArgTypes types;
  const bool known =
      bundle && qlxScanBundlePattern({bundle, message->key, message->locale}, &types);
  if (known) appendParameters(out, types, args);
  out << "</TranslationInfo>\n"sv;
}

// ---- The same for one element alone

void qlxPDXMLEmitULevel(CxUStringBuff *record, int32_t level) {
  RecordText out(record);
  out << qlxLevelWord(level);
}

void qlxPDXMLEmitUProductInfo(CxUStringBuff *record, Event *event, uint8_t component,
                              uint8_t product, uint8_t instance, uint8_t server) {
  RecordText out(record);
  qlxPDXMLAppendProducts(out, qlxFindEventValues(event),
                         {component != 0, product != 0, instance != 0, server != 0});
}

uint8_t qlxPDXMLEmitUSource(CxUStringBuff *record, Event *event) {
  RecordText out(record);
  return qlxPDXMLAppendSource(out, qlxFindEventValues(event));
}

void qlxPDXMLEmitUTranslationInfo(CxUStringBuff *record, Event *event, const char *bundle,
                                  va_list *args) {
  RecordText out(record);
  qlxPDXMLAppendTranslation(out, event, bundle, args);
}

uint8_t qlxPDXMLCheckKey(const char *key) {
  return !key || qlxPDXMLIsFree(qlxEventKeyOf(key));
}
