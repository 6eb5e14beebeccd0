// The descriptor of a log file, and what is in its place: hosts that close it or take its number,
// files that are no regular ones, records that were written in part.
#include "file/QlxLogFile.h"

#include <algorithm>
#include <fcntl.h>
#include <fstream>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include "support/Child.h"
#include "support/Descriptors.h"
#include "support/FileHandlerTest.h"
#include "support/FileSizeLimit.h"
#include "support/SemaphoreKey.h"
#include "support/SystemCalls.h"
#include "support/WorkingDir.h"

namespace {

// ---- Both handlers

class LogFileTest : public FileHandlerFixture, public ::testing::WithParamInterface<const char *> {
 protected:
  LogFileTest() : FileHandlerFixture(GetParam()) {}

  void SetUp() override {
    FileHandlerFixture::SetUp();
    set("MPFileSemKey", key.text());
  }

  // A file of the host's, at a number.
  void openForHost(const char *name, int number) {
    const int file = ::open(dir.write(name, "host\n").c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(dup2(file, number), number);
    if (file != number) ::close(file);
  }

  void appendInAnotherProcess(const char *bytes) {
    Child other([&] {
      rlimit limit;
      getrlimit(RLIMIT_FSIZE, &limit);
      limit.rlim_cur = limit.rlim_max;
      setrlimit(RLIMIT_FSIZE, &limit);
      std::ofstream(dir.path("app.log"), std::ios::app) << bytes;
    });
    EXPECT_EQ(other.end(), 0);
  }

  static bool isOpen(int number) { return fcntl(number, F_GETFD) != -1; }

  SemaphoreKey key;
  SystemCalls calls;
};

INSTANTIATE_TEST_SUITE_P(Handlers, LogFileTest,
                         ::testing::Values("qlx_filehandler", "qlx_multiproc_filehandler"),
                         [](const auto &tested) { return std::string(tested.param + 4); });

TEST_P(LogFileTest, HasANumberThatHostsDoNotExpect) {
  log(u"1");
  EXPECT_GE(vars()->file, 500);
}

TEST_P(LogFileTest, HasALowNumberWhereNoneIsHighEnough) {
  rlimit limit;
  getrlimit(RLIMIT_NOFILE, &limit);
  const rlimit lower{64, limit.rlim_max};
  setrlimit(RLIMIT_NOFILE, &lower);
  EXPECT_EQ(logged(u"1"), kSuccess);
  setrlimit(RLIMIT_NOFILE, &limit);
  EXPECT_LT(vars()->file, 64);
  EXPECT_EQ(dir.read("app.log"), "1\n");
}

TEST_P(LogFileTest, NeverTakesTheNumberOfAStandardStream) {
  for (const rlim_t numbers : {rlim_t{1024}, rlim_t{64}}) {
    Child child([&] {
      const rlimit limit{numbers, numbers};
      setrlimit(RLIMIT_NOFILE, &limit);
      for (const int number : {0, 1, 2}) ::close(number);
      set("maxFileBytes", "1");
      EXPECT_EQ(logged(u"1"), kSuccess);
      EXPECT_EQ(logged(u"2"), kSuccess);
      for (const int number : {0, 1, 2}) EXPECT_FALSE(isOpen(number)) << number;
    });
    EXPECT_EQ(child.end(), 0);
    EXPECT_EQ(generations(), numbers == 1024 ? "2| 1| - -" : "2| 1| 2| -");
  }
}

TEST_P(LogFileTest, IsOpenedAnewAfterAHostClosedAllDescriptors) {
  Child child([&] {
    EXPECT_EQ(logged(u"1"), kSuccess);
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    EXPECT_EQ(logged(u"2"), kSuccess);
    EXPECT_EQ(logged(u"3"), kSuccess);
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("app.log"), "1\n2\n3\n");
}

TEST_P(LogFileTest, LeavesAHostsFileAloneThatHasItsNumberNow) {
  const char *const actions[] = {"log", "roll", "change", "release"};
  for (const std::string action : actions) {
    Child child([&] {
      log(u"1");
      const int number = vars()->file;
      ASSERT_EQ(close_range(3, ~0U, 0), 0);
      ASSERT_NO_FATAL_FAILURE(openForHost("host", number));
      if (action == "roll") set("maxFileBytes", "1");
      if (action == "change") set("maxFiles", "5");
      if (action == "release") {
        QlxRemListener(logger.get(), handler.get());
        handler.reset();
      } else {
        EXPECT_EQ(logged(u"2"), kSuccess);
      }
      EXPECT_TRUE(isOpen(number));
      EXPECT_EQ(dir.read("host"), "host\n");
    });
    EXPECT_EQ(child.end(), 0) << action;
  }
  EXPECT_EQ(generations(), "2|1|2|1| 1|2|1| - -");
}

TEST_P(LogFileTest, WritesNoTrailerIntoAHostsFile) {
  formatter->trailer = "tail\n";
  Child child([&] {
    log(u"1");
    const int number = vars()->file;
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    ASSERT_NO_FATAL_FAILURE(openForHost("host", number));
    set("maxFiles", "5");
    EXPECT_EQ(dir.read("host"), "host\n");
  });
  EXPECT_EQ(child.end(), 0);
}

TEST_P(LogFileTest, IsEachHandlersOwnAfterAHostClosedAllDescriptors) {
  Handle second = attach("second", GetParam());
  format(second);
  QlxSetObjProp(second.get(), "fileName", dir.path("second.log").c_str());
  QlxSetObjProp(second.get(), "MPFileSemKey", key.text().c_str());
  Child child([&] {
    log(u"1");
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    QlxRemListener(logger.get(), handler.get());  // the second gets the first one's number
    log(u"2");
    QlxAddListener(logger.get(), handler.get());
    log(u"3");
    log(u"4");
    EXPECT_NE(vars()->file, static_cast<QlxFileHandlerVars *>(second->vars)->file);
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("app.log"), "1\n3\n4\n");
  EXPECT_EQ(dir.read("second.log"), "1\n2\n3\n4\n");
}

TEST_P(LogFileTest, IsEachHandlersOwnAlsoWhenBothWriteTheSameFile) {
  Handle second = attach("second", GetParam());
  format(second);
  QlxSetObjProp(second.get(), "fileName", dir.path("app.log").c_str());
  QlxSetObjProp(second.get(), "MPFileSemKey", key.text().c_str());
  Child child([&] {
    log(u"1");
    ASSERT_EQ(close_range(3, ~0U, 0), 0);
    QlxRemListener(logger.get(), handler.get());
    log(u"2");
    QlxAddListener(logger.get(), handler.get());
    set("maxFiles", "4");  // closes what is its own
    EXPECT_TRUE(isOpen(static_cast<QlxFileHandlerVars *>(second->vars)->file));
    EXPECT_EQ(logged(u"3"), kSuccess);
    EXPECT_NE(vars()->file, static_cast<QlxFileHandlerVars *>(second->vars)->file);
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("app.log"), "1\n1\n2\n3\n3\n");
}

TEST_P(LogFileTest, KeepsNoDescriptorWhenItCloses) {
  const int before = openDescriptors();
  log(u"1");
  set("maxFiles", "5");
  EXPECT_EQ(openDescriptors(), before);
}

// ---- Pieces of records

TEST_P(LogFileTest, CutsAPieceOffThatNobodyHasAppendedTo) {
  log(u"12345");
  {
    const FileSizeLimit full{8};
    EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  }
  EXPECT_EQ(dir.read("app.log"), "12345\n");
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "12345\nnext\n");
}

TEST_P(LogFileTest, StartsANewLineBehindAPieceThatCannotBeCutOff) {
  log(u"12345");
  calls.onTruncate = [](int) { return EPERM; };
  {
    const FileSizeLimit full{8};
    EXPECT_EQ(logged(u"67890"), failure(EFBIG));
    EXPECT_EQ(logged(u"x"), failure(EFBIG));
  }
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(logged(u"last"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "12345\n67\nnext\nlast\n");
}

TEST_P(LogFileTest, LeavesWhatSomebodyAppendedBehindThePiece) {
  log(u"12345");
  calls.onSeek = [this](int, int origin) {
    // The limit holds for this process and its children, unless they lift it.
    if (origin == SEEK_CUR) appendInAnotherProcess("other\n");
    return 0;
  };
  {
    const FileSizeLimit full{8};
    EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  }
  calls.onSeek = nullptr;
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "12345\n67other\n\nnext\n");
}

TEST_P(LogFileTest, StartsAnotherFileWithoutAnEmptyLine) {
  log(u"12345");
  calls.onTruncate = [](int) { return EPERM; };
  {
    const FileSizeLimit full{8};
    log(u"67890");
  }
  set("fileName", dir.write("other.log", "old\n"));
  log(u"next");
  EXPECT_EQ(dir.read("other.log"), "old\nnext\n");
}

TEST_P(LogFileTest, GoesOnWhereThePieceBeganAlsoWhenItDoesNotAppend) {
  set("appending", "false");
  log(u"12345");
  {
    const FileSizeLimit full{8};
    EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  }
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "12345\nnext\n");
}

TEST_P(LogFileTest, StartsTheFileAfterARolloverWithoutAnEmptyLine) {
  set("maxFileBytes", "1");
  calls.onTruncate = [](int) { return EPERM; };
  {
    const FileSizeLimit full{3};
    EXPECT_EQ(logged(u"67890"), failure(EFBIG));
  }
  calls.onTruncate = nullptr;
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(generations(), "next| 678 - -");
}

// ---- What is no regular file

TEST_P(LogFileTest, NeverWaitsForTheReaderOfAFifo) {
  ASSERT_EQ(mkfifo(dir.path("app.log").c_str(), 0600), 0);
  EXPECT_EQ(logged(u"nobody reads"), failure(ENXIO));
  const int reader = ::open(dir.path("app.log").c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
  EXPECT_EQ(logged(u"1"), kSuccess);
  const std::u16string much(4000, u'x');
  CxStatus status = kSuccess;
  for (int i = 0; i < 1000 && status == kSuccess; ++i) status = logged(much.c_str());
  EXPECT_EQ(status, failure(EAGAIN));
  std::string bytes(1 << 20, '\0');
  bytes.resize(static_cast<size_t>(std::max<ssize_t>(0, read(reader, bytes.data(), bytes.size()))));
  EXPECT_EQ(bytes.substr(0, 4), "1\nxx");
  EXPECT_EQ(logged(u"2"), kSuccess);
  ::close(reader);
}

TEST_P(LogFileTest, OpensAFifoOnceAndNeverRollsIt) {
  formatter->header = "head\n";
  set("maxFileBytes", "1");
  ASSERT_EQ(mkfifo(dir.path("app.log").c_str(), 0600), 0);
  const int reader = ::open(dir.path("app.log").c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
  for (const char16_t *text : {u"1", u"2", u"3"}) EXPECT_EQ(logged(text), kSuccess);
  char bytes[64] = {};
  const bool hasHeader = std::string(GetParam()) == "qlx_filehandler";
  ASSERT_GT(read(reader, bytes, sizeof bytes), 0);
  EXPECT_STREQ(bytes, hasHeader ? "head\n1\n2\n3\n" : "1\n2\n3\n");
  EXPECT_EQ(dir.list(), std::vector<std::string>{"app.log"});
  ::close(reader);
}

TEST_P(LogFileTest, NeitherRollsNorEmptiesADevice) {
  set("maxFileBytes", "0");
  set("appending", "false");
  std::filesystem::create_symlink("/dev/null", dir.path("app.log"));
  EXPECT_EQ(logged(u"1"), kSuccess);
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.list(), std::vector<std::string>{"app.log"});
}

TEST_P(LogFileTest, TellsOfADeviceThatIsFull) {
  std::filesystem::create_symlink("/dev/full", dir.path("app.log"));
  EXPECT_EQ(logged(u"1"), failure(ENOSPC));
}

TEST_P(LogFileTest, NeitherMovesNorEmptiesWhatALinkToADescriptorLeadsTo) {  // such as /dev/stdout
  const int file = ::open(dir.write("output", "before\n").c_str(), O_RDWR | O_CLOEXEC);
  if (!std::filesystem::exists("/proc/self/fd")) GTEST_SKIP() << "no /proc here";
  std::filesystem::create_symlink("/proc/self/fd/" + std::to_string(file), dir.path("app.log"));
  set("maxFileBytes", "1");
  set("appending", "false");
  EXPECT_EQ(logged(u"1"), kSuccess);
  EXPECT_EQ(logged(u"2"), kSuccess);
  EXPECT_EQ(dir.read("output"), "before\n1\n2\n");
  EXPECT_EQ(dir.list(), (std::vector<std::string>{"app.log", "output"}));
  ::close(file);
}

TEST_P(LogFileTest, NeitherMovesNorEmptiesWhatALinkToAStandardStreamLeadsTo) {
  std::filesystem::create_symlink("/dev/stdout", dir.path("app.log"));
  dir.write("output", "before\n");
  Child child([&] {
    ASSERT_EQ(dup2(::open(dir.path("output").c_str(), O_RDWR), STDOUT_FILENO), STDOUT_FILENO);
    set("maxFileBytes", "1");
    EXPECT_EQ(logged(u"1"), kSuccess);
    EXPECT_EQ(logged(u"2"), kSuccess);
  });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(dir.read("output"), "before\n1\n2\n");
  EXPECT_EQ(dir.list(), (std::vector<std::string>{"app.log", "output"}));
}

// ---- Names

// What is opened is then looked at, moved and emptied under the very same name.
TEST_P(LogFileTest, TakesABackslashInTheWorkingDirectoryForASeparator) {
  std::filesystem::create_directory(dir.path("a\\b"));
  const WorkingDir here{dir.path("a\\b")};
  set("fileName", "app.log");
  set("appending", "false");
  for (const char16_t *text : {u"1", u"2"}) EXPECT_EQ(logged(text), kSuccess);
  EXPECT_EQ(dir.read("a/b/app.log"), "1\n2\n");
}

TEST_P(LogFileTest, RefusesANameThatIsTooLongForAGeneration) {
  set("maxFiles", "100");
  set("maxFileBytes", "1");
  const std::string directory = dir.path() + "/" + std::string(100, 'd');
  for (const size_t length : {254u, 255u, 256u, 257u}) {
    // directory, two separators, base, two digits, ".log"
    const std::string base(length - directory.size() - 2 - 2 - 4, 'x');
    set("fileName", directory + "/" + base + ".log");
    const CxStatus expected = length <= 256 ? kSuccess : failure(ENAMETOOLONG);
    EXPECT_EQ(logged(u"1"), expected) << length;
    EXPECT_EQ(logged(u"2"), expected) << length;
    if (length > 256) continue;
    std::ifstream active(directory + "/" + base + ".log");
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(active), {}), "2\n") << length;
    EXPECT_TRUE(std::filesystem::exists(directory + "/" + base + "1.log")) << length;
    std::filesystem::remove_all(directory);
  }
  EXPECT_EQ(dir.list(), std::vector<std::string>{});
}

TEST_P(LogFileTest, MayHaveTheLongestNameWithoutGenerations) {
  const std::string directory = dir.path() + "/" + std::string(100, 'd');
  const std::string base(256 - directory.size() - 2 - 4, 'x');
  set("maxFiles", "1");
  set("fileName", directory + "/" + base + ".log");
  EXPECT_EQ(logged(u"1"), kSuccess);
  set("maxFiles", "2");
  EXPECT_EQ(logged(u"2"), failure(ENAMETOOLONG));
  set("maxFiles", "1");
  EXPECT_EQ(logged(u"3"), kSuccess);
  EXPECT_TRUE(std::filesystem::exists(directory + "/" + base + ".log"));
}

// ---- Permissions

TEST_P(LogFileTest, IsMadeWithTheNineBitsOfItsPermissionOnly) {
  const mode_t before = umask(0);
  set("filePermission", "-1");
  set("dirPermission", "7777");
  set("fileName", dir.path("new/app.log"));
  log(u"1");
  umask(before);
  struct stat info = {};
  EXPECT_EQ(stat(dir.path("new/app.log").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 07777, 0777u);
  EXPECT_EQ(stat(dir.path("new").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 07777, 0777u);
}

}  // namespace
