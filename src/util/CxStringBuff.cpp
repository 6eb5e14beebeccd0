// The growable 8-bit buffer. Every append makes room first and then cannot fail, so a failed one
// leaves the text as it was.
#include "CxStringBuff.h"

#include <cstring>

#include "CxDecimal.h"
#include "CxOwned.h"

static constexpr uint32_t kFirstCapacity = 1024;

uint8_t cxStringBuffHasCapacity(CxStringBuff *buffer, int64_t extra) {
  if (!buffer) return 0;
  if (!buffer->data) {
    auto *block = static_cast<char *>(OslMemoryMalloc(kFirstCapacity));
    if (!block) return 0;
    block[0] = 0;
    *buffer = {0, kFirstCapacity, block};
  }
  const int64_t needed = int64_t{buffer->length} + extra + 1;
  if (needed <= int64_t{buffer->capacity}) return 1;
  const uint32_t capacity = cxGrownCapacity(buffer->capacity, static_cast<uint64_t>(needed));
  auto *block = static_cast<char *>(OslMemoryRealloc(buffer->data, capacity));
  if (!block) return 0;
  buffer->data = block;
  buffer->capacity = capacity;
  return 1;
}

// Copies bytes behind the text, where room was made for them.
static void put(CxStringBuff *buffer, const char *bytes, uint32_t count) {
  std::memcpy(buffer->data + buffer->length, bytes, count);
  buffer->length += count;
  buffer->data[buffer->length] = 0;
}

// Whether a text lies in the buffer's own block, which growing may move.
static bool isOwn(const CxStringBuff *buffer, const char *text) {
  const auto start = reinterpret_cast<uintptr_t>(buffer->data);
  const auto place = reinterpret_cast<uintptr_t>(text);
  return buffer->data && place >= start && place - start <= buffer->length;
}

// Makes room for `room` bytes and appends `count` of them, also from the buffer's own text.
static uint8_t append(CxStringBuff *buffer, const char *text, uint32_t count, int64_t room) {
  if (!buffer) return 0;
  const bool own = isOwn(buffer, text);
  const size_t offset = own ? static_cast<size_t>(text - buffer->data) : 0;
  if (!cxStringBuffHasCapacity(buffer, room)) return 0;
  put(buffer, own ? buffer->data + offset : text, count);
  return 1;
}

uint8_t CxStringBuffAppendChar(CxStringBuff *buffer, char byte) {
  if (!cxStringBuffHasCapacity(buffer, 1)) return 0;
  buffer->data[buffer->length++] = byte;
  buffer->data[buffer->length] = 0;
  return 1;
}

namespace {
struct Utf8Form {
  int32_t limit;  // the highest code point of this form; negative ones are below every limit
  uint8_t lead, leadMask;
};
}  // namespace

// One row for each length in bytes. Deliberate: the two-byte form ends at 0x7FE.
static constexpr Utf8Form kUtf8Forms[] = {
    {0x7F, 0x00, 0x7F},     {0x7FE, 0xC0, 0x1F},     {0xFFFF, 0xE0, 0x0F},
    {0x1FFFFF, 0xF0, 0x07}, {0x3FFFFFF, 0xF8, 0x03}, {INT32_MAX, 0xFC, 0x01},
};

uint8_t CxStringBuffAppendUTF32Char(CxStringBuff *buffer, int32_t codePoint) {
  uint32_t count = 0;
  for (const Utf8Form &form : kUtf8Forms) {
    ++count;
    if (codePoint > form.limit || !cxStringBuffHasCapacity(buffer, count)) continue;
    const auto bits = static_cast<uint32_t>(codePoint);
    char bytes[6];
    bytes[0] = static_cast<char>(form.lead | (bits >> 6 * (count - 1) & form.leadMask));
    for (uint32_t i = 1; i < count; ++i)
      bytes[i] = static_cast<char>(0x80 | (bits >> 6 * (count - 1 - i) & 0x3F));
    put(buffer, bytes, count);
    return 1;
  }
  return 0;
}

uint8_t CxStringBuffAppendUCS2Char(CxStringBuff *buffer, UChar unit) {
  return CxStringBuffAppendUTF32Char(buffer, unit);
}

static uint8_t appendSigned(CxStringBuff *buffer, int64_t value, char zero, char minus) {
  char digits[kMaxDecimalDigits + 1];
  char *const end = digits + sizeof digits;
  char *first = cxDecimalBefore(end, cxMagnitude(value), zero);
  if (value < 0) *--first = minus;
  const auto count = static_cast<uint32_t>(end - first);
  return append(buffer, first, count, count);
}

uint8_t CxStringBuffAppendInt32(CxStringBuff *buffer, int32_t value) {
  return CxStringBuffAppendInt64(buffer, value);
}

uint8_t CxStringBuffAppendInt64(CxStringBuff *buffer, int64_t value) {
  return appendSigned(buffer, value, '0', '-');
}

// Deliberate: digit by digit, and 1 also when memory ends among the digits.
uint8_t CxStringBuffAppendUInt64(CxStringBuff *buffer, uint64_t value) {
  if (!buffer) return 0;
  char digits[kMaxDecimalDigits];
  char *const end = digits + sizeof digits;
  for (const char *digit = cxDecimalBefore(end, value, '0'); digit < end; ++digit)
    CxStringBuffAppendChar(buffer, *digit);
  return 1;
}

// Deliberate: zero has no digits here.
uint8_t CxStringBuffAppendEBCDICInt64(CxStringBuff *buffer, int64_t value) {
  if (value == 0) return append(buffer, "", 0, 0);
  return appendSigned(buffer, value, '\xF0', '\x60');
}

uint8_t CxStringBuffAppendStr(CxStringBuff *buffer, const char *text) {
  return CxStringBuffAppendStrN(buffer, text, -1);
}

uint8_t CxStringBuffAppendStrN(CxStringBuff *buffer, const char *text, int32_t count) {
  if (!text) return 0;
  if (count == -1) {
    const uint32_t length = OslStringLen(text);
    return append(buffer, text, length, length);
  }
  const size_t copied = count > 0 ? strnlen(text, static_cast<size_t>(count)) : 0;
  return append(buffer, text, static_cast<uint32_t>(copied), count);
}

uint8_t CxStringBuffInsertStr(CxStringBuff *buffer, const char *text, int32_t position) {
  if (!buffer || !text || position < 0 || static_cast<uint32_t>(position) > buffer->length)
    return 0;
  const bool own = isOwn(buffer, text);
  const OwnedStr copy{own ? OslStringDup(text) : nullptr};
  const char *source = own ? copy.get() : text;
  if (!source) return 0;
  const uint32_t count = OslStringLen(source);
  // Deliberate: the text's own length is asked for once more beside what is inserted.
  if (!cxStringBuffHasCapacity(buffer, int64_t{buffer->length} + count)) return 0;
  char *place = buffer->data + position;
  std::memmove(place + count, place, buffer->length - static_cast<uint32_t>(position) + 1);
  std::memcpy(place, source, count);
  buffer->length += count;
  return 1;
}

char *CxStringBuffTakeStr(CxStringBuff *buffer) {
  if (!buffer) return nullptr;
  char *text = buffer->data;
  *buffer = {};
  return text;
}

const char *CxStringBuffPeekStr(const CxStringBuff *buffer) {
  return buffer ? buffer->data : nullptr;
}

char *CxStringBuffCopyStr(const CxStringBuff *buffer) {
  return OslStringDup(CxStringBuffPeekStr(buffer));
}

void CxStringBuffRestart(CxStringBuff *buffer) {
  if (!buffer) return;
  buffer->length = 0;
  if (buffer->data) buffer->data[0] = 0;
}

void CxStringBuffDiscard(CxStringBuff *buffer) {
  OslMemoryFree(CxStringBuffTakeStr(buffer));
}

uint8_t CxStringBuffPack(CxStringBuff *buffer) {
  if (!buffer) return 0;
  if (buffer->length == 0) {
    CxStringBuffDiscard(buffer);
    return 1;
  }
  if (buffer->capacity == buffer->length + 1) return 0;  // Deliberate: nothing to do is a 0
  auto *block = static_cast<char *>(OslMemoryRealloc(buffer->data, buffer->length + 1));
  if (!block) return 0;
  buffer->data = block;
  buffer->capacity = buffer->length + 1;
  return 1;
}
