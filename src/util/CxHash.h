// The hashes of the library: every index finds its slots by them.
#ifndef QLX_SRC_CXHASH_H
#define QLX_SRC_CXHASH_H

#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <string_view>

inline constexpr uint64_t kCxHashSpread = 0x9E3779B97F4A7C15;

// Of a name.
inline uint32_t cxHashText(const char *text) {
  uint32_t hash = 2166136261U;  // FNV-1a
  for (; *text; ++text) hash = (hash ^ static_cast<uint8_t>(*text)) * 16777619U;
  return hash;
}

// Of an identity: where the block starts.
inline uint32_t cxHashAddress(const void *block) {
  return static_cast<uint32_t>((reinterpret_cast<uintptr_t>(block) * kCxHashSpread) >> 32);
}

// Of a longer text, without reading all of it: from the length, and the units at both ends and in
// the middle.
inline uint32_t cxHashEnds(std::u16string_view text) {
  constexpr size_t kUnits = sizeof(uint64_t) / sizeof(char16_t);
  uint64_t hash = text.size() * kCxHashSpread;
  const auto add = [&](uint64_t units) { hash = (hash ^ units) * kCxHashSpread; };
  if (text.size() < kUnits) {
    for (const char16_t unit : text) add(unit);
    return static_cast<uint32_t>(hash >> 32);
  }
  const size_t last = text.size() - kUnits;
  for (const size_t at : {size_t{0}, last / 2, last}) {
    uint64_t units;
    std::memcpy(&units, text.data() + at, sizeof units);
    add(units);
  }
  return static_cast<uint32_t>(hash >> 32);
}

#endif
