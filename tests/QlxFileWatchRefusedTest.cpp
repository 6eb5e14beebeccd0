// Watched paths where a filter refuses one of the system calls that watching takes.
#include <cerrno>
#include <cstddef>
#include <ostream>
#include <vector>

#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>

#include "support/FileWatchTest.h"

namespace {

struct Refusal {
  const char *name;
  std::vector<uint32_t> calls;
};

void PrintTo(const Refusal &refusal, std::ostream *out) {
  *out << refusal.name;
}

const Refusal kRefusals[] = {
    {"Instances", {SYS_inotify_init1}},
    {"Watches", {SYS_inotify_add_watch}},
    {"TheirEnds", {SYS_inotify_rm_watch}},
    {"Sets", {SYS_epoll_create1}},
    {"Members", {SYS_epoll_ctl}},
#ifdef SYS_epoll_wait
    {"Questions", {SYS_epoll_wait, SYS_epoll_pwait}},
#else
    {"Questions", {SYS_epoll_pwait}},
#endif
    {"Contexts", {SYS_io_setup}},
    {"Requests", {SYS_io_submit}},
    {"Cancels", {SYS_io_cancel}},
    {"AllOfFlags", {SYS_io_setup, SYS_io_submit, SYS_io_cancel}},
    {"Status", {SYS_statx}},
    {"FileSystems", {SYS_statfs}},
    {"Advice", {SYS_madvise}},
};

constexpr int kSkipped = 77;

// The calls fail from now on, and nothing else does.
void refuse(const std::vector<uint32_t> &calls, uint32_t error) {
  std::vector<sock_filter> filter{
      BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
  };
  for (const uint32_t call : calls) {
    filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, call, 0, 1));
    filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | error));
  }
  filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
  const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
  prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
  if (prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) _exit(kSkipped);
}

class FileWatchRefusedTest : public FileWatchTest,
                             public ::testing::WithParamInterface<std::tuple<Refusal, uint32_t>> {
 protected:
  void refuseNow() { refuse(std::get<Refusal>(GetParam()).calls, std::get<uint32_t>(GetParam())); }

  // As in many seconds, with a change now and then.
  void logForLong() {
    for (int second = 0; second < 40; ++second) {
      vars()->watch.lastLook -= 1;
      logTimes(kUntilWatched);
      if (second % 8 != 7) continue;
      fs::remove(dir.path(kName));
      EXPECT_EQ(next(), "next\n");
    }
  }

  static void expectPassed(Child &child) {
    const int status = child.end();
    if (status == kSkipped) GTEST_SKIP() << "no filters of system calls";
    EXPECT_EQ(status, 0);
  }
};

INSTANTIATE_TEST_SUITE_P(Calls, FileWatchRefusedTest,
                         ::testing::Combine(::testing::ValuesIn(kRefusals),
                                            ::testing::Values(EPERM, ENOSYS)),
                         [](const auto &tested) {
                           return std::get<0>(tested.param).name +
                                  std::string(std::get<1>(tested.param) == EPERM ? "NotPermitted"
                                                                                 : "Unknown");
                         });

TEST_P(FileWatchRefusedTest, SeesEachRemovalAndKeepsNoMoreThanItsDescriptors) {
  const size_t before = openDescriptors();
  Child child([&] {
    refuseNow();
    set("fileName", dir.path(kName));
    logForLong();
    EXPECT_LE(openDescriptors(), before + 3);
    QlxSetObjProp(handler.get(), "maxFiles", "5");  // closes the file
    EXPECT_LE(openDescriptors(), before + 2);
  });
  expectPassed(child);
}

TEST_P(FileWatchRefusedTest, SeesEachRemovalWhenTheFilterComesLater) {
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchFile());
    const size_t before = openDescriptors();
    refuseNow();
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
    logForLong();
    EXPECT_LE(openDescriptors(), before + 2);
  });
  expectPassed(child);
}

TEST_P(FileWatchRefusedTest, SeesEachRemovalWhenTheFilterComesWithTheFlagInPlace) {
  if (!systemHasFlags()) GTEST_SKIP() << "no poll requests on this machine";
  Child child([&] {
    ASSERT_NO_FATAL_FAILURE(watchFile());
    awaitFlag();
    const size_t before = openDescriptors();
    refuseNow();
    logTimes(3);
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
    logForLong();
    EXPECT_LE(openDescriptors(), before + 2);
  });
  expectPassed(child);
}

}  // namespace
