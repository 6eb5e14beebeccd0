// The two operations that most classes share: passing an event on to the listeners, and reacting to
// the configuration keys of every class.
#include <qlx/class/containers.h>
#include <qlx/class/object.h>
#include <qlx/class/props.h>
#include <qlx/memory.h>
#include <qlx/object.h>
#include <qlx/props.h>

#include "QlxConfigKeys.h"
#include "QlxListeners.h"
#include "QlxObject.h"
#include "QlxOperation.h"
#include "QlxProps.h"
#include "util/QlxGroupWalk.h"

// ---- Passing an event on

static void passTo(QlxObject *listener, Event *event, va_list *args) {
  const ObjClass *objClass = listener->objClass;
  const bool processes = isKind(listener, Filter) || isKind(listener, Handler);
  if (!processes || !objClass->op1.fProcess || (listener->marks & kMarkPassing)) return;
  qlxCall({objClass, "fProcess"}, objClass->op1.fProcess, listener, event, args);
}

// One that is removed before its turn is left out, one that is added gets the event at the end, and
// none gets it twice. Those that had it and are removed are released when all have it.
static void passToAll(QlxObject *object, Event *event, va_list *args) {
  QlxGroupWalk<ListenerGroup, ListenerGroupNode> walk;
  const auto group = [object] { return object->objClass ? *qlxListenersOf(object) : nullptr; };
  while (const ListenerGroupNode *node = walk.step(group())) {
    const KeptObject listener{node->value};
    passTo(listener.get(), event, args);
  }
  while (const auto removed = walk.takePassed()) qlxIntlReleaseObject(removed->value);
}

void QlxBasicObjectFLog(QlxObject *object, Event *event, va_list *args) {
  if (!object || !loadEnabled(object)) return;
  // A chain that leads back to an object on the current path ends there; an object that two
  // branches reach gets the event twice.
  ListenerGroup **group = qlxListenersOf(object);
  if (!group || !*group || !(*group)->head || (object->marks & kMarkPassing)) return;
  object->marks |= kMarkPassing;
  const KeptObject kept{object};
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
