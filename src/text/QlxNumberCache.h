// The two formats in which doubles are written beside messages, cached for the default locale.
#ifndef QLX_SRC_QLXNUMBERCACHE_H
#define QLX_SRC_QLXNUMBERCACHE_H

#include <qlx/types.h>

// As a message pattern's "#" or "#.#####" writes it.
enum NumberStyle { kWholeNumber, kFraction };

// Appends a number in the default locale. Returns 1, or 0 when memory ran out; what ICU cannot
// format is empty.
uint8_t qlxAppendCachedNumber(CxUStringBuff *text, NumberStyle which, double value);

#endif
