// Results that the caller owns, as strings that free themselves.
#ifndef QLX_TESTS_TAKE_H
#define QLX_TESTS_TAKE_H

#include <string>

#include <qlx/memory.h>

// The text of a returned string, which it frees; "<null>" for null.
inline std::string take(char *text) {
  const std::string taken = text ? text : "<null>";
  OslMemoryFree(text);
  return taken;
}

inline std::u16string take(UChar *text) {
  const std::u16string taken = text ? text : u"<null>";
  OslMemoryFree(text);
  return taken;
}

#endif
