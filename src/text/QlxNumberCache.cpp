#include "QlxNumberCache.h"

#include <string_view>

#include <unicode/decimfmt.h>
#include <unicode/unum.h>

#include "QlxFormatCache.h"
#include "util/CxDecimal.h"
#include "util/CxUStringBuff.h"

struct CachedNumber {
  std::u16string_view pattern;
  UNumberFormat *format;  // null: not opened
  bool plainDigits;       // a whole number that is not negative is its ASCII digits
};

static CachedNumber gNumbers[] = {{u"#", nullptr, false}, {u"#.#####", nullptr, false}};

// Beyond this not every whole number is a double.
static constexpr double kMaxWhole = 9007199254740992.0;

static void dropAll() {
  for (CachedNumber &cached : gNumbers) {
    unum_close(cached.format);
    cached.format = nullptr;
  }
}

static const FormatCache gThis{dropAll, FormatCache::kDefaultsChange};
static CxLook gLook;

// Any digit may be another one in the locale, and any locale may put signs around them. A format of
// another class may have a word for any one number.
static bool writesPlainDigits(const UNumberFormat *format) {
  const auto *plain = reinterpret_cast<const icu::NumberFormat *>(format);
  if (plain->getDynamicClassID() != icu::DecimalFormat::getStaticClassID()) return false;
  constexpr std::u16string_view kDigits = u"1234567890";
  UChar text[32];
  UErrorCode status = U_ZERO_ERROR;
  const int32_t units = unum_formatInt64(format, 1234567890, text, 32, nullptr, &status);
  return U_SUCCESS(status) && kDigits == std::u16string_view{text, static_cast<size_t>(units)};
}

// As a message format makes it: the locale's own, which then gets the pattern. One that takes no
// pattern, as that of a locale with worded numbers, stays as it is.
static void open(CachedNumber &cached, const char *locale) {
  UErrorCode status = U_ZERO_ERROR;
  cached.format = unum_open(UNUM_DECIMAL, nullptr, 0, qlxGoodLocale(locale), nullptr, &status);
  if (U_FAILURE(status)) cached.format = nullptr;
  if (!cached.format) return;
  unum_applyPattern(cached.format, 0, cached.pattern.data(),
                    static_cast<int32_t>(cached.pattern.size()), nullptr, &status);
  cached.plainDigits = writesPlainDigits(cached.format);
}

uint8_t qlxAppendCachedNumber(CxUStringBuff *text, NumberStyle which, double value) {
  const FormatCacheLock lock;
  qlxCheckDefaults(kLocaleOnly, &gLook);
  CachedNumber &cached = gNumbers[which];
  if (!cached.format) open(cached, qlxDefaultLocale());
  if (!cached.format) return cxUStringBuffHasCapacity(text, 0);
  if (cached.plainDigits && value >= 0 && value < kMaxWhole) {
    const auto whole = static_cast<uint64_t>(value);
    const bool negativeZero = whole == 0 && __builtin_signbit(value);
    if (static_cast<double>(whole) == value && !negativeZero) {
      return CxUStringBuffAppendUInt64(text, whole);
    }
  }
  UErrorCode status = U_ZERO_ERROR;
  qlxAppendFormatted(text, &status, [&](UChar *room, int32_t units, UErrorCode *answer) {
    return unum_formatDouble(cached.format, value, room, units, nullptr, answer);
  });
  return status != U_MEMORY_ALLOCATION_ERROR;
}

// Of the buffer's family; here because they are the ones that ask ICU.

uint8_t CxUStringBuffAppendUDate(CxUStringBuff *buffer, double date) {
  return buffer ? qlxAppendCachedNumber(buffer, kWholeNumber, date) : 0;
}

uint8_t CxUStringBuffAppendUDouble(CxUStringBuff *buffer, double value) {
  return buffer ? qlxAppendCachedNumber(buffer, kFraction, value) : 0;
}
