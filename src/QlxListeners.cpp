// Listeners: who gets an object's events, and the two basic operations that most classes share,
// passing an event on and reacting to the common configuration keys.
#include "QlxObject.h"

#include <array>

#include <qlx/class/containers.h>
#include <qlx/class/filter.h>
#include <qlx/class/handler.h>
#include <qlx/class/props.h>
#include <qlx/memory.h>
#include <qlx/object.h>
#include <qlx/props.h>

#include "QlxConfigKeys.h"
#include "QlxLocked.h"
#include "QlxLoggedEvent.h"
#include "QlxProps.h"

static ListenerGroup **groupField(QlxObject *object) {
  if (!object || !object->objClass) return nullptr;
  switch (object->objClass->kind) {
    case Logger:
    case Filter:
      return &object->kind2.listeners;
    case Handler:
      return &object->kind1.listeners;
    default:
      return nullptr;
  }
}

ListenerGroup *qlxFetchListenerGroup(QlxObject *object, uint8_t create) {
  ListenerGroup **group = groupField(object);
  if (!group) return nullptr;
  if (!*group && create == 1) *group = qlxIntlAllocListenerGroup();
  return *group;
}

void qlxFreeListeners(QlxObject *object) {
  ListenerGroup **group = groupField(object);
  if (!group) return;
  ListenerGroup *listeners = *group;
  *group = nullptr;  // a listener that goes may ask for the group
  qlxIntlFreeListenerGroup(listeners);
}

uint8_t qlxIntlAddListener(QlxObject *object, QlxObject *listener) {
  if (!listener || !listener->objClass) return 0;
  return qlxIntlListenerGroupAdd(qlxFetchListenerGroup(object, 1), listener);
}

uint8_t qlxIntlRemListener(QlxObject *object, QlxObject *listener) {
  return qlxIntlListenerGroupRem(qlxFetchListenerGroup(object, 0), listener);
}

ListenerGroupNode *qlxIntlGetListeners(QlxObject *object) {
  return qlxIntlListenerGroupIterator(qlxFetchListenerGroup(object, 0));
}

// ---- Passing an event on

namespace {

// Counted references to a group's members, so that an operation may change the group meanwhile.
// Without memory for all of them: to the first few.
class Snapshot {
 public:
  Snapshot(const ListenerGroupNode *head, size_t needed) {
    if (needed > few_.size()) {
      many_.reset(static_cast<QlxObject **>(
          OslMemoryMalloc(static_cast<uint32_t>(needed * sizeof(QlxObject *)))));
      if (many_) members_ = many_.get();
    }
    const size_t room = many_ ? needed : few_.size();
    for (; head && count_ < room; head = head->next) {
      members_[count_++] = qlxIntlAcquireObject(head->value);
    }
  }
  ~Snapshot() {
    for (QlxObject *member : *this) qlxIntlReleaseObject(member);
  }
  Snapshot(const Snapshot &) = delete;
  Snapshot &operator=(const Snapshot &) = delete;

  QlxObject **begin() const { return members_; }
  QlxObject **end() const { return members_ + count_; }
  size_t size() const { return count_; }

 private:
  std::array<QlxObject *, 16> few_;
  Owned<QlxObject *, OslMemoryFree> many_;
  QlxObject **members_ = few_.data();
  size_t count_ = 0;
};

}  // namespace

static size_t countFrom(const ListenerGroupNode *node) {
  size_t count = 0;
  for (; node; node = node->next) ++count;
  return count;
}

static ListenerGroupNode *nodeOf(QlxObject *listener, QlxObject *object) {
  return QlxListenerGroupGetLink(qlxFetchListenerGroup(object, 0), listener);
}

// The listener after the last of these that is still there.
static QlxObject *listenerAfter(const Snapshot &listeners, QlxObject *object) {
  for (QlxObject **last = listeners.end(); last != listeners.begin();) {
    const ListenerGroupNode *node = nodeOf(*--last, object);
    if (node) return node->next ? node->next->value : nullptr;
  }
  return nullptr;
}

// The operations that take an event whose source is only noted, and settle it where they have to.
static bool asksForNotedSource(fProcess process) {
  return process == QlxFileUHandlerFProcess || process == QlxMultiProcFileUHandlerFProcess ||
         process == QlxBasicFilterFProcess;
}

static void passTo(QlxObject *listener, Event *event, va_list *args) {
  const ObjClass *objClass = listener->objClass;
  const bool processes = isKind(listener, Filter) || isKind(listener, Handler);
  if (!processes || !objClass->op1.fProcess || (listener->marks & kMarkPassing)) return;
  if (!asksForNotedSource(objClass->op1.fProcess)) qlxSettleEvent(event);
  objClass->op1.fProcess(listener, event, args);
}

// Passes an event to the listeners from a node on, to no more than `left`. Returns the one that is
// next where memory was short for all of them.
static ObjectRef passToSome(const ListenerGroupNode *node, size_t &left, QlxObject *object,
                            Event *event, va_list *args) {
  const Snapshot listeners(node, left);
  for (QlxObject *listener : listeners) passTo(listener, event, args);
  left -= listeners.size();
  return ObjectRef{left > 0 ? qlxIntlAcquireObject(listenerAfter(listeners, object)) : nullptr};
}

static void passToAll(const ListenerGroupNode *head, QlxObject *object, Event *event,
                      va_list *args) {
  size_t left = countFrom(head);
  ObjectRef next = passToSome(head, left, object, event, args);
  while (next) next = passToSome(nodeOf(next.get(), object), left, object, event, args);
}

void QlxBasicObjectFLog(QlxObject *object, Event *event, va_list *args) {
  if (!object || !loadEnabled(object)) return;
  ListenerGroupNode *head = qlxIntlGetListeners(object);
  // A chain that leads back to an object on the current path ends there; an object that two
  // branches reach gets the event twice.
  if (!head || (object->marks & kMarkPassing)) return;
  object->marks |= kMarkPassing;
  const ObjectRef held{qlxIntlAcquireObject(object)};
  if (head->next)
    passToAll(head, object, event, args);
  else
    passTo(ObjectRef{qlxIntlAcquireObject(head->value)}.get(), event, args);
  object->marks &= static_cast<uint8_t>(~kMarkPassing);
}

// ---- The common configuration keys

static void applyLogging(QlxObject *object, const char *key) {
  struct Word {
    const char *word;
    uint8_t enabled;
  };
  static constexpr Word kWords[] = {{"on", 1}, {"true", 1}, {"off", 0}, {"false", 0}};
  const char *value = qlxPeekMapProp(object->props, key);
  for (const Word &row : kWords) {
    if (value && OslStringICmp(value, row.word) == 0) return storeEnabled(object, row.enabled);
  }
}

static void applyListenerNames(QlxObject *object, const char *key) {
  qlxFreeListeners(object);
  const OwnedStr names{qlxIntlGetObjProp(object, key, nullptr)};
  for (QlxStrTok rest = QlxStrTokIterator(names.get(), " \t\r\n\f\v"); QlxStrTokIterHasNext(rest);
       rest = QlxStrTokIterNext(rest)) {
    const OwnedStr name{QlxStrTokIterGet(rest)};
    const ObjectRef listener{qlxIntlGetObject(name.get(), nullptr)};
    qlxIntlAddListener(object, listener.get());
  }
}

// Deliberate: accepted without effect.
static void applyNothing(QlxObject *, const char *) {}

static constexpr ConfigKey kCommonKeys[] = {
    {"description", applyNothing},    {"descriptionFile", applyNothing},
    {"descriptionSet", applyNothing}, {"descriptionKey", applyNothing},
    {"logging", applyLogging},        {"listenerNames", applyListenerNames},
};

void QlxBasicObjectFCfgChange(QlxObject *object, const char *key) {
  if (!object || !object->objClass || !key) return;
  qlxApplyConfigKey(kCommonKeys, object, key);
}

// Public functions

uint8_t QlxAddListener(QlxObject *object, QlxObject *listener) {
  return qlxLocked<qlxIntlAddListener>(object, listener);
}

uint8_t QlxRemListener(QlxObject *object, QlxObject *listener) {
  return qlxLocked<qlxIntlRemListener>(object, listener);
}

ListenerGroupNode *QlxGetListeners(QlxObject *object) {
  return qlxLocked<qlxIntlGetListeners>(object);
}
