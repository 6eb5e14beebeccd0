// What writers and their judge share: memory, since every system call of a writer may fail.
#ifndef QLX_TESTS_FAULTS_BOARD_H
#define QLX_TESTS_FAULTS_BOARD_H

#include <atomic>
#include <cstdint>
#include <cstdlib>

#include <sys/mman.h>

inline constexpr uint32_t kMaxWriters = 4;
inline constexpr uint32_t kMaxRecords = 256;
inline constexpr uint32_t kRecordsAfter = 10;  // of each writer, when no call fails any more

enum class Step : uint32_t { kStarted, kWarm, kTraced, kLogged, kFinished };

// Of one log call. Written once the call is back.
struct Answer {
  std::atomic<char> kind;  // 0: not asked, '-': success
  std::atomic<int32_t> code;
};

struct WriterBoard {
  std::atomic<Step> step;
  std::atomic<uint32_t> count;  // of the records asked for
  Answer answers[kMaxRecords];
};

struct Board {
  std::atomic<Step> until;     // how far the writers may go
  std::atomic<uint32_t> cuts;  // writes for which there was a limit
  WriterBoard writers[kMaxWriters];

  static Board *make() {
    void *place =
        mmap(nullptr, sizeof(Board), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (place == MAP_FAILED) std::abort();
    return static_cast<Board *>(place);  // zeros
  }
};

#endif
