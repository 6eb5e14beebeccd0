// The key followName: a log file that another one took the name of, as a rotation does that makes
// the new file itself.
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <sys/stat.h>
#include <unistd.h>

#include "support/Child.h"
#include "support/FileHandlerTest.h"
#include "support/FileSizeLimit.h"
#include "support/SystemCalls.h"
#include "support/TestClock.h"

namespace {

namespace fs = std::filesystem;

class FollowNameTest : public FileHandlerTest {
 protected:
  void SetUp() override {
    FileHandlerTest::SetUp();
    set("followName", "true");
  }

  void frame() {
    formatter->header = "head\n";
    formatter->trailer = "tail\n";
  }

  // Moves the file away, as "old.log", and makes another under its name.
  void replace(const std::string &bytes) {
    fs::rename(dir.path("app.log"), dir.path("old.log"));
    dir.write("app.log", bytes);
  }

  const TestClock clock;
};

// ---- The switch

TEST_F(FollowNameTest, GoesOnInTheFileThatTookItsName) {
  frame();
  log(u"1");
  replace("other\n");
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(logged(u"3"), kSuccess);
  EXPECT_EQ(dir.read("old.log"), "head\n1\ntail\n");
  EXPECT_EQ(dir.read("app.log"), "other\nhead\n2\n3\n");
}

TEST_F(FollowNameTest, IsOffWithoutAValue) {
  EXPECT_EQ(vars()->followName, 1);
  changeAbsent("followName");
  EXPECT_EQ(vars()->followName, 0);
  set("followName", "maybe");
  EXPECT_EQ(vars()->followName, 0);
}

TEST_F(FollowNameTest, StaysInAFileThatHasItsNameByAnotherLink) {
  frame();
  log(u"1");
  fs::rename(dir.path("app.log"), dir.path("old.log"));
  fs::create_hard_link(dir.path("old.log"), dir.path("app.log"));
  log(u"2");
  EXPECT_EQ(dir.read("app.log"), "head\n1\n2\n");
}

TEST_F(FollowNameTest, FollowsASymbolicLinkThatIsPointedElsewhere) {
  frame();
  fs::create_symlink(dir.write("first.log", ""), dir.path("app.log"));
  log(u"1");
  fs::remove(dir.path("app.log"));
  fs::create_symlink(dir.write("second.log", ""), dir.path("app.log"));
  log(u"2");
  EXPECT_EQ(dir.read("first.log"), "head\n1\ntail\n");
  EXPECT_EQ(dir.read("second.log"), "head\n2\n");
}

TEST_F(FollowNameTest, StaysInTheFileOfALinkThatIsMadeAnew) {
  frame();
  for (const char16_t *text : {u"1", u"2"}) {
    fs::remove(dir.path("app.log"));
    fs::create_symlink(dir.path("file.log"), dir.path("app.log"));
    log(text);
  }
  EXPECT_EQ(dir.read("file.log"), "head\n1\n2\n");
}

TEST_F(FollowNameTest, DoesNotNoticeAFileThatIsPutBackBetweenTwoLooks) {
  frame();
  log(u"1");
  replace("other\n");
  fs::rename(dir.path("old.log"), dir.path("app.log"));
  log(u"2");
  EXPECT_EQ(dir.read("app.log"), "head\n1\n2\n");
}

TEST_F(FollowNameTest, ReturnsIntoAFileThatIsPutBackLater) {
  frame();
  set("appending", "false");
  log(u"1");
  replace("other\n");
  log(u"2");
  fs::rename(dir.path("app.log"), dir.path("other.log"));
  fs::rename(dir.path("old.log"), dir.path("app.log"));
  log(u"3");
  EXPECT_EQ(dir.read("other.log"), "other\nhead\n2\ntail\n");
  EXPECT_EQ(dir.read("app.log"), "head\n1\ntail\nhead\n3\n");
}

TEST_F(FollowNameTest, StartsTheOtherFileWithoutAnEmptyLine) {
  log(u"12345");
  {
    SystemCalls calls;
    calls.onTruncate = [](int) { return EPERM; };
    const FileSizeLimit full{8};
    EXPECT_EQ(logged(u"67890"), failure(EFBIG));  // a piece of it stays
  }
  replace("other\n");
  log(u"next");
  EXPECT_EQ(dir.read("app.log"), "other\nnext\n");
}

// ---- What is no regular file

TEST_F(FollowNameTest, WritesIntoAFifoThatTookItsNameAndStaysThere) {
  log(u"1");
  fs::rename(dir.path("app.log"), dir.path("old.log"));
  ASSERT_EQ(mkfifo(dir.path("app.log").c_str(), 0600), 0);
  const int reader = ::open(dir.path("app.log").c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
  EXPECT_EQ(logged(u"2"), kSuccess);
  fs::remove(dir.path("app.log"));
  dir.write("app.log", "other\n");
  EXPECT_EQ(logged(u"3"), kSuccess);  // what is no regular file is not looked at
  char bytes[16] = {};
  EXPECT_EQ(read(reader, bytes, sizeof bytes), 4);
  EXPECT_STREQ(bytes, "2\n3\n");
  EXPECT_EQ(dir.read("app.log"), "other\n");
  ::close(reader);
}

TEST_F(FollowNameTest, NeitherMovesNorEmptiesWhatALinkToADescriptorLeadsTo) {
  if (!fs::exists("/proc/self/fd")) GTEST_SKIP() << "no /proc here";
  const int file = ::open(dir.write("output", "before\n").c_str(), O_RDWR | O_CLOEXEC);
  set("maxFileBytes", "1");
  set("appending", "false");
  log(u"1");
  fs::rename(dir.path("app.log"), dir.path("old.log"));
  fs::create_symlink("/proc/self/fd/" + std::to_string(file), dir.path("app.log"));
  for (const char16_t *text : {u"2", u"3"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(dir.read("output"), "before\n2\n3\n");
  EXPECT_EQ(dir.list(), (std::vector<std::string>{"app.log", "old.log", "output"}));
  ::close(file);
}

// ---- What others made is not emptied, although "appending" is off

TEST_F(FollowNameTest, AppendsToTheFileThatTookItsName) {
  set("appending", "false");
  log(u"1");
  replace("other\n");
  log(u"2");
  EXPECT_EQ(dir.read("app.log"), "other\n2\n");
  set("maxFiles", "4");  // an opening that no look is the reason of
  log(u"3");
  EXPECT_EQ(dir.read("app.log"), "3\n");
}

TEST_F(FollowNameTest, AppendsToAFileThatCouldNotBeOpenedAtFirst) {
  set("appending", "false");
  log(u"1");
  fs::rename(dir.path("app.log"), dir.path("old.log"));
  fs::create_directory(dir.path("app.log"));
  EXPECT_EQ(logged(u"lost"), failure(EISDIR));
  fs::remove(dir.path("app.log"));
  dir.write("app.log", "other\n");
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "other\n2\n");
}

// Another program makes the file right after a look that found none.
class LateFileTest : public FollowNameTest {
 protected:
  void SetUp() override {
    FollowNameTest::SetUp();
    set("appending", "false");
  }

  void makeAtTheNextLookThatFindsNone() {
    calls.onLook = [this, failures = 2](const char *path) mutable {  // both ways of looking
      const bool isName = std::string_view(path).ends_with("app.log");
      if (!isName || failures == 0) return 0;
      if (failures == 2 && dir.has("app.log")) return 0;
      if (failures-- == 2) dir.write("app.log", "other\n");
      return ENOENT;
    };
  }

  SystemCalls calls;
};

TEST_F(LateFileTest, IsAppendedToAfterADeletion) {
  log(u"1");
  fs::remove(dir.path("app.log"));
  makeAtTheNextLookThatFindsNone();
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "other\n2\n");
}

TEST_F(LateFileTest, IsAppendedToAfterARollover) {
  set("maxFileBytes", "8");
  log(u"1234567");
  makeAtTheNextLookThatFindsNone();
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("app1.log"), "1234567\n");
  EXPECT_EQ(dir.read("app.log"), "other\n2\n");
}

// ---- Rollovers

TEST_F(FollowNameTest, RollsTheOtherFileByItsOwnSize) {
  frame();
  set("maxFileBytes", "20");
  log(u"1");
  replace("as large as it may be\n");
  log(u"2");
  EXPECT_EQ(generations(), "head|2| as large as it may be|tail| - -");
  EXPECT_EQ(dir.read("old.log"), "head\n1\ntail\n");
}

TEST_F(FollowNameTest, LeavesAFullFileWithoutMovingTheOneThatTookItsName) {
  set("maxFileBytes", "8");
  log(u"1234567");
  replace("other\n");
  log(u"2");
  EXPECT_EQ(generations(), "other|2| - - -");
}

TEST_F(FollowNameTest, OpensTheFileOfItsOwnRolloverOnce) {
  frame();
  set("maxFileBytes", "9");
  for (const char16_t *text : {u"1", u"2", u"3", u"4", u"5"}) log(text);
  EXPECT_EQ(generations(), "head|5| head|3|4|tail| head|1|2|tail| -");
}

TEST_F(FollowNameTest, TwoHandlersOfOneFileStayTogether) {
  const Handle second = attach("second", "qlx_filehandler");
  format(second);
  QlxSetObjProp(second.get(), "fileName", dir.path("app.log").c_str());
  for (QlxObject *each : {handler.get(), second.get()}) {
    QlxSetObjProp(each, "followName", "true");
    QlxSetObjProp(each, "maxFiles", "4");
    QlxSetObjProp(each, "maxFileBytes", "4");
  }
  for (const char16_t *text : {u"1", u"2", u"3"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(generations(), "3|3| 2|2| 1|1| -");
}

// ---- Looks

class FollowInABurstTest : public FollowNameTest {
 protected:
  static constexpr int kFirstLooks = 1024;
  static constexpr int kLooksATick = 16;

  // So many records that those of this tick share the last look.
  void burst() {
    log(u"first");
    for (int i = 0; i < kFirstLooks; ++i) cxLookAgain(&vars()->look);
    for (int i = 0; i < kLooksATick; ++i) log(u"looking");
  }
};

TEST_F(FollowInABurstTest, FollowsFromTheNextTickOn) {
  burst();
  replace("other\n");
  log(u"same tick");
  EXPECT_EQ(dir.read("app.log"), "other\n");
  ++TestClock::tick;
  log(u"next");
  const std::string old = dir.read("old.log");
  EXPECT_EQ(old.substr(old.rfind("looking")), "looking\nsame tick\n");
  EXPECT_EQ(dir.read("app.log"), "other\nnext\n");
}

TEST_F(FollowInABurstTest, LooksBeforeItMovesAFileThatItTakesForFull) {
  set("maxFileBytes", "200");
  burst();
  replace("other\n");
  while (dir.read("app.log") == "other\n") ASSERT_EQ(logged(u"same tick"), kSuccess);
  EXPECT_EQ(generations(), "other|same tick| - - -");
}

TEST_F(FollowInABurstTest, LooksAnewInAForkedChild) {
  burst();
  Child child([&] {
    replace("other\n");
    EXPECT_EQ(logged(u"child"), kSuccess);
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("app.log"), "other\nchild\n");
  ++TestClock::tick;
  EXPECT_EQ(logged(u"parent"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "other\nchild\nparent\n");
}

}  // namespace
