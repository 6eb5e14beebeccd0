// The bytes of a properties file, read whole before the first of them counts: what is slow to
// answer is so waited for without the API lock.
#ifndef QLX_SRC_QLXPROPSFILE_H
#define QLX_SRC_QLXPROPSFILE_H

#include <span>

#include <qlx/memory.h>
#include <qlx/types.h>

#include "util/CxOwned.h"

inline constexpr uint32_t kMaxPropsBytes = 64 << 20;
inline constexpr uint32_t kMaxPropsPathBytes = 256;

struct QlxPropsFile {
  Owned<uint8_t, OslMemoryFree> block;
  uint32_t length = 0;
  bool isWhole = false;        // read to its end
  CxStatus status = {'-', 0};  // of the system; success also when memory ran out

  std::span<const uint8_t> bytes() const { return {block.get(), length}; }
};

// Reads a regular file, or a pipe until its end, for which it waits. Interrupted, it goes on;
// the caller sees to it that the thread is not cancelled. A folder, a device or a socket, a path of
// more than kMaxPropsPathBytes and a file of more than kMaxPropsBytes are refused, with no bytes.
QlxPropsFile qlxLoadProps(const char *path);

#endif
