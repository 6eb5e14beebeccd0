// What all caches of ICU's formats share: when they are emptied, and their lock.
//
// A format depends on the defaults under which it was opened: ICU's default locale, time zone and
// code page. A cached one must give the same text, byte for byte, as one that is opened now. So the
// defaults are looked at before a cached format is used, as often as CxLook.h says, and a change
// empties the caches.
//
// One lock guards all caches of this folder. It is not the API lock, which those who format a date
// need not have. While it is held nothing is called that takes a lock of this library, and no
// host's code.
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

  static void dropAll(Until until);  // kClose: all caches; kDefaultsChange: those that end with it

 private:
  void (*const drop_)();
  const Until until_;
  const FormatCache *const next_;
};

// All below are called with the lock held.

enum QlxDefaults : uint8_t { kLocaleOnly, kZoneOnly, kEveryDefault };

// Looks whether the defaults are still the same, and empties caches when they are not. With a null
// `look` in any case; else when that says that it is time for it, or when a default is not known:
// never looked at, or a name too long to compare.
void qlxCheckDefaults(QlxDefaults which, CxLook *look);

// The defaults at the last look: the locale's name, and the zone, null when it is not known.
const char *qlxDefaultLocale(void);
const icu::TimeZone *qlxDefaultZone(void);

// Whether a name is safe as a locale's: ICU's parser can read it, and the name that the parser
// makes of it keeps to ICU's lengths. With some other names ICU ends the process when it makes
// dates or plural rules.
bool qlxIsGoodLocale(const char *name);

// The name, or "", the root locale's, in place of one that is not good.
const char *qlxGoodLocale(const char *name);

// Whether two texts by which something is cached are the same; null is the same as null alone.
inline bool qlxSameText(const char *a, const char *b) {
  return a && b ? std::strcmp(a, b) == 0 : a == b;
}

// Appends what format(room, units, status) writes: straight into the buffer's block, which has room
// for that many units. As ICU's calls do, format answers the units needed; when they did not fit it
// is asked again, with more room. Returns the units appended; 0 with the text unchanged when
// *status is a failure.
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
