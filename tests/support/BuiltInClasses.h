// The names of the classes that the library brings.
#ifndef QLX_TESTS_BUILTINCLASSES_H
#define QLX_TESTS_BUILTINCLASSES_H

#include <string>

#include "object/QlxClasses.h"

// Those of a kind, in the order of the library's list, each with "|" behind it.
inline std::string builtInNames(int32_t kind) {
  std::string names;
#define QLX_ADD_NAME(record) \
  if (record.kind == kind) names += std::string(record.name) + "|";
  QLX_BUILTIN_CLASSES(QLX_ADD_NAME)
#undef QLX_ADD_NAME
  return names;
}

#endif
