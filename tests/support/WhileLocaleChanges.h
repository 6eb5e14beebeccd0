// A call during which another thread changes ICU's default locale all the time.
#ifndef QLX_TESTS_WHILELOCALECHANGES_H
#define QLX_TESTS_WHILELOCALECHANGES_H

#include <atomic>
#include <thread>

#include "support/IcuDefaults.h"

// The default locale is one of the two during the call, and the first one when this returns.
template <typename Call>
void whileLocaleChanges(const char *first, const char *second, Call call) {
  std::atomic<bool> started{false}, stop{false};
  std::thread changing([&] {
    for (; !stop; started = true) {
      IcuDefaults::setLocale(second);
      IcuDefaults::setLocale(first);
    }
  });
  while (!started) std::this_thread::yield();
  call();
  stop = true;
  changing.join();
}

#endif
