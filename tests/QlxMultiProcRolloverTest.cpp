// The rollover of a file that several processes share, and what fails in it.
#include "support/MultiProcFileHandlerTest.h"
#include "support/Descriptors.h"
#include "support/TestClock.h"

#include <sys/syscall.h>

namespace {

// ---- Rolling over

TEST_F(MultiProcFileHandlerTest, RollsOverBeforeTheEventThatFindsTheFileFull) {
  set("maxFileBytes", "5");
  set("maxFiles", "2");
  EXPECT_EQ(logged(u"first"), kSuccess);
  EXPECT_EQ(logged(u"second"), kSuccess);
  EXPECT_EQ(generations(), "second| first| - -");
}

TEST_F(MultiProcFileHandlerTest, FillsTheFileToItsLimitAndPastItByOneRecord) {
  set("maxFileBytes", "10");
  for (const char16_t *text : {u"1234", u"567", u"90123", u"4"}) log(text);
  EXPECT_EQ(generations(), "4| 1234|567|90123| - -");
}

TEST_F(MultiProcFileHandlerTest, IsFullAtExactlyItsLimit) {
  set("maxFileBytes", "5");
  for (const char16_t *text : {u"1234", u"5"}) log(text);
  EXPECT_EQ(generations(), "5| 1234| - -");
}

TEST_F(MultiProcFileHandlerTest, ReplacesGenerationOneWhenThereAreTwoFiles) {
  rollAlways("2");
  for (const char16_t *text : {u"longest", u"long", u"3"}) {  // nothing of it stays behind the next
    EXPECT_EQ(logged(text), kSuccess);
  }
  EXPECT_EQ(generations(), "3| long| - -");
}

TEST_F(MultiProcFileHandlerTest, KeepsAsManyGenerationsAsItIsTold) {
  rollAlways("3");
  for (const char16_t *text : {u"1", u"2", u"3", u"4"}) {
    EXPECT_EQ(logged(text), kSuccess);
  }
  EXPECT_EQ(generations(), "4| 3| 2| -");
}

TEST_F(MultiProcFileHandlerTest, NeverRollsWithFewerThanTwoFiles) {
  for (const char *files : {"1", "0", "-1"}) {
    set("fileName", dir.path("app.log"));
    rollAlways(files);
    for (const char16_t *text : {u"1", u"2"}) log(text);
  }
  EXPECT_EQ(generations(), "1|2|1|2|1|2| - - -");
}

TEST_F(MultiProcFileHandlerTest, NeverRollsAtANegativeLimit) {
  rollAlways("2");
  set("maxFileBytes", "-1");
  for (const char16_t *text : {u"1", u"2"}) log(text);
  EXPECT_EQ(generations(), "1|2| - - -");
}

TEST_F(MultiProcFileHandlerTest, RollsAtEveryEventWithALimitOfZero) {
  set("maxFileBytes", "0");
  for (const char16_t *text : {u"1", u"2"}) log(text);
  EXPECT_EQ(generations(), "2| 1|  -");  // the empty file was rolled too
}

TEST_F(MultiProcFileHandlerTest, LeavesTheActiveFileInItsPlace) {
  rollAlways("2");
  log(u"1");
  const ino_t before = activeInode();
  const CxFile file = vars()->file;
  log(u"2");
  EXPECT_EQ(activeInode(), before);
  EXPECT_EQ(vars()->file, file);
  EXPECT_EQ(generations(), "2| 1| - -");
}

TEST_F(MultiProcFileHandlerTest, CopiesFilesOfAnySize) {
  rollAlways("2");
  std::string bytes;
  for (const size_t size : {1, 8191, 8192, 8193, 16384, 100000}) {
    log(u"before");
    bytes.assign(size, 'x');
    bytes.back() = '\n';
    dir.write("app.log", bytes);
    log(u"after");
    EXPECT_EQ(dir.read("app1.log"), bytes) << size;
    EXPECT_EQ(dir.read("app.log"), "after\n") << size;
  }
}

TEST_F(MultiProcFileHandlerTest, CountsWhatOtherProcessesWrite) {
  set("maxFileBytes", "10");
  log(u"1");
  Child other([this] { log(u"from another"); });
  EXPECT_EQ(other.end(), 0);
  log(u"2");
  EXPECT_EQ(generations(), "2| 1|from another| - -");
}

TEST_F(MultiProcFileHandlerTest, GoesOnInTheActiveFileAfterAnotherProcessRolledIt) {
  set("maxFileBytes", "6");
  open();
  const Signal mine, theirs;
  Child other([&] {
    close();  // a descriptor of its own
    for (const char16_t *text : {u"b1", u"b2", u"b3"}) {
      theirs.await();
      EXPECT_EQ(logged(text), kSuccess);
      mine.give();
    }
  });
  for (const char16_t *text : {u"a1", u"a2", u"a3"}) {
    EXPECT_EQ(logged(text), kSuccess);
    theirs.give();
    mine.await();
  }
  EXPECT_EQ(other.end(), 0);
  EXPECT_EQ(generations(), "a3|b3| a2|b2| a1|b1| -");
  EXPECT_TRUE(semaphoreIsFree());
}

TEST_F(MultiProcFileHandlerTest, SharesItsDescriptorWithAForkedProcess) {
  set("maxFileBytes", "6");
  log(u"a1");
  Child other([this] {
    for (const char16_t *text : {u"b1", u"b2", u"b3"}) log(text);
  });
  EXPECT_EQ(other.end(), 0);
  log(u"a2");
  EXPECT_EQ(generations(), "a2| b2|b3| a1|b1| -");
}

TEST_F(MultiProcFileHandlerTest, GoesOnInADeletedActiveFile) {
  log(u"one");
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_FALSE(dir.has("app.log"));
  set("maxFileBytes", "8");  // closes
  log(u"three");
  EXPECT_EQ(dir.read("app.log"), "three\n");
}

// All its processes would have to follow at the same record.
TEST_F(MultiProcFileHandlerTest, GoesOnInItsFileWhateverFollowNameSays) {
  set("followName", "true");
  log(u"1");
  std::filesystem::rename(dir.path("app.log"), dir.path("old.log"));
  dir.write("app.log", "other\n");
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("old.log"), "1\n2\n");
  EXPECT_EQ(dir.read("app.log"), "other\n");
}

TEST_F(MultiProcFileHandlerTest, RollsADeletedActiveFileOver) {
  set("maxFileBytes", "8");
  log(u"one");
  std::filesystem::remove(dir.path("app.log"));
  log(u"two");
  EXPECT_EQ(logged(u"three"), kSuccess);
  EXPECT_EQ(generations(), "- one|two| - -");
}

TEST_F(MultiProcFileHandlerTest, WaitsForAStoppedHolderAndGoesOnWhenItIsKilled) {
  for (const bool killed : {false, true}) {
    Child holder([this] {
      calls.onOperate = [](const sembuf &operation, size_t) {
        if (!isLock(operation)) raise(SIGSTOP);  // written, not yet given back
        return 0;
      };
      log(u"holder");
    });
    holder.awaitStop();
    Child other([this] { EXPECT_EQ(logged(u"other"), kSuccess); });
    ASSERT_TRUE(key.awaitWaiting(1));
    EXPECT_EQ(dir.read("app.log"), "holder\n");
    holder.send(killed ? SIGKILL : SIGCONT);
    EXPECT_EQ(other.end(), 0);
    EXPECT_EQ(holder.end(), killed ? -SIGKILL : 0);
    EXPECT_EQ(dir.read("app.log"), "holder\nother\n");
    EXPECT_TRUE(semaphoreIsFree());
    std::filesystem::remove(dir.path("app.log"));
  }
}

// ---- Failures of a rollover: the active file is emptied all the same, and the event tells of them

TEST_F(MultiProcFileHandlerTest, SaysThatGenerationOneCannotBeOpenedAndEmptiesTheFileAllTheSame) {
  forward();
  rollAlways("2");
  log(u"lost");
  obstruct("app1.log");
  CaptureStdout output;
  EXPECT_EQ(logged(u"two"), failure(EISDIR));
  EXPECT_EQ(output.bytes(), "ERR opening " + dir.path() + "//app1.log pre rollover\n");
  EXPECT_EQ(dir.read("app.log"), "two\n");
  EXPECT_RECORDED(u"lost|two|");
  EXPECT_TRUE(semaphoreIsFree());
}

TEST_F(MultiProcFileHandlerTest, PrintsNothingElse) {
  rollAlways("3");
  log(u"one");
  obstruct("app2.log");
  FailingMemory memory;
  CaptureStdout output;
  log(u"two");
  calls.onOperate = [](const sembuf &, size_t) { return EIDRM; };
  log(u"three");
  close();
  std::filesystem::remove(dir.path("app.log"));
  std::filesystem::create_directory(dir.path("app.log"));
  log(u"four");
  EXPECT_EQ(output.bytes(), "");
}

TEST_F(MultiProcFileHandlerTest, ReplacesAGenerationOneThatCouldNotBeMoved) {
  rollAlways("3");
  log(u"new");
  dir.write("app1.log", "longer\n");
  obstruct("app2.log");
  EXPECT_EQ(logged(u"last"), failure(EISDIR));
  EXPECT_EQ(dir.read("app1.log"), "new\n");
  EXPECT_EQ(dir.read("app.log"), "last\n");
}

TEST_F(MultiProcFileHandlerTest, DoesNotFollowALinkThatWasPlantedAsGenerationOne) {
  dir.write("precious", "untouched\n");
  rollAlways("3");
  log(u"new");
  obstruct("app2.log");  // the link stays where it is, too
  std::filesystem::create_symlink(dir.path("precious"), dir.path("app1.log"));
  log(u"last");
  EXPECT_EQ(dir.read("precious"), "untouched\n");
  EXPECT_FALSE(std::filesystem::is_symlink(dir.path("app1.log")));
  EXPECT_EQ(dir.read("app1.log"), "new\n");
}

TEST_F(MultiProcFileHandlerTest, EmptiesTheFileAlsoWhenItCannotBeRead) {
  rollAlways("2");
  log(u"lost");
  replaceDescriptor(::open(dir.path("app.log").c_str(), O_WRONLY | O_APPEND));
  EXPECT_EQ(logged(u"two"), failure(EBADF));
  EXPECT_EQ(generations(), "two|  - -");
}

TEST_F(MultiProcFileHandlerTest, DoesNotOpenGenerationOneWhenTheFileHasNoBeginning) {
  rollAlways("2");
  log(u"lost");
  calls.onSeek = [](int, int origin) { return origin == SEEK_SET ? ESPIPE : 0; };
  EXPECT_EQ(logged(u"two"), failure(ESPIPE));
  calls.onSeek = nullptr;
  EXPECT_FALSE(dir.has("app1.log"));
}

TEST_F(MultiProcFileHandlerTest, EmptiesTheFileAlsoWhenTheCopyCannotBeWritten) {
  set("maxFileBytes", "8");
  log(u"12345678");
  const FileSizeLimit limit{5};
  EXPECT_EQ(logged(u"two"), failure(EFBIG));
  EXPECT_EQ(dir.read("app1.log"), "12345");
  EXPECT_EQ(dir.read("app.log"), "two\n");
  EXPECT_TRUE(semaphoreIsFree());
}

TEST_F(MultiProcFileHandlerTest, ClosesTheCopy) {
  rollAlways("3");
  log(u"one");
  const int before = openDescriptors();
  log(u"two");
  EXPECT_EQ(generations(), "two| one| - -");
  EXPECT_EQ(openDescriptors(), before);
}

constexpr int64_t kSecond = 1000000000;

TEST_F(MultiProcFileHandlerTest, TellsOfAFileThatCannotBeEmptiedAndWritesOn) {
  const TestClock clock;
  set("maxFileBytes", "4");
  set("maxFiles", "4");
  dir.write("app2.log", "older\n");
  log(u"one");
  calls.onTruncate = [](int) { return EPERM; };
  for (int i = 0; i < 3; ++i, TestClock::tick += kSecond) {
    EXPECT_EQ(logged(u"two"), failure(EPERM));
    EXPECT_EQ(logged(u"at once"), kSuccess);  // the next try is a second later
  }
  EXPECT_FALSE(dir.has("app1.log"));  // the same records twice
  EXPECT_EQ(dir.read("app3.log"), "older\n");
  EXPECT_TRUE(semaphoreIsFree());
  calls.onTruncate = nullptr;
  EXPECT_EQ(logged(u"new"), kSuccess);
  EXPECT_EQ(generations(), "new| one|two|at once|two|at once|two|at once| - older|");
}

TEST_F(MultiProcFileHandlerTest, KeepsTheCopyOfAFileThatWasEmptiedWithoutAnAnswer) {
  rollAlways("3");
  log(u"one");
  calls.onTruncate = [](int file) {
    EXPECT_EQ(syscall(SYS_ftruncate, file, 0), 0);
    return EIO;
  };
  EXPECT_EQ(logged(u"two"), failure(EIO));
  EXPECT_EQ(generations(), "two| one| - -");
}

TEST_F(MultiProcFileHandlerTest, KeepsTheCopyWhenSomebodyAppendsToTheEmptiedFileAtOnce) {
  rollAlways("3");
  log(u"one");
  calls.onSeek = [this](int, int) {  // somebody who does not wait for the semaphore
    if (dir.read("app.log").empty()) dir.write("app.log", "foreign\n");
    return 0;
  };
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_EQ(generations(), "foreign|two| one| - -");
}

TEST_F(MultiProcFileHandlerTest, TriesInterruptedCallsAgain) {
  rollAlways("2");
  log(u"one");
  int interruptions = 3;
  calls.onTruncate = [&](int) { return interruptions-- > 0 ? EINTR : 0; };
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_EQ(generations(), "two| one| - -");
}

TEST_F(MultiProcFileHandlerTest, DoesNotMindGenerationsThatAreMissing) {
  rollAlways("9");
  log(u"one");
  EXPECT_EQ(logged(u"two"), kSuccess);
  dir.write("app5.log", "five\n");
  EXPECT_EQ(logged(u"three"), kSuccess);
  EXPECT_EQ(generations(), "three| two| one| -");
  EXPECT_EQ(dir.read("app6.log"), "five\n");
}

TEST_F(MultiProcFileHandlerTest, RollsStepByStepForItsCallers) {
  rollAlways("3");
  log(u"one");
  dir.write("app1.log", "older\n");
  qlxMultiProcFileHandlerDoRollover(vars());
  EXPECT_EQ(generations(), " one| older| -");
  log(u"two");
  qlxMultiProcFileHandlerRollActiveLog(vars());
  EXPECT_EQ(generations(), " two| older| -");
  qlxMultiProcFileHandlerDoRollover(nullptr);
  qlxMultiProcFileHandlerRollActiveLog(nullptr);
}

// ---- No descriptors left

TEST_F(MultiProcFileHandlerTest, CopiesWithTheNumberThatItHasInReserve) {
  for (const rlim_t numbers : {rlim_t{1024}, rlim_t{64}}) {  // high ones, and low ones
    Child child([&] {
      const rlimit limit{numbers, numbers};
      setrlimit(RLIMIT_NOFILE, &limit);
      rollAlways("5");
      log(u"1");
      for (const char16_t *text : {u"2", u"3", u"4"}) {
        while (::open("/dev/null", O_RDONLY | O_CLOEXEC) != -1) {
        }
        ASSERT_EQ(errno, EMFILE);
        EXPECT_EQ(logged(text), kSuccess);
      }
    });
    EXPECT_EQ(child.end(), 0);
    EXPECT_EQ(generations(), "4| 3| 2| 1|");
    for (const std::string &name : dir.list()) std::filesystem::remove(dir.path(name));
  }
}

// ---- keepFullFile: what could not be copied is not emptied

class KeepFullFileTest : public MultiProcFileHandlerTest {
 protected:
  void SetUp() override {
    MultiProcFileHandlerTest::SetUp();
    set("keepFullFile", "true");
    EXPECT_EQ(vars()->keepFullFile, 1);
  }

  const TestClock clock;
};

TEST_F(KeepFullFileTest, RollsAsEverWhenNothingFails) {
  rollAlways("3");
  for (const char16_t *text : {u"1", u"2", u"3", u"4"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(generations(), "4| 3| 2| -");
}

TEST_F(KeepFullFileTest, KeepsTheFileWhenGenerationOneCannotBeMade) {
  rollAlways("2");
  log(u"1");
  obstruct("app1.log");
  const uint64_t lost = problems().recordsLost;
  EXPECT_EQ(logged(u"2"), failure(ENOTEMPTY));
  EXPECT_EQ(logged(u"3"), kSuccess);  // told once a second
  EXPECT_EQ(dir.read("app.log"), "1\n2\n3\n");
  EXPECT_EQ(problems().recordsLost, lost);
  std::filesystem::remove_all(dir.path("app1.log"));
  TestClock::tick += kSecond;
  EXPECT_EQ(logged(u"4"), kSuccess);
  EXPECT_EQ(generations(), "4| 1|2|3| - -");
}

TEST_F(KeepFullFileTest, KeepsTheFileAndTheOlderGenerationsWhenTheCopyCannotBeWritten) {
  set("maxFileBytes", "8");
  set("maxFiles", "4");
  dir.write("app1.log", "older\n");
  dir.write("app3.log", "oldest\n");
  log(u"12345678");
  {
    const FileSizeLimit limit{5};
    for (int i = 0; i < 3; ++i) {
      EXPECT_EQ(logged(u"lost"), failure(EFBIG));
      TestClock::tick += kSecond;
    }
  }
  EXPECT_EQ(generations(), "12345678| - older| oldest|");
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_EQ(generations(), "two| 12345678| older| oldest|");
}

TEST_F(KeepFullFileTest, NeitherFollowsNorRemovesWhatTookTheNameMeanwhile) {
  rollAlways("3");
  dir.write("precious", "untouched\n");
  log(u"1");
  const std::string first = dir.path("app1.log");
  calls.afterLook = [&](const char *path) {
    if (std::filesystem::path(path).lexically_normal() != first) return;
    if (access(path, F_OK) == 0) return;
    std::filesystem::create_symlink(dir.path("precious"), first);
  };
  EXPECT_EQ(logged(u"2"), failure(EEXIST));
  EXPECT_EQ(dir.read("precious"), "untouched\n");
  EXPECT_TRUE(std::filesystem::is_symlink(first));
  EXPECT_EQ(dir.read("app.log"), "1\n2\n");
}

TEST_F(KeepFullFileTest, IsOffWithoutAValue) {
  set("keepFullFile", "true");
  changeAbsent("keepFullFile");
  EXPECT_EQ(vars()->keepFullFile, 0);
  set("keepFullFile", "maybe");
  EXPECT_EQ(vars()->keepFullFile, 0);
}

// ---- A full disk, and no memory

TEST_F(MultiProcFileHandlerTest, TellsOfARecordThatCannotBeWrittenAndForwardsIt) {
  forward();
  log(u"12345");
  const FileSizeLimit limit{8};
  EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  EXPECT_EQ(dir.read("app.log"), "12345\n");  // the piece that was written is cut off again
  EXPECT_RECORDED(u"12345|67890|");
  EXPECT_TRUE(semaphoreIsFree());
}

constexpr size_t kDiskBytes = 32768;

// A small disk of this process alone, in the test's own folder.
bool mountSmallDisk(const std::string &place) {
  const std::string size = "size=" + std::to_string(kDiskBytes);
  return unshare(CLONE_NEWNS) == 0 &&
         mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
         mount("none", place.c_str(), "tmpfs", 0, size.c_str()) == 0;
}

TEST_F(MultiProcFileHandlerTest, EmptiesTheFileAlsoWhenTheDiskIsTooFullForTheCopy) {
  constexpr int kNoDisk = 77;
  std::filesystem::create_directory(dir.path("disk"));
  set("fileName", dir.path("disk/app.log"));
  Child other([this] {
    if (!mountSmallDisk(dir.path("disk"))) _exit(kNoDisk);
    set("maxFileBytes", std::to_string(kDiskBytes * 2));
    const std::u16string line(999, u'x');
    size_t whole = 0;
    while (logged(line.c_str()) == kSuccess) ++whole;
    EXPECT_EQ(whole, kDiskBytes / 1000);
    EXPECT_EQ(logged(u"1234567"), kSuccess);
    EXPECT_EQ(logged(line.c_str()), failure(ENOSPC));
    EXPECT_EQ(dir.read("disk/app.log").size(), whole * 1000 + 8);
    EXPECT_TRUE(semaphoreIsFree());

    rollAlways("2");
    set("keepFullFile", "true");  // not even begun
    const uint64_t told = problems().rolloversFailed;
    EXPECT_EQ(logged(u"kept"), failure(ENOSPC));
    EXPECT_EQ(problems().rolloversFailed, told + 1);
    EXPECT_FALSE(dir.has("disk/app1.log"));
    EXPECT_EQ(dir.read("disk/app.log").size(), whole * 1000 + 8 + 5);
    set("keepFullFile", "false");
    vars()->rollFailed = 0;
    EXPECT_EQ(logged(u"next"), failure(ENOSPC));
    EXPECT_EQ(dir.read("disk/app1.log"), "");
    EXPECT_EQ(dir.read("disk/app.log"), "next\n");
    EXPECT_EQ(logged(u"last"), kSuccess);
    EXPECT_EQ(dir.read("disk/app1.log"), "next\n");
  });
  const int end = other.end();
  if (end == kNoDisk) GTEST_SKIP() << "this process may not mount a disk of its own";
  EXPECT_EQ(end, 0);
}

TEST_F(MultiProcFileHandlerTest, SurvivesEveryFailedAllocationOfAnEvent) {
  rollAlways("3");
  log(u"first");
  const std::u16string texts[] = {u"short", std::u16string(3000, u'x')};
  for (const std::u16string &text : texts) {
    for (uint64_t nth = 1, failures = 1; failures > 0; ++nth) {
      const CaptureStdout silence;
      FailingMemory memory;
      memory.failOnce(nth);
      log(text.c_str());
      failures = memory.failures();
      EXPECT_TRUE(semaphoreIsFree());
    }
    EXPECT_EQ(logged(text.c_str()), kSuccess);
    EXPECT_EQ(dir.read("app.log"), std::string(text.begin(), text.end()) + "\n");
  }
}

TEST_F(MultiProcFileHandlerTest, RollsWithoutMemoryForNames) {
  rollAlways("3");
  log(u"one");
  qlxMultiProcFileHandlerDoRollover(vars());
  log(u"two");
  FailingMemory memory;
  memory.failFrom(1);
  qlxMultiProcFileHandlerDoRollover(vars());
  EXPECT_EQ(generations(), " two| one| -");
}

}  // namespace
