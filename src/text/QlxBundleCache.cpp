// Resource bundles are cached by name, locale and default locale: where ICU has no bundle of the
// locale, it looks for one of the default locale. What is cached is the handle; ICU itself keeps
// the data that it has loaded, even when its data directory changes.
#include "QlxBundleCache.h"

#include <algorithm>
#include <array>
#include <cstring>

#include <unicode/uloc.h>
#include <unicode/ures.h>

#include <qlx/memory.h>

#include "QlxFormatCache.h"
#include "QlxMessageCache.h"
#include "util/CxHash.h"
#include "util/CxOwned.h"
#include "util/CxUnits.h"

struct BundleKey {
  const char *name;
  const char *locale;  // null is the default locale, and not the same as ""
  const char *defaultLocale;
};

static constexpr const char *BundleKey::*kKeyTexts[] = {&BundleKey::name, &BundleKey::locale,
                                                        &BundleKey::defaultLocale};

// What is cached for a key of a bundle. The text is the bundle's own, and valid as long as that.
struct BundlePattern {
  std::array<char, 48> key;
  std::u16string_view text;  // its data is null: a free place, all zero
  MessagePlace message;
  bool isScanned, isReadable;
  ArgTypes types;
};

struct CachedBundle {
  UResourceBundle *bundle;  // null: a free place, all zero
  BundleKey key;            // with copies of the texts, owned
  uint64_t lastUse;         // larger is later
  std::array<BundlePattern, 64> patterns;
};

static constexpr int kMaxCachedBundles = 16;

static CachedBundle gBundles[kMaxCachedBundles];
static uint64_t gUses;
static CxLook gLook;

static void freeTexts(BundleKey &key) {
  for (auto text : kKeyTexts) OslMemoryFree(const_cast<char *>(key.*text));
}

static void drop(CachedBundle &cached) {
  ures_close(cached.bundle);
  freeTexts(cached.key);
  cached = {};
}

static void dropAll() {
  for (CachedBundle &cached : gBundles)
    if (cached.bundle) drop(cached);
}

static const FormatCache gThis{dropAll, FormatCache::kClose};

static bool isSame(const BundleKey &a, const BundleKey &b) {
  return std::ranges::all_of(kKeyTexts, [&](auto text) { return qlxSameText(a.*text, b.*text); });
}

// A changed default locale drops no bundle, since the pattern that is being formatted may be of one
// of them. The bundles of the old default are just not found, as it is a part of their key.
static CachedBundle *find(const BundleKey &key) {
  for (CachedBundle &cached : gBundles)
    if (cached.bundle && isSame(cached.key, key)) return &cached;
  return nullptr;
}

// Opens a bundle by its name or, when that fails, by the part after the name's last "/".
static icu::LocalUResourceBundlePointer open(const char *name, const char *locale,
                                             UErrorCode *status) {
  icu::LocalUResourceBundlePointer bundle{ures_open(name, locale, status)};
  const char *separator = std::strrchr(name, '/');
  if (U_SUCCESS(*status) || !separator) return bundle;
  *status = U_ZERO_ERROR;
  return icu::LocalUResourceBundlePointer{ures_open(separator + 1, locale, status)};
}

// Takes the bundle over when there is memory for its key, but not when the default locale has
// changed meanwhile: ICU may have looked for it in either. That a bundle cannot be opened is not
// cached: it may be there the next time.
static void store(const BundleKey &key, icu::LocalUResourceBundlePointer &bundle) {
  if (!qlxSameText(uloc_getDefault(), key.defaultLocale)) return;
  BundleKey copy = key;
  bool whole = true;
  for (auto text : kKeyTexts) {
    copy.*text = OslStringDup(key.*text);
    whole = whole && (copy.*text || !(key.*text));
  }
  if (!whole) return freeTexts(copy);
  CachedBundle &place = *std::ranges::min_element(gBundles, {}, &CachedBundle::lastUse);
  drop(place);
  place.bundle = bundle.orphan();
  place.key = copy;
  place.lastUse = ++gUses;
}

// The place of a key's pattern; null: the key is too long for one.
static BundlePattern *placeOf(CachedBundle *cached, const char *key) {
  if (std::strlen(key) >= sizeof BundlePattern::key) return nullptr;
  return &cached->patterns[cxHashText(key) % cached->patterns.size()];
}

// A text that has a zero in it ends there.
static void lookUp(BundlePattern *pattern, const UResourceBundle *bundle, const char *key,
                   UErrorCode *status) {
  *status = U_ZERO_ERROR;
  const UChar *text = ures_getStringByKey(bundle, key, nullptr, status);
  if (U_SUCCESS(*status)) *pattern = {{}, {text, cxUnitsLength(text)}, {}, false, false, {}};
}

// Null when there is no pattern. `room` is for the pattern of a key that has no place.
static BundlePattern *patternOf(CachedBundle *cached, const char *key, BundlePattern *room,
                                UErrorCode *status) {
  BundlePattern *const place = key ? placeOf(cached, key) : nullptr;
  if (place && place->text.data() && std::strcmp(place->key.data(), key) == 0) return place;
  lookUp(room, cached->bundle, key, status);
  if (U_FAILURE(*status)) return nullptr;
  if (!place) return room;
  std::strcpy(room->key.data(), key);
  *place = *room;
  return place;
}

// Calls use(pattern) when there is one.
template <typename Use>
static void withPattern(const MessageName &message, UErrorCode *status, Use use) {
  qlxCheckDefaults(kLocaleOnly, &gLook);
  BundleKey key{message.bundle, message.locale, qlxDefaultLocale()};
  BundlePattern room{};
  if (CachedBundle *cached = find(key)) {
    cached->lastUse = ++gUses;
    if (BundlePattern *pattern = patternOf(cached, message.key, &room, status)) use(*pattern);
    return;
  }
  // ICU looks in the default locale when there is no bundle of the other. Its name is that of this
  // moment: ICU, asked for no locale, would take the one of a moment later.
  key.defaultLocale = uloc_getDefault();
  if (!qlxIsGoodLocale(key.defaultLocale)) *status = U_ILLEGAL_ARGUMENT_ERROR;
  if (U_FAILURE(*status)) return;
  const char *locale = key.locale ? key.locale : key.defaultLocale;
  icu::LocalUResourceBundlePointer fresh = open(key.name, locale, status);
  if (U_FAILURE(*status)) return;
  lookUp(&room, fresh.getAlias(), message.key, status);
  if (U_SUCCESS(*status)) use(room);
  store(key, fresh);
}

uint32_t qlxAppendBundleMessage(CxUStringBuff *text, const MessageName &message, va_list *args,
                                UErrorCode *status) {
  const FormatCacheLock lock;
  uint32_t appended = 0;
  withPattern(message, status, [&](BundlePattern &pattern) {
    appended = qlxAppendCachedMessageAt(&pattern.message, text, message.locale, pattern.text, args,
                                        status);
  });
  return appended;
}

bool qlxScanBundlePattern(const MessageName &message, ArgTypes *types) {
  const FormatCacheLock lock;
  UErrorCode status = U_ZERO_ERROR;
  bool isReadable = false;
  *types = {};
  withPattern(message, &status, [&](BundlePattern &pattern) {
    if (!pattern.isScanned) {
      pattern.isReadable = qlxScanPatternTypes(pattern.text.data(), &pattern.types);
    }
    pattern.isScanned = true;
    isReadable = pattern.isReadable;
    *types = pattern.types;
  });
  return isReadable;
}
