// Parsed message patterns, cached by pattern and locale: to parse one costs about twenty times what
// it costs to format with it. When all places are taken, the one that was not used for longest is
// dropped.
#ifndef QLX_SRC_QLXMESSAGECACHE_H
#define QLX_SRC_QLXMESSAGECACHE_H

#include <cstdarg>
#include <string_view>

#include <qlx/types.h>

#include "util/CxUStringBuff.h"
#include "util/CxUnits.h"

inline constexpr int kMaxCachedMessages = 64;

// Appends the pattern, formatted with the arguments in a locale (null is the default locale), as
// u_vformatMessage() formats it. Null args read as zeros: a number is 0, a date is 1970, and a text
// is a null string, which ICU answers with U_ILLEGAL_ARGUMENT_ERROR. Returns the units appended; 0
// with the buffer's text unchanged when *status is a failure and when the text is empty. When
// memory runs out *status is U_MEMORY_ALLOCATION_ERROR. It is U_ILLEGAL_ARGUMENT_ERROR for a
// pattern that nests too deep, and for one whose arguments need data of a locale whose name is not
// good (qlxIsGoodLocale()).
uint32_t qlxAppendCachedMessage(CxUStringBuff *text, const char *locale, const UChar *pattern,
                                va_list *args, UErrorCode *status);

// Where a caller found the message of its pattern and locale the last time; all zero at first. When
// the serial number there is another one by now, so is the message.
struct MessagePlace {
  struct CachedMessage *cached;
  uint64_t serial;  // of what was cached there
};

// The same for a caller that has the lock of the caches and a MessagePlace for its pattern.
uint32_t qlxAppendCachedMessageAt(MessagePlace *place, CxUStringBuff *text, const char *locale,
                                  std::u16string_view pattern, va_list *args, UErrorCode *status);

// For cxAnyUnit(): the units by which a pattern differs from the text that it gives.
struct QlxPatternSyntax {
  template <typename Units>
  auto operator()(Units units) const {
    constexpr uint16_t kOpen = u'{', kClose = u'}', kQuote = u'\'';
    return (units == kOpen) | (units == kClose) | (units == kQuote);
  }
};

// Whether a pattern gives just itself as its text, in every locale.
inline bool qlxIsPlainPattern(std::u16string_view pattern) {
  return !cxAnyUnit(pattern.data(), pattern.size(), QlxPatternSyntax{});
}

#endif
