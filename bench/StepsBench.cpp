// The floor under a record of the file handler: the system calls that it cannot do without, alone
// and together, first in a process of one thread, then with another thread asleep: the system takes
// more care of descriptors then. Prints nanoseconds a record, minimum and median over many short
// batches.
#include <fcntl.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <ctime>
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

}  // namespace

int main() {
  char folder[] = "/tmp/qlxstepsXXXXXX";
  if (!mkdtemp(folder)) return 1;
  const std::string path = std::string(folder) + "/log";
  const std::string record = std::string(150, 'x') + "\n";
  const int file = open(path.c_str(), O_RDWR | O_APPEND | O_CREAT | O_CLOEXEC, 0600);

  const auto write = [&] {
    if (::write(file, record.data(), record.size()) < 0) abort();
  };
  struct statx found;
  const auto size = [&] {
    if (statx(file, "", AT_EMPTY_PATH, STATX_TYPE | STATX_INO | STATX_SIZE, &found) != 0) abort();
  };
  const auto look = [&] {
    if (statx(AT_FDCWD, path.c_str(), 0, STATX_TYPE, &found) != 0) abort();
  };
  const auto tick = [] {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
  };
  const auto measureAll = [&](const char *process) {
    std::printf("%-50s %7s %7s\n", process, "minimum", "median");
    measure("getppid: the way into the system and back", file, [] { getppid(); });
    measure("write", file, write);
    measure("tick, write (a record of a burst)", file, [&] { tick(), write(); });
    measure("size, write", file, [&] { size(), write(); });
    measure("look at the path, size, write (any other record)", file,
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
