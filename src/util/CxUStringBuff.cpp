// The growable UTF-16 buffer that records are formatted in. Text is converted straight into the
// block wherever its length there is known or fits; nothing else is allocated then.
#include "CxUStringBuff.h"

#include <cstring>
#include <string_view>

#include "CxDecimal.h"
#include "CxOwned.h"
#include "CxStringBuff.h"
#include "CxUString.h"
#include "CxUnits.h"

static constexpr uint32_t kFirstCapacityBytes = 1024;

uint8_t cxUStringBuffHasCapacity(CxUStringBuff *buffer, uint32_t extra) {
  if (!buffer) return 0;
  if (!buffer->data) {
    auto *block = static_cast<UChar *>(OslMemoryMalloc(kFirstCapacityBytes));
    if (!block) return 0;
    block[0] = 0;
    *buffer = {0, kFirstCapacityBytes, block};
  }
  const uint64_t needed = (uint64_t{buffer->length} + extra + 1) * sizeof(UChar);
  if (needed <= buffer->capacity) return 1;
  const uint32_t capacity = cxGrownCapacity(buffer->capacity, needed);
  auto *block = static_cast<UChar *>(OslMemoryRealloc(buffer->data, capacity));
  if (!block) return 0;
  buffer->data = block;
  buffer->capacity = capacity;
  return 1;
}

static UChar *endOf(CxUStringBuff *buffer) {
  return buffer->data + buffer->length;
}

// Counts units that stand behind the text already.
static uint8_t extend(CxUStringBuff *buffer, uint32_t units) {
  buffer->length += units;
  *endOf(buffer) = 0;
  return 1;
}

// Whether a text lies in the buffer's own block, which growing may move.
static bool isOwn(const CxUStringBuff *buffer, const UChar *text) {
  const auto start = reinterpret_cast<uintptr_t>(buffer->data);
  const auto place = reinterpret_cast<uintptr_t>(text);
  return buffer->data && place >= start && place - start <= buffer->length * sizeof(UChar);
}

uint8_t cxUStringBuffAppendUnits(CxUStringBuff *buffer, const UChar *text, uint32_t units) {
  if (!buffer) return 0;
  const bool own = isOwn(buffer, text);
  const size_t offset = own ? static_cast<size_t>(text - buffer->data) : 0;
  if (!cxUStringBuffHasCapacity(buffer, units)) return 0;
  std::memcpy(endOf(buffer), own ? buffer->data + offset : text, units * sizeof(UChar));
  return extend(buffer, units);
}

// Appends bytes of the default code page, none of them zero. The buffer grows by what they become,
// so what might become shorter and does not fit as it is takes the way over a copy.
static uint8_t appendBytes(CxUStringBuff *buffer, const char *text, uint32_t bytes) {
  const bool plainAndLong = buffer && buffer->data && !cxUStringBuffFits(buffer, bytes) &&
                            cxUStringIsPlainAscii(text, bytes);
  if (!cxUStringBuffHasCapacity(buffer, plainAndLong ? bytes : 0)) return 0;
  if (cxUStringBuffFits(buffer, bytes)) {  // no byte becomes more than a unit
    if (cxUStringWiden(endOf(buffer), text, bytes)) return extend(buffer, bytes);
    return extend(buffer, cxUStringConvert(endOf(buffer), text, bytes));
  }
  if (bytes >= kMaxBuffBytes) return 0;
  const OwnedUStr units{
      static_cast<UChar *>(OslMemoryMalloc((bytes + 1) * static_cast<uint32_t>(sizeof(UChar))))};
  if (!units) return 0;
  return cxUStringBuffAppendUnits(buffer, units.get(), cxUStringConvert(units.get(), text, bytes));
}

uint8_t cxUStringBuffAppend(CxUStringBuff *buffer, std::string_view text) {
  return appendBytes(buffer, text.data(), static_cast<uint32_t>(text.size()));
}

uint8_t cxUStringBuffAppendAscii(CxUStringBuff *buffer, std::string_view text) {
  const auto units = static_cast<uint32_t>(text.size());
  if (!cxUStringBuffHasCapacity(buffer, units)) return 0;
  cxWidenAscii(endOf(buffer), text.data(), units);
  return extend(buffer, units);
}

uint8_t CxUStringBuffAppendChar(CxUStringBuff *buffer, char character) {
  return appendBytes(buffer, &character, character ? 1 : 0);
}

uint8_t CxUStringBuffAppendStr(CxUStringBuff *buffer, const char *text) {
  return text ? appendBytes(buffer, text, OslStringLen(text)) : 0;
}

uint8_t CxUStringBuffAppendStrN(CxUStringBuff *buffer, const char *text, int32_t count) {
  if (count == -1) return CxUStringBuffAppendStr(buffer, text);
  if (!text) return 0;
  const size_t bytes = count > 0 ? strnlen(text, static_cast<size_t>(count)) : 0;
  return appendBytes(buffer, text, static_cast<uint32_t>(bytes));
}

uint8_t CxUStringBuffAppendUStr(CxUStringBuff *buffer, const UChar *text) {
  return text ? cxUStringBuffAppendUnits(buffer, text, static_cast<uint32_t>(cxUnitsLength(text)))
              : 0;
}

uint8_t CxUStringBuffAppendInt32(CxUStringBuff *buffer, int32_t value) {
  return CxUStringBuffAppendInt64(buffer, value);
}

// Deliberate: the 64 bits are written as an unsigned number, whatever their sign.
uint8_t CxUStringBuffAppendInt64(CxUStringBuff *buffer, int64_t value) {
  return CxUStringBuffAppendUInt64(buffer, static_cast<uint64_t>(value));
}

uint8_t CxUStringBuffAppendUInt64(CxUStringBuff *buffer, uint64_t value) {
  UChar digits[kMaxDecimalDigits];
  UChar *const end = digits + kMaxDecimalDigits;
  const UChar *first = cxDecimalBefore(end, value, u'0');
  return cxUStringBuffAppendUnits(buffer, first, static_cast<uint32_t>(end - first));
}

UChar *CxUStringBuffTakeUStr(CxUStringBuff *buffer) {
  if (!buffer) return nullptr;
  UChar *text = buffer->data;
  *buffer = {};
  return text;
}

void CxUStringBuffRestart(CxUStringBuff *buffer) {
  if (!buffer) return;
  buffer->length = 0;
  if (buffer->data) buffer->data[0] = 0;
}

void CxUStringBuffDiscard(CxUStringBuff *buffer) {
  OslMemoryFree(CxUStringBuffTakeUStr(buffer));
}
