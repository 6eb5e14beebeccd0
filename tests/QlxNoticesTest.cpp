// Notices of changes, and the flag that answers for them from memory.
#include "QlxNotices.h"

#include <atomic>
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <functional>
#include <string>
#include <thread>

#include <fcntl.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sys/eventfd.h>
#include <sys/inotify.h>
#include <sys/prctl.h>
#include <unistd.h>

#include "support/Child.h"
#include "support/NoticesFlag.h"
#include "support/TempDir.h"

namespace fs = std::filesystem;

namespace {

constexpr uint32_t kAll = IN_ATTRIB | IN_MOVED_FROM | IN_DELETE | IN_MOVE_SELF | IN_DELETE_SELF;

class NoticesTest : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!systemHasFlags()) GTEST_SKIP() << "no poll requests on this machine";
    watch();
  }
  void TearDown() override {
    qlxAioCalls = systems_;
    close();
  }

  void watch() {
    const ApiLock lock;
    ASSERT_TRUE(qlxNoticesOpen());
    ASSERT_NE(qlxNoticesWatch(dir.path().c_str(), kAll), -1);
  }
  static void close() {
    const ApiLock lock;
    qlxNoticesClose();
  }
  static uint32_t changes() {
    const ApiLock lock;
    return qlxNoticesChanges();
  }

  static int awaitFlag() { return askUntilFlagged(changes); }
  static void askTimes(int count) {
    for (int i = 0; i < count; ++i) changes();
  }

  void removeOne() {
    dir.write("one", "");
    fs::remove(dir.path("one"));
  }

  // One change is seen by the next question.
  void expectSeen(const std::function<void()> &change) {
    const uint32_t before = changes();
    change();
    EXPECT_FALSE(isFlagged());
    EXPECT_NE(changes(), before);
  }

  const TempDir dir;

 private:
  const QlxAioCalls systems_ = qlxAioCalls;
};

// ---- When there is a flag

TEST_F(NoticesTest, AskTheSystemForLongBeforeTheyTakeContexts) {
  Child child([&] {
    watch();
    EXPECT_GE(awaitFlag(), 16384);
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(NoticesTest, CountQuestionsTowardsAContextAcrossChanges) {
  Child child([&] {
    watch();
    askTimes(16000);
    removeOne();
    EXPECT_LT(awaitFlag(), 1000);
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(NoticesTest, HaveTheFlagAgainAfterAFewQuietQuestions) {
  awaitFlag();
  removeOne();
  EXPECT_FALSE(isFlagged());
  const int questions = awaitFlag();
  EXPECT_GE(questions, 10);
  EXPECT_LT(questions, 100);
}

TEST_F(NoticesTest, HaveNoFlagWhileSomethingAlwaysChanges) {
  awaitFlag();
  for (int i = 0; i < 50; ++i) {
    removeOne();
    askTimes(10);
    EXPECT_FALSE(isFlagged());
  }
}

TEST_F(NoticesTest, HaveTheFlagAgainAfterTheyWereClosed) {
  awaitFlag();
  close();
  EXPECT_FALSE(isFlagged());
  watch();
  awaitFlag();
  expectSeen([&] { removeOne(); });
}

TEST_F(NoticesTest, DoNotAskTheSystemWhileTheFlagIsQuiet) {
  Child child([&] {
    watch();
    awaitFlag();
    const ApiLock lock;
    const sock_filter only[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_exit_group, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_KILL_PROCESS),
    };
    const sock_fprog program{std::size(only), const_cast<sock_filter *>(only)};
    prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
    if (prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) _exit(77);
    const uint32_t before = qlxNoticesChanges();
    int seen = 0;
    for (int i = 0; i < 1000; ++i) seen += qlxNoticesChanges() != before;
    syscall(SYS_exit_group, seen);  // alone, where _exit() does more
  });
  const int status = child.end();
  if (status == 77) GTEST_SKIP() << "no filters of system calls";
  EXPECT_EQ(status, 0);
}

// ---- What the flag sees

TEST_F(NoticesTest, SetTheFlagAtOnceThousandsOfTimes) {
  for (int i = 0; i < 5000; ++i) {
    awaitFlag();
    expectSeen([&] { removeOne(); });
  }
}

TEST_F(NoticesTest, SetTheFlagBeforeAnotherProcessGoesOn) {
  Signal wanted, made;
  Child child([&] {
    for (int i = 0; i < 2000; ++i) {
      wanted.await();
      removeOne();
      made.give();
    }
  });
  for (int i = 0; i < 2000; ++i) {
    awaitFlag();
    expectSeen([&] {
      wanted.give();
      made.await();
    });
  }
  EXPECT_EQ(child.end(), 0);
}

// The other thread changes while this one asks, so that changes fall into each step of a question.
TEST_F(NoticesTest, SeeEachChangeOfAnotherThreadByTheNextQuestion) {
  constexpr int kRounds = 500;
  std::atomic<uint32_t> asked{changes()}, before{0};
  std::atomic<int> made{0}, seen{0};
  std::thread other([&] {
    for (int round = 1; round <= kRounds; ++round) {
      while (seen < round - 1) std::this_thread::yield();
      before = asked.load();
      removeOne();
      made = round;
    }
  });
  while (seen < kRounds) {
    const int round = made;
    asked = changes();
    if (round == seen) continue;
    EXPECT_NE(asked, before) << round;
    seen = round;
    askTimes(round % 40);
  }
  other.join();
}

// ---- A change while the flag is put in place

class ArmingTest : public NoticesTest {
 protected:
  inline static std::function<void()> sBefore, sAfter;
  inline static int sInsteadOf = -1;  // a descriptor that is never readable
  inline static int sSubmitted;

  static int submit(aio_context_t context, long count, iocb **requests) {
    ++sSubmitted;
    if (sBefore) sBefore();
    if (sInsteadOf != -1 && requests[0]->aio_buf != 0) {
      requests[0]->aio_fildes = static_cast<uint32_t>(sInsteadOf);
    }
    const int result = static_cast<int>(syscall(SYS_io_submit, context, count, requests));
    if (sAfter) sAfter();
    return result;
  }

  void SetUp() override {
    NoticesTest::SetUp();
    if (IsSkipped()) return;
    awaitFlag();
    qlxAioCalls.submit = submit;
    sBefore = sAfter = nullptr;
    sSubmitted = 0;
  }

  // Until the flag was submitted with a change in between.
  void expectSeenWhileArming() {
    removeOne();
    uint32_t before = changes();
    for (int i = 0; i < 100 && sSubmitted == 0; ++i) {
      const uint32_t now = changes();
      if (sSubmitted != 0) {
        EXPECT_NE(now, before);
      }
      before = now;
    }
    EXPECT_EQ(sSubmitted, 1);
    EXPECT_FALSE(isFlagged());
    sBefore = sAfter = nullptr;
  }
};

TEST_F(ArmingTest, SeesAChangeBeforeTheRequest) {
  sBefore = [&] { removeOne(); };
  expectSeenWhileArming();
  awaitFlag();
  expectSeen([&] { removeOne(); });
}

TEST_F(ArmingTest, SeesAChangeRightAfterTheRequest) {
  sAfter = [&] { removeOne(); };
  expectSeenWhileArming();
  awaitFlag();
  expectSeen([&] { removeOne(); });
}

// As when the system could not put the end of the request into the ring at once.
TEST_F(ArmingTest, SeesAChangeThatTheFlagDoesNotTell) {
  sInsteadOf = eventfd(0, EFD_CLOEXEC);
  sAfter = [&] { removeOne(); };
  expectSeenWhileArming();
  ::close(sInsteadOf);
  sInsteadOf = -1;
  awaitFlag();
  expectSeen([&] { removeOne(); });
}

// Else its end could be taken for that of the next request, or come between.
TEST_F(ArmingTest, StartsNoFlagBeforeTheCancelledRequestHasEnded) {
  sInsteadOf = eventfd(0, EFD_CLOEXEC);
  sAfter = [&] { removeOne(); };
  qlxAioCalls.cancel = [](aio_context_t, iocb *, io_event *) { return -1; };
  expectSeenWhileArming();
  askTimes(100);
  EXPECT_EQ(sSubmitted, 1);
  expectSeen([&] { removeOne(); });
  EXPECT_EQ(eventfd_write(sInsteadOf, 1), 0);  // ends it
  ::close(sInsteadOf);
  sInsteadOf = -1;
  awaitFlag();
  expectSeen([&] { removeOne(); });
}

// ---- Machines without flags. Children have no contexts yet.

class WithoutFlagTest : public NoticesTest {
 protected:
  inline static int sSetUps, sSubmits, sError;

  static int refuseSetUp(unsigned, aio_context_t *) {
    ++sSetUps;
    errno = sError;
    return -1;
  }
  static int refuseSubmit(aio_context_t, long, iocb **) {
    ++sSubmits;
    errno = sError;
    return -1;
  }
  // A context with a ring of another kind.
  static int setUpUnknown(unsigned, aio_context_t *context) {
    alignas(64) static uint32_t ring[1024] = {0, 100, 0, 0, 0xa10a10a1, 1, 1, 32};
    ++sSetUps;
    *context = reinterpret_cast<aio_context_t>(ring);
    return 0;
  }

  void SetUp() override {
    NoticesTest::SetUp();
    sSetUps = sSubmits = 0;
  }

  // Asks for long in a child, which is to see changes nevertheless.
  void askInChild(const std::function<void()> &check) {
    Child child([&] {
      watch();
      askTimes(40000);
      EXPECT_FALSE(isFlagged());
      expectSeen([&] { removeOne(); });
      check();
    });
    EXPECT_EQ(child.end(), 0);
  }
};

TEST_F(WithoutFlagTest, AsksTheSystemWhereContextsAreRefusedAndTriesOnce) {
  qlxAioCalls.setUp = refuseSetUp;
  for (const int error : {ENOSYS, EPERM, EAGAIN, ENOMEM}) {
    sError = error;
    askInChild([] { EXPECT_EQ(sSetUps, 1); });
  }
}

TEST_F(WithoutFlagTest, AsksTheSystemWhereRequestsAreRefusedAndTriesOnce) {
  qlxAioCalls.submit = refuseSubmit;
  sError = EINVAL;
  askInChild([] { EXPECT_EQ(sSubmits, 1); });
}

// Such as by a host, between two calls.
TEST_F(WithoutFlagTest, TriesAgainWhereTheDescriptorWasClosedMeanwhile) {
  qlxAioCalls.submit = [](aio_context_t context, long count, iocb **requests) {
    if (++sSubmits > 1) return static_cast<int>(syscall(SYS_io_submit, context, count, requests));
    errno = EBADF;
    return -1;
  };
  Child child([&] {
    watch();
    awaitFlag();
    EXPECT_GT(sSubmits, 1);
    expectSeen([&] { removeOne(); });
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(WithoutFlagTest, AsksTheSystemWhereTheRingIsOfAnotherKind) {
  qlxAioCalls.setUp = setUpUnknown;
  qlxAioCalls.submit = refuseSubmit;
  askInChild([] {
    EXPECT_EQ(sSetUps, 1);
    EXPECT_EQ(sSubmits, 0);
  });
}

TEST_F(WithoutFlagTest, TakesNoContextsWhenHalfOfThemAreInUse) {
  const std::string limit = dir.write("limit", "100\n");
  qlxAioCalls.setUp = refuseSetUp;
  qlxAioCalls.limit = limit.c_str();
  for (const auto &[inUse, wanted] : {std::pair{"49\n", 1}, {"50\n", 0}, {"x", 0}, {"", 0}}) {
    const std::string file = dir.write("inUse", inUse);
    qlxAioCalls.inUse = file.c_str();
    askInChild([wanted = wanted] { EXPECT_EQ(sSetUps, wanted); });
  }
  const std::string none = dir.path("none");
  qlxAioCalls.inUse = none.c_str();
  askInChild([] { EXPECT_EQ(sSetUps, 0); });
}

// ---- Processes

TEST_F(NoticesTest, AreFlaggedInAParentAndSeenByItsChildAlike) {
  awaitFlag();
  Signal ready, removed;
  Child child([&] {
    EXPECT_FALSE(isFlagged());
    watch();
    EXPECT_GE(awaitFlag(), 16384);
    const uint32_t before = changes();
    ready.give();
    removed.await();
    EXPECT_FALSE(isFlagged());
    EXPECT_NE(changes(), before);
  });
  ready.await();
  EXPECT_TRUE(isFlagged());
  const uint32_t before = changes();
  removeOne();
  EXPECT_NE(changes(), before);
  removed.give();
  EXPECT_EQ(child.end(), 0);
}

TEST_F(NoticesTest, StayFlaggedWhenAChildEnds) {
  awaitFlag();
  Child child([&] { close(); });
  EXPECT_EQ(child.end(), 0);
  EXPECT_TRUE(isFlagged());
  expectSeen([&] { removeOne(); });
}

// The ring ends with its process, and to read it then would end the reader.
TEST_F(NoticesTest, ReadNoFlagOfAParentThatHasEndedWithoutTheHandlersOfAFork) {
  int answers[2];
  ASSERT_EQ(pipe(answers), 0);
  Signal orphaned;
  Child parent([&] {
    watch();
    awaitFlag();
    if (syscall(SYS_clone, SIGCHLD, 0, 0, 0, 0) != 0) return;
    alarm(Child::kHangSeconds);
    orphaned.await();
    const char answer = isFlagged() ? 'y' : 'n';
    _exit(write(answers[1], &answer, 1) == 1 ? 0 : 1);
  });
  EXPECT_EQ(parent.end(), 0);
  ::close(answers[1]);
  orphaned.give();
  char answer = '-';
  EXPECT_EQ(read(answers[0], &answer, 1), 1);
  EXPECT_EQ(answer, 'n');
  ::close(answers[0]);
}

TEST_F(NoticesTest, GiveTheInstanceBackWhenTheyAreClosed) {
  Child child([&] {
    const std::string map = "0 " + std::to_string(geteuid()) + " 1\n";
    if (unshare(CLONE_NEWUSER) != 0) _exit(77);
    std::ofstream("/proc/self/uid_map") << map;
    std::ofstream limit("/proc/sys/user/max_inotify_instances");
    limit << 1 << std::flush;
    if (!limit) _exit(77);
    watch();
    ASSERT_EQ(inotify_init1(IN_CLOEXEC), -1);
    awaitFlag();
    close();
    int own = -1;  // the request before is ended by a worker of the system
    while (own == -1) own = inotify_init1(IN_CLOEXEC);
  });
  const int status = child.end();
  if (status == 77) GTEST_SKIP() << "no limits of its own";
  EXPECT_EQ(status, 0);
}

}  // namespace
