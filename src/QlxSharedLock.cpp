// The semaphore that serialises the processes of one shared file. One System V semaphore: 1 is
// free, 0 is held. The kernel gives it back when its holder dies; the library never removes the
// set.
#include "QlxMultiProcFileHandler.h"

#include <cerrno>

#include <sched.h>
#include <sys/ipc.h>
#include <sys/sem.h>
#include <unistd.h>

#include "QlxSharedLock.h"
#include "util/CxStatus.h"

static constexpr int kMaxRetries = 10;
static constexpr int kEagerAttempts = 40;  // each gives up the processor; a sleep costs more

// semctl()'s argument is the caller's to declare.
union SemaphoreArgument {
  int val;
};

static bool isFinal(int error) {
  return error == EACCES || error == EINVAL || error == ENOENT || error == ENOSPC;
}

CxStatus qlxSharedLockSetUp(QlxFileHandlerVars *vars) {
  vars->semId = semget(vars->semKey, 1, IPC_CREAT | IPC_EXCL | 0666);
  const bool created = vars->semId != -1;
  if (!created) {
    if (isFinal(errno)) return cxFailure(errno);
    vars->semId = semget(vars->semKey, 1, 0);
    if (vars->semId == -1) return cxFailure(errno);
  }
  // Whoever attaches leaves the value alone: the set may be held.
  if (created && semctl(vars->semId, 0, SETVAL, SemaphoreArgument{1}) == -1) {
    const int error = errno;
    semctl(vars->semId, 0, IPC_RMID);  // left at 0 it would block the next process for ever
    vars->semId = -1;
    return cxFailure(error);
  }
  vars->semReady = 1;
  return kCxSuccess;
}

static bool operate(const QlxFileHandlerVars *vars, short change, short flags) {
  sembuf operation = {0, change, static_cast<short>(flags | SEM_UNDO)};
  return semop(vars->semId, &operation, 1) == 0;
}

CxStatus qlxSharedLockTake(QlxFileHandlerVars *vars) {
  for (int attempt = 0; attempt < kEagerAttempts; ++attempt) {
    if (operate(vars, -1, IPC_NOWAIT)) return kCxSuccess;
    if (errno != EAGAIN) break;  // the blocking operation finds out, its errors count alone
    sched_yield();
  }
  for (int retries = 0; !operate(vars, -1, 0);) {
    if (errno != ENOSPC && errno != EINTR) return cxFailure(errno);
    sleep(1);
    if (++retries > kMaxRetries) break;  // Deliberate: goes on without the semaphore
  }
  return kCxSuccess;
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

void qlxMultiProcFileHandlerUnlockSem(QlxFileHandlerVars *vars) {
  if (!vars || vars->semReady != 1) return;
  const bool held = semctl(vars->semId, 0, GETVAL) == 0;
  if (!held || !operate(vars, 1, 0)) qlxKeepFailure(nullptr, cxFailure(errno));
}
