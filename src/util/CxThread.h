// The rounding of a sleep, without the sleep, and the calling thread's cancellation state.
#ifndef QLX_SRC_CXTHREAD_H
#define QLX_SRC_CXTHREAD_H

#include <qlx/system.h>

QLX_BEGIN_DECLS

// Whole seconds for CxThreadSleep().
uint32_t cxSleepSeconds(uint32_t milliseconds);

QLX_END_DECLS

// A thread's state and type of cancellation.
struct CxCancellation {
  int state, type;
};

// Keeps the calling thread from being cancelled, of whichever type; returns what holds before, for
// cxThreadRestoreCancel(), which ends a thread of asynchronous type at once when it was cancelled
// meanwhile. The state alone is not enough: the signal that cancels such a thread may be on its way
// already, and ends it also under a state that does not allow it.
inline CxCancellation cxThreadDisableCancel() {
  CxCancellation before = {PTHREAD_CANCEL_ENABLE, PTHREAD_CANCEL_DEFERRED};
  pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &before.state);
  pthread_setcanceltype(PTHREAD_CANCEL_DEFERRED, &before.type);
  return before;
}
// The type comes last: a thread that the state ended would have another result than
// PTHREAD_CANCELED in some versions of the C library.
inline void cxThreadRestoreCancel(CxCancellation before) {
  if (before.state != PTHREAD_CANCEL_DISABLE) pthread_setcancelstate(before.state, nullptr);
  if (before.type != PTHREAD_CANCEL_DEFERRED) pthread_setcanceltype(before.type, nullptr);
}

// Keeps it from being cancelled for a scope.
class CxNoCancel {
 public:
  CxNoCancel() : before_(cxThreadDisableCancel()) {}
  ~CxNoCancel() { cxThreadRestoreCancel(before_); }
  CxNoCancel(const CxNoCancel &) = delete;
  CxNoCancel &operator=(const CxNoCancel &) = delete;

 private:
  CxCancellation before_;
};

#endif
