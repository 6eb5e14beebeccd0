#include "support/SystemCalls.h"

#include <cerrno>
#include <cstdarg>
#include <unistd.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/syscall.h>

static SystemCalls *current;

SystemCalls::SystemCalls() {
  current = this;
}

SystemCalls::~SystemCalls() {
  current = nullptr;
}

// Whether a test's hook fails the call, with its error number in errno.
template <typename... Args>
static bool fails(std::function<int(Args...)> SystemCalls::*hook, Args... args) {
  const int error = current && current->*hook ? (current->*hook)(args...) : 0;
  if (error != 0) errno = error;
  return error != 0;
}

extern "C" unsigned sleep(unsigned seconds) {
  if (current) current->slept.push_back(seconds);
  return 0;
}

extern "C" int semget(key_t key, int count, int flags) noexcept {
  if (fails(&SystemCalls::onGet, key, flags)) return -1;
  return static_cast<int>(syscall(SYS_semget, key, count, flags));
}

extern "C" int semop(int id, sembuf *operations, size_t count) noexcept {
  if (fails<const sembuf &, size_t>(&SystemCalls::onOperate, *operations, count)) return -1;
  return static_cast<int>(syscall(SYS_semop, id, operations, count));
}

extern "C" int semctl(int id, int number, int command, ...) noexcept {
  if (fails(&SystemCalls::onControl, command)) return -1;
  va_list rest;
  va_start(rest, command);
  const unsigned long argument = va_arg(rest, unsigned long);
  va_end(rest);
  return static_cast<int>(syscall(SYS_semctl, id, number, command, argument));
}

extern "C" int ftruncate(int file, off_t length) noexcept {
  if (fails(&SystemCalls::onTruncate, file)) return -1;
  return static_cast<int>(syscall(SYS_ftruncate, file, length));
}

extern "C" off_t lseek(int file, off_t offset, int origin) noexcept {
  if (fails(&SystemCalls::onSeek, file, origin)) return -1;
  return syscall(SYS_lseek, file, offset, origin);
}

extern "C" int statx(int directory, const char *path, int flags, unsigned mask,
                     struct statx *info) noexcept {
  if (fails(&SystemCalls::onLook, path)) return -1;
  return static_cast<int>(syscall(SYS_statx, directory, path, flags, mask, info));
}

extern "C" int fstatat(int directory, const char *path, struct stat *info, int flags) noexcept {
  if (fails(&SystemCalls::onLook, path)) return -1;
  return static_cast<int>(syscall(SYS_newfstatat, directory, path, info, flags));
}

extern "C" int lstat(const char *path, struct stat *info) noexcept {
  const int result =
      static_cast<int>(syscall(SYS_newfstatat, AT_FDCWD, path, info, AT_SYMLINK_NOFOLLOW));
  const int error = errno;
  if (current && current->afterLook) current->afterLook(path);
  errno = error;
  return result;
}
