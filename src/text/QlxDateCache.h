// Date formats, cached by style, each with the text of the last second that it was asked for: to
// open one costs several times what it costs to format with it, and the texts of one second differ
// only in their milliseconds. When all places are taken, the one that was not used for longest is
// dropped.
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
// or 0 when memory ran out. A time that ICU cannot format is an empty text; where ICU has no date
// format at all, the buffer is not touched, so that one without a block stays without.
uint8_t qlxAppendCachedDate(CxUStringBuff *text, const DateStyle &style, double time);

// The same as bytes; false, with nothing appended, when the text is not ASCII, is too long, or is
// not one that can be cached for its second.
bool qlxAppendCachedDateAscii(CxAsciiLine *line, const DateStyle &style, double time);

#endif
