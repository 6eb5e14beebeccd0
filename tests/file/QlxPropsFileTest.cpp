// What may stand behind the path of a properties file, and what goes on while it is read.
#include "file/QlxPropsFile.h"

#include <gtest/gtest.h>

#include <atomic>
#include <csignal>
#include <optional>
#include <thread>

#include <fcntl.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <qlx/proplist.h>

#include "support/Child.h"
#include "support/OwnThread.h"
#include "support/Status.h"
#include "support/ToolkitLifeTest.h"

namespace {

constexpr CxStatus kUntouched{'?', 77};

class PropsFileTest : public ToolkitLifeTest {
 protected:
  void SetUp() override { ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0); }
  ~PropsFileTest() override { CxPropListDiscard(&list); }

  CxStatus statusOf(const std::string &path) {
    CxStatus status = kUntouched;
    EXPECT_EQ(CxPropListRead(path.c_str(), &list, &status), 0);
    return status;
  }
  static CxStatus statusOfOpening(const std::string &path) {
    CxStatus status = kUntouched;
    EXPECT_EQ(QlxOpenToolkit(path.c_str(), &status), 0);
    return status;
  }

  // A file of so many bytes, all but the first few of them without a block on the disk.
  std::string large(uint64_t bytes) const {
    const std::string path = dir.write("large", "a.b=1\n#");
    std::filesystem::resize_file(path, bytes);
    return path;
  }

  const std::string pipe = dir.path("pipe");
  CxPropList list{};
};

TEST_F(PropsFileTest, ADeviceIsRefused) {
  EXPECT_EQ(statusOf("/dev/zero"), failure(EINVAL));
  EXPECT_EQ(statusOf("/dev/null"), failure(EINVAL));
  EXPECT_EQ(statusOfOpening("/dev/zero"), failure(EINVAL));
}

TEST_F(PropsFileTest, AFolderIsRefused) {
  EXPECT_EQ(statusOf(dir.path()), failure(EISDIR));
  EXPECT_EQ(statusOfOpening(dir.path()), failure(EISDIR));
}

TEST_F(PropsFileTest, ASocketIsRefused) {
  sockaddr_un address = {AF_UNIX, {}};
  dir.path("socket").copy(address.sun_path, sizeof address.sun_path - 1);
  const int listening = socket(AF_UNIX, SOCK_STREAM, 0);
  ASSERT_EQ(bind(listening, reinterpret_cast<sockaddr *>(&address), sizeof address), 0);
  EXPECT_EQ(statusOf(dir.path("socket")), failure(ENXIO));
  close(listening);
}

TEST_F(PropsFileTest, ALargeFileIsRefusedWithNothingOfIt) {
  EXPECT_EQ(statusOf(large(kMaxPropsBytes + 1)), failure(EFBIG));
  EXPECT_EQ(list.count, 0);
  EXPECT_EQ(statusOfOpening(dir.path("large")), failure(EFBIG));
}

TEST_F(PropsFileTest, AFileOfTheLargestSizeIsRead) {
  EXPECT_EQ(CxPropListRead(large(kMaxPropsBytes).c_str(), &list, nullptr), 1);
  EXPECT_EQ(list.count, 1);
}

TEST_F(PropsFileTest, APathOf256BytesIsTheLongest) {
  dir.write("file", "a.b=1\n");
  std::string path = dir.path();
  while (path.size() < kMaxPropsPathBytes - std::string("/file").size()) path += "/";
  path += "/file";
  ASSERT_EQ(path.size(), 256u);
  EXPECT_EQ(CxPropListRead(path.c_str(), &list, nullptr), 1);
  EXPECT_EQ(statusOf(path + "x"), failure(ENAMETOOLONG));
  EXPECT_EQ(statusOfOpening(path + "x"), failure(ENAMETOOLONG));
}

// ---- Pipes. What waits for one that nobody fills is ended by the child's alarm.

// The writing end of a named pipe, there when somebody reads it.
class Writer {
 public:
  explicit Writer(const std::string &pipe) : end_(open(pipe.c_str(), O_WRONLY)) {}
  ~Writer() { close(end_); }
  Writer(const Writer &) = delete;
  Writer &operator=(const Writer &) = delete;

  bool write(const std::string &text) const {
    return ::write(end_, text.data(), text.size()) == static_cast<ssize_t>(text.size());
  }
  void awaitEmpty() const {
    for (int left = 1; left > 0; sched_yield()) ioctl(end_, FIONREAD, &left);
  }

 private:
  int end_;
};

// An open that reads the pipe, in a thread of its own.
class Opening {
 public:
  explicit Opening(const std::string &path)
      : thread_([this, path] { result_ = QlxOpenToolkit(path.c_str(), &status_); }) {}

  uint8_t result() {
    thread_.join();
    return result_;
  }
  CxStatus status() const { return status_; }  // after result()
  pthread_t id() { return thread_.native_handle(); }

 private:
  uint8_t result_ = 7;
  CxStatus status_ = kUntouched;
  std::thread thread_;
};

std::string propertyOf(const char *cfg) {
  ObjCfg *found = QlxLogMgrHasCfg(cfg) ? QlxLogMgrGetCfg(cfg) : nullptr;
  char *value = QlxGetObjCfgProp(found, "key", nullptr);
  const std::string text = value ? value : "<none>";
  OslMemoryFree(value);
  QlxReleaseObjCfg(found);
  return text;
}

TEST_F(PropsFileTest, APipeIsReadToItsEnd) {
  expectNoHang([this] {
    Opening opening(pipe);
    {
      const Writer writer(pipe);
      writer.write("cfg.k");
      writer.awaitEmpty();
      writer.write("ey=value\n");
    }
    EXPECT_EQ(opening.result(), 1);
    EXPECT_EQ(propertyOf("cfg"), "value");
  });
}

TEST_F(PropsFileTest, ADescriptorsPipeIsReadToItsEnd) {
  if (!std::filesystem::exists("/dev/fd")) GTEST_SKIP() << "no /proc here";
  expectNoHang([] {
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    ASSERT_EQ(write(ends[1], "cfg.key=value\n", 14), 14);
    ::close(ends[1]);
    EXPECT_EQ(QlxOpenToolkit(("/dev/fd/" + std::to_string(ends[0])).c_str(), nullptr), 1);
    EXPECT_EQ(propertyOf("cfg"), "value");
  });
}

TEST_F(PropsFileTest, OtherCallsGoOnWhileAPipeIsWaitedFor) {
  expectNoHang([this] {
    Opening opening(pipe);
    std::optional<Writer> writer(pipe);
    EXPECT_EQ(QlxLogMgrHasCfg("cfg"), 0);
    EXPECT_FALSE(toolkitLogger());
    writer.reset();
    EXPECT_EQ(opening.result(), 1);
    EXPECT_TRUE(toolkitLogger());
  });
}

TEST_F(PropsFileTest, CountsForNothingWhenTheToolkitIsOpenedMeanwhile) {
  expectNoHang([this] {
    Opening opening(pipe);
    std::optional<Writer> writer(pipe);
    EXPECT_EQ(open(), 1);
    writer->write("cfg.key=value\n");
    writer.reset();
    EXPECT_EQ(opening.result(), 1);
    EXPECT_EQ(propertyOf("cfg"), "<none>");
  });
}

TEST_F(PropsFileTest, ThatIsBrokenDoesNotCloseWhatWasOpenedMeanwhile) {
  expectNoHang([this] {
    Opening opening(pipe);
    std::optional<Writer> writer(pipe);
    EXPECT_EQ(open(), 1);
    writer->write("broken\n");
    writer.reset();
    EXPECT_EQ(opening.result(), 1);
    EXPECT_EQ(opening.status(), kUntouched);
    EXPECT_TRUE(toolkitLogger());
  });
}

TEST_F(PropsFileTest, MakesTheToolkitOpenAlsoWhenItIsClosedMeanwhile) {
  expectNoHang([this] {
    Opening opening(pipe);
    std::optional<Writer> writer(pipe);
    QlxCloseToolkit();
    writer->write("cfg.key=value\n");
    writer.reset();
    EXPECT_EQ(opening.result(), 1);
    EXPECT_EQ(propertyOf("cfg"), "value");
  });
}

TEST_F(PropsFileTest, APipeIsRefusedAtTheLimitWithNothingOfIt) {
  expectNoHang([this] {
    signal(SIGPIPE, SIG_IGN);
    std::thread filling([this] {
      const Writer writer(pipe);
      writer.write("a.b=1\n#");
      const std::string comment(1 << 20, 'c');
      while (writer.write(comment)) continue;
    });
    EXPECT_EQ(statusOf(pipe), failure(EFBIG));
    EXPECT_EQ(list.count, 0);
    filling.join();
  });
}

std::atomic<int> gInterrupted{0};

// Has the thread's calls of the system fail with EINTR.
void interruptOften(pthread_t thread) {
  for (int i = 0; i < 100; ++i) {
    const int before = gInterrupted;
    pthread_kill(thread, SIGUSR1);
    while (gInterrupted == before) sched_yield();
  }
}

TEST_F(PropsFileTest, InterruptedOpensAndReadsGoOn) {
  expectNoHang([this] {
    struct sigaction action = {};
    action.sa_handler = [](int) { ++gInterrupted; };
    sigaction(SIGUSR1, &action, nullptr);
    Opening opening(pipe);
    interruptOften(opening.id());
    std::optional<Writer> writer(pipe);
    writer->write("cfg.key=");
    writer->awaitEmpty();
    interruptOften(opening.id());
    writer->write("value\n");
    writer.reset();
    EXPECT_EQ(opening.result(), 1);
    EXPECT_EQ(propertyOf("cfg"), "value");
  });
}

class CancelledOpenTest : public PropsFileTest, public ::testing::WithParamInterface<int> {};

INSTANTIATE_TEST_SUITE_P(Types, CancelledOpenTest,
                         ::testing::Values(PTHREAD_CANCEL_DEFERRED, PTHREAD_CANCEL_ASYNCHRONOUS));

TEST_P(CancelledOpenTest, AThreadThatWaitsForAPipeEndsWhenTheToolkitIsOpen) {
  expectNoHang([this] {
    const OwnThread thread([this] {
      pthread_setcanceltype(GetParam(), nullptr);
      QlxOpenToolkit(pipe.c_str(), nullptr);
      pthread_testcancel();
    });
    std::optional<Writer> writer(pipe);
    thread.cancel();
    writer->write("cfg.key=value\n");
    writer.reset();
    EXPECT_TRUE(thread.endsCancelled());
    EXPECT_EQ(propertyOf("cfg"), "value");
  });
}

}  // namespace
