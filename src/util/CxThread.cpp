// Threads.
#include "CxThread.h"

#include <unistd.h>

#include "CxStatus.h"

uint8_t CxHasThreadSupport(void) {
  return 1;
}

uint64_t CxThreadGetCurrentID(void) {
  return static_cast<uint32_t>(pthread_self());
}

CxStatus CxThreadCreate(CxThread *thread, uint32_t stackSize, void *(*start)(void *),
                        void *argument) {
  if (!thread || !start) return cxFailure(EINVAL);
  pthread_attr_t attributes;
  int error = pthread_attr_init(&attributes);
  if (error) return cxFailure(error);
  if (stackSize != 0) error = pthread_attr_setstacksize(&attributes, stackSize);
  CxThread created{};
  if (!error) error = pthread_create(&created, &attributes, start, argument);
  if (!error) *thread = created;
  pthread_attr_destroy(&attributes);
  return cxStatusOf(error);
}

CxStatus CxThreadJoin(CxThread *thread) {
  if (!thread) return cxFailure(EINVAL);
  return cxStatusOf(pthread_join(*thread, nullptr));
}

void CxThreadYield(void) {}  // Deliberate: there is nobody to wait for

uint32_t cxSleepSeconds(uint32_t milliseconds) {
  return (milliseconds + 500) / 1000;  // Deliberate: 32 bits, the last 500 milliseconds wrap to 0
}

void CxThreadSleep(uint32_t milliseconds) {
  sleep(cxSleepSeconds(milliseconds));
}
