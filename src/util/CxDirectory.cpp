// Directories: their names, one after the other.
#include <qlx/files.h>

#include <dirent.h>

#include <qlx/memory.h>

#include "CxStatus.h"

static DIR *streamOf(const CxDirectory *directory) {
  return static_cast<DIR *>(*directory);
}

CxStatus CxDirectoryOpen(CxDirectory *directory, const char *path) {
  if (!directory) return cxFailure(EINVAL);
  *directory = nullptr;
  CxFilePath local;
  CxInitFilePath(&local, path);
  if (CxFilePathIsDir(&local) != 0) return cxFailure(EINVAL);  // also for a path that is unfit
  *directory = opendir(local.path);                            // close-on-exec by itself
  return cxStatusOfCall(*directory != nullptr);
}

CxStatus CxDirectoryGetNext(CxDirectory *directory, char *name, uint32_t length) {
  if (name) name[0] = '\0';
  if (!directory || !*directory || !name) return cxFailure(EINVAL);
  errno = 0;  // the only sign that tells the end from a failure
  if (const dirent *const entry = readdir(streamOf(directory))) {
    OslStringNCat(name, entry->d_name, length);
    return kCxSuccess;
  }
  // A directory that is gone has no entries: that is an end too.
  return cxStatusOf(errno == ENOENT ? 0 : errno);
}

CxStatus CxDirectoryClose(CxDirectory *directory) {
  if (!directory || !*directory) return cxFailure(EINVAL);
  DIR *const stream = streamOf(directory);
  *directory = nullptr;
  return cxStatusOfCall(closedir(stream) == 0);
}
