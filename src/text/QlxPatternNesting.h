// How deep the messages of a pattern nest. ICU's parser calls itself for each level, and so do its
// formats: a pattern that nests without end ends the process, on a small stack early.
#ifndef QLX_SRC_QLXPATTERNNESTING_H
#define QLX_SRC_QLXPATTERNNESTING_H

#include <string_view>

// A pattern that nests deeper is refused before ICU sees it.
inline constexpr int kMaxPatternNesting = 8;

// The levels of messages below the pattern itself, counted as ICU's parser counts them: a choice's,
// plural's or select's message is one level below the message that the argument is in, and what is
// quoted is none. kMaxPatternNesting + 1 for all that is deeper. Of a pattern that ICU cannot read
// at least the levels that it would go down to. One pass at most, no memory.
int qlxPatternNesting(std::u16string_view pattern);

inline bool qlxNestsTooDeep(std::u16string_view pattern) {
  return qlxPatternNesting(pattern) > kMaxPatternNesting;
}

#endif
