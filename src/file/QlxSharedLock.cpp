// The semaphore that serialises the processes of one shared file: one System V semaphore, 1 is
// free, 0 is held. Every change carries SEM_UNDO, so that the kernel gives it back when its holder
// dies. The library never removes the set.
#include "QlxSharedLock.h"

#include <algorithm>
#include <cerrno>
#include <iterator>

#include <sched.h>
#include <sys/ipc.h>
#include <sys/sem.h>
#include <unistd.h>

#include "QlxProblems.h"
#include "util/CxStatus.h"

static constexpr int kFinalErrors[] = {EACCES, EINVAL, ENOENT, ENOSPC};  // of making a set
static constexpr int kMaxRetries = 10;
static constexpr int kEagerAttempts = 40;
static constexpr int kAttemptsPerTurn = 10;  // of the processor, which the holder may need
static constexpr unsigned kRetrySeconds = 1;

// semctl()'s argument is the caller's to declare.
union SemaphoreArgument {
  int val;
};

// ---- Set-up

static bool isFinal(int error) {
  return std::find(std::begin(kFinalErrors), std::end(kFinalErrors), error) !=
         std::end(kFinalErrors);
}

// Frees the semaphore of the set just made, which came with the value 0.
static CxStatus freeNewSet(QlxSharedLock *lock) {
  if (semctl(lock->semId, 0, SETVAL, SemaphoreArgument{1}) != -1) return kCxSuccess;
  const CxStatus status = cxFailure(errno);
  semctl(lock->semId, 0, IPC_RMID);  // left at 0 it would block the next process for ever
  lock->semId = -1;
  return status;
}

// Deliberate: leaves the value alone, for the set may be held.
static CxStatus attach(QlxSharedLock *lock) {
  lock->semId = semget(lock->semKey, 1, 0);
  return cxStatusOfCall(lock->semId != -1);
}

CxStatus qlxSharedLockSetUp(QlxSharedLock *lock) {
  lock->semId = semget(lock->semKey, 1, IPC_CREAT | IPC_EXCL | 0666);
  if (lock->semId == -1 && isFinal(errno)) return cxFailure(errno);
  const CxStatus status = lock->semId == -1 ? attach(lock) : freeNewSet(lock);
  if (!cxFailed(status)) lock->semReady = 1;
  return status;
}

// ---- Lock and unlock

static bool take(const QlxSharedLock *lock, int flags) {
  sembuf take = {0, -1, static_cast<short>(flags | SEM_UNDO)};
  return semop(lock->semId, &take, 1) == 0;
}

// Most holders are done within two microseconds: asking again for as long, and then giving up the
// processor, is cheaper than being put to sleep and woken.
static bool takeEagerly(const QlxSharedLock *lock) {
  for (int attempt = 1; attempt <= kEagerAttempts; ++attempt) {
    if (take(lock, IPC_NOWAIT)) return true;
    if (errno != EAGAIN) return false;
    if (attempt % kAttemptsPerTurn == 0) sched_yield();
  }
  return false;
}

CxStatus qlxSharedLockTake(const QlxSharedLock *lock) {
  if (takeEagerly(lock)) return kCxSuccess;  // whatever failed there, only the next ones count
  for (int retries = 0; retries <= kMaxRetries; ++retries) {
    if (take(lock, 0)) return kCxSuccess;
    if (errno != ENOSPC && errno != EINTR) return cxFailure(errno);
    sleep(kRetrySeconds);
  }
  return kCxSuccess;  // Deliberate: goes on without the semaphore
}

// Looks and adds in one step: between two steps another unlock could make it 2. A system that takes
// one operation at a time gets them in two, for a semaphore that is not given back stops everybody.
static bool giveBackIfHeld(const QlxSharedLock *lock) {
  sembuf giveBack = {0, 1, SEM_UNDO};
  sembuf both[] = {{0, 0, IPC_NOWAIT}, giveBack};
  if (semop(lock->semId, both, std::size(both)) == 0) return true;
  return errno != EAGAIN && semctl(lock->semId, 0, GETVAL) == 0 &&
         semop(lock->semId, &giveBack, 1) == 0;
}

CxStatus qlxSharedLockGiveBack(const QlxSharedLock *lock) {
  return lock->semReady == 1 ? cxStatusOfCall(giveBackIfHeld(lock)) : kCxSuccess;
}
