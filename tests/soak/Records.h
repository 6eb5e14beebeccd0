// The oracle of shared log files: records that tell who wrote them and whether they are whole, and
// what a look at all generations finds of them.
#ifndef QLX_TESTS_SOAK_RECORDS_H
#define QLX_TESTS_SOAK_RECORDS_H

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

// Writer and sequence number.
using RecordId = std::pair<uint32_t, uint32_t>;

// A line, without its line feed: the identifier, so many bytes of padding, a checksum of both.
std::string recordText(RecordId id, size_t padding);

// What stands in the generations of "app.log" in a folder.
//
// A process that dies inside a rollover leaves the active file as it was and, in generation 1, the
// beginning or all of it; the next process rolls over again. So a file that is a beginning of the
// next newer one is a cut copy: it is counted and left out. Everything else may stand there once.
struct Findings {
  std::map<RecordId, int> records;  // how often each whole record was found, without cut copies
  int cutCopies = 0;
  uint64_t recordsInCutCopies = 0;
  int fragments = 0;  // pieces that are no whole record
  uint64_t largestFile = 0;
  int files = 0;

  uint64_t repeated() const;  // records that were found more than once, outside of cut copies
};

// Looks at the generations from the active one up to the number given; missing ones are skipped.
Findings lookInto(const std::string &folder, int lastGeneration);

// Adds the records and fragments of one file's bytes.
void parseRecords(std::string_view bytes, Findings *findings);

#endif
