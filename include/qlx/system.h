/**
 * @file
 * Mutexes, processes, threads, time, the host's name and a trace for debugging the library itself.
 *
 * Every operation that can fail answers a CxStatus: {'-', 0} for success, otherwise kind 'p' and
 * the system's error number (22 for a null or empty argument that is needed). Nothing is printed,
 * and nothing here takes the API lock. Pointers are borrowed for the call.
 */
#ifndef QLX_SYSTEM_H
#define QLX_SYSTEM_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/* ---- Mutexes: any thread; every operation takes the handle's address --------------------- */

/**
 * Makes a mutex with default attributes: not recursive.
 *
 * @param mutex  receives the handle, null on failure; null: 22
 * @return 12 when memory ran out
 */
QLX_API CxStatus CxMutexCreate(CxMutex *mutex);

/** Locks; 22 for a null address or handle. */
QLX_API CxStatus CxMutexLock(CxMutex *mutex);

/** Unlocks; 22 for a null address or handle. */
QLX_API CxStatus CxMutexUnlock(CxMutex *mutex);

/** Frees the mutex and sets the handle to null, also when it fails; 22 for a null address or
 * handle. */
QLX_API CxStatus CxMutexDestroy(CxMutex *mutex);

/* ---- Processes --------------------------------------------------------------------------- */

/** @return the variable's value, borrowed from the environment; null when absent or for null */
QLX_API char *CxProcessGetEnv(const char *name);

/** @return the id of this process */
QLX_API int64_t CxProcessGetCurrentID(void);

/**
 * Fills the buffer with the working directory.
 *
 * @param buffer  at least one byte, also when `size` is 0: on any failure it becomes the empty
 *                string; null: 22
 * @param size    its size in bytes, with room for the terminator; 0: 22
 */
QLX_API CxStatus CxProcessGetCwd(char *buffer, uint32_t size);

/**
 * Starts a program in a child process, which inherits the environment.
 *
 * Deliberate: when the program cannot be started, this returns in the CHILD, with success and an id
 * of -1. A caller that sees this must end that process itself, with _exit().
 *
 * @param id         receives the child's id, -1 on failure; null: 22, as for a null or empty path
 * @param path       the program's file; not searched for
 * @param arguments  as for execv(): the program's name first, null last; a null vector is the path
 *                   alone
 */
QLX_API CxStatus CxProcessCreate(int64_t *id, const char *path, char *const arguments[]);

/** Does nothing, deliberately: a child is neither waited for nor signalled. 22 for an id of 0. */
QLX_API CxStatus CxProcessRelease(int64_t id);

/* ---- Threads ----------------------------------------------------------------------------- */

/** @return always 1 */
QLX_API uint8_t CxHasThreadSupport(void);

/** @return the low 32 bits of this thread's handle; the high 32 bits are 0 */
QLX_API uint64_t CxThreadGetCurrentID(void);

/**
 * Starts a thread, which is to be joined.
 *
 * @param thread     receives the handle on success; null: 22, as for a null routine
 * @param stackSize  bytes; 0 is the system's default
 * @param start      the routine; its result is discarded
 * @param argument   passed to the routine, may be null
 */
QLX_API CxStatus CxThreadCreate(CxThread *thread, uint32_t stackSize, void *(*start)(void *),
                                void *argument);

/** Waits for the thread to end; 22 for a null address. */
QLX_API CxStatus CxThreadJoin(CxThread *thread);

/** Does nothing, deliberately. */
QLX_API void CxThreadYield(void);

/**
 * Sleeps for whole seconds: the nearest number of them, so that below 500 milliseconds it returns
 * at once. A signal that is caught ends the sleep. Deliberate: the rounding is 32-bit arithmetic,
 * in which the last 500 milliseconds of the range wrap to no sleep.
 */
QLX_API void CxThreadSleep(uint32_t milliseconds);

/* ---- System ------------------------------------------------------------------------------ */

/** @return milliseconds since 1970-01-01 UTC, a whole number: parts of one are dropped */
QLX_API double CxSystemGetTimestamp(void);

/**
 * Finds the host's fully qualified name: its own when that has a dot, else the resolver's. When the
 * resolver's has none either, the host's own short name is a success, deliberately.
 *
 * @param buffer  null: 22. Not terminated when the resolver's name has `length` bytes or more: pass
 *                an array with a byte more than `length`, zero at the end
 * @param length  bytes that may be written, with room for the host's own name and its terminator
 * @return 38 when the host has no name or one that does not fit (the buffer is empty then) or the
 *         name does not resolve (the buffer holds the short name)
 */
QLX_API CxStatus CxSystemGetFQHostname(char *buffer, uint32_t length);

/*
 * The trace, for debugging: indented lines on the standard error stream, which is flushed each
 * time. The format supplies the line end; null is ignored. The library itself never calls these.
 * The indentation is the process's, not the thread's.
 */

/** Prints the indentation, "ENTER " and the text, then indents by 3 more. */
QLX_API void cxIntlTraceEnter(const char *format, ...) __attribute__((format(printf, 1, 2)));

/** Indents by 3 less, then prints the indentation, "LEAVE " and the text. */
QLX_API void cxIntlTraceLeave(const char *format, ...) __attribute__((format(printf, 1, 2)));

/** Prints the indentation, "... " and the text. */
QLX_API void cxIntlTracePoint(const char *format, ...) __attribute__((format(printf, 1, 2)));

QLX_END_DECLS

#endif
