// The types that an argument of a message pattern may have, in the one vocabulary of the library:
// of the scan of a pattern, of its composition, and of who writes the arguments.
#ifndef QLX_SRC_QLXARGTYPE_H
#define QLX_SRC_QLXARGTYPE_H

#include <cstdint>

enum class ArgType : uint8_t {
  kNone,     // no argument, or of a type that is left to ICU
  kString,   // a terminated text in UTF-16
  kInteger,  // int32_t
  kDouble,
};

#endif
