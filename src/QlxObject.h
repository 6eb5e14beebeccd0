// The life of an object: made by name, counted, retired. A retired object is an inert header: its
// contents are gone, its class is null, and its memory stays until the last reference is given
// back.
#ifndef QLX_SRC_QLXOBJECT_H
#define QLX_SRC_QLXOBJECT_H

#include <atomic>

#include <qlx/class/object.h>

#include "util/CxOwned.h"

using ObjectRef = Owned<QlxObject, qlxIntlReleaseObject>;  // one counted reference

// Bits of QlxObject::marks.
enum ObjectMark : uint8_t {
  kMarkPassing = 1,  // passes an event on right now: a chain that comes back here ends
  kMarkClosed = 2,   // a handler whose fClose has run for the last time
  kMarkDying = 4,    // being destroyed: no release destroys it again
};

// The upper bits of QlxObject::marks count the steps of closing that the object has taken.
inline uint8_t closingStepsTaken(const QlxObject *object) {
  return object->marks >> 4;
}
inline void countClosingStep(QlxObject *object) {
  object->marks += 1 << 4;
}

inline bool isKind(const QlxObject *object, int32_t kind) {
  return object && object->objClass && object->objClass->kind == kind;
}

// The two fields that a log call reads without the lock.
inline uint8_t loadEnabled(const QlxObject *object) {
  return std::atomic_ref(const_cast<QlxObject *>(object)->enabled).load(std::memory_order_relaxed);
}
inline int32_t loadLevel(const QlxObject *object) {
  return std::atomic_ref(const_cast<QlxObject *>(object)->kind1.level)
      .load(std::memory_order_relaxed);
}
inline void storeEnabled(QlxObject *object, uint8_t flag) {
  std::atomic_ref(object->enabled).store(flag, std::memory_order_relaxed);
}
inline void storeLevel(QlxObject *object, int32_t level) {
  // Objects of the other kinds keep a pointer there.
  if (!isKind(object, Logger) && !isKind(object, Filter)) return;
  std::atomic_ref(object->kind1.level).store(level, std::memory_order_relaxed);
}

/** Closes a handler for good: its class's fClose runs once, whoever asks first. */
void qlxCloseHandlerOnce(QlxObject *object);

/** Has a class free the variables of an object of its; they may be null. */
void qlxFreeVars(const ObjClass *objClass, void *vars);

/** Frees an object's listener group, which releases the listeners. */
void qlxFreeListeners(QlxObject *object);

/** Destroys the contents; what is left is an inert header. The caller has a reference. */
void qlxRetireObject(QlxObject *object);

#endif
