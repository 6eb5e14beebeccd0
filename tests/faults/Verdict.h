// What stands in the folder after a run, against what the log calls answered.
#ifndef QLX_TESTS_FAULTS_VERDICT_H
#define QLX_TESTS_FAULTS_VERDICT_H

#include <cstdint>
#include <string>

#include "Board.h"
#include "Variants.h"

struct Verdict {
  uint64_t injected = 0;  // calls that failed because they were made to
  uint64_t acknowledged = 0;
  uint64_t lost = 0;        // acknowledged, and in no generation
  uint64_t lostCopies = 0;  // the same, where a failed copy may lose records
  uint64_t doubled = 0;
  uint64_t torn = 0;        // pieces that are no whole record on a line of its own
  uint64_t disordered = 0;  // records that stand before an earlier one of their process
  uint64_t refused = 0;     // records that failed when no call did any more
  uint64_t leaked = 0;      // descriptors
  uint64_t hangs = 0;
  uint64_t crashes = 0;
  std::string wrong;  // all that is, in words; empty when all rules held

  // Adds to what is wrong, unless the count is 0.
  void note(uint64_t count, const std::string &what);
};

// Puts what is there before the handlers into the folder. The files of other people look much like
// generations, and generation 1 is a link to one of them.
void prepareFolder(const Variant &variant, const std::string &root, const std::string &folder);

// Looks at the folder and at the answers.
void judgeFolder(const Variant &variant, const std::string &root, const std::string &folder,
                 const Board &board, Verdict *verdict);

#endif
