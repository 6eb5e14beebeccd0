#include "QlxFileWatch.h"

#include <array>
#include <cstring>
#include <ctime>

#include <fcntl.h>
#include <linux/magic.h>
#include <sys/epoll.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/statfs.h>
#include <unistd.h>

namespace {

// What may change where a name leads: renaming, removing (which changes the count of links),
// rights.
constexpr uint32_t kChanges = IN_ATTRIB | IN_MOVE_SELF | IN_DELETE_SELF;
constexpr uint32_t kDirectoryChanges = kChanges | IN_MOVED_FROM | IN_DELETE;  // and of what it has

// A file that is closed after a few records is not worth the set-up of a watch.
constexpr uint8_t kLooksBeforeWatch = 8;

// On these all changes are made by this system's own calls, which tell of them.
constexpr uint32_t kLocalFileSystems[] = {EXT4_SUPER_MAGIC,     XFS_SUPER_MAGIC, BTRFS_SUPER_MAGIC,
                                          TMPFS_MAGIC,          RAMFS_MAGIC,     F2FS_SUPER_MAGIC,
                                          OVERLAYFS_SUPER_MAGIC};

constexpr size_t kMaxPathBytes = 1024;

// Shared by all watched paths: any change makes each of them look again. The readiness of the
// notices is asked of an epoll descriptor, which is the cheapest question, and answers with an
// error when a host closed it or put something else in its place.
struct Notices {
  int inotify = -1;
  int epoll = -1;
  uint32_t changes = 0;
};
Notices gNotices;

int64_t nowInSeconds() {
  timespec now;
  clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
  return now.tv_sec;
}

void closeNotices() {
  for (int *descriptor : {&gNotices.epoll, &gNotices.inotify}) {
    if (*descriptor != -1) close(*descriptor);
    *descriptor = -1;
  }
  ++gNotices.changes;
}

bool openNotices() {
  if (gNotices.epoll != -1) return true;
  gNotices.inotify = inotify_init1(IN_NONBLOCK | IN_CLOEXEC);
  gNotices.epoll = epoll_create1(EPOLL_CLOEXEC);
  epoll_event interest{.events = EPOLLIN, .data = {}};
  const bool opened = gNotices.inotify != -1 && gNotices.epoll != -1 &&
                      epoll_ctl(gNotices.epoll, EPOLL_CTL_ADD, gNotices.inotify, &interest) == 0;
  if (!opened) closeNotices();
  return opened;
}

// Takes the notices that wait; what they say does not matter.
void readNotices() {
  alignas(inotify_event) std::array<char, 4096> notices;
  while (read(gNotices.inotify, notices.data(), notices.size()) > 0) continue;
  ++gNotices.changes;
}

// Counts a change when there are notices, and when there is nobody left to give them.
void askForNotices() {
  epoll_event ready;
  const int count = epoll_wait(gNotices.epoll, &ready, 1, 0);
  if (count == 0) [[likely]]
    return;
  if (count > 0) return readNotices();
  // Not ours any more: a host closed it. Whatever has these numbers now is not closed.
  gNotices.inotify = gNotices.epoll = -1;
  ++gNotices.changes;
}

bool isLocal(const char *path) {
  struct statfs system;
  if (statfs(path, &system) != 0) return false;
  for (const uint32_t local : kLocalFileSystems) {
    if (static_cast<uint32_t>(system.f_type) == local) return true;
  }
  return false;
}

int addWatch(const char *path, uint32_t changes) {
  return inotify_add_watch(gNotices.inotify, path, changes | IN_DONT_FOLLOW);
}

// Watches every directory of an absolute path but the file's own: a watched directory makes each
// write to its files slower, and the one above it tells of its changes. A symbolic link may be
// changed without a notice.
bool watchDirectories(char *path) {
  char *const name = std::strrchr(path, '/');
  for (char *separator = path; separator; separator = std::strchr(separator + 1, '/')) {
    if (separator != path && separator[-1] == '/') continue;
    char *const end = separator == path ? separator + 1 : separator;
    const bool isOwn = separator + std::strspn(separator, "/") > name;
    const char next = *end;
    *end = '\0';
    struct stat info;
    const bool watched = lstat(path, &info) == 0 && S_ISDIR(info.st_mode) &&
                         ((isOwn && separator != path) || addWatch(path, kDirectoryChanges) != -1);
    *end = next;
    if (!watched) return false;
  }
  return true;
}

bool watchPath(QlxFileWatch *watch, const char *path) {
  std::array<char, kMaxPathBytes> copy;
  const size_t bytes = std::strlen(path) + 1;
  if (path[0] != '/' || bytes > copy.size() || !isLocal(path) || !openNotices()) return false;
  std::memcpy(copy.data(), path, bytes);
  if (!watchDirectories(copy.data())) return false;
  watch->watchNumber = addWatch(path, kChanges);
  return watch->watchNumber != -1;
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
  if (!watch->watching) return false;
  askForNotices();
  return watch->changesSeen == gNotices.changes && watch->lastLook == nowInSeconds();
}

// The watch comes first and the look after it, so that no change falls between them.
bool startWatch(QlxFileWatch *watch, const char *path) {
  if (gNotices.epoll != -1) askForNotices();
  watch->changesSeen = gNotices.changes;
  watch->lastLook = nowInSeconds();
  return watchPath(watch, path) && isRegularFile(path, AT_SYMLINK_NOFOLLOW);
}

}  // namespace

bool qlxFileWatchFindsFile(QlxFileWatch *watch, const char *path) {
  if (stillHolds(watch)) [[likely]]
    return true;
  watch->watching = 0;
  if (watch->looks < kLooksBeforeWatch) {
    ++watch->looks;
  } else if (startWatch(watch, path)) {
    watch->watching = 1;
    return true;
  }
  return isRegularFile(path, 0);
}

void qlxFileWatchEnd(QlxFileWatch *watch) {
  if (watch->watching && gNotices.inotify != -1) {
    inotify_rm_watch(gNotices.inotify, watch->watchNumber);
  }
  *watch = {};
}

void qlxFileWatchStop(void) {
  closeNotices();
}

void qlxFileWatchForget(void) {
  closeNotices();
}
