// A simple message pattern, taken apart into literal texts and arguments: strings, integers and
// doubles. Its text is then put together piece by piece, which is much cheaper than ICU's message
// format. A number is written by its shape (QlxNumberShape.h), or else by the number format that
// the parsed message has for it.
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
  bool isShaped[2];       // integers, doubles; false: the number formats write them
  NumberShape shapes[2];  // integers, doubles; one for all arguments, whose formats are alike
};

// Takes apart the pattern that `message` was made of; both outlive the result. False when the
// pattern has anything but text, {n}, {n,number} and {n,number,integer}, when an n is 10 or more
// or has two types, when one below the highest n is missing, and when there are too many pieces.
bool qlxCompose(QlxComposed *composed, std::u16string_view pattern, const UMessageFormat *message);

// Appends the text. No argument may lie in the buffer's own block, which may move. False, with the
// buffer's text unchanged, when an argument is a null string or memory ran out.
bool qlxAppendComposed(CxUStringBuff *text, const QlxComposed *composed, va_list *args);

#endif
