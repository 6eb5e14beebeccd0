// How a file that several processes have open rolls over. It never changes its name: it is copied
// into generation 1 and emptied in place, so that every process's descriptor stays valid. One that
// stays full is copied again once a second, and costs no older generation.
//
// The caller holds the lock of the processes, and has checked the names. Failures are told as those
// of a rollover, with the event, which may be null.
#ifndef QLX_SRC_QLXSHAREDFILE_H
#define QLX_SRC_QLXSHAREDFILE_H

#include "QlxLogFile.h"
#include "QlxRolling.h"

struct QlxSharedFile : QlxGenerations, QlxLogFile {
  uint8_t keepFullFile;  // 1: a file that could not be copied is not emptied
  int64_t lastRollTry;   // tick of the last rollover, whatever became of it
};

/** Copies the open file into generation 1 and empties it, also when the copy failed, unless
 *  keepFullFile is set. False when it is as full as before; then there is no copy of it either. */
bool qlxSharedFileCopyAndEmpty(QlxSharedFile *shared, Event *event);

/** The same, after the other generations have moved up by one. */
void qlxSharedFileRollOver(QlxSharedFile *shared, Event *event);

/** True for a file that stays full, until its rollover is due again. */
bool qlxSharedFileWaits(const QlxSharedFile *shared);

#endif
