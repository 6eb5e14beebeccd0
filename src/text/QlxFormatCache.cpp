#include "QlxFormatCache.h"

#include <pthread.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <string_view>

#include <unicode/localpointer.h>
#include <unicode/locid.h>
#include <unicode/ucnv.h>
#include <unicode/uloc.h>

#include "util/CxThread.h"

static pthread_mutex_t gLock = PTHREAD_MUTEX_INITIALIZER;
static CxCancellation gCancellation;  // of the thread that holds gLock, as it was before

// What the cached formats were made under. A name that does not fit is kept cut, and so never found
// the same: nothing is then cached for longer than a call.
static std::array<char, 256> gLocale;
static std::array<char, 64> gCodePage;
static icu::TimeZone *gZone;  // owned; null: not known

static void dropAll() {
  qlxDropCachedMessages();
  qlxDropCachedDates();
  qlxDropCachedNumbers();
}

template <size_t size>
static void check(std::array<char, size> &known, const char *name) {
  if (std::strcmp(known.data(), name) == 0) return;
  dropAll();
  std::strncpy(known.data(), name, size - 1);
}

const char *qlxCheckCachedLocale(void) {
  const char *name = uloc_getDefault();
  check(gLocale, name);
  return name;
}

// The parser itself minds the capacities of the language, the script, the country and each key.
bool qlxIsGoodLocale(const char *name) {
  const icu::Locale locale(name);
  if (locale.isBogus()) return false;
  const std::string_view whole{locale.getName()};
  const size_t keywords = whole.size() - std::min(whole.size(), whole.find('@'));  // with the "@"
  return whole.size() < ULOC_FULLNAME_CAPACITY && keywords <= ULOC_KEYWORD_AND_VALUES_CAPACITY;
}

const char *qlxGoodLocale(const char *name) {
  return qlxIsGoodLocale(name) ? name : "";
}

void qlxCheckCachedCodePage(void) {
  check(gCodePage, ucnv_getDefaultName());
}

// Zones of one name may differ: a host may make them, and one that ICU does not know has the name
// that the system gives it.
void qlxCheckCachedZone(void) {
  icu::LocalPointer<icu::TimeZone> zone{icu::TimeZone::createDefault()};
  if (gZone && zone.isValid() && *zone == *gZone) return;
  dropAll();
  delete gZone;
  gZone = zone.orphan();
}

const icu::TimeZone *qlxCachedZone(void) {
  return gZone;
}

void qlxDropCachedFormats(void) {
  const FormatCacheLock lock;
  dropAll();
  qlxDropCachedBundles();
  delete gZone;
  gZone = nullptr;
}

void qlxFormatCacheLock(void) {
  const CxCancellation before = cxThreadDisableCancel();
  pthread_mutex_lock(&gLock);
  gCancellation = before;
}

void qlxFormatCacheUnlock(void) {
  const CxCancellation before = gCancellation;
  pthread_mutex_unlock(&gLock);
  cxThreadRestoreCancel(before);
}
