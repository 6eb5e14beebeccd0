// Resource bundles, cached by name and locale, with the patterns that were asked for.
#ifndef QLX_SRC_QLXBUNDLECACHE_H
#define QLX_SRC_QLXBUNDLECACHE_H

#include <cstdarg>

#include <qlx/types.h>

#include "QlxPatternTypes.h"

struct MessageName {
  const char *bundle;  // not null; searched by its name or, when that fails, by the part after its
                       // last "/"
  const char *key;
  const char *locale;
};

// As qlxAppendCachedMessage(), for the pattern of that name.
uint32_t qlxAppendBundleMessage(CxUStringBuff *text, const MessageName &message, va_list *args,
                                UErrorCode *status);

// Learns the types of such a pattern's arguments; false when there is none or it cannot be read.
bool qlxScanBundlePattern(const MessageName &message, ArgTypes *types);

#endif
