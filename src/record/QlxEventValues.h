// The properties of an event that the built-in formatters write, all found in one walk; also those
// of an event whose source is only noted and has not become properties (QlxLoggedEvent.h).
#ifndef QLX_SRC_QLXEVENTVALUES_H
#define QLX_SRC_QLXEVENTVALUES_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

#include <qlx/event.h>

#include "QlxEventKeys.h"

// Texts are the event's own or the caller's; null for a key that is absent or has no value.
struct EventValues {
  std::array<const char *, static_cast<size_t>(EventKey::kNone)> texts;
  std::optional<int32_t> sourceLine;  // nothing when the property is no number
  uint32_t keys;                      // a bit for each key that the event has, also without a value

  const char *operator[](EventKey key) const { return texts[static_cast<size_t>(key)]; }
  bool has(EventKey key) const { return (keys >> static_cast<uint32_t>(key) & 1U) != 0; }
};

QLX_BEGIN_DECLS

// The text is not null.
EventKey qlxEventKeyOf(const char *text);

QLX_END_DECLS

// A null event has none.
EventValues qlxFindEventValues(const Event *event);

// Numbers, where the event has such. Deliberate: both are cut to 32 bits; the thread is unsigned
// then, the process is not.
std::optional<uint64_t> qlxThreadOf(const EventValues &values);
std::optional<int32_t> qlxProcessOf(const EventValues &values);

#endif
