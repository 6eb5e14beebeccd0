#include "support/MultiProcFileHandlerTest.h"

namespace {

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
  changeAbsent("fileName");
  EXPECT_EQ(vars()->fullName, nullptr);
  open();
  EXPECT_EQ(logged(u"one"), kSuccess);
  EXPECT_EQ(vars()->opened, 0);
  EXPECT_EQ(key.set(), -1);
  EXPECT_RECORDED(u"");
}

TEST_F(MultiProcFileHandlerTest, TellsOfANameThatIsTooLong) {
  forward();
  set("fileName", std::string(300, 'x'));
  EXPECT_EQ(logged(u"one"), failure(ENAMETOOLONG));
  EXPECT_EQ(key.set(), -1);
  EXPECT_RECORDED(u"");
  const ApiLock lock;
  EXPECT_EQ(QlxMultiProcFileHandlerFOpenWithErr(handler.get()), failure(ENAMETOOLONG));
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

}  // namespace
