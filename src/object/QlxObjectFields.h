// What an object's header says, for those who need no more of it.
#ifndef QLX_SRC_QLXOBJECTFIELDS_H
#define QLX_SRC_QLXOBJECTFIELDS_H

#include <atomic>

#include <qlx/types.h>

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

#endif
