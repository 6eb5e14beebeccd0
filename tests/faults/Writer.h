// A process that logs numbered records through one handler, first while calls fail and then while
// none does, and notes what each log call answered.
#ifndef QLX_TESTS_FAULTS_WRITER_H
#define QLX_TESTS_FAULTS_WRITER_H

#include <string>

#include "Board.h"
#include "Variants.h"

// What getppid() answers to a traced writer: no process has this number.
inline constexpr long kTracedMark = 0x7ffffff1;

// Which of a count are meant: FIRST, FIRST+ (and all after it), FIRST+STEP, FIRST..LAST.
struct When {
  uint32_t first = 0;  // 0: none
  uint32_t last = 0;
  uint32_t step = 1;

  static bool read(const char *text, When *when);
  bool has(uint32_t number) const {
    return first != 0 && number >= first && number <= last && (number - first) % step == 0;
  }
};

struct WriterPlan {
  const Variant *variant;
  std::string folder;      // of the log
  std::string warmFolder;  // of a log that nobody looks at
  std::string semaphoreKey;
  bool traced = false;
  When cut;  // the records at which no file may grow by more than so many bytes
  int32_t cutBytes = 0;
};

// Ends the process.
[[noreturn]] void runWriter(const WriterPlan &plan, uint32_t slot, Board *board);

#endif
