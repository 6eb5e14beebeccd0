// In place of the C library's sleep, semget, semop, semctl, ftruncate, lseek, statx, fstatat and
// lstat, for the whole program of the tests: nothing in it waits by the clock, and a test may
// answer instead of the system.
#ifndef QLX_TESTS_SYSTEMCALLS_H
#define QLX_TESTS_SYSTEMCALLS_H

#include <functional>
#include <vector>

#include <sys/sem.h>

// What the calls do while it lives; one at a time. Without a hook a call goes to the system. A hook
// gives the error number with which the call fails, or 0 to let it go on to the system.
class SystemCalls {
 public:
  SystemCalls();
  ~SystemCalls();
  SystemCalls(const SystemCalls &) = delete;
  SystemCalls &operator=(const SystemCalls &) = delete;

  std::function<int(key_t key, int flags)> onGet;
  std::function<int(const sembuf &first, size_t count)> onOperate;
  std::function<int(int command)> onControl;
  std::function<int(int file)> onTruncate;
  std::function<int(int file, int origin)> onSeek;
  std::function<int(const char *path)> onLook;      // by statx or fstatat; "" at a descriptor
  std::function<void(const char *path)> afterLook;  // by lstat
  std::vector<unsigned> slept;                      // the seconds of each sleep
};

#endif
