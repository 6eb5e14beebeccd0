// The message identifier that a text starts with, for those who need no copy of it.
#ifndef QLX_SRC_QLXMSGID_H
#define QLX_SRC_QLXMSGID_H

#include <string_view>

#include <qlx/class/msgid.h>
#include <qlx/kmsid.h>

struct MessageId {
  char text[sizeof CxKMSIDInfo::id + 1];  // "" is none
};

QLX_BEGIN_DECLS

MessageId qlxMessageIdOf(const UChar *text);  // null has none
MessageId qlxMessageIdOfText(std::u16string_view text);

QLX_END_DECLS

#endif
