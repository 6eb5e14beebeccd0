// What a log call costs, row by row, and beside each the floor: a bare write of the same bytes to
// an append-mode file. Every record is handed to the operating system before its call returns.
//
//   qlx_bench --benchmark_repetitions=9 --benchmark_enable_random_interleaving=true
//             --benchmark_report_aggregates_only=true
#include <benchmark/benchmark.h>

#include <fcntl.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

#include <qlx/qlx.h>

namespace {

constexpr const UChar kText[] =
    u"a text of about one hundred bytes, as long as the line of a common log tends to be in "
    u"practice";

// What a pd logger stamps; without effect on a basic logger.
constexpr const char *kStamps[] = {"organization", "product",      "component",      "client",
                                   "server",       "serverFormat", "productInstance"};

// An open toolkit that logs into a file of its own; made before the threads of a row start.
class Host {
 public:
  Host(const char *maxBytes, const char *maxFiles, const char *loggerClass = "qlx_basiclogger",
       const char *formatterClass = "qlx_basicformatter") {
    char pattern[] = "/tmp/qlxbenchXXXXXX";
    folder_ = mkdtemp(pattern);
    QlxOpenToolkit(nullptr, nullptr);
    set("benchFile", "className", "qlx_filehandler");
    set("benchFile", "fileName", path().c_str());
    set("benchFile", "maxFileBytes", maxBytes);
    set("benchFile", "maxFiles", maxFiles);
    set("benchFile", "formatterName", "benchFormatter");
    set("benchFormatter", "className", formatterClass);
    for (const char *key : kStamps) set("bench", key, "seven");
    set("bench", "listenerNames", "benchFile");
    logger_ = QlxGetObject("bench", loggerClass);
  }
  ~Host() {
    QlxReleaseObject(logger_);
    QlxCloseToolkit();
    std::filesystem::remove_all(folder_);
  }

  QlxObject *logger() const { return logger_; }
  std::string path() const { return folder_ + "/bench.log"; }

 private:
  static void set(const char *name, const char *key, const char *value) {
    ObjCfg *cfg = QlxLogMgrGetCfg(name);
    QlxSetObjCfgProp(cfg, key, value);
    QlxReleaseObjCfg(cfg);
  }

  std::string folder_;
  QlxObject *logger_ = nullptr;
};

Host *gHost;

void openUnlimited(const benchmark::State &) {
  gHost = new Host("1000000", "1");
}
void openRolling(const benchmark::State &) {
  gHost = new Host("1048576", "3");
}

// A pd logger stamps, whether its formatter shows what it stamped (the last two) or not.
void openPd(const benchmark::State &) {
  gHost = new Host("1000000", "1", "qlx_pdlogger");
}
void openPdXml(const benchmark::State &) {
  gHost = new Host("1000000", "1", "qlx_pdlogger", "qlx_xmlformatter");
}
void openPdTrace(const benchmark::State &) {
  gHost = new Host("1000000", "1", "qlx_pdlogger", "qlx_vextraceformatter");
}

void closeHost(const benchmark::State &) {
  delete gHost;
  gHost = nullptr;
}

QlxLogResult logText() {
  return QlxLogDebugMin(gHost->logger(), "transfer.c", "run", 42, kText);
}

QlxLogResult logTextPattern() {
  return QlxLogUText(gHost->logger(),
                     u"user {0} moved {1,number,integer} items at {2,number} a second", u"alice",
                     12345, 2.75);
}

QlxLogResult logMessage() {
  return QlxLogInfo(gHost->logger(), QLX_BENCH_BUNDLE, "transfer", u"alice", 12345, 2.75);
}

QlxLogResult logIdentifiedMessage() {
  return QlxLogInfo(gHost->logger(), QLX_BENCH_BUNDLE, "identified", u"alice", 12345);
}

template <QlxLogResult (*Log)()>
void logs(benchmark::State &state) {
  for ([[maybe_unused]] auto _ : state) {
    if (Log().statusKind != '-') state.SkipWithError("a record was not written");
  }
}

// The bytes of one record of this row, written bare. Rolled files are not part of the floor.
template <QlxLogResult (*Log)()>
void writesTheSameBytes(benchmark::State &state) {
  static std::string record;
  if (state.thread_index() == 0) {
    Log();
    struct stat info = {};
    stat(gHost->path().c_str(), &info);
    record.assign(static_cast<size_t>(info.st_size), 'x');
    record.back() = '\n';
  }
  const std::string path = gHost->path() + ".floor";
  const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600);
  for ([[maybe_unused]] auto _ : state) {
    if (write(fd, record.data(), record.size()) < 0) state.SkipWithError("write failed");
  }
  close(fd);
}

void suppressed(benchmark::State &state) {
  for ([[maybe_unused]] auto _ : state) {
    benchmark::DoNotOptimize(QlxLogDebugMax(gHost->logger(), "transfer.c", "run", 42, kText));
  }
}

#define ROW(name, function, open) \
  BENCHMARK(function)->Name(name)->Setup(open)->Teardown(closeHost)->UseRealTime()

ROW("suppressed call", suppressed, openUnlimited);
ROW("text, one file", logs<logText>, openUnlimited);
ROW("text, one file: bare write", writesTheSameBytes<logText>, openUnlimited);
ROW("3 parameters, text pattern", logs<logTextPattern>, openUnlimited);
ROW("3 parameters, text pattern: bare write", writesTheSameBytes<logTextPattern>, openUnlimited);
ROW("3 parameters, bundle", logs<logMessage>, openUnlimited);
ROW("3 parameters, bundle: bare write", writesTheSameBytes<logMessage>, openUnlimited);
ROW("text, rolling 3 of 1 MiB", logs<logText>, openRolling);
ROW("text, rolling 3 of 1 MiB: bare write", writesTheSameBytes<logText>, openRolling);
ROW("pd logger stamping 7 values", logs<logText>, openPd);
ROW("pd logger stamping 7 values: bare write", writesTheSameBytes<logText>, openPd);
ROW("XML record, 2 parameters", logs<logIdentifiedMessage>, openPdXml);
ROW("XML record, 2 parameters: bare write", writesTheSameBytes<logIdentifiedMessage>, openPdXml);
ROW("trace line", logs<logText>, openPdTrace);
ROW("trace line: bare write", writesTheSameBytes<logText>, openPdTrace);
ROW("text, one file", logs<logText>, openUnlimited)->Threads(2);
ROW("text, one file: bare write", writesTheSameBytes<logText>, openUnlimited)->Threads(2);
ROW("text, one file", logs<logText>, openUnlimited)->Threads(8);
ROW("text, one file: bare write", writesTheSameBytes<logText>, openUnlimited)->Threads(8);

}  // namespace
