/**
 * @file
 * The way of a log call below the lock, for class operations and for code that takes the lock
 * itself (qlx/class/toolkit.h). None of these takes the lock or tests the threshold, unless it says
 * so. `result` and `args` may be null; what the result tells is said in qlx/logger.h.
 */
#ifndef QLX_CLASS_LOGGER_H
#define QLX_CLASS_LOGGER_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return as QlxLoggerGetFLog() */
QLX_API fLog qlxIntlLoggerGetFLog(QlxObject *logger);

/** Deliberate: always 0, a placeholder. Use QlxIsLoggable(), which takes no lock. */
QLX_API uint8_t qlxIntlIsLoggable(QlxObject *logger, int32_t level);

/** Logs a bundle's message at a level of the caller's choice. */
QLX_API void qlxLogUMessageEntry(QlxLogResult *result, QlxObject *logger, int32_t level,
                                 const char *bundle, const char *key, va_list *args);

/** Logs a text (a pattern) at a level of the caller's choice. */
QLX_API void qlxLogUDebugEntry(QlxLogResult *result, QlxObject *logger, int32_t level,
                               const char *file, const char *function, int32_t line,
                               const UChar *text, va_list *args);

/** Logs through the toolkit logger, after its threshold test; nothing while the toolkit is closed.
 */
QLX_API void qlxIntlLogVA(QlxLogResult *result, int32_t level, const char *bundle, const char *key,
                          ...);

/** The basic logger's keys: "level", and the common ones. */
QLX_API void QlxBasicLoggerFCfgChange(QlxObject *logger, const char *key);

/*
 * The problem-determination logger: a basic logger that stamps every event with the identity of the
 * product and of the place where it runs.
 */
/** @return variables with the host's name as server ("NO_HOSTNAME" when it cannot be learned), "IP"
 *          as its format, and a reference to the formatter "quill.pdMsgIdFormatter"; null when
 *          memory ran out */
QLX_API void *QlxPDLoggerFAllocVars(void);

/** Null is ignored. */
QLX_API void QlxPDLoggerFFreeVars(void *vars);

/** The seven values that are stamped, and the basic logger's keys. Deliberate: an absent value is
 *  not stamped, also not "server" and "serverFormat", which have a value at first. Without
 * variables the seven have no effect and the others do. */
QLX_API void QlxPDLoggerFCfgChange(QlxObject *logger, const char *key);

/** Sets the values, "processId" and "threadId" as properties of the event, over those it has, and,
 *  when it has none, the message identifier that its text starts with, or "". Then passes it to the
 *  listeners. The message is bound for that also when nobody listens, so that a failed bind shows
 *  in the result of the log call. */
QLX_API void QlxPDLoggerFLog(QlxObject *logger, Event *event, va_list *args);

QLX_END_DECLS

#endif
