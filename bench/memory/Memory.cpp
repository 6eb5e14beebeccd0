// What a host that logs keeps and asks for: its resident size before and after a million records to
// two files, and the allocations of one record, by kind of record, once everything that is held
// between calls is there. Prints markdown.
//
//   qlx_memory FOLDER
#include <qlx/qlx.h>

#include <errno.h>
#include <stdio.h>
#include <stdlib.h>
#include <unistd.h>

#include <atomic>
#include <filesystem>
#include <string>

// ---- Every block passes here ----

static std::atomic<int64_t> gAllocations;

extern "C" {
void *__libc_malloc(size_t size);
void *__libc_calloc(size_t count, size_t size);
void *__libc_realloc(void *block, size_t size);
void *__libc_memalign(size_t alignment, size_t size);

void *malloc(size_t size) {
  gAllocations.fetch_add(1, std::memory_order_relaxed);
  return __libc_malloc(size);
}
void *calloc(size_t count, size_t size) {
  gAllocations.fetch_add(1, std::memory_order_relaxed);
  return __libc_calloc(count, size);
}
void *realloc(void *block, size_t size) {
  gAllocations.fetch_add(1, std::memory_order_relaxed);
  return __libc_realloc(block, size);
}
void *aligned_alloc(size_t alignment, size_t size) {
  gAllocations.fetch_add(1, std::memory_order_relaxed);
  return __libc_memalign(alignment, size);
}
int posix_memalign(void **block, size_t alignment, size_t size) {
  gAllocations.fetch_add(1, std::memory_order_relaxed);
  *block = __libc_memalign(alignment, size);
  return *block ? 0 : ENOMEM;
}
}

namespace {

constexpr UChar kText[] =
    u"a text of about one hundred bytes, as long as the line of a common log tends to be in "
    u"practice";

[[noreturn]] void fail(const char *what) {
  fprintf(stderr, "qlx_memory: %s\n", what);
  exit(1);
}

void check(QlxLogResult result) {
  if (result.statusKind != '-') fail("a record was not written");
}

void set(const char *name, const char *key, const std::string &value) {
  ObjCfg *cfg = QlxLogMgrGetCfg(name);
  if (!QlxSetObjCfgProp(cfg, key, value.c_str())) fail("a property was not set");
  QlxReleaseObjCfg(cfg);
}

void configureFile(const std::string &name, const std::string &path, const char *formatterClass) {
  set((name + "Formatter").c_str(), "className", formatterClass);
  set(name.c_str(), "className", "qlx_filehandler");
  set(name.c_str(), "fileName", path);
  set(name.c_str(), "maxFiles", "3");
  set(name.c_str(), "formatterName", name + "Formatter");
}

int64_t residentKiB() {
  FILE *file = fopen("/proc/self/statm", "r");
  long long total, resident;
  if (!file || fscanf(file, "%lld %lld", &total, &resident) != 2) fail("no resident size");
  fclose(file);
  return resident * sysconf(_SC_PAGESIZE) / 1024;
}

struct Kind {
  const char *name;
  const char *formatterClass;
  void (*log)(QlxObject *logger);
};

void logText(QlxObject *logger) {
  check(QlxLogUText(logger, kText));
}
void logSource(QlxObject *logger) {
  check(QlxLogDebugMin(logger, "transfer.c", "run", 42, kText));
}
void logPattern(QlxObject *logger) {
  check(QlxLogUText(logger, u"user {0} moved {1,number,integer} items at {2,number} a second",
                    u"alice", 12345, 2.75));
}
void logMessage(QlxObject *logger) {
  check(QlxLogInfo(logger, QLX_BENCH_BUNDLE, "transfer", u"alice", 12345, 2.75));
}
void logPlainMessage(QlxObject *logger) {
  check(QlxLogInfo(logger, QLX_BENCH_BUNDLE, "ready"));
}

constexpr Kind kKinds[] = {
    {"text", "qlx_basicformatter", logText},
    {"text with file, function, line", "qlx_basicformatter", logSource},
    {"text pattern with string, integer, double", "qlx_basicformatter", logPattern},
    {"message without parameters", "qlx_basicformatter", logPlainMessage},
    {"message with string, integer, double", "qlx_basicformatter", logMessage},
    {"XML: text with file, function, line", "qlx_xmlformatter", logSource},
    {"XML: message with string, integer, double", "qlx_xmlformatter", logMessage},
    {"trace line: text with file, function, line", "qlx_vextraceformatter", logSource},
};

double allocationsOf(const Kind &kind, QlxObject *logger, int records) {
  const int64_t before = gAllocations.load();
  for (int i = 0; i < records; i++) kind.log(logger);
  return static_cast<double>(gAllocations.load() - before) / records;
}

// In steps of a thousand, the least: the date's text is made anew at each second.
void reportAllocations(const std::string &folder) {
  puts("| record | allocations, least | on the average |\n|---|---|---|");
  for (const Kind &kind : kKinds) {
    QlxOpenToolkit(nullptr, nullptr);
    configureFile("memoryFile", folder + "/kind.log", kind.formatterClass);
    set("memory", "listenerNames", "memoryFile");
    QlxObject *logger = QlxGetObject("memory", "qlx_basiclogger");
    if (!logger) fail("no logger");
    allocationsOf(kind, logger, 1000);
    double least = 1e9, sum = 0;
    constexpr int kSteps = 10;
    for (int i = 0; i < kSteps; i++) {
      const double allocations = allocationsOf(kind, logger, 1000);
      if (allocations < least) least = allocations;
      sum += allocations;
    }
    printf("| %s | %.2f | %.2f |\n", kind.name, least, sum / kSteps);
    QlxReleaseObject(logger);
    QlxCloseToolkit();
  }
}

void logAll(QlxObject *logger, int records) {
  for (int i = 0; i < records; i += 4) {
    logText(logger);
    logSource(logger);
    logPattern(logger);
    logMessage(logger);
  }
}

// Text, text with source, text pattern and message in turn, each record to two files.
void reportResidentSize(const std::string &folder) {
  puts("| resident size of the host | KiB |\n|---|---|");
  printf("| before it opens the toolkit | %lld |\n", static_cast<long long>(residentKiB()));
  QlxOpenToolkit(nullptr, nullptr);
  configureFile("memoryOne", folder + "/one.log", "qlx_basicformatter");
  configureFile("memoryTwo", folder + "/two.log", "qlx_xmlformatter");
  set("memory", "listenerNames", "memoryOne memoryTwo");
  QlxObject *logger = QlxGetObject("memory", "qlx_basiclogger");
  if (!logger) fail("no logger");
  printf("| toolkit open, one logger, two files | %lld |\n", static_cast<long long>(residentKiB()));
  int logged = 0;
  for (const int records : {100, 10'000, 100'000, 1'000'000}) {
    logAll(logger, records - logged);
    logged = records;
    printf("| after %d records | %lld |\n", records, static_cast<long long>(residentKiB()));
    fflush(stdout);
  }
  QlxReleaseObject(logger);
  QlxCloseToolkit();
  printf("| toolkit closed | %lld |\n", static_cast<long long>(residentKiB()));
}

}  // namespace

int main(int argc, char **argv) {
  if (argc != 2) {
    fprintf(stderr, "usage: qlx_memory FOLDER\n");
    return 2;
  }
  const std::string folder = std::string(argv[1]) + "/memory";
  std::filesystem::create_directories(folder);
  reportResidentSize(folder);
  puts("");
  reportAllocations(folder);
  std::filesystem::remove_all(folder);
  return 0;
}
