#include "QlxListeners.h"

#include <qlx/class/containers.h>
#include <qlx/class/object.h>
#include <qlx/object.h>

#include "QlxLocked.h"

ListenerGroup *qlxFetchListenerGroup(QlxObject *object, uint8_t create) {
  ListenerGroup **group = qlxListenersOf(object);
  if (!group) return nullptr;
  if (!*group && create == 1) *group = qlxIntlAllocListenerGroup();
  return *group;
}

void qlxFreeListeners(QlxObject *object) {
  ListenerGroup **group = qlxListenersOf(object);
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
