// What tests reach of the system services: the arithmetic without the clock, and the host's name
// with the two calls that find it as arguments.
#ifndef QLX_SRC_CXSYSTEM_H
#define QLX_SRC_CXSYSTEM_H

#include <netdb.h>

#include <qlx/system.h>

QLX_BEGIN_DECLS

// Whole milliseconds of a clock reading; parts of one are dropped.
int64_t cxMillisOf(int64_t seconds, int64_t microseconds);

typedef struct CxHostCalls {
  int (*getName)(char *buffer, size_t length);  // as gethostname()
  int (*resolve)(const char *name, struct hostent *host, char *work, size_t size,
                 struct hostent **found, int *error);  // as gethostbyname_r()
} CxHostCalls;

CxStatus cxIntlGetFQHostname(char *buffer, uint32_t length, const CxHostCalls *calls);

QLX_END_DECLS

#endif
