// The rounding of a sleep, without the sleep, and the calling thread's cancellation state.
#ifndef QLX_SRC_CXTHREAD_H
#define QLX_SRC_CXTHREAD_H

#include <qlx/system.h>

QLX_BEGIN_DECLS

// Whole seconds for CxThreadSleep().
uint32_t cxIntlSleepSeconds(uint32_t milliseconds);

QLX_END_DECLS

// Keeps the calling thread from being cancelled, of whichever type; returns the state before, for
// cxThreadRestoreCancel(), which ends a thread of asynchronous type at once when it was cancelled
// meanwhile.
inline int cxThreadDisableCancel() {
  int before = PTHREAD_CANCEL_ENABLE;
  pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &before);
  return before;
}
inline void cxThreadRestoreCancel(int before) {
  pthread_setcancelstate(before, nullptr);
}

// Keeps it from being cancelled for a scope.
class CxNoCancel {
 public:
  CxNoCancel() : before_(cxThreadDisableCancel()) {}
  ~CxNoCancel() { cxThreadRestoreCancel(before_); }
  CxNoCancel(const CxNoCancel &) = delete;
  CxNoCancel &operator=(const CxNoCancel &) = delete;

 private:
  int before_;
};

#endif
