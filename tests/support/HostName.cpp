#include "support/HostName.h"

#include <cstring>

#include <dlfcn.h>
#include <netdb.h>
#include <unistd.h>

const char *madeUpName;
std::string madeUpOfficialName;

extern "C" int gethostname(char *name, size_t length) noexcept {
  static const auto real =
      reinterpret_cast<int (*)(char *, size_t)>(dlsym(RTLD_NEXT, "gethostname"));
  if (!madeUpName) return real(name, length);
  if (!*madeUpName) return -1;
  std::strncpy(name, madeUpName, length);
  return 0;
}

extern "C" int gethostbyname_r(const char *name, hostent *host, char *work, size_t size,
                               hostent **found, int *error) {
  static const auto real =
      reinterpret_cast<decltype(&gethostbyname_r)>(dlsym(RTLD_NEXT, "gethostbyname_r"));
  if (!madeUpName) return real(name, host, work, size, found, error);
  *host = {};
  host->h_name = madeUpOfficialName.data();
  *found = madeUpOfficialName.empty() ? nullptr : host;
  return 0;
}
