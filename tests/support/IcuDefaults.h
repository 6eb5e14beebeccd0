// ICU's process-wide defaults for a test that changes them: locale, time zone and code page are put
// back at its end. A change is seen by the next record, be it the thousandth of a burst.
#ifndef QLX_TESTS_ICUDEFAULTS_H
#define QLX_TESTS_ICUDEFAULTS_H

#include <string>

#include <unicode/ucal.h>
#include <unicode/ucnv.h>
#include <unicode/uloc.h>

#include "util/CxLook.h"

class IcuDefaults {
 public:
  IcuDefaults() : locale_(uloc_getDefault()), codePage_(ucnv_getDefaultName()) {
    UErrorCode status = U_ZERO_ERROR;
    const int32_t length = ucal_getDefaultTimeZone(zone_, kMaxZone, &status);
    zone_[U_SUCCESS(status) && length < kMaxZone ? length : 0] = 0;
  }
  ~IcuDefaults() {
    setLocale(locale_.c_str());
    setZone(zone_);
    setCodePage(codePage_.c_str());
  }
  IcuDefaults(const IcuDefaults &) = delete;
  IcuDefaults &operator=(const IcuDefaults &) = delete;

  static bool setLocale(const char *locale) {
    UErrorCode status = U_ZERO_ERROR;
    uloc_setDefault(locale, &status);
    cxLookRestart();
    return U_SUCCESS(status);
  }
  static bool setZone(const UChar *zone) {
    UErrorCode status = U_ZERO_ERROR;
    ucal_setDefaultTimeZone(zone, &status);
    cxLookRestart();
    return U_SUCCESS(status);
  }
  // False when this build of ICU has UTF-8 for good.
  static bool setCodePage(const char *name) {
    ucnv_setDefaultName(name);
    cxLookRestart();
    return ucnv_compareNames(ucnv_getDefaultName(), name) == 0;
  }

 private:
  static constexpr int32_t kMaxZone = 128;

  std::string locale_, codePage_;
  UChar zone_[kMaxZone];
};

#endif
