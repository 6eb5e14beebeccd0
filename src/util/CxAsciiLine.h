// A line of bytes that holds as long as all of it is ASCII and fits: nearly every line of a log.
// Its appending functions answer whether it still holds; after a false nothing was appended.
// Header only; nothing is allocated.
#ifndef QLX_SRC_CXASCIILINE_H
#define QLX_SRC_CXASCIILINE_H

#include <array>
#include <cstring>
#include <string_view>

#include "CxUnits.h"

class CxAsciiLine {
 public:
  const char *data() const { return bytes_.data(); }
  uint32_t length() const { return static_cast<uint32_t>(length_); }

  void clear() { length_ = 0; }

  bool append(std::string_view text) {
    if (text.size() > room() || !cxCopyAscii(end(), text.data(), text.size())) return false;
    length_ += text.size();
    return true;
  }

  // What is known to be ASCII.
  bool appendAscii(std::string_view text) {
    if (text.size() > room()) return false;
    std::memcpy(end(), text.data(), text.size());
    length_ += text.size();
    return true;
  }

  // Nothing is appended either, and the line still holds, when a unit has the property that
  // `isUnwanted` tells, see cxAnyUnit().
  template <typename Test = CxNoUnit>
  bool append(const UChar *text, size_t units, Test isUnwanted = {}) {
    if (units > room() || !cxNarrowAscii(end(), text, units, isUnwanted)) return false;
    length_ += units;
    return true;
  }

 private:
  size_t room() const { return bytes_.size() - length_; }
  char *end() { return bytes_.data() + length_; }

  std::array<char, 4096> bytes_;  // not cleared
  size_t length_ = 0;
};

#endif
