#include "QlxFormatCache.h"

#include <algorithm>
#include <array>
#include <optional>
#include <string_view>
#include <utility>

#include <unicode/localpointer.h>
#include <unicode/locid.h>
#include <unicode/ucnv.h>
#include <unicode/uloc.h>

#include "util/CxHooks.h"

// ---- A fork, and the end

static std::optional<FormatCacheLock> gForkLock;

static const CxHooks gHooks{{
    .beforeFork = [] { gForkLock.emplace(); },
    .afterFork = [](bool) { gForkLock.reset(); },
    .atClose = qlxDropCachedFormats,
}};

// ---- The caches

static constinit const FormatCache *gFirst = nullptr;

FormatCache::FormatCache(void (*drop)(), Until until)
    : drop_(drop), until_(until), next_(std::exchange(gFirst, this)) {}

void FormatCache::dropAll(Until until) {
  for (const FormatCache *it = gFirst; it; it = it->next_)
    if (it->until_ <= until) it->drop_();
}

// ---- The defaults

// A name that does not fit is stored cut, and so never found the same: nothing is then cached for
// longer than a call.
static std::array<char, 256> gLocale;
static std::array<char, 64> gCodePage;
static icu::TimeZone *gZone;  // owned; null: not known

template <size_t size>
static void check(std::array<char, size> &known, const char *name) {
  if (std::strcmp(known.data(), name) == 0) return;
  FormatCache::dropAll(FormatCache::kDefaultsChange);
  std::strncpy(known.data(), name, size - 1);
}

static bool isCut() {
  return gLocale[gLocale.size() - 2] != '\0';
}

// Zones of one name may differ: a host may make them, and one that ICU does not know has the name
// that the system gives it.
static void checkZone() {
  icu::LocalPointer<icu::TimeZone> zone{icu::TimeZone::createDefault()};
  if (gZone && zone.isValid() && *zone == *gZone) return;
  FormatCache::dropAll(FormatCache::kDefaultsChange);
  delete gZone;
  gZone = zone.orphan();
}

static bool isKnown(QlxDefaults which) {
  const bool isLocaleKnown = gLocale[0] != '\0' && !isCut();
  return (which == kZoneOnly || isLocaleKnown) && (which == kLocaleOnly || gZone);
}

void qlxCheckDefaults(QlxDefaults which, CxLook *look) {
  if (look && isKnown(which) && !cxLookAgain(look)) return;
  if (which != kZoneOnly) check(gLocale, uloc_getDefault());
  if (which != kLocaleOnly) checkZone();
  if (which == kEveryDefault) check(gCodePage, ucnv_getDefaultName());
}

const char *qlxDefaultLocale(void) {
  return isCut() ? uloc_getDefault() : gLocale.data();
}

const icu::TimeZone *qlxDefaultZone(void) {
  return gZone;
}

void qlxDropCachedFormats(void) {
  const FormatCacheLock lock;
  FormatCache::dropAll(FormatCache::kClose);
  delete std::exchange(gZone, nullptr);
}

// ---- Names of locales

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
