// Date formats, cached by pattern, each with the text of the last second that it was asked for:
// opening one costs several times what formatting with it does, and the text of a second changes
// only in its milliseconds. Bounded; the one not used for longest goes.
#ifndef QLX_SRC_QLXDATECACHE_H
#define QLX_SRC_QLXDATECACHE_H

#include <qlx/types.h>

#include "util/CxAsciiLine.h"
#include "util/CxUStringBuff.h"

inline constexpr int kMaxCachedDates = 16;

struct DateStyle {
  const char
      *pattern;  // ICU's, in 8 bits; null is the default one, which the offset from UTC follows
  bool isUtc;    // else in the default zone
};

// The default pattern is "yyyy-MM-dd HH:mm:ss.SSS".
//
// Appends a time in milliseconds since 1970-01-01 UTC, formatted in the default locale. Returns 1,
// or 0 when memory ran out; what ICU cannot format is empty, and nothing is appended, not even to a
// buffer without a block, where it has no format.
uint8_t qlxAppendCachedDate(CxUStringBuff *text, const DateStyle &style, double time);

// The same as bytes; false when the text is not ASCII, or not one that is cached for its second.
bool qlxAppendCachedDateAscii(CxAsciiLine *line, const DateStyle &style, double time);

#endif
