/* Every public header is C11: `everyHeader.h` includes them all, in no order that helps them. */
#include "everyHeader.h"

/* What a host's compiler must lay out as the library's does. */
_Static_assert(sizeof(QlxLogResult) == 12, "a log result is three 32-bit words");
_Static_assert(sizeof(CxStatus) == 8, "a status is two 32-bit words");
_Static_assert(sizeof(UChar) == 2, "text is UTF-16");

int main(void) {
  return 0;
}
