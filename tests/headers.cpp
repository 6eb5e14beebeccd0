// Every public header is C++11, with C linkage throughout.
#include "everyHeader.h"

static_assert(sizeof(QlxLogResult) == 12, "as C lays it out");
static_assert(sizeof(CxStatus) == 8, "as C lays it out");

extern "C" QlxLogResult QlxLogInfo(QlxObject *logger, const char *bundle, const char *key, ...);

int main() {
  return 0;
}
