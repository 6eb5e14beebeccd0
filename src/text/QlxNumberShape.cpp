#include "QlxNumberShape.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include <unicode/dcfmtsym.h>
#include <unicode/decimfmt.h>

#include "util/CxDecimal.h"

// Powers of ten are exact, and so are whole numbers below the bound.
static constexpr double kTenTo[] = {1, 1e1, 1e2, 1e3, 1e4, 1e5, 1e6};
static constexpr int32_t kMaxFractionDigits = 6;
static constexpr double kMaxScaled = 1125899906842624.0;  // 2^50
static constexpr double kTieMargin = 0x1p-51;

// ---- Writing

static UChar *writeAffix(const NumberAffix &affix, UChar *out) {
  std::memcpy(out, affix.units.data(), sizeof affix.units);
  return out + affix.length;
}

// Writes a whole number so that it ends before `end`, and returns its first unit.
static UChar *wholeBefore(const NumberShape &shape, uint64_t value, UChar *end) {
  int32_t toSeparator = value >= shape.groupsFrom ? shape.groupSize : -1;
  do {
    if (toSeparator-- == 0) {
      *--end = shape.groupSeparator;
      toSeparator = shape.otherGroupSize - 1;
    }
    *--end = shape.digits[value % 10];
    value /= 10;
  } while (value != 0);
  return end;
}

// Writes the separator and the fraction's digits, without the zeros at their end.
static UChar *writeFraction(const NumberShape &shape, uint32_t value, UChar *out) {
  if (value == 0) return out;
  int32_t count = shape.fractionDigits;
  for (; value % 10 == 0; value /= 10) --count;
  *out = shape.decimalSeparator;
  for (UChar *digit = out + count; digit != out; value /= 10) *digit-- = shape.digits[value % 10];
  return out + count + 1;
}

static UChar *writeNumber(const NumberShape &shape, bool negative, uint64_t whole,
                          uint32_t fraction, UChar *out) {
  std::array<UChar, kMaxShapedUnits> room;
  UChar *const end = room.data() + room.size();
  const UChar *const first = wholeBefore(shape, whole, end);
  out = writeAffix(shape.prefix[negative], out);
  out = std::copy(first, static_cast<const UChar *>(end), out);
  out = writeFraction(shape, fraction, out);
  return writeAffix(shape.suffix[negative], out);
}

UChar *qlxWriteShapedInteger(const NumberShape &shape, int32_t value, UChar *out) {
  return writeNumber(shape, value < 0, cxMagnitude(value), 0, out);
}

// The format rounds the shortest decimal form of the value, a tie to the even digit. That form and
// the product each differ from the value's exact multiple by at most 2^-53 of it (half a unit in
// the last place), together by less than kTieMargin of the product: farther than this from a tie,
// both have the same nearest whole number. The fraction of the product is exact.
UChar *qlxWriteShapedDouble(const NumberShape &shape, double value, UChar *out) {
  const double unit = kTenTo[shape.fractionDigits];
  const double scaled = std::fabs(value) * unit;
  if (!(scaled < kMaxScaled)) return nullptr;  // nor is NaN
  const auto below = static_cast<uint64_t>(scaled);
  const double fraction = scaled - static_cast<double>(below);
  if (std::fabs(fraction - 0.5) <= scaled * kTieMargin) return nullptr;
  const uint64_t nearest = below + (fraction > 0.5);
  const bool negative = std::signbit(value);
  if (nearest == 0 && negative) return nullptr;
  const auto units = static_cast<uint64_t>(unit);
  return writeNumber(shape, negative, nearest / units, static_cast<uint32_t>(nearest % units), out);
}

// ---- Taking

namespace {

using icu::DecimalFormat;
using icu::DecimalFormatSymbols;
using icu::UnicodeString;

// Whether nothing but digits in groups and affixes makes up a number.
bool isPlain(const DecimalFormat &format) {
  return !format.isScientificNotation() && !format.areSignificantDigitsUsed() &&
         !format.isDecimalSeparatorAlwaysShown() && !format.isSignAlwaysShown() &&
         format.getMultiplier() == 1 && format.getMultiplierScale() == 0 &&
         format.getRoundingIncrement() == 0 && format.getFormatWidth() <= 0 &&
         format.getRoundingMode() == icu::NumberFormat::kRoundHalfEven;
}

bool hasPlainDigits(const DecimalFormat &format) {
  return format.getMinimumIntegerDigits() == 1 && format.getMaximumIntegerDigits() >= 20 &&
         format.getMinimumFractionDigits() == 0 &&
         format.getMaximumFractionDigits() <= kMaxFractionDigits;
}

// A symbol of one unit; those of more have no place in a shape.
bool takeSymbol(const DecimalFormatSymbols &symbols,
                DecimalFormatSymbols::ENumberFormatSymbol which, UChar *unit) {
  const UnicodeString &text = symbols.getConstSymbol(which);
  *unit = text.charAt(0);
  return text.length() == 1;
}

bool takeDigits(const DecimalFormatSymbols &symbols, NumberShape *shape) {
  return std::ranges::all_of(shape->digits, [&](UChar &digit) {
    const auto index = static_cast<int32_t>(&digit - shape->digits.data());
    return takeSymbol(symbols,
                      index == 0 ? DecimalFormatSymbols::kZeroDigitSymbol
                                 : static_cast<DecimalFormatSymbols::ENumberFormatSymbol>(
                                       DecimalFormatSymbols::kOneDigitSymbol + index - 1),
                      &digit);
  });
}

bool takeSymbols(const DecimalFormatSymbols *symbols, NumberShape *shape) {
  return symbols && takeDigits(*symbols, shape) &&
         takeSymbol(*symbols, DecimalFormatSymbols::kDecimalSeparatorSymbol,
                    &shape->decimalSeparator) &&
         takeSymbol(*symbols, DecimalFormatSymbols::kGroupingSeparatorSymbol,
                    &shape->groupSeparator);
}

bool takeGroups(const DecimalFormat &format, NumberShape *shape) {
  shape->groupsFrom = UINT64_MAX;
  shape->groupSize = format.isGroupingUsed() ? format.getGroupingSize() : 0;
  if (shape->groupSize <= 0) return true;
  const int32_t other = format.getSecondaryGroupingSize();
  shape->otherGroupSize = other > 0 ? other : shape->groupSize;
  const int32_t digits = shape->groupSize + std::max(format.getMinimumGroupingDigits(), 1);
  if (digits > kMaxDecimalDigits) return false;
  shape->groupsFrom = 1;
  for (int32_t i = 1; i < digits; ++i) shape->groupsFrom *= 10;
  return true;
}

bool takeAffix(const UnicodeString &text, NumberAffix *affix) {
  const int32_t length = text.length();
  if (length > static_cast<int32_t>(affix->units.size())) return false;
  affix->length = static_cast<uint8_t>(length);
  text.extract(0, length, affix->units.data());
  return true;
}

// What stands around the one digit of a number; ICU's getters for it cost far more.
bool takeAffixes(const DecimalFormat &format, NumberShape *shape, bool negative) {
  UnicodeString text;
  format.format(int32_t{negative ? -7 : 7}, text);
  const int32_t digit = text.indexOf(shape->digits[7]);
  return digit >= 0 && takeAffix(text.tempSubString(0, digit), &shape->prefix[negative]) &&
         takeAffix(text.tempSubString(digit + 1), &shape->suffix[negative]);
}

bool take(const DecimalFormat &format, NumberShape *shape) {
  shape->fractionDigits = format.getMaximumFractionDigits();
  return isPlain(format) && hasPlainDigits(format) &&
         takeSymbols(format.getDecimalFormatSymbols(), shape) && takeGroups(format, shape) &&
         takeAffixes(format, shape, false) && takeAffixes(format, shape, true);
}

// ---- Proving

constexpr int32_t kIntegers[] = {0,     7,      -7,      12,         999,       1000,
                                 -1000, 12345,  -99999,  1234567890, INT32_MAX, INT32_MIN,
                                 98765, 654321, 7654321, -10000000};

// Few of them have a fraction: these cost ICU ten times what whole numbers do.
constexpr double kDoubles[] = {0,         7,           -12,       1000,         12345,
                               9999,      1e9,         1e12,      0.5,          0.0009,
                               -999.9996, -98765.4321, 1e9 + .25, 40302010.605, 200.0 / 3.0};

bool isWritten(const UnicodeString &expected, const UChar *text, const UChar *end) {
  return expected == UnicodeString(false, text, static_cast<int32_t>(end - text));
}

bool writesInteger(const NumberShape &shape, const icu::NumberFormat &format, int32_t value) {
  UnicodeString expected;
  format.format(value, expected);
  UChar text[kMaxShapedUnits];
  return isWritten(expected, text, qlxWriteShapedInteger(shape, value, text));
}

bool writesDouble(const NumberShape &shape, const icu::NumberFormat &format, double value) {
  UChar text[kMaxShapedUnits];
  const UChar *end = qlxWriteShapedDouble(shape, value, text);
  if (!end) return true;
  UnicodeString expected;
  format.format(value, expected);
  return isWritten(expected, text, end);
}

bool isProved(const NumberShape &shape, const icu::NumberFormat &format, ArgType type) {
  if (type == ArgType::kInteger)
    return std::ranges::all_of(kIntegers,
                               [&](int32_t value) { return writesInteger(shape, format, value); });
  return std::ranges::all_of(kDoubles,
                             [&](double value) { return writesDouble(shape, format, value); });
}

}  // namespace

bool qlxTakeNumberShape(NumberShape *shape, const icu::NumberFormat *format, ArgType type) {
  *shape = {};
  if (!format || format->getDynamicClassID() != DecimalFormat::getStaticClassID()) return false;
  return take(*static_cast<const DecimalFormat *>(format), shape) &&
         isProved(*shape, *format, type);
}
