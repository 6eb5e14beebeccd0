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

#include "QlxMultiProcFileHandler.h"
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
static CxStatus freeNewSet(QlxFileHandlerVars *vars) {
  if (semctl(vars->semId, 0, SETVAL, SemaphoreArgument{1}) != -1) return kCxSuccess;
  const CxStatus status = cxFailure(errno);
  semctl(vars->semId, 0, IPC_RMID);  // left at 0 it would block the next process for ever
  vars->semId = -1;
  return status;
}

// Deliberate: leaves the value alone, for the set may be held.
static CxStatus attach(QlxFileHandlerVars *vars) {
  vars->semId = semget(vars->semKey, 1, 0);
  return cxStatusOfCall(vars->semId != -1);
}

CxStatus qlxSharedLockSetUp(QlxFileHandlerVars *vars) {
  vars->semId = semget(vars->semKey, 1, IPC_CREAT | IPC_EXCL | 0666);
  if (vars->semId == -1 && isFinal(errno)) return cxFailure(errno);
  const CxStatus status = vars->semId == -1 ? attach(vars) : freeNewSet(vars);
  if (!qlxFailed(status)) vars->semReady = 1;
  return status;
}

// ---- Lock and unlock

static bool take(const QlxFileHandlerVars *vars, int flags) {
  sembuf take = {0, -1, static_cast<short>(flags | SEM_UNDO)};
  return semop(vars->semId, &take, 1) == 0;
}

// Most holders are done within two microseconds: asking again for as long, and then giving up the
// processor, is cheaper than being put to sleep and woken.
static bool takeEagerly(const QlxFileHandlerVars *vars) {
  for (int attempt = 1; attempt <= kEagerAttempts; ++attempt) {
    if (take(vars, IPC_NOWAIT)) return true;
    if (errno != EAGAIN) return false;
    if (attempt % kAttemptsPerTurn == 0) sched_yield();
  }
  return false;
}

CxStatus qlxSharedLockTake(QlxFileHandlerVars *vars) {
  if (takeEagerly(vars)) return kCxSuccess;  // whatever failed there, only the next ones count
  for (int retries = 0; retries <= kMaxRetries; ++retries) {
    if (take(vars, 0)) return kCxSuccess;
    if (errno != ENOSPC && errno != EINTR) return cxFailure(errno);
    sleep(kRetrySeconds);
  }
  return kCxSuccess;  // Deliberate: goes on without the semaphore
}

// Looks and adds in one step: between two steps another unlock could make it 2. A system that takes
// one operation at a time gets them in two, for a semaphore that is not given back stops everybody.
static bool giveBackIfHeld(const QlxFileHandlerVars *vars) {
  sembuf giveBack = {0, 1, SEM_UNDO};
  sembuf both[] = {{0, 0, IPC_NOWAIT}, giveBack};
  if (semop(vars->semId, both, std::size(both)) == 0) return true;
  return errno != EAGAIN && semctl(vars->semId, 0, GETVAL) == 0 &&
         semop(vars->semId, &giveBack, 1) == 0;
}

void qlxMultiProcFileHandlerUnlockSem(QlxFileHandlerVars *vars) {
  if (!vars || vars->semReady != 1) return;
  qlxKeepFailure(nullptr, cxStatusOfCall(giveBackIfHeld(vars)));
}

uint8_t qlxMultiProcFileHandlerInitSem(QlxFileHandlerVars *vars) {
  if (!vars) return 0;
  const CxStatus status = qlxSharedLockSetUp(vars);
  qlxKeepFailure(nullptr, status);
  return !qlxFailed(status);
}

uint8_t qlxMultiProcFileHandlerLockSem(QlxFileHandlerVars *vars) {
  if (!vars) return 0;
  const CxStatus status = qlxSharedLockTake(vars);
  qlxKeepFailure(nullptr, status);
  return !qlxFailed(status);
}
