#include "support/FileHandlerTest.h"

#include <fcntl.h>
#include <fstream>

#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/WorkingDir.h"

namespace {

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
  EXPECT_EQ(fresh->keepFullFile, 0);
  EXPECT_EQ(fresh->followName, 0);
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

}  // namespace
