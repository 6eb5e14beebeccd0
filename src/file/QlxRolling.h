// Moving the generations of a log file up: each by one, the highest first, the oldest goes.
//
// Nothing here replaces a file that could not be moved. A move that fails ends the moving, and
// leaves a gap above it; from then on the files below that gap are moved into it, and nothing else,
// until the active file itself has moved: a rollover that fails again and again costs no older
// file. A process that can foresee it begins that way.
//
// The names have been checked (qlxFHCheckNames()). Failures are told as those of a rollover, with
// the event, which may be null; a missing file is none.
#ifndef QLX_SRC_QLXROLLING_H
#define QLX_SRC_QLXROLLING_H

#include "QlxFileNames.h"

QLX_BEGIN_DECLS

struct QlxGenerations : QlxLogNames {
  uint8_t rollFailed;  // 1: the active file could not be moved or emptied when it was full
};

/** Moves all but the active file. False when a move failed. */
bool qlxShiftGenerations(const QlxLogNames *files, Event *event);

/** Moves the generations below the lowest gap; without a gap the oldest goes first. False when the
 *  first generation is still there. */
bool qlxFreeFirstGeneration(const QlxLogNames *files, Event *event);

/** Moves all, the active file too, which may be open. False when that stays where it is. */
bool qlxMoveActiveFile(QlxGenerations *files);

QLX_END_DECLS

#endif
