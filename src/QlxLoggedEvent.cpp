#include "QlxLoggedEvent.h"

#include <cstring>
#include <malloc.h>

#include <qlx/class/containers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/memory.h>
#include <qlx/system.h>

#include "QlxProps.h"
#include "util/CxDecimal.h"
#include "util/CxStatus.h"
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

// A block of an unusual size is not kept for all that come after it.
static constexpr size_t kMaxKeptBytes = 64 * 1024;
static constexpr int kMaxKeptNodes = 32;

// Of the last event, emptied. All null while its successor is on its way: a log call that a class's
// operation makes then gets an event of its own.
static struct {
  Event *event;  // with a message; neither has contents
  char *bundle, *key, *messageId;
  UChar *text;
  StringToStringMap *props;      // empty
  StringToStringMapNode *nodes;  // linked by next, in the order in which they were set
} gKept;

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

// Moves a kept block, with a text in it, to where it is wanted; null for null.
template <typename Char>
static bool lend(Char **to, Char **kept, const Char *text, size_t length) {
  if (!text) return true;
  if (!refill(kept, text, length)) return false;
  *to = *kept;
  *kept = nullptr;
  return true;
}

template <typename Char>
static void takeBack(Char **kept, Char **from) {
  if (*from && capacityOf(*from) <= kMaxKeptBytes) std::swap(*kept, *from);
  OslMemoryFree(*from);
  *from = nullptr;
}

void qlxMissMemory(Event *event) {
  event->status = cxFailure(ENOMEM);
}

bool qlxMissedMemory(const Event *event) {
  return event->status.kind == 'p' && event->status.code == ENOMEM;
}

// ---- Properties

// The first kept node, with that key and value; null when there is none or memory ran out.
static StringToStringMapNode *refillNode(const char *key, std::string_view value) {
  StringToStringMapNode *node = gKept.nodes;
  if (!node) return nullptr;
  // Calls of one kind set the same keys in the same order.
  const bool sameKey = std::strcmp(node->key, key) == 0;
  if (!sameKey && !refill(&node->key, key, std::strlen(key))) return nullptr;
  if (!refill(&node->value, value.data(), value.size())) return nullptr;
  gKept.nodes = node->next;
  return node;
}

// A map may have kept the key without its value.
static void stampAnew(Event *event, const char *key, const char *value) {
  if (QlxSetEventProp(event, key, value) && qlxPeekMapProp(event->props, key)) return;
  qlxMissMemory(event);
}

void qlxStampEvent(Event *event, const char *key, std::string_view value) {
  if (!event->props) std::swap(event->props, gKept.props);
  StringToStringMap *props = event->props;
  StringToStringMapNode *node = nullptr;
  const bool isNew = props && (!props->head || !qlxIntlStringToStringMapHasKey(props, key));
  if (isNew) node = refillNode(key, value);
  if (!node) return stampAnew(event, key, value.data());
  node->owner = props;
  Nodes::linkAtTail(node);
}

void qlxStampEventInt(Event *event, const char *key, int32_t value) {
  char digits[kMaxDecimalDigits + 2];
  char *const end = digits + sizeof digits - 1;
  *end = '\0';
  char *first = cxDecimalBefore(end, cxMagnitude(value), '0');
  if (value < 0) *--first = '-';
  qlxStampEvent(event, key, {first, static_cast<size_t>(end - first)});
}

void qlxStampEventMessageId(Event *event, std::string_view messageId) {
  const bool stamped =
      lend(&event->messageId, &gKept.messageId, messageId.data(), messageId.size());
  if (!stamped) qlxMissMemory(event);
}

// ---- Where an event comes from

const EventSource *qlxNotedEventSource(const Event *event) {
  return event && gNoted.event == event ? &gNoted.source : nullptr;
}

static void stampSource(Event *event, const EventSource &source) {
  if (source.file) {
    qlxStampEvent(event, "qlx_prop_srcfile", source.file);
    qlxStampEventInt(event, "qlx_prop_srcline", source.line);
  }
  if (source.function) qlxStampEvent(event, "qlx_prop_srcfunction", source.function);
}

void qlxSettleEvent(Event *event) {
  if (!qlxNotedEventSource(event)) return;
  gNoted.event = nullptr;
  stampSource(event, gNoted.source);
}

void qlxSettleNotedEvent(void) {
  qlxSettleEvent(gNoted.event);
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

static bool isKeepable(const StringToStringMap *props) {
  int nodes = 0;
  for (const StringToStringMapNode *node = props->head; node; node = node->next, ++nodes) {
    if (!node->value || capacityOf(node->key) + capacityOf(node->value) > kMaxKeptBytes / 16) {
      return false;
    }
  }
  return nodes <= kMaxKeptNodes;
}

// What is not used for long must not grow.
static void cutKeptNodes() {
  StringToStringMapNode *node = gKept.nodes;
  for (int count = 1; node && count < kMaxKeptNodes; ++count) node = node->next;
  if (!node) return;
  freeNodes(node->next);
  node->next = nullptr;
}

static void takeBackProps(StringToStringMap *props) {
  if (!props) return;
  if (gKept.props || !isKeepable(props)) return qlxIntlFreeStringToStringMap(props);
  // What was not used this time stays behind what was.
  StringToStringMapNode *rest = gKept.nodes;
  StringToStringMapNode **end = &gKept.nodes;
  while (props->head) {
    *end = Nodes::unlink(props->head).release();
    end = &(*end)->next;
  }
  *end = rest;
  cutKeptNodes();
  gKept.props = props;
}

// ---- Events

static Event *refillEvent(const char *bundle, const char *key, const UChar *text) {
  I18Msg *message = gKept.event->message;
  const bool whole =
      lend(&message->bundle, &gKept.bundle, bundle, bundle ? std::strlen(bundle) : 0) &&
      lend(&message->key, &gKept.key, key, key ? std::strlen(key) : 0) &&
      lend(&message->text, &gKept.text, text, text ? cxUnitsLength(text) : 0);
  Event *event = gKept.event;
  gKept.event = nullptr;
  if (whole) return event;
  QlxFreeEvent(event);
  return nullptr;
}

LoggedEvent::LoggedEvent(int32_t level, const char *bundle, const char *key, const UChar *text)
    : event_(nullptr) {
  if (gKept.event) event_ = refillEvent(bundle, key, text);
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

void LoggedEvent::noteSource(const EventSource &source) const {
  gNoted = {event_, source};
}

static void takeBackMessage(I18Msg *message) {
  takeBack(&gKept.bundle, &message->bundle);
  takeBack(&gKept.key, &message->key);
  takeBack(&gKept.text, &message->text);
  qlxIntlFreeParmList(message->parms);
  if (!message->shared) OslMemoryFree(message->locale);
  *message = {};
}

LoggedEvent::~LoggedEvent() {
  if (!event_) return;
  gNoted.event = nullptr;
  I18Msg *message = event_->message;
  if (gKept.event || !message) {
    QlxFreeEvent(event_);
    return;
  }
  takeBackMessage(message);
  takeBackProps(event_->props);
  takeBack(&gKept.messageId, &event_->messageId);
  OslMemoryFree(event_->locale);
  *event_ = {};
  event_->message = message;
  gKept.event = event_;
}

void qlxDropKeptEvent(void) {
  QlxFreeEvent(gKept.event);
  OslMemoryFree(gKept.bundle);
  OslMemoryFree(gKept.key);
  OslMemoryFree(gKept.messageId);
  OslMemoryFree(gKept.text);
  qlxIntlFreeStringToStringMap(gKept.props);
  freeNodes(gKept.nodes);
  gKept = {};
}
