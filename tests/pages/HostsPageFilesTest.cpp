// What docs/hosts.md tells of log files and no other test shows.
#include <atomic>
#include <csignal>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <sched.h>
#include <sstream>
#include <sys/resource.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

#include "support/Child.h"
#include "support/FileHandlerFixture.h"
#include "support/SemaphoreKey.h"
#include "support/WorkingDir.h"

namespace {

namespace fs = std::filesystem;

constexpr int kNotAllowed = 77;

void limit(__rlimit_resource_t what, rlim_t value) {
  rlimit limits;
  getrlimit(what, &limits);
  limits.rlim_cur = value;
  setrlimit(what, &limits);
}

// ---- Both handlers

class HostsPageFileTest : public FileHandlerFixture,
                          public ::testing::WithParamInterface<const char *> {
 protected:
  HostsPageFileTest() : FileHandlerFixture(GetParam()) {}

  void SetUp() override {
    FileHandlerFixture::SetUp();
    set("MPFileSemKey", key.text());
  }

  bool isShared() const { return std::string(GetParam()) != "qlx_filehandler"; }

  SemaphoreKey key;
};

INSTANTIATE_TEST_SUITE_P(Handlers, HostsPageFileTest,
                         ::testing::Values("qlx_filehandler", "qlx_multiproc_filehandler"),
                         [](const auto &tested) { return std::string(tested.param + 4); });

// ---- Signals that a write may send

// What a process does with each signal, and which it blocks.
std::string signalsOfThisThread() {
  std::ostringstream all;
  sigset_t blocked;
  pthread_sigmask(SIG_SETMASK, nullptr, &blocked);
  for (int number = 1; number < NSIG; ++number) {
    struct sigaction now = {};
    sigaction(number, nullptr, &now);
    all << reinterpret_cast<uintptr_t>(now.sa_handler) << sigismember(&blocked, number) << " ";
  }
  return all.str();
}

class HostsPageSignalsTest : public HostsPageFileTest {
 protected:
  const std::string before = signalsOfThisThread();  // before the toolkit is opened
};

INSTANTIATE_TEST_SUITE_P(Handlers, HostsPageSignalsTest,
                         ::testing::Values("qlx_filehandler", "qlx_multiproc_filehandler"),
                         [](const auto &tested) { return std::string(tested.param + 4); });

TEST_P(HostsPageSignalsTest, AreNeitherSetNorBlocked) {
  std::string under;
  recorder->alsoDo = [&](Event *) { under = signalsOfThisThread(); };
  forward();
  set("maxFileBytes", "1");
  for (const char16_t *text : {u"1", u"2"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(under, before);
  QlxCloseToolkit();
  EXPECT_EQ(signalsOfThisThread(), before);
}

TEST_P(HostsPageFileTest, AFileThatMayNotGrowEndsTheProcess) {
  Child child([&] {
    limit(RLIMIT_CORE, 0);
    limit(RLIMIT_FSIZE, 8);
    std::signal(SIGXFSZ, SIG_DFL);
    EXPECT_EQ(logged(u"12345"), kSuccess);
    log(u"67890");
  });
  EXPECT_EQ(child.end(), -SIGXFSZ);
  EXPECT_EQ(dir.read("app.log"), "12345\n67");
}

TEST_P(HostsPageFileTest, AFifoWithoutItsReaderEndsTheProcessOrFailsTheCall) {
  ASSERT_EQ(mkfifo(dir.path("app.log").c_str(), 0600), 0);
  const auto read = [&] { return ::open(dir.path("app.log").c_str(), O_RDONLY | O_NONBLOCK); };
  for (const bool ignored : {false, true}) {
    Child child([&] {
      std::signal(SIGPIPE, ignored ? SIG_IGN : SIG_DFL);
      const int reader = read();
      EXPECT_EQ(logged(u"1"), kSuccess);
      ::close(reader);
      EXPECT_EQ(logged(u"2"), failure(EPIPE));
      const int next = read();
      EXPECT_EQ(logged(u"3"), kSuccess);
      char bytes[8] = {};
      EXPECT_GT(::read(next, bytes, sizeof bytes), 0);
      EXPECT_STREQ(bytes, "1\n3\n");
    });
    EXPECT_EQ(child.end(), ignored ? 0 : -SIGPIPE);
  }
}

TEST_P(HostsPageFileTest, AKilledProcessLeavesWhatItsCallsHaveAnswered) {
  Child child([&] {
    for (const char16_t *text : {u"1", u"2"}) EXPECT_EQ(logged(text), kSuccess);
    raise(SIGKILL);
  });
  EXPECT_EQ(child.end(), -SIGKILL);
  EXPECT_EQ(dir.read("app.log"), "1\n2\n");
}

// ---- Daemons and names

TEST_P(HostsPageFileTest, ADaemonGoesOnInItsFiles) {
  log(u"1");
  Child daemon([&] {
    EXPECT_NE(setsid(), -1);
    fs::current_path("/");
    EXPECT_EQ(close_range(0, ~0U, 0), 0);
    for (int number : {0, 1, 2}) EXPECT_EQ(::open("/dev/null", O_RDWR), number);
    EXPECT_EQ(logged(u"2"), kSuccess);
    set("maxFiles", "5");
    EXPECT_EQ(logged(u"3"), kSuccess);
  });
  EXPECT_EQ(daemon.end(), 0);
  EXPECT_EQ(dir.read("app.log"), "1\n2\n3\n");
}

TEST_P(HostsPageFileTest, ABareNameIsTakenInTheWorkingDirectoryOfTheSetting) {
  fs::create_directory(dir.path("there"));
  const WorkingDir here{dir.path()};
  set("fileName", "plain.log");
  const WorkingDir there{dir.path("there")};
  EXPECT_EQ(logged(u"1"), kSuccess);
  EXPECT_EQ(dir.read("plain.log"), "1\n");
}

TEST_P(HostsPageFileTest, ARelativeDirectoryIsTakenInTheWorkingDirectoryOfTheMoment) {
  fs::create_directory(dir.path("there"));
  const WorkingDir here{dir.path()};
  set("fileName", "logs/app.log");
  EXPECT_EQ(logged(u"1"), kSuccess);
  const WorkingDir there{dir.path("there")};
  EXPECT_EQ(logged(u"2"), kSuccess);
  set("maxFiles", "5");  // closes
  EXPECT_EQ(logged(u"3"), kSuccess);
  EXPECT_EQ(dir.read("logs/app.log"), isShared() ? "1\n2\n" : "1\n");
  EXPECT_EQ(dir.read("there/logs/app.log"), isShared() ? "3\n" : "2\n3\n");
}

void changeRoot(const std::string &root) {
  const bool isAllowed =
      chroot(root.c_str()) == 0 || (unshare(CLONE_NEWUSER) == 0 && chroot(root.c_str()) == 0);
  if (!isAllowed) _exit(kNotAllowed);
  fs::current_path("/");
}

TEST_P(HostsPageFileTest, ANewRootHasAFileOfTheSameName) {
  fs::create_directories(dir.path("root") + fs::path(dir.path()).parent_path().string());
  EXPECT_EQ(logged(u"1"), kSuccess);
  Child child([&] {
    changeRoot(dir.path("root"));
    EXPECT_EQ(logged(u"2"), kSuccess);
    set("maxFiles", "5");  // closes
    EXPECT_EQ(logged(u"3"), kSuccess);
  });
  const int end = child.end();
  if (end == kNotAllowed) GTEST_SKIP() << "this process may not change its root";
  EXPECT_EQ(end, 0);
  EXPECT_EQ(dir.read("app.log"), isShared() ? "1\n2\n" : "1\n");
  EXPECT_EQ(dir.read("root" + dir.path() + "/app.log"), isShared() ? "3\n" : "2\n3\n");
}

// ---- Who else moves and writes the file

TEST_P(HostsPageFileTest, AChangedSettingLeavesAFileThatWasMovedAway) {
  log(u"1");
  fs::rename(dir.path("app.log"), dir.path("moved.log"));
  dir.write("app.log", "new\n");
  log(u"2");
  set("maxFiles", "3");  // the value that it has
  log(u"3");
  EXPECT_EQ(dir.read("moved.log"), "1\n2\n");
  EXPECT_EQ(dir.read("app.log"), "new\n3\n");
}

TEST_P(HostsPageFileTest, AnEmptiedFileIsFilledFromItsStart) {
  set("maxFileBytes", "9");
  for (const char16_t *text : {u"111", u"222"}) log(text);
  fs::resize_file(dir.path("app.log"), 0);  // as after a copy
  for (const char16_t *text : {u"333", u"444"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(generations(), "333|444| - - -");
  if (isShared()) return;
  set("appending", "false");
  log(u"5");
  fs::resize_file(dir.path("app.log"), 0);
  log(u"6");
  EXPECT_EQ(dir.read("app.log"), std::string("\0\0006\n", 4));  // at its own place
}

TEST_P(HostsPageFileTest, TwoHandlersOfOneFileRollIt) {
  const Handle second = attach("second", GetParam());
  format(second);
  for (QlxObject *each : {handler.get(), second.get()}) {
    QlxSetObjProp(each, "MPFileSemKey", key.text().c_str());
    QlxSetObjProp(each, "fileName", dir.path("app.log").c_str());
    QlxSetObjProp(each, "maxFiles", "4");
    QlxSetObjProp(each, "maxFileBytes", "4");
  }
  for (const char16_t *text : {u"1", u"2", u"3"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(generations(), isShared() ? "3|3| 2|2| 1|1| -" : "2|3| 2|3| 1|1| -");
}

// ---- Limits

TEST_P(HostsPageFileTest, WithoutDescriptorsEachCallTriesAgain) {
  Child child([&] {
    limit(RLIMIT_NOFILE, 3);
    EXPECT_EQ(logged(u"1"), failure(EMFILE));
    EXPECT_EQ(logged(u"2"), failure(EMFILE));
    limit(RLIMIT_NOFILE, 64);
    EXPECT_EQ(logged(u"3"), kSuccess);
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("app.log"), "3\n");
}

TEST_P(HostsPageFileTest, AUserWhoMayNotOpenTheFileIsTold) {
  dir.write("app.log", "");
  fs::permissions(dir.path(), fs::perms(0755));
  fs::permissions(dir.path("app.log"), fs::perms(0400));
  Child child([&] {
    if (geteuid() == 0 && setresuid(65534, 65534, 65534) != 0) _exit(kNotAllowed);
    if (access(dir.path("app.log").c_str(), W_OK) == 0) _exit(kNotAllowed);
    EXPECT_EQ(logged(u"1"), failure(EACCES));
  });
  const int end = child.end();
  if (end == kNotAllowed) GTEST_SKIP() << "this process may not become another user";
  EXPECT_EQ(end, 0);
}

TEST_P(HostsPageFileTest, AnOpenFileIsWrittenOnByAUserWhoMayNotOpenIt) {
  const TempDir folder;
  fs::permissions(folder.path(), fs::perms(0755));
  set("fileName", folder.path("app.log"));
  set("filePermission", "600");
  log(u"1");
  Child child([&] {
    if (geteuid() != 0 || setresuid(65534, 65534, 65534) != 0) _exit(kNotAllowed);
    EXPECT_EQ(logged(u"2"), kSuccess);
    set("maxFiles", "5");  // closes
    EXPECT_EQ(logged(u"3"), failure(EACCES));
  });
  const int end = child.end();
  if (end == kNotAllowed) GTEST_SKIP() << "this process may not become another user";
  EXPECT_EQ(end, 0);
  EXPECT_EQ(folder.read("app.log"), "1\n2\n");
}

// ---- Forks

TEST_P(HostsPageFileTest, ChildrenOfABusyProcessWriteWholeLines) {
  std::atomic<bool> stop{false};
  std::thread parent([&] {
    while (!stop) log(u"parent");
  });
  constexpr int kChildren = 20;
  bool good = true;
  for (int i = 0; i < kChildren && good; ++i) {
    Child child([&] { EXPECT_EQ(logged(u"child"), kSuccess); });
    good = child.end() == 0;
  }
  stop = true;
  parent.join();
  std::istringstream lines(dir.read("app.log"));
  int children = 0;
  for (std::string line; std::getline(lines, line); children += line == "child") {
    EXPECT_TRUE(line == "child" || line == "parent") << line;
  }
  EXPECT_EQ(children, kChildren);
  EXPECT_EQ(key.value(), isShared() ? 1 : -1);
}

}  // namespace
