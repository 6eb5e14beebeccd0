// Message identifiers of events: what the bound text starts with, parsed once an event.
#include "QlxMsgId.h"

#include <algorithm>

#include <qlx/class/message.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxFormatted.h"
#include "util/CxOwned.h"

static MessageId parse(const char *text) {
  const CxKMSIDInfo info = CxParseKMSID(text);
  MessageId id{};  // one of ten characters has no terminator of its own
  std::copy_n(info.id, info.length, id.text);
  return id;
}

MessageId qlxMessageIdOf(const UChar *text) {
  // An identifier is ASCII, so the start of the text up to anything else says it all.
  MessageId start{};
  for (size_t i = 0; text && i + 1 < sizeof start.text && text[i] != 0 && text[i] < 0x80; ++i) {
    start.text[i] = static_cast<char>(text[i]);
  }
  return parse(start.text);
}

static char *copyOf(const MessageId &id) {
  return *id.text ? OslStringDup(id.text) : nullptr;
}

char *qlxPDXMLGetMessageID(const char *text) {
  return copyOf(parse(text));
}

char *qlxPDXMLUGetMessageID(const UChar *text) {
  return copyOf(qlxMessageIdOf(text));
}

void qlxPDXMLUFormatterCacheMessageID(QlxObject *, Event *event, va_list *args) {
  if (!event || event->messageId) return;
  const BoundText text{event, args};
  QlxSetEventMessageId(event, qlxMessageIdOf(text.get()).text);
}
