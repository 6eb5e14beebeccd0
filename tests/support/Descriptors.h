// The descriptors of this process, looked at one by one: a machine need not have /proc.
#ifndef QLX_TESTS_DESCRIPTORS_H
#define QLX_TESTS_DESCRIPTORS_H

#include <string>

#include <fcntl.h>
#include <sys/stat.h>

inline constexpr int kMostDescriptors = 4096;  // the library's begin at 500

inline int openDescriptors() {
  int open = 0;
  for (int number = 0; number < kMostDescriptors; ++number) open += fcntl(number, F_GETFD) != -1;
  return open;
}

// The one at which a file is open, -1 when there is none.
inline int descriptorOf(const std::string &path) {
  struct stat file = {}, open = {};
  if (stat(path.c_str(), &file) != 0) return -1;
  for (int number = 0; number < kMostDescriptors; ++number) {
    if (fstat(number, &open) != 0) continue;
    if (open.st_dev == file.st_dev && open.st_ino == file.st_ino) return number;
  }
  return -1;
}

#endif
