// Message identifiers of events: what the bound text starts with, parsed once an event.
#include <qlx/class/msgid.h>

#include <algorithm>
#include <array>

#include <qlx/class/message.h>
#include <qlx/event.h>
#include <qlx/kmsid.h>
#include <qlx/memory.h>

#include "util/CxOwned.h"

char *qlxPDXMLGetMessageID(const char *text) {
  const CxKMSIDInfo info = CxParseKMSID(text);
  if (info.length < 1) return nullptr;
  std::array<char, sizeof info.id + 1> id{};  // one of ten characters has no terminator of its own
  std::copy_n(info.id, info.length, id.begin());
  return OslStringDup(id.data());
}

char *qlxPDXMLUGetMessageID(const UChar *text) {
  if (!text) return nullptr;
  // An identifier is ASCII, so the start of the text up to anything else says it all.
  std::array<char, sizeof CxKMSIDInfo::id + 1> start{};
  for (size_t i = 0; i + 1 < start.size() && text[i] != 0 && text[i] < 0x80; ++i) {
    start[i] = static_cast<char>(text[i]);
  }
  return qlxPDXMLGetMessageID(start.data());
}

void qlxPDXMLUFormatterCacheMessageID(QlxObject *, Event *event, va_list *args) {
  if (!event || event->messageId) return;
  const OwnedUStr text{QlxBindEventUMsg(event, qlxIntlBindUI18Msg, args)};
  const OwnedStr id{qlxPDXMLUGetMessageID(text.get())};
  QlxSetEventMessageId(event, id ? id.get() : "");
}
