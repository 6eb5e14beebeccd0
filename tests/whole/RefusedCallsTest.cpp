// Handlers that write files where a filter refuses one of their system calls: what they can do
// without is not missed.
#include <cerrno>
#include <filesystem>
#include <ostream>

#include "support/Child.h"
#include "support/FileHandlerFixture.h"
#include "support/SeenCalls.h"
#include "support/SemaphoreKey.h"
#include "support/TestClock.h"

namespace {

struct Refusal {
  const char *name;
  std::set<long> calls;
};

void PrintTo(const Refusal &refusal, std::ostream *out) {
  *out << refusal.name;
}

class RefusedCallsTest : public FileHandlerFixture,
                         public ::testing::WithParamInterface<std::tuple<Refusal, unsigned>> {
 protected:
  RefusedCallsTest() : FileHandlerFixture("qlx_filehandler") {}
};

const Refusal kRefusals[] = {
    {"Statx", {SYS_statx}},
    {"MovesIntoAGap", {SYS_renameat2}},
    {"HighNumbers", {SYS_fcntl}},
    {"FileSystems", {SYS_fstatfs}},
#ifdef SYS_readlink
    {"Links", {SYS_readlink, SYS_readlinkat}},
#else
    {"Links", {SYS_readlinkat}},
#endif
};

INSTANTIATE_TEST_SUITE_P(Calls, RefusedCallsTest,
                         ::testing::Combine(::testing::ValuesIn(kRefusals),
                                            ::testing::Values(EPERM, ENOSYS)),
                         [](const auto &tested) {
                           return std::get<0>(tested.param).name +
                                  std::string(std::get<1>(tested.param) == EPERM ? "NotPermitted"
                                                                                 : "Unknown");
                         });

// Records, rollovers, and one that could not move its files at first.
TEST_P(RefusedCallsTest, AreNotMissed) {
  constexpr int kNoFilters = 77;
  const SemaphoreKey key;
  const Handle shared = get("shared", "qlx_multiproc_filehandler");
  QlxSetObjProp(shared.get(), "MPFileSemKey", key.text().c_str());
  format(shared);
  for (QlxObject *each : {handler.get(), shared.get()}) {
    const TempDir folder;
    const TestClock clock;
    for (const auto &[name, value] : {std::pair{"fileName", folder.path("app.log")},
                                      {"maxFileBytes", std::string("1")},
                                      {"maxFiles", std::string("4")},
                                      {"keepFullFile", std::string("true")}}) {
      QlxSetObjProp(each, name, value.c_str());
    }
    QlxRemListener(logger.get(), handler.get());
    QlxAddListener(logger.get(), each);
    Child child([&] {
      if (!refuseCalls(std::get<0>(GetParam()).calls, std::get<1>(GetParam()))) _exit(kNoFilters);
      for (const char16_t *text : {u"1", u"2", u"3"}) EXPECT_EQ(logged(text), kSuccess);
      std::filesystem::create_directories(folder.path("app3.log/inside"));
      log(u"4");  // the oldest cannot go
      for (const char *name : {"app3.log/inside", "app3.log"})
        std::filesystem::remove(folder.path(name));
      TestClock::tick += 1000000000;
      EXPECT_EQ(logged(u"5"), kSuccess);
    });
    const int end = child.end();
    if (end == kNoFilters) GTEST_SKIP() << "no filters of system calls here";
    EXPECT_EQ(end, 0);
    EXPECT_EQ(folder.read("app.log"), "5\n");
    EXPECT_EQ(folder.read("app1.log"), "3\n4\n");
    EXPECT_EQ(folder.read("app2.log"), "2\n");
    EXPECT_EQ(folder.read("app3.log"), "1\n");
  }
}

}  // namespace
