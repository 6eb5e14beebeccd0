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

// Where watching fails, or something always changes, looking costs less than starting anew.
constexpr uint8_t kMaxStartsASecond = 16;

// Numbers are not used again. Beyond this one all watches are given up, so that those of
// directories and moved files that nobody needs any more do not pile up.
constexpr int kMaxWatchNumber = 1024;

// Above the numbers that files usually get. When a host closes all descriptors, these are found
// closed, and they do not take the number that a handler still has for its file.
constexpr int kFirstDescriptor = 500;

// On these all changes are made by this system's own calls, which tell of them.
constexpr uint32_t kLocalFileSystems[] = {EXT4_SUPER_MAGIC,     XFS_SUPER_MAGIC, BTRFS_SUPER_MAGIC,
                                          TMPFS_MAGIC,          RAMFS_MAGIC,     F2FS_SUPER_MAGIC,
                                          OVERLAYFS_SUPER_MAGIC};

constexpr size_t kMaxPathBytes = 1024;

// Shared by all watched paths: any change makes each of them look again. The readiness of the
// notices is asked of an epoll descriptor, which is the cheapest question, and answers with an
// error when a host closed it.
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

epoll_event interest() {
  return {.events = EPOLLIN, .data = {.ptr = &gNotices}};
}

// A host may have closed the descriptors and have others with their numbers, which are left alone.
bool areOurs() {
  epoll_event same = interest();
  return gNotices.epoll != -1 &&
         epoll_ctl(gNotices.epoll, EPOLL_CTL_MOD, gNotices.inotify, &same) == 0;
}

void forgetNotices() {
  gNotices.inotify = gNotices.epoll = -1;
  ++gNotices.changes;
}

void closeNotices() {
  if (areOurs()) {
    close(gNotices.epoll);
    close(gNotices.inotify);
  }
  forgetNotices();
}

// The same file under a higher number; -1 when there is none, or no file.
int moveUp(int descriptor) {
  if (descriptor == -1) return -1;
  const int moved = fcntl(descriptor, F_DUPFD_CLOEXEC, kFirstDescriptor);
  close(descriptor);
  return moved;
}

bool openNotices() {
  if (areOurs()) return true;
  forgetNotices();
  const int inotify = moveUp(inotify_init1(IN_NONBLOCK | IN_CLOEXEC));
  const int epoll = inotify == -1 ? -1 : moveUp(epoll_create1(EPOLL_CLOEXEC));
  epoll_event wanted = interest();
  if (epoll != -1 && epoll_ctl(epoll, EPOLL_CTL_ADD, inotify, &wanted) == 0) {
    gNotices.inotify = inotify;
    gNotices.epoll = epoll;
    return true;
  }
  for (const int descriptor : {inotify, epoll}) {
    if (descriptor != -1) close(descriptor);
  }
  return false;
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
  if (count > 0 && ready.data.ptr == &gNotices && areOurs()) return readNotices();
  forgetNotices();
}

bool isLocal(const char *path) {
  struct statfs system;
  if (statfs(path, &system) != 0) return false;
  for (const uint32_t local : kLocalFileSystems) {
    if (static_cast<uint32_t>(system.f_type) == local) return true;
  }
  return false;
}

// Adds to what is watched of the same thing already.
int addWatch(const char *path, uint32_t changes) {
  return inotify_add_watch(gNotices.inotify, path, changes | IN_DONT_FOLLOW | IN_MASK_ADD);
}

// Of a file's own directory the one above it tells, and a watched directory makes each write to its
// files slower. Nothing is above the root, and nothing above a mounted one tells of it.
bool watchDirectory(const char *path, bool isOwn) {
  struct statx info;
  if (statx(AT_FDCWD, path, AT_SYMLINK_NOFOLLOW, STATX_TYPE, &info) != 0) return false;
  if (!S_ISDIR(info.stx_mode) || !isLocal(path)) return false;
  const bool isToldOf = isOwn && !(info.stx_attributes & STATX_ATTR_MOUNT_ROOT);
  return isToldOf || addWatch(path, kDirectoryChanges) != -1;
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

void removeWatch(int number) {
  if (number > 0) inotify_rm_watch(gNotices.inotify, number);
}

bool watchPath(QlxFileWatch *watch, const char *path) {
  std::array<char, kMaxPathBytes> copy;
  const size_t bytes = std::strlen(path) + 1;
  if (bytes > copy.size()) return false;
  std::memcpy(copy.data(), path, bytes);
  if (!watchDirectories(copy.data())) return false;
  const int number = addWatch(path, kChanges);
  if (number != watch->watchNumber) removeWatch(watch->watchNumber);
  watch->watchNumber = number;
  if (number > kMaxWatchNumber) closeNotices();
  return number != -1 && gNotices.epoll != -1;
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

bool mayStart(QlxFileWatch *watch) {
  if (watch->looks < kLooksBeforeWatch) {
    ++watch->looks;
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
  if (path[0] != '/' || !isLocal(path) || !openNotices()) return false;
  askForNotices();
  watch->changesSeen = gNotices.changes;
  return watchPath(watch, path) && isRegularFile(path, AT_SYMLINK_NOFOLLOW);
}

}  // namespace

bool qlxFileWatchFindsFile(QlxFileWatch *watch, const char *path) {
  if (stillHolds(watch)) [[likely]]
    return true;
  watch->watching = mayStart(watch) && startWatch(watch, path);
  return watch->watching || isRegularFile(path, 0);
}

void qlxFileWatchEnd(QlxFileWatch *watch) {
  if (areOurs()) removeWatch(watch->watchNumber);
  *watch = {};
}

void qlxFileWatchStop(void) {
  closeNotices();
}
