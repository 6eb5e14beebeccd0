// The room check of the 8-bit buffer.
#ifndef QLX_SRC_CXSTRINGBUFF_H
#define QLX_SRC_CXSTRINGBUFF_H

#include <qlx/buffers.h>

QLX_BEGIN_DECLS

// No block of a buffer passes this many bytes.
inline constexpr uint32_t kMaxBuffBytes = uint32_t{1} << 30;

// Doubles `capacity` while it does not exceed `needed` bytes: the result is larger than `needed`,
// or 0 when it would pass the limit.
constexpr uint32_t cxGrownCapacity(uint32_t capacity, uint64_t needed) {
  if (needed >= kMaxBuffBytes) return 0;
  while (capacity <= needed) capacity *= 2;
  return capacity <= kMaxBuffBytes ? capacity : 0;
}

// Makes room for `extra` bytes and the terminator behind the text; makes the first block. Returns
// 1, or 0 with the text unchanged.
uint8_t cxStringBuffHasCapacity(CxStringBuff *buffer, int64_t extra);

QLX_END_DECLS

#endif
