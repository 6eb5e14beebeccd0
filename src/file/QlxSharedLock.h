// The lock between processes: a semaphore that all who know its key share.
#ifndef QLX_SRC_QLXSHAREDLOCK_H
#define QLX_SRC_QLXSHAREDLOCK_H

#include <qlx/types.h>

struct QlxSharedLock {
  uint8_t semReady;  // 1 once the semaphore is there
  int32_t semKey;    // key of the semaphore that processes share
  int32_t semId;     // its identifier; -1: none
};

/** Makes the semaphore set of the key, free, or attaches to it as it is. */
CxStatus qlxSharedLockSetUp(QlxSharedLock *lock);

/** Waits for the semaphore. Deliberate: after the eleventh interruption it goes on without, so that
 *  a record is rather written unserialised than lost. */
CxStatus qlxSharedLockTake(const QlxSharedLock *lock);

/** Gives the semaphore back, unless it is free already: its value never rises above 1. */
CxStatus qlxSharedLockGiveBack(const QlxSharedLock *lock);

#endif
