// Notices of changes to files, from the system (inotify), shared by all that is watched in the
// process: any change makes each of them look again. Whether there are notices is answered from
// memory after it was asked for long (QlxReadiness), by a system call before that and elsewhere.
//
// All functions are called with the API lock held. A host may close the descriptors, and have
// files of its own with their numbers, which are left alone; only of an epoll set of its own in
// their place may a question take an edge-triggered event.
#ifndef QLX_SRC_QLXNOTICES_H
#define QLX_SRC_QLXNOTICES_H

#include <stdint.h>

#include <qlx/base.h>

QLX_BEGIN_DECLS

/** Makes watching possible. False: it is not, such as without descriptors left. */
bool qlxNoticesOpen(void);

/** Gives all watches and descriptors back. Also for the child of a fork, which must not take the
 *  parent's notices. */
void qlxNoticesClose(void);

/**
 * Takes the notices that wait. The result is another one than before when something may have
 * happened since to what is watched, or when it is not watched any more.
 */
uint32_t qlxNoticesChanges(void);

/** Adds to what is told of a file or directory. The watch's number; -1: it is not watched. */
int32_t qlxNoticesWatch(const char *path, uint32_t changes);

/** Numbers that are not above 0 are none. */
void qlxNoticesUnwatch(int32_t number);

/** Whether qlxNoticesChanges() would answer from memory now. */
bool qlxNoticesAreFlagged(void);

QLX_END_DECLS

#endif
