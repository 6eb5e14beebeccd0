// What is logged in a run: the handler and its settings, the form of the records, and what stands
// in the folder before.
#ifndef QLX_TESTS_FAULTS_VARIANTS_H
#define QLX_TESTS_FAULTS_VARIANTS_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "soak/Records.h"

enum class Form { kLine, kFramedLine, kXml };

// More generations than any run fills, so that none is removed.
inline constexpr int kMaxFiles = 40;

// Records of earlier processes, more than the file may have. Nobody else writes under this number.
inline constexpr uint32_t kEarlierSlot = 63;
inline constexpr uint32_t kEarlierRecords = 12;

inline constexpr std::string_view kHeader = "<log>\n";
inline constexpr std::string_view kTrailer = "</log>\n";
inline constexpr std::string_view kElementStart = "<Trace";
inline constexpr std::string_view kElementEnd = "</Trace>\n";

// Sum of padding, numbers and checksum: some 60 bytes.
inline constexpr size_t kPadding = 32;

struct Variant {
  const char *name;
  const char *handlerClass;
  Form form = Form::kLine;
  uint32_t writers = 1;
  uint32_t records = 200;  // of each writer, until the faults end
  const char *maxFileBytes = "600";
  bool freshFolder = false;       // the handler makes it; else it has other people's files
  bool earlier = false;           // the active file is there, and full
  bool reconfigures = false;      // now and then, so that the file is closed and opened
  bool mayLoseCopies = false;     // empties the active file also when its copy failed
  const char *cutWhen = nullptr;  // writes that are short besides: after them, calls may fail that
                                  // clean up. Then pieces may be left, on lines of their own.
  std::vector<std::pair<const char *, const char *>> settings = {};
};

// Null when there is none of this name.
const Variant *findVariant(std::string_view name);
std::string variantNames();

inline std::string textOf(RecordId id) {
  return recordText(id, kPadding);
}

#endif
