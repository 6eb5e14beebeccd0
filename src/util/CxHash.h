// The one hash of the library: every index over names or objects finds its slots by it.
#ifndef QLX_SRC_CXHASH_H
#define QLX_SRC_CXHASH_H

#include <cstdint>

inline uint32_t cxHashText(const char *text) {
  uint32_t hash = 2166136261U;  // FNV-1a
  for (; *text; ++text) hash = (hash ^ static_cast<uint8_t>(*text)) * 16777619U;
  return hash;
}

// Of an identity: where the block starts.
inline uint32_t cxHashAddress(const void *block) {
  return static_cast<uint32_t>((reinterpret_cast<uintptr_t>(block) * 0x9E3779B97F4A7C15U) >> 32);
}

#endif
