// The begin and the end of a process: first calls from several threads at once, log calls from exit
// handlers and from the destructors of static objects.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>

#include <sys/wait.h>
#include <unistd.h>

#include <qlx/qlx.h>

#include "object/QlxLocked.h"
#include "support/TempDir.h"
#include "support/Together.h"

namespace {

constexpr unsigned kHangSeconds = 20;  // until a child that hangs is ended

// The exit status of a child process that makes the call and then ends as a program does.
template <typename Call>
int exitOfChild(Call call) {
  std::fflush(nullptr);
  const pid_t child = fork();
  if (child == 0) {
    alarm(kHangSeconds);
    call();
    std::exit(::testing::Test::HasFailure() ? 1 : 0);
  }
  int status = -1;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  return status;
}

// In a process of its own, where nothing has called the library yet.
TEST(ProcessLifeTest, FirstCallsMayComeFromSeveralThreads) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const auto raceOfFirstCalls = [] {
    std::atomic<int> good{0};
    const auto open = [&] { good += QlxOpenToolkit(nullptr, nullptr); };
    const auto allocate = [&] {
      StringGroup *group = QlxAllocStringGroup();
      good += QlxStringGroupAdd(group, "a");
      QlxFreeStringGroup(group);
    };
    const auto lock = [&] {
      if (const ApiLock held; held) ++good;
    };
    const auto registerClass = [&] {
      QlxAddLoggerClass("test_logger", nullptr, nullptr, nullptr, nullptr, nullptr);
      ++good;
    };
    together(open, allocate, lock, registerClass, open, allocate, lock);
    QlxObject *logger = QlxGetObject("log", "test_logger");
    good += QlxIsLoggable(logger, FATAL);
    QlxReleaseObject(logger);
    QlxCloseToolkit();
    return good == 8;
  };
  EXPECT_EXIT(std::exit(raceOfFirstCalls() ? 0 : 1), ::testing::ExitedWithCode(0), "");
}

// Logs when it goes: as a static object it goes after main().
struct LastWords {
  ~LastWords() {
    if (!logger) return;
    QlxLogUText(logger, u"from a static object");
    if (closes) QlxCloseToolkit();
    QlxLogUText(logger, u"after the end");
    QlxReleaseObject(logger);
  }
  QlxObject *logger = nullptr;
  bool closes = false;
};

// What a child that ends has written to its file.
std::string lastWords(bool closes) {
  const TempDir dir;
  const std::string path = dir.path("app.log");
  const int status = exitOfChild([&] {
    static LastWords words;
    static QlxObject *logger;
    QlxOpenToolkit(nullptr, nullptr);
    logger = words.logger = QlxGetObject("log", "qlx_basiclogger");
    words.closes = closes;
    QlxObject *file = QlxGetObject("file", "qlx_filehandler");
    QlxSetObjProp(file->kind2.formatter, "dateTimeFormat", "'-'");
    QlxSetObjProp(file, "fileName", path.c_str());
    QlxAddListener(logger, file);
    QlxReleaseObject(file);
    std::atexit([] { QlxLogUText(logger, u"from a handler"); });
  });
  EXPECT_EQ(status, 0);
  return dir.read("app.log");
}

TEST(ProcessLifeTest, LogsFromExitHandlersAndStaticObjects) {
  EXPECT_EQ(lastWords(false), "- from a handler\n- from a static object\n- after the end\n");
}

TEST(ProcessLifeTest, LogsNothingAfterAStaticObjectClosedIt) {
  EXPECT_EQ(lastWords(true), "- from a handler\n- from a static object\n");
}

}  // namespace
