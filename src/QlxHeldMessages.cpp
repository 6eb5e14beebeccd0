// Parsed message patterns, held by pattern and locale.
#include "QlxHeldFormats.h"

#include <algorithm>
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
#include "util/CxOwned.h"
#include "util/CxUnits.h"

struct PatternKey {
  const char *locale;  // null is the default locale, and not the same as ""
  std::u16string_view pattern;
  uint32_t hash;  // of the pattern
};

struct HeldMessage {
  UMessageFormat *format;  // null: a free place, all zero
  bool isComposed;         // false: the pattern is left to ICU
  QlxComposed composed;
  PatternKey key;  // with copies of the two texts, owned
  bool usesZone;
  uint64_t lastUse;  // larger is later
};

static HeldMessage gMessages[kMaxHeldMessages];
static uint64_t gUses;

// Missing arguments read as zeros up to this many.
static constexpr int32_t kMaxZeroArgs = 64;

static void drop(HeldMessage &held) {
  umsg_close(held.format);
  OslMemoryFree(const_cast<char *>(held.key.locale));
  OslMemoryFree(const_cast<UChar *>(held.key.pattern.data()));
  held = {};
}

void qlxIntlDropHeldMessages(void) {
  for (HeldMessage &held : gMessages)
    if (held.format) drop(held);
}

static uint32_t hashOf(std::u16string_view pattern) {
  uint32_t hash = 2166136261U;  // FNV-1a
  for (const char16_t unit : pattern) hash = (hash ^ unit) * 16777619U;
  return hash;
}

static bool sameKey(const PatternKey &a, const PatternKey &b) {
  return a.hash == b.hash && a.pattern == b.pattern && qlxSameText(a.locale, b.locale);
}

static HeldMessage *find(const PatternKey &key) {
  for (HeldMessage &held : gMessages)
    if (held.format && sameKey(held.key, key)) return &held;
  return nullptr;
}

// The held format that the defaults of this moment would give too.
static HeldMessage *findCurrent(const PatternKey &key) {
  qlxIntlCheckHeldLocale();
  HeldMessage *held = find(key);
  if (!held || !held->usesZone) return held;
  qlxIntlCheckHeldZone();
  return held->format ? held : nullptr;
}

// Whether an argument may have one of the types, which are words in any mix of case.
static bool mayHaveType(std::u16string_view pattern,
                        std::initializer_list<std::u16string_view> types) {
  const auto isAt = [&](size_t at, std::u16string_view type) {
    return type.size() <= pattern.size() - at &&
           u_strncasecmp(pattern.data() + at, type.data(), static_cast<int32_t>(type.size()),
                         U_FOLD_CASE_DEFAULT) == 0;
  };
  for (size_t at = 0; at < pattern.size(); ++at)
    if (std::ranges::any_of(types, [&](auto type) { return isAt(at, type); })) return true;
  return false;
}

// Where no argument is a date or time, the zone, which is costly to ask for, need not be looked at.
static bool mayUseZone(std::u16string_view pattern) {
  return mayHaveType(pattern, {u"date", u"time"});
}

// ICU crashes in a date style, and in a choice by plural rules, of a locale whose name begins with
// more than a language.
static bool hasLanguage(const char *locale) {
  char language[ULOC_LANG_CAPACITY];
  UErrorCode status = U_ZERO_ERROR;
  uloc_getLanguage(locale, language, sizeof language, &status);
  return U_SUCCESS(status) && status != U_STRING_NOT_TERMINATED_WARNING;
}

static icu::LocalUMessageFormatPointer open(const PatternKey &key, bool usesZone,
                                            UErrorCode *status) {
  if (usesZone) qlxIntlCheckHeldZone();
  const bool usesLanguage = usesZone || mayHaveType(key.pattern, {u"plural", u"selectordinal"});
  if (usesLanguage && !hasLanguage(key.locale)) *status = U_ILLEGAL_ARGUMENT_ERROR;
  return icu::LocalUMessageFormatPointer{umsg_open(
      key.pattern.data(), static_cast<int32_t>(key.pattern.size()), key.locale, nullptr, status)};
}

// Takes the format over when there is memory to hold it.
static void hold(const PatternKey &key, bool usesZone, icu::LocalUMessageFormatPointer &format) {
  OwnedStr locale{OslStringDup(key.locale)};
  OwnedUStr pattern{CxUStringDup(key.pattern.data())};
  if (!pattern || (key.locale && !locale)) return;
  HeldMessage &place = *std::ranges::min_element(gMessages, {}, &HeldMessage::lastUse);
  drop(place);
  place.format = format.orphan();
  place.key = {locale.release(), {pattern.release(), key.pattern.size()}, key.hash};
  place.usesZone = usesZone;
  place.lastUse = ++gUses;
  place.isComposed = qlxCompose(&place.composed, place.key.pattern, place.format);
}

// The highest number that an argument of the pattern may have, or -1. What only looks like an
// argument, in quotes, counts as well.
static int32_t highestArgument(std::u16string_view pattern) {
  int32_t highest = -1;
  for (size_t at = 0; (at = pattern.find(u'{', at)) != pattern.npos;) {
    ++at;
    while (at < pattern.size() && u_hasBinaryProperty(pattern[at], UCHAR_PATTERN_WHITE_SPACE)) ++at;
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

// Numbers and pointers travel in registers of two kinds and then on the stack: with this many zeros
// of both kinds whatever is read is a zero.
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

static uint32_t appendHeld(CxUStringBuff *text, const HeldMessage &held, va_list *args,
                           UErrorCode *status) {
  const uint32_t before = text->length;
  *status = U_ZERO_ERROR;
  if (args && held.isComposed && qlxAppendComposed(text, &held.composed, args)) {
    return text->length - before;
  }
  return append(text, held.format, held.key.pattern, args, status);
}

uint32_t qlxIntlAppendHeldMessage(CxUStringBuff *text, const char *locale,
                                  std::u16string_view pattern, va_list *args, UErrorCode *status) {
  if (qlxIsPlainPattern(pattern.data(), pattern.size())) return appendPlain(text, pattern, status);
  const PatternKey key{locale, pattern, hashOf(pattern)};
  if (HeldMessage *held = findCurrent(key)) {
    held->lastUse = ++gUses;
    return appendHeld(text, *held, args, status);
  }
  const bool usesZone = mayUseZone(key.pattern);
  *status = U_ZERO_ERROR;
  icu::LocalUMessageFormatPointer fresh = open(key, usesZone, status);
  if (U_FAILURE(*status)) return 0;
  const UMessageFormat *format = fresh.getAlias();
  hold(key, usesZone, fresh);
  return append(text, format, key.pattern, args, status);
}

uint32_t qlxAppendHeldMessage(CxUStringBuff *text, const char *locale, const UChar *pattern,
                              va_list *args, UErrorCode *status) {
  const HeldFormatsLock lock;
  return qlxIntlAppendHeldMessage(text, locale, {pattern, cxUnitsLength(pattern)}, args, status);
}
