// Paths with "/" as their only separator, and the making of directories.
#include <qlx/files.h>

#include <cerrno>
#include <cstring>
#include <string_view>
#include <sys/stat.h>

static constexpr int32_t kPathBytes = sizeof(CxFilePath::path);

uint8_t CxInitFilePath(CxFilePath *path, const char *text) {
  if (!path) return 0;
  path->length = -1;
  path->lastSep = -1;
  if (!text) {
    path->path[0] = '\0';
    return 0;
  }
  for (int32_t i = 0; i < kPathBytes; ++i) {
    const char c = text[i] == '\\' ? '/' : text[i];
    path->path[i] = c;
    if (c == '/') path->lastSep = i;
    if (c == '\0') {
      path->length = i;
      return 1;
    }
  }
  return 0;
}

// The error number of a look at the path, 0 when `info` is filled.
static int32_t look(const CxFilePath *path, struct stat *info) {
  if (!path || path->length <= 0) return EINVAL;
  return stat(path->path, info) == 0 ? 0 : errno;
}

int32_t CxFilePathIsDir(const CxFilePath *path) {
  struct stat info;
  if (const int32_t error = look(path, &info)) return error;
  return S_ISDIR(info.st_mode) ? 0 : ENOTDIR;
}

int32_t CxFilePathExists(const CxFilePath *path) {
  struct stat info;
  return look(path, &info);
}

uint8_t CxFilePathParent(const CxFilePath *path, CxFilePath *parent) {
  if (!path || !parent || path->length < 0 || path->lastSep < 0) return 0;
  const int32_t end = path->lastSep;
  memmove(parent->path, path->path, static_cast<size_t>(end));
  parent->path[end] = '\0';
  parent->length = end;
  const size_t found = std::string_view{parent->path, static_cast<size_t>(end)}.rfind('/');
  parent->lastSep = found == std::string_view::npos ? -1 : static_cast<int32_t>(found);
  return 1;
}

int32_t CxFilePathMkdirs(const CxFilePath *path, uint32_t mode) {
  if (const int32_t state = CxFilePathIsDir(path); state != ENOENT) return state;
  CxFilePath parent;
  if (CxFilePathParent(path, &parent)) {
    if (const int32_t error = CxFilePathMkdirs(&parent, mode)) return error;
  }
  const int32_t error = mkdir(path->path, 0777) == 0 ? 0 : errno;
  // Deliberate: also when somebody else made it, and past the process's file-creation mask.
  (void)!chmod(path->path, static_cast<mode_t>(mode));
  return error == EEXIST ? 0 : error;
}
