// The command `qlx sem`, started as a user starts it, on sets of the tests' own.
#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <regex>
#include <string>
#include <vector>

#include <pwd.h>
#include <sched.h>
#include <sys/ipc.h>
#include <sys/sem.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/TempDir.h"
#include "tool/Process.h"

namespace {

class SemCommandTest : public ::testing::Test {
 protected:
  void TearDown() override { remove(); }

  // As a handler makes it, unless the test wants another.
  void make(int semaphores = 1, int mode = 0666) {
    id = semget(key, semaphores, IPC_CREAT | IPC_EXCL | mode);
    ASSERT_NE(id, -1) << strerror(errno);
    ASSERT_EQ(semctl(id, 0, SETVAL, 1), 0);
  }
  void remove() const {
    if (const int left = semget(key, 0, 0); left != -1) semctl(left, 0, IPC_RMID);
  }
  bool isThere() const { return semget(key, 0, 0) != -1; }

  Outcome sem(const std::vector<std::string> &arguments, int output = -1) const {
    std::vector<std::string> all = {"sem"};
    all.insert(all.end(), arguments.begin(), arguments.end());
    return Process(all, dir.path(), {}, -1, output).finish();
  }
  std::string decimal() const { return std::to_string(key); }
  std::string hex() const {
    char text[16];
    snprintf(text, sizeof text, "0x%08x", static_cast<unsigned>(key));
    return text;
  }
  std::string named() const { return "key " + decimal() + " (" + hex() + ")"; }

  // The set's line of a list, with single blanks; empty when it is not there.
  std::string line(const Outcome &list) const {
    std::smatch match;
    const std::regex wanted("\n *(" + decimal() + " [^\n]*)");
    if (!std::regex_search(list.out, match, wanted)) return "";
    return std::regex_replace(match[1].str(), std::regex(" +"), " ");
  }
  std::string lineOf(const std::string &valueAndWaiting, const std::string &process) const {
    return decimal() + " " + hex() + " " + std::to_string(id) + " " + valueAndWaiting + " 0666 " +
           owner() + " " + process;
  }
  static std::string owner() {
    const passwd *entry = getpwuid(geteuid());
    return entry ? entry->pw_name : std::to_string(geteuid());
  }

  void change(int by, short flags = 0) const {
    sembuf operation = {0, static_cast<short>(by), flags};
    ASSERT_EQ(semop(id, &operation, 1), 0) << strerror(errno);
  }

  const key_t key = 0x73000000 | (getpid() & 0xffffff);
  const TempDir dir;
  int id = -1;
};

TEST_F(SemCommandTest, ListsASetByItsKeyInDecimalAndInHexadecimal) {
  make();
  for (const std::string &name : {decimal(), hex()}) {
    const Outcome outcome = sem({"list", name});
    EXPECT_EQ(outcome.status, 0) << outcome.err;
    EXPECT_EQ(line(outcome), lineOf("1 0", std::to_string(getpid()) + " alive"));
    EXPECT_EQ(std::count(outcome.out.begin(), outcome.out.end(), '\n'), 2) << outcome.out;
  }
}

TEST_F(SemCommandTest, ListsTheSetsThatLookLikeAHandlers) {
  make();
  const Outcome outcome = sem({"list"});
  EXPECT_EQ(outcome.status, 0) << outcome.err;
  EXPECT_EQ(line(outcome), lineOf("1 0", std::to_string(getpid()) + " alive"));
}

TEST_F(SemCommandTest, ListsNoSetOfAnotherModeUnlessByItsKey) {
  make(1, 0600);
  EXPECT_EQ(line(sem({"list"})), "");
  EXPECT_NE(line(sem({"list", decimal()})), "");
}

TEST_F(SemCommandTest, TakesNoSetOfSeveralSemaphores) {
  make(2);
  EXPECT_EQ(line(sem({"list"})), "");
  for (const char *command : {"list", "remove"}) {
    const Outcome outcome = sem({command, decimal()});
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.err,
              "qlx: " + named() + ": a set of 2 semaphores belongs to something else\n");
  }
  EXPECT_TRUE(isThere());
}

TEST_F(SemCommandTest, ShowsThatTheProcessThatHoldsItHasEnded) {
  make();
  const pid_t child = fork();
  if (child == 0) {
    change(-1);
    _exit(0);
  }
  siginfo_t info;
  ASSERT_EQ(waitid(P_PID, child, &info, WEXITED | WNOWAIT), 0);
  const std::string unawaited = line(sem({"list", decimal()}));
  ASSERT_EQ(waitpid(child, nullptr, 0), child);
  const std::string ended = lineOf("0 0", std::to_string(child) + " ended");
  EXPECT_EQ(line(sem({"list", decimal()})), ended);
  if (access("/proc/self/stat", R_OK) != 0) GTEST_SKIP() << "no /proc here, for one not waited for";
  EXPECT_EQ(unawaited, ended);
}

TEST_F(SemCommandTest, CountsTheProcessesThatWait) {
  make();
  change(-1);
  const pid_t child = fork();
  if (child == 0) {
    change(-1);
    _exit(0);
  }
  while (semctl(id, 0, GETNCNT) != 1) sched_yield();
  EXPECT_EQ(line(sem({"list", decimal()})), lineOf("0 1", std::to_string(getpid()) + " alive"));
  change(1);
  ASSERT_EQ(waitpid(child, nullptr, 0), child);
}

TEST_F(SemCommandTest, RemovesASetAndNoOther) {
  make();
  const int other = semget(key ^ 0x01000000, 1, IPC_CREAT | IPC_EXCL | 0666);
  const Outcome outcome = sem({"remove", hex()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "removed " + named() + ", id " + std::to_string(id) + "\n");
  EXPECT_EQ(outcome.err, "");
  EXPECT_FALSE(isThere());
  EXPECT_EQ(semctl(other, 0, IPC_RMID), 0);
}

TEST_F(SemCommandTest, FailsInOneLineForAKeyWithoutASet) {
  for (const char *command : {"list", "remove"}) {
    const Outcome outcome = sem({command, decimal()});
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "qlx: " + named() + ": there is no semaphore set\n");
  }
}

TEST_F(SemCommandTest, ReadsNegativeKeysInBothForms) {
  EXPECT_EQ(sem({"list", "--", "-2147000001"}).err,
            "qlx: key -2147000001 (0x8007613f): there is no semaphore set\n");
  EXPECT_EQ(sem({"list", "0x8007613f"}).err,
            "qlx: key -2147000001 (0x8007613f): there is no semaphore set\n");
}

TEST_F(SemCommandTest, AnswersWrongUsageWithStatusTwo) {
  const std::vector<std::vector<std::string>> wrong = {
      {},
      {"show"},
      {"remove"},
      {"list", "0"},  // a set that has no key cannot be found by it
      {"list", "0x0"},
      {"list", "key"},
      {"list", "12x"},
      {"list", "0x"},
      {"list", ""},
      {"list", "2147483648"},
      {"list", "0x100000000"},
      {"remove", decimal(), "1"},
  };
  make();
  for (const auto &arguments : wrong) {
    const Outcome outcome = sem(arguments);
    EXPECT_EQ(outcome.status, 2) << ::testing::PrintToString(arguments);
    EXPECT_NE(outcome.err, "");
  }
  EXPECT_TRUE(isThere());
}

TEST_F(SemCommandTest, FailsWhenStandardOutputCannotBeWritten) {
  make();
  const int full = open("/dev/full", O_WRONLY | O_CLOEXEC);
  EXPECT_EQ(sem({"list", decimal()}, full).status, 1);
  EXPECT_EQ(sem({"list"}, full).status, 1);
  close(full);
}

}  // namespace
