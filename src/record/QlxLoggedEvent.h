// The event of a log call. It lives for the one call under the API lock, so its blocks are cached
// and serve the next call: a call of a kind that was made before allocates nothing.
//
// Where in the host's code the event comes from is only noted at first. Most lines are written
// without anybody looking at the event's properties; before somebody may, the event is settled.
#ifndef QLX_SRC_QLXLOGGEDEVENT_H
#define QLX_SRC_QLXLOGGEDEVENT_H

#include <string_view>

#include <qlx/event.h>

#include "QlxEventKeys.h"

// Texts of the caller's; each may be null. The line goes with the file.
struct EventSource {
  const char *file, *function;
  int32_t line;
};

QLX_BEGIN_DECLS

// What is noted for an event and not among its properties yet, or null.
const EventSource *qlxNotedEventSource(const Event *event);

// Makes what is noted properties of the event that it is noted for. To be called before anything
// but the library's own code that asks for the note runs, also where that gets no event: it may log
// too, and reuse the caller's texts for that.
void qlxSettleNotedEvent(void);

// Sets a property as QlxSetEventProp() does, in a cached block where there is one.
// The event is settled. It is its status when memory ran out.
void qlxStampEvent(Event *event, EventKey key, std::string_view value);
void qlxStampEventInt(Event *event, EventKey key, int32_t value);

// Sets the message identifier, of an event that has none, in the same way. For want of memory it
// stays without one.
void qlxStampEventMessageId(Event *event, std::string_view messageId);

// Frees what is cached.
void qlxDropCachedEvent(void);

QLX_END_DECLS

// An event as QlxVaAllocUEvent() makes it; its status tells when it has no message for want of
// memory. The API lock is held.
class LoggedEvent {
 public:
  LoggedEvent(int32_t level, const char *bundle, const char *key);
  LoggedEvent(int32_t level, const UChar *text, const EventSource &source);  // which is noted
  ~LoggedEvent();
  LoggedEvent(const LoggedEvent &) = delete;
  LoggedEvent &operator=(const LoggedEvent &) = delete;

  Event *get() const { return event_; }  // null when memory ran out
  Event *operator->() const { return event_; }

 private:
  LoggedEvent(int32_t level, const char *bundle, const char *key, const UChar *text);

  Event *event_;
};

#endif
