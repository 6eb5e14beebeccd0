// The lock rule, once: a public function takes the API lock and calls its twin; nothing else.
#ifndef QLX_SRC_QLXLOCKED_H
#define QLX_SRC_QLXLOCKED_H

#include <qlx/class/toolkit.h>

// Holds the API lock for a scope; false when the lock could not be taken.
class ApiLock {
 public:
  ApiLock() : held_(qlxAPIMutexLock() == 1) {}
  ~ApiLock() {
    if (held_) qlxAPIMutexUnlock();
  }
  ApiLock(const ApiLock &) = delete;
  ApiLock &operator=(const ApiLock &) = delete;
  explicit operator bool() const { return held_; }

 private:
  bool held_;
};

// Runs Twin under the API lock; without the lock the caller gets 0, null, 0.0 or nothing.
template <auto Twin, typename... Args>
auto qlxLocked(Args... args) -> decltype(Twin(args...)) {
  if (const ApiLock lock; lock) return Twin(args...);
  return decltype(Twin(args...))();
}

#endif
