// Whether a path still leads to a regular file, asked before every record. A look at the path costs
// more than the record's write, so the system is asked to tell of changes instead: watches on
// the file and on the directories above it, and one cheap question for all of the process.
#ifndef QLX_SRC_QLXFILEWATCH_H
#define QLX_SRC_QLXFILEWATCH_H

#include <stdint.h>

#include <qlx/base.h>

QLX_BEGIN_DECLS

typedef struct QlxFileWatch {
  uint8_t watching;     // 1: what follows holds, and a change is told
  uint8_t looks;        // at the path since the file was opened, as far as they are counted
  uint8_t starts;       // of the watch, or tries, in the second of the last look
  int32_t watchNumber;  // of the file itself; not above 0: none
  uint32_t changesSeen;
  int64_t lastLook;  // seconds
} QlxFileWatch;

/** A process starts no watch before it has looked so often: one that logs little ends sooner
 *  without. Counted anew after qlxFileWatchStop(). Tests set another number. */
extern uint32_t qlxFileWatchFirstLooks;

/**
 * Whether the path leads to a regular file, now: nothing that happened before the call is missed.
 * Only a change which the system does not tell of, such as another file system mounted over a
 * directory, may be seen a second late, and one whose notice a child took that was made without
 * the handlers of a fork. A zeroed watch looks at the path; how it goes on is its own affair. Where
 * nothing can be watched (a relative path, symbolic links, a network's file system, no watches
 * left) it looks every time.
 */
bool qlxFileWatchFindsFile(QlxFileWatch *watch, const char *path);

/** Ends the watch of a file that is closed; the next question starts anew. */
void qlxFileWatchEnd(QlxFileWatch *watch);

/** Gives the descriptors back; paths are looked at until the next watch starts. Also for the child
 *  of a fork, which must not take the parent's notices. */
void qlxFileWatchStop(void);

QLX_END_DECLS

#endif
