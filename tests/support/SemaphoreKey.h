// A semaphore key of the test's own; the set under it is removed with the object.
#ifndef QLX_TESTS_SEMAPHOREKEY_H
#define QLX_TESTS_SEMAPHOREKEY_H

#include <atomic>
#include <string>
#include <unistd.h>

#include <sys/ipc.h>
#include <sys/sem.h>
#include <sys/syscall.h>

class SemaphoreKey {
 public:
  SemaphoreKey() : key_(next()) { remove(); }  // one of an earlier process with this number
  ~SemaphoreKey() {
    if (getpid() == maker_) remove();
  }
  SemaphoreKey(const SemaphoreKey &) = delete;
  SemaphoreKey &operator=(const SemaphoreKey &) = delete;

  int32_t number() const { return key_; }
  std::string text() const { return std::to_string(key_); }

  // Identifier of the set, -1 without one.
  int set() const { return get(0, 0); }

  // Makes the set; at 0 it is as a set is before its maker has freed it.
  int make(int value) const {
    const int id = get(1, IPC_CREAT | IPC_EXCL | 0666);
    control(id, SETVAL, value);
    return id;
  }

  void remove() const { control(set(), IPC_RMID); }

  // Of the semaphore; -1 without a set.
  int value() const { return control(set(), GETVAL); }
  int waiting() const { return control(set(), GETNCNT); }

  // True as soon as so many processes wait for the semaphore; false when they never do.
  bool awaitWaiting(int count) const {
    for (int looks = 0; looks < kMaxLooks; ++looks) {
      if (waiting() == count) return true;
      usleep(100);
    }
    return false;
  }

 private:
  static constexpr int kMaxLooks = 100000;  // ten seconds and more

  // Past the C library, where a test may have put calls of its own.
  int get(int count, int flags) const {
    return static_cast<int>(syscall(SYS_semget, key_, count, flags));
  }
  static int control(int id, int command, long argument = 0) {
    return static_cast<int>(syscall(SYS_semctl, id, 0, command, argument));
  }

  // Process numbers have 22 bits; the upper bits keep away from the library's own default.
  static int32_t next() {
    static std::atomic<int32_t> count{0};
    return 0x40000000 + ((getpid() & 0x3FFFFF) << 8) + (count++ & 0xFF);
  }

  int32_t key_;
  pid_t maker_ = getpid();
};

#endif
