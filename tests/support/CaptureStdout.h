// Everything that is written to the standard output stream while it lives, byte for byte.
#ifndef QLX_TESTS_CAPTURESTDOUT_H
#define QLX_TESTS_CAPTURESTDOUT_H

#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>

class CaptureStdout {
 public:
  CaptureStdout() : file_(std::tmpfile()) {
    std::fflush(stdout);
    saved_ = dup(STDOUT_FILENO);
    if (!file_ || saved_ < 0 || dup2(fileno(file_), STDOUT_FILENO) < 0) std::abort();
  }
  ~CaptureStdout() {
    restore();
    std::fclose(file_);
  }
  CaptureStdout(const CaptureStdout &) = delete;
  CaptureStdout &operator=(const CaptureStdout &) = delete;

  // Ends the capture.
  std::string bytes() {
    restore();
    std::string all;
    char part[4096];
    std::rewind(file_);
    while (const size_t count = std::fread(part, 1, sizeof part, file_)) all.append(part, count);
    return all;
  }

 private:
  void restore() {
    if (saved_ < 0) return;
    std::fflush(stdout);
    dup2(saved_, STDOUT_FILENO);
    close(saved_);
    saved_ = -1;
  }

  std::FILE *file_;
  int saved_;
};

#endif
