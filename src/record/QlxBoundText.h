// The text of an event's message, for formatters that look at it before they write it.
#ifndef QLX_SRC_QLXBOUNDTEXT_H
#define QLX_SRC_QLXBOUNDTEXT_H

#include <optional>
#include <string_view>

#include <qlx/types.h>

#include "QlxCachedBuffer.h"

class BoundText {
 public:
  // Binds as qlxIntlBindUI18Msg() does; empty where that gives null. The text is valid as long as
  // this object and the message are. The API lock is held.
  std::u16string_view bind(Event *event, va_list *args);

 private:
  std::optional<CachedBuffer> buffer_;  // of a text that is not the message's own
};

#endif
