// The system calls of docs/hosts.md: its table names those that the kernel tells of, and no others.
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <regex>

#include "support/CaptureStdout.h"
#include "support/FileHandlerFixture.h"
#include "support/FileSizeLimit.h"
#include "support/SeenCalls.h"
#include "support/SemaphoreKey.h"

namespace {

using Names = std::set<std::string>;

// Which of several calls that do the same is made is a matter of the machine and its C library:
// they have one name.
const std::map<long, std::string> kNames{
    {SYS_openat, "open"},         {SYS_fstat, "stat"},
    {SYS_semtimedop, "semop"},    {SYS_fchmodat, "chmod"},
    {SYS_mkdirat, "mkdir"},       {SYS_unlinkat, "unlink"},
    {SYS_readlinkat, "readlink"}, {SYS_renameat, "rename"},
#ifdef SYS_newfstatat
    {SYS_newfstatat, "stat"},
#endif
#ifdef SYS_open  // older calls, which newer machines do not have
    {SYS_open, "open"},           {SYS_stat, "stat"},
    {SYS_lstat, "stat"},          {SYS_chmod, "chmod"},
    {SYS_mkdir, "mkdir"},         {SYS_unlink, "unlink"},
    {SYS_readlink, "readlink"},   {SYS_rename, "rename"},
#endif
    {SYS_close, "close"},         {SYS_fcntl, "fcntl"},
    {SYS_fstatfs, "fstatfs"},     {SYS_fsync, "fsync"},
    {SYS_ftruncate, "ftruncate"}, {SYS_getcwd, "getcwd"},
    {SYS_geteuid, "geteuid"},     {SYS_getdents64, "getdents64"},
    {SYS_lseek, "lseek"},         {SYS_read, "read"},
    {SYS_renameat2, "renameat2"}, {SYS_sched_yield, "sched_yield"},
    {SYS_semctl, "semctl"},       {SYS_semget, "semget"},
    {SYS_semop, "semop"},         {SYS_statx, "statx"},
    {SYS_write, "write"},
};

// What any call may need, for memory, the lock and the time.
const std::set<long> kAnyCalls{SYS_brk,    SYS_mmap,      SYS_munmap,
                               SYS_mremap, SYS_mprotect,  SYS_madvise,
                               SYS_futex,  SYS_getrandom, SYS_clock_gettime};

std::string read(const std::filesystem::path &path) {
  std::ifstream in(path);
  return {std::istreambuf_iterator<char>(in), {}};
}

// The rows of the page's table, by their first cell.
std::map<std::string, Names> rowsOfThePage() {
  const auto root = std::filesystem::path(QLX_HEADERS).parent_path().parent_path();
  const std::string page = read(root / "docs/hosts.md");
  const size_t start = page.find("\n| What is done | System calls |\n");
  EXPECT_NE(start, std::string::npos);
  const std::string table = page.substr(start, page.find("\n\n", start) - start);
  static const std::regex row(R"(\n\| ([^|]+) \| ([^|]+) \|)");
  static const std::regex name("`([a-z0-9_]+)`");
  std::map<std::string, Names> rows;
  for (std::sregex_iterator it(table.begin(), table.end(), row), end; it != end; ++it) {
    const std::string cell = (*it)[2];
    for (std::sregex_iterator in(cell.begin(), cell.end(), name); in != end; ++in)
      rows[(*it)[1]].insert((*in)[1]);
  }
  return rows;
}

class HostsPageCallsTest : public FileHandlerFixture {
 protected:
  HostsPageCallsTest() : FileHandlerFixture("qlx_filehandler") {}

  void SetUp() override {
    FileHandlerFixture::SetUp();
    shared = get("shared", "qlx_multiproc_filehandler");
    format(shared);
    QlxSetObjProp(shared.get(), "MPFileSemKey", key.text().c_str());
  }
  void TearDown() override {
    shared.reset();
    FileHandlerFixture::TearDown();
  }

  // Makes another handler the logger's only one.
  void listen(const Handle &only) {
    QlxRemListener(logger.get(), handler.get());
    QlxAddListener(logger.get(), only.get());
  }

  // Opens a file in a new directory, writes, rolls over, and opens it again.
  void useAll(const Handle &file) const {
    const auto change = [&](const char *name, const std::string &value) {
      QlxSetObjProp(file.get(), name, value.c_str());
    };
    change("fileName", dir.path("new/app.log"));
    for (const char *limit : {"100", "1", "100"}) {
      change("maxFileBytes", limit);
      for (int i = 0; i < 2; ++i) QlxLogUText(logger.get(), u"text");
    }
    change("maxFileBytes", "1");
  }

  // Something that can neither be removed, nor moved onto.
  void obstruct(const std::string &name) const {
    std::filesystem::create_directories(dir.path(name + "/inside"));
  }

  Handle shared;
  SemaphoreKey key;
};

Names namesOf(const std::set<long> &calls) {
  Names names;
  for (const long call : calls) {
    if (kAnyCalls.contains(call)) continue;
    const auto known = kNames.find(call);
    names.insert(known != kNames.end() ? known->second : std::to_string(call));
  }
  return names;
}

Names without(const Names &all, const Names &some) {
  Names rest;
  std::ranges::set_difference(all, some, std::inserter(rest, rest.end()));
  return rest;
}

// A row of the table, the rows whose calls it does not tell again, and what is done for it.
struct Step {
  const char *row;
  std::vector<const char *> besides;
  std::function<void()> prepare, work;
  std::function<void(long)> onCall = [](long) {};
};

TEST_F(HostsPageCallsTest, TheTableHasThemAll) {
  constexpr const char *kFile = "`qlx_filehandler`";
  constexpr const char *kShared = "`qlx_multiproc_filehandler`";
  std::optional<FileSizeLimit> full;
  std::optional<CaptureStdout> out;
  const auto once = [this] { log(u"once"); };
  const auto fill = [this](const char *name, const char *maxFiles) {
    set("fileName", dir.path(name));
    set("maxFiles", maxFiles);
    log(u"full");
    set("maxFileBytes", "1");
  };
  const auto stick = [&] {
    obstruct("stuck1.log");
    fill("stuck.log", "2");
    log(u"once");
    std::filesystem::remove_all(dir.path("stuck1.log"));
  };
  const auto meetAFullDisk = [&] {
    fill("part.log", "1");
    log(u"once");
    full.emplace(12);
  };
  const auto hold = [this](int value) { semctl(key.set(), 0, SETVAL, value); };
  const Step steps[] = {
      {kFile, {}, [] {}, [this] { useAll(handler); }},
      {"it, for a name without a directory", {kFile}, [] {}, [this] { set("fileName", "x.log"); }},
      {"it, after a move that failed", {kFile}, stick, once},
      {"it, with `maxFiles` above 100", {kFile}, [&] { fill("many.log", "101"); }, once},
      {"it, for a record of which it could write a part", {kFile}, meetAFullDisk, once},
      {kShared,
       {kFile},
       [&] {
         full.reset();
         listen(shared);
       },
       [this] { useAll(shared); }},
      {"it, while others hold the semaphore",
       {kFile, kShared},
       [&] { hold(0); },
       once,
       [&](long call) { call == SYS_sched_yield ? hold(1) : void(); }},
      {"`qlx_consolehandler`",
       {},
       [&] {
         QlxRemListener(logger.get(), shared.get());
         attach("console", "qlx_consolehandler");
         format(get("console"));
         out.emplace();
       },
       once},
      {"`QlxOpenToolkit`",
       {},
       [this] {
         dir.write("app.properties", "a.b=c\n");
         QlxCloseToolkit();
       },
       [this] { EXPECT_EQ(QlxOpenToolkit(dir.path("app.properties").c_str(), nullptr), 1); }},
  };
  std::map<std::string, Names> rows = rowsOfThePage();
  const std::map<std::string, Names> all = rows;
  for (const Step &step : steps) {
    step.prepare();
    const auto seen = seenCalls(step.work, step.onCall);
    out.reset();
    if (!seen) GTEST_SKIP() << "no filter here that tells of system calls";
    Names told = namesOf(*seen);
    for (const char *row : step.besides) told = without(told, all.at(row));
    EXPECT_EQ(told, rows[step.row]) << step.row;
    rows.erase(step.row);
  }
  EXPECT_EQ(rows, (std::map<std::string, Names>{}));
}

}  // namespace
