// The generations that are there, found by trying or by the directory, and the moves of each.
#include "QlxRolling.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <functional>
#include <string_view>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <qlx/files.h>
#include <qlx/memory.h>

#include "QlxProblems.h"
#include "util/CxOwned.h"
#include "util/CxStatus.h"

// Up to so many generations each is tried; for more of them the directory says which are there.
static constexpr int32_t kMostTried = 100;

static bool succeedsUnlessMissing(const QlxLogNames *files, Event *event, CxStatus status) {
  if (!cxFailed(status) || status.code == ENOENT) return true;
  qlxKeepRollover(event, status, files->fullName);
  return false;
}

static bool removeGeneration(const QlxLogNames *files, int32_t generation, Event *event) {
  QlxFileName name;
  qlxFHWriteName(files, generation, name);
  const CxStatus status = cxUntilDone([&] { return CxFileNameRemove(name); });
  return succeedsUnlessMissing(files, event, status);
}

static CxStatus renameOver(const char *from, const char *to) {
  return cxUntilDone([&] { return CxFileNameRename(from, to); });
}

// Of a file system that does not know the call, and of filters that refuse it. What refuses the
// move itself with EPERM does so again.
static bool mayBeOfTheCall(int32_t error) {
  return error == EINVAL || error == ENOSYS || error == EPERM;
}

// Into a gap: whoever has filled it meanwhile stays.
static CxStatus renameIntoGap(const char *from, const char *to) {
  const auto call = [&] {
    return cxStatusOfCall(renameat2(AT_FDCWD, from, AT_FDCWD, to, RENAME_NOREPLACE) == 0);
  };
  const CxStatus status = cxUntilDone(call);
  return mayBeOfTheCall(status.code) ? renameOver(from, to) : status;
}

using Rename = CxStatus(const char *from, const char *to);

static bool moveUp(const QlxLogNames *files, int32_t generation, Rename *move, Event *event) {
  QlxFileName from, to;
  qlxFHWriteName(files, generation, from);
  qlxFHWriteName(files, generation + 1, to);
  return succeedsUnlessMissing(files, event, move(from, to));
}

static bool exists(const QlxLogNames *files, int32_t generation) {
  QlxFileName name;
  qlxFHWriteName(files, generation, name);
  struct stat info;
  return lstat(name, &info) == 0 || errno != ENOENT;
}

// ---- The generations that are there

namespace {

// Numbers from 1 to below maxFiles, of files that are there, in no order.
class Numbers {
 public:
  ~Numbers() { OslMemoryFree(numbers_); }
  bool add(int32_t number) {
    if (count_ == room_ && !grow()) return false;
    numbers_[count_++] = number;
    return true;
  }
  int32_t *begin() { return numbers_; }
  int32_t *end() { return numbers_ + count_; }

 private:
  bool grow() {
    const uint32_t room = room_ == 0 ? 64 : 2 * room_;
    const uint64_t bytes = uint64_t{room} * sizeof(int32_t);
    void *larger =
        bytes > UINT32_MAX ? nullptr : OslMemoryRealloc(numbers_, static_cast<uint32_t>(bytes));
    if (!larger) return false;
    numbers_ = static_cast<int32_t *>(larger);
    room_ = room;
    return true;
  }

  int32_t *numbers_ = nullptr;
  uint32_t count_ = 0, room_ = 0;
};

using Directory = Owned<DIR, closedir>;

}  // namespace

// The number of a generation by the name of its file; not above 0 for a file that is none. A name
// that writes a number otherwise, such as app01.log, does no harm: it is not the one that is moved.
static int32_t numberOf(std::string_view name, std::string_view base, const char *extension) {
  if (!name.starts_with(base)) return 0;
  name.remove_prefix(base.size());
  int32_t number = 0;
  const char *const end = name.data() + name.size();
  const auto [rest, error] = std::from_chars(name.data(), end, number);
  if (error != std::errc()) return 0;
  const std::string_view after{rest, static_cast<size_t>(end - rest)};
  const bool isOurs =
      extension ? after.starts_with('.') && after.substr(1) == extension : after.empty();
  return isOurs ? number : 0;
}

// False when the directory cannot be read, or memory ran out.
static bool listGenerations(const QlxLogNames *files, Numbers *numbers) {
  if (OslStringChr(files->extPart, '/')) return false;  // each is in a directory of its own
  const Directory directory{opendir(files->dirPart ? files->dirPart : ".")};
  if (!directory) return false;
  const std::string_view base{files->basePart + (files->basePart[0] == '/')};
  for (;;) {
    errno = 0;
    const dirent *entry = readdir(directory.get());
    if (!entry) return errno == 0;
    const int32_t number = numberOf(entry->d_name, base, files->extPart);
    if (number > 0 && number < files->maxFiles && !numbers->add(number)) return false;
  }
}

// ---- Moving

static bool shiftTried(const QlxLogNames *files, Event *event) {
  for (int32_t i = files->maxFiles - 2; i >= 1; --i) {
    if (!moveUp(files, i, renameOver, event)) return false;
  }
  return true;
}

static bool shiftListed(const QlxLogNames *files, Numbers &numbers, Event *event) {
  std::sort(numbers.begin(), numbers.end(), std::greater<>());
  for (const int32_t number : numbers) {
    if (number < files->maxFiles - 1 && !moveUp(files, number, renameOver, event)) return false;
  }
  return true;
}

bool qlxShiftGenerations(const QlxLogNames *files, Event *event) {
  if (files->maxFiles < 2) return false;
  Numbers numbers;
  const bool fewEnough = files->maxFiles <= kMostTried;
  if (!fewEnough && !listGenerations(files, &numbers)) return qlxFreeFirstGeneration(files, event);
  removeGeneration(files, files->maxFiles - 1, event);  // what stays is replaced
  return fewEnough ? shiftTried(files, event) : shiftListed(files, numbers, event);
}

bool qlxFreeFirstGeneration(const QlxLogNames *files, Event *event) {
  if (files->maxFiles < 2) return false;
  const int32_t last = files->maxFiles - 1;
  int32_t gap = 1;
  while (gap < last && exists(files, gap)) ++gap;
  if (gap == last && !removeGeneration(files, last, event)) return false;
  for (int32_t i = gap - 1; i >= 1; --i) {
    if (!moveUp(files, i, renameIntoGap, event)) return false;
  }
  return true;
}

// What the system will say, as far as that can be foretold: else each process of a service that is
// started again and again would find it out at the cost of a generation.
static bool mayMoveActiveFile(const QlxLogNames *files) {
  QlxFileName name;
  qlxFHWriteName(files, 0, name);
  struct statx file, directory;
  const char *const parent = files->dirPart ? files->dirPart : ".";
  if (statx(AT_FDCWD, name, AT_SYMLINK_NOFOLLOW, STATX_UID, &file) != 0) return true;
  if (file.stx_attributes & (STATX_ATTR_APPEND | STATX_ATTR_IMMUTABLE)) return false;
  if (statx(AT_FDCWD, parent, 0, STATX_MODE | STATX_UID, &directory) != 0) return true;
  const uid_t user = geteuid();
  const bool isOwner = user == 0 || user == file.stx_uid || user == directory.stx_uid;
  return isOwner || !(directory.stx_mode & S_ISVTX);
}

bool qlxMoveActiveFile(QlxGenerations *files) {
  if (files->maxFiles < 2) return false;
  files->rollFailed = files->rollFailed || !mayMoveActiveFile(files);
  const auto makeRoom = files->rollFailed ? qlxFreeFirstGeneration : qlxShiftGenerations;
  const auto move = files->rollFailed ? renameIntoGap : renameOver;
  files->rollFailed = !makeRoom(files, nullptr) || !moveUp(files, 0, move, nullptr);
  return !files->rollFailed;
}
