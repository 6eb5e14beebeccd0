// Who gets an object's events: the group of its listeners, which loggers, filters and handlers
// have.
#ifndef QLX_SRC_QLXLISTENERS_H
#define QLX_SRC_QLXLISTENERS_H

#include <qlx/types.h>

// Where an object keeps its group, which is null until it has a listener; null for one of a kind
// that has none.
inline ListenerGroup **qlxListenersOf(QlxObject *object) {
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

QLX_BEGIN_DECLS

/** Frees an object's listener group, which releases the listeners. */
void qlxFreeListeners(QlxObject *object);

QLX_END_DECLS

#endif
