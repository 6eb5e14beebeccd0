#include "QlxMultiProcFileHandler.h"

#include <fcntl.h>
#include <sched.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include "support/CaptureStdout.h"
#include "support/Child.h"
#include "support/FailingMemory.h"
#include "support/FileHandlerFixture.h"
#include "support/FileSizeLimit.h"
#include "support/SemaphoreKey.h"
#include "support/SystemCalls.h"
#include "support/WorkingDir.h"

namespace {

constexpr const char *kClass = "qlx_multiproc_filehandler";

class MultiProcFileHandlerTest : public FileHandlerFixture {
 protected:
  MultiProcFileHandlerTest() : FileHandlerFixture(kClass) {}

  void SetUp() override {
    FileHandlerFixture::SetUp();
    set("MPFileSemKey", key.text());
  }

  void open() {
    const ApiLock lock;
    EXPECT_EQ(QlxMultiProcFileHandlerFOpenWithErr(handler.get()), kSuccess);
  }
  void close() {
    const ApiLock lock;
    QlxMultiProcFileHandlerFClose(handler.get());
  }

  // Rolls over whatever the active file holds, into so many generations.
  void rollAlways(const char *maxFiles) {
    set("maxFileBytes", "1");
    set("maxFiles", maxFiles);
  }

  // Something that is in the way of a generation: neither removed nor opened nor replaced.
  void obstruct(const std::string &name) {
    std::filesystem::create_directory(dir.path(name));
    dir.write(name + "/inside", "");
  }

  ino_t activeInode() {
    struct stat info = {};
    EXPECT_EQ(stat(dir.path("app.log").c_str(), &info), 0);
    return info.st_ino;
  }

  // Puts something else behind the descriptor of the open active file.
  void replaceDescriptor(int with) {
    ASSERT_NE(with, -1);
    ASSERT_EQ(dup2(with, vars()->file), vars()->file);
    ::close(with);
  }

  bool semaphoreIsFree() { return key.value() == 1; }

  SemaphoreKey key;
  SystemCalls calls;
};

bool isLock(const sembuf &operation) {
  return operation.sem_op == -1;
}

// ---- Writing

TEST_F(MultiProcFileHandlerTest, AppendsEachTextAndLeavesTheSemaphoreFree) {
  EXPECT_EQ(logged(u"first"), kSuccess);
  EXPECT_EQ(logged(u"second"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "first\nsecond\n");
  EXPECT_EQ(vars()->semId, key.set());
  EXPECT_TRUE(semaphoreIsFree());
}

TEST_F(MultiProcFileHandlerTest, WritesTextsOfAnyLength) {
  const std::u16string longest(3000, u'x');
  EXPECT_EQ(logged(longest.c_str()), kSuccess);
  EXPECT_EQ(dir.read("app.log"), std::string(3000, 'x') + "\n");
}

TEST_F(MultiProcFileHandlerTest, ChecksRollsAndWritesWhileItHoldsTheSemaphore) {
  rollAlways("2");
  log(u"first");
  std::string seen;
  calls.onOperate = [&](const sembuf &operation, size_t) {
    seen += (isLock(operation) ? "lock: " : "unlock: ") + generations() + "\n";
    return 0;
  };
  log(u"second");
  EXPECT_EQ(seen, "lock: first| - - -\nunlock: second| first| - -\n");
}

TEST_F(MultiProcFileHandlerTest, OpensAndFormatsBeforeTheLock) {
  int formatted = -1;
  bool opened = false;
  calls.onOperate = [&](const sembuf &operation, size_t) {
    if (isLock(operation)) formatted = formatter->formatted;
    if (isLock(operation)) opened = dir.has("app.log");
    return 0;
  };
  log(u"one");
  EXPECT_EQ(formatted, 1);
  EXPECT_TRUE(opened);
}

TEST_F(MultiProcFileHandlerTest, LocksNothingForATextOfNullAndForwardsAllTheSame) {
  forward();
  formatter->silent = true;
  int operations = 0;
  calls.onOperate = [&](const sembuf &, size_t) { return ++operations, 0; };
  EXPECT_EQ(logged(u"one"), kSuccess);
  EXPECT_EQ(operations, 0);
  EXPECT_EQ(dir.read("app.log"), "");
  EXPECT_RECORDED(u"one|");
}

TEST_F(MultiProcFileHandlerTest, DoesNothingWhileItIsDisabled) {
  forward();
  QlxSetObjectEnabled(handler.get(), 0);
  log(u"one");
  EXPECT_FALSE(dir.has("app.log"));
  EXPECT_EQ(key.set(), -1);
  EXPECT_RECORDED(u"");
}

TEST_F(MultiProcFileHandlerTest, ForwardsTheEventAfterItIsWrittenAndUnlocked) {
  forward();
  recorder->alsoDo = [this](Event *) {
    EXPECT_EQ(dir.read("app.log"), "one\n");
    EXPECT_TRUE(semaphoreIsFree());
  };
  log(u"one");
  EXPECT_RECORDED(u"one|");
}

TEST_F(MultiProcFileHandlerTest, AppendsWhateverAppendingSays) {
  dir.write("app.log", "old\n");
  set("appending", "false");
  log(u"one");
  close();
  log(u"two");
  set("maxFiles", "4");  // closes too
  log(u"three");
  EXPECT_EQ(dir.read("app.log"), "old\none\ntwo\nthree\n");
}

TEST_F(MultiProcFileHandlerTest, MeasuresTheWholeFileWhateverAppendingSays) {
  set("appending", "false");
  set("maxFileBytes", "8");
  for (const char16_t *text : {u"1234", u"5678", u"90"}) log(text);
  EXPECT_EQ(generations(), "90| 1234|5678| - -");
}

TEST_F(MultiProcFileHandlerTest, MakesDirectoryFileAndGenerationsWithTheirPermissions) {
  const mode_t before = umask(0);
  set("fileName", dir.path("a/b/app.log"));
  set("filePermission", "640");
  set("dirPermission", "710");
  rollAlways("2");
  log(u"one");
  log(u"two");
  umask(before);
  struct stat info = {};
  for (const char *name : {"a/b/app.log", "a/b/app1.log"}) {
    ASSERT_EQ(stat(dir.path(name).c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 07777, 0640u) << name;
  }
  ASSERT_EQ(stat(dir.path("a/b").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 07777, 0710u);
}

TEST_F(MultiProcFileHandlerTest, TriesToOpenAlsoWhenTheDirectoryCannotBeMade) {
  std::string deep = dir.path();  // a working directory of more than 256 bytes is none for a name
  for (int i = 0; i < 4; ++i) deep += "/" + std::string(80, 'd');
  std::filesystem::create_directories(deep);
  const WorkingDir here{deep};
  set("fileName", "app.log");
  EXPECT_EQ(vars()->dirPart, nullptr);
  EXPECT_EQ(logged(u"one"), kSuccess);
  EXPECT_EQ(dir.read(deep.substr(dir.path().size() + 1) + "/app.log"), "one\n");
}

TEST_F(MultiProcFileHandlerTest, KeepsItsDescriptorFromOtherPrograms) {
  log(u"one");
  EXPECT_EQ(fcntl(vars()->file, F_GETFD), FD_CLOEXEC);
  EXPECT_EQ(fcntl(vars()->file, F_GETFL) & (O_ACCMODE | O_APPEND), O_RDWR | O_APPEND);
}

// ---- Header, trailer, opening, closing

TEST_F(MultiProcFileHandlerTest, WritesHeaderAndTrailerNeitherOpeningNorClosingNorRolling) {
  formatter->header = "head\n";
  formatter->trailer = "tail\n";
  log(u"one");
  close();
  rollAlways("2");
  log(u"two");
  log(u"three");
  close();
  EXPECT_EQ(generations(), "three| two| - -");
  EXPECT_EQ(formatter->trailersAsked, 0);
}

TEST_F(MultiProcFileHandlerTest, WritesTheTrailerWhenAChangedSettingClosesTheFile) {
  formatter->header = "head\n";
  formatter->trailer = "tail\n";
  log(u"one");
  set("maxFiles", "5");
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_EQ(dir.read("app.log"), "one\ntail\n");
  log(u"two");
  EXPECT_EQ(dir.read("app.log"), "one\ntail\ntwo\n");
}

TEST_F(MultiProcFileHandlerTest, ClosesTheFileWithoutATrailerWhenItIsReleased) {
  formatter->trailer = "tail\n";
  log(u"one");
  const CxFile file = vars()->file;
  QlxRemListener(logger.get(), handler.get());
  handler.reset();
  QlxCloseToolkit();
  EXPECT_EQ(fcntl(file, F_GETFD), -1);
  EXPECT_EQ(dir.read("app.log"), "one\n");
  QlxOpenToolkit(nullptr, nullptr);
}

TEST_F(MultiProcFileHandlerTest, ClosesOnce) {
  open();
  const CxFile file = vars()->file;
  close();
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_EQ(vars()->file, -1);
  EXPECT_EQ(fcntl(file, F_GETFD), -1);
  close();
  EXPECT_EQ(vars()->opened, 0);
}

TEST_F(MultiProcFileHandlerTest, OpensWithoutLookingAtTheSize) {
  rollAlways("2");
  dir.write("app.log", "full\n");
  open();
  EXPECT_EQ(vars()->opened, 1);
  EXPECT_EQ(generations(), "full| - - -");
  log(u"one");
  EXPECT_EQ(generations(), "one| full| - -");
}

TEST_F(MultiProcFileHandlerTest, KeepsTheOpenFileAtTheNextOpening) {
  open();
  const CxFile file = vars()->file;
  open();
  EXPECT_EQ(vars()->file, file);
}

TEST_F(MultiProcFileHandlerTest, HasNothingToOpenWithoutAName) {
  forward();
  set("fileName", std::string(300, 'x'));
  EXPECT_EQ(vars()->fullName, nullptr);
  open();
  EXPECT_EQ(logged(u"one"), kSuccess);
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_EQ(key.set(), -1);
  EXPECT_RECORDED(u"");
}

TEST_F(MultiProcFileHandlerTest, DropsTheEventForItsListenersTooWhenTheFileCannotBeOpened) {
  forward();
  std::filesystem::create_directory(dir.path("app.log"));
  EXPECT_EQ(logged(u"one"), failure(EISDIR));
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_EQ(formatter->formatted, 0);
  EXPECT_RECORDED(u"");
  const ApiLock lock;
  EXPECT_EQ(QlxMultiProcFileHandlerFOpenWithErr(handler.get()), failure(EISDIR));
}

TEST_F(MultiProcFileHandlerTest, TriesAgainAtTheNextEventAfterAFailedOpen) {
  std::filesystem::create_directory(dir.path("app.log"));
  EXPECT_EQ(logged(u"one"), failure(EISDIR));
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "two\n");
}

// ---- The semaphore

TEST_F(MultiProcFileHandlerTest, SetsTheSemaphoreUpOnceAtItsFirstOpening) {
  int asked = 0;
  calls.onGet = [&](key_t, int) { return ++asked, 0; };
  set("maxFiles", "4");
  EXPECT_EQ(vars()->semReady, 0);
  EXPECT_EQ(key.set(), -1);
  log(u"one");
  close();
  log(u"two");
  EXPECT_EQ(vars()->semReady, 1);
  EXPECT_EQ(asked, 1);
}

TEST_F(MultiProcFileHandlerTest, SetsTheSemaphoreUpBeforeItMakesTheFile) {
  bool there = true;
  calls.onGet = [&](key_t, int) { return there = dir.has("app.log"), 0; };
  log(u"one");
  EXPECT_FALSE(there);
}

TEST_F(MultiProcFileHandlerTest, KeepsItsSetWhenTheKeyChanges) {
  log(u"one");
  const int set_ = vars()->semId;
  const SemaphoreKey other;
  set("MPFileSemKey", other.text());
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_EQ(vars()->semKey, other.number());
  EXPECT_EQ(vars()->semId, set_);
  EXPECT_EQ(other.set(), -1);
  const Handle fresh = attach("fresh", kClass);
  format(fresh);
  QlxSetObjProp(fresh.get(), "fileName", dir.path("fresh.log").c_str());
  QlxSetObjProp(fresh.get(), "MPFileSemKey", other.text().c_str());
  EXPECT_EQ(logged(u"three"), kSuccess);
  EXPECT_EQ(qlxFileHandlerVars(fresh.get())->semId, other.set());
}

TEST_F(MultiProcFileHandlerTest, DropsTheEventForItsListenersTooWithoutASemaphore) {
  forward();
  calls.onGet = [](key_t, int) { return ENOSPC; };
  EXPECT_EQ(logged(u"one"), failure(ENOSPC));
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_EQ(formatter->formatted, 0);
  EXPECT_FALSE(dir.has("app.log"));
  EXPECT_RECORDED(u"");
}

TEST_F(MultiProcFileHandlerTest, CallsAnOpeningWithoutASemaphoreASuccess) {
  calls.onGet = [](key_t, int) { return EACCES; };
  open();
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_FALSE(dir.has("app.log"));
}

TEST_F(MultiProcFileHandlerTest, TriesAgainAtTheNextEventAfterAFailedSetUp) {
  calls.onControl = [](int) { return EPERM; };
  EXPECT_EQ(logged(u"one"), failure(EPERM));
  calls.onControl = nullptr;
  key.remove();
  EXPECT_EQ(logged(u"two"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "two\n");
}

TEST_F(MultiProcFileHandlerTest, DropsTheRecordButForwardsItWhenTheLockFails) {
  forward();
  log(u"one");
  calls.onOperate = [](const sembuf &operation, size_t) { return isLock(operation) ? ENOMEM : 0; };
  rollAlways("2");
  EXPECT_EQ(logged(u"two"), failure(ENOMEM));
  EXPECT_EQ(generations(), "one| - - -");
  EXPECT_RECORDED(u"one|two|");
  EXPECT_EQ(recorder->records[1].status, failure(ENOMEM));
  calls.onOperate = nullptr;
  EXPECT_EQ(logged(u"three"), kSuccess);
}

TEST_F(MultiProcFileHandlerTest, DoesNotUnlockWhatItCouldNotLock) {
  log(u"one");
  int operations = 0;
  calls.onOperate = [&](const sembuf &, size_t) { return ++operations, EACCES; };
  EXPECT_EQ(logged(u"two"), failure(EACCES));
  EXPECT_EQ(operations, 2);  // an eager attempt and the waiting one
}

TEST_F(MultiProcFileHandlerTest, WritesWithoutTheSemaphoreAfterElevenInterruptions) {
  log(u"one");
  for (const int error : {EINTR, ENOSPC}) {
    calls.slept.clear();
    calls.onOperate = [&](const sembuf &op, size_t) { return isLock(op) ? error : 0; };
    EXPECT_EQ(logged(u"more"), kSuccess);
    EXPECT_EQ(calls.slept, std::vector<unsigned>(11, 1));
    EXPECT_TRUE(semaphoreIsFree());
  }
  EXPECT_EQ(dir.read("app.log"), "one\nmore\nmore\n");
}

TEST_F(MultiProcFileHandlerTest, DropsRecordsForGoodWhenItsSetIsRemoved) {
  forward();
  log(u"one");
  key.remove();
  EXPECT_EQ(logged(u"two"), failure(EINVAL));
  const SemaphoreKey other;
  set("MPFileSemKey", other.text());
  EXPECT_EQ(logged(u"three"), failure(EINVAL));
  EXPECT_EQ(dir.read("app.log"), "one\n");
  EXPECT_EQ(key.set(), -1);
  EXPECT_RECORDED(u"one|two|three|");

  const Handle fresh = attach("fresh", kClass);
  format(fresh);
  QlxSetObjProp(fresh.get(), "fileName", dir.path("app.log").c_str());
  QlxSetObjProp(fresh.get(), "MPFileSemKey", key.text().c_str());
  log(u"four");
  EXPECT_EQ(dir.read("app.log"), "one\nfour\n");
}

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

TEST_F(MultiProcFileHandlerTest, WritesOverAGenerationOneThatCouldNotBeMovedWithoutTruncatingIt) {
  rollAlways("3");
  log(u"new");
  dir.write("app1.log", "longer\n");
  obstruct("app2.log");
  EXPECT_EQ(logged(u"last"), failure(EISDIR));
  EXPECT_EQ(dir.read("app1.log"), "new\ner\n");
  EXPECT_EQ(dir.read("app.log"), "last\n");
}

TEST_F(MultiProcFileHandlerTest, EmptiesTheFileAlsoWhenItCannotBeRead) {
  rollAlways("2");
  log(u"lost");
  replaceDescriptor(::open(dir.path("app.log").c_str(), O_WRONLY | O_APPEND));
  EXPECT_EQ(logged(u"two"), failure(EBADF));
  EXPECT_EQ(generations(), "two|  - -");
}

TEST_F(MultiProcFileHandlerTest, DoesNotOpenGenerationOneWhenTheFileHasNoBeginning) {
  set("maxFileBytes", "0");
  open();
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  replaceDescriptor(ends[1]);
  EXPECT_EQ(logged(u"two"), failure(ESPIPE));
  EXPECT_EQ(generations(), " - - -");
  char bytes[8] = {};
  EXPECT_EQ(read(ends[0], bytes, sizeof bytes), 4);
  EXPECT_STREQ(bytes, "two\n");
  ::close(ends[0]);
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

TEST_F(MultiProcFileHandlerTest, TellsOfACopyThatMayNotHaveReachedTheDisk) {
  rollAlways("3");
  log(u"one");
  obstruct("app2.log");  // generation 1 stays in its place
  std::filesystem::create_symlink("/dev/null", dir.path("app1.log"));
  EXPECT_EQ(logged(u"two"), failure(EINVAL));  // what the null device answers a flush
  EXPECT_EQ(dir.read("app.log"), "two\n");
}

TEST_F(MultiProcFileHandlerTest, ClosesTheCopy) {
  const auto descriptors = [] {
    const std::filesystem::directory_iterator all("/proc/self/fd");
    return std::distance(begin(all), end(all));
  };
  rollAlways("3");
  log(u"one");
  const auto before = descriptors();
  log(u"two");
  EXPECT_EQ(generations(), "two| one| - -");
  EXPECT_EQ(descriptors(), before);
}

TEST_F(MultiProcFileHandlerTest, TellsOfAFileThatCannotBeEmptiedAndWritesOn) {
  rollAlways("2");
  open();
  const int sealed = memfd_create("sealed", MFD_ALLOW_SEALING);
  ASSERT_EQ(fcntl(sealed, F_SETFL, O_APPEND), 0);
  ASSERT_EQ(fcntl(sealed, F_ADD_SEALS, F_SEAL_SHRINK), 0);
  replaceDescriptor(sealed);
  log(u"one");
  EXPECT_EQ(logged(u"two"), failure(EPERM));
  EXPECT_EQ(dir.read("app1.log"), "one\n");
  char bytes[16] = {};
  EXPECT_EQ(pread(vars()->file, bytes, sizeof bytes, 0), 8);
  EXPECT_STREQ(bytes, "one\ntwo\n");
  EXPECT_TRUE(semaphoreIsFree());
}

TEST_F(MultiProcFileHandlerTest, TellsOfAFileThatCannotBeMeasuredAndWritesNowhere) {
  forward();
  log(u"one");
  ::close(vars()->file);
  EXPECT_EQ(logged(u"two"), failure(EBADF));
  EXPECT_RECORDED(u"one|two|");
  EXPECT_TRUE(semaphoreIsFree());
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

// ---- A full disk, and no memory

TEST_F(MultiProcFileHandlerTest, TellsOfARecordThatCannotBeWrittenAndForwardsIt) {
  forward();
  log(u"12345");
  const FileSizeLimit limit{8};
  EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  EXPECT_EQ(dir.read("app.log"), "12345\n67");
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
    EXPECT_EQ(logged(u"1234567"), failure(ENOSPC));
    EXPECT_EQ(dir.read("disk/app.log").size(), kDiskBytes);
    EXPECT_TRUE(semaphoreIsFree());

    rollAlways("2");
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

TEST_F(MultiProcFileHandlerTest, TellsOfARolloverWithoutMemoryForAName) {
  rollAlways("3");
  const CaptureStdout silence;
  int told = 0;
  for (uint64_t nth = 1, failures = 1; failures > 0; ++nth) {
    for (const UChar *text : {u"1", u"2", u"3"}) log(text);  // what one without memory left empty
    FailingMemory memory;
    memory.failOnce(nth);
    told += logged(u"more") == failure(ENOMEM);
    failures = memory.failures();
  }
  EXPECT_GE(told, 2);  // the names of two generations
}

}  // namespace
