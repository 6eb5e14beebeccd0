// The clock of the library's looks, in a test's hand while it lives: it stands still.
#ifndef QLX_TESTS_TESTCLOCK_H
#define QLX_TESTS_TESTCLOCK_H

#include "util/CxLook.h"

class TestClock {
 public:
  TestClock() : before_(cxLookTick) {
    tick = 1;
    cxLookTick = [] { return tick; };
    cxLookRestart();
  }
  ~TestClock() {
    cxLookTick = before_;
    cxLookRestart();
  }
  TestClock(const TestClock &) = delete;
  TestClock &operator=(const TestClock &) = delete;

  static inline int64_t tick;  // nanoseconds

 private:
  int64_t (*before_)(void);
};

#endif
