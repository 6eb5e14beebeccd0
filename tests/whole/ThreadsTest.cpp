// Threads that log while others change what they log to, and forks from among them. What a thread
// sanitizer watches.
#include <gtest/gtest.h>

#include <atomic>
#include <sstream>
#include <string>

#include <sys/wait.h>
#include <unistd.h>

#include <qlx/class.h>
#include <qlx/qlx.h>

#include "support/CaptureStdout.h"
#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/TempDir.h"
#include "support/Together.h"
#include "support/WantedLeak.h"

namespace {

constexpr int kLoggingThreads = 4;
constexpr int kCalls = 150;  // of each kind and thread
constexpr int kRounds = 60;  // of all changes
constexpr int kForks = 20;
constexpr unsigned kHangSeconds = 20;  // until a child that hangs is ended

bool succeeded(QlxLogResult result) {
  return result.statusKind == '-' && result.statusCode == 0;
}

class ThreadsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(bundles_.add("root", R"(key { "{0} has {1,number,integer}, {2,date,short}" })"));
    const std::string config = dir_.write("app.properties", R"(
app.className = qlx_basiclogger
app.level = INFO
app.listenerNames = filter
filter.className = qlx_levelfilter
filter.listenerNames = file
file.className = qlx_filehandler
file.maxFiles = 1
file.formatterName = text
console.className = qlx_consolehandler
text.className = qlx_basicformatter
text.dateTimeFormat = '-'
file.fileName = )" + dir_.path("app.log"));
    ASSERT_EQ(QlxOpenToolkit(config.c_str(), nullptr), 1);
    logger_ = QlxGetObject("app", nullptr);
    file_ = QlxGetObject("file", nullptr);
    text_ = QlxGetObject("text", nullptr);
    ASSERT_NE(logger_, nullptr);
    ASSERT_NE(file_, nullptr);
    ASSERT_NE(text_, nullptr);
  }
  void TearDown() override {
    for (QlxObject *object : {text_, file_, logger_}) QlxReleaseObject(object);
    QlxCloseToolkit();
  }

  // Calls of every kind; the debug calls are suppressed while the level is INFO.
  void logAll() const {
    const std::string bundle = bundles_.path();
    for (int i = 0; i < kCalls; ++i) {
      EXPECT_TRUE(succeeded(QlxLogDebugMax(logger_, "file", "function", i, u"debug")));
      EXPECT_TRUE(succeeded(QlxLogUText(logger_, u"text {0}", u"with text")));
      EXPECT_TRUE(succeeded(QlxLogInfo(logger_, bundle.c_str(), "key", u"it", i, 1e12)));
    }
  }

  void changeSettings() const {
    const std::string one = dir_.path("one.log");
    const std::string two = dir_.path("two/two.log");
    const struct {
      QlxObject *object;
      const char *key, *even, *odd;
    } changes[] = {
        {logger_, "level", "ALL", "INFO"},
        {logger_, "logging", "off", "on"},
        {logger_, "listenerNames", "file console", "filter app"},
        {file_, "fileName", one.c_str(), two.c_str()},
        {file_, "formatterName", "quill.defaultFormatter", "text"},
        {file_, "maxFiles", "3", "1"},
        {file_, "maxFileBytes", "500", "100000"},
        {text_, "separator", " | ", " "},
        {text_, "dateTimeFormat", "yyyy-MM-dd HH:mm:ss.SSS", "HH:mm"},
        {text_, "locale", "de", "ja"},
    };
    for (int round = 0; round < kRounds; ++round) {
      for (const auto &change : changes) {
        const char *value = round % 2 == 0 ? change.even : change.odd;
        EXPECT_EQ(QlxSetObjProp(change.object, change.key, value), 1);
      }
    }
  }

  void makeAndReleaseObjects() const {
    for (int round = 0; round < kRounds; ++round) {
      QlxObject *filter = QlxGetObject("filter", nullptr);
      QlxObject *passing = QlxGetObject("passing", "qlx_levelfilter");
      QlxAddListener(logger_, passing);
      QlxSetObjPropInt(passing, "level", round);
      OslMemoryFree(QlxGetObjProp(logger_, "level", nullptr));
      OslMemoryFree(QlxGetObjectName(passing));
      ObjCfg *cfg = QlxLogMgrGetCfg("passing");
      QlxSetObjCfgProp(cfg, "level", "WARN");
      QlxLogMgrApplyCfg(passing, "passing");
      QlxReleaseObjCfg(cfg);
      QlxSetObjectEnabled(logger_, 1);
      QlxRemListener(logger_, passing);
      QlxReleaseObject(passing);
      QlxReleaseObject(filter);
    }
  }

  // What takes no API lock, under defaults of ICU that change.
  static void formatWithoutLock() {
    for (int round = 0; round < kRounds; ++round) {
      IcuDefaults::setLocale(round % 2 == 0 ? "en_US" : "de_DE");
      IcuDefaults::setZone(round % 2 == 0 ? u"UTC" : u"Asia/Kolkata");
      OslMemoryFree(QlxBasicUFormatterFormatDate(nullptr, 1e12));
      CxUStringToStdout(u"beside");
      Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
      OslMemoryFree(QlxBindEventUMsg(event, qlxIntlBindUI18Msg, nullptr));
      QlxFreeEvent(event);
    }
  }

  const TempDir dir_;
  const ResourceBundles bundles_;
  QlxObject *logger_ = nullptr, *file_ = nullptr, *text_ = nullptr;
};

TEST_F(ThreadsTest, LogWhileEverythingChanges) {
  const IcuDefaults defaults;
  CaptureStdout console;
  const auto log = [this] { logAll(); };
  together(
      log, log, log, log, [this] { changeSettings(); }, [this] { makeAndReleaseObjects(); },
      formatWithoutLock);

  const struct {
    QlxObject *object;
    const char *key, *value;
  } settings[] = {
      {logger_, "level", "INFO"},         {logger_, "logging", "on"},
      {logger_, "listenerNames", "file"}, {file_, "listenerNames", ""},
      {file_, "fileName", nullptr},       {file_, "formatterName", "text"},
      {text_, "dateTimeFormat", "'-'"},   {text_, "separator", " "},
  };
  const std::string last = dir_.path("last.log");
  for (const auto &setting : settings)
    QlxSetObjProp(setting.object, setting.key, setting.value ? setting.value : last.c_str());
  EXPECT_TRUE(succeeded(QlxLogUText(logger_, u"still here")));
  EXPECT_EQ(dir_.read("last.log"), "- still here\n");
}

TEST_F(ThreadsTest, WriteWholeLinesEachThreadsInItsOrder) {
  std::atomic<int> numbers{0};
  const auto log = [&] {
    const int thread = numbers++;
    for (int i = 0; i < kCalls; ++i) {
      EXPECT_TRUE(
          succeeded(QlxLogUText(logger_, u"{0,number,integer} {1,number,integer}", thread, i)));
    }
  };
  together(log, log, log, log);

  int next[kLoggingThreads] = {};
  std::istringstream lines(dir_.read("app.log"));
  for (std::string line; std::getline(lines, line);) {
    int thread = -1;
    int number = -1;
    ASSERT_EQ(std::sscanf(line.c_str(), "- %d %d", &thread, &number), 2) << line;
    ASSERT_TRUE(thread >= 0 && thread < kLoggingThreads) << line;
    ASSERT_EQ(number, next[thread]++);
  }
  for (const int count : next) EXPECT_EQ(count, kCalls);
}

// Handles outlive the toolkit: what a thread logs meanwhile is written or does nothing.
TEST_F(ThreadsTest, LogWithTheirHandlesWhileTheToolkitClosesAndOpens) {
  std::atomic<bool> done{false};
  const auto log = [&] {
    for (int i = 0; i < kCalls * 10 && !done; ++i) {
      EXPECT_TRUE(succeeded(QlxLogUText(logger_, u"text")));
      QlxSetObjProp(file_, "maxFiles", "2");
      OslMemoryFree(QlxGetObjectName(text_));
    }
  };
  together(log, log, [&] {
    for (int i = 0; i < kRounds; ++i) {
      QlxCloseToolkit();
      EXPECT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);
    }
    done = true;
  });
  EXPECT_EQ(QlxIsLoggable(logger_, FATAL), 0);
}

// ---- Forks

// Without the API lock a thread may be inside the allocator while another forks. That of the
// address sanitizer stays locked in the child then.
#ifdef QLX_TESTS_LSAN
constexpr bool kAllocatorSurvivesForks = false;
#else
constexpr bool kAllocatorSurvivesForks = true;
#endif

TEST_F(ThreadsTest, ForkWhileOthersLog) {
  std::atomic<bool> done{false};
  const std::string bundle = bundles_.path();
  const auto log = [&] {
    while (!done) QlxLogInfo(logger_, bundle.c_str(), "key", u"parent", 1, 1e12);
  };
  const auto format = [&] {
    while (!done && kAllocatorSurvivesForks)
      OslMemoryFree(QlxBasicUFormatterFormatDate(nullptr, 1e12));
  };
  together(log, log, format, format, [&] {
    for (int i = 0; i < kForks && !HasFailure(); ++i) {
      const pid_t child = fork();
      if (child == 0) {
        alarm(kHangSeconds);
        const bool good = succeeded(QlxLogUText(logger_, u"child")) &&
                          QlxSetObjProp(text_, "separator", "-") == 1;
        QlxCloseToolkit();
        _exit(good ? 0 : 1);
      }
      int status = -1;
      EXPECT_EQ(waitpid(child, &status, 0), child);
      EXPECT_EQ(status, 0);
    }
    done = true;
  });
  std::istringstream lines(dir_.read("app.log"));
  int children = 0;
  for (std::string line; std::getline(lines, line);) children += line == "- child";
  EXPECT_EQ(children, kForks);
}

// A class's operation holds the lock: its child holds it too, and goes on as the operation does.
TEST_F(ThreadsTest, ForkFromAClassOperation) {
  static int childStatus;
  childStatus = -1;
  QlxAddHandlerClass(
      "test_forking", nullptr, nullptr, nullptr, nullptr,
      [](QlxObject *handler, Event *event, va_list *args) {
        const pid_t child = fork();
        if (child == 0) {
          alarm(kHangSeconds);
          qlxIntlSetObjProp(handler, "child", "yes");
          QlxBasicObjectFLog(handler, event, args);
          qlxAPIMutexUnlock();
          _exit(QlxOpenToolkit(nullptr, nullptr) == 1 ? 0 : 1);
        }
        waitpid(child, &childStatus, 0);
      },
      nullptr, nullptr);
  QlxObject *forking = QlxGetObject("forking", "test_forking");
  QlxAddListener(logger_, forking);
  EXPECT_TRUE(succeeded(QlxLogUText(logger_, u"text")));
  EXPECT_EQ(childStatus, 0);
  EXPECT_TRUE(succeeded(QlxLogUText(logger_, u"again")));
  EXPECT_EQ(dir_.read("app.log"), "- text\n- again\n");
  QlxReleaseObject(forking);
}

}  // namespace
