// What goes along with every event: the locale in which it is bound, and whether memory ran out.
#ifndef QLX_SRC_QLXEVENT_H
#define QLX_SRC_QLXEVENT_H

#include <cerrno>

#include <qlx/class/event.h>
#include <qlx/class/message.h>

#include "util/CxStatus.h"

// Makes it the event's status that memory ran out, so that the log call's result tells it.
inline void qlxMissMemory(Event *event) {
  event->status = cxFailure(ENOMEM);
}

// Whether it is.
inline bool qlxMissedMemory(const Event *event) {
  return event->status.kind == 'p' && event->status.code == ENOMEM;
}

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

#endif
