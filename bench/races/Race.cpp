#include "Race.h"

#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <span>
#include <thread>
#include <vector>

namespace fs = std::filesystem;

namespace race {
namespace {

constexpr int64_t kMiB = 1'048'576;

constexpr Row kRows[] = {
    {"suppressed", Call::Suppressed, 20'000'000},
    {"suppressed-inline", Call::SuppressedInline, 20'000'000},
    {"text", Call::Text, 300'000},
    {"message", Call::Message, 300'000},
    {"message-localized", Call::Localized, 300'000},
    // At any scale some rollovers.
    {"rolling", Call::Text, 300'000, 1, 1, kMiB, 3, Layout::Line, false, 30'000},
    {"threads-2", Call::Text, 300'000, 2},
    {"threads-8", Call::Text, 300'000, 8},
    // All generations are kept here: 60000 records are eight or nine of the twelve MiB.
    {"processes-4", Call::Text, 60'000, 1, 4, kMiB, 12, Layout::Line, false, 30'000},
    {"xml", Call::Text, 300'000, 1, 1, 1'000'000'000, 3, Layout::Xml},
    {"trace", Call::Text, 300'000, 1, 1, 1'000'000'000, 3, Layout::Trace},
    {"xml-stamped", Call::Text, 300'000, 1, 1, 1'000'000'000, 3, Layout::Xml, true},
    {"trace-stamped", Call::Text, 300'000, 1, 1, 1'000'000'000, 3, Layout::Trace, true},
};

constexpr int kMaxWorkers = 8;

// What the threads or processes of one run share.
struct Meeting {
  pthread_barrier_t start;
  std::array<int64_t, kMaxWorkers> begin, end;  // of each worker, in nanoseconds
};

[[noreturn]] void fail(const std::string &what) {
  fprintf(stderr, "race: %s\n", what.c_str());
  exit(1);
}

int64_t now() {
  timespec time;
  clock_gettime(CLOCK_MONOTONIC, &time);
  return time.tv_sec * 1'000'000'000 + time.tv_nsec;
}

// ---- What stands in the files ----

std::string contentOf(const fs::path &path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

std::vector<fs::path> filesIn(const std::string &folder) {
  std::vector<fs::path> files;
  for (const fs::directory_entry &entry : fs::directory_iterator(folder)) {
    const bool isLock = entry.path().extension() == ".lock";
    if (entry.is_regular_file() && !entry.is_symlink() && !isLock) files.push_back(entry.path());
  }
  return files;
}

uintmax_t bytesIn(const std::string &folder) {
  uintmax_t bytes = 0;
  for (const fs::path &path : filesIn(folder)) bytes += fs::file_size(path);
  return bytes;
}

template <typename Accepts>
size_t spanOf(std::string_view text, Accepts accepts) {
  return std::find_if_not(text.begin(), text.end(), accepts) - text.begin();
}

bool isDigit(char c) {
  return c >= '0' && c <= '9';
}
// Digits, after the blanks that pad them, if any.
size_t spanOfNumber(std::string_view text) {
  const size_t blanks = spanOf(text, [](char c) { return c == ' '; });
  const size_t digits = spanOf(text.substr(blanks), isDigit);
  return digits ? blanks + digits : 0;
}
bool isInWord(char c) {
  return c != ' ' && c != '<' && c != '(' && c != '\n';
}

// How many characters of `text` the placeholder at the start of `shape` stands for; 0: it does not
// match. `length` becomes the length of the placeholder.
size_t matchOne(std::string_view shape, std::string_view text, std::string_view wanted,
                size_t &length) {
  if (shape.starts_with("{number}")) return length = 8, spanOfNumber(text);
  if (shape.starts_with("{word}")) return length = 6, spanOf(text, isInWord);
  if (shape.starts_with("{text}")) return length = 6, text.starts_with(wanted) * wanted.size();
  length = 1;
  if (text.empty()) return 0;
  return shape.front() == '#' ? isDigit(text.front()) : shape.front() == text.front();
}

// The length of the record at the start of `text`; 0: there is none of this shape.
size_t matchRecord(std::string_view shape, std::string_view text, std::string_view wanted) {
  const size_t size = text.size();
  while (!shape.empty()) {
    size_t length;
    const size_t matched = matchOne(shape, text, wanted, length);
    if (!matched) return 0;
    text.remove_prefix(matched);
    shape.remove_prefix(length);
  }
  return size - text.size();
}

struct Count {
  int64_t records = 0, malformed = 0;
};

void skipLine(std::string_view &text) {
  const size_t end = text.find('\n');
  text.remove_prefix(end == text.npos ? text.size() : end + 1);
}

void skipHeader(std::string_view &text, const std::string &last) {
  if (last.empty()) return;
  while (!text.empty() && !text.starts_with(last)) skipLine(text);
  skipLine(text);
}

Count countRecords(const std::string &folder, const Shape &shape, std::string_view wanted) {
  Count count;
  for (const fs::path &path : filesIn(folder)) {
    const std::string content = contentOf(path);
    std::string_view rest = content;
    skipHeader(rest, shape.lastOfHeader);
    while (!rest.empty()) {
      const size_t length = matchRecord(shape.record, rest, wanted);
      if (length) {
        count.records++;
        rest.remove_prefix(length);
      } else {
        count.malformed++;
        skipLine(rest);
      }
    }
  }
  return count;
}

// ---- One run ----

const char *wantedText(const Row &row) {
  return row.call == Call::Text ? kText : kMessage;
}

bool isSuppressed(const Row &row) {
  return row.call == Call::Suppressed || row.call == Call::SuppressedInline;
}

void emptyFolder(const std::string &folder) {
  fs::remove_all(folder);
  fs::create_directories(folder);
}

Setup setupOf(const Row &row, const std::string &folder, int64_t maxBytes, int files) {
  return {.folder = folder,
          .path = folder + "/race.log",
          .maxBytes = maxBytes,
          .files = files,
          .source = row.call == Call::Text,
          .shared = row.processes > 1,
          .layout = row.layout,
          .stamped = row.stamped};
}

// This program again. Loggers are used only in such processes: some libraries can be set up once,
// and some start threads before main(), which a fork alone would lose.
pid_t start(std::vector<std::string> arguments) {
  const pid_t child = fork();
  if (child < 0) fail("fork failed");
  if (child > 0) return child;
  std::vector<char *> argv = {const_cast<char *>("race")};
  for (std::string &argument : arguments) argv.push_back(argument.data());
  argv.push_back(nullptr);
  execv("/proc/self/exe", argv.data());
  _exit(127);
}

void waitFor(pid_t child) {
  int status;
  if (waitpid(child, &status, 0) != child || status != 0) fail("a run's process failed");
}

// Each of the first records is with the operating system when its call returns.
void checkEachIsWritten(const Field &field, const Row &row, const std::string &folder) {
  const Setup setup = setupOf(row, folder, row.maxBytes, row.files);
  field.withLogger(setup, row.call, [&](const Log &log) {
    for (int i = 1; i <= 20; i++) {
      log(1);
      const Count count = countRecords(folder, field.shape(row), wantedText(row));
      if (count.records == i && !count.malformed) continue;
      fail(std::to_string(i) + " records are wanted, not\n" + contentOf(filesIn(folder).front()));
    }
  });
}

constexpr int64_t kRollingRecords = 10'000;  // about 1.5 MB

void logRolling(const Field &field, const Row &row, const std::string &folder) {
  const Setup setup = setupOf(row, folder, kMiB / 4, 11);
  field.withLogger(setup, row.call, [&](const Log &log) { log(kRollingRecords); });
}

// Several rollovers with all generations kept: nothing is lost on the way.
void checkRolling(const Field &field, const Row &row, const std::string &folder) {
  const Count count = countRecords(folder, field.shape(row), wantedText(row));
  if (filesIn(folder).size() < 5) fail("the file did not roll");
  if (count.records != kRollingRecords || count.malformed) fail("records were lost by rolling");
}

// The kept generations obey the limits, at most a record above; else what is wrong.
std::string checkGenerations(const Row &row, const std::string &folder) {
  const std::vector<fs::path> files = filesIn(folder);
  if (std::ssize(files) > row.files) return "too many files";
  for (const fs::path &path : files) {
    const uintmax_t bytes = fs::file_size(path);
    if (bytes > static_cast<uintmax_t>(row.maxBytes) + 1000) {
      return "a file of " + std::to_string(bytes) + " bytes";
    }
  }
  return "";
}

Meeting *mapMeeting(int file) {
  void *shared = mmap(nullptr, sizeof(Meeting), PROT_READ | PROT_WRITE, MAP_SHARED, file, 0);
  if (shared == MAP_FAILED) fail("no shared memory");
  return static_cast<Meeting *>(shared);
}

// The file is inherited by the processes that meet.
Meeting *openMeeting(int workers, int &file) {
  file = memfd_create("race", 0);
  if (file < 0 || ftruncate(file, sizeof(Meeting)) != 0) fail("no shared memory");
  Meeting *meeting = mapMeeting(file);
  pthread_barrierattr_t attributes;
  pthread_barrierattr_init(&attributes);
  pthread_barrierattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
  pthread_barrier_init(&meeting->start, &attributes, workers);
  return meeting;
}

void work(Meeting *meeting, int worker, int64_t count, const Log &log) {
  pthread_barrier_wait(&meeting->start);
  meeting->begin[worker] = now();
  log(count);
  meeting->end[worker] = now();
}

int64_t elapsed(const Meeting &meeting, int workers) {
  const auto begin = std::span(meeting.begin).first(workers);
  const auto end = std::span(meeting.end).first(workers);
  return *std::max_element(end.begin(), end.end()) - *std::min_element(begin.begin(), begin.end());
}

void runThreads(Meeting *meeting, int threads, int64_t each, const Log &log) {
  if (threads == 1) return work(meeting, 0, each, log);
  std::vector<std::thread> workers;
  workers.reserve(threads);
  for (int i = 0; i < threads; i++) workers.emplace_back(work, meeting, i, each, log);
  for (std::thread &worker : workers) worker.join();
}

int workersOf(const Row &row) {
  return row.threads * row.processes;
}
int64_t recordsOfEach(const Row &row, double scale) {
  const auto all = static_cast<int64_t>(static_cast<double>(row.records) * std::min(scale, 1.0));
  return std::max(all, row.least) / workersOf(row);
}
int64_t warmUpOf(int64_t each) {
  return std::max<int64_t>(10, each / 50);
}

// One line: logger, row, nanoseconds a record, records, how many of them are lost, malformed lines,
// and what else is wrong.
void report(const Field &field, const Row &row, const std::string &folder, int64_t each,
            double nanoseconds) {
  const int64_t timed = each * workersOf(row), logged = timed + warmUpOf(each) * row.processes;
  Count count = {logged, 0};
  if (!isSuppressed(row)) {
    count = countRecords(folder, field.shape(row), wantedText(row));
  } else if (bytesIn(folder) != 0) {
    fail("a suppressed call wrote something");
  }
  // Three generations cannot keep all, which is not a loss.
  const int64_t lost = row.name == "rolling" ? 0 : logged - count.records;
  const std::string wrong = field.rolls ? checkGenerations(row, folder) : "";
  printf("%s\t%s\t%.2f\t%jd\t%jd\t%jd\t%s\n", field.name, row.name.data(),
         nanoseconds / static_cast<double>(timed), static_cast<intmax_t>(logged),
         static_cast<intmax_t>(lost), static_cast<intmax_t>(count.malformed), wrong.c_str());
}

// Every process opens a logger of its own, warms it up, and waits for the others.
void runWorker(const Field &field, const Row &row, const std::string &folder, double scale,
               int worker, int meetingFile) {
  Meeting *meeting = mapMeeting(meetingFile);
  const int64_t each = recordsOfEach(row, scale);
  const Setup setup = setupOf(row, folder, row.maxBytes, row.files);
  field.withLogger(setup, row.call, [&](const Log &log) {
    log(warmUpOf(each));
    if (row.processes == 1) return runThreads(meeting, row.threads, each, log);
    work(meeting, worker, each, log);
  });
}

void race(const Field &field, const Row &row, const std::string &folder, double scale) {
  const std::string name(row.name);
  if (!isSuppressed(row)) {
    emptyFolder(folder);
    waitFor(start({"--check", name, folder}));
  }
  if (row.name == "rolling") {
    emptyFolder(folder);
    waitFor(start({"--roll", name, folder}));
    checkRolling(field, row, folder);
  }

  emptyFolder(folder);
  int meetingFile;
  const Meeting *meeting = openMeeting(workersOf(row), meetingFile);
  std::vector<pid_t> children;
  children.reserve(row.processes);
  for (int i = 0; i < row.processes; i++) {
    children.push_back(start({"--work", name, folder, std::to_string(scale), std::to_string(i),
                              std::to_string(meetingFile)}));
  }
  for (const pid_t child : children) waitFor(child);
  report(field, row, folder, recordsOfEach(row, scale),
         static_cast<double>(elapsed(*meeting, workersOf(row))));
  fs::remove_all(folder);
}

}  // namespace

// What `race_NAME ROW` does, and the steps of it that it starts this program for.
static bool step(const Field &field, const Row &row, std::span<char *> arguments) {
  const std::string_view what = arguments[0];
  if (what == row.name && arguments.size() >= 2) {
    ::race::race(field, row, arguments[1], arguments.size() > 2 ? atof(arguments[2]) : 1.0);
    return true;
  }
  if (arguments.size() < 3 || arguments[1] != row.name) return false;
  if (what == "--check") return checkEachIsWritten(field, row, arguments[2]), true;
  if (what == "--roll") return logRolling(field, row, arguments[2]), true;
  if (what != "--work" || arguments.size() < 6) return false;
  runWorker(field, row, arguments[2], atof(arguments[3]), atoi(arguments[4]), atoi(arguments[5]));
  return true;
}

int run(int argc, char **argv, const Field &field) {
  const std::string_view what = argc > 1 ? argv[1] : "";
  if (what == "--version") return puts(field.version().c_str()) < 0;
  for (const Row &row : kRows) {
    if (!field.takesPart(row)) continue;
    if (what == "--rows") puts(row.name.data());
    if (argc > 1 && step(field, row, std::span(argv, argc).subspan(1))) return 0;
  }
  if (what == "--rows") return 0;
  fprintf(stderr, "usage: race_%s --version | --rows | ROW FOLDER [SCALE]\n", field.name);
  return 2;
}

}  // namespace race
