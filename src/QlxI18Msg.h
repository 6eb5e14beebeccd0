// The binder of messages into a text that is being built.
#ifndef QLX_SRC_QLXI18MSG_H
#define QLX_SRC_QLXI18MSG_H

#include <qlx/class/message.h>

QLX_BEGIN_DECLS

// Binds as qlxIntlBindUI18Msg() does and appends the text. Returns 1, or 0 where that gives null;
// the buffer's text is unchanged then.
uint8_t qlxIntlBindI18MsgTo(I18Msg *message, va_list *args, CxUStringBuff *text);

QLX_END_DECLS

#endif
