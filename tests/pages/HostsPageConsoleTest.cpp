// What docs/hosts.md tells of the console and no other test shows. All of it needs a standard
// output of its own, so it is done in children.
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <string>
#include <thread>
#include <unistd.h>

#include "support/ChainTest.h"
#include "support/Child.h"
#include "support/Status.h"
#include "support/TempDir.h"

namespace {

class HostsPageConsoleTest : public HandledChainTest {
 protected:
  HostsPageConsoleTest() : HandledChainTest("console", "qlx_consolehandler") {}

  void SetUp() override {
    HandledChainTest::SetUp();
    format(handler);
  }

  CxStatus logged(const char16_t *text) {
    const QlxLogResult result = log(text);
    return {result.statusKind, result.statusCode};
  }
};

// Standard output is a pipe.
struct OutputPipe {
  OutputPipe() {
    EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
    EXPECT_EQ(dup2(ends[1], STDOUT_FILENO), STDOUT_FILENO);
    ::close(ends[1]);
    fcntl(ends[0], F_SETFL, O_NONBLOCK);
  }

  // What there is now.
  std::string read() const {
    std::string bytes(1 << 20, '\0');
    const ssize_t count = ::read(ends[0], bytes.data(), bytes.size());
    bytes.resize(count > 0 ? static_cast<size_t>(count) : 0);
    return bytes;
  }

  void fill() const {
    fcntl(STDOUT_FILENO, F_SETFL, O_NONBLOCK);
    while (::write(STDOUT_FILENO, "x", 1) == 1) continue;
    fcntl(STDOUT_FILENO, F_SETFL, 0);
  }

  int ends[2];
};

TEST_F(HostsPageConsoleTest, ARecordIsOutWhenTheCallReturns) {
  Child child([&] {
    const OutputPipe out;
    log(u"1");
    EXPECT_EQ(out.read(), "1\n\n");
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(HostsPageConsoleTest, AFailureIsSeenByTheStreamAlone) {
  for (const bool closed : {false, true}) {
    Child child([&] {
      const int full = ::open("/dev/full", O_WRONLY | O_CLOEXEC);
      dup2(full, STDOUT_FILENO);
      if (closed) ::close(STDOUT_FILENO);
      EXPECT_EQ(std::ferror(stdout), 0);
      EXPECT_EQ(logged(u"1"), kSuccess);
      EXPECT_NE(std::ferror(stdout), 0);
    });
    EXPECT_EQ(child.end(), 0);
  }
}

TEST_F(HostsPageConsoleTest, WhatAFullPipeRefusesIsLost) {
  Child child([&] {
    const OutputPipe out;
    out.fill();
    fcntl(STDOUT_FILENO, F_SETFL, O_NONBLOCK);
    EXPECT_EQ(logged(u"1"), kSuccess);
    EXPECT_NE(std::ferror(stdout), 0);
    out.read();
    EXPECT_EQ(logged(u"2"), kSuccess);
    EXPECT_EQ(out.read(), "2\n\n");
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_F(HostsPageConsoleTest, AFileWithTheNumberOneGetsTheText) {
  const TempDir dir;
  Child child([&] {
    ::close(STDOUT_FILENO);
    EXPECT_EQ(::open(dir.path("data").c_str(), O_CREAT | O_WRONLY, 0600), STDOUT_FILENO);
    log(u"1");
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("data"), "1\n\n");
}

TEST_F(HostsPageConsoleTest, AReaderThatIsGoneEndsTheProcessUnlessTheSignalIsIgnored) {
  for (const bool ignored : {false, true}) {
    Child child([&] {
      std::signal(SIGPIPE, ignored ? SIG_IGN : SIG_DFL);
      const OutputPipe out;
      ::close(out.ends[0]);
      EXPECT_EQ(logged(u"1"), kSuccess);
      EXPECT_NE(std::ferror(stdout), 0);
    });
    EXPECT_EQ(child.end(), ignored ? 0 : -SIGPIPE);
  }
}

// A thread logs into a full pipe, with the lock; another one asks for the lock.
TEST_F(HostsPageConsoleTest, AFullPipeStopsEveryCallThatTakesTheLock) {
  const Handle recording = get("recording", RecordingHandler::kClass);
  QlxRemListener(logger.get(), handler.get());
  QlxAddListener(logger.get(), recording.get());  // before the console
  QlxAddListener(logger.get(), handler.get());
  for (const bool isRead : {false, true}) {
    Child child([&] {
      const OutputPipe out;
      out.fill();
      const Signal hasLock;
      recorder->alsoDo = [&](Event *) { hasLock.give(); };
      std::thread writer([&] { log(u"1"); });
      hasLock.await();
      if (isRead) {
        std::string bytes;
        while (!bytes.ends_with("1\n\n")) bytes += out.read();
      } else {
        ualarm(100000, 0);  // what ends it
      }
      EXPECT_EQ(QlxSetObjProp(handler.get(), "logging", "on"), 1);
      writer.join();
    });
    EXPECT_EQ(child.end(), isRead ? 0 : -SIGALRM);
  }
}

}  // namespace
