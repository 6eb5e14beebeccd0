// What docs/hosts.md tells and no other test shows; and that the tests that it names are there.
#include <gtest/gtest.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <string>

#include <dlfcn.h>
#include <sys/wait.h>
#include <unicode/ucal.h>
#include <unistd.h>

#include "support/ChainTest.h"
#include "support/Child.h"
#include "support/FreshProcess.h"
#include "support/OpenToolkit.h"
#include "support/TempDir.h"
#include "util/CxAsciiLine.h"
#include "util/CxOwned.h"
#include "text/QlxDateCache.h"

namespace {

// ---- Threads

using HostsPageTest = ChainTest;

TEST_F(HostsPageTest, ASuppressedCallTakesNoLock) {
  QlxSetObjProp(logger.get(), "level", "FATAL");
  Child child([this] {
    const ApiLock lock;
    QlxLogInfo(logger.get(), nullptr, "key");
    EXPECT_EQ(QlxIsLoggable(logger.get(), INFO), 0);
  });
  EXPECT_EQ(child.end(), 0);
}

// ---- Signal handlers

QlxObject *gLogger = nullptr;

TEST_F(HostsPageTest, ASignalHandlerThatLogsUnderTheLockWaitsForItself) {
  const Handle handler = attach("recording", RecordingHandler::kClass);
  gLogger = logger.get();
  Child child([this] {
    std::signal(SIGUSR1, [](int) { QlxLogUText(gLogger, u"from a signal handler"); });
    recorder->alsoDo = [](Event *) {
      ualarm(100000, 0);  // what ends it
      raise(SIGUSR1);
    };
    log(u"text");
  });
  EXPECT_EQ(child.end(), -SIGALRM);
}

// ---- Plug-ins

template <typename Function>
Function *find(void *library, const char *name) {
  return reinterpret_cast<Function *>(dlsym(library, name));
}

TEST(HostsPageLibraryTest, AClosedLibraryStaysLoaded) {
  Child child([] {
    void *library = dlopen(QLX_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(library, nullptr) << dlerror();
    auto *open = find<decltype(QlxOpenToolkit)>(library, "QlxOpenToolkit");
    auto *close = find<decltype(QlxCloseToolkit)>(library, "QlxCloseToolkit");
    EXPECT_EQ(open(nullptr, nullptr), 1);
    dlclose(library);
    close();
    Child grandchild([&] { EXPECT_EQ(open(nullptr, nullptr), 1); });  // by its fork handlers
    EXPECT_EQ(grandchild.end(), 0);
  });
  EXPECT_EQ(child.end(), 0);
}

// ---- The end of a process

// What a process that logs to a file, with the trailer "end", leaves there.
std::string leftBehind(bool closes) {
  const TempDir dir;
  const std::string path = dir.path("app.log");
  Child child([&] {
    QlxOpenToolkit(nullptr, nullptr);
    QlxAddUFormatterClass(
        "test_ending", nullptr, nullptr, nullptr, QlxBasicFormatterFCfgChange, nullptr, nullptr,
        [](QlxObject *) { return OslStringDup("end"); }, nullptr);
    QlxObject *logger = QlxGetObject("log", "qlx_basiclogger");
    QlxObject *file = QlxGetObject("file", "qlx_filehandler");
    QlxObject *formatter = QlxGetObject("formatter", "test_ending");
    QlxSetObjProp(formatter, "dateTimeFormat", "'-'");
    QlxHandlerSetFormatter(file, formatter);
    QlxSetObjProp(file, "fileName", path.c_str());
    QlxAddListener(logger, file);
    QlxLogUText(logger, u"text");
    if (closes) QlxCloseToolkit();
  });
  EXPECT_EQ(child.end(), 0);
  return dir.read("app.log");
}

TEST(HostsPageExitTest, TrailersAreWrittenByTheCloseAlone) {
  EXPECT_EQ(leftBehind(true), "- text\nend");
  EXPECT_EQ(leftBehind(false), "- text\n");
}

// ---- The time zone

constexpr double kTime = 1155725335123.0;  // 2006-08-16 10:48:55.123 UTC

std::string hour() {
  CxAsciiLine line;
  EXPECT_TRUE(qlxAppendCachedDateAscii(&line, {"HH", false}, kTime));
  return std::string(line.data(), line.length());
}

void setZoneVariable(const char *zone) {
  setenv("TZ", zone, 1);
  tzset();
}

TEST(HostsPageZoneTest, IsAskedForOnceAndThenFollowsIcu) {
  inFreshProcess([] {
    setZoneVariable("Asia/Tokyo");  // before the first date
    const OpenToolkit toolkit;
    EXPECT_EQ(hour(), "19");
    setZoneVariable("UTC");
    EXPECT_EQ(hour(), "19");
    UErrorCode status = U_ZERO_ERROR;
    UChar zone[128];
    ucal_getHostTimeZone(zone, 128, &status);
    ucal_setDefaultTimeZone(zone, &status);
    EXPECT_EQ(hour(), "10");
  });
}

// ---- The page

constexpr const char *kPrograms[] = {"qlx_tests", "qlx_call_tests", "qlx_host_name_tests",
                                     "qlx_bundle_tests", "qlx_page_tests"};

// The tests of a program, each as its source names it: "Suite.Test".
std::set<std::string> testsOf(const std::filesystem::path &program) {
  static const std::regex decoration(R"(^[^/]*/(?=[^/]*\.)|/[^/.]*$)");
  const std::string command = "'" + program.string() + "' --gtest_list_tests";
  const Owned<FILE, pclose> list{popen(command.c_str(), "r")};
  std::set<std::string> names;
  std::string suite;
  char line[4096];
  while (std::fgets(line, sizeof line, list.get())) {
    const std::string word = std::strtok(line, " \n");
    if (word.back() == '.') {
      suite = word;
    } else {
      names.insert(std::regex_replace(suite + word, decoration, ""));
    }
  }
  return names;
}

TEST(HostsPage, NamesTestsThatAreThere) {
  const auto root = std::filesystem::path(QLX_HEADERS).parent_path().parent_path();
  std::ifstream in(root / "docs/hosts.md");
  const std::string page{std::istreambuf_iterator<char>(in), {}};
  const auto folder = std::filesystem::read_symlink("/proc/self/exe").parent_path();
  std::set<std::string> tests;
  for (const char *program : kPrograms) tests.merge(testsOf(folder / program));
  static const std::regex name(R"(\b[A-Z][A-Za-z]+\.[A-Z][A-Za-z0-9]+\b)");
  int found = 0;
  for (std::sregex_iterator it(page.begin(), page.end(), name), end; it != end; ++it, ++found) {
    EXPECT_TRUE(tests.contains(it->str())) << it->str();
  }
  EXPECT_GT(found, 20);
}

}  // namespace
