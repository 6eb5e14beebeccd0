#include "support/FileHandlerTest.h"

#include <atomic>
#include <cerrno>
#include <csignal>
#include <fstream>
#include <thread>
#include <unistd.h>

#include "support/FailingMemory.h"
#include "support/FileSizeLimit.h"

namespace {

TEST_F(FileHandlerTest, StoresAFailedOpenInTheEventAndForwardsIt) {
  forward();
  dir.write("blocked", "");
  set("fileName", dir.path("blocked/app.log"));
  EXPECT_EQ(logged(u"lost"), failure(ENOTDIR));
  ASSERT_EQ(recorder->records.size(), 1u);
  EXPECT_EQ(recorder->records[0].status, failure(ENOTDIR));
  EXPECT_EQ(formatter->formatted, 1);  // the event keeps what formatting does to it
}

TEST_F(FileHandlerTest, TriesAgainAtTheNextEventAfterAFailedOpen) {
  dir.write("blocked", "");
  set("fileName", dir.path("blocked/app.log"));
  log(u"lost");
  std::filesystem::remove(dir.path("blocked"));
  EXPECT_EQ(logged(u"kept"), kSuccess);
  EXPECT_EQ(dir.read("blocked/app.log"), "kept\n");
}

TEST_F(FileHandlerTest, WritesNothingWithoutANameAndForwardsAllTheSame) {
  forward();
  log(u"first");
  changeAbsent("fileName");
  EXPECT_EQ(vars()->fullName, nullptr);
  EXPECT_EQ(logged(u"second"), kSuccess);
  EXPECT_EQ(generations(), "first| - - -");
  EXPECT_RECORDED(u"first|second|");
}

TEST_F(FileHandlerTest, HasNoNameWhenTheConfiguredOneIsTooLong) {
  set("fileName", std::string(257, 'x'));
  EXPECT_EQ(vars()->fullName, nullptr);
  EXPECT_EQ(logged(u"lost"), failure(ENAMETOOLONG));
}

TEST_F(FileHandlerTest, CutsThePieceOfARecordOffThatCannotBeFinishedAndStoresTheFailure) {
  forward();
  log(u"12345");
  const FileSizeLimit limit{8};
  EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  EXPECT_EQ(dir.read("app.log"), "12345\n");
  EXPECT_EQ(vars()->size, 6u);
  EXPECT_RECORDED(u"12345|67890|");
}

TEST_F(FileHandlerTest, CountsAHeaderThatCannotBeWrittenAsAFailedOpen) {
  formatter->header = "head\n";
  {
    const FileSizeLimit limit{0};
    EXPECT_EQ(logged(u"1"), failure(EFBIG));
    EXPECT_EQ(vars()->opened, 0);
    EXPECT_EQ(vars()->file, -1);
  }
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "head\n2\n");
}

TEST_F(FileHandlerTest, LeavesAnEarlierFailureInTheEventWhenItsOwnWriteSucceeds) {
  const Handle first = get("first", "qlx_filehandler");
  QlxSetObjProp(first.get(), "fileName", dir.path("app.log/impossible").c_str());
  dir.write("app.log", "");
  QlxRemListener(logger.get(), handler.get());
  QlxAddListener(logger.get(), first.get());
  QlxAddListener(first.get(), handler.get());
  EXPECT_EQ(logged(u"one"), failure(ENOTDIR));
  EXPECT_EQ(dir.read("app.log"), "one\n");
}

TEST_F(FileHandlerTest, SurvivesEveryFailedAllocationOfAnEvent) {
  set("maxFileBytes", "20");
  formatter->header = "head\n";
  formatter->trailer = "tail\n";
  const std::u16string texts[] = {u"short", std::u16string(5000, u'x')};
  for (const std::u16string &text : texts) {
    for (uint64_t nth = 1, failures = 1; failures > 0; ++nth) {
      FailingMemory memory;
      memory.failOnce(nth);
      log(text.c_str());
      failures = memory.failures();
    }
    EXPECT_EQ(logged(text.c_str()), kSuccess);
    EXPECT_NE(dir.read("app.log").find(std::string(text.begin(), text.end())), std::string::npos);
  }
}

TEST_F(FileHandlerTest, TellsOfARecordThatItCouldNotNarrow) {
  FailingMemory memory;
  log(std::u16string(5000, u'x').c_str());
  const uint64_t all = memory.attempts();
  std::vector<CxStatus> failed;
  for (uint64_t nth = 1; nth <= all; ++nth) {
    memory.failOnce(nth);
    if (const CxStatus status = logged(std::u16string(5000, u'x').c_str()); status.kind == 'p') {
      failed.push_back(status);
    }
  }
  ASSERT_EQ(failed.size(), 1u);
  EXPECT_EQ(failed[0], failure(ENOMEM));
}

TEST_F(FileHandlerTest, TellsOfEachRecordWhileItsNameFoundNoMemory) {
  const std::string name = dir.path("other.log");
  for (uint64_t nth = 1, failures = 1; failures > 0; ++nth) {
    FailingMemory memory;
    memory.failOnce(nth);
    QlxSetObjProp(handler.get(), "fileName", name.c_str());
    failures = memory.failures();
    memory.failNone();
    const OwnedStr stored{QlxGetObjProp(handler.get(), "fileName", nullptr)};
    if (!stored) continue;
    EXPECT_EQ(logged(u"1"), vars()->fullName ? kSuccess : failure(ENOMEM)) << nth;
  }
  EXPECT_EQ(logged(u"1"), kSuccess);
}

TEST_F(FileHandlerTest, IgnoresNullAndObjectsWithoutVariables) {
  QlxObject bare = {};
  for (QlxObject *object : {static_cast<QlxObject *>(nullptr), &bare}) {
    QlxFileUHandlerFProcess(object, nullptr, nullptr);
    QlxFileHandlerFOpen(object);
    EXPECT_EQ(QlxFileHandlerFOpenWithErr(object), kSuccess);
    QlxFileHandlerFClose(object);
    QlxFileHandlerFCfgChange(object, "fileName");
    qlxFileHandlerCfgPerms(object, "644");
    qlxFileHandlerCfgDirPerms(object, "755");
  }
  QlxFileUHandlerFProcess(handler.get(), nullptr, nullptr);
  QlxFileHandlerFFreeVars(nullptr);
  EXPECT_FALSE(dir.has("app.log"));
  log(u"1");
  QlxFileHandlerFCfgChange(handler.get(), nullptr);
  EXPECT_EQ(vars()->opened, 1);
}

// ---- Writes that come in pieces

std::atomic<int> signalsCaught;

void catchSignal(int) {
  ++signalsCaught;
}

// Waits until a thread of this process sleeps, by its state in /proc.
void awaitSleep(pid_t thread) {
  for (char state = 0; state != 'S';) {
    std::ifstream stat("/proc/self/task/" + std::to_string(thread) + "/stat");
    const std::string line{std::istreambuf_iterator<char>(stat), {}};
    state = line[line.rfind(')') + 2];
  }
}

// The first signal finds a part of the bytes in the pipe and makes the write short; the second
// finds the pipe full and makes the next one fail with EINTR.
TEST(FileHandlerWrite, GoesOnAfterAShortWriteAndAfterAnInterruption) {
  if (!std::filesystem::exists("/proc/self/task")) GTEST_SKIP() << "no /proc here";
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  struct sigaction action = {}, before;
  action.sa_handler = catchSignal;  // without SA_RESTART
  sigaction(SIGUSR1, &action, &before);
  signalsCaught = 0;

  const pthread_t writer = pthread_self();
  const pid_t writerId = gettid();
  const std::string bytes(300000, 'x');
  std::string received;
  std::thread reader([&] {
    for (int round = 1; round <= 2; ++round) {
      awaitSleep(writerId);
      pthread_kill(writer, SIGUSR1);
      while (signalsCaught < round) std::this_thread::yield();
    }
    char part[65536];
    while (received.size() < bytes.size()) {
      const ssize_t count = read(ends[0], part, sizeof part);
      if (count <= 0) break;
      received.append(part, static_cast<size_t>(count));
    }
  });
  QlxFileHandlerVars vars = {};
  vars.file = ends[1];
  const CxStatus status = qlxLogFileWrite(&vars, bytes.data(), static_cast<uint32_t>(bytes.size()));
  ::close(ends[1]);
  reader.join();
  ::close(ends[0]);
  sigaction(SIGUSR1, &before, nullptr);
  EXPECT_EQ(status, kSuccess);
  EXPECT_EQ(received, bytes);
  EXPECT_EQ(vars.size, bytes.size());
}

}  // namespace
