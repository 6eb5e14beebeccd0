// Loggers: the log calls that a host makes. A call tests the logger before it takes the lock, makes
// an event, hands it to the logger's class, and answers with the event's status.
#include <qlx/logger.h>

#include <cerrno>

#include <qlx/class/event.h>
#include <qlx/class/logger.h>
#include <qlx/class/message.h>
#include <qlx/event.h>
#include <qlx/level.h>
#include <qlx/memory.h>

#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "object/QlxConfigKeys.h"
#include "object/QlxLocked.h"
#include "record/QlxLoggedEvent.h"
#include "QlxObject.h"
#include "object/QlxOperation.h"
#include "QlxProps.h"

static constexpr QlxLogResult kNothingLogged = {'-', 0, 0};
static constexpr QlxLogResult kNoMemory = {'p', ENOMEM, 0};

// Deliberate: tests whatever object it is given, by the fields of a logger.
static inline bool isLoggable(const QlxObject *logger, int32_t level) {
  if (!logger || !loadEnabled(logger)) return false;
  const int32_t threshold = loadLevel(logger);
  return level >= threshold || level == UNSPECIFIED || threshold == UNSPECIFIED;
}

uint8_t QlxIsLoggable(QlxObject *logger, int32_t level) {
  return isLoggable(logger, level);
}

uint8_t qlxIntlIsLoggable(QlxObject *, int32_t) {
  return 0;
}  // Deliberate: a placeholder

fLog qlxIntlLoggerGetFLog(QlxObject *logger) {
  return isKind(logger, Logger) && loadEnabled(logger) ? logger->objClass->op1.fLog : nullptr;
}

// ---- The two entries

static void report(QlxLogResult *result, const QlxLogResult &what) {
  if (result) *result = what;
}

static void passToLogger(QlxLogResult *result, QlxObject *logger, fLog log, Event *event,
                         va_list *args) {
  qlxCall({logger->objClass, "fLog"}, log, logger, event, args);
  const int32_t bindError = event->message ? event->message->error : 0;
  report(result, {event->status.kind, event->status.code, bindError});
}

void qlxLogUMessageEntry(QlxLogResult *result, QlxObject *logger, int32_t level, const char *bundle,
                         const char *key, va_list *args) {
  report(result, kNothingLogged);
  const fLog log = qlxIntlLoggerGetFLog(logger);
  if (!log) return;
  const LoggedEvent event{level, bundle, key};
  if (!event.get()) return report(result, kNoMemory);
  event->isMessage = 1;
  passToLogger(result, logger, log, event.get(), args);
}

void qlxLogUDebugEntry(QlxLogResult *result, QlxObject *logger, int32_t level, const char *file,
                       const char *function, int32_t line, const UChar *text, va_list *args) {
  report(result, kNothingLogged);
  const fLog log = qlxIntlLoggerGetFLog(logger);
  if (!log) return;
  const LoggedEvent event{level, text, {file, function, line}};
  if (!event.get()) return report(result, kNoMemory);
  event->isMessage = 0;
  passToLogger(result, logger, log, event.get(), args);
}

void qlxIntlLogVA(QlxLogResult *result, int32_t level, const char *bundle, const char *key, ...) {
  report(result, kNothingLogged);
  QlxObject *logger = qlxToolkitLogger();
  if (!isLoggable(logger, level)) return;
  va_list args;
  va_start(args, key);
  qlxLogUMessageEntry(result, logger, level, bundle, key, &args);
  va_end(args);
}

// ---- The basic logger

static void applyLevel(QlxObject *logger, const char *key) {
  storeLevel(logger, QlxGetLevelFromString(qlxPeekMapProp(logger->props, key)));
}

static constexpr ConfigKey kLoggerKeys[] = {{"level", applyLevel}};

void QlxBasicLoggerFCfgChange(QlxObject *logger, const char *key) {
  if (!logger || !key) return;
  if (!qlxApplyConfigKey(kLoggerKeys, logger, key)) QlxBasicObjectFCfgChange(logger, key);
}

const ObjClass qlxBasicLoggerClass = {
    .kind = Logger,
    .name = "qlx_basiclogger",
    .description = nullptr,
    .op1 = {.fLog = QlxBasicObjectFLog},
    .fCfgChange = QlxBasicLoggerFCfgChange,
    .own = &kTakesNotes,
};

// Public functions. The threshold test runs before the lock, so a suppressed call costs no lock.

static QlxLogResult logMessage(QlxObject *logger, int32_t level, const char *bundle,
                               const char *key, va_list *args) {
  QlxLogResult result = kNothingLogged;
  if (const ApiLock lock; lock) qlxLogUMessageEntry(&result, logger, level, bundle, key, args);
  return result;
}

static QlxLogResult logDebug(QlxObject *logger, int32_t level, const char *file,
                             const char *function, int32_t line, const UChar *text, va_list *args) {
  QlxLogResult result = kNothingLogged;
  if (const ApiLock lock; lock) {
    qlxLogUDebugEntry(&result, logger, level, file, function, line, text, args);
  }
  return result;
}

// A started list as an address: inside a VA form `&args` would have the wrong type.
#define QLX_WITH_COPY(args, call)   \
  va_list copy;                     \
  va_copy(copy, args);              \
  const QlxLogResult result = call; \
  va_end(copy);                     \
  return result;

#define QLX_WITH_LIST(last, call)   \
  va_list args;                     \
  va_start(args, last);             \
  const QlxLogResult result = call; \
  va_end(args);                     \
  return result;

#define QLX_MESSAGE_CALLS(Name, level)                                                          \
  QlxLogResult Name(QlxObject *logger, const char *bundle, const char *key, ...) {              \
    if (!isLoggable(logger, level)) return kNothingLogged;                                      \
    QLX_WITH_LIST(key, logMessage(logger, level, bundle, key, &args))                           \
  }                                                                                             \
  QlxLogResult Name##VA(QlxObject *logger, const char *bundle, const char *key, va_list args) { \
    if (!isLoggable(logger, level)) return kNothingLogged;                                      \
    QLX_WITH_COPY(args, logMessage(logger, level, bundle, key, &copy))                          \
  }

QLX_MESSAGE_CALLS(QlxLogUMsg, UNSPECIFIED)
QLX_MESSAGE_CALLS(QlxLogInfo, INFO)
QLX_MESSAGE_CALLS(QlxLogWarn, WARN)
QLX_MESSAGE_CALLS(QlxLogError, ERROR)
QLX_MESSAGE_CALLS(QlxLogFatal, FATAL)

#define QLX_DEBUG_CALLS(Name, level)                                                             \
  QlxLogResult Name(QlxObject *logger, const char *file, const char *function, int32_t line,     \
                    const UChar *text, ...) {                                                    \
    if (!isLoggable(logger, level)) return kNothingLogged;                                       \
    QLX_WITH_LIST(text, logDebug(logger, level, file, function, line, text, &args))              \
  }                                                                                              \
  QlxLogResult Name##VA(QlxObject *logger, const char *file, const char *function, int32_t line, \
                        const UChar *text, va_list args) {                                       \
    if (!isLoggable(logger, level)) return kNothingLogged;                                       \
    QLX_WITH_COPY(args, logDebug(logger, level, file, function, line, text, &copy))              \
  }

QLX_DEBUG_CALLS(QlxLogDebugMin, DEBUG_MIN)
QLX_DEBUG_CALLS(QlxLogDebugMid, DEBUG_MID)
QLX_DEBUG_CALLS(QlxLogDebugMax, DEBUG_MAX)

QlxLogResult QlxLogUText(QlxObject *logger, const UChar *text, ...) {
  if (!isLoggable(logger, UNSPECIFIED)) return kNothingLogged;
  QLX_WITH_LIST(text, logDebug(logger, UNSPECIFIED, nullptr, nullptr, 0, text, &args))
}

QlxLogResult QlxLogUTextVA(QlxObject *logger, const UChar *text, va_list args) {
  if (!isLoggable(logger, UNSPECIFIED)) return kNothingLogged;
  QLX_WITH_COPY(args, logDebug(logger, UNSPECIFIED, nullptr, nullptr, 0, text, &copy))
}

#undef QLX_DEBUG_CALLS
#undef QLX_MESSAGE_CALLS
#undef QLX_WITH_LIST
#undef QLX_WITH_COPY

fLog QlxLoggerGetFLog(QlxObject *logger) {
  return qlxLocked<qlxIntlLoggerGetFLog>(logger);
}
