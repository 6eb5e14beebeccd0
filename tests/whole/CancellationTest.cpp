// Threads that are cancelled inside the library: nothing stays locked behind them.
#include <gtest/gtest.h>

#include <atomic>

#include <pthread.h>
#include <unistd.h>

#include "text/QlxFormatCache.h"
#include "object/QlxLocked.h"
#include "support/ChainTest.h"
#include "support/Child.h"
#include "support/FailingMemory.h"
#include "support/FreshProcess.h"
#include "support/MultiProcFileHandlerFixture.h"
#include "support/OwnThread.h"
#include "support/WrongUseOfAMutex.h"

namespace {

struct Way {
  const char *name;
  int type;  // of cancellation
};

constexpr Way kDeferred = {"Deferred", PTHREAD_CANCEL_DEFERRED};
constexpr Way kAsynchronous = {"Asynchronous", PTHREAD_CANCEL_ASYNCHRONOUS};

void setType(const Way &way) {
  int ignored = 0;
  pthread_setcanceltype(way.type, &ignored);
}

// Where a thread ends that was cancelled, whichever way.
void awaitCancellation() {
  for (;;) pause();
}

class CancelledThreadTest : public HandledChainTest, public ::testing::WithParamInterface<Way> {
 protected:
  // Logs in a thread that is cancelled while its handler waits.
  void cancelWhileHandling() {
    const Signal inside, cancelled;
    recorder->alsoDo = [&](Event *) {
      inside.give();
      cancelled.await();  // a cancellation point
      pthread_testcancel();
    };
    const OwnThread thread([&] {
      setType(GetParam());
      log(u"cancelled");
      awaitCancellation();
    });
    inside.await();
    thread.cancel();
    cancelled.give();
    EXPECT_TRUE(thread.endsCancelled());
    recorder->alsoDo = nullptr;
  }
};

INSTANTIATE_TEST_SUITE_P(Ways, CancelledThreadTest, ::testing::Values(kDeferred, kAsynchronous),
                         [](const auto &info) { return info.param.name; });

TEST_P(CancelledThreadTest, LeavesTheLockToTheOthers) {
  expectNoHang([this] {
    cancelWhileHandling();
    log(u"next");
    EXPECT_RECORDED(u"cancelled|next|");
  });
}

// Outside of the library the thread runs no function of C++: one that is noexcept ends the process
// when the thread is cancelled in it.
void logWithoutEnd(QlxObject *logger, int *logged) {
  for (;;) {
    QlxLogUText(logger, u"{0,number}", 1.0);
    __atomic_fetch_add(logged, 1, __ATOMIC_SEQ_CST);
    pthread_testcancel();
  }
}

TEST_P(CancelledThreadTest, LeavesTheLockWhereverItIsCancelled) {
  expectNoHang([this] {
    QlxObject *const object = logger.get();
    for (int i = 0; i < 300; ++i) {
      int logged = 0;
      const OwnThread thread([&] {
        setType(GetParam());
        logWithoutEnd(object, &logged);
      });
      while (__atomic_load_n(&logged, __ATOMIC_SEQ_CST) < 2 + i % 5) sched_yield();
      thread.cancel();
      EXPECT_TRUE(thread.endsCancelled());
      recorder->records.clear();
      log(u"next");
      EXPECT_RECORDED(u"next|");
    }
  });
}

TEST_P(CancelledThreadTest, IsCancelledWhenTheCallReturns) {
  expectNoHang([this] {
    std::atomic<bool> handled{false}, returned{false}, passedOn{false};
    recorder->alsoDo = [&](Event *) {
      pthread_cancel(pthread_self());
      pthread_testcancel();
      handled = true;
    };
    const OwnThread thread([&] {
      setType(GetParam());
      log(u"text");
      returned = true;
      pthread_testcancel();
      passedOn = true;
    });
    EXPECT_TRUE(thread.endsCancelled());
    EXPECT_TRUE(handled);
    EXPECT_EQ(returned, GetParam().type == PTHREAD_CANCEL_DEFERRED);
    EXPECT_FALSE(passedOn);
  });
}

// ---- The lock itself

TEST(CancellationTest, IsOffWhileTheLockIsHeld) {
  EXPECT_TRUE(isCancellable());
  {
    const ApiLock lock;
    EXPECT_FALSE(isCancellable());
  }
  EXPECT_TRUE(isCancellable());
}

TEST(CancellationTest, IsOffForAHostThatTakesTheLockItself) {
  ASSERT_EQ(qlxAPIMutexLock(), 1);
  EXPECT_FALSE(isCancellable());
  qlxAPIMutexUnlock();
  EXPECT_TRUE(isCancellable());
}

TEST(CancellationTest, StaysOffWhereTheHostHasItOff) {
  int state = 0;
  pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &state);
  { const ApiLock lock; }
  EXPECT_FALSE(isCancellable());
  pthread_setcancelstate(state, &state);
}

// The C library's signal of an asynchronous cancellation ends a thread that was of that type when
// it was sent, whatever its state is when it comes.
TEST(CancellationTest, IsDeferredWhileTheLockIsHeldAndAsBeforeAfterIt) {
  setType(kAsynchronous);
  int type = -1;
  {
    const ApiLock lock;
    pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, &type);
    EXPECT_EQ(type, PTHREAD_CANCEL_DEFERRED);
  }
  pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, &type);
  EXPECT_EQ(type, PTHREAD_CANCEL_ASYNCHRONOUS);
}

TEST(CancellationTest, IsAsBeforeWhenTheLockCannotBeHad) {
  inFreshProcess([] {
    FailingMemory memory;
    memory.failFrom(1);
    EXPECT_EQ(qlxAPIMutexLock(), 0);
    EXPECT_TRUE(isCancellable());
  });
}

TEST(CancellationTest, IsAsBeforeWhenTheLockIsGivenBackByAnotherThread) {
  WRONG_USE_OF_A_MUTEX();
  ASSERT_EQ(qlxAPIMutexLock(), 1);
  const OwnThread other([] {
    qlxAPIMutexUnlock();
    EXPECT_TRUE(isCancellable());
  });
  EXPECT_FALSE(other.endsCancelled());
  pthread_setcancelstate(PTHREAD_CANCEL_ENABLE, nullptr);
}

TEST(CancellationTest, IsAsBeforeAfterAFork) {
  { const ApiLock lock; }
  Child child([] { EXPECT_TRUE(isCancellable()); });
  EXPECT_EQ(child.end(), 0);
  EXPECT_TRUE(isCancellable());
}

TEST(CancellationTest, IsAsBeforeAfterAForkUnderTheLock) {
  const ApiLock lock;
  Child child([] {
    EXPECT_FALSE(isCancellable());
    qlxAPIMutexUnlock();
    EXPECT_TRUE(isCancellable());
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_FALSE(isCancellable());
}

TEST(CancellationTest, IsOffWhileFormatsAreHeld) {
  {
    const FormatCacheLock lock;
    EXPECT_FALSE(isCancellable());
  }
  EXPECT_TRUE(isCancellable());
}

// ---- The semaphore between processes

using CancelledSharerTest = MultiProcFileHandlerFixture;

// The semaphore is held when the thread logs, and is given back when it was cancelled: what it
// writes with then is a cancellation point under the semaphore.
TEST_F(CancelledSharerTest, GivesTheSemaphoreBack) {
  log(u"first");
  expectNoHang([this] {
    sembuf take = {0, -1, SEM_UNDO}, giveBack = {0, 1, SEM_UNDO};
    ASSERT_EQ(semop(key.set(), &take, 1), 0);
    const OwnThread thread([this] {
      log(u"cancelled");
      awaitCancellation();
    });
    ASSERT_TRUE(key.awaitWaiting(1));
    thread.cancel();
    ASSERT_EQ(semop(key.set(), &giveBack, 1), 0);
    EXPECT_TRUE(thread.endsCancelled());
    EXPECT_TRUE(semaphoreIsFree());
    log(u"next");
    EXPECT_EQ(dir.read("app.log"), "first\ncancelled\nnext\n");
  });
}

}  // namespace
