// The rounding of a sleep, without the sleep.
#ifndef QLX_SRC_CXTHREAD_H
#define QLX_SRC_CXTHREAD_H

#include <qlx/system.h>

QLX_BEGIN_DECLS

// Whole seconds for CxThreadSleep().
uint32_t cxIntlSleepSeconds(uint32_t milliseconds);

QLX_END_DECLS

#endif
