// Hands records to a logger and keeps in mind whether one failed; the first failure is told on
// standard error, once, and so is the first rollover that failed while its record was written.
#ifndef QLX_TOOLS_RECORDER_H
#define QLX_TOOLS_RECORDER_H

#include <string>
#include <vector>

#include <qlx/class/handler.h>
#include <qlx/types.h>

#include "MessageArguments.h"

// The system's text for a failed platform operation.
std::string platformErrorText(CxStatus status);

class Recorder {
 public:
  // The logger is borrowed.
  Recorder(QlxObject *logger, int32_t level) : logger_(logger), level_(level) {}

  // One record of this text, which is no pattern.
  void logLine(const std::u16string &line);

  // One record of a bundle's message, with at most kMaxMessageArguments arguments.
  void logMessage(const char *bundle, const char *key,
                  const std::vector<MessageArgument> &arguments);

  bool hasFailed() const { return hasFailed_; }

 private:
  void judge(const QlxLogResult &result);
  void judge(const QlxLogResult &result, bool lost);
  void tellRollover(const QlxHandlerProblems &problems);
  void fail(const std::string &why);

  QlxObject *const logger_;
  const int32_t level_;
  QlxHandlerProblems before_ = {};
  bool hasFailed_ = false;
  bool hasToldRollover_ = false;
};

#endif
