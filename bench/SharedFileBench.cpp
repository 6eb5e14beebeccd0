// What a record costs when several processes log to one rolling file, and beside it the floors: the
// same records by the plain file handler, and bare appends. From the moment on which the processes
// start together, to the end of the last one, divided by all records. The rows take turns, so that
// a busy machine is as busy for each; after each turn all files are read, and every record must be
// in them whole and once.
//
//   qlx_shared_bench [REPETITIONS [RECORDS [NAME...]]]      of the rows whose names contain a NAME
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <vector>

#include <fcntl.h>
#include <sys/ipc.h>
#include <sys/sem.h>
#include <sys/wait.h>
#include <unistd.h>

#include <qlx/qlx.h>

namespace {

using Clock = std::chrono::steady_clock;  // one clock for all processes of the machine

constexpr int kMaxBytes = 1048576;
constexpr size_t kTextBytes = 70;  // a line has the date before it
constexpr size_t kDateBytes = 30;  // with its separator
constexpr size_t kLineBytes = kDateBytes + kTextBytes + 1;

[[noreturn]] void stop(const char *what) {
  perror(what);
  exit(1);
}

// "writer 03 record 00001234 ...": fixed places, so that a record costs no formatting here.
constexpr size_t kWriterAt = 7, kWriterDigits = 2, kRecordAt = 17, kRecordDigits = 8;

template <typename Char>
void putNumber(Char *digits, size_t count, int number) {
  for (; count > 0; number /= 10) digits[--count] = static_cast<Char>('0' + number % 10);
}

// Called for each record; keeps the text with its terminator from one to the next.
template <typename Char>
class Text {
 public:
  explicit Text(int writer) {
    constexpr std::string_view kBegin = "writer 00 record 00000000 ";
    std::copy(kBegin.begin(), kBegin.end(), text_);
    std::fill(text_ + kBegin.size(), text_ + kTextBytes, Char('.'));
    putNumber(text_ + kWriterAt, kWriterDigits, writer);
  }
  const Char *of(int record) {
    putNumber(text_ + kRecordAt, kRecordDigits, record);
    return text_;
  }

 private:
  Char text_[kTextBytes + 1] = {};
};

// What one process writes with.
class Writer {
 public:
  virtual ~Writer() = default;
  virtual bool write(int record) = 0;
};

class BareAppend : public Writer {
 public:
  BareAppend(const std::string &path, int writer) : text_(writer), line_(kLineBytes, ' ') {
    line_.back() = '\n';
    descriptor_ = open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600);
  }
  ~BareAppend() override { close(descriptor_); }
  bool write(int record) override {
    memcpy(line_.data() + kDateBytes, text_.of(record), kTextBytes);
    return ::write(descriptor_, line_.data(), line_.size()) == ssize_t{kLineBytes};
  }

 private:
  Text<char> text_;
  std::string line_;
  int descriptor_;
};

class Logging : public Writer {
 public:
  Logging(const char *handlerClass, const std::string &path, int writer, int maxFiles, key_t key)
      : text_(writer) {
    QlxOpenToolkit(nullptr, nullptr);
    set("benchFile", "className", handlerClass);
    set("benchFile", "fileName", path);
    set("benchFile", "maxFileBytes", std::to_string(kMaxBytes));
    set("benchFile", "maxFiles", std::to_string(maxFiles));
    set("benchFile", "MPFileSemKey", std::to_string(key));
    set("bench", "listenerNames", "benchFile");
    logger_ = QlxGetObject("bench", "qlx_basiclogger");
  }
  ~Logging() override {
    QlxReleaseObject(logger_);
    QlxCloseToolkit();
  }
  bool write(int record) override {
    const QlxLogResult result = QlxLogUText(logger_, text_.of(record));
    return result.statusKind == '-';
  }

 private:
  static void set(const char *name, const char *key, const std::string &value) {
    ObjCfg *cfg = QlxLogMgrGetCfg(name);
    QlxSetObjCfgProp(cfg, key, value.c_str());
    QlxReleaseObjCfg(cfg);
  }

  Text<UChar> text_;
  QlxObject *logger_;
};

struct Row {
  const char *name;
  int processes;
  const char *handlerClass;  // null: bare
};

constexpr Row kRows[] = {
    {"4 processes, qlx_multiproc_filehandler", 4, "qlx_multiproc_filehandler"},
    {"4 processes, bare append, no lock", 4, nullptr},
    {"1 process, qlx_multiproc_filehandler", 1, "qlx_multiproc_filehandler"},
    {"1 process, qlx_filehandler", 1, "qlx_filehandler"},
    {"1 process, bare append", 1, nullptr},
};

// One turn of one row, in a folder and with a semaphore of its own.
class Turn {
 public:
  Turn(const Row &row, int records) : row_(row), each_(records / row.processes) {
    const char *parent = getenv("TMPDIR");
    folder_ = std::string(parent ? parent : "/tmp") + "/qlxbenchXXXXXX";
    if (!mkdtemp(folder_.data())) stop("mkdtemp");
    for (int *ends : {ready_, start_, end_})
      if (pipe2(ends, O_CLOEXEC) != 0) stop("pipe");
  }
  ~Turn() {
    for (const int *ends : {ready_, start_, end_}) close(ends[0]);
    if (const int set = semget(key_, 1, 0); set != -1) semctl(set, 0, IPC_RMID);
    std::filesystem::remove_all(folder_);
  }
  Turn(const Turn &) = delete;
  Turn &operator=(const Turn &) = delete;

  // Nanoseconds a record.
  double run() {
    std::vector<pid_t> children;
    for (int writer = 0; writer < row_.processes; ++writer) {
      children.push_back(fork());
      if (children.back() < 0) stop("fork");
      if (children.back() == 0) _exit(beWriter(writer) ? 0 : 1);
    }
    for (const int *ends : {ready_, start_, end_})
      if (ends != start_) close(ends[1]);
    close(start_[0]);
    start_[0] = -1;
    for (int i = 0; i < row_.processes; ++i) receive<char>(ready_[0]);
    const Clock::time_point start = Clock::now();
    close(start_[1]);
    Clock::time_point end = start;
    for (int i = 0; i < row_.processes; ++i)
      end = std::max(end, receive<Clock::time_point>(end_[0]));
    for (const pid_t child : children) {
      int status = 0;
      if (waitpid(child, &status, 0) != child || status != 0) stop("a writer failed");
    }
    return std::chrono::duration<double, std::nano>(end - start).count() / records();
  }

  int records() const { return each_ * row_.processes; }

  // How many different records stand in the files as whole lines; -1 when one stands there twice.
  int recordsFound() const {
    std::vector<bool> seen(records());
    int found = 0;
    for (const auto &file : std::filesystem::directory_iterator(folder_)) {
      std::ifstream in(file.path());
      for (std::string line; std::getline(in, line);) {
        const int index = indexOf(line);
        if (index < 0) continue;
        if (seen[index]) return -1;
        seen[index] = true;
        ++found;
      }
    }
    return found;
  }

 private:
  template <typename T>
  static T receive(int descriptor) {
    T value{};
    if (read(descriptor, &value, sizeof value) != sizeof value) stop("a writer is gone");
    return value;
  }

  bool beWriter(int number) {
    close(start_[1]);
    const std::string path = folder_ + "/bench.log";
    Writer *const writer =
        row_.handlerClass
            ? static_cast<Writer *>(new Logging(row_.handlerClass, path, number, maxFiles(), key_))
            : new BareAppend(path, number);
    bool good = ::write(ready_[1], "r", 1) == 1;
    char none;
    good &= read(start_[0], &none, 1) == 0;  // all start when the parent closes its end
    for (int record = 0; record < each_; ++record) good &= writer->write(record);
    const Clock::time_point end = Clock::now();
    good &= ::write(end_[1], &end, sizeof end) == sizeof end;
    delete writer;
    return good;
  }

  // Enough for all records; more would cost a failing rename each at every rollover.
  int maxFiles() const {
    return 2 + static_cast<int>(int64_t{records()} * int64_t{kLineBytes} / kMaxBytes);
  }

  int indexOf(const std::string &line) const {
    if (line.size() != kLineBytes - 1) return -1;
    const char *text = line.c_str() + kDateBytes;
    int writer, record, length = 0;
    if (sscanf(text, "writer %2d record %8d %n", &writer, &record, &length) != 2) return -1;
    if (strspn(text + length, ".") != kTextBytes - static_cast<size_t>(length)) return -1;
    if (writer < 0 || writer >= row_.processes || record < 0 || record >= each_) return -1;
    return writer * each_ + record;
  }

  const Row &row_;
  const int each_;  // records of one process
  const key_t key_ = 0x71000000 | (getpid() & 0xffffff);
  std::string folder_;
  int ready_[2], start_[2], end_[2];
};

struct Result {
  const Row *row;
  std::vector<double> nanos;
  int records, found;
};

void print(Result &result) {
  std::sort(result.nanos.begin(), result.nanos.end());
  printf("%-40s %9.0f %9.0f %9d %9d\n", result.row->name, result.nanos.front(),
         result.nanos[result.nanos.size() / 2], result.records, result.found);
}

bool isWanted(const Row &row, int argc, char **argv) {
  if (argc <= 3) return true;
  return std::any_of(argv + 3, argv + argc, [&](char *name) { return strstr(row.name, name); });
}

}  // namespace

int main(int argc, char **argv) {
  const int repetitions = argc > 1 ? atoi(argv[1]) : 9;
  const int records = argc > 2 ? atoi(argv[2]) : 100000;
  std::vector<Result> results;
  for (const Row &row : kRows)
    if (isWanted(row, argc, argv)) results.push_back({&row, {}, 0, 0});
  if (repetitions < 1 || records < 4 || results.empty()) {
    fprintf(stderr, "usage: qlx_shared_bench [REPETITIONS [RECORDS [NAME...]]]\n");
    return 2;
  }
  bool isComplete = true;
  for (int repetition = 0; repetition < repetitions; ++repetition) {
    for (Result &result : results) {
      Turn turn(*result.row, records);
      result.nanos.push_back(turn.run());
      result.records += turn.records();
      const int found = turn.recordsFound();
      result.found += found;
      isComplete &= found == turn.records();
    }
  }
  printf("%-40s %9s %9s %9s %9s\n", "ns a record", "minimum", "median", "records", "found");
  for (Result &result : results) print(result);
  if (!isComplete) fprintf(stderr, "records were lost, torn or written twice\n");
  return isComplete ? 0 : 1;
}
