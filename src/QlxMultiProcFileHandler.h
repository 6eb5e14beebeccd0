// The steps of the multi-process file handler. Its variables are the file handler's.
#ifndef QLX_SRC_QLXMULTIPROCFILEHANDLER_H
#define QLX_SRC_QLXMULTIPROCFILEHANDLER_H

#include "QlxFileHandler.h"

QLX_BEGIN_DECLS

// As qlxSharedLockSetUp(), qlxSharedLockTake() and qlxSharedLockGiveBack(), which say what they do;
// here their failures are reported, and null is none to lock.

/** Makes the semaphore set, or attaches to it. @return 1, or 0 for null and when that failed */
uint8_t qlxMultiProcFileHandlerInitSem(QlxFileHandlerVars *vars);

/** Waits for the semaphore. @return 1, or 0 for null and when waiting failed */
uint8_t qlxMultiProcFileHandlerLockSem(QlxFileHandlerVars *vars);

/** Gives the semaphore back, unless it is free already. */
void qlxMultiProcFileHandlerUnlockSem(QlxFileHandlerVars *vars);

/** Moves the generations up by one and empties the active file into the first. */
void qlxMultiProcFileHandlerDoRollover(QlxFileHandlerVars *vars);

/** Copies the active file into generation 1 and truncates it, also when the copy failed, unless
 *  keepFullFile is set. */
void qlxMultiProcFileHandlerRollActiveLog(QlxFileHandlerVars *vars);

QLX_END_DECLS

#endif
