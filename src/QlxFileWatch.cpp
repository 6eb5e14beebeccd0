#include "QlxFileWatch.h"

#include <array>
#include <cstring>
#include <ctime>

#include <fcntl.h>
#include <linux/magic.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/statfs.h>
#include <unistd.h>

#include "QlxNotices.h"

namespace {

// What may change where a name leads: renaming, removing (which changes the count of links),
// rights.
constexpr uint32_t kChanges = IN_ATTRIB | IN_MOVE_SELF | IN_DELETE_SELF;
constexpr uint32_t kDirectoryChanges = kChanges | IN_MOVED_FROM | IN_DELETE;  // and of what it has

// A file that is closed after a few records is not worth the set-up of a watch.
constexpr uint8_t kLooksBeforeWatch = 8;

uint32_t gLooksBefore;  // the first watch of the process

// Where watching fails, or something always changes, looking costs less than starting anew.
constexpr uint8_t kMaxStartsASecond = 16;

// Numbers are not used again. Beyond this one all watches are given up, so that those of
// directories and moved files that nobody needs any more do not pile up. Not often, since the
// system takes some 10 ms to end them, and a process may need more than these.
constexpr int32_t kMaxWatchNumber = 1024;
constexpr int64_t kSecondsBetweenGivingUp = 10;
int64_t gMayGiveUp;  // from this second on

// On these all changes are made by this system's own calls, which tell of them.
constexpr uint32_t kLocalFileSystems[] = {EXT4_SUPER_MAGIC,     XFS_SUPER_MAGIC, BTRFS_SUPER_MAGIC,
                                          TMPFS_MAGIC,          RAMFS_MAGIC,     F2FS_SUPER_MAGIC,
                                          OVERLAYFS_SUPER_MAGIC};

constexpr size_t kMaxPathBytes = 1024;

int64_t nowInSeconds() {
  timespec now;
  clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
  return now.tv_sec;
}

bool isLocal(const char *path) {
  struct statfs system;
  if (statfs(path, &system) != 0) return false;
  for (const uint32_t local : kLocalFileSystems) {
    if (static_cast<uint32_t>(system.f_type) == local) return true;
  }
  return false;
}

// Systems before 5.8 do not say.
bool mayBeMounted(const struct statx &info) {
  return !(info.stx_attributes_mask & STATX_ATTR_MOUNT_ROOT) ||
         (info.stx_attributes & STATX_ATTR_MOUNT_ROOT);
}

// Of a file's own directory the one above it tells, and a watched directory makes each write to its
// files slower. Nothing is above the root, and nothing above a mounted one tells of it.
bool watchDirectory(const char *path, bool isOwn) {
  struct statx info;
  if (statx(AT_FDCWD, path, AT_SYMLINK_NOFOLLOW, STATX_TYPE, &info) != 0) return false;
  if (!S_ISDIR(info.stx_mode) || !isLocal(path)) return false;
  const bool isToldOf = isOwn && !mayBeMounted(info);
  return isToldOf || qlxNoticesWatch(path, kDirectoryChanges) != -1;
}

// Every directory of an absolute path. A symbolic link may be changed without a notice.
bool watchDirectories(char *path) {
  char *const name = std::strrchr(path, '/');
  for (char *separator = path; separator; separator = std::strchr(separator + 1, '/')) {
    if (separator != path && separator[-1] == '/') continue;
    char *const end = separator == path ? separator + 1 : separator;
    const bool isOwn = separator + std::strspn(separator, "/") > name;
    const char next = *end;
    *end = '\0';
    const bool watched = watchDirectory(path, isOwn && separator != path);
    *end = next;
    if (!watched) return false;
  }
  return true;
}

bool giveUp(int64_t now) {
  if (now < gMayGiveUp) return false;
  gMayGiveUp = now + kSecondsBetweenGivingUp;
  qlxNoticesClose();
  return true;
}

bool watchPath(QlxFileWatch *watch, const char *path) {
  std::array<char, kMaxPathBytes> copy;
  const size_t bytes = std::strlen(path) + 1;
  if (bytes > copy.size()) return false;
  std::memcpy(copy.data(), path, bytes);
  if (!watchDirectories(copy.data())) return false;
  const int32_t number = qlxNoticesWatch(path, kChanges);
  if (number != watch->watchNumber) qlxNoticesUnwatch(watch->watchNumber);
  watch->watchNumber = number;
  return number != -1 && !(number > kMaxWatchNumber && giveUp(watch->lastLook));
}

// Does not ask for the times: after a look at them the next write has to store them anew, which
// costs as much again as the write.
bool isRegularFile(const char *path, int flags) {
  struct statx type;
  if (statx(AT_FDCWD, path, flags, STATX_TYPE, &type) == 0) return S_ISREG(type.stx_mode);
  struct stat info;  // missing, or a system that refuses statx
  return fstatat(AT_FDCWD, path, &info, flags) == 0 && S_ISREG(info.st_mode);
}

bool stillHolds(const QlxFileWatch *watch) {
  return watch->watching && watch->changesSeen == qlxNoticesChanges() &&
         watch->lastLook == nowInSeconds();
}

bool mayStart(QlxFileWatch *watch) {
  if (watch->looks < kLooksBeforeWatch) {
    ++watch->looks;
    return false;
  }
  if (gLooksBefore < qlxFileWatchFirstLooks) {
    ++gLooksBefore;
    return false;
  }
  const int64_t now = nowInSeconds();
  if (watch->lastLook != now) watch->starts = 0;
  watch->lastLook = now;
  if (watch->starts == kMaxStartsASecond) return false;
  ++watch->starts;
  return true;
}

// The watch comes first and the look after it, so that no change falls between them.
bool startWatch(QlxFileWatch *watch, const char *path) {
  if (path[0] != '/' || !isLocal(path) || !qlxNoticesOpen()) return false;
  watch->changesSeen = qlxNoticesChanges();
  return watchPath(watch, path) && isRegularFile(path, AT_SYMLINK_NOFOLLOW);
}

}  // namespace

// When a process that has watches ends, the system takes some 10 ms to end these (it waits for all
// of its processors), where a look costs about a microsecond more than a watch.
uint32_t qlxFileWatchFirstLooks = 4096;

bool qlxFileWatchFindsFile(QlxFileWatch *watch, const char *path) {
  if (stillHolds(watch)) [[likely]]
    return true;
  watch->watching = mayStart(watch) && startWatch(watch, path);
  return watch->watching || isRegularFile(path, 0);
}

void qlxFileWatchEnd(QlxFileWatch *watch) {
  qlxNoticesUnwatch(watch->watchNumber);
  *watch = {};
}

void qlxFileWatchStop(void) {
  gMayGiveUp = 0;
  gLooksBefore = 0;
  qlxNoticesClose();
}
