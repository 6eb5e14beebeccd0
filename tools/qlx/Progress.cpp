#include "Progress.h"

#include <cinttypes>
#include <cstdio>
#include <utility>

#include <sys/stat.h>
#include <unistd.h>

static constexpr std::chrono::milliseconds kBetweenShows{200};

Progress::Progress(int descriptor, std::string name) : name_(std::move(name)) {
  struct stat about;
  if (!isatty(STDERR_FILENO) || fstat(descriptor, &about) != 0 || !S_ISREG(about.st_mode)) return;
  if (static_cast<uint64_t>(about.st_size) >= kLongFileBytes) totalBytes_ = about.st_size;
}

// The cursor goes back to the line's start, so that a record on the same terminal takes its place.
void Progress::update(uint64_t bytesRead) {
  ++records_;
  if (totalBytes_ == 0 || Clock::now() < nextShow_) return;
  nextShow_ = Clock::now() + kBetweenShows;
  const uint64_t percent = bytesRead < totalBytes_ ? 100 * bytesRead / totalBytes_ : 100;
  fprintf(stderr, "\rqlx: %3" PRIu64 "%% of %s, %" PRIu64 " records\033[K\r", percent,
          name_.c_str(), records_);
}

void Progress::finish() const {
  if (totalBytes_ != 0) fputs("\r\033[K", stderr);
}
