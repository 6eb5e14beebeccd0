// What a path and a descriptor lead to, the numbers of descriptors, and the steps on the open file.
#include "QlxLogFile.h"

#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <qlx/files.h>

#include "QlxProblems.h"
#include "util/CxFile.h"
#include "util/CxStatus.h"

static constexpr int kHighNumber = 500;
static constexpr int kFirstFreeNumber = STDERR_FILENO + 1;

static QlxLogFile *gOpen;  // linked by next

// ---- What a path or a descriptor leads to

namespace {
struct Found {
  bool isRegular;
  uint64_t device, inode;
  int64_t size;
};
}  // namespace

// Does not ask for the times: after a look at them the next write has to store them anew, which
// costs as much again as the write.
static CxStatus find(int directory, const char *path, int flags, Found *found) {
  struct statx info;
  if (statx(directory, path, flags, STATX_TYPE | STATX_INO | STATX_SIZE, &info) == 0) {
    const uint64_t device = uint64_t{info.stx_dev_major} << 32 | info.stx_dev_minor;
    *found = {S_ISREG(info.stx_mode), device, info.stx_ino, static_cast<int64_t>(info.stx_size)};
    return kCxSuccess;
  }
  struct stat old;  // missing, or a system that refuses statx
  if (fstatat(directory, path, &old, flags) != 0) return cxFailure(errno);
  const uint64_t device = uint64_t{major(old.st_dev)} << 32 | minor(old.st_dev);
  *found = {S_ISREG(old.st_mode), device, old.st_ino, old.st_size};
  return kCxSuccess;
}

static CxStatus findOpen(CxFile file, Found *found) {
  return file < 0 ? cxFailure(EBADF) : find(file, "", AT_EMPTY_PATH, found);
}

static bool isOpenFile(const QlxLogFile *log, const Found &found) {
  return found.device == log->device && found.inode == log->inode;
}

CxStatus qlxLogFileFindName(const QlxLogFile *log, const char *name, bool *isOther) {
  Found found = {};
  const CxStatus status = find(AT_FDCWD, name, 0, &found);
  *isOther = !cxFailed(status) && !isOpenFile(log, found);
  return cxFailed(status) || found.isRegular ? status : cxFailure(ENOENT);
}

// Links to descriptors, such as /dev/stdout: what they lead to is not this name's, so it must
// neither be renamed nor truncated.
static bool isDescriptorsName(const char *name) {
  static constexpr const char *kPlaces[] = {"/proc/", "/dev/fd/", "/dev/std"};
  char target[sizeof "/dev/fd/"] = "";
  const ssize_t length = readlink(name, target, sizeof target - 1);
  for (const char *place : kPlaces) {
    const size_t bytes = strlen(place);
    if (strncmp(name, place, bytes) == 0) return true;
    if (length > 0 && strncmp(target, place, bytes) == 0) return true;
  }
  return false;
}

// ---- Numbers

// A number that another handler, or this one, had before its host closed it, is its no more.
static void claim(QlxLogFile *log, CxFile number, CxFile *place) {
  for (QlxLogFile *each = gOpen; each; each = each->next) {
    if (each->file == number) each->file = -1;
    if (each->reserve == number) each->reserve = -1;
  }
  if (log->file == number) log->file = -1;
  if (log->reserve == number) log->reserve = -1;
  *place = number;
}

// False when it is not among them.
static bool unlinkFromOpen(const QlxLogFile *log) {
  QlxLogFile **link = &gOpen;
  while (*link && *link != log) link = &(*link)->next;
  if (!*link) return false;
  *link = log->next;
  return true;
}

static int duplicateFrom(int lowest, CxFile file) {
  return fcntl(file, F_DUPFD_CLOEXEC, lowest);
}

CxStatus qlxOpenHigh(CxFile *file, const char *name, int32_t flags, uint32_t mode) {
  CxFile low = -1;
  *file = -1;
  const CxStatus status =
      cxUntilDone([&] { return CxFileOpenMode(&low, name, flags | O_NOCTTY, mode & 0777); });
  if (cxFailed(status)) return status;
  *file = low >= kHighNumber ? low : duplicateFrom(kHighNumber, low);
  if (*file == -1) *file = low >= kFirstFreeNumber ? low : duplicateFrom(kFirstFreeNumber, low);
  const CxStatus moved = cxStatusOfCall(*file != -1);
  if (*file != low) CxFileClose(&low);
  return moved;
}

// ---- Opening, measuring, closing

// A FIFO without a reader, or a terminal without a line, would keep the caller waiting.
static CxStatus openName(QlxLogFile *log, const char *name, int32_t existing, CxFile *file) {
  Found found = {};
  const bool exists = !cxFailed(find(AT_FDCWD, name, 0, &found));
  const bool isFile = !exists || (found.isRegular && !isDescriptorsName(name));
  if (log->keepWritten) existing = O_APPEND;
  const int32_t flags = isFile ? O_CREAT | O_RDWR | existing : O_WRONLY | O_APPEND | O_NONBLOCK;
  const CxStatus status = qlxOpenHigh(file, name, flags, log->filePermission);
  log->rolls = isFile;
  return status;
}

static void takeSize(QlxLogFile *log, const Found &found) {
  log->size = static_cast<uint64_t>(found.size);
  if (found.size == 0) log->torn = 0;
}

static CxStatus note(QlxLogFile *log) {
  Found found;
  const CxStatus status = findOpen(log->file, &found);
  if (cxFailed(status)) return status;
  if (!isOpenFile(log, found)) log->torn = 0;  // that was another file
  log->device = found.device;
  log->inode = found.inode;
  takeSize(log, found);
  if (found.isRegular) return kCxSuccess;
  log->rolls = 0;
  return cxStatusOfCall(fcntl(log->file, F_SETFL, O_APPEND | O_NONBLOCK) == 0);
}

CxStatus qlxLogFileOpen(QlxLogFile *log, const char *name, int32_t existing) {
  qlxLogFileClose(log);  // a formatter that logs while it makes the header has opened it, too
  CxFile file = -1;
  CxStatus status = openName(log, name, existing, &file);
  if (cxFailed(status)) return status;
  claim(log, file, &log->file);
  status = note(log);
  if (cxFailed(status)) {
    CxFileClose(&log->file);
    return status;
  }
  log->next = gOpen;
  gOpen = log;
  log->look = {};
  log->keepWritten = 0;
  return kCxSuccess;
}

// EBADF also for a number that leads to another file now.
static CxStatus findOurs(const QlxLogFile *log, CxFile file, Found *found) {
  const CxStatus status = findOpen(file, found);
  if (cxFailed(status)) return status;
  return isOpenFile(log, *found) ? status : cxFailure(EBADF);
}

CxStatus qlxLogFileMeasure(QlxLogFile *log) {
  Found found;
  const CxStatus status = findOurs(log, log->file, &found);
  if (cxFailed(status)) return status;
  takeSize(log, found);
  return kCxSuccess;
}

CxStatus qlxLogFileClose(QlxLogFile *log) {
  if (!unlinkFromOpen(log)) return kCxSuccess;  // it was not open
  qlxLogFileSpend(log);
  const bool isOurs = !cxFailed(qlxLogFileMeasure(log));
  if (isOurs) return CxFileClose(&log->file);
  log->keepWritten = 1;
  log->file = -1;
  return kCxSuccess;
}

// ---- Writing

static CxStatus endTornLine(QlxLogFile *log) {
  if (!log->torn) return kCxSuccess;
  const CxStatus status = cxFileWriteAll(&log->file, "\n", 1, &log->size);
  log->torn = cxFailed(status);
  return status;
}

// What somebody appended behind the piece stays, and so does the piece then.
static void cutOff(QlxLogFile *log, uint64_t piece) {
  const off_t end = log->rolls ? lseek(log->file, 0, SEEK_CUR) : -1;
  const off_t start = end - static_cast<off_t>(piece);
  const bool isLast = end >= 0 && start >= 0 && !cxFailed(qlxLogFileMeasure(log)) &&
                      log->size == static_cast<uint64_t>(end);
  const auto cut = [&] { return cxStatusOfCall(ftruncate(log->file, start) == 0); };
  log->torn = !isLast || cxFailed(cxUntilDone(cut));
  if (log->torn) return (void)endTornLine(log);  // other processes do not know of the piece
  log->size = static_cast<uint64_t>(start);
  lseek(log->file, start, SEEK_SET);
}

CxStatus qlxLogFileWrite(QlxLogFile *log, const char *bytes, uint32_t length) {
  if (length == 0) return kCxSuccess;
  uint64_t written = 0;
  CxStatus status = endTornLine(log);
  if (!cxFailed(status)) status = cxFileWriteAll(&log->file, bytes, length, &written);
  log->size += written;
  if (!cxFailed(status)) return status;
  log->look = {};
  if (written > 0) cutOff(log, written);
  return status;
}

// ---- The number in reserve

void qlxLogFileReserve(QlxLogFile *log) {
  if (log->reserve >= 0) return;
  int number = duplicateFrom(kHighNumber, log->file);
  if (number == -1) number = duplicateFrom(kFirstFreeNumber, log->file);
  if (number != -1) claim(log, number, &log->reserve);
}

bool qlxLogFileSpend(QlxLogFile *log) {
  CxFile reserve = log->reserve;
  log->reserve = -1;
  Found found;
  return !cxFailed(findOurs(log, reserve, &found)) && !cxFailed(CxFileClose(&reserve));
}
