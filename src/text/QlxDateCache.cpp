#include "QlxDateCache.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <utility>

#include <unicode/calendar.h>
#include <unicode/ucal.h>
#include <unicode/uchar.h>
#include <unicode/udat.h>
#include <unicode/ustring.h>

#include <qlx/memory.h>
#include <qlx/ustring.h>

#include "QlxFormatCache.h"
#include "util/CxOwned.h"
#include "util/CxUnits.h"

static constexpr UChar kDefaultPattern[] = u"yyyy-MM-dd HH:mm:ss.SSS";
static constexpr int32_t kMillisDigits = 3;

struct CachedDate {
  UDateFormat *format;  // null: a free place, all zero
  DateStyle style;      // with a copy of the pattern, owned; the offset from UTC follows a null one
  uint64_t lastUse;     // larger is later
  bool varies;          // texts of one second differ in more than three digits: none is cached

  // The text of `second` at its millisecond 0, when hasText.
  bool hasText;
  int64_t second;  // since 1970
  CxUStringBuff text;
  int32_t fraction;  // where in the text the milliseconds stand, or -1: it has none
  std::array<char, 64> ascii;
  uint32_t asciiLength;  // of the text's bytes when they are ASCII and fit; else 0
};

// A whole number of milliseconds, taken apart.
struct Moment {
  int64_t second;
  int32_t millis;  // 0 to 999
};

static CachedDate gDates[kMaxCachedDates];
static UCalendar *gCalendar;  // null: not opened
static uint64_t gUses;
static CxLook gLook;

static void drop(CachedDate &cached) {
  udat_close(cached.format);
  OslMemoryFree(const_cast<char *>(cached.style.pattern));
  CxUStringBuffDiscard(&cached.text);
  cached = {};
}

static void dropAll() {
  for (CachedDate &cached : gDates)
    if (cached.format) drop(cached);
  ucal_close(std::exchange(gCalendar, nullptr));
}

static const FormatCache gThis{dropAll, FormatCache::kDefaultsChange};

static UDateFormat *openDate(const DateStyle &style, UErrorCode *status) {
  const OwnedUStr pattern{CxUStringDupStrToUChar(style.pattern)};
  if (style.pattern && !pattern) *status = U_MEMORY_ALLOCATION_ERROR;
  return udat_open(UDAT_PATTERN, UDAT_PATTERN, qlxGoodLocale(qlxDefaultLocale()),
                   style.isUtc ? u"UTC" : nullptr, -1, pattern ? pattern.get() : kDefaultPattern,
                   -1, status);
}

static CachedDate *find(const DateStyle &style) {
  for (CachedDate &cached : gDates) {
    const bool isSame = cached.format && cached.style.isUtc == style.isUtc &&
                        qlxSameText(cached.style.pattern, style.pattern);
    if (isSame) return &cached;
  }
  return nullptr;
}

// Opens a format under the defaults of this moment; null, with the reason, when that fails.
static CachedDate *add(const DateStyle &style, UErrorCode *status) {
  qlxCheckDefaults(kEveryDefault, nullptr);
  icu::LocalUDateFormatPointer format{openDate(style, status)};
  OwnedStr pattern{OslStringDup(style.pattern)};
  if (style.pattern && !pattern) *status = U_MEMORY_ALLOCATION_ERROR;
  if (U_FAILURE(*status)) return nullptr;
  CachedDate &place = *std::ranges::min_element(gDates, {}, &CachedDate::lastUse);
  drop(place);
  place.format = format.orphan();
  place.style = {pattern.release(), style.isUtc};
  return &place;
}

// The format of a style, found or opened.
static CachedDate *fetch(const DateStyle &style, UErrorCode *status) {
  qlxCheckDefaults(kEveryDefault, &gLook);
  CachedDate *cached = find(style);
  if (!cached) cached = add(style, status);
  if (cached) cached->lastUse = ++gUses;
  return cached;
}

// ---- The zone's clock

// In the zone of the last look, since the default zone may be another one by now.
static UCalendar *openCalendar(UErrorCode *status) {
  const char *locale = qlxGoodLocale(qlxDefaultLocale());
  UCalendar *calendar = ucal_open(nullptr, -1, locale, UCAL_TRADITIONAL, status);
  const icu::TimeZone *zone = qlxDefaultZone();
  if (calendar && zone) reinterpret_cast<icu::Calendar *>(calendar)->setTimeZone(*zone);
  return calendar;
}

// The cached calendar, at a time.
static const UCalendar *calendarAt(double time, UErrorCode *status) {
  if (!gCalendar) gCalendar = openCalendar(status);
  ucal_setMillis(gCalendar, time, status);
  return gCalendar;
}

static int32_t offsetOf(const UCalendar *calendar, UErrorCode *status) {
  const int32_t zone = ucal_get(calendar, UCAL_ZONE_OFFSET, status);
  return zone + ucal_get(calendar, UCAL_DST_OFFSET, status);
}

// A style's offset from UTC at a time, in milliseconds.
static int32_t offsetAt(const DateStyle &style, double time) {
  if (style.isUtc) return 0;
  UErrorCode status = U_ZERO_ERROR;
  const int32_t offset = offsetOf(calendarAt(time, &status), &status);
  return U_SUCCESS(status) ? offset : 0;
}

// Whether the zone's clock goes on by a second when UTC does, and at the same moment. A zone may
// have parts of a second, or change within one.
static bool isSteady(const DateStyle &style, double second) {
  if (style.isUtc) return true;
  constexpr double kLastMillis = 999;
  UErrorCode status = U_ZERO_ERROR;
  const UCalendar *calendar = calendarAt(second, &status);
  const int32_t offset = offsetOf(calendar, &status);
  double change = 0;
  if (ucal_getTimeZoneTransitionDate(calendar, UCAL_TZ_TRANSITION_NEXT, &change, &status) &&
      change <= second + kLastMillis) {
    return false;
  }
  // Not every zone tells of its changes.
  const bool lasts = offsetOf(calendarAt(second + kLastMillis, &status), &status) == offset;
  return U_SUCCESS(status) && lasts && offset % 1000 == 0;
}

// As "%02d" writes it: a sign takes the place of a leading zero.
static uint8_t appendTwoDigits(CxUStringBuff *text, int32_t number) {
  const char *lead = number < 0 ? "-" : number < 10 ? "0" : "";
  return CxUStringBuffAppendStr(text, lead) && CxUStringBuffAppendInt32(text, std::abs(number));
}

// Deliberate: the minutes keep their sign and the sign before them is that of the hours alone, so
// that -330 minutes are "-05:-30" and -30 are "+00:-30".
static uint8_t appendOffset(CxUStringBuff *text, int32_t offset) {
  const int32_t hours = offset / 3'600'000;
  const int32_t minutes = offset / 60'000 % 60;
  return CxUStringBuffAppendStr(text, hours < 0 ? "-" : "+") &&
         appendTwoDigits(text, std::abs(hours)) && CxUStringBuffAppendStr(text, ":") &&
         appendTwoDigits(text, minutes);
}

// Appends the date by ICU, with the offset where it belongs. The places of the fields are optional.
static uint8_t appendDate(CxUStringBuff *text, const CachedDate &cached, double time,
                          UFieldPositionIterator *fields, UErrorCode *status) {
  const UDateFormat *format = cached.format;
  qlxAppendFormatted(text, status, [&](UChar *room, int32_t units, UErrorCode *answer) {
    return fields ? udat_formatForFields(format, time, room, units, fields, answer)
                  : udat_format(format, time, room, units, nullptr, answer);
  });
  if (*status == U_MEMORY_ALLOCATION_ERROR) return 0;
  return cached.style.pattern ? 1 : appendOffset(text, offsetAt(cached.style, time));
}

// Whether a text is three zeros of one script. In Unicode the digits 1 to 9 follow their zero.
static bool isZeros(const UChar *digits, int32_t length) {
  return length == kMillisDigits && u_charDigitValue(digits[0]) == 0 && digits[1] == digits[0] &&
         digits[2] == digits[0];
}

// Finds where the milliseconds stand in the text of a whole second, as three zeros; -1 when they
// stand nowhere. Nothing when texts of the same second may differ elsewhere too.
static std::optional<int32_t> findFraction(const CxUStringBuff &text,
                                           UFieldPositionIterator *fields) {
  int32_t found = -1;
  int32_t begin = 0;
  int32_t end = 0;
  for (int32_t field; (field = ufieldpositer_next(fields, &begin, &end)) >= 0;) {
    if (field == UDAT_MILLISECONDS_IN_DAY_FIELD) return std::nullopt;
    if (field != UDAT_FRACTIONAL_SECOND_FIELD) continue;
    if (found >= 0 || !isZeros(text.data + begin, end - begin)) return std::nullopt;
    found = begin;
  }
  return found;
}

// Makes the text of a second the cached one; false when none can be.
static bool cacheSecond(CachedDate &cached, int64_t second) {
  if (cached.hasText && cached.second == second) return true;
  if (cached.varies) return false;
  cached.hasText = false;
  CxUStringBuffRestart(&cached.text);
  UErrorCode status = U_ZERO_ERROR;
  const icu::LocalUFieldPositionIteratorPointer fields{ufieldpositer_open(&status)};
  if (U_FAILURE(status)) return false;
  const double time = static_cast<double>(second) * 1000;
  if (!isSteady(cached.style, time)) return false;
  if (!appendDate(&cached.text, cached, time, fields.getAlias(), &status)) return false;
  const std::optional<int32_t> fraction = findFraction(cached.text, fields.getAlias());
  cached.varies = U_FAILURE(status) || !fraction;
  if (cached.varies) return false;
  cached.fraction = *fraction;
  cached.second = second;
  cached.hasText = true;
  const uint32_t units = cached.text.length;
  const bool plain =
      units <= cached.ascii.size() && cxNarrowAscii(cached.ascii.data(), cached.text.data, units);
  cached.asciiLength = plain ? units : 0;
  return true;
}

// Writes the milliseconds over the zeros of the cached text's copy.
template <typename Unit>
static void addMillis(Unit *text, const CachedDate &cached, int32_t millis) {
  if (cached.fraction < 0) return;
  for (int32_t at = cached.fraction + kMillisDigits; millis > 0; millis /= 10) {
    --at;
    text[at] = static_cast<Unit>(text[at] + millis % 10);
  }
}

static uint8_t appendCached(CxUStringBuff *text, const CachedDate &cached, int32_t millis) {
  if (!CxUStringBuffAppendUStr(text, cached.text.data)) return 0;
  addMillis(text->data + text->length - cached.text.length, cached, millis);
  return 1;
}

// Nothing for a time that is no whole number, or so large that it may be none once a zone's offset
// is added.
static std::optional<Moment> momentOf(double time) {
  constexpr double kMaxWhole = 4503599627370496.0;  // 2 to the power 52
  if (!(time >= -kMaxWhole && time <= kMaxWhole)) return std::nullopt;
  const auto whole = static_cast<int64_t>(time);
  if (static_cast<double>(whole) != time) return std::nullopt;
  const int64_t millis = (whole % 1000 + 1000) % 1000;
  return Moment{(whole - millis) / 1000, static_cast<int32_t>(millis)};
}

static uint8_t appendBy(CachedDate &cached, CxUStringBuff *text, double time) {
  const std::optional<Moment> moment = momentOf(time);
  if (moment && cacheSecond(cached, moment->second))
    return appendCached(text, cached, moment->millis);
  UErrorCode status = U_ZERO_ERROR;
  return appendDate(text, cached, time, nullptr, &status);
}

uint8_t qlxAppendCachedDate(CxUStringBuff *text, const DateStyle &style, double time) {
  const FormatCacheLock lock;
  UErrorCode status = U_ZERO_ERROR;
  CachedDate *cached = fetch(style, &status);
  return cached ? appendBy(*cached, text, time) : status != U_MEMORY_ALLOCATION_ERROR;
}

bool qlxAppendCachedDateAscii(CxAsciiLine *line, const DateStyle &style, double time) {
  const FormatCacheLock lock;
  UErrorCode status = U_ZERO_ERROR;
  CachedDate *cached = fetch(style, &status);
  const std::optional<Moment> moment = cached ? momentOf(time) : std::nullopt;
  if (!moment || !cacheSecond(*cached, moment->second) || cached->asciiLength == 0) return false;
  std::array<char, 64> text = cached->ascii;
  addMillis(text.data(), *cached, moment->millis);
  return line->append({text.data(), cached->asciiLength});
}
