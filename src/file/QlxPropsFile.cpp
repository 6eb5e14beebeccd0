// Opening, refusing what may never end, and reading to the end; what the bytes say is read
// elsewhere.
#include "QlxPropsFile.h"

#include <algorithm>

#include <fcntl.h>
#include <sys/stat.h>

#include <qlx/files.h>

#include "util/CxStatus.h"

static constexpr uint32_t kBlockBytes = 8192;

static bool isInterrupted(const CxStatus &status) {
  return cxFailed(status) && status.code == EINTR;
}

// What may never end, or do something when it is opened. A folder and a socket fail by themselves.
static CxStatus refuseDevice(const struct stat &info) {
  return cxStatusOf(S_ISCHR(info.st_mode) || S_ISBLK(info.st_mode) ? EINVAL : 0);
}

static CxStatus checkPath(const char *path) {
  if (OslStringLen(path) > kMaxPropsPathBytes) return cxFailure(ENAMETOOLONG);
  char native[kMaxPropsPathBytes + 1] = {};
  CxFileNameLocalize(path, native, kMaxPropsPathBytes);
  struct stat info;
  return stat(native, &info) == 0 ? refuseDevice(info) : kCxSuccess;  // else opening it fails
}

// Looks again at what was opened: the path may lead to something else by now.
static CxStatus checkOpened(CxFile file, uint32_t *expected) {
  struct stat info;
  if (fstat(file, &info) == -1) return cxFailure(errno);
  if (info.st_size > kMaxPropsBytes) return cxFailure(EFBIG);
  *expected = static_cast<uint32_t>(info.st_size);
  return refuseDevice(info);
}

static bool makeRoom(QlxPropsFile &props, uint32_t bytes) {
  auto *block = static_cast<uint8_t *>(OslMemoryRealloc(props.block.get(), bytes));
  if (!block) return false;
  (void)props.block.release();
  props.block.reset(block);
  return true;
}

// Until the end, a failure, the limit, or until memory runs out; the last two leave no bytes.
static void readAll(CxFile *file, QlxPropsFile &props, uint32_t expected) {
  uint32_t room = 0;
  for (uint32_t wanted = std::max(expected + 1, kBlockBytes);; wanted = room * 2) {
    room = std::min(wanted, kMaxPropsBytes + 1);
    if (!makeRoom(props, room)) return (void)(props.length = 0);
    while (props.length < room) {
      int32_t count = 0;
      props.status =
          CxFileRead(file, props.block.get() + props.length, room - props.length, &count);
      if (isInterrupted(props.status)) continue;
      if (cxFailed(props.status)) return;
      props.isWhole = count == 0;
      if (props.isWhole) return;
      props.length += static_cast<uint32_t>(count);
    }
    if (room > kMaxPropsBytes) break;
  }
  props.length = 0;
  props.status = cxFailure(EFBIG);
}

static void readOpened(CxFile *file, QlxPropsFile &props) {
  uint32_t expected = 0;
  props.status = checkOpened(*file, &expected);
  if (!cxFailed(props.status)) readAll(file, props, expected);
  const CxStatus closed = CxFileClose(file);
  if (!cxFailed(props.status)) props.status = closed;
}

QlxPropsFile qlxLoadProps(const char *path) {
  QlxPropsFile props;
  props.status = checkPath(path);
  if (cxFailed(props.status)) return props;
  CxFile file = -1;
  do props.status = CxFileOpen(&file, path, O_RDONLY | O_NOCTTY);
  while (isInterrupted(props.status));
  if (!cxFailed(props.status)) readOpened(&file, props);
  return props;
}
