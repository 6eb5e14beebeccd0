// The event of a log call. It lives for one call under the API lock, and its blocks are cached for
// the next call: a call like one that was made before allocates nothing.
//
// The event's source, which is where in the host's code it comes from, is only noted at first: most
// records are written without a look at the event's properties. Before code that may look at them
// runs, the event is settled: what is noted becomes properties.
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

// Makes what is noted properties of its event. To be called before any code runs that does not ask
// for the note, even when that code gets no event: it may log, which makes another note, or change
// the caller's texts, which the note only points to.
void qlxSettleNotedEvent(void);

// Sets a property of a settled event as QlxSetEventProp() does, in a cached block where there is
// one. When memory runs out, the event's status tells it.
void qlxStampEvent(Event *event, EventKey which, std::string_view value);
void qlxStampEventInt(Event *event, EventKey key, int32_t value);

// Sets the message identifier of an event that has none, in the same way; without memory the event
// stays without one.
void qlxStampEventMessageId(Event *event, std::string_view messageId);

// Frees what is cached.
void qlxDropCachedEvent(void);

QLX_END_DECLS

// An event as QlxVaAllocUEvent() makes it. When memory ran out for its message, it has none, and
// its status tells that. The API lock is held.
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
