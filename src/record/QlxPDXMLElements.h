// The emitters of an XML record's elements. A null event has no properties and no message. When
// memory runs out the record is lost as a whole (QlxRecordText.h).
#ifndef QLX_SRC_QLXPDXMLELEMENTS_H
#define QLX_SRC_QLXPDXMLELEMENTS_H

#include <qlx/class/formatter.h>

#include "QlxEventValues.h"
#include "QlxRecordText.h"

QLX_BEGIN_DECLS

/** Appends the word of a level. */
void qlxPDXMLEmitULevel(CxUStringBuff *record, int32_t level);

/** Appends the product elements that are selected and that the event has, in their fixed order. */
void qlxPDXMLEmitUProductInfo(CxUStringBuff *record, Event *event, uint8_t component,
                              uint8_t product, uint8_t instance, uint8_t server);

/** Appends the source element; 0 when the event has no source file and nothing was appended. */
uint8_t qlxPDXMLEmitUSource(CxUStringBuff *record, Event *event);

/** Appends the bundle, the key and, as far as the pattern tells their types, the parameters. */
void qlxPDXMLEmitUTranslationInfo(CxUStringBuff *record, Event *event, const char *bundle,
                                  va_list *args);

/** 0 for a property that has an element of its own and is no free attribute, else 1. */
uint8_t qlxPDXMLCheckKey(const char *key);

QLX_END_DECLS

// The same for a RecordText, from values that were already found.
struct ProductElements {
  bool component, product, instance, server;  // those that are selected
};

void qlxPDXMLAppendProducts(RecordText &out, const EventValues &values,
                            const ProductElements &selected);
bool qlxPDXMLAppendSource(RecordText &out, const EventValues &values);
void qlxPDXMLAppendTranslation(RecordText &out, const Event *event, const char *bundle,
                               va_list *args);

// Deliberate: "organization" has no element of its own and is a free attribute.
inline bool qlxPDXMLIsFree(EventKey key) {
  return key == EventKey::kNone || key == EventKey::kOrganization;
}

#endif
