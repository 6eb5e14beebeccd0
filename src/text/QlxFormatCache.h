// What ICU's formats are made under, and how long they are good: a cached format, message or number
// is what opening anew under the default locale, time zone and code page of that moment gives, byte
// for byte. Who finds that one of these defaults has changed drops everything that is cached by it.
//
// A lock of its own guards all caches of this folder, since formatting a date takes no API lock.
// Who holds it calls nothing that takes a lock of this library, and no host's code.
#ifndef QLX_SRC_QLXFORMATCACHE_H
#define QLX_SRC_QLXFORMATCACHE_H

#include <pthread.h>

#include <cstdint>
#include <cstring>

#include <unicode/timezone.h>

#include "util/CxLook.h"
#include "util/CxThread.h"
#include "util/CxUStringBuff.h"

class FormatCacheLock {
 public:
  FormatCacheLock() { pthread_mutex_lock(&gMutex); }
  ~FormatCacheLock() { pthread_mutex_unlock(&gMutex); }
  FormatCacheLock(const FormatCacheLock &) = delete;
  FormatCacheLock &operator=(const FormatCacheLock &) = delete;

 private:
  static inline pthread_mutex_t gMutex = PTHREAD_MUTEX_INITIALIZER;
  CxNoCancel untilItIsGivenBack_;
};

// Drops everything; formatting afterwards caches anew. Takes the lock.
void qlxDropCachedFormats(void);

// A cache registers how it is emptied, as a static of its file.
class FormatCache {
 public:
  enum Until { kDefaultsChange, kClose };
  FormatCache(void (*drop)(), Until until);
  FormatCache(const FormatCache &) = delete;
  FormatCache &operator=(const FormatCache &) = delete;

  static void dropAll(Until until);  // those that last until then or shorter

 private:
  void (*const drop_)();
  const Until until_;
  const FormatCache *const next_;
};

// All below are called with the lock held.

enum QlxDefaults : uint8_t { kLocaleOnly, kZoneOnly, kEveryDefault };

// Looks whether defaults are still the same, when `look` says that it is time for that; with a null
// look, and while they are not known, in any case.
void qlxCheckDefaults(QlxDefaults which, CxLook *look);

// The defaults as they were when they were looked at last: the locale's name, and the zone, which
// is null when it is not known.
const char *qlxDefaultLocale(void);
const icu::TimeZone *qlxDefaultZone(void);

// Whether ICU takes a name for one of a locale: its own parser can read it, and what that makes of
// it keeps to ICU's lengths. By some other names ICU cannot make dates and plural rules without
// ending the process.
bool qlxIsGoodLocale(const char *name);

// The name, or the root's for one that is not good.
const char *qlxGoodLocale(const char *name);

// Whether two texts by which something is cached are the same; null is the same as null alone.
inline bool qlxSameText(const char *a, const char *b) {
  return a && b ? std::strcmp(a, b) == 0 : a == b;
}

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
