// The process: its id, environment and working directory, and the start of programs.
#include "CxProcess.h"

#include <cstdlib>
#include <unistd.h>

#include "CxStatus.h"

char *CxProcessGetEnv(const char *name) {
  return name ? getenv(name) : nullptr;
}

int64_t CxProcessGetCurrentID(void) {
  return getpid();
}

CxStatus CxProcessGetCwd(char *buffer, uint32_t size) {
  if (!buffer) return cxFailure(EINVAL);
  if (size != 0 && getcwd(buffer, size)) return kCxSuccess;
  buffer[0] = '\0';
  return cxFailure(size == 0 ? EINVAL : errno);
}

CxStatus cxIntlProcessCreate(int64_t *id, const char *path, char *const arguments[],
                             pid_t (*forkCall)(void)) {
  if (!id || !path || !*path) return cxFailure(EINVAL);
  *id = -1;
  const pid_t child = forkCall();
  if (child == -1) return cxFailure(errno);
  if (child == 0) {
    char *const nameOnly[] = {const_cast<char *>(path), nullptr};
    execv(path, arguments ? arguments : nameOnly);
    return kCxSuccess;  // Deliberate: in the child, with the id -1; the caller ends it
  }
  *id = child;
  return kCxSuccess;
}

CxStatus CxProcessCreate(int64_t *id, const char *path, char *const arguments[]) {
  return cxIntlProcessCreate(id, path, arguments, fork);
}

CxStatus CxProcessRelease(int64_t id) {
  return cxStatusOf(id == 0 ? EINVAL : 0);
}
