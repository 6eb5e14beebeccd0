// ICU formats that are cached between calls. Opening a date format costs several times what
// formatting with it does, and parsing a message pattern about twenty times; the text of a second
// changes only in its milliseconds. What comes out is, byte for byte, what opening anew for every
// call gives: a cached format is good for the default locale, time zone and code page that it was
// made under, and when one of them is another by now, everything is dropped. Bounded; the one not
// used for longest goes.
//
// A lock of its own guards all of it, since formatting a date takes no API lock. Whoever holds it
// calls nothing that takes a lock of this library, and no host's code.
#ifndef QLX_SRC_QLXFORMATCACHE_H
#define QLX_SRC_QLXFORMATCACHE_H

#include <cstdint>
#include <cstring>
#include <string_view>

#include <unicode/timezone.h>

#include <qlx/types.h>

#include "QlxPatternTypes.h"
#include "util/CxAsciiLine.h"
#include "util/CxUStringBuff.h"
#include "util/CxUnits.h"

inline constexpr int kMaxCachedMessages = 64;
inline constexpr int kMaxCachedDates = 16;

QLX_BEGIN_DECLS

// Appends the pattern, formatted with the arguments in a locale (null is the default locale), as
// u_vformatMessage() formats it. Null args read as zeros: a number is 0, a date is 1970, and a text
// is a null string, which ICU answers with U_ILLEGAL_ARGUMENT_ERROR. Returns the units appended; 0
// with the buffer's text unchanged when *status is a failure and when the text is empty. When
// memory runs out *status is U_MEMORY_ALLOCATION_ERROR. A pattern that nests too deep, and what
// takes dates or plural rules from a locale of a name that is none, are U_ILLEGAL_ARGUMENT_ERROR.
uint32_t qlxAppendCachedMessage(CxUStringBuff *text, const char *locale, const UChar *pattern,
                                va_list *args, UErrorCode *status);

// The same for a pattern of a bundle, which is searched by its name or, when that fails, by the
// part after the name's last "/". The bundle is not null.
struct MessageName {
  const char *bundle;
  const char *key;
  const char *locale;
};
uint32_t qlxAppendBundleMessage(CxUStringBuff *text, const MessageName &message, va_list *args,
                                UErrorCode *status);

// Learns the types of such a pattern's arguments; false when there is none or it cannot be read.
bool qlxScanBundlePattern(const MessageName &message, ArgTypes *types);

// Appends a time in milliseconds since 1970-01-01 UTC, formatted by an 8-bit date pattern in the
// default locale and zone; a null pattern is "yyyy-MM-dd HH:mm:ss.SSS" and the offset from UTC.
// Returns 1, or 0 when memory ran out; what ICU cannot format is empty, and nothing is appended,
// not even to a buffer without a block, where it has no format.
uint8_t qlxAppendCachedDate(CxUStringBuff *text, const char *pattern, double time);

// The same as bytes; false when the text is not ASCII, or not one that is kept for its second.
bool qlxAppendCachedDateAscii(CxAsciiLine *line, const char *pattern, double time);

// Appends a number in the default locale as a message pattern's "#" or "#.#####" writes it. Returns
// 1, or 0 when memory ran out; what ICU cannot format is empty.
typedef enum QlxCachedNumber { kCachedWhole, kCachedFraction } QlxCachedNumber;
uint8_t qlxAppendCachedNumber(CxUStringBuff *text, QlxCachedNumber which, double value);

// Drops everything; formatting afterwards holds anew.
void qlxDropCachedFormats(void);

// For a fork: the lock is taken before it and given back after it, in the parent and in the child.
void qlxFormatCacheLock(void);
void qlxFormatCacheUnlock(void);

// For the modules that hold, which have the lock. `known` is where the message of this pattern and
// locale was cached the last time, all zero at first; the default locale was checked before.
struct MessagePlace {
  struct CachedMessage *cached;
  uint64_t serial;  // of what the place cached then
};
uint32_t qlxAppendCachedMessageAt(CxUStringBuff *text, MessagePlace *known, const char *locale,
                                  std::u16string_view pattern, va_list *args, UErrorCode *status);
void qlxDropCachedBundles(void);
void qlxDropCachedMessages(void);
void qlxDropCachedDates(void);
void qlxDropCachedNumbers(void);

// Whether ICU takes a name for one of a locale: its own parser can read it, and what that makes of
// it keeps to ICU's lengths. By some other names ICU cannot make dates and plural rules without
// ending the process.
bool qlxIsGoodLocale(const char *name);

// The name, or the root's for one that is not good.
const char *qlxGoodLocale(const char *name);

// Each drops everything when that default is not the one of its last call.
const char *qlxCheckCachedLocale(void);  // the default locale's name
void qlxCheckCachedZone(void);
void qlxCheckCachedCodePage(void);

// The default zone as it was when it was checked last; null when it is not known.
const icu::TimeZone *qlxCachedZone(void);

QLX_END_DECLS

// Whether two texts by which something is cached are the same; null is the same as null alone.
inline bool qlxSameText(const char *a, const char *b) {
  return a && b ? std::strcmp(a, b) == 0 : a == b;
}

// For cxAnyUnit(): what makes a pattern another text than its own.
struct QlxPatternSyntax {
  template <typename Units>
  auto operator()(Units units) const {
    constexpr uint16_t kOpen = u'{', kClose = u'}', kQuote = u'\'';
    return (units == kOpen) | (units == kClose) | (units == kQuote);
  }
};

// Whether a pattern is its own text, in every locale.
inline bool qlxIsPlainPattern(const UChar *pattern, size_t units) {
  return !cxAnyUnit(pattern, units, QlxPatternSyntax{});
}

class FormatCacheLock {
 public:
  FormatCacheLock() { qlxFormatCacheLock(); }
  ~FormatCacheLock() { qlxFormatCacheUnlock(); }
  FormatCacheLock(const FormatCacheLock &) = delete;
  FormatCacheLock &operator=(const FormatCacheLock &) = delete;
};

// Appends what format(room, units, status) writes straight into the buffer's block. As ICU's calls
// do, it answers the units needed, and is asked again only when they did not fit. Returns the units
// appended; 0 with the text unchanged when *status is a failure.
template <typename Format>
uint32_t qlxAppendFormatted(CxUStringBuff *text, UErrorCode *status, const Format &format) {
  for (uint32_t needed = 0;;) {
    *status = U_MEMORY_ALLOCATION_ERROR;
    if (!cxUStringBuffHasCapacity(text, needed)) return 0;
    *status = U_ZERO_ERROR;
    UChar *const end = text->data + text->length;
    const uint32_t room = text->capacity / sizeof(UChar) - text->length;
    const int32_t answer = format(end, static_cast<int32_t>(room), status);
    needed = answer > 0 ? static_cast<uint32_t>(answer) : 0;
    const bool failed = U_FAILURE(*status) && *status != U_BUFFER_OVERFLOW_ERROR;
    if (!failed && needed < room && U_SUCCESS(*status)) {
      end[needed] = 0;
      text->length += needed;
      return needed;
    }
    end[0] = 0;
    if (failed || needed < room) return 0;
  }
}

#endif
