#include "Writer.h"

#include <csignal>
#include <cstring>
#include <optional>

#include <fcntl.h>
#include <poll.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <qlx/qlx.h>

#include "support/PlainFormatter.h"

static constexpr uint32_t kRecordsBetweenChanges = 23;

bool When::read(const char *text, When *when) {
  unsigned first = 0;
  unsigned number = 0;
  char end = 0;
  if (std::sscanf(text, "%u..%u%c", &first, &number, &end) == 2) {
    *when = {first, number, 1};
  } else if (std::sscanf(text, "%u+%u%c", &first, &number, &end) == 2) {
    *when = {first, UINT32_MAX, number};
  } else if (std::sscanf(text, "%u%c%c", &first, &end, &end) == 2 &&
             text[std::strlen(text) - 1] == '+') {
    *when = {first, UINT32_MAX, 1};
  } else if (std::sscanf(text, "%u%c", &first, &end) == 1) {
    *when = {first, first, 1};
  } else {
    return false;
  }
  return when->first != 0 && when->step != 0;
}

namespace {

class Writer {
 public:
  Writer(const WriterPlan &plan, uint32_t slot, Board *board)
      : plan_(plan), slot_(slot), board_(board), own_(&board->writers[slot]) {}

  // Locale, time zone and texts are loaded before a call may fail; the handler is made after.
  void run() {
    standApart();
    QlxOpenToolkit(nullptr, nullptr);
    formatter_.emplace();
    if (plan_.variant->form == Form::kFramedLine) {
      formatter_->header = kHeader;
      formatter_->trailer = kTrailer;
    }
    warmUp();
    reach(Step::kWarm);
    await(Step::kTraced);
    awaitMark(plan_.traced);
    reach(Step::kTraced);
    openLog();
    for (uint32_t i = 0; i < plan_.variant->records; ++i) logWithFaults();
    reach(Step::kLogged);
    await(Step::kFinished);
    awaitMark(false);
    limitFiles(RLIM_INFINITY);
    for (uint32_t i = 0; i < kRecordsAfter; ++i) logNext();
    QlxReleaseObject(handler_);
    QlxReleaseObject(logger_);
    QlxCloseToolkit();
    reach(Step::kFinished);
    for (;;) nap();  // until the judge has looked at the descriptors
  }

 private:
  static void nap() { poll(nullptr, 0, 1); }

  void reach(Step step) { own_->step = step; }
  void await(Step step) const {
    while (board_->until.load() < step) nap();
  }
  // While calls may fail, and only then, one of them answers the mark.
  static void awaitMark(bool wanted) {
    while ((syscall(SYS_getppid) == kTracedMark) != wanted) nap();
  }

  static void standApart() {
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    prctl(PR_SET_PTRACER, PR_SET_PTRACER_ANY, 0, 0, 0);
    std::signal(SIGXFSZ, SIG_IGN);
    const int nothing = open("/dev/null", O_RDWR);
    dup2(nothing, STDIN_FILENO);
    dup2(nothing, STDOUT_FILENO);
    close(nothing);
  }

  QlxObject *makeFormatter(const char *name) const {
    return QlxGetObject(
        name, plan_.variant->form == Form::kXml ? "qlx_xmlformatter" : PlainFormatter::kClass);
  }

  // A logger with a handler, which is the caller's too.
  QlxObject *makeLog(const std::string &name, QlxObject *handler, const std::string &folder) const {
    QlxObject *logger = QlxGetObject((name + ".log").c_str(), "qlx_basiclogger");
    QlxObject *format = makeFormatter((name + ".format").c_str());
    QlxHandlerSetFormatter(handler, format);
    QlxSetObjProp(handler, "MPFileSemKey", plan_.semaphoreKey.c_str());
    QlxSetObjProp(handler, "maxFileBytes", plan_.variant->maxFileBytes);
    QlxSetObjProp(handler, "maxFiles", std::to_string(kMaxFiles).c_str());
    for (const auto &[key, value] : plan_.variant->settings) QlxSetObjProp(handler, key, value);
    QlxSetObjProp(handler, "fileName", (folder + "/app.log").c_str());
    QlxAddListener(logger, handler);
    QlxReleaseObject(format);
    return logger;
  }

  void warmUp() {
    QlxObject *handler = QlxGetObject("warm.file", "qlx_filehandler");
    QlxObject *logger = makeLog("warm", handler, plan_.warmFolder + std::to_string(slot_));
    for (int i = 0; i < 3; ++i) QlxLogUText(logger, u"warm");
    QlxReleaseObject(handler);
    QlxReleaseObject(logger);
  }

  void openLog() {
    handler_ = QlxGetObject("run.file", plan_.variant->handlerClass);
    logger_ = makeLog("run", handler_, plan_.folder);
  }

  void logNext() {
    const uint32_t number = own_->count++;
    const std::string text = textOf({slot_, number});
    const std::u16string wide(text.begin(), text.end());
    const QlxLogResult result = QlxLogUText(logger_, wide.c_str());
    own_->answers[number].code = result.statusCode;
    own_->answers[number].kind = result.statusKind;
  }

  static void limitFiles(rlim_t bytes) {
    rlimit limit;
    getrlimit(RLIMIT_FSIZE, &limit);
    limit.rlim_cur = bytes;
    setrlimit(RLIMIT_FSIZE, &limit);
  }

  // As on a full disk: the write is short, and the next one fails. A limit below the file's size
  // lets no record in, and makes the copy of the file short.
  void logWithFaults() {
    struct stat active = {};
    const bool cuts = plan_.cut.has(own_->count + 1);
    if (cuts && stat((plan_.folder + "/app.log").c_str(), &active) == 0) {
      const int64_t limit = active.st_size + plan_.cutBytes;
      limitFiles(static_cast<rlim_t>(limit > 0 ? limit : 0));
      ++board_->cuts;
    }
    logNext();
    if (cuts) limitFiles(RLIM_INFINITY);
    const bool reopens = plan_.variant->reconfigures && own_->count % kRecordsBetweenChanges == 0;
    if (reopens) QlxSetObjProp(handler_, "filePermission", "644");
  }

  const WriterPlan &plan_;
  const uint32_t slot_;
  Board *const board_;
  WriterBoard *const own_;
  std::optional<PlainFormatter> formatter_;  // until the toolkit is closed
  QlxObject *handler_ = nullptr;
  QlxObject *logger_ = nullptr;
};

}  // namespace

void runWriter(const WriterPlan &plan, uint32_t slot, Board *board) {
  Writer(plan, slot, board).run();
  _exit(0);
}
