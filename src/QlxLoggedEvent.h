// The event of a log call. It lives for the one call under the API lock, so its blocks are kept and
// serve the next call: a call of a kind that was made before allocates nothing.
#ifndef QLX_SRC_QLXLOGGEDEVENT_H
#define QLX_SRC_QLXLOGGEDEVENT_H

#include <string_view>

#include <qlx/event.h>

QLX_BEGIN_DECLS

// Sets a property as QlxSetEventProp() does, in a kept block where there is one.
void qlxStampEvent(Event *event, const char *key, std::string_view value);
void qlxStampEventInt(Event *event, const char *key, int32_t value);

// Frees what is kept.
void qlxDropKeptEvent(void);

QLX_END_DECLS

// An event as QlxVaAllocUEvent() makes it. The API lock is held.
class LoggedEvent {
 public:
  LoggedEvent(int32_t level, const char *bundle, const char *key, const UChar *text);
  ~LoggedEvent();
  LoggedEvent(const LoggedEvent &) = delete;
  LoggedEvent &operator=(const LoggedEvent &) = delete;

  Event *get() const { return event_; }  // null when memory ran out
  Event *operator->() const { return event_; }

 private:
  Event *event_;
};

#endif
