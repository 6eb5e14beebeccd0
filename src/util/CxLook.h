// "Look again?": how often the library looks at what others change without telling it, such as
// where a path leads. A look is a system call, and a burst of records need not make it for each:
// after the first looks of a process only the first records of each tick of the system's coarse
// clock (some milliseconds) look; the rest of that tick's records share the last look. So a change
// is seen by the next record at any usual rate, and within one tick in a burst.
//
// A look has one owner at a time: who asks has the lock that guards what is looked at.
#ifndef QLX_SRC_CXLOOK_H
#define QLX_SRC_CXLOOK_H

#include <stdint.h>

#include <qlx/base.h>

QLX_BEGIN_DECLS

// One for each thing that is looked at. All zero: the next question is answered by a look; so who
// has a reason to look, such as a failure or a change of settings, empties it.
typedef struct CxLook {
  int64_t tick;    // of the last look
  uint32_t looks;  // in that tick
} CxLook;

/** True: look now, which the caller does. False: what the last look showed still counts. */
bool cxLookAgain(CxLook *look);

/** Every record looks again, as in a new process: the child of a fork begins so. */
void cxLookRestart(void);

/** The tick of the clock; tests set one of their own. */
extern int64_t (*cxLookTick)(void);

QLX_END_DECLS

#endif
