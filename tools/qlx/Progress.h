// How far a long file is, on standard error when that is a terminal; otherwise silent.
#ifndef QLX_TOOLS_PROGRESS_H
#define QLX_TOOLS_PROGRESS_H

#include <chrono>
#include <cstdint>
#include <string>

class Progress {
 public:
  static constexpr uint64_t kLongFileBytes = 4 << 20;

  Progress(int descriptor, std::string name);

  // One more record is logged, and this much of the file is read.
  void update(uint64_t bytesRead);

  // Clears the line.
  void finish() const;

 private:
  using Clock = std::chrono::steady_clock;

  std::string name_;
  uint64_t totalBytes_ = 0;  // 0: silent
  uint64_t records_ = 0;
  Clock::time_point nextShow_ = Clock::now();
};

#endif
