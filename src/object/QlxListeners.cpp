// Listeners: who gets an object's events, and the two basic operations that most classes share,
// passing an event on and reacting to the common configuration keys.
#include "QlxObject.h"

#include <qlx/class/containers.h>
#include <qlx/class/filter.h>
#include <qlx/class/handler.h>
#include <qlx/class/props.h>
#include <qlx/memory.h>
#include <qlx/object.h>
#include <qlx/props.h>

#include "QlxConfigKeys.h"
#include "QlxLocked.h"
#include "record/QlxLoggedEvent.h"
#include "QlxOperation.h"
#include "QlxProps.h"
#include "util/QlxGroupWalk.h"

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
  qlxCall({objClass, "fProcess"}, objClass->op1.fProcess, listener, event, args);
}

// One that is removed before its turn is left out, one that is added gets the event at the end, and
// none gets it twice. Those that had it and are removed are released when all have it.
static void passToAll(QlxObject *object, Event *event, va_list *args) {
  QlxGroupWalk<ListenerGroup, ListenerGroupNode> walk;
  while (const ListenerGroupNode *node = walk.step(qlxFetchListenerGroup(object, 0))) {
    const ObjectRef listener{qlxIntlAcquireObject(node->value)};
    passTo(listener.get(), event, args);
  }
  while (const auto removed = walk.takePassed()) qlxIntlReleaseObject(removed->value);
}

void QlxBasicObjectFLog(QlxObject *object, Event *event, va_list *args) {
  if (!object || !loadEnabled(object)) return;
  // A chain that leads back to an object on the current path ends there; an object that two
  // branches reach gets the event twice.
  if (!qlxIntlGetListeners(object) || (object->marks & kMarkPassing)) return;
  object->marks |= kMarkPassing;
  const ObjectRef held{qlxIntlAcquireObject(object)};
  passToAll(object, event, args);
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
