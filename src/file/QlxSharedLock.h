// The lock between processes, with the status of a failure for the event.
#ifndef QLX_SRC_QLXSHAREDLOCK_H
#define QLX_SRC_QLXSHAREDLOCK_H

#include "QlxFileHandler.h"

/** As qlxMultiProcFileHandlerInitSem(), but answers the failure instead of reporting it. */
CxStatus qlxSharedLockSetUp(QlxFileHandlerVars *vars);

/** As qlxMultiProcFileHandlerLockSem(), but answers the failure instead of reporting it. */
CxStatus qlxSharedLockTake(QlxFileHandlerVars *vars);

#endif
