#include "QlxEventValues.h"

#include <algorithm>
#include <iterator>
#include <string_view>

#include <qlx/class/containers.h>
#include <qlx/class/props.h>

#include "QlxLoggedEvent.h"

// A place of its own for each key, by its length and its last byte but one.
static constexpr size_t kPlaces = 32;

static constexpr size_t placeOf(std::string_view key) {
  const auto byte = key.size() > 1 ? static_cast<unsigned char>(key[key.size() - 2]) : 0U;
  return (5 * key.size() + byte) % kPlaces;
}

static constexpr auto kKeyAt = [] {
  std::array<EventKey, kPlaces> keys;
  keys.fill(EventKey::kNone);
  for (size_t i = 0; i < std::size(kEventKeys); ++i)
    keys[placeOf(kEventKeys[i])] = static_cast<EventKey>(i);
  return keys;
}();
static_assert(std::ranges::count(kKeyAt, EventKey::kNone) == kPlaces - std::size(kEventKeys));

EventKey qlxEventKeyOf(const char *text) {
  const std::string_view key{text};
  const EventKey found = kKeyAt[placeOf(key)];
  const bool same = found != EventKey::kNone && key == nameOf(found);
  return same ? found : EventKey::kNone;
}

static EventValues findProperties(const StringToStringMapNode *node) {
  EventValues values{};
  for (; node; node = node->next) {
    const EventKey key = qlxEventKeyOf(node->key);
    values.keys |= 1U << static_cast<uint32_t>(key);
    if (key != EventKey::kNone) values.texts[static_cast<size_t>(key)] = node->value;
  }
  uint8_t isNumber = 0;
  const int32_t line = qlxPropStrToInt32(values[EventKey::kSourceLine], &isNumber);
  if (isNumber) values.sourceLine = line;
  return values;
}

EventValues qlxFindEventValues(const Event *event) {
  if (const EventSource *source = qlxNotedEventSource(event)) {
    EventValues values{{source->file, source->function}, {}, 0};
    if (source->file) values.sourceLine = source->line;
    return values;
  }
  return findProperties(event && event->props ? event->props->head : nullptr);
}

static std::optional<int64_t> numberIn(const char *text) {
  uint8_t isNumber = 0;
  const int64_t number = qlxPropStrToInt64(text, &isNumber);
  return isNumber ? std::optional{number} : std::nullopt;
}

std::optional<uint64_t> qlxThreadOf(const EventValues &values) {
  const auto number = numberIn(values[EventKey::kThreadId]);
  return number ? std::optional<uint64_t>{static_cast<uint32_t>(*number)} : std::nullopt;
}

std::optional<int32_t> qlxProcessOf(const EventValues &values) {
  const auto number = numberIn(values[EventKey::kProcessId]);
  return number ? std::optional{static_cast<int32_t>(*number)} : std::nullopt;
}
