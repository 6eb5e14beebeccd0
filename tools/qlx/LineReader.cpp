#include "LineReader.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

#include <unistd.h>

LineReader::LineReader(int descriptor, const StopSignal &stop)
    : descriptor_(descriptor), stop_(stop) {
  UErrorCode status = U_ZERO_ERROR;
  converter_.adoptInstead(ucnv_open(nullptr, &status));
  if (U_FAILURE(status)) error_ = ENOTSUP;
}

bool LineReader::fill() {
  if (error_ != 0 || !stop_.waitReadable(descriptor_)) return false;
  const ssize_t count = read(descriptor_, buffer_.data(), buffer_.size());
  if (count < 0) error_ = errno;
  if (count <= 0) return false;
  at_ = 0;
  end_ = static_cast<size_t>(count);
  bytesRead_ += end_;
  return true;
}

// Takes the next bytes of the buffer. The converter keeps an unfinished character between two
// calls, and gives it up at a line end.
void LineReader::decode(std::u16string &line, size_t count, bool isLineEnd) {
  const char *source = buffer_.data() + at_;
  const char *const sourceEnd = source + count;
  at_ += count;
  UErrorCode status;
  do {
    const size_t length = line.size();
    line.resize(length + count + 16);
    UChar *target = line.data() + length;
    status = U_ZERO_ERROR;
    ucnv_toUnicode(converter_.getAlias(), &target, line.data() + line.size(), &source, sourceEnd,
                   nullptr, static_cast<UBool>(isLineEnd), &status);
    line.resize(target - line.data());
  } while (status == U_BUFFER_OVERFLOW_ERROR);
}

bool LineReader::next(std::u16string &line) {
  line.clear();
  bool isLineEnd = false;
  size_t bytes = 0;
  while (!isLineEnd && bytes < kMaxLineBytes && hasBytes()) {
    const char *const from = buffer_.data() + at_;
    const size_t most = std::min(end_ - at_, kMaxLineBytes - bytes);
    const void *const lineFeed = memchr(from, '\n', most);
    isLineEnd = lineFeed != nullptr;
    const size_t count = isLineEnd ? static_cast<const char *>(lineFeed) - from : most;
    decode(line, count, isLineEnd);
    bytes += count;
    if (!isLineEnd) continue;
    ++at_;
    if (isPiece_ && bytes == 0 && line.empty()) isPiece_ = isLineEnd = false;
  }
  isPiece_ = !isLineEnd && bytes == kMaxLineBytes;
  if (!isLineEnd && !isPiece_) decode(line, 0, true);
  if (!isLineEnd && bytes == 0 && line.empty()) return false;
  std::replace(line.begin(), line.end(), u'\0', u'\xFFFD');
  return true;
}
