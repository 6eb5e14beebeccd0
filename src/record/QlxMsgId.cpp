// Message identifiers of events: what the bound text starts with, parsed once an event.
#include "QlxMsgId.h"

#include <algorithm>

#include <qlx/class/message.h>
#include <qlx/event.h>
#include <qlx/memory.h>

#include "QlxBoundText.h"
#include "QlxEvent.h"
#include "QlxLoggedEvent.h"
#include "util/CxOwned.h"

static MessageId parse(const char *text) {
  const CxKMSIDInfo info = CxParseKMSID(text);
  MessageId id{};  // one of ten characters has no terminator of its own
  std::copy_n(info.id, info.length, id.text);
  return id;
}

// What an identifier is made of, in ASCII.
static bool isPartOfOne(UChar unit) {
  const UChar lower = unit | 0x20;
  return (unit >= u'0' && unit <= u'9') || (lower >= u'a' && lower <= u'z');
}

MessageId qlxMessageIdOfText(std::u16string_view text) {
  // The start of the text up to anything else says it all.
  MessageId start{};
  const size_t limit = std::min(text.size(), sizeof start.text - 1);
  for (size_t i = 0; i < limit && isPartOfOne(text[i]); ++i) {
    start.text[i] = static_cast<char>(text[i]);
  }
  return *start.text ? parse(start.text) : start;
}

MessageId qlxMessageIdOf(const UChar *text) {
  return text ? qlxMessageIdOfText(text) : MessageId{};
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
  BoundText bound;
  const MessageId id = qlxMessageIdOfText(bound.bind(event, args));
  if (event->message && event->message->error == U_MEMORY_ALLOCATION_ERROR) qlxMissMemory(event);
  qlxStampEventMessageId(event, id.text);
}
