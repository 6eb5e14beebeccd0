// Mutexes on the heap behind a handle; a null handle means that there is no mutex.
#include "CxMutex.h"

#include "CxOwned.h"

using MutexBlock = Owned<pthread_mutex_t, OslMemoryFree>;

CxStatus cxIntlMutexCreate(CxMutex *mutex, CxMutexInit init) {
  if (!mutex) return cxFailure(EINVAL);
  *mutex = nullptr;
  MutexBlock block{static_cast<pthread_mutex_t *>(OslMemoryMalloc(sizeof(pthread_mutex_t)))};
  if (!block) return cxFailure(ENOMEM);
  if (const int error = init(block.get(), nullptr)) return cxFailure(error);
  *mutex = block.release();
  return kCxSuccess;
}

CxStatus CxMutexCreate(CxMutex *mutex) {
  return cxIntlMutexCreate(mutex, pthread_mutex_init);
}

CxStatus CxMutexLock(CxMutex *mutex) {
  if (!mutex || !*mutex) return cxFailure(EINVAL);
  return cxMutexLock(*mutex);
}

CxStatus CxMutexUnlock(CxMutex *mutex) {
  if (!mutex || !*mutex) return cxFailure(EINVAL);
  return cxMutexUnlock(*mutex);
}

CxStatus CxMutexDestroy(CxMutex *mutex) {
  if (!mutex || !*mutex) return cxFailure(EINVAL);
  const MutexBlock block{*mutex};
  *mutex = nullptr;
  return cxStatusOf(pthread_mutex_destroy(block.get()));
}
