// A leak that is wanted: the leak checker ignores the blocks that are made while this lives.
#ifndef QLX_TESTS_WANTEDLEAK_H
#define QLX_TESTS_WANTEDLEAK_H

#if defined(__SANITIZE_ADDRESS__)
#define QLX_TESTS_LSAN
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define QLX_TESTS_LSAN
#endif
#endif

#ifdef QLX_TESTS_LSAN
#include <sanitizer/lsan_interface.h>
#endif

class WantedLeak {
 public:
#ifdef QLX_TESTS_LSAN
  WantedLeak() {
    __lsan_disable();
  }
  ~WantedLeak() {
    __lsan_enable();
  }
#else
  WantedLeak() {}
#endif
  WantedLeak(const WantedLeak &) = delete;
  WantedLeak &operator=(const WantedLeak &) = delete;
};

#endif
