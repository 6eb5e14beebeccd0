// The text of an event's message, for who looks at it before it is written.
#ifndef QLX_SRC_QLXBOUNDTEXT_H
#define QLX_SRC_QLXBOUNDTEXT_H

#include <optional>
#include <string_view>

#include <qlx/types.h>

#include "QlxCachedBuffer.h"

class BoundText {
 public:
  // Binds as qlxIntlBindUI18Msg() does; empty where that gives null. Good as long as this and the
  // message. The API lock is held.
  std::u16string_view bind(Event *event, va_list *args);

 private:
  std::optional<CachedBuffer> buffer_;  // of a text that is not the message's own
};

#endif
