// Time stamps and the host's name.
#include "CxSystem.h"

#include <cstring>
#include <sys/time.h>
#include <unistd.h>

#include "CxOwned.h"
#include "CxStatus.h"

static constexpr uint32_t kFirstWorkBytes = 1024;
static constexpr uint32_t kMaxWorkBytes = 64 * 1024;

int64_t cxMillisOf(int64_t seconds, int64_t microseconds) {
  return seconds * 1000 + microseconds / 1000;
}

double CxSystemGetTimestamp(void) {
  timeval now;
  gettimeofday(&now, nullptr);
  return static_cast<double>(cxMillisOf(now.tv_sec, now.tv_usec));
}

static bool ownName(char *buffer, uint32_t length, const CxHostCalls &calls) {
  buffer[0] = '\0';
  if (calls.getName(buffer, length) == 0 && memchr(buffer, '\0', length)) return true;
  buffer[0] = '\0';  // a name that was cut, perhaps without a terminator
  return false;
}

// Puts the resolver's name for the one in the buffer over it, when that has a dot.
static CxStatus qualify(char *buffer, uint32_t length, const CxHostCalls &calls) {
  for (uint32_t size = kFirstWorkBytes; size <= kMaxWorkBytes; size *= 2) {
    const OwnedStr work{static_cast<char *>(OslMemoryMalloc(size))};
    if (!work) break;
    hostent host;
    hostent *found = nullptr;
    int error = 0;
    const int result = calls.resolve(buffer, &host, work.get(), size, &found, &error);
    if (result == ERANGE) continue;
    if (result != 0 || !found) break;
    if (OslStringChr(found->h_name, '.')) OslStringNCpy(buffer, found->h_name, length);
    return kCxSuccess;
  }
  return cxFailure(ENOSYS);
}

CxStatus cxIntlGetFQHostname(char *buffer, uint32_t length, const CxHostCalls *calls) {
  if (!buffer) return cxFailure(EINVAL);
  if (!ownName(buffer, length, *calls)) return cxFailure(ENOSYS);
  if (OslStringChr(buffer, '.')) return kCxSuccess;
  return qualify(buffer, length, *calls);
}

CxStatus CxSystemGetFQHostname(char *buffer, uint32_t length) {
  static constexpr CxHostCalls kSystemCalls{gethostname, gethostbyname_r};
  return cxIntlGetFQHostname(buffer, length, &kSystemCalls);
}
