// The clock of the library's looks, in a test's hand while it lives: it stands still.
#ifndef QLX_TESTS_TESTCLOCK_H
#define QLX_TESTS_TESTCLOCK_H

#include "QlxLook.h"

class TestClock {
 public:
  TestClock() : before_(qlxLookTick) {
    tick = 1;
    qlxLookTick = [] { return tick; };
    qlxLookRestart();
  }
  ~TestClock() {
    qlxLookTick = before_;
    qlxLookRestart();
  }
  TestClock(const TestClock &) = delete;
  TestClock &operator=(const TestClock &) = delete;

  static inline int64_t tick;  // nanoseconds

 private:
  int64_t (*before_)(void);
};

#endif
