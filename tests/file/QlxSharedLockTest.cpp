#include "file/QlxSharedLock.h"

#include <gtest/gtest.h>

#include <vector>

#include "QlxMultiProcFileHandler.h"
#include "support/Child.h"
#include "support/SemaphoreKey.h"
#include "support/Status.h"
#include "support/SystemCalls.h"

namespace {

class SharedLockTest : public ::testing::Test {
 protected:
  SharedLockTest() {
    vars.semKey = key.number();
    vars.semId = -1;
  }

  uint8_t setUp() { return qlxMultiProcFileHandlerInitSem(&vars); }
  uint8_t lock() { return qlxMultiProcFileHandlerLockSem(&vars); }
  void unlock() { qlxMultiProcFileHandlerUnlockSem(&vars); }

  // Has the waiting operations fail with the error so many times, in place of the system's answer;
  // without a lock held, the eager ones find the semaphore held.
  void failWaiting(int error, int times) {
    calls.onOperate = [this, error, times](const sembuf &operation, size_t) {
      if (operation.sem_op != -1) return 0;
      if (operation.sem_flg & IPC_NOWAIT) return EAGAIN;
      return ++waits <= times ? error : 0;
    };
  }

  // Adds 1 without regard to anything, as another program may.
  void raise() { semctl(vars.semId, 0, SETVAL, static_cast<unsigned long>(key.value()) + 1); }

  SemaphoreKey key;
  SystemCalls calls;
  QlxFileHandlerVars vars{};
  int waits = 0;  // waiting operations since failWaiting()
};

// ---- Set-up

TEST_F(SharedLockTest, SetUpMakesAFreeSemaphore) {
  EXPECT_EQ(setUp(), 1);
  EXPECT_EQ(vars.semReady, 1);
  EXPECT_EQ(vars.semId, key.set());
  EXPECT_EQ(key.value(), 1);
}

TEST_F(SharedLockTest, SetUpMakesOneSemaphoreThatEverybodyMayUse) {
  setUp();
  semid_ds set{};
  ASSERT_EQ(semctl(vars.semId, 0, IPC_STAT, &set), 0);
  EXPECT_EQ(set.sem_nsems, 1u);
  EXPECT_EQ(set.sem_perm.mode & 0777, 0666);
}

TEST_F(SharedLockTest, SetUpAttachesToASetThatIsThereWithoutSettingItsValue) {
  const int id = key.make(0);
  calls.onControl = [](int) { return EACCES; };  // it asks for nothing
  EXPECT_EQ(setUp(), 1);
  EXPECT_EQ(vars.semReady, 1);
  EXPECT_EQ(vars.semId, id);
  EXPECT_EQ(key.value(), 0);
}

TEST_F(SharedLockTest, SetUpAttachesAlsoWhenMakingFailedOtherwise) {
  const int id = key.make(1);
  std::vector<int> flags;
  calls.onGet = [&flags](key_t, int asked) {
    flags.push_back(asked);
    return flags.size() == 1 ? ENOMEM : 0;
  };
  EXPECT_EQ(setUp(), 1);
  EXPECT_EQ(vars.semId, id);
  EXPECT_EQ(flags, (std::vector<int>{1974, 0}));
}

TEST_F(SharedLockTest, SetUpFailsWhenAttachingFails) {
  key.make(1);
  calls.onGet = [](key_t, int flags) { return flags == 0 ? EACCES : 0; };
  EXPECT_EQ(qlxSharedLockSetUp(&vars), failure(EACCES));
  EXPECT_EQ(setUp(), 0);
  EXPECT_EQ(vars.semReady, 0);
  EXPECT_EQ(vars.semId, -1);
}

class SharedLockSetUpErrors : public SharedLockTest, public ::testing::WithParamInterface<int> {};

TEST_P(SharedLockSetUpErrors, EndTheSetUpAtTheFirstStep) {
  key.make(1);  // there is one to attach to
  int asked = 0;
  calls.onGet = [&asked](key_t, int) {
    ++asked;
    return GetParam();
  };
  EXPECT_EQ(qlxSharedLockSetUp(&vars), failure(GetParam()));
  EXPECT_EQ(asked, 1);
  EXPECT_EQ(setUp(), 0);
  EXPECT_EQ(vars.semReady, 0);
  EXPECT_EQ(vars.semId, -1);
}

INSTANTIATE_TEST_SUITE_P(All, SharedLockSetUpErrors,
                         ::testing::Values(EACCES, EINVAL, ENOENT, ENOSPC));

TEST_F(SharedLockTest, SetUpRemovesTheSetItMadeWhenItCannotFreeIt) {
  calls.onControl = [](int command) { return command == SETVAL ? ERANGE : 0; };
  EXPECT_EQ(qlxSharedLockSetUp(&vars), failure(ERANGE));
  EXPECT_EQ(setUp(), 0);
  EXPECT_EQ(vars.semReady, 0);
  EXPECT_EQ(vars.semId, -1);
  EXPECT_EQ(key.set(), -1);
}

TEST_F(SharedLockTest, SetUpSucceedsAfterOneThatFailed) {
  calls.onControl = [](int command) { return command == SETVAL ? EPERM : 0; };
  EXPECT_EQ(setUp(), 0);
  calls.onControl = nullptr;
  EXPECT_EQ(setUp(), 1);
  EXPECT_EQ(key.value(), 1);
}

// ---- Lock

TEST_F(SharedLockTest, LockAndUnlockTakeAndGiveTheSemaphore) {
  setUp();
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(lock(), 1);
    EXPECT_EQ(key.value(), 0);
    unlock();
    EXPECT_EQ(key.value(), 1);
  }
  EXPECT_TRUE(calls.slept.empty());
}

TEST_F(SharedLockTest, EveryChangeIsUndoneWhenItsProcessDies) {
  setUp();
  bool all = true;
  calls.onOperate = [&all](const sembuf &operation, size_t) {
    if (operation.sem_op != 0) all = all && (operation.sem_flg & SEM_UNDO);
    return 0;
  };
  lock();
  unlock();
  failWaiting(0, 0);
  lock();
  EXPECT_TRUE(all);
  EXPECT_EQ(waits, 1);
}

TEST_F(SharedLockTest, AKilledHolderGivesTheSemaphoreBack) {
  setUp();
  for (const bool eager : {true, false}) {
    if (!eager) failWaiting(0, 0);
    const Signal locked;
    Child holder([&] {
      lock();
      locked.give();
      pause();
    });
    locked.await();
    EXPECT_EQ(key.value(), 0);
    EXPECT_EQ(holder.kill(), -SIGKILL);
    EXPECT_EQ(key.value(), 1) << eager;
  }
}

TEST_F(SharedLockTest, AProcessThatEndsAfterItsUnlocksChangesNothing) {
  setUp();
  Child other([&] {
    for (int i = 0; i < 5; ++i) {
      lock();
      unlock();
    }
  });
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(key.value(), 1);
}

TEST_F(SharedLockTest, LockWaitsForAStoppedHolder) {
  setUp();
  Child holder([&] {
    lock();
    ::raise(SIGSTOP);
    unlock();
  });
  holder.awaitStop();
  Child other([&] {
    EXPECT_EQ(lock(), 1);
    EXPECT_EQ(key.value(), 0);
    unlock();
  });
  ASSERT_TRUE(key.awaitWaiting(1));
  EXPECT_EQ(key.value(), 0);
  holder.send(SIGCONT);
  EXPECT_EQ(holder.end(), 0);
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(key.value(), 1);
}

TEST_F(SharedLockTest, LockWaitsUntilTheMakerOfTheSetHasFreedIt) {
  Child maker([&] {
    calls.onControl = [](int command) {
      if (command == SETVAL) ::raise(SIGSTOP);  // made, not yet free
      return 0;
    };
    EXPECT_EQ(setUp(), 1);
  });
  maker.awaitStop();
  EXPECT_EQ(setUp(), 1);
  EXPECT_EQ(key.value(), 0);
  Child other([&] {
    EXPECT_EQ(lock(), 1);
    unlock();
  });
  ASSERT_TRUE(key.awaitWaiting(1));
  maker.send(SIGCONT);
  EXPECT_EQ(maker.end(), 0);
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(key.value(), 1);
}

TEST_F(SharedLockTest, AllThatFailsAnEagerAttemptIsLeftToTheWaitingOne) {
  setUp();
  for (const int error : {EINTR, ENOSPC, EINVAL, EIDRM, EACCES, ENOMEM}) {
    int eager = 0;
    calls.onOperate = [&eager, error](const sembuf &operation, size_t) {
      if (!(operation.sem_flg & IPC_NOWAIT) || operation.sem_op == 0) return 0;
      ++eager;
      return error;
    };
    EXPECT_EQ(qlxSharedLockTake(&vars), kSuccess) << error;
    EXPECT_EQ(eager, 1) << error;
    EXPECT_EQ(key.value(), 0);
    unlock();
  }
  EXPECT_TRUE(calls.slept.empty());
}

TEST_F(SharedLockTest, EagerAttemptsEnd) {
  setUp();
  int eager = 0;
  calls.onOperate = [&](const sembuf &operation, size_t) {
    if (!(operation.sem_flg & IPC_NOWAIT)) return ++waits, 0;
    return ++eager, EAGAIN;
  };
  EXPECT_EQ(lock(), 1);
  EXPECT_GT(eager, 1);
  EXPECT_LT(eager, 1000);
  EXPECT_EQ(waits, 1);
  EXPECT_EQ(key.value(), 0);
}

class SharedLockRetries : public SharedLockTest, public ::testing::WithParamInterface<int> {};

TEST_P(SharedLockRetries, WaitASecondEach) {
  setUp();
  for (const int times : {1, 2, 10}) {
    calls.slept.clear();
    waits = 0;
    failWaiting(GetParam(), times);
    EXPECT_EQ(lock(), 1);
    EXPECT_EQ(waits, times + 1);
    EXPECT_EQ(calls.slept, std::vector<unsigned>(static_cast<size_t>(times), 1));
    EXPECT_EQ(key.value(), 0);
    unlock();
  }
}

TEST_P(SharedLockRetries, EndAtTheEleventhWithoutTheSemaphore) {
  setUp();
  failWaiting(GetParam(), 1000);
  EXPECT_EQ(lock(), 1);
  EXPECT_EQ(waits, 11);
  EXPECT_EQ(calls.slept, std::vector<unsigned>(11, 1));
  EXPECT_EQ(key.value(), 1);
  EXPECT_EQ(qlxSharedLockTake(&vars), kSuccess);
}

INSTANTIATE_TEST_SUITE_P(All, SharedLockRetries, ::testing::Values(EINTR, ENOSPC));

TEST_F(SharedLockTest, ASignalInterruptsTheWaiting) {
  setUp();
  lock();
  const Signal interrupted;
  Child other([&] {
    struct sigaction nothing = {};
    nothing.sa_handler = [](int) {};
    nothing.sa_flags = SA_RESTART;  // the system restarts no semaphore operation
    sigaction(SIGUSR1, &nothing, nullptr);
    calls.onOperate = [&](const sembuf &operation, size_t) {
      if (!(operation.sem_flg & IPC_NOWAIT) && ++waits == 2) interrupted.give();
      return 0;
    };
    EXPECT_EQ(lock(), 1);
    EXPECT_EQ(calls.slept, (std::vector<unsigned>{1}));
    unlock();
  });
  ASSERT_TRUE(key.awaitWaiting(1));
  other.send(SIGUSR1);
  interrupted.await();
  unlock();
  EXPECT_EQ(other.end(), 0);
}

TEST_F(SharedLockTest, AnyOtherErrorEndsTheLockAtOnce) {
  setUp();
  for (const int error : {EINVAL, EIDRM, EACCES, ENOMEM, EAGAIN, E2BIG, EFBIG, ERANGE}) {
    waits = 0;
    failWaiting(error, 1000);
    EXPECT_EQ(lock(), 0) << error;
    EXPECT_EQ(waits, 1) << error;
    EXPECT_EQ(qlxSharedLockTake(&vars), failure(error));
  }
  EXPECT_TRUE(calls.slept.empty());
  EXPECT_EQ(key.value(), 1);
}

TEST_F(SharedLockTest, AnotherErrorEndsTheRetriesToo) {
  setUp();
  calls.onOperate = [this](const sembuf &operation, size_t) {
    if (operation.sem_flg & IPC_NOWAIT) return EAGAIN;
    return ++waits < 3 ? EINTR : EIDRM;
  };
  EXPECT_EQ(qlxSharedLockTake(&vars), failure(EIDRM));
  EXPECT_EQ(calls.slept.size(), 2u);
}

TEST_F(SharedLockTest, LockFailsWhenTheSetIsRemoved) {
  setUp();
  lock();
  Child waiting([&] { EXPECT_EQ(qlxSharedLockTake(&vars), failure(EIDRM)); });
  ASSERT_TRUE(key.awaitWaiting(1));
  key.remove();
  EXPECT_EQ(waiting.end(), 0);
  EXPECT_EQ(qlxSharedLockTake(&vars), failure(EINVAL));
}

TEST_F(SharedLockTest, NullVariablesLockNothing) {
  EXPECT_EQ(qlxMultiProcFileHandlerInitSem(nullptr), 0);
  EXPECT_EQ(qlxMultiProcFileHandlerLockSem(nullptr), 0);
  qlxMultiProcFileHandlerUnlockSem(nullptr);
}

// ---- Unlock

TEST_F(SharedLockTest, UnlockLeavesAFreeSemaphoreAtOne) {
  setUp();
  unlock();
  EXPECT_EQ(key.value(), 1);
  Child other([&] { unlock(); });
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(key.value(), 1);  // also after what its end may undo
}

TEST_F(SharedLockTest, UnlockLeavesAHigherValueAlone) {
  setUp();
  raise();
  unlock();
  EXPECT_EQ(key.value(), 2);
}

TEST_F(SharedLockTest, UnlockDoesNothingBeforeTheSetUp) {
  vars.semId = key.make(0);
  unlock();
  EXPECT_EQ(key.value(), 0);
}

TEST_F(SharedLockTest, UnlockDoesNotMindARemovedSet) {
  setUp();
  lock();
  key.remove();
  unlock();
  EXPECT_EQ(key.set(), -1);
}

TEST_F(SharedLockTest, UnlockLooksAndAddsInOneStep) {
  setUp();
  lock();
  int steps = 0;
  calls.onOperate = [&steps](const sembuf &, size_t) { return ++steps, 0; };
  calls.onControl = [&steps](int) { return ++steps, 0; };
  for (int unlocks = 1; unlocks <= 2; ++unlocks) {  // the second finds it free
    unlock();
    EXPECT_EQ(steps, unlocks);
    EXPECT_EQ(key.value(), 1);
  }
}

TEST_F(SharedLockTest, UnlockGivesBackAlsoWhereTheSystemTakesOneOperationAtATime) {
  setUp();
  calls.onOperate = [](const sembuf &, size_t count) { return count > 1 ? E2BIG : 0; };
  lock();
  unlock();
  EXPECT_EQ(key.value(), 1);
  unlock();
  EXPECT_EQ(key.value(), 1);
  raise();
  unlock();
  EXPECT_EQ(key.value(), 2);
}

TEST_F(SharedLockTest, UnlockLeavesASemaphoreAloneThatItCannotRead) {
  setUp();
  lock();
  calls.onOperate = [](const sembuf &, size_t count) { return count > 1 ? E2BIG : 0; };
  calls.onControl = [](int) { return EACCES; };
  unlock();
  EXPECT_EQ(key.value(), 0);
}

// ---- After giving up. These say what follows, for docs/configuration.md.

TEST_F(SharedLockTest, TheUnlockAfterGivingUpLeavesAFreeSemaphoreFree) {
  setUp();
  Child other([&] {
    failWaiting(EINTR, 1000);
    EXPECT_EQ(lock(), 1);
    unlock();
    EXPECT_EQ(key.value(), 1);
  });
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(key.value(), 1);
}

TEST_F(SharedLockTest, TheUnlockAfterGivingUpFreesTheSemaphoreOfItsHolder) {
  setUp();
  lock();
  const Signal unlocked, look;
  Child other([&] {
    failWaiting(EINTR, 1000);
    EXPECT_EQ(lock(), 1);
    unlock();
    unlocked.give();
    look.await();
  });
  unlocked.await();
  EXPECT_EQ(key.value(), 1);
  unlock();  // the holder's own finds it free
  EXPECT_EQ(key.value(), 1);
  look.give();
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(key.value(), 0);  // the system has undone an unlock that had no lock
}

}  // namespace
