// Loops over text that run on blocks of 16 bytes: the length of UTF-16 text, and ASCII between its
// two widths. Header only.
#ifndef QLX_SRC_CXUNITS_H
#define QLX_SRC_CXUNITS_H

#include <cstddef>
#include <cstdint>
#include <cstring>

#include <qlx/base.h>

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define QLX_ONE_UNIT_AT_ONCE
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define QLX_ONE_UNIT_AT_ONCE
#endif
#endif

inline constexpr size_t kBlockUnits = 8;
typedef uint16_t CxUnitBlock __attribute__((vector_size(2 * kBlockUnits)));
typedef uint8_t CxByteBlock __attribute__((vector_size(kBlockUnits)));
typedef uint64_t CxWordBlock __attribute__((vector_size(2 * kBlockUnits)));

inline CxUnitBlock cxLoadUnits(const UChar *text) {
  CxUnitBlock block;
  std::memcpy(&block, text, sizeof block);
  return block;
}

// Whether any lane is not zero.
template <typename Block>
bool cxAnyLane(Block block) {
  CxWordBlock words;
  static_assert(sizeof words == sizeof block);
  std::memcpy(&words, &block, sizeof words);
  return (words[0] | words[1]) != 0;
}

// The length of a terminated text.
inline size_t cxUnitsLength(const UChar *text) {
  const UChar *at = text;
#ifndef QLX_ONE_UNIT_AT_ONCE
  // A block at its own alignment never reaches into another page than its first unit, so what lies
  // behind the terminator may be loaded; sanitizers of addresses and threads think otherwise.
  for (; reinterpret_cast<uintptr_t>(at) % sizeof(CxUnitBlock) != 0; ++at)
    if (*at == 0) return static_cast<size_t>(at - text);
  while (!cxAnyLane(cxLoadUnits(at) == 0)) at += kBlockUnits;
#endif
  while (*at != 0) ++at;
  return static_cast<size_t>(at - text);
}

// Whether any of the units, or of the lanes of a block, has the property that `test` tells.
template <typename Test>
bool cxAnyUnit(const UChar *text, size_t length, Test test) {
  for (; length >= kBlockUnits; text += kBlockUnits, length -= kBlockUnits)
    if (cxAnyLane(test(cxLoadUnits(text)))) return true;
  for (; length > 0; --length, ++text)
    if (test(static_cast<uint16_t>(*text))) return true;
  return false;
}

// Narrows ASCII. False, with `out` in any state, when not all of it is.
inline bool cxNarrowAscii(char *out, const UChar *text, size_t length) {
  CxUnitBlock seen = {};
  for (; length >= kBlockUnits; length -= kBlockUnits, text += kBlockUnits, out += kBlockUnits) {
    const CxUnitBlock units = cxLoadUnits(text);
    seen |= units;
    const CxByteBlock bytes = __builtin_convertvector(units, CxByteBlock);
    std::memcpy(out, &bytes, sizeof bytes);
  }
  uint16_t rest = 0;
  for (; length > 0; --length) {
    rest |= *text;
    *out++ = static_cast<char>(*text++);
  }
  return rest < 0x80 && !cxAnyLane(seen & 0xFF80);
}

// Copies ASCII. False, with `out` in any state, when not all of it is.
inline bool cxCopyAscii(char *out, const char *text, size_t length) {
  uint64_t seen = 0;
  for (; length >= sizeof seen; length -= sizeof seen, text += sizeof seen, out += sizeof seen) {
    uint64_t bytes;
    std::memcpy(&bytes, text, sizeof bytes);
    seen |= bytes;
    std::memcpy(out, &bytes, sizeof bytes);
  }
  uint8_t rest = 0;
  for (; length > 0; --length) {
    rest |= static_cast<uint8_t>(*text);
    *out++ = *text++;
  }
  return ((seen | rest) & 0x8080808080808080U) == 0;
}

// Widens ASCII. False, with `out` in any state, when not all of it is.
inline bool cxWidenAscii(UChar *out, const char *text, size_t length) {
  CxUnitBlock seen = {};
  for (; length >= kBlockUnits; length -= kBlockUnits, text += kBlockUnits, out += kBlockUnits) {
    CxByteBlock bytes;
    std::memcpy(&bytes, text, sizeof bytes);
    const CxUnitBlock units = __builtin_convertvector(bytes, CxUnitBlock);
    seen |= units;
    std::memcpy(out, &units, sizeof units);
  }
  uint8_t rest = 0;
  for (; length > 0; --length) {
    const auto byte = static_cast<uint8_t>(*text++);
    rest |= byte;
    *out++ = byte;
  }
  return rest < 0x80 && !cxAnyLane(seen & 0xFF80);
}

#endif
