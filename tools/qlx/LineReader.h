// Lines of a descriptor as UTF-16.
#ifndef QLX_TOOLS_LINEREADER_H
#define QLX_TOOLS_LINEREADER_H

#include <array>
#include <cstdint>
#include <string>

#include <unicode/localpointer.h>
#include <unicode/ucnv.h>

#include "StopSignal.h"

// Bytes are decoded by ICU's default converter, as the library encodes them again: UTF-8 here. What
// is no text in it becomes U+FFFD, and so does NUL, which ends a text in the library. A line of
// more than kMaxLineBytes comes in pieces. A last line needs no line feed. After a stop, what was
// read already still comes, and then the end.
class LineReader {
 public:
  static constexpr size_t kMaxLineBytes = 1 << 20;

  // Both are borrowed.
  LineReader(int descriptor, const StopSignal &stop);

  // The next line without its line feed; false at the end.
  bool next(std::u16string &line);

  // The error number of the read that ended the input, else 0.
  int error() const { return error_; }
  uint64_t bytesRead() const { return bytesRead_; }

 private:
  bool fill();
  bool hasBytes() { return at_ < end_ || fill(); }
  void decode(std::u16string &line, size_t count, bool isLineEnd);

  const int descriptor_;
  const StopSignal &stop_;
  icu::LocalUConverterPointer converter_;
  std::array<char, 1 << 16> buffer_;
  size_t at_ = 0, end_ = 0;  // what of the buffer has not been decoded yet
  bool isPiece_ = false;     // the last line was cut: its rest follows, perhaps a bare line feed
  uint64_t bytesRead_ = 0;
  int error_ = 0;
};

#endif
