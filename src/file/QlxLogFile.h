// The open log file of a handler: opened, measured, written and closed here, and nowhere else. Its
// descriptor is one that the process's host may close, and put a file of its own in its place. So
// it has a high number, and what it leads to is compared with what was opened before it is
// measured, truncated or closed; one that is no longer ours is left alone.
//
// What is no regular file (a FIFO, a device, a terminal) is opened once, written without waiting,
// and otherwise left as it is: no rollover, no truncation, no look.
#ifndef QLX_SRC_QLXLOGFILE_H
#define QLX_SRC_QLXLOGFILE_H

#include <qlx/types.h>

#include "util/CxLook.h"

QLX_BEGIN_DECLS

struct QlxLogFile {
  CxFile file;              // -1: closed
  CxFile reserve;           // a number to give up when there are none left; -1: none
  uint64_t size;            // bytes in the file: measured before, counted in a write
  uint64_t device, inode;   // of what was opened
  uint32_t filePermission;  // of a newly made file, less the process's mask: the nine lowest bits
  uint8_t rolls;            // 1: a regular file that may be renamed and truncated
  uint8_t torn;             // 1: ends in a piece of a record
  uint8_t keepWritten;      // 1: what the name leads to may be what this wrote: not to be emptied
  CxLook look;              // at the path and at the descriptor
  QlxLogFile *next;         // all that are open, in no order
};

/**
 * Opens a file with a number that hosts do not expect: beyond 500 where the limit allows, never one
 * of the standard streams'. An interrupted call is tried again.
 */
CxStatus qlxOpenHigh(CxFile *file, const char *name, int32_t flags, uint32_t mode);

/** Opens the file of a name, with O_APPEND or O_TRUNC as `existing`, and measures it. With
 * keepWritten, as after a descriptor that was taken away, it appends whatever `existing` says. */
CxStatus qlxLogFileOpen(QlxLogFile *log, const char *name, int32_t existing);

/** Sets the size to that of the open file, which has other writers' bytes too. EBADF also when the
 *  number leads to another file now. */
CxStatus qlxLogFileMeasure(QlxLogFile *log);

/** Closes what is ours, and forgets the number in any case. */
CxStatus qlxLogFileClose(QlxLogFile *log);

/**
 * Writes all of it; the size counts what was written. A piece of it that was written before a
 * failure is cut off again; where that cannot be, the next bytes start on a line of their own.
 */
CxStatus qlxLogFileWrite(QlxLogFile *log, const char *bytes, uint32_t length);

/** Success for a name that leads to a regular file, ENOENT for one that does not; another error
 *  leaves it open. `isOther` becomes whether it leads to something else than the open file. */
CxStatus qlxLogFileFindName(const QlxLogFile *log, const char *name, bool *isOther);

/** Keeps a number to give up when there are none left; qlxLogFileSpend() gives it up, and answers
 *  whether there was one. Closing the file gives it up too. */
void qlxLogFileReserve(QlxLogFile *log);
bool qlxLogFileSpend(QlxLogFile *log);

QLX_END_DECLS

#endif
