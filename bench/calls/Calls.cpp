// The calls inside the library that one debug record to a rolling file takes: a host of a library
// that is compiled with -finstrument-functions, so that each of its functions tells when it begins
// and ends. Prints a line for each call, its depth and its function's offset in the library, and at
// the end where the library is.
//
//   qlx_calls FOLDER RECORDS   the record after so many
//
// A record now and then does what the others need not do, a new second's date for example: some are
// recorded, and what most of them did is printed.
#include <qlx/qlx.h>

#include <dlfcn.h>
#include <stdio.h>
#include <stdlib.h>

#include <algorithm>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

namespace {

struct Call {
  int depth;
  void *function;
  auto operator<=>(const Call &) const = default;
};
using Calls = std::vector<Call>;

// One thread only: a host of one thread. Room that is there before a record starts, so that the
// recorder asks for no memory within it.
Calls gCalls;
int gDepth;
bool gRecording;

constexpr size_t kMaxCalls = 100'000;
constexpr int kRecorded = 101;
constexpr UChar kText[] = u"a text as long as the lines of a log";

[[noreturn]] void fail(const char *what) {
  fprintf(stderr, "qlx_calls: %s\n", what);
  exit(1);
}

void set(const char *name, const char *key, const std::string &value) {
  ObjCfg *cfg = QlxLogMgrGetCfg(name);
  if (!QlxSetObjCfgProp(cfg, key, value.c_str())) fail("a property was not set");
  QlxReleaseObjCfg(cfg);
}

QlxObject *openLogger(const std::string &folder) {
  QlxOpenToolkit(nullptr, nullptr);
  set("callsFormatter", "className", "qlx_basicformatter");
  set("callsFile", "className", "qlx_filehandler");
  set("callsFile", "fileName", folder + "/calls.log");
  set("callsFile", "maxFileBytes", "1000000000");
  set("callsFile", "maxFiles", "3");
  set("callsFile", "formatterName", "callsFormatter");
  set("calls", "listenerNames", "callsFile");
  QlxObject *logger = QlxGetObject("calls", "qlx_basiclogger");
  if (!logger) fail("no logger");
  return logger;
}

void log(QlxObject *logger) {
  const QlxLogResult result = QlxLogDebugMin(logger, "Calls.cpp", "log", 42, kText);
  if (result.statusKind != '-') fail("a record was not written");
}

Calls record(QlxObject *logger) {
  gCalls.clear();
  gRecording = true;
  log(logger);
  gRecording = false;
  if (gCalls.empty()) fail("the library tells nothing of its calls");
  if (gCalls.size() == kMaxCalls) fail("too many calls");
  return gCalls;
}

Calls recordUsual(QlxObject *logger) {
  std::map<Calls, int> seen;
  for (int i = 0; i < kRecorded; ++i) ++seen[record(logger)];
  const auto usual = std::max_element(
      seen.begin(), seen.end(), [](const auto &a, const auto &b) { return a.second < b.second; });
  if (usual->second <= kRecorded / 2) fail("no two records do the same");
  return usual->first;
}

void print(const Calls &calls) {
  Dl_info library = {};
  for (const Call &call : calls) {
    if (!dladdr(call.function, &library)) fail("a function of no library");
    printf("%d %#tx\n", call.depth,
           static_cast<char *>(call.function) - static_cast<char *>(library.dli_fbase));
  }
  printf("library %s\n", library.dli_fname);
}

}  // namespace

// What the library's functions call: at their begin and at their end.
extern "C" void __cyg_profile_func_enter(void *function, void *) {
  if (!gRecording) return;
  if (gCalls.size() < kMaxCalls) gCalls.push_back({gDepth, function});
  ++gDepth;
}
extern "C" void __cyg_profile_func_exit(void *, void *) {
  if (gRecording) --gDepth;
}

int main(int argc, char **argv) {
  if (argc != 3) {
    fprintf(stderr, "usage: qlx_calls FOLDER RECORDS\n");
    return 2;
  }
  std::filesystem::create_directories(argv[1]);
  gCalls.reserve(kMaxCalls);
  QlxObject *logger = openLogger(argv[1]);
  for (long left = strtol(argv[2], nullptr, 10); left > 0; --left) log(logger);
  print(recordUsual(logger));
  QlxReleaseObject(logger);
  QlxCloseToolkit();
  std::filesystem::remove_all(argv[1]);
  return 0;
}
