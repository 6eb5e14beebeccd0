// The making of a mutex with the initialising call as an argument, so that a test makes it fail.
#ifndef QLX_SRC_CXMUTEX_H
#define QLX_SRC_CXMUTEX_H

#include <qlx/system.h>

#include "CxStatus.h"

QLX_BEGIN_DECLS

typedef int (*CxMutexInit)(pthread_mutex_t *mutex, const pthread_mutexattr_t *attributes);

// CxMutexCreate() with pthread_mutex_init() as `init`.
CxStatus cxIntlMutexCreate(CxMutex *mutex, CxMutexInit init);

// Of a mutex that is there.
inline CxStatus cxMutexLock(CxMutex mutex) {
  return cxStatusOf(pthread_mutex_lock(mutex));
}
inline CxStatus cxMutexUnlock(CxMutex mutex) {
  return cxStatusOf(pthread_mutex_unlock(mutex));
}

QLX_END_DECLS

#endif
