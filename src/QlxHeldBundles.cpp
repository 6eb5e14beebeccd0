// Resource bundles, held by name and locale, and by the default locale, in which ICU looks for them
// when it has no bundle of the locale. ICU keeps what it has loaded anyway, also when its data
// directory is another one by now; held is the handle.
#include "QlxHeldFormats.h"

#include <algorithm>
#include <array>
#include <cstring>

#include <unicode/uloc.h>
#include <unicode/ures.h>

#include <qlx/memory.h>

#include "QlxPatternTypes.h"
#include "util/CxOwned.h"
#include "util/CxUnits.h"

struct BundleKey {
  const char *name;
  const char *locale;  // null is the default locale, and not the same as ""
  const char *defaultLocale;
};

static constexpr const char *BundleKey::*kKeyTexts[] = {&BundleKey::name, &BundleKey::locale,
                                                        &BundleKey::defaultLocale};

// What the scan of a pattern found; patterns stay where they are while their bundle is held.
struct Scan {
  const UChar *pattern;
  bool readable;
  ArgTypes types;
};

struct HeldBundle {
  UResourceBundle *bundle;  // null: a free place, all zero
  BundleKey key;            // with copies of the texts, owned
  uint64_t lastUse;         // larger is later
  std::array<Scan, 16> scans;
};

static constexpr int kMaxHeldBundles = 16;

static HeldBundle gBundles[kMaxHeldBundles];
static uint64_t gUses;

static void freeTexts(BundleKey &key) {
  for (auto text : kKeyTexts) OslMemoryFree(const_cast<char *>(key.*text));
}

static void drop(HeldBundle &held) {
  ures_close(held.bundle);
  freeTexts(held.key);
  held = {};
}

void qlxIntlDropHeldBundles(void) {
  for (HeldBundle &held : gBundles)
    if (held.bundle) drop(held);
}

static bool isSame(const BundleKey &a, const BundleKey &b) {
  return std::ranges::all_of(kKeyTexts, [&](auto text) { return qlxSameText(a.*text, b.*text); });
}

// A pattern of a held bundle is in use while it is formatted, so nothing here is dropped when a
// default turns out to be another one.
static HeldBundle *find(const BundleKey &key) {
  for (HeldBundle &held : gBundles)
    if (held.bundle && isSame(held.key, key)) return &held;
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

// Takes the bundle over when there is memory to hold it. One that cannot be opened is not held: it
// may be there the next time.
static void hold(const BundleKey &key, icu::LocalUResourceBundlePointer &bundle) {
  BundleKey copy = key;
  bool whole = true;
  for (auto text : kKeyTexts) {
    copy.*text = OslStringDup(key.*text);
    whole = whole && (copy.*text || !(key.*text));
  }
  if (!whole) return freeTexts(copy);
  HeldBundle &place = *std::ranges::min_element(gBundles, {}, &HeldBundle::lastUse);
  drop(place);
  place.bundle = bundle.orphan();
  place.key = copy;
  place.lastUse = ++gUses;
}

// The text ends at its first zero, where it has one.
static std::u16string_view lookUp(const UResourceBundle *bundle, const char *key,
                                  UErrorCode *status) {
  *status = U_ZERO_ERROR;
  const UChar *pattern = ures_getStringByKey(bundle, key, nullptr, status);
  if (U_FAILURE(*status)) return {};
  return {pattern, cxUnitsLength(pattern)};
}

// Calls use(held bundle or null, pattern); not at all when the bundle cannot be opened.
template <typename Use>
static void withPattern(const MessageName &message, UErrorCode *status, Use use) {
  const BundleKey key{message.bundle, message.locale, uloc_getDefault()};
  if (HeldBundle *held = find(key)) {
    held->lastUse = ++gUses;
    return use(held, lookUp(held->bundle, message.key, status));
  }
  icu::LocalUResourceBundlePointer fresh = open(message.bundle, message.locale, status);
  if (U_FAILURE(*status)) return;
  use(nullptr, lookUp(fresh.getAlias(), message.key, status));
  hold(key, fresh);
}

uint32_t qlxAppendBundleMessage(CxUStringBuff *text, const MessageName &message, va_list *args,
                                UErrorCode *status) {
  const HeldFormatsLock lock;
  uint32_t appended = 0;
  withPattern(message, status, [&](HeldBundle *, std::u16string_view pattern) {
    if (U_SUCCESS(*status)) {
      appended = qlxIntlAppendHeldMessage(text, message.locale, pattern, args, status);
    }
  });
  return appended;
}

static const Scan &scanOf(HeldBundle *held, const UChar *pattern, Scan *room) {
  const size_t place = reinterpret_cast<uintptr_t>(pattern) / sizeof(uint64_t);
  Scan &scan = held ? held->scans[place % held->scans.size()] : *room;
  if (scan.pattern == pattern) return scan;
  scan.pattern = pattern;
  scan.readable = qlxScanPatternTypes(pattern, &scan.types);
  return scan;
}

bool qlxScanBundlePattern(const MessageName &message, ArgTypes *types) {
  const HeldFormatsLock lock;
  UErrorCode status = U_ZERO_ERROR;
  Scan room{};
  withPattern(message, &status, [&](HeldBundle *held, std::u16string_view pattern) {
    if (U_SUCCESS(status)) room = scanOf(held, pattern.data(), &room);
  });
  *types = room.types;
  return room.readable;
}
