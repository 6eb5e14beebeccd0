/**
 * @file
 * Log calls.
 *
 * A call tests the logger's enabled flag and threshold first, without the lock; a suppressed call
 * costs nothing more. Then it takes the API lock, makes an event and hands it to the logger's
 * listeners. All arguments are borrowed; a null logger logs nothing. The result starts as
 * {'-', 0, 0} and stays so when there was nothing to log; else it tells the event's status (a
 * handler that could not write stores the system's error there) and ICU's code of the last failed
 * bind. When memory runs out for the event or for its record, the status is {'p', ENOMEM}: nothing
 * was logged then, or a record that lacks what there was no memory for, as its locale.
 *
 * The message parameters follow as ICU reads them for the pattern: a string is a `const UChar *`, a
 * {0,number,integer} an int32_t, a {0,number} a double, a {0,date} a UDate (double). Each call has
 * a VA form that takes the started list in their place and leaves it to the caller to end.
 *
 * These functions are not to be called from class operations, which hold the lock.
 */
#ifndef QLX_LOGGER_H
#define QLX_LOGGER_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * @param level  UNSPECIFIED (-9999) passes whatever the threshold is
 * @return 1 when an event of that level would be passed on, else 0. Takes no lock.
 */
QLX_API uint8_t QlxIsLoggable(QlxObject *logger, int32_t level);

/* Messages of a resource bundle, at INFO, WARN, ERROR, FATAL, and without a level (always passed).
 */
QLX_API QlxLogResult QlxLogInfo(QlxObject *logger, const char *bundle, const char *key, ...);
QLX_API QlxLogResult QlxLogInfoVA(QlxObject *logger, const char *bundle, const char *key,
                                  va_list args);
QLX_API QlxLogResult QlxLogWarn(QlxObject *logger, const char *bundle, const char *key, ...);
QLX_API QlxLogResult QlxLogWarnVA(QlxObject *logger, const char *bundle, const char *key,
                                  va_list args);
QLX_API QlxLogResult QlxLogError(QlxObject *logger, const char *bundle, const char *key, ...);
QLX_API QlxLogResult QlxLogErrorVA(QlxObject *logger, const char *bundle, const char *key,
                                   va_list args);
QLX_API QlxLogResult QlxLogFatal(QlxObject *logger, const char *bundle, const char *key, ...);
QLX_API QlxLogResult QlxLogFatalVA(QlxObject *logger, const char *bundle, const char *key,
                                   va_list args);
QLX_API QlxLogResult QlxLogUMsg(QlxObject *logger, const char *bundle, const char *key, ...);
QLX_API QlxLogResult QlxLogUMsgVA(QlxObject *logger, const char *bundle, const char *key,
                                  va_list args);

/*
 * Debug texts with their source location, at DEBUG_MIN, DEBUG_MID, DEBUG_MAX. The text is a message
 * PATTERN: an apostrophe or a brace means there what it means to ICU; log foreign text as {0} with
 * the text as argument. One that nests deeper than 8 levels is not formatted (qlx/message.h). Null
 * file, function or text: left out; a line without a file is dropped.
 */
QLX_API QlxLogResult QlxLogDebugMin(QlxObject *logger, const char *file, const char *function,
                                    int32_t line, const UChar *text, ...);
QLX_API QlxLogResult QlxLogDebugMinVA(QlxObject *logger, const char *file, const char *function,
                                      int32_t line, const UChar *text, va_list args);
QLX_API QlxLogResult QlxLogDebugMid(QlxObject *logger, const char *file, const char *function,
                                    int32_t line, const UChar *text, ...);
QLX_API QlxLogResult QlxLogDebugMidVA(QlxObject *logger, const char *file, const char *function,
                                      int32_t line, const UChar *text, va_list args);
QLX_API QlxLogResult QlxLogDebugMax(QlxObject *logger, const char *file, const char *function,
                                    int32_t line, const UChar *text, ...);
QLX_API QlxLogResult QlxLogDebugMaxVA(QlxObject *logger, const char *file, const char *function,
                                      int32_t line, const UChar *text, va_list args);

/* Plain text, a pattern as above, without level (always passed) and location. */
QLX_API QlxLogResult QlxLogUText(QlxObject *logger, const UChar *text, ...);
QLX_API QlxLogResult QlxLogUTextVA(QlxObject *logger, const UChar *text, va_list args);

/** @return the class's log operation; null for a null or disabled object or one that is no logger.
 *  Takes the API lock. */
QLX_API fLog QlxLoggerGetFLog(QlxObject *logger);

QLX_END_DECLS

#endif
