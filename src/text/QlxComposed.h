// A message pattern taken apart into literal text and arguments of three plain types, so that a
// text is put together without the machinery for all the other patterns. The numbers are written in
// the shapes of the parsed message's own formatters, or by these.
#ifndef QLX_SRC_QLXCOMPOSED_H
#define QLX_SRC_QLXCOMPOSED_H

#include <cstdarg>
#include <string_view>

#include <unicode/numfmt.h>
#include <unicode/umsg.h>

#include <qlx/buffers.h>

#include "QlxNumberShape.h"

inline constexpr int32_t kMaxComposedPieces = 24;
inline constexpr int32_t kMaxComposedArguments = 10;

struct ComposedPiece {
  const UChar *text;                // a literal; null: an argument
  int32_t length;                   // of the literal, or the argument's number
  const icu::NumberFormat *format;  // of an argument that is a number
};

struct QlxComposed {
  int32_t pieceCount;
  int32_t argumentCount;
  ComposedPiece pieces[kMaxComposedPieces];
  ArgType types[kMaxComposedArguments];
  bool isShaped[2];       // of integers and of doubles; false: the formatters write the numbers
  NumberShape shapes[2];  // the same; formatters of one type are all made alike
};

// Takes a pattern apart that `message` was made of; both outlive the result. False when the pattern
// has anything but text, {n}, {n,number} and {n,number,integer}, each number below 10 and none left
// out, or is too long.
bool qlxCompose(QlxComposed *composed, std::u16string_view pattern, const UMessageFormat *message);

// Appends the text; no argument lies in the buffer's own block. False, with the buffer's text
// unchanged, when an argument is a null string or memory ran out.
bool qlxAppendComposed(CxUStringBuff *text, const QlxComposed *composed, va_list *args);

#endif
