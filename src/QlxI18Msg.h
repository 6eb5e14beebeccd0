// The binder of messages into a text that is being built.
#ifndef QLX_SRC_QLXI18MSG_H
#define QLX_SRC_QLXI18MSG_H

#include <qlx/class/message.h>

QLX_BEGIN_DECLS

// What comes before every bind of an event's message: the event's locale counts, where it has one.
inline void qlxUseEventLocale(const Event *event) {
  if (event->locale) qlxSetI18MsgLocale(event->message, event->locale);
}

// Binds as qlxIntlBindUI18Msg() does and appends the text. Returns 1, or 0 where that gives null;
// the buffer's text is unchanged then.
uint8_t qlxIntlBindI18MsgTo(I18Msg *message, va_list *args, CxUStringBuff *text);

QLX_END_DECLS

#endif
