// What the formatters of the library that have keys share.
#ifndef QLX_SRC_QLXBASICFORMATTER_H
#define QLX_SRC_QLXBASICFORMATTER_H

#include <qlx/types.h>

#include "text/QlxDateCache.h"

// How the formatter writes times; the default style for null and for an object of another kind.
DateStyle qlxDateStyleOf(const QlxObject *formatter);

#endif
