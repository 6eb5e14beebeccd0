// What a message pattern says about the types of its arguments.
#ifndef QLX_SRC_QLXPATTERNTYPES_H
#define QLX_SRC_QLXPATTERNTYPES_H

#include <array>

#include <qlx/base.h>

#include "QlxArgType.h"

using ArgTypes = std::array<ArgType, 10>;  // by argument index

/** Scans a pattern; false when it cannot be read or nests too deep. Deliberate: one apostrophe
 * toggles quoting, also where ICU prints it. The last type seen for an index counts; indexes above
 * 9 are ignored. */
bool qlxScanPatternTypes(const UChar *pattern, ArgTypes *types);

#endif
