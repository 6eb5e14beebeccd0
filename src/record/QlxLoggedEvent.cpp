#include "QlxLoggedEvent.h"

#include <cstring>
#include <malloc.h>
#include <utility>

#include <qlx/class/containers.h>
#include <qlx/memory.h>
#include <qlx/system.h>

#include "QlxEvent.h"
#include "QlxProps.h"
#include "util/CxDecimal.h"
#include "util/CxHooks.h"
#include "util/CxUnits.h"
#include "util/QlxMapTemplate.h"

namespace {

struct PropertyElements {
  using Head = StringToStringMap;
  using Node = StringToStringMapNode;
  using Element = char *;
  using Parameter = const char *;
};

using Nodes = QlxMapTemplate<PropertyElements>::Nodes;

}  // namespace

// A block of an unusual size is not cached for all that come after it.
static constexpr size_t kMaxCachedBytes = size_t{64} * 1024;
static constexpr int kMaxCachedNodes = 32;

// Of the last event, emptied. All null while its successor is on its way: a log call that a class's
// operation makes then gets an event of its own.
static struct {
  Event *event;  // with a message; neither has contents
  char *bundle, *key, *messageId;
  UChar *text;
  StringToStringMap *props;      // empty
  StringToStringMapNode *nodes;  // linked by next, in the order in which they were set
} gCache;

// Of the event that was made last. It is settled before a host's operation may make another one.
static struct {
  Event *event;  // null: nothing is noted
  EventSource source;
} gNoted;

// ---- Blocks

static size_t capacityOf(void *block) {
  return block ? malloc_usable_size(block) : 0;
}

// Copies `bytes` and a terminator into a block, or into a new one in its place.
template <typename Char>
static bool refill(Char **block, const Char *text, size_t length) {
  const size_t bytes = (length + 1) * sizeof(Char);
  if (capacityOf(*block) < bytes) {
    if (bytes > UINT32_MAX) return false;
    auto *larger = static_cast<Char *>(OslMemoryMalloc(static_cast<uint32_t>(bytes)));
    if (!larger) return false;
    OslMemoryFree(*block);
    *block = larger;
  }
  std::memcpy(*block, text, length * sizeof(Char));
  (*block)[length] = 0;
  return true;
}

// Moves a cached block, with a text in it, to where it is wanted; null for null.
template <typename Char>
static bool lend(Char **to, Char **cached, const Char *text, size_t length) {
  if (!text) return true;
  if (!refill(cached, text, length)) return false;
  *to = *cached;
  *cached = nullptr;
  return true;
}

template <typename Char>
static void takeBack(Char **cached, Char **from) {
  if (!*from) return;
  if (capacityOf(*from) <= kMaxCachedBytes) std::swap(*cached, *from);
  if (*from) OslMemoryFree(*from);
  *from = nullptr;
}

// ---- Properties

// The first cached node, with that key and value; null when there is none or memory ran out.
static StringToStringMapNode *refillNode(const char *key, std::string_view value) {
  StringToStringMapNode *node = gCache.nodes;
  if (!node) return nullptr;
  // Calls of one kind set the same keys in the same order.
  const bool sameKey = std::strcmp(node->key, key) == 0;
  if (!sameKey && !refill(&node->key, key, std::strlen(key))) return nullptr;
  if (!refill(&node->value, value.data(), value.size())) return nullptr;
  gCache.nodes = node->next;
  return node;
}

// A map may have cached the key without its value.
static void stampAnew(Event *event, const char *key, const char *value) {
  if (QlxSetEventProp(event, key, value) && qlxPeekMapProp(event->props, key)) return;
  qlxMissMemory(event);
}

void qlxStampEvent(Event *event, EventKey which, std::string_view value) {
  const char *key = nameOf(which);
  if (!event->props) std::swap(event->props, gCache.props);
  StringToStringMap *props = event->props;
  StringToStringMapNode *node = nullptr;
  const bool isNew = props && (!props->head || !qlxIntlStringToStringMapHasKey(props, key));
  if (isNew) node = refillNode(key, value);
  if (!node) return stampAnew(event, key, value.data());
  node->owner = props;
  Nodes::linkAtTail(node);
}

void qlxStampEventInt(Event *event, EventKey key, int32_t value) {
  char digits[kMaxDecimalDigits + 2];
  char *const end = digits + sizeof digits - 1;
  *end = '\0';
  char *first = cxDecimalBefore(end, cxMagnitude(value), '0');
  if (value < 0) *--first = '-';
  qlxStampEvent(event, key, {first, static_cast<size_t>(end - first)});
}

void qlxStampEventMessageId(Event *event, std::string_view messageId) {
  const bool stamped =
      lend(&event->messageId, &gCache.messageId, messageId.data(), messageId.size());
  if (!stamped) qlxMissMemory(event);
}

// ---- Where an event comes from

const EventSource *qlxNotedEventSource(const Event *event) {
  return event && gNoted.event == event ? &gNoted.source : nullptr;
}

void qlxSettleNotedEvent(void) {
  Event *event = std::exchange(gNoted.event, nullptr);
  if (!event) return;
  const EventSource &source = gNoted.source;
  if (source.file) {
    qlxStampEvent(event, EventKey::kSourceFile, source.file);
    qlxStampEventInt(event, EventKey::kSourceLine, source.line);
  }
  if (source.function) qlxStampEvent(event, EventKey::kSourceFunction, source.function);
}

// ---- Properties taken back

static void freeNodes(StringToStringMapNode *node) {
  while (node) {
    StringToStringMapNode *next = node->next;
    OslMemoryFree(node->key);
    OslMemoryFree(node->value);
    OslMemoryFree(node);
    node = next;
  }
}

static bool isCacheable(const StringToStringMap *props) {
  int nodes = 0;
  for (const StringToStringMapNode *node = props->head; node; node = node->next, ++nodes) {
    if (!node->value || capacityOf(node->key) + capacityOf(node->value) > kMaxCachedBytes / 16) {
      return false;
    }
  }
  return nodes <= kMaxCachedNodes;
}

// What is not used for long must not grow.
static void cutCachedNodes() {
  StringToStringMapNode *node = gCache.nodes;
  for (int count = 1; node && count < kMaxCachedNodes; ++count) node = node->next;
  if (!node) return;
  freeNodes(node->next);
  node->next = nullptr;
}

static void takeBackProps(StringToStringMap *props) {
  if (!props) return;
  if (gCache.props || !isCacheable(props)) return qlxIntlFreeStringToStringMap(props);
  // What was not used this time stays behind what was.
  StringToStringMapNode *rest = gCache.nodes;
  StringToStringMapNode **end = &gCache.nodes;
  while (props->head) {
    *end = Nodes::unlink(props->head).release();
    end = &(*end)->next;
  }
  *end = rest;
  cutCachedNodes();
  gCache.props = props;
}

// ---- Events

static Event *refillEvent(const char *bundle, const char *key, const UChar *text) {
  I18Msg *message = gCache.event->message;
  const bool whole =
      lend(&message->bundle, &gCache.bundle, bundle, bundle ? std::strlen(bundle) : 0) &&
      lend(&message->key, &gCache.key, key, key ? std::strlen(key) : 0) &&
      lend(&message->text, &gCache.text, text, text ? cxUnitsLength(text) : 0);
  Event *event = gCache.event;
  gCache.event = nullptr;
  if (whole) return event;
  QlxFreeEvent(event);
  return nullptr;
}

LoggedEvent::LoggedEvent(int32_t level, const char *bundle, const char *key)
    : LoggedEvent(level, bundle, key, nullptr) {}

LoggedEvent::LoggedEvent(int32_t level, const UChar *text, const EventSource &source)
    : LoggedEvent(level, nullptr, nullptr, text) {
  if (event_) gNoted = {event_, source};
}

LoggedEvent::LoggedEvent(int32_t level, const char *bundle, const char *key, const UChar *text)
    : event_(nullptr) {
  if (gCache.event) event_ = refillEvent(bundle, key, text);
  if (!event_) {
    event_ = QlxVaAllocUEvent(level, bundle, key, text);
    if (event_ && !event_->message) qlxMissMemory(event_);
    return;
  }
  event_->time = CxSystemGetTimestamp();
  event_->level = level;
  event_->isMessage = bundle != nullptr;
  event_->status = {'-', 0};
}

static void takeBackMessage(I18Msg *message) {
  takeBack(&gCache.bundle, &message->bundle);
  takeBack(&gCache.key, &message->key);
  takeBack(&gCache.text, &message->text);
  if (message->parms) qlxIntlFreeParmList(message->parms);
  if (message->locale && !message->shared) OslMemoryFree(message->locale);
  *message = {};
}

LoggedEvent::~LoggedEvent() {
  if (!event_) return;
  gNoted.event = nullptr;
  I18Msg *message = event_->message;
  if (gCache.event || !message) {
    QlxFreeEvent(event_);
    return;
  }
  takeBackMessage(message);
  takeBackProps(event_->props);
  takeBack(&gCache.messageId, &event_->messageId);
  if (event_->locale) OslMemoryFree(event_->locale);
  *event_ = {};
  event_->message = message;
  gCache.event = event_;
}

void qlxDropCachedEvent(void) {
  QlxFreeEvent(gCache.event);
  OslMemoryFree(gCache.bundle);
  OslMemoryFree(gCache.key);
  OslMemoryFree(gCache.messageId);
  OslMemoryFree(gCache.text);
  qlxIntlFreeStringToStringMap(gCache.props);
  freeNodes(gCache.nodes);
  gCache = {};
}

static const CxHooks gHooks{{.atClose = qlxDropCachedEvent}};
