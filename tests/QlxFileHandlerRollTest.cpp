#include "support/FileHandlerTest.h"

#include <fstream>
#include <sys/stat.h>
#include <unistd.h>

#include "support/Child.h"
#include "support/WorkingDir.h"

namespace {

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
  const WorkingDir here{dir.path()};  // a folder with a dot in its path would be one
  set("fileName", "app7");
  log(u"1");
  EXPECT_EQ(dir.read("app7_"), "1\n");
}

// Nobody's files in a folder of the superuser's, where each may move its own files only.
constexpr int kNotAllowed = 77;

void becomeNobody() {
  if (geteuid() != 0 || setresuid(65534, 65534, 65534) != 0) _exit(kNotAllowed);
}

class SharedFolderTest : public FileHandlerTest {
 protected:
  void SetUp() override {
    FileHandlerTest::SetUp();
    for (const char *name : {"app.log", "app1.log", "app2.log", "app3.log"}) {
      folder.write(name, std::string(name) + "\n");
      chmod(folder.path(name).c_str(), 0666);
      if (name[3] != '.') (void)!chown(folder.path(name).c_str(), 65534, 65534);
    }
    ASSERT_EQ(chmod(folder.path().c_str(), 01777), 0);
    set("fileName", folder.path("app.log"));
    set("maxFileBytes", "1");
  }

  const TempDir folder;
};

TEST_F(SharedFolderTest, LeavesTheOlderGenerationsWhileTheActiveFileCannotBeMoved) {
  formatter->header = "head\n";
  formatter->trailer = "tail\n";
  set("maxFiles", "5");
  Child child([&] {
    becomeNobody();
    const QlxHandlerProblems before = problems();
    for (const char16_t *text : {u"1", u"2", u"3"}) EXPECT_EQ(logged(text), kSuccess);
    EXPECT_EQ(problems().rolloversFailed, before.rolloversFailed + 3);
    EXPECT_EQ(problems().rollover, failure(EPERM));
    EXPECT_EQ(problems().rolloverFile, folder.path() + "//app.log");
    EXPECT_EQ(problems().recordsLost, before.recordsLost);
  });
  const int end = child.end();
  if (end == kNotAllowed) GTEST_SKIP() << "this process may not become another user";
  ASSERT_EQ(end, 0);
  EXPECT_EQ(folder.read("app.log"), "app.log\nhead\n1\n2\n3\n");
  EXPECT_FALSE(folder.has("app1.log"));
  EXPECT_EQ(folder.read("app2.log"), "app1.log\n");
  EXPECT_EQ(folder.read("app4.log"), "app3.log\n");
}

TEST_F(SharedFolderTest, LeavesTheOlderGenerationsHoweverOftenItsProcessIsStarted) {
  set("maxFiles", "4");
  for (int process = 1; process <= 5; ++process) {
    Child child([&] {
      becomeNobody();
      EXPECT_EQ(logged(u"1"), kSuccess);
    });
    const int end = child.end();
    if (end == kNotAllowed) GTEST_SKIP() << "this process may not become another user";
    ASSERT_EQ(end, 0);
    EXPECT_EQ(folder.list(), (std::vector<std::string>{"app.log", "app2.log", "app3.log"}));
  }
  EXPECT_EQ(folder.read("app2.log") + folder.read("app3.log"), "app1.log\napp2.log\n");
}

TEST_F(FileHandlerTest, MovesTheFileOnceItCanBe) {
  formatter->trailer = "tail\n";
  set("maxFileBytes", "1");
  set("maxFiles", "2");
  std::filesystem::create_directories(dir.path("app1.log/occupied"));
  for (const char16_t *text : {u"1", u"2"}) log(text);
  std::filesystem::remove_all(dir.path("app1.log"));
  EXPECT_EQ(logged(u"3"), kSuccess);
  EXPECT_EQ(generations(), "3| 1|2|tail| - -");
}

TEST_F(FileHandlerTest, DoesNotStopForManyGenerations) {
  set("maxFileBytes", "1");
  set("maxFiles", "2147483647");
  for (const char16_t *text : {u"1", u"2", u"3", u"4"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(generations(), "4| 3| 2| 1|");
}

TEST_F(FileHandlerTest, WritesOnIntoTheFullFileWhenItCannotBeRenamed) {
  set("maxFileBytes", "1");
  set("maxFiles", "2");
  std::filesystem::create_directories(dir.path("app1.log/occupied"));
  EXPECT_EQ(logged(u"1"), kSuccess);
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "1\n2\n");
}

}  // namespace
