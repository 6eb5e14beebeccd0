// Locales in which numbers come out in every way that ICU knows.
#ifndef QLX_TESTS_LOCALES_H
#define QLX_TESTS_LOCALES_H

#include <string>
#include <vector>

#include <unicode/uloc.h>

inline std::vector<std::string> allLocales() {
  std::vector<std::string> names{"",
                                 "en@numbers=arab",
                                 "zh@numbers=hans",
                                 "ja@numbers=jpan",
                                 "hi@numbers=native",
                                 "ar@numbers=native",
                                 "de@numbers=roman",
                                 "en@numbers=hebr",
                                 "ta@numbers=traditional",
                                 "ccp@numbers=native",
                                 "de@currency=JPY",
                                 "xx_YY",
                                 "en_US_POSIX"};
  for (int32_t i = 0; i < uloc_countAvailable(); ++i) names.emplace_back(uloc_getAvailable(i));
  return names;
}

#endif
