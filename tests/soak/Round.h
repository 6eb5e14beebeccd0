// One round of many processes on one file: they write, some are killed and come again, and at the
// end what they were told was written is looked for.
#ifndef QLX_TESTS_SOAK_ROUND_H
#define QLX_TESTS_SOAK_ROUND_H

#include <cstdint>
#include <random>

struct Plan {
  uint64_t processes = 4;
  uint64_t records = 0;  // of all writers together; 0: until the kills are done
  uint64_t kills = 0;
  uint64_t bytes = 65536;      // limit of a file; 0: another one for each round
  uint64_t generations = 400;  // files that are kept
  uint64_t seed = 1;
  uint64_t seconds = 0;  // after which no further round begins; 0: no limit
};

struct Outcome {
  uint64_t records = 0;   // marked as written
  uint64_t lost = 0;      // marked, and not found
  uint64_t repeated = 0;  // found more than once, cut copies left out
  uint64_t inCopies = 0;  // records found in cut copies too
  uint64_t copies = 0;    // cut copies: generations that a killed rollover left
  uint64_t torn = 0;      // fragments
  uint64_t kills = 0;
  uint64_t rollovers = 0;  // files found, the active ones left out
  uint64_t oversized = 0;  // rounds with a file above its limit and one record
  uint64_t failures =
      0;  // log calls that failed, and writers that ended otherwise than they should
  uint64_t badSemaphores = 0;  // rounds whose semaphore did not end at 1
  int semaphore = 1;           // its value at the end of the last round

  void add(const Outcome &round);
  bool keepsTheRules() const;
};

// Runs a round with at most so many kills; the limit of a file is the plan's.
Outcome runRound(const Plan &plan, uint64_t kills, std::mt19937_64 &random);

#endif
