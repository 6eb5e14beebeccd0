#include "QlxFileHandler.h"

#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <fcntl.h>
#include <fstream>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

#include "support/FailingMemory.h"
#include "support/FileHandlerFixture.h"
#include "support/FileSizeLimit.h"
#include "support/IcuDefaults.h"
#include "support/WorkingDir.h"

namespace {

class FileHandlerTest : public FileHandlerFixture {
 protected:
  FileHandlerTest() : FileHandlerFixture("qlx_filehandler") {}

  // Tells the handler of a key that has no value.
  void changeAbsent(const char *key) {
    const ApiLock lock;
    if (handler->props) qlxIntlStringToStringMapRem(handler->props, key);
    QlxFileHandlerFCfgChange(handler.get(), key);
  }

  void close() {
    const ApiLock lock;
    QlxFileHandlerFClose(handler.get());
  }
};

// What other programs see of a file's permissions.
uint32_t modeOf(const std::string &path) {
  struct stat info = {};
  EXPECT_EQ(stat(path.c_str(), &info), 0) << path;
  return info.st_mode & 07777;
}

class FileCreationMask {
 public:
  explicit FileCreationMask(mode_t mask) : before_(umask(mask)) {}
  ~FileCreationMask() { umask(before_); }

 private:
  mode_t before_;
};

// ---- The variables

TEST_F(FileHandlerTest, StartsWithItsInitialValues) {
  const WorkingDir here{dir.path()};
  QlxFileHandlerVars *fresh = static_cast<QlxFileHandlerVars *>(QlxFileHandlerFAllocVars());
  ASSERT_NE(fresh, nullptr);
  EXPECT_EQ(fresh->file, -1);
  EXPECT_EQ(fresh->opened, 0);
  EXPECT_EQ(fresh->size, 0u);
  EXPECT_EQ(fresh->maxBytes, 1048576);
  EXPECT_EQ(fresh->maxFiles, 3);
  EXPECT_EQ(fresh->fullName, std::filesystem::current_path().string() + "/default.log");
  EXPECT_EQ(fresh->dirPart, std::filesystem::current_path().string());
  EXPECT_STREQ(fresh->basePart, "default");
  EXPECT_STREQ(fresh->extPart, "log");
  EXPECT_EQ(fresh->generation, 0);
  EXPECT_EQ(fresh->encoding, nullptr);
  EXPECT_EQ(fresh->filePermission, 0744u);
  EXPECT_EQ(fresh->dirPermission, 0771u);
  EXPECT_EQ(fresh->appending, 1);
  EXPECT_EQ(fresh->semReady, 0);
  EXPECT_EQ(fresh->semKey, 31821);
  EXPECT_EQ(fresh->semId, -1);
  EXPECT_EQ(fresh->logInternalErrs, 1);
  EXPECT_FALSE(dir.has("default.log"));
  QlxFileHandlerFFreeVars(fresh);
}

TEST_F(FileHandlerTest, FreesItsVariablesWithTheOpenFileButWithoutTheTrailer) {
  formatter->trailer = "tail";
  log(u"one");
  const CxFile file = vars()->file;
  ASSERT_NE(fcntl(file, F_GETFD), -1);
  {
    const ApiLock lock;
    QlxFileHandlerFFreeVars(handler->vars);
    handler->vars = nullptr;
  }
  EXPECT_EQ(fcntl(file, F_GETFD), -1);
  EXPECT_EQ(dir.read("app.log"), "one\n");
}

TEST_F(FileHandlerTest, IsMadeCompleteOrNotAtAllWhenMemoryRunsOut) {
  FailingMemory memory;
  const int64_t before = memory.live();
  for (uint64_t nth = 1;; ++nth) {
    memory.failOnce(nth);
    void *fresh = QlxFileHandlerFAllocVars();
    if (memory.failures() == 0) {
      EXPECT_GT(nth, 4u);  // the record, three parts and the name
      ASSERT_NE(fresh, nullptr);
      QlxFileHandlerFFreeVars(fresh);
      break;
    }
    EXPECT_EQ(fresh, nullptr);
  }
  EXPECT_EQ(memory.live(), before);
}

// ---- Writing

TEST_F(FileHandlerTest, WritesEachTextAsTheFormatterMadeIt) {
  EXPECT_EQ(logged(u"first"), kSuccess);
  EXPECT_EQ(logged(u"second"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "first\nsecond\n");
}

TEST_F(FileHandlerTest, AppendsToWhatTheFileHolds) {
  dir.write("app.log", "old\n");
  log(u"new");
  EXPECT_EQ(dir.read("app.log"), "old\nnew\n");
}

TEST_F(FileHandlerTest, MakesMissingDirectories) {
  set("fileName", dir.path("a/b/app.log"));
  EXPECT_EQ(logged(u"one"), kSuccess);
  EXPECT_EQ(dir.read("a/b/app.log"), "one\n");
}

TEST_F(FileHandlerTest, TakesBackslashesForSeparators) {
  set("fileName", dir.path("a\\app.log"));
  log(u"one");
  EXPECT_EQ(dir.read("a/app.log"), "one\n");
}

TEST_F(FileHandlerTest, WritesIntoTheWorkingDirectoryWhenTheNameHasNone) {
  const WorkingDir here{dir.path()};
  set("fileName", "plain.log");
  log(u"one");
  EXPECT_EQ(dir.read("plain.log"), "one\n");
  EXPECT_EQ(vars()->fullName, std::filesystem::current_path().string() + "/plain.log");
}

TEST_F(FileHandlerTest, DoublesTheSeparatorOfANameThatHasOne) {
  EXPECT_EQ(vars()->fullName, dir.path() + "//app.log");
}

TEST_F(FileHandlerTest, TriesToOpenAlsoWhenTheDirectoryCannotBeMade) {
  std::string deep = dir.path();  // a working directory of more than 256 bytes is none for a name
  for (int i = 0; i < 4; ++i) deep += "/" + std::string(80, 'd');
  std::filesystem::create_directories(deep);
  const WorkingDir here{deep};
  set("fileName", "app.log");
  EXPECT_EQ(vars()->dirPart, nullptr);
  EXPECT_EQ(logged(u"one"), kSuccess);
  EXPECT_EQ(dir.read(deep.substr(dir.path().size() + 1) + "/app.log"), "one\n");
}

TEST_F(FileHandlerTest, WritesTextsOfAnyLength) {
  const std::u16string longest(3000, u'x');
  log(longest.c_str());
  log(std::u16string(2046, u'y').c_str());  // with its line feed the longest that needs no block
  log(std::u16string(2047, u'z').c_str());
  EXPECT_EQ(dir.read("app.log"), std::string(3000, 'x') + "\n" + std::string(2046, 'y') + "\n" +
                                     std::string(2047, 'z') + "\n");
}

TEST_F(FileHandlerTest, NarrowsInTheDefaultCodePageOfTheMoment) {
  const IcuDefaults defaults;
  std::string wanted;
  for (const char *codePage :
       {"UTF-8", "ISO-8859-1", "US-ASCII", "UTF-16BE", "ibm-1047", "UTF-8"}) {
    ucnv_setDefaultName(codePage);
    for (const char16_t *text : {u"plain", u"gr\u00fc\u00df \u20ac \U0001F600"}) {
      log(text);
      char *narrow = CxUStringDupUCharToStr((std::u16string(text) + u"\n").c_str());
      wanted += narrow;
      OslMemoryFree(narrow);
    }
  }
  ucnv_setDefaultName("UTF-8");
  EXPECT_EQ(dir.read("app.log"), wanted);
}

TEST_F(FileHandlerTest, WritesNothingForATextOfNullAndForwardsAllTheSame) {
  forward();
  formatter->silent = true;
  EXPECT_EQ(logged(u"text"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "");
  EXPECT_RECORDED(u"text|");
}

TEST_F(FileHandlerTest, WritesNothingWithoutAFormatterAndForwardsAllTheSame) {
  forward();
  QlxHandlerSetFormatter(handler.get(), nullptr);
  EXPECT_EQ(logged(u"text"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "");
  EXPECT_RECORDED(u"text|");
}

TEST_F(FileHandlerTest, ForwardsTheEventAndTheArgumentsAfterTheyAreWritten) {
  forward();
  std::string seen;
  recorder->alsoDo = [&](Event *) { seen = dir.read("app.log"); };
  QlxLogUText(logger.get(), u"{0}!", u"hello");
  EXPECT_EQ(seen, "hello!\n");
  EXPECT_RECORDED(u"hello!|");
}

TEST_F(FileHandlerTest, WritesAndForwardsNothingWhileItIsDisabled) {
  forward();
  QlxSetObjectEnabled(handler.get(), 0);
  log(u"text");
  EXPECT_FALSE(dir.has("app.log"));
  EXPECT_RECORDED(u"");
}

TEST_F(FileHandlerTest, KeepsTheSizeOfTheActiveFile) {
  formatter->header = "head\n";
  dir.write("app.log", "old\n");
  log(u"one");
  EXPECT_EQ(vars()->size, dir.read("app.log").size());
  std::ofstream(dir.path("app.log"), std::ios::app) << "foreign\n";
  log(u"two");
  EXPECT_EQ(vars()->size, dir.read("app.log").size());
  EXPECT_EQ(dir.read("app.log"), "old\nhead\none\nforeign\ntwo\n");
}

// ---- Rolling over

TEST_F(FileHandlerTest, RollsOverBeforeTheEventThatFindsTheFileFull) {
  set("maxFileBytes", "5");
  set("maxFiles", "2");
  log(u"first");  // six bytes with its line feed: the file is over the limit now
  EXPECT_EQ(generations(), "first| - - -");
  log(u"second");  // finds it so, rolls, then writes
  EXPECT_EQ(generations(), "second| first| - -");
}

TEST_F(FileHandlerTest, FillsTheFileToItsLimitAndPastItByOneRecord) {
  set("maxFileBytes", "6");
  log(u"1234");  // five bytes: not full
  log(u"a");     // seven
  log(u"b");
  EXPECT_EQ(generations(), "b| 1234|a| - -");
}

TEST_F(FileHandlerTest, IsFullAtExactlyItsLimit) {
  set("maxFileBytes", "6");
  log(u"12345");
  log(u"b");
  EXPECT_EQ(generations(), "b| 12345| - -");
}

TEST_F(FileHandlerTest, KeepsAsManyGenerationsAsItIsTold) {
  set("maxFileBytes", "1");
  set("maxFiles", "3");
  for (const char16_t *text : {u"1", u"2", u"3", u"4", u"5"}) log(text);
  EXPECT_EQ(generations(), "5| 4| 3| -");
}

TEST_F(FileHandlerTest, NeverRollsWithFewerThanTwoGenerations) {
  formatter->header = "head\n";  // shows that the file stays open, too
  set("maxFileBytes", "1");
  for (const char *count : {"1", "0", "-5"}) {
    set("maxFiles", count);
    log(u"1");
    log(u"2");
  }
  EXPECT_EQ(generations(), "head|1|2|head|1|2|head|1|2| - - -");
}

TEST_F(FileHandlerTest, NeverRollsAtANegativeLimit) {
  set("maxFileBytes", "-1");
  log(u"1");
  log(u"2");
  EXPECT_EQ(generations(), "1|2| - - -");
}

// A file larger than 32 bits count, without a byte on the disk.
TEST_F(FileHandlerTest, ComparesSizesIn64Bits) {
  const uintmax_t huge = (uintmax_t{5} << 30) + 1;
  dir.write("app.log", "");
  std::error_code refused;
  std::filesystem::resize_file(dir.path("app.log"), huge, refused);
  if (refused) GTEST_SKIP() << "no room for a sparse file: " << refused.message();
  set("maxFileBytes", "-1");
  log(u"1");
  log(u"2");
  EXPECT_EQ(std::filesystem::file_size(dir.path("app.log")), huge + 4);
  set("maxFileBytes", "2147483647");
  log(u"3");
  EXPECT_EQ(dir.read("app.log"), "3\n");
  EXPECT_EQ(std::filesystem::file_size(dir.path("app1.log")), huge + 4);
}

TEST_F(FileHandlerTest, RollsAtEveryEventWithALimitOfZero) {
  set("maxFileBytes", "0");
  set("maxFiles", "4");
  log(u"1");
  EXPECT_EQ(generations(), "1|  - -");  // the file was full as soon as it was made
  log(u"2");
  EXPECT_EQ(generations(), "2|  1| ");  // and once more for the new file
}

TEST_F(FileHandlerTest, RollsAFileThatIsFullWhenItIsOpened) {
  formatter->header = "head\n";
  formatter->trailer = "tail\n";
  dir.write("app.log", "full\n");
  set("maxFileBytes", "5");
  log(u"new");
  EXPECT_EQ(generations(), "head|new| full|tail| - -");
  EXPECT_EQ(vars()->size, dir.read("app.log").size());
}

TEST_F(FileHandlerTest, CountsWhatOtherProcessesWrite) {
  set("maxFileBytes", "10");
  log(u"own");
  std::ofstream(dir.path("app.log"), std::ios::app) << "foreign\n";
  log(u"next");
  EXPECT_EQ(generations(), "next| own|foreign| - -");
}

TEST_F(FileHandlerTest, NumbersTheGenerationsBehindAnUnderscoreWhenTheNameEndsInADigit) {
  set("fileName", dir.path("trace5.log"));
  set("maxFileBytes", "1");
  log(u"1");
  log(u"2");
  EXPECT_EQ(dir.read("trace5_.log"), "2\n");
  EXPECT_EQ(dir.read("trace5_1.log"), "1\n");
  EXPECT_FALSE(dir.has("trace5.log"));
}

TEST_F(FileHandlerTest, PutsTheUnderscoreAlsoIntoANameWithoutExtension) {
  set("fileName", dir.path("app7"));
  log(u"1");
  EXPECT_EQ(dir.read("app7_"), "1\n");
}

TEST_F(FileHandlerTest, WritesOnIntoTheFullFileWhenItCannotBeRenamed) {
  set("maxFileBytes", "1");
  set("maxFiles", "2");
  std::filesystem::create_directories(dir.path("app1.log/occupied"));
  EXPECT_EQ(logged(u"1"), kSuccess);
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "1\n2\n");
}

// ---- A look at the file before every event

TEST_F(FileHandlerTest, MakesADeletedFileAgainWithItsHeader) {
  formatter->header = "head\n";
  log(u"lost");
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"kept"), kSuccess);
  EXPECT_EQ(generations(), "head|kept| - - -");
}

TEST_F(FileHandlerTest, EndsAFileThatWasMovedAwayWithItsTrailer) {
  formatter->trailer = "tail\n";
  log(u"old");
  std::filesystem::rename(dir.path("app.log"), dir.path("moved.log"));
  log(u"new");
  EXPECT_EQ(dir.read("moved.log"), "old\ntail\n");
  EXPECT_EQ(dir.read("app.log"), "new\n");
}

TEST_F(FileHandlerTest, MakesTheDirectoryAgainToo) {
  set("fileName", dir.path("logs/app.log"));
  log(u"lost");
  std::filesystem::remove_all(dir.path("logs"));
  EXPECT_EQ(logged(u"kept"), kSuccess);
  EXPECT_EQ(dir.read("logs/app.log"), "kept\n");
}

TEST_F(FileHandlerTest, ReopensWhenSomethingElseThanAFileHasItsName) {
  log(u"old");
  std::filesystem::remove(dir.path("app.log"));
  std::filesystem::create_directory(dir.path("app.log"));
  EXPECT_EQ(logged(u"lost"), failure(EISDIR));
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"kept"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "kept\n");
}

TEST_F(FileHandlerTest, GoesOnInTheOldFileWhenAnotherRegularFileTakesItsName) {
  log(u"1");
  std::filesystem::rename(dir.path("app.log"), dir.path("old.log"));
  dir.write("app.log", "other\n");
  log(u"2");
  EXPECT_EQ(dir.read("old.log"), "1\n2\n");
  EXPECT_EQ(dir.read("app.log"), "other\n");
}

TEST_F(FileHandlerTest, ReopensWhenTheOpenFileCannotBeMeasured) {
  formatter->header = "head\n";
  formatter->trailer = "tail\n";
  for (const char *appending : {"true", "false"}) {
    set("appending", appending);
    log(u"1");
    ASSERT_EQ(::close(vars()->file), 0);  // as a host does that becomes a daemon
    EXPECT_EQ(logged(u"2"), kSuccess);
    const std::string all = dir.read("app.log");
    EXPECT_EQ(all.substr(all.rfind("head")), "head\n2\n");
  }
}

// ---- Opening and closing

TEST_F(FileHandlerTest, WritesTheHeaderAtEveryOpening) {
  formatter->header = "head\n";
  dir.write("app.log", "old\n");
  log(u"1");
  log(u"2");
  close();
  log(u"3");
  EXPECT_EQ(generations(), "old|head|1|2|head|3| - - -");
}

TEST_F(FileHandlerTest, WritesTheTrailerAtEveryClosing) {
  formatter->trailer = "tail\n";
  close();
  EXPECT_FALSE(dir.has("app.log"));
  log(u"1");
  close();
  close();
  EXPECT_EQ(formatter->trailersAsked, 1);
  log(u"2");
  QlxRemListener(logger.get(), handler.get());
  handler.reset();
  EXPECT_EQ(dir.read("app.log"), "1\ntail\n2\ntail\n");
}

TEST_F(FileHandlerTest, WritesTheTrailerIntoTheFullFile) {
  formatter->trailer = "tail\n";
  set("maxFileBytes", "1");
  log(u"1");
  log(u"2");
  EXPECT_EQ(generations(), "2| 1|tail| - -");
}

TEST_F(FileHandlerTest, OpensBeforeTheFirstEventWhenAsked) {
  formatter->header = "head\n";
  {
    const ApiLock lock;
    EXPECT_EQ(QlxFileHandlerFOpenWithErr(handler.get()), kSuccess);
    QlxFileHandlerFOpen(handler.get());
  }
  EXPECT_EQ(vars()->opened, 1);
  log(u"1");
  EXPECT_EQ(generations(), "head|1| - - -");
}

TEST_F(FileHandlerTest, EmptiesTheFileAtEveryOpeningWhenItDoesNotAppend) {
  dir.write("app.log", "old\n");
  set("appending", "false");
  log(u"1");
  log(u"2");
  EXPECT_EQ(generations(), "1|2| - - -");
  set("maxFiles", "4");  // any change reopens
  log(u"3");
  EXPECT_EQ(generations(), "3| - - -");
}

TEST_F(FileHandlerTest, RollsOverAlsoWhenItDoesNotAppend) {
  set("appending", "false");
  set("maxFileBytes", "1");
  log(u"1");
  log(u"2");
  EXPECT_EQ(generations(), "2| 1| - -");
}

TEST_F(FileHandlerTest, WritesOnAtItsOwnPlaceWhenItDoesNotAppend) {
  set("appending", "false");
  log(u"1");
  std::ofstream(dir.path("app.log"), std::ios::app) << "foreign\n";
  log(u"2");
  EXPECT_EQ(dir.read("app.log"), "1\n2\nreign\n");
}

TEST_F(FileHandlerTest, KeepsItsDescriptorFromOtherPrograms) {
  log(u"1");
  EXPECT_EQ(fcntl(vars()->file, F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
}

// ---- Failures

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
  EXPECT_EQ(logged(u"lost"), kSuccess);
}

TEST_F(FileHandlerTest, ContinuesAShortWriteAndStoresItsFailure) {
  forward();
  log(u"12345");
  const FileSizeLimit limit{8};
  EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  EXPECT_EQ(dir.read("app.log"), "12345\n67");
  EXPECT_EQ(vars()->size, 8u);
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
  const std::u16string texts[] = {u"short", std::u16string(3000, u'x')};
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
  log(std::u16string(3000, u'x').c_str());
  const uint64_t all = memory.attempts();
  std::vector<CxStatus> failed;
  for (uint64_t nth = 1; nth <= all; ++nth) {
    memory.failOnce(nth);
    if (const CxStatus status = logged(std::u16string(3000, u'x').c_str()); status.kind == 'p') {
      failed.push_back(status);
    }
  }
  ASSERT_EQ(failed.size(), 1u);
  EXPECT_EQ(failed[0], failure(ENOMEM));
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

// ---- Configuration

TEST_F(FileHandlerTest, SetsTheLimitInBytesByEitherKey) {
  set("maxFileSize", "4096");
  EXPECT_EQ(vars()->maxBytes, 4096);
  set("maxFileBytes", "10");
  EXPECT_EQ(vars()->maxBytes, 10);
}

TEST_F(FileHandlerTest, TakesDefaultsForKeysWithoutAReadableValue) {
  for (const char *key : {"maxFileSize", "maxFileBytes"}) {
    set(key, "77");
    changeAbsent(key);
    EXPECT_EQ(vars()->maxBytes, 1024) << key;
    set(key, "77");
    set(key, "many");
    EXPECT_EQ(vars()->maxBytes, 1024) << key;
  }
  set("maxFiles", "77");
  changeAbsent("maxFiles");
  EXPECT_EQ(vars()->maxFiles, 3);
  set("maxFiles", "77");
  set("maxFiles", "many");
  EXPECT_EQ(vars()->maxFiles, 3);
  set("appending", "false");
  EXPECT_EQ(vars()->appending, 0);
  changeAbsent("appending");
  EXPECT_EQ(vars()->appending, 1);
  set("appending", "false");
  set("appending", "yes");
  EXPECT_EQ(vars()->appending, 1);
}

TEST_F(FileHandlerTest, TakesZeroForASemaphoreKeyWithoutAValue) {
  set("MPFileSemKey", "4711");
  EXPECT_EQ(vars()->semKey, 4711);
  changeAbsent("MPFileSemKey");
  EXPECT_EQ(vars()->semKey, 0);
  set("MPFileSemKey", "4711");
  set("MPFileSemKey", "none");
  EXPECT_EQ(vars()->semKey, 0);
}

TEST_F(FileHandlerTest, ReadsAppendingForLogInternalErrs) {
  set("logInternalErrs", "false");
  EXPECT_EQ(vars()->logInternalErrs, 1);  // "appending" is absent
  set("appending", "false");
  EXPECT_EQ(vars()->logInternalErrs, 1);
  set("logInternalErrs", "true");
  EXPECT_EQ(vars()->logInternalErrs, 0);
}

TEST_F(FileHandlerTest, KeepsTheEncodingWithoutUsingIt) {
  const IcuDefaults defaults;
  ucnv_setDefaultName("UTF-8");
  set("fileEncoding", "UTF-16BE");
  EXPECT_STREQ(vars()->encoding, "UTF-16BE");
  log(u"\u00fc");
  EXPECT_EQ(dir.read("app.log"), "\xc3\xbc\n");
  changeAbsent("fileEncoding");
  EXPECT_EQ(vars()->encoding, nullptr);
}

struct PermissionCase {
  const char *text;
  uint32_t mode;  // 0123 is what was there before
};

class Permission : public FileHandlerTest, public ::testing::WithParamInterface<PermissionCase> {};

TEST_P(Permission, IsReadAsUpToFourOctalDigits) {
  vars()->filePermission = vars()->dirPermission = 0123;
  set("filePermission", GetParam().text);
  set("dirPermission", GetParam().text);
  EXPECT_EQ(vars()->filePermission, GetParam().mode);
  EXPECT_EQ(vars()->dirPermission, GetParam().mode);
}

INSTANTIATE_TEST_SUITE_P(Texts, Permission,
                         ::testing::Values(PermissionCase{"644", 0644},
                                           PermissionCase{"0600", 0600}, PermissionCase{"rw", 0123},
                                           PermissionCase{"12345", 01234},
                                           PermissionCase{" \t755", 0755}, PermissionCase{"", 0123},
                                           PermissionCase{"9", 0123}, PermissionCase{"68", 06},
                                           PermissionCase{"00644", 064}, PermissionCase{"7z", 07}));

TEST_F(FileHandlerTest, KeepsItsPermissionsWithoutAText) {
  qlxFileHandlerCfgPerms(handler.get(), nullptr);
  qlxFileHandlerCfgDirPerms(handler.get(), nullptr);
  EXPECT_EQ(vars()->filePermission, 0744u);
  EXPECT_EQ(vars()->dirPermission, 0771u);
}

TEST_F(FileHandlerTest, MakesFilesLessTheMaskAndDirectoriesPastIt) {
  const FileCreationMask mask{027};
  set("filePermission", "666");
  set("dirPermission", "777");
  set("fileName", dir.path("new/app.log"));
  log(u"1");
  EXPECT_EQ(modeOf(dir.path("new/app.log")), 0640u);
  EXPECT_EQ(modeOf(dir.path("new")), 0777u);
}

// Every setting takes effect by opening the file again; two leave it open.
TEST_F(FileHandlerTest, ClosesForEveryKeyButTwo) {
  formatter->trailer = "tail";
  const char *const keys[] = {"fileName",     "maxFileSize",  "maxFileBytes",   "maxFiles",
                              "appending",    "fileEncoding", "filePermission", "dirPermission",
                              "MPFileSemKey", "logging",      "listenerNames",  "formatterName",
                              "description",  "unknown",      "FileName"};
  for (const char *key : keys) {
    set("fileName", dir.path("app.log"));
    log(u"1");
    ASSERT_EQ(vars()->opened, 1) << key;
    QlxSetObjProp(handler.get(), key, "plain");
    EXPECT_EQ(vars()->opened, 0) << key;
    EXPECT_EQ(vars()->file, -1) << key;
  }
}

TEST_F(FileHandlerTest, StaysOpenForLogInternalErrsAndForPermissionsWithoutValue) {
  log(u"1");
  set("logInternalErrs", "true");
  EXPECT_EQ(vars()->opened, 1);
  changeAbsent("logInternalErrs");
  changeAbsent("filePermission");
  changeAbsent("dirPermission");
  EXPECT_EQ(vars()->opened, 1);
}

TEST_F(FileHandlerTest, ClosesWithTheOldFormattersTrailerWhenItGetsAnother) {
  formatter->trailer = "tail\n";
  log(u"1");
  set("formatterName", "nobody");
  EXPECT_EQ(dir.read("app.log"), "1\ntail\n");
  EXPECT_EQ(QlxHandlerGetFormatter(handler.get()), nullptr);
}

TEST_F(FileHandlerTest, GoesOnUnderItsNewName) {
  log(u"1");
  set("fileName", dir.path("other.log"));
  log(u"2");
  EXPECT_EQ(dir.read("app.log"), "1\n");
  EXPECT_EQ(dir.read("other.log"), "2\n");
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
  const CxStatus status =
      qlxFileHandlerWrite(&vars, bytes.data(), static_cast<uint32_t>(bytes.size()));
  ::close(ends[1]);
  reader.join();
  ::close(ends[0]);
  sigaction(SIGUSR1, &before, nullptr);
  EXPECT_EQ(status, kSuccess);
  EXPECT_EQ(received, bytes);
  EXPECT_EQ(vars.size, bytes.size());
}

}  // namespace
