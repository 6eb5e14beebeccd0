// What the formatters of the library that have keys share.
#ifndef QLX_SRC_QLXBASICFORMATTER_H
#define QLX_SRC_QLXBASICFORMATTER_H

#include <qlx/types.h>

#include "text/QlxDateCache.h"

// The variables of the basic formatter, and what those of others begin with.
struct QlxFormatterVars {
  uint8_t isUtc;  // 1: times in UTC, 0: in the default zone
};

// How the formatter writes times; the default style for null and for an object of another kind.
DateStyle qlxDateStyleOf(const QlxObject *formatter);

#endif
