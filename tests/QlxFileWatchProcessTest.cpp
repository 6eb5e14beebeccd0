// Watched paths across forks, closed descriptors and threads.
#include "support/FileWatchTest.h"

namespace {

// ---- Processes

TEST_F(FileWatchTest, TellsAChildAndItsParentAlike) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  Signal removed;
  Child child([&] {
    removed.await();
    EXPECT_FALSE(finds());
  });
  fs::remove(dir.path(kName));
  removed.give();
  EXPECT_EQ(child.end(), 0);
  EXPECT_FALSE(finds());
}

TEST_F(FileWatchTest, WatchesInAChildAsInItsParent) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  Child child([&] {
    log(u"child");
    EXPECT_EQ(vars()->watch.watching, 1);
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
  });
  EXPECT_EQ(child.end(), 0);
  fs::remove(dir.path(kName));
  EXPECT_EQ(next(), "next\n");
}

// ---- Descriptors

enum class Way { Asked, Flagged };  // how it is known whether there are notices

class FileWatchDescriptorTest : public FileWatchTest, public ::testing::WithParamInterface<Way> {
 protected:
  void SetUp() override {
    FileWatchTest::SetUp();
    if (GetParam() == Way::Flagged && !systemHasFlags()) {
      GTEST_SKIP() << "no poll requests on this machine";
    }
    ASSERT_NO_FATAL_FAILURE(watchFile());
  }

  // The child of a fork watches anew.
  void watchInChild() {
    logTimes(1);
    ASSERT_EQ(vars()->watch.watching, 1);
    if (GetParam() == Way::Flagged) awaitFlag();
  }
};

INSTANTIATE_TEST_SUITE_P(Ways, FileWatchDescriptorTest, ::testing::Values(Way::Asked, Way::Flagged),
                         [](const auto &tested) {
                           return tested.param == Way::Asked ? "Asked" : "Flagged";
                         });

TEST_P(FileWatchDescriptorTest, SeesARemovalAfterAHostClosedAllDescriptors) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    fs::remove(dir.path(kName));
    EXPECT_FALSE(finds());
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_P(FileWatchDescriptorTest, SeesARemovalAfterAHostClosedItsDescriptorsOnly) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    ASSERT_EQ(close_range(500, ~0U, 0), 0);
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_P(FileWatchDescriptorTest, GoesOnAfterAHostClosedAllDescriptors) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    log(u"first");
    logTimes(kUntilWatched);
    EXPECT_EQ(vars()->watch.watching, 1);
    fs::remove(dir.path(kName));
    log(u"last");
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read(kName), "last\n");
}

TEST_P(FileWatchDescriptorTest, LosesNoEventWhenAHostClosedAllDescriptors) {
  const std::string before = dir.read(kName);
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    log(u"one");
    log(u"two");
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read(kName), before + "steady\none\ntwo\n");
}

TEST_F(FileWatchTest, KeepsOutOfTheNumbersThatFilesGet) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  EXPECT_GE(descriptorsOf("inotify").at(0), 500);
  EXPECT_GE(descriptorsOf("eventpoll").at(0), 500);
}

// What a host has put in place of the descriptors: one end of a pair with a byte to read.
class HostsPair {
 public:
  HostsPair() {
    EXPECT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends_), 0);
    EXPECT_EQ(write(ends_[1], "x", 1), 1);
  }
  int end() const { return ends_[0]; }

  // Nothing was read from it, and the number is still its.
  void expectUntouched(int number) const {
    char byte = 0;
    EXPECT_EQ(recv(number, &byte, 1, MSG_PEEK | MSG_DONTWAIT), 1);
    struct stat a {
    }, b{};
    EXPECT_EQ(fstat(number, &a), 0);
    EXPECT_EQ(fstat(ends_[0], &b), 0);
    EXPECT_EQ(a.st_ino, b.st_ino);
  }

 private:
  int ends_[2];
};

// Both of the watch's numbers as a host has taken them.
class TakenNumbers {
 public:
  TakenNumbers() {
    for (const int number : {inotify_, epoll_}) EXPECT_EQ(dup2(pair_.end(), number), number);
  }
  void expectUntouched() const {
    for (const int number : {inotify_, epoll_}) pair_.expectUntouched(number);
  }

 private:
  const int inotify_ = descriptorsOf("inotify").at(0);
  const int epoll_ = descriptorsOf("eventpoll").at(0);
  const HostsPair pair_;
};

TEST_P(FileWatchDescriptorTest, LeavesAHostsFilesAloneThatHaveItsNumbers) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    const TakenNumbers taken;
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
    logTimes(kUntilWatched);
    EXPECT_EQ(vars()->watch.watching, 1);
    set("maxFiles", "5");  // closes the file
    taken.expectUntouched();
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_P(FileWatchDescriptorTest, LeavesAHostsFilesAloneWhenItStops) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    const TakenNumbers taken;
    Child forked([&] { taken.expectUntouched(); });
    EXPECT_EQ(forked.end(), 0);
    set("maxFiles", "5");  // closes the file
    handler.reset();
    logger.reset();
    QlxCloseToolkit();
    taken.expectUntouched();
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_P(FileWatchDescriptorTest, ReadsNothingForAHostsOwnQuestion) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    const int inotify = descriptorsOf("inotify").at(0);
    const int epoll = descriptorsOf("eventpoll").at(0);
    const HostsPair pair;
    const int own = epoll_create1(EPOLL_CLOEXEC);
    epoll_event wanted{.events = EPOLLIN, .data = {.u64 = 1}};
    dup2(pair.end(), inotify);
    dup2(own, epoll);
    ASSERT_EQ(epoll_ctl(epoll, EPOLL_CTL_ADD, inotify, &wanted), 0);
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
    logTimes(kUntilWatched);
    EXPECT_EQ(vars()->watch.watching, 1);
    pair.expectUntouched(inotify);
    epoll_event ready{};
    EXPECT_EQ(epoll_wait(epoll, &ready, 1, 0), 1);
    EXPECT_EQ(uint64_t{ready.data.u64}, 1U);  // a copy: the record is packed
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_P(FileWatchDescriptorTest, LeavesAHostsQuietSetOfDescriptorsAlone) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchInChild());
    const int epoll = descriptorsOf("eventpoll").at(0);
    const int own = epoll_create1(EPOLL_CLOEXEC);
    dup2(own, epoll);
    fs::remove(dir.path(kName));
    if (GetParam() == Way::Flagged) {
      EXPECT_FALSE(finds());
    }
    for (int i = 0; i < 100; ++i) {  // the system is asked about the host's own
      const ApiLock lock;
      qlxNoticesChanges();
    }
    EXPECT_FALSE(isFlagged());
    vars()->watch.lastLook -= 1;
    EXPECT_EQ(next(), "next\n");
    epoll_event none;
    EXPECT_EQ(epoll_wait(epoll, &none, 1, 0), 0);
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(FileWatchTest, LooksWhereThereAreTooFewDescriptors) {
  Child child([&] {
    const rlimit few{100, 100};
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &few), 0);
    set("fileName", dir.path(kName));
    log(u"steady");
    const size_t before = openDescriptors();
    logTimes(kUntilWatched);
    EXPECT_EQ(vars()->watch.watching, 0);
    EXPECT_EQ(openDescriptors(), before);
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(FileWatchTest, GoesOnAfterItWasStopped) {
  const size_t before = openDescriptors();
  ASSERT_NO_FATAL_FAILURE(watchFile());
  EXPECT_EQ(openDescriptors(), before + 3);
  {
    const ApiLock lock;
    qlxFileWatchStop();
  }
  EXPECT_EQ(openDescriptors(), before + 1);
  log(u"again");
  EXPECT_EQ(vars()->watch.watching, 1);
  fs::remove(dir.path(kName));
  EXPECT_EQ(next(), "next\n");
}

TEST(FileWatchLifeTest, LeavesNoDescriptorWhenTheToolkitIsClosed) {
  const TempDir dir;
  const size_t before = openDescriptors();
  for (int round = 0; round < 3; ++round) {
    ASSERT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);
    QlxObject *logger = QlxGetObject("log", "qlx_basiclogger");
    QlxObject *handler = QlxGetObject("file", "qlx_filehandler");
    QlxSetObjProp(handler, "fileName", dir.path("app.log").c_str());
    QlxAddListener(logger, handler);
    for (int i = 0; i < kUntilWatched; ++i) QlxLogUText(logger, u"text");
    EXPECT_EQ(static_cast<QlxFileHandlerVars *>(handler->vars)->watch.watching, 1);
    EXPECT_EQ(openDescriptors(), before + 3);
    QlxReleaseObject(handler);
    QlxReleaseObject(logger);
    QlxCloseToolkit();
    EXPECT_EQ(openDescriptors(), before);
  }
}

// ---- Threads

TEST_P(FileWatchDescriptorTest, NoticesRemovalsWhileAnotherThreadLogs) {
  if (GetParam() == Way::Flagged) awaitFlag();
  std::atomic<bool> done{false};
  std::thread other([&] {
    while (!done) log(u"other");
  });
  for (int i = 0; i < 50; ++i) {
    std::error_code missing;
    fs::remove(dir.path(kName), missing);
    log(u"mine");
    EXPECT_TRUE(dir.has(kName));
  }
  done = true;
  other.join();
}

}  // namespace
