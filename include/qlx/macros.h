/**
 * @file
 * Log calls as macros. Each tests the logger in place, so a call below the threshold costs a load,
 * a compare and a branch behind the test for null, and evaluates none of its arguments but the
 * logger, which is evaluated once.
 *
 * A macro is a statement and drops the call's result; call the function where the result matters.
 * What a function of qlx/logger.h says of its arguments holds for the macro that calls it. Debug
 * calls are given the file, the function and the line in which the macro stands.
 *
 *     QLX_DEBUG_MIN(logger, u"read {0,number,integer} bytes", count);
 *     QLX_ERROR(logger, "messages", "unreadable", path);
 */
#ifndef QLX_MACROS_H
#define QLX_MACROS_H

#include <qlx/logger.h>

QLX_BEGIN_DECLS

/**
 * QlxIsLoggable() without the call. Takes no lock; the logger is not released meanwhile.
 *
 * @param logger  a logger, or null, which logs nothing
 * @param level   best a constant: what the comparison alone decides is then left out
 */
static inline int qlxIsLoggableInPlace(const QlxObject *logger, int32_t level) {
  int32_t threshold;
  if (!logger) return 0;
  threshold = __atomic_load_n(&logger->kind1.level, __ATOMIC_RELAXED);
  /* A threshold of UNSPECIFIED passes all, which for levels above it the comparison says. */
  if (level < threshold && level != UNSPECIFIED &&
      (level > UNSPECIFIED || threshold != UNSPECIFIED)) {
    return 0;
  }
  return __atomic_load_n(&logger->enabled, __ATOMIC_RELAXED) != 0;
}

QLX_END_DECLS

/* Not for hosts: the form of all macros below. The call is moved out of the way of one that is
 * suppressed; beside what it costs, the jump there is nothing. */
#define QLX_LOG_IN_PLACE(logger, level, call, ...)                    \
  do {                                                                \
    QlxObject *const qlxLogger_ = (logger);                           \
    if (__builtin_expect(qlxIsLoggableInPlace(qlxLogger_, level), 0)) \
      call(qlxLogger_, __VA_ARGS__);                                  \
  } while (0)

/* (logger, text, ...): a text, which is a pattern, and its arguments */
#define QLX_DEBUG_MIN(logger, ...) \
  QLX_LOG_IN_PLACE(logger, DEBUG_MIN, QlxLogDebugMin, __FILE__, __func__, __LINE__, __VA_ARGS__)
#define QLX_DEBUG_MID(logger, ...) \
  QLX_LOG_IN_PLACE(logger, DEBUG_MID, QlxLogDebugMid, __FILE__, __func__, __LINE__, __VA_ARGS__)
#define QLX_DEBUG_MAX(logger, ...) \
  QLX_LOG_IN_PLACE(logger, DEBUG_MAX, QlxLogDebugMax, __FILE__, __func__, __LINE__, __VA_ARGS__)

/* (logger, bundle, key, ...): a message of a resource bundle and its arguments */
#define QLX_INFO(logger, ...) QLX_LOG_IN_PLACE(logger, INFO, QlxLogInfo, __VA_ARGS__)
#define QLX_WARN(logger, ...) QLX_LOG_IN_PLACE(logger, WARN, QlxLogWarn, __VA_ARGS__)
#define QLX_ERROR(logger, ...) QLX_LOG_IN_PLACE(logger, ERROR, QlxLogError, __VA_ARGS__)
#define QLX_FATAL(logger, ...) QLX_LOG_IN_PLACE(logger, FATAL, QlxLogFatal, __VA_ARGS__)

#endif
