// Levels as the words of records.
#ifndef QLX_SRC_QLXLEVEL_H
#define QLX_SRC_QLXLEVEL_H

#include <string_view>

#include <qlx/level.h>

// Three to five letters; "OTHER" for a number that is no level of an event. Deliberate: FATAL has
// no word of its own, it is written as "ERROR".
std::string_view qlxLevelWord(int32_t level);

#endif
