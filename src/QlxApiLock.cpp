// The API lock: one plain, non-recursive mutex around all of the library's state. It is made by the
// first call that needs it and then stays for the life of the process: closing the toolkit must not
// free it under a thread that still waits. A child forked while other threads log finds it free.
#include "QlxLocked.h"

#include <atomic>

#include <qlx/system.h>
#include <qlx/toolkit.h>

#include "QlxHeldFormats.h"

namespace {

pthread_mutex_t gMaking = PTHREAD_MUTEX_INITIALIZER;  // guards the making of gMutex
CxMutex gMutex;                                       // written once, before gMade
std::atomic<bool> gMade;
std::atomic<pthread_t> gHolder;  // who holds gMutex; only the holder itself relies on it
bool gTakenForFork;              // written and read only by the thread that holds gMutex

bool heldByThisThread() {
  return gHolder.load(std::memory_order_relaxed) == pthread_self();
}

void beforeFork() {
  const bool take = !heldByThisThread();
  if (take) qlxAPIMutexLock();
  gTakenForFork = take;
  qlxHeldFormatsLock();
}

void afterFork() {
  qlxHeldFormatsUnlock();
  if (gTakenForFork) qlxAPIMutexUnlock();
}

CxStatus makeMutex() {
  pthread_mutex_lock(&gMaking);
  CxStatus status = {'-', 0};
  if (!gMade.load(std::memory_order_relaxed)) {
    status = CxMutexCreate(&gMutex);
    if (status.kind == '-') {
      // Without memory for the registration the lock still works; only a fork while another thread
      // logs is then unprotected.
      (void)pthread_atfork(beforeFork, afterFork, afterFork);
      gMade.store(true, std::memory_order_release);
    }
  }
  pthread_mutex_unlock(&gMaking);
  return status;
}

bool succeeded(CxStatus status) {
  if (status.kind == '-') return true;
  QlxReportPlatformErr(status);
  return false;
}

}  // namespace

uint8_t qlxAPIMutexLock(void) {
  if (!gMade.load(std::memory_order_acquire) && !succeeded(makeMutex())) return 0;
  if (!succeeded(CxMutexLock(&gMutex))) return 0;
  gHolder.store(pthread_self(), std::memory_order_relaxed);
  return 1;
}

void qlxAPIMutexUnlock(void) {
  if (!gMade.load(std::memory_order_acquire)) return;
  gHolder.store(pthread_t{}, std::memory_order_relaxed);
  succeeded(CxMutexUnlock(&gMutex));
}
