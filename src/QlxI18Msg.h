// The binder of messages into a text that is being built.
#ifndef QLX_SRC_QLXI18MSG_H
#define QLX_SRC_QLXI18MSG_H

#include <qlx/class/event.h>
#include <qlx/class/message.h>

#include "record/QlxLoggedEvent.h"

QLX_BEGIN_DECLS

// What comes before every bind of an event's message: the event's locale counts, where it has one.
inline void qlxUseEventLocale(Event *event) {
  if (!event->locale) return;
  qlxSetI18MsgLocale(event->message, event->locale);
  if (event->message && !event->message->locale) qlxMissMemory(event);
}

// Makes a formatter's locale the event's; null leaves the event its own. Deliberate: it stays on
// the event, and what formats the event later binds in it too.
inline void qlxUseFormatterLocale(Event *event, const char *locale) {
  if (!locale) return;
  qlxSetEventLocale(event, locale);
  if (!event->locale) qlxMissMemory(event);
}

// Binds as qlxIntlBindUI18Msg() does and appends the text. Returns 1, or 0 where that gives null;
// the buffer's text is unchanged then.
uint8_t qlxIntlBindI18MsgTo(I18Msg *message, va_list *args, CxUStringBuff *text);

QLX_END_DECLS

#endif
