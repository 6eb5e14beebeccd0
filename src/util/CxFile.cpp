// Files: POSIX descriptors with 64-bit sizes, and what is done with files by their names.
#include "CxFile.h"

#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <span>
#include <sys/stat.h>
#include <unistd.h>

#include <qlx/memory.h>

#include "CxStatus.h"

static_assert(sizeof(off_t) == 8, "files over 2 GiB need 64-bit offsets");

static constexpr uint32_t kNameBytes = 256;
static constexpr uint32_t kPrivateMode = 0600;

namespace {

// A name as the operating system gets it: cut, localized, and terminated by the byte beyond.
struct LocalName {
  explicit LocalName(const char *name) : valid(CxFileNameLocalize(name, text, kNameBytes) == 1) {}
  char text[kNameBytes + 1] = {};
  bool valid;
};

}  // namespace

static void turnBackslashes(std::span<char> name) {
  for (char &c : name) {
    if (c == '\\') c = '/';
  }
}

CxStatus CxFileOpen(CxFile *file, const char *name, int32_t flags) {
  return CxFileOpenMode(file, name, flags, kPrivateMode);
}

CxStatus CxFileOpenMode(CxFile *file, const char *name, int32_t flags, uint32_t mode) {
  if (!file) return cxFailure(EINVAL);
  const LocalName local{name};  // Deliberate: no name is tried too, as the empty one
  *file = open(local.text, flags | O_CLOEXEC, static_cast<mode_t>(mode));
  return cxStatusOfCall(*file != -1);
}

CxStatus CxFileRead(CxFile *file, void *buffer, uint32_t length, int32_t *count) {
  if (!file || !buffer || !count) return cxFailure(EINVAL);
  *count = static_cast<int32_t>(read(*file, buffer, length));
  return cxStatusOfCall(*count != -1);
}

CxStatus CxFileWrite(CxFile *file, const void *buffer, uint32_t length, int32_t *count) {
  if (!file || !buffer || !count) return cxFailure(EINVAL);
  *count = static_cast<int32_t>(write(*file, buffer, length));
  return cxStatusOfCall(*count != -1);
}

CxStatus cxFileWriteAll(CxFile *file, const char *bytes, uint32_t length, uint64_t *written) {
  while (length > 0) {
    int32_t count = 0;
    const CxStatus status = cxUntilDone([&] { return CxFileWrite(file, bytes, length, &count); });
    if (cxFailed(status)) return status;
    if (count == 0) return cxFailure(EIO);
    bytes += count;
    length -= static_cast<uint32_t>(count);
    *written += static_cast<uint32_t>(count);
  }
  return kCxSuccess;
}

CxStatus CxFileSeek(CxFile *file, int64_t offset, int32_t origin) {
  if (!file) return cxFailure(EINVAL);
  // Deliberate: the low 32 bits of the offset, and any place but the start is a failure.
  return cxStatusOfCall(lseek(*file, static_cast<int32_t>(offset), origin) == 0);
}

CxStatus cxIntlFileCheckEmpty(CxFile file) {
  struct stat info;
  if (fstat(file, &info) == -1) return cxFailure(errno);
  return cxStatusOf(info.st_size == 0 ? 0 : EINVAL);
}

CxStatus CxFileTrunc(CxFile *file) {
  if (!file) return cxFailure(EINVAL);
  if (lseek(*file, 0, SEEK_SET) == -1 || ftruncate(*file, 0) == -1) return cxFailure(errno);
  return cxIntlFileCheckEmpty(*file);
}

CxStatus CxFileGetSize(CxFile *file, int64_t *size) {
  if (!file || !size) return cxFailure(EINVAL);
  struct stat info;
  if (fstat(*file, &info) == -1) return cxFailure(errno);
  *size = info.st_size;
  return kCxSuccess;
}

CxStatus CxFileFlush(CxFile *file) {
  if (!file) return cxFailure(EINVAL);
  return cxStatusOfCall(fsync(*file) == 0);
}

CxStatus CxFileClose(CxFile *file) {
  if (!file) return cxFailure(EINVAL);
  const CxFile closing = *file;
  *file = -1;
  return cxStatusOfCall(close(closing) == 0);
}

CxStatus CxFileNameGetSize(const char *name, int64_t *size) {
  if (!name || !size) return cxFailure(EINVAL);
  struct stat info;
  if (stat(name, &info) == -1) return cxFailure(errno);
  *size = info.st_size;
  return kCxSuccess;
}

CxStatus CxFileNameGetInfo(CxFileInfo *record, const char *name) {
  if (!record || !name || !*name) return cxFailure(EINVAL);
  struct stat info;
  if (stat(name, &info) == -1) return cxFailure(errno);
  *record = {info.st_size, info.st_ctime, info.st_mtime, info.st_atime};
  return kCxSuccess;
}

CxStatus CxFileNameRemove(const char *name) {
  const LocalName local{name};
  if (!local.valid) return cxFailure(EINVAL);
  return cxStatusOfCall(remove(local.text) == 0);
}

CxStatus CxFileNameRename(const char *oldName, const char *newName) {
  const LocalName from{oldName};
  const LocalName to{newName};
  if (!from.valid || !to.valid) return cxFailure(EINVAL);
  return cxStatusOfCall(rename(from.text, to.text) == 0);
}

uint8_t CxFileNameLocalize(const char *source, char *destination, uint32_t length) {
  if (!source || !destination || length == 0) return 0;
  OslStringNCpy(destination, source, length);
  turnBackslashes({destination, strnlen(destination, length)});
  return 1;
}

uint8_t CxFileNameGetNative(const char *source, char *destination, uint32_t length) {
  if (!source || !destination) return 0;
  OslStringNCpy(destination, source, length);
  turnBackslashes({destination, length});
  return 1;
}
