#include "QlxHeldFormats.h"

#include <pthread.h>

#include <array>
#include <cstring>

#include <unicode/ucal.h>
#include <unicode/ucnv.h>
#include <unicode/uloc.h>
#include <unicode/ustring.h>

static pthread_mutex_t gLock = PTHREAD_MUTEX_INITIALIZER;

// What the held formats were made under. A name that does not fit is kept cut, and so never found
// the same: nothing is then held for longer than a call.
static std::array<char, 256> gLocale;
static std::array<char, 64> gCodePage;
static std::array<UChar, 128> gZone;

static void dropAll() {
  qlxIntlDropHeldMessages();
  qlxIntlDropHeldDates();
  qlxIntlDropHeldNumbers();
}

template <size_t size>
static void check(std::array<char, size> &known, const char *name) {
  if (std::strcmp(known.data(), name) == 0) return;
  dropAll();
  std::strncpy(known.data(), name, size - 1);
}

void qlxIntlCheckHeldLocale(void) {
  check(gLocale, uloc_getDefault());
}

void qlxIntlCheckHeldCodePage(void) {
  check(gCodePage, ucnv_getDefaultName());
}

void qlxIntlCheckHeldZone(void) {
  std::array<UChar, gZone.size()> zone;
  UErrorCode status = U_ZERO_ERROR;
  const int32_t length = ucal_getDefaultTimeZone(zone.data(), zone.size(), &status);
  const bool whole = U_SUCCESS(status) && length < static_cast<int32_t>(zone.size());
  if (whole && u_strcmp(zone.data(), gZone.data()) == 0) return;
  dropAll();
  if (!whole) zone[0] = 0;
  u_strcpy(gZone.data(), zone.data());
}

void qlxDropHeldFormats(void) {
  const HeldFormatsLock lock;
  dropAll();
  qlxIntlDropHeldBundles();
}

void qlxHeldFormatsLock(void) {
  pthread_mutex_lock(&gLock);
}

void qlxHeldFormatsUnlock(void) {
  pthread_mutex_unlock(&gLock);
}
