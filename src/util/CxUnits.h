// Loops over text that run on blocks of 16 bytes: the length of UTF-16 text, and ASCII between its
// two widths. Header only.
#ifndef QLX_SRC_CXUNITS_H
#define QLX_SRC_CXUNITS_H

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#ifdef __SSE2__
#include <emmintrin.h>
#endif

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

// The same for the result of a comparison, whose lanes have all bits alike.
template <typename Block>
bool cxAnyMatch(Block block) {
#ifdef __SSE2__
  __m128i lanes;
  static_assert(sizeof lanes == sizeof block);
  std::memcpy(&lanes, &block, sizeof lanes);
  return _mm_movemask_epi8(lanes) != 0;
#else
  return cxAnyLane(block);
#endif
}

// Calls step(offset) for blocks of `size` that cover all of a length of at least one of them: the
// last one begins within the one before it, which costs less than a loop over single units.
template <size_t size, typename Step>
inline void cxForBlocks(size_t length, Step step) {
  size_t at = 0;
  for (; at + size <= length; at += size) step(at);
  if (at < length) step(length - size);
}

#ifndef QLX_ONE_UNIT_AT_ONCE

// The place of the first lane that is not zero, of a comparison's result; kBlockUnits for none.
inline size_t cxFirstLane(CxUnitBlock block) {
  static_assert(std::endian::native == std::endian::little);
  CxWordBlock words;
  std::memcpy(&words, &block, sizeof words);
  if (words[0] != 0) return static_cast<size_t>(std::countr_zero(words[0])) / 16;
  if (words[1] != 0) return static_cast<size_t>(std::countr_zero(words[1])) / 16 + kBlockUnits / 2;
  return kBlockUnits;
}

#endif

// The length of a terminated text.
inline size_t cxUnitsLength(const UChar *text) {
  const UChar *at = text;
#ifndef QLX_ONE_UNIT_AT_ONCE
  // What lies behind the terminator may be loaded as long as it is in the same page, and a block at
  // its own alignment always is; sanitizers of addresses and threads think otherwise.
  constexpr uintptr_t kSmallestPage = 4096;
  constexpr uintptr_t kBlockBytes = sizeof(CxUnitBlock);
  const auto address = reinterpret_cast<uintptr_t>(text);
  if (address % 2 == 0 && address % kSmallestPage <= kSmallestPage - kBlockBytes) {
    if (const size_t first = cxFirstLane(cxLoadUnits(text) == 0); first < kBlockUnits) return first;
    at += kBlockUnits - address % kBlockBytes / sizeof(UChar);
    while (!cxAnyMatch(cxLoadUnits(at) == 0)) at += kBlockUnits;
    return static_cast<size_t>(at - text) + cxFirstLane(cxLoadUnits(at) == 0);
  }
#endif
  while (*at != 0) ++at;
  return static_cast<size_t>(at - text);
}

// Whether any of the units, or of the lanes of a block, has the property that `test` tells.
template <typename Test>
bool cxAnyUnit(const UChar *text, size_t length, Test test) {
  if (length >= kBlockUnits) {
    decltype(test(CxUnitBlock{})) found = {};
    cxForBlocks<kBlockUnits>(length, [&](size_t at) { found |= test(cxLoadUnits(text + at)); });
    return cxAnyMatch(found);
  }
  for (; length > 0; --length, ++text)
    if (test(static_cast<uint16_t>(*text))) return true;
  return false;
}

// What no unit is.
struct CxNoUnit {
  template <typename Units>
  auto operator()(Units units) const {
    return units != units;
  }
};

// Narrows ASCII; the two do not overlap. False, with `out` in any state, when not all of it is, or
// when a unit has the property that `isUnwanted` tells, see cxAnyUnit().
template <typename Test = CxNoUnit>
bool cxNarrowAscii(char *out, const UChar *text, size_t length, Test isUnwanted = {}) {
  if (length >= kBlockUnits) {
    CxUnitBlock seen = {};
    decltype(isUnwanted(seen)) unwanted = {};
    cxForBlocks<kBlockUnits>(length, [&](size_t at) {
      const CxUnitBlock units = cxLoadUnits(text + at);
      seen |= units;
      unwanted |= isUnwanted(units);
      const CxByteBlock bytes = __builtin_convertvector(units, CxByteBlock);
      std::memcpy(out + at, &bytes, sizeof bytes);
    });
    return !cxAnyLane(seen & 0xFF80) && !cxAnyMatch(unwanted);
  }
  uint16_t seen = 0;
  bool unwanted = false;
  for (; length > 0; --length, ++text) {
    seen |= *text;
    unwanted |= static_cast<bool>(isUnwanted(static_cast<uint16_t>(*text)));
    *out++ = static_cast<char>(*text);
  }
  return seen < 0x80 && !unwanted;
}

// Copies ASCII; the two do not overlap. False, with `out` in any state, when not all of it is.
inline bool cxCopyAscii(char *out, const char *text, size_t length) {
  constexpr uint64_t kHighBits = 0x8080808080808080U;
  uint64_t seen = 0;
  const auto copy = [&]<typename Word>(Word word, size_t at) {
    std::memcpy(&word, text + at, sizeof word);
    seen |= word;
    std::memcpy(out + at, &word, sizeof word);
  };
  if (length >= sizeof(uint64_t)) {
    cxForBlocks<sizeof(uint64_t)>(length, [&](size_t at) { copy(uint64_t{}, at); });
  } else if (length >= sizeof(uint32_t)) {
    cxForBlocks<sizeof(uint32_t)>(length, [&](size_t at) { copy(uint32_t{}, at); });
  } else {
    for (size_t at = 0; at < length; ++at) copy(uint8_t{}, at);
  }
  return (seen & kHighBits) == 0;
}

// Widens ASCII; the two do not overlap. False, with `out` in any state, when not all of it is.
inline bool cxWidenAscii(UChar *out, const char *text, size_t length) {
  if (length >= kBlockUnits) {
    CxUnitBlock seen = {};
    cxForBlocks<kBlockUnits>(length, [&](size_t at) {
      CxByteBlock bytes;
      std::memcpy(&bytes, text + at, sizeof bytes);
      const CxUnitBlock units = __builtin_convertvector(bytes, CxUnitBlock);
      seen |= units;
      std::memcpy(out + at, &units, sizeof units);
    });
    return !cxAnyLane(seen & 0xFF80);
  }
  uint8_t seen = 0;
  for (; length > 0; --length) {
    const auto byte = static_cast<uint8_t>(*text++);
    seen |= byte;
    *out++ = byte;
  }
  return seen < 0x80;
}

#endif
