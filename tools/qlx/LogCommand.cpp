// Opens the toolkit, feeds the inputs to the logger and closes the toolkit, which leaves everything
// written whatever ended the input.
#include "LogCommand.h"

#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <unistd.h>

#include <qlx/level.h>
#include <qlx/object.h>
#include <qlx/toolkit.h>

#include "ExitStatus.h"
#include "LineReader.h"
#include "MessageArguments.h"
#include "Progress.h"
#include "Recorder.h"
#include "StopSignal.h"

namespace {
// The open toolkit.
class Toolkit {
 public:
  explicit Toolkit(const std::string &config)
      : isOpen_(QlxOpenToolkit(config.empty() ? nullptr : config.c_str(), &status_) == 1) {}
  ~Toolkit() {
    if (isOpen_) QlxCloseToolkit();
  }
  Toolkit(const Toolkit &) = delete;
  Toolkit &operator=(const Toolkit &) = delete;

  bool isOpen() const { return isOpen_; }
  std::string problem() const {
    if (status_.kind == '-')
      return "a line of it cannot be read, or its key names no configuration";
    return platformErrorText(status_);
  }

 private:
  CxStatus status_{'-', 0};
  const bool isOpen_;
};

// One counted reference to a logger, or nothing.
class LoggerRef {
 public:
  explicit LoggerRef(const std::string &name) : object_(QlxGetObject(name.c_str(), nullptr)) {}
  ~LoggerRef() { QlxReleaseObject(object_); }
  LoggerRef(const LoggerRef &) = delete;
  LoggerRef &operator=(const LoggerRef &) = delete;

  bool isLogger() const {
    return object_ && object_->objClass && object_->objClass->kind == Logger;
  }
  QlxObject *get() const { return object_; }

 private:
  QlxObject *const object_;
};
}  // namespace

// Returns false when the input could not be read to its end.
static bool logLines(int descriptor, const std::string &name, const StopSignal &stop,
                     Recorder &recorder) {
  LineReader lines(descriptor, stop);
  Progress progress(descriptor, name);
  std::u16string line;
  while (lines.next(line)) {
    recorder.logLine(line);
    progress.update(lines.bytesRead());
  }
  progress.finish();
  if (lines.error() == 0) return true;
  failed(name, strerror(lines.error()));
  return false;
}

static bool logFile(const std::string &name, const StopSignal &stop, Recorder &recorder) {
  if (name == "-") return logLines(STDIN_FILENO, "standard input", stop, recorder);
  const int descriptor = open(name.c_str(), O_RDONLY | O_CLOEXEC);
  if (descriptor < 0) {
    failed(name, strerror(errno));
    return false;
  }
  const bool complete = logLines(descriptor, name, stop, recorder);
  close(descriptor);
  return complete;
}

static int logInputs(std::vector<std::string> names, Recorder &recorder) {
  const StopSignal stop;
  if (names.empty()) names.push_back("-");
  bool complete = true;
  for (const std::string &name : names) {
    if (stop.requested()) break;
    complete &= logFile(name, stop, recorder);
  }
  return complete ? kSuccess : kFailure;
}

static int logOneMessage(const LogOptions &options, Recorder &recorder) {
  std::string problem;
  const auto arguments =
      readMessageArguments(options.bundle.c_str(), options.key.c_str(), options.inputs, problem);
  if (!arguments) {
    failed(options.key, problem);
    return kWrongUsage;
  }
  recorder.logMessage(options.bundle.c_str(), options.key.c_str(), *arguments);
  return kSuccess;
}

int runLogCommand(const LogOptions &options) {
  const Toolkit toolkit(options.config);
  if (!toolkit.isOpen()) {
    return failed(options.config.empty() ? "the toolkit" : options.config, toolkit.problem());
  }
  const LoggerRef logger(options.logger);
  if (!logger.isLogger()) return failed(options.logger, "no logger of this name is configured");

  Recorder recorder(logger.get(), QlxGetLevelFromString(options.level.c_str()));
  const int status = options.bundle.empty() ? logInputs(options.inputs, recorder)
                                            : logOneMessage(options, recorder);
  return status == kSuccess && recorder.hasFailed() ? kFailure : status;
}
