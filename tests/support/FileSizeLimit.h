// A disk that is full, as far as one file goes: no file of this process grows past so many bytes
// while it lives; the write that would is short, or fails with EFBIG.
#ifndef QLX_TESTS_FILESIZELIMIT_H
#define QLX_TESTS_FILESIZELIMIT_H

#include <csignal>
#include <sys/resource.h>

class FileSizeLimit {
 public:
  explicit FileSizeLimit(rlim_t bytes) : before_(signal(SIGXFSZ, SIG_IGN)) {
    getrlimit(RLIMIT_FSIZE, &limit_);
    const rlimit lower{bytes, limit_.rlim_max};
    setrlimit(RLIMIT_FSIZE, &lower);
  }
  ~FileSizeLimit() {
    setrlimit(RLIMIT_FSIZE, &limit_);
    signal(SIGXFSZ, before_);
  }
  FileSizeLimit(const FileSizeLimit &) = delete;
  FileSizeLimit &operator=(const FileSizeLimit &) = delete;

 private:
  rlimit limit_;
  sighandler_t before_;
};

#endif
