// The shape of a plain decimal format: its digits, separators, groups and signs as data, by which
// common numbers are written without ICU. A shape is used only when it has written a fixed set of
// numbers just as its format does. Numbers that are very large, or whose rounding is in doubt, are
// left to the format.
#ifndef QLX_SRC_QLXNUMBERSHAPE_H
#define QLX_SRC_QLXNUMBERSHAPE_H

#include <array>
#include <cstdint>

#include <unicode/numfmt.h>

#include <qlx/base.h>

#include "QlxArgType.h"

struct NumberAffix {
  uint8_t length;
  std::array<UChar, 7> units;
};

struct NumberShape {
  std::array<UChar, 10> digits;
  UChar decimalSeparator, groupSeparator;
  int32_t groupSize;                          // of the group before the decimal separator
  int32_t otherGroupSize;                     // of the groups before that one
  uint64_t groupsFrom;                        // the least whole number that has groups
  int32_t fractionDigits;                     // at most; trailing zeros are left out
  std::array<NumberAffix, 2> prefix, suffix;  // [0]: of zero and positive numbers, [1]: negative
};

// Room for any number that a shape writes.
inline constexpr uint32_t kMaxShapedUnits = 64;

// Takes the shape of a format for integers or doubles; false when it has none.
bool qlxTakeNumberShape(NumberShape *shape, const icu::NumberFormat *format, ArgType type);

// Write a number at `out`, which has room for kMaxShapedUnits, and return the end of what they
// wrote. Null: the format has to write it; no integer is such a number.
UChar *qlxWriteShapedInteger(const NumberShape &shape, int32_t value, UChar *out);
UChar *qlxWriteShapedDouble(const NumberShape &shape, double value, UChar *out);

#endif
