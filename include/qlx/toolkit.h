/**
 * @file
 * Opening and closing the library, and three small utilities.
 *
 * One global lock, the API lock, guards all of the library's state. Public functions take it unless
 * their header says otherwise; it is not recursive, so a class operation, which runs with the lock
 * held, calls only what takes no lock (qlx/class.h). A thread cannot be cancelled while it has the
 * lock, or waits for it.
 */
#ifndef QLX_TOOLKIT_H
#define QLX_TOOLKIT_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * Opens the toolkit: the log manager, the built-in classes, the configurations of a properties
 * file, and the logger "quill.errorLogger" with its console handler. Opening an open toolkit does
 * nothing (its file is not read), and opens are not counted: one close undoes any number of them.
 *
 * The file is read before anything is opened and without the API lock, so a pipe that somebody
 * fills late keeps no other thread waiting. When another thread has opened the toolkit meanwhile,
 * the file counts for nothing, also when it failed. The thread is not cancelled before the file is
 * read to its end.
 *
 * @param configFileName  path of a properties file, or null: at most 256 bytes, backslashes
 *                        separate as "/" does; a regular file, or a pipe that ends ("/dev/fd/3"),
 *                        of at most 64 MiB
 * @param status          borrowed, may be null; written only when the file cannot be read or is
 *                        refused: {'p', error number} for a system error, {'-', 0} for a file that
 *                        was refused (a syntax error, a key without a dot). A longer path gives
 *                        {'p', ENAMETOOLONG}, a longer file {'p', EFBIG}, a folder {'p', EISDIR},
 *                        a device {'p', EINVAL}
 * @return 1 when the toolkit is open; 0 when the file failed (the toolkit is closed again) or the
 *         API lock cannot be taken
 */
QLX_API uint8_t QlxOpenToolkit(const char *configFileName, CxStatus *status);

/**
 * Closes the toolkit: handlers are closed, which writes formatters' trailers, and all objects,
 * classes and configurations go, also those made without an open. No other thread may be inside the
 * library.
 *
 * Handles that the host still holds become inert: every call with one is safe and does nothing,
 * also after the next open; QlxReleaseObject() still gives it back.
 *
 * The toolkit holds ICU objects while it is open: close it before a call of ICU's u_cleanup(). What
 * formats without an open toolkit (messages, dates, numbers) holds some too, and this gives them
 * back.
 */
QLX_API void QlxCloseToolkit(void);

/**
 * Joins the strings that are not null, with the separator between each two. Takes no lock.
 *
 * @param count      entries in `strings`
 * @param strings    borrowed; entries may be null
 * @param separator  borrowed; null is nothing
 * @return a new string (empty when there is nothing to join) that the caller frees with
 *         OslMemoryFree(), or null when memory ran out
 */
QLX_API char *QlxStrACat(int32_t count, const char *const *strings, const char *separator);

/** Takes note of a failed platform operation. Deliberate: prints and logs nothing. Takes no lock.
 */
QLX_API void QlxReportPlatformErr(CxStatus status);

/**
 * @return for kind 'p' the system's text of the error number, a new string that the caller frees
 *         with OslMemoryFree(); null for any other kind. Takes no lock.
 */
QLX_API char *QlxGetPlatformErrStr(CxStatus status);

QLX_END_DECLS

#endif
