// The decimal digits of a 64-bit number, for every text that wants them. Header only.
#ifndef QLX_SRC_CXDECIMAL_H
#define QLX_SRC_CXDECIMAL_H

#include <cstdint>

inline constexpr int kMaxDecimalDigits = 20;  // of 18446744073709551615

// The value of -negative, also for the most negative number, which has no positive form of its
// type.
constexpr uint64_t cxMagnitude(int64_t value) {
  return value < 0 ? 0 - static_cast<uint64_t>(value) : static_cast<uint64_t>(value);
}

// Writes the digits so that they end before `end`, and returns the first; 0 has the one digit
// `zero`.
template <typename Char>
Char *cxDecimalBefore(Char *end, uint64_t value, Char zero) {
  do {
    *--end = static_cast<Char>(zero + value % 10);
    value /= 10;
  } while (value != 0);
  return end;
}

#endif
