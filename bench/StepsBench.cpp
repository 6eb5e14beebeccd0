// The floor under a record of the file handler: the system calls that it cannot do without, alone
// and together, first in a process of one thread, then with another thread asleep: the system takes
// more care of descriptors then. Prints nanoseconds a record, minimum and median over many short
// batches.
#include <fcntl.h>
#include <linux/aio_abi.h>
#include <poll.h>
#include <stdlib.h>
#include <sys/epoll.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <semaphore>
#include <string>
#include <thread>
#include <vector>

namespace {

constexpr int kBatches = 2000;
constexpr int kRecords = 100;  // in a batch

template <typename Step>
void measure(const char *name, int file, Step step) {
  std::vector<double> times;
  for (int batch = 0; batch < kBatches; ++batch) {
    if (batch % 100 == 0 && ftruncate(file, 0) != 0) return;
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < kRecords; ++i) step();
    const std::chrono::duration<double, std::nano> taken = std::chrono::steady_clock::now() - start;
    times.push_back(taken.count() / kRecords);
  }
  std::sort(times.begin(), times.end());
  std::printf("%-50s %7.0f %7.0f\n", name, times.front(), times[times.size() / 2]);
}

// Where the ends of requests have their count: a change of it says that there are notices. Null:
// the system has no such requests.
const unsigned *startFlag(int poll) {
  static iocb request;
  aio_context_t context = 0;
  request.aio_lio_opcode = IOCB_CMD_POLL;
  request.aio_fildes = static_cast<unsigned>(poll);
  request.aio_buf = POLLIN;
  iocb *requests = &request;
  if (syscall(SYS_io_setup, 1, &context) != 0) return nullptr;
  if (syscall(SYS_io_submit, context, 1, &requests) != 1) return nullptr;
  return reinterpret_cast<const unsigned *>(context) + 3;
}

}  // namespace

int main() {
  char folder[] = "/tmp/qlxstepsXXXXXX";
  if (!mkdtemp(folder)) return 1;
  const std::string path = std::string(folder) + "/log";
  const std::string record = std::string(150, 'x') + "\n";
  const int file = open(path.c_str(), O_RDWR | O_APPEND | O_CREAT | O_CLOEXEC, 0600);
  const int notices = inotify_init1(IN_NONBLOCK | IN_CLOEXEC);
  const int poll = epoll_create1(EPOLL_CLOEXEC);
  epoll_event event{.events = EPOLLIN, .data = {}};
  epoll_ctl(poll, EPOLL_CTL_ADD, notices, &event);
  inotify_add_watch(notices, path.c_str(), IN_ATTRIB | IN_MOVE_SELF | IN_DELETE_SELF);

  const auto write = [&] {
    if (::write(file, record.data(), record.size()) < 0) abort();
  };
  const auto size = [&] { lseek(file, 0, SEEK_END); };
  const auto ask = [&] { epoll_wait(poll, &event, 1, 0); };
  const auto look = [&] {
    struct statx type;
    if (statx(AT_FDCWD, path.c_str(), 0, STATX_TYPE, &type) != 0) abort();
  };
  const unsigned *const told = startFlag(poll);
  const unsigned quiet = told ? *told : 0;
  const auto load = [&] {
    if (__atomic_load_n(told, __ATOMIC_ACQUIRE) != quiet) abort();
  };
  const auto measureAll = [&](const char *process) {
    std::printf("%-50s %7s %7s\n", process, "minimum", "median");
    measure("getppid: the way into the system and back", file, [] { getppid(); });
    measure("write", file, write);
    measure("size, write", file, [&] { size(), write(); });
    measure("notices, size, write (a watched path)", file, [&] { ask(), size(), write(); });
    if (told) {
      measure("flag, size, write (a path watched for long)", file,
              [&] { load(), size(), write(); });
    }
    measure("look at the path, size, write (any other path)", file,
            [&] { look(), size(), write(); });
  };
  measureAll("ns a record, one thread");
  std::binary_semaphore end{0};
  std::thread other([&] { end.acquire(); });
  measureAll("ns a record, two threads");
  end.release();
  other.join();
  std::filesystem::remove_all(folder);
}
