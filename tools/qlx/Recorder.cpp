// The public log calls have fixed levels. Any level is logged by the entries below them, under the
// API lock and after the threshold test, as those calls do it.
#include "Recorder.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

#include <unicode/utypes.h>

#include <qlx/class/handler.h>
#include <qlx/class/logger.h>
#include <qlx/class/toolkit.h>
#include <qlx/logger.h>
#include <qlx/memory.h>
#include <qlx/toolkit.h>

std::string platformErrorText(CxStatus status) {
  char *text = QlxGetPlatformErrStr(status);
  std::string result = text ? text : "error " + std::to_string(status.code);
  OslMemoryFree(text);
  return result;
}

static const QlxLogResult kNoLock = {'p', ENOLCK, 0};

static QlxLogResult logText(QlxObject *logger, int32_t level, const UChar *pattern, ...) {
  if (qlxAPIMutexLock() != 1) return kNoLock;
  QlxLogResult result = {'-', 0, 0};
  va_list arguments;
  va_start(arguments, pattern);
  qlxLogUDebugEntry(&result, logger, level, nullptr, nullptr, 0, pattern, &arguments);
  va_end(arguments);
  qlxAPIMutexUnlock();
  return result;
}

namespace {
struct Message {
  QlxObject *logger;
  int32_t level;
  const char *bundle, *key;
};
}  // namespace

static QlxLogResult logBound(const Message *message, ...) {
  if (qlxAPIMutexLock() != 1) return kNoLock;
  QlxLogResult result = {'-', 0, 0};
  va_list arguments;
  va_start(arguments, message);
  qlxLogUMessageEntry(&result, message->logger, message->level, message->bundle, message->key,
                      &arguments);
  va_end(arguments);
  qlxAPIMutexUnlock();
  return result;
}

// An argument list is made only by a call, whose types are fixed when it is compiled. So there is
// one call for each sequence of types, and this picks it, one argument at a time.
template <typename... Bound>
static QlxLogResult logWith(const Message &message, const MessageArgument *next, size_t left,
                            Bound... bound) {
  if constexpr (sizeof...(Bound) < kMaxMessageArguments) {
    if (left > 0) {
      if (const auto *text = std::get_if<std::u16string>(next)) {
        return logWith(message, next + 1, left - 1, bound..., text->c_str());
      }
      if (const auto *integer = std::get_if<int32_t>(next)) {
        return logWith(message, next + 1, left - 1, bound..., *integer);
      }
      return logWith(message, next + 1, left - 1, bound..., *std::get_if<double>(next));
    }
  }
  return logBound(&message, bound...);
}

void Recorder::logLine(const std::u16string &line) {
  if (!QlxIsLoggable(logger_, level_)) return;
  judge(logText(logger_, level_, u"{0}", line.c_str()));
}

void Recorder::logMessage(const char *bundle, const char *key,
                          const std::vector<MessageArgument> &arguments) {
  if (!QlxIsLoggable(logger_, level_)) return;
  const Message message = {logger_, level_, bundle, key};
  judge(logWith(message, arguments.data(), arguments.size()));
}

static QlxHandlerProblems problemsSoFar() {
  QlxHandlerProblems problems = {};
  if (qlxAPIMutexLock() != 1) return problems;
  qlxIntlGetHandlerProblems(&problems);
  qlxAPIMutexUnlock();
  return problems;
}

// A status alone does not say whether the record was lost: a failed rollover has one, too.
void Recorder::judge(const QlxLogResult &result) {
  const QlxHandlerProblems now = problemsSoFar();
  const bool rolled = now.rolloversFailed == before_.rolloversFailed;
  const bool lost = now.recordsLost != before_.recordsLost || (result.statusKind != '-' && rolled);
  before_ = now;
  if (!rolled && !lost) tellRollover(now);
  judge(result, lost);
}

// The console handler reports nothing, but it writes to this process's standard output.
void Recorder::judge(const QlxLogResult &result, bool lost) {
  if (hasFailed_) return;
  if (ferror(stdout))
    fail("standard output cannot be written");
  else if (lost)
    fail(platformErrorText({result.statusKind, result.statusCode}));
  else if (result.msgStatus > 0)
    fail(u_errorName(static_cast<UErrorCode>(result.msgStatus)));
}

void Recorder::tellRollover(const QlxHandlerProblems &problems) {
  if (hasToldRollover_) return;
  hasToldRollover_ = true;
  fprintf(stderr, "qlx: %s: written, but not rolled over: %s\n", problems.rolloverFile,
          platformErrorText(problems.rollover).c_str());
}

void Recorder::fail(const std::string &why) {
  hasFailed_ = true;
  fprintf(stderr, "qlx: a record failed: %s\n", why.c_str());
}
