#include "QlxMessageCache.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <initializer_list>
#include <string_view>
#include <utility>

#include <unicode/uchar.h>
#include <unicode/umsg.h>
#include <unicode/ustring.h>

#include <qlx/memory.h>
#include <qlx/ustring.h>

#include "QlxComposed.h"
#include "QlxFormatCache.h"
#include "QlxPatternNesting.h"
#include "util/CxHash.h"
#include "util/CxOwned.h"
#include "util/CxUnits.h"

struct PatternKey {
  const char *locale;  // null is the default locale, and not the same as ""
  std::u16string_view pattern;
  uint32_t tag;  // cxHashEnds() of the pattern
};

enum class Composing : uint8_t { kUntried, kLeftToIcu, kDone };

struct CachedMessage {
  UMessageFormat *format;  // null: a free place, all zero
  Composing composing;     // untried until the message is found again
  QlxComposed composed;
  PatternKey key;  // with copies of the two texts, owned
  bool usesZone;
  uint64_t serial;   // no two cached messages ever have the same
  uint64_t lastUse;  // larger is later
};

static CachedMessage gMessages[kMaxCachedMessages];
static std::array<MessagePlace, kMaxCachedMessages> gLatest;  // by tag: what was asked for last
static uint64_t gUses;
static CxLook gLocaleLook, gZoneLook;

// Missing arguments read as zeros up to this many.
static constexpr int32_t kMaxZeroArgs = 64;

static void drop(CachedMessage &cached) {
  umsg_close(cached.format);
  OslMemoryFree(const_cast<char *>(cached.key.locale));
  OslMemoryFree(const_cast<UChar *>(cached.key.pattern.data()));
  cached = {};
}

static void dropAll() {
  for (CachedMessage &cached : gMessages)
    if (cached.format) drop(cached);
}

static const FormatCache gThis{dropAll, FormatCache::kDefaultsChange};

static bool samePattern(std::u16string_view a, std::u16string_view b) {
  return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(UChar)) == 0;
}

static bool isAt(const CachedMessage &cached, const PatternKey &key) {
  return cached.format && cached.key.tag == key.tag &&
         samePattern(cached.key.pattern, key.pattern) && qlxSameText(cached.key.locale, key.locale);
}

static CachedMessage *find(const PatternKey &key) {
  for (CachedMessage &cached : gMessages)
    if (isAt(cached, key)) return &cached;
  return nullptr;
}

// Whether the defaults of this moment would give the same format.
static bool isCurrent(const CachedMessage &cached) {
  if (!cached.usesZone) return true;
  qlxCheckDefaults(kZoneOnly, &gZoneLook);
  return cached.format;
}

// The place behind the white space that begins at a place, which ICU leaves out.
static size_t skipSpace(std::u16string_view pattern, size_t at) {
  while (at < pattern.size() && u_hasBinaryProperty(pattern[at], UCHAR_PATTERN_WHITE_SPACE)) ++at;
  return at;
}

// Whether an argument may have one of the types, which are words in any mix of case behind a comma.
static bool mayHaveType(std::u16string_view pattern,
                        std::initializer_list<std::u16string_view> types) {
  const auto isAt = [&](size_t at, std::u16string_view type) {
    return type.size() <= pattern.size() - at &&
           u_strncasecmp(pattern.data() + at, type.data(), static_cast<int32_t>(type.size()),
                         U_FOLD_CASE_DEFAULT) == 0;
  };
  for (size_t at = 0; (at = pattern.find(u',', at)) != pattern.npos;) {
    at = skipSpace(pattern, at + 1);
    if (std::ranges::any_of(types, [&](auto type) { return isAt(at, type); })) return true;
  }
  return false;
}

// Whether an argument may be a date or a time. For other patterns the zone need not be looked at,
// which is costly.
static bool mayUseZone(std::u16string_view pattern) {
  return mayHaveType(pattern, {u"date", u"time"});
}

// Whether ICU may need plural rules for the pattern. They give the forms of the words also in
// worded numbers, in long names of currencies, and in the short notations and units of number
// skeletons.
static bool mayUsePluralRules(std::u16string_view pattern) {
  return mayHaveType(pattern,
                     {u"plural", u"selectordinal", u"ordinal", u"spellout", u"duration", u"::"}) ||
         pattern.find(u"\u00a4\u00a4\u00a4") != pattern.npos;
}

// Whether ICU can be given the pattern. An argument with a type takes data of the locale, and where
// that has none, of the default locale.
static bool isSafe(std::u16string_view pattern, const char *locale, const char *defaultLocale,
                   bool usesZone) {
  const bool hasTypes = pattern.find(u',') != pattern.npos;
  const bool usesRules = usesZone || mayUsePluralRules(pattern);
  return (!hasTypes || qlxIsGoodLocale(defaultLocale)) && (!usesRules || qlxIsGoodLocale(locale)) &&
         !qlxNestsTooDeep(pattern);
}

// Names the default locale, since ICU, given no name, would take the default of a moment later,
// which nobody has checked.
static icu::LocalUMessageFormatPointer open(const PatternKey &key, bool usesZone,
                                            UErrorCode *status) {
  qlxCheckDefaults(usesZone ? kEveryDefault : kLocaleOnly, nullptr);
  const char *defaultLocale = qlxDefaultLocale();
  const char *locale = key.locale ? key.locale : defaultLocale;
  if (!isSafe(key.pattern, locale, defaultLocale, usesZone)) *status = U_ILLEGAL_ARGUMENT_ERROR;
  return icu::LocalUMessageFormatPointer{umsg_open(
      key.pattern.data(), static_cast<int32_t>(key.pattern.size()), locale, nullptr, status)};
}

// Takes the format over when there is memory for its key.
static void store(const PatternKey &key, bool usesZone, icu::LocalUMessageFormatPointer &format) {
  OwnedStr locale{OslStringDup(key.locale)};
  OwnedUStr pattern{CxUStringDup(key.pattern.data())};
  if (!pattern || (key.locale && !locale)) return;
  CachedMessage &place = *std::ranges::min_element(gMessages, {}, &CachedMessage::lastUse);
  drop(place);
  place.format = format.orphan();
  place.key = {locale.release(), {pattern.release(), key.pattern.size()}, cxHashEnds(key.pattern)};
  place.usesZone = usesZone;
  place.serial = place.lastUse = ++gUses;
}

// The highest number that an argument of the pattern may have, or -1. What only looks like an
// argument, in quotes, counts as well.
static int32_t highestArgument(std::u16string_view pattern) {
  int32_t highest = -1;
  for (size_t at = 0; (at = pattern.find(u'{', at)) != pattern.npos;) {
    at = skipSpace(pattern, at + 1);
    int32_t number = -1;
    for (; at < pattern.size() && pattern[at] >= u'0' && pattern[at] <= u'9'; ++at)
      number = std::min(std::max(number, 0) * 10 + (pattern[at] - u'0'), kMaxZeroArgs);
    highest = std::max(highest, number);
  }
  return highest;
}

static int32_t formatList(const UMessageFormat *format, UChar *room, int32_t units,
                          UErrorCode *status, ...) {
  va_list args;
  va_start(args, status);
  const int32_t needed = umsg_vformat(format, room, units, args, status);
  va_end(args);
  return needed;
}

// Doubles travel in registers of one kind, integers and pointers in those of another, and what
// finds no register on the stack: with this many zeros of both kinds each argument that ICU reads
// is zero.
template <size_t... index>
static int32_t formatZeros(const UMessageFormat *format, UChar *room, int32_t units,
                           UErrorCode *status, std::index_sequence<index...>) {
  return formatList(format, room, units, status, 0.0, 0.0, 0.0, 0.0, 0.0, 0.0, 0.0, 0.0,
                    (static_cast<void>(index), int64_t{0})...);
}

static int32_t formatWithoutArgs(const UMessageFormat *format, std::u16string_view pattern,
                                 UChar *room, int32_t units, UErrorCode *status) {
  if (highestArgument(pattern) >= kMaxZeroArgs) {
    *status = U_ILLEGAL_ARGUMENT_ERROR;
    return -1;
  }
  return formatZeros(format, room, units, status, std::make_index_sequence<kMaxZeroArgs + 8>{});
}

static uint32_t append(CxUStringBuff *text, const UMessageFormat *format,
                       std::u16string_view pattern, va_list *args, UErrorCode *status) {
  return qlxAppendFormatted(text, status, [&](UChar *room, int32_t units, UErrorCode *answer) {
    if (!args) return formatWithoutArgs(format, pattern, room, units, answer);
    va_list copy;
    va_copy(copy, *args);
    const int32_t needed = umsg_vformat(format, room, units, copy, answer);
    va_end(copy);
    return needed;
  });
}

// A pattern without syntax is its own text, in every locale.
static uint32_t appendPlain(CxUStringBuff *text, std::u16string_view pattern, UErrorCode *status) {
  const auto units = static_cast<uint32_t>(pattern.size());
  *status = U_MEMORY_ALLOCATION_ERROR;
  if (!cxUStringBuffHasCapacity(text, units)) return 0;
  *status = U_ZERO_ERROR;
  pattern.copy(text->data + text->length, units);
  text->length += units;
  text->data[text->length] = 0;
  return units;
}

static bool isComposed(CachedMessage &cached) {
  if (cached.composing == Composing::kUntried) {
    const bool done = qlxCompose(&cached.composed, cached.key.pattern, cached.format);
    cached.composing = done ? Composing::kDone : Composing::kLeftToIcu;
  }
  return cached.composing == Composing::kDone;
}

static uint32_t appendCached(CxUStringBuff *text, CachedMessage &cached, va_list *args,
                             UErrorCode *status) {
  cached.lastUse = ++gUses;
  const uint32_t before = text->length;
  *status = U_ZERO_ERROR;
  if (args && isComposed(cached) && qlxAppendComposed(text, &cached.composed, args)) {
    return text->length - before;
  }
  return append(text, cached.format, cached.key.pattern, args, status);
}

// The pattern is not a plain one.
static uint32_t appendParsed(CxUStringBuff *text, MessagePlace *place, PatternKey key,
                             va_list *args, UErrorCode *status) {
  CachedMessage *cached = place->cached;
  if (!cached || cached->serial != place->serial) {
    key.tag = cxHashEnds(key.pattern);
    cached = find(key);
  }
  if (cached && isCurrent(*cached)) {
    *place = {cached, cached->serial};
    return appendCached(text, *cached, args, status);
  }
  const bool usesZone = mayUseZone(key.pattern);
  *status = U_ZERO_ERROR;
  icu::LocalUMessageFormatPointer fresh = open(key, usesZone, status);
  if (U_FAILURE(*status)) return 0;
  const UMessageFormat *format = fresh.getAlias();
  store(key, usesZone, fresh);
  return append(text, format, key.pattern, args, status);
}

// A plain pattern never gets a place, so one that has a place need not be searched.
static bool isPlain(const MessagePlace &place, std::u16string_view pattern) {
  return !place.cached && qlxIsPlainPattern(pattern);
}

uint32_t qlxAppendCachedMessageAt(MessagePlace *place, CxUStringBuff *text, const char *locale,
                                  std::u16string_view pattern, va_list *args, UErrorCode *status) {
  if (isPlain(*place, pattern)) return appendPlain(text, pattern, status);
  return appendParsed(text, place, {locale, pattern, 0}, args, status);
}

uint32_t qlxAppendCachedMessage(CxUStringBuff *text, const char *locale, const UChar *pattern,
                                va_list *args, UErrorCode *status) {
  const FormatCacheLock lock;
  const std::u16string_view whole{pattern, cxUnitsLength(pattern)};
  const PatternKey key{locale, whole, cxHashEnds(whole)};
  MessagePlace &latest = gLatest[key.tag % gLatest.size()];
  MessagePlace place = latest.cached && isAt(*latest.cached, key) ? latest : MessagePlace{};
  if (isPlain(place, whole)) return appendPlain(text, whole, status);
  qlxCheckDefaults(kLocaleOnly, &gLocaleLook);
  const uint32_t appended = appendParsed(text, &place, key, args, status);
  latest = place;
  return appended;
}
