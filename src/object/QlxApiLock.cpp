// The API lock: one plain, non-recursive mutex around all of the library's state. It is made by the
// first call that needs it and then stays for the life of the process: closing the toolkit must not
// free it under a thread that still waits. A child forked while other threads log finds it free.
// A thread cannot be cancelled while it has the lock: it would leave it, and all that it guards,
// as they are.
#include "QlxLocked.h"

#include <atomic>

#include <qlx/system.h>
#include <qlx/toolkit.h>

#include "util/CxHooks.h"
#include "util/CxMutex.h"
#include "util/CxThread.h"

namespace {

std::atomic<CxMutex> gMutex;     // set once
std::atomic<bool> gForkHandled;  // the fork handlers are registered, or about to be
std::atomic<pthread_t> gHolder;  // who holds gMutex; only the holder itself relies on it
bool gTakenForFork;              // written and read only by the thread that holds gMutex
CxCancellation gCancellation;    // of the thread that holds gMutex, as it was before

bool heldByThisThread() {
  return gHolder.load(std::memory_order_relaxed) == pthread_self();
}

void beforeFork() {
  const bool held = heldByThisThread();
  if (held || qlxAPIMutexLock()) gTakenForFork = !held;
  CxHooks::beforeFork();
}

void afterFork(bool isChild) {
  CxHooks::afterFork(isChild);
  if (heldByThisThread() && gTakenForFork) qlxAPIMutexUnlock();
}

void afterForkInParent() {
  afterFork(false);
}

void afterForkInChild() {
  afterFork(true);
}

// Threads that make their first call at the same time may each make a mutex; the first one stays.
// Nothing is locked meanwhile, so a fork leaves nothing locked.
CxStatus makeMutex() {
  CxMutex made = nullptr;
  const CxStatus status = CxMutexCreate(&made);
  if (cxFailed(status)) return status;
  // Without memory for the registration the lock still works; only a fork while another thread logs
  // is then unprotected.
  if (!gForkHandled.exchange(true))
    (void)pthread_atfork(beforeFork, afterForkInParent, afterForkInChild);
  CxMutex none = nullptr;
  if (!gMutex.compare_exchange_strong(none, made)) CxMutexDestroy(&made);
  return status;
}

bool succeeded(CxStatus status) {
  if (!cxFailed(status)) return true;
  QlxReportPlatformErr(status);
  return false;
}

bool take() {
  if (!gMutex.load(std::memory_order_acquire) && !succeeded(makeMutex())) return false;
  return succeeded(cxMutexLock(gMutex.load(std::memory_order_acquire)));
}

}  // namespace

uint8_t qlxAPIMutexLock(void) {
  const CxCancellation before = cxThreadDisableCancel();
  if (!take()) {
    cxThreadRestoreCancel(before);
    return 0;
  }
  gCancellation = before;
  gHolder.store(pthread_self(), std::memory_order_relaxed);
  return 1;
}

void qlxAPIMutexUnlock(void) {
  CxMutex mutex = gMutex.load(std::memory_order_acquire);
  if (!mutex) return;
  const bool isHolder = heldByThisThread();
  const CxCancellation before = gCancellation;
  gHolder.store(pthread_t{}, std::memory_order_relaxed);
  succeeded(cxMutexUnlock(mutex));
  if (isHolder) cxThreadRestoreCancel(before);
}
