#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "object/QlxLocked.h"
#include "support/ChainTest.h"
#include "support/FailingMemory.h"
#include "support/FreshProcess.h"
#include "support/OpenToolkit.h"

namespace {

// Whether a child ended with exit status 0.
bool endedWell(pid_t child) {
  int status = -1;
  return waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

// Ends a child that hangs.
constexpr unsigned kMaxChildSeconds = 30;

TEST(ApiLockTest, IsTakenAndGivenBack) {
  for (int i = 0; i < 2; ++i) {
    EXPECT_EQ(qlxAPIMutexLock(), 1);
    qlxAPIMutexUnlock();
  }
}

TEST(ApiLockTest, IsHeldByOneThreadAtATime) {
  constexpr int kThreads = 4, kTimes = 2000;
  int count = 0;  // no atomic: the lock guards it
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&count] {
      for (int n = 0; n < kTimes; ++n) {
        const ApiLock lock;
        ++count;
      }
    });
  }
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ(count, kThreads * kTimes);
}

TEST(ApiLockTest, GivingBackWhatWasNeverTakenDoesNothing) {
  inFreshProcess([] {
    qlxAPIMutexUnlock();
    EXPECT_EQ(qlxAPIMutexLock(), 1);
    qlxAPIMutexUnlock();
  });
}

TEST(ApiLockTest, WithoutItCallsDoNothingAndGiveTheirFailureValues) {
  inFreshProcess([] {
    FailingMemory memory;
    memory.failFrom(1);
    CxStatus status = {'x', 7};
    EXPECT_EQ(QlxOpenToolkit(nullptr, &status), 0);
    EXPECT_EQ(status.kind, 'x');
    EXPECT_EQ(qlxAPIMutexLock(), 0);
    QlxObject object = {};
    object.enabled = 1;
    object.name = const_cast<char *>("name");
    EXPECT_EQ(QlxGetObject("a", "qlx_basiclogger"), nullptr);
    EXPECT_EQ(QlxIsObjectEnabled(&object), 0);
    EXPECT_EQ(QlxAcquireObject(&object), nullptr);
    EXPECT_EQ(QlxGetObjPropDouble(&object, "key", nullptr), 0.0);
    EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
    EXPECT_EQ(QlxAllocObjCfg("a"), nullptr);
    EXPECT_EQ(QlxLogUText(&object, u"text").statusKind, '-');
    QlxReleaseObject(&object);
    QlxAddLoggerClass("class", nullptr, nullptr, nullptr, nullptr, nullptr);
    QlxCloseToolkit();
    memory.failNone();  // the next call makes it
    EXPECT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);
    QlxCloseToolkit();
  });
}

// Lets each of the first two allocations wait for the other.
struct MeetingHook : CxMemoryHook {
  MeetingHook() : CxMemoryHook{mayAllocateIn, allocatedIn, freedIn} {}
  static MeetingHook *self(CxMemoryHook *hook) { return static_cast<MeetingHook *>(hook); }
  static bool mayAllocateIn(CxMemoryHook *hook) {
    ++self(hook)->arrived;
    const auto latest = std::chrono::steady_clock::now() + std::chrono::seconds(5);
    while (self(hook)->arrived < 2 && std::chrono::steady_clock::now() < latest) {
      std::this_thread::yield();
    }
    return true;
  }
  static void allocatedIn(CxMemoryHook *hook) { ++self(hook)->live; }
  static void freedIn(CxMemoryHook *hook) { --self(hook)->live; }

  std::atomic<int> arrived{0}, live{0};
};

TEST(ApiLockTest, IsOneWhenTwoFirstCallsMeet) {
  inFreshProcess([] {
    MeetingHook hook;
    cxIntlSetMemoryHook(&hook);
    int count = 0;
    const auto use = [&count] {
      for (int i = 0; i < 1000; ++i) {
        const ApiLock lock;
        EXPECT_TRUE(lock);
        ++count;
      }
    };
    std::thread other(use);
    use();
    other.join();
    cxIntlSetMemoryHook(nullptr);
    EXPECT_EQ(hook.arrived, 2);
    EXPECT_EQ(hook.live, 1);
    EXPECT_EQ(count, 2000);
  });
}

class ForkTest : public HandledChainTest {
 protected:
  // Logs, and asks for what takes the lock.
  bool works() {
    recorder->records.clear();
    log(u"after the fork");
    const Handle made = get("made", "qlx_basiclogger");
    return recorder->records.size() == 1 && made;
  }
};

TEST_F(ForkTest, AChildOfABusyProcessFindsTheLockFree) {
  std::atomic<bool> stop{false};
  std::vector<std::thread> threads;
  for (int i = 0; i < 2; ++i) {
    threads.emplace_back([&] {
      while (!stop) log(u"{0,date} {0,number}");
    });
  }
  bool good = true;
  for (int i = 0; i < 20 && good; ++i) {
    const pid_t child = fork();
    if (child == 0) {
      alarm(kMaxChildSeconds);
      _exit(works() ? 0 : 1);
    }
    good = endedWell(child);
  }
  stop = true;
  for (std::thread &thread : threads) thread.join();
  EXPECT_TRUE(good);
}

TEST_F(ForkTest, AnOperationOfAClassMayFork) {
  pid_t child = -1;
  recorder->alsoDo = [&](Event *) { child = fork(); };
  log(u"text");
  recorder->alsoDo = nullptr;
  if (child == 0) {
    alarm(kMaxChildSeconds);
    _exit(works() ? 0 : 1);
  }
  EXPECT_TRUE(endedWell(child));
  EXPECT_TRUE(works());
}

TEST_F(ForkTest, AnOperationThatForksKeepsTheLock) {
  pid_t child = -1;
  recorder->alsoDo = [&](Event *) {
    child = fork();
    if (child != 0) return;
    ualarm(100000, 0);  // what ends a child that waits for the lock that it has
    qlxAPIMutexLock();
    _exit(0);
  };
  log(u"text");
  int status = 0;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGALRM);
}

TEST_F(ForkTest, TheChildMayCloseAndOpenTheToolkit) {
  const pid_t child = fork();
  if (child == 0) {
    alarm(kMaxChildSeconds);
    QlxCloseToolkit();
    _exit(QlxOpenToolkit(nullptr, nullptr) == 1 ? 0 : 1);
  }
  EXPECT_TRUE(endedWell(child));
}

TEST(ApiLockTest, OutlivesTheToolkitUnderAThreadThatWaitsForIt) {
  static std::atomic<bool> *called;
  static std::thread *waiter;
  std::atomic<bool> calls{false};
  std::thread thread;
  QlxObject *handler = nullptr;
  called = &calls, waiter = &thread;
  {
    const OpenToolkit open;
    QlxAddHandlerClass("closing", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                       [](QlxObject *) {
                         *waiter = std::thread([] {
                           *called = true;
                           EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);  // waits until all is closed
                         });
                         while (!*called) std::this_thread::yield();
                       });
    handler = QlxGetObject("a", "closing");
  }
  thread.join();
  QlxReleaseObject(handler);
}

}  // namespace
