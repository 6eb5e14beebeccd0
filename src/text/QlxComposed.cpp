#include "QlxComposed.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <span>
#include <utility>

#include <unicode/messagepattern.h>
#include <unicode/msgfmt.h>

#include "QlxPatternNesting.h"
#include "util/CxUStringBuff.h"
#include "util/CxUnits.h"

namespace {

struct Argument {
  union {
    const UChar *text;
    int32_t integer;
    double number;
  };
  uint32_t length;  // of a text
};
using Arguments = std::array<Argument, kMaxComposedArguments>;

}  // namespace

// ---- Taking apart

namespace {

using Part = icu::MessagePattern::Part;

class Parser {
 public:
  Parser(std::u16string_view pattern, QlxComposed *out)
      : pattern_(pattern), out_(out), parts_(status_) {}

  bool parse() {
    if (qlxNestsTooDeep(pattern_)) return false;
    const icu::UnicodeString text(false, pattern_.data(), static_cast<int32_t>(pattern_.size()));
    parts_.parse(text, nullptr, status_);
    if (U_FAILURE(status_)) return false;
    for (int32_t i = 1; i < parts_.countParts(); ++i) {
      const Part &part = parts_.getPart(i);
      if (!addLiteral(part.getIndex())) return false;
      from_ = part.getLimit();
      if (part.getType() == UMSGPAT_PART_TYPE_MSG_LIMIT) return hasAllArguments();
      if (isQuote(part.getType())) continue;
      if (part.getType() != UMSGPAT_PART_TYPE_ARG_START || !addArgument(i)) return false;
      i = parts_.getLimitPartIndex(i);
      from_ = parts_.getPart(i).getLimit();
    }
    return false;
  }

 private:
  // What is left out of the text, or where a quote that stands for itself could be doubled.
  static bool isQuote(UMessagePatternPartType type) {
    return type == UMSGPAT_PART_TYPE_SKIP_SYNTAX || type == UMSGPAT_PART_TYPE_INSERT_CHAR;
  }

  ComposedPiece *newPiece() {
    return out_->pieceCount < kMaxComposedPieces ? &out_->pieces[out_->pieceCount++] : nullptr;
  }

  bool addLiteral(int32_t end) {
    if (end == from_) return true;
    ComposedPiece *piece = newPiece();
    if (piece) *piece = {pattern_.data() + from_, end - from_, nullptr};
    return piece;
  }

  // Around a style there may be blanks.
  bool is(int32_t partIndex, UMessagePatternPartType type, std::u16string_view word) const {
    const Part &part = parts_.getPart(partIndex);
    std::u16string_view text = pattern_.substr(static_cast<size_t>(part.getIndex()),
                                               static_cast<size_t>(part.getLength()));
    while (text.starts_with(u' ')) text.remove_prefix(1);
    while (text.ends_with(u' ')) text.remove_suffix(1);
    return part.getType() == type && text == word;
  }

  // The parts of an argument: its start, number, and, for a simple one, type and style.
  ArgType typeAt(int32_t start) const {
    const int32_t parts = parts_.getLimitPartIndex(start) - start;
    if (parts == 2 && parts_.getPart(start).getArgType() == UMSGPAT_ARG_TYPE_NONE) {
      return ArgType::kString;
    }
    if (parts < 3 || !is(start + 2, UMSGPAT_PART_TYPE_ARG_TYPE, u"number")) {
      return ArgType::kNone;
    }
    if (parts == 3) return ArgType::kDouble;
    const bool integer = parts == 4 && is(start + 3, UMSGPAT_PART_TYPE_ARG_STYLE, u"integer");
    return integer ? ArgType::kInteger : ArgType::kNone;
  }

  bool addArgument(int32_t start) {
    const Part &number = parts_.getPart(start + 1);
    const ArgType type = typeAt(start);
    if (type == ArgType::kNone || number.getType() != UMSGPAT_PART_TYPE_ARG_NUMBER) return false;
    const int32_t index = number.getValue();
    if (index >= kMaxComposedArguments) return false;
    ArgType &known = out_->types[index];
    if (known != ArgType::kNone && known != type) return false;
    known = type;
    ComposedPiece *piece = newPiece();
    if (piece) *piece = {nullptr, index, nullptr};
    return piece;
  }

  bool hasAllArguments() {
    int32_t count = 0;
    while (count < kMaxComposedArguments && out_->types[count] != ArgType::kNone) ++count;
    out_->argumentCount = count;
    for (; count < kMaxComposedArguments; ++count)
      if (out_->types[count] != ArgType::kNone) return false;
    return true;
  }

  std::u16string_view pattern_;
  QlxComposed *out_;
  UErrorCode status_ = U_ZERO_ERROR;
  icu::MessagePattern parts_;
  int32_t from_ = 0;  // of the literal text before the next part
};

// Takes the message's formatters, which are those of its arguments in their order.
bool takeFormats(QlxComposed *composed, const UMessageFormat *message) {
  int32_t count = 0;
  const icu::Format **formats =
      reinterpret_cast<const icu::MessageFormat *>(message)->getFormats(count);
  int32_t next = 0;
  for (int32_t i = 0; i < composed->pieceCount; ++i) {
    ComposedPiece &piece = composed->pieces[i];
    if (piece.text) continue;
    if (next == count) return false;
    const icu::Format *format = formats[next++];
    const bool isText = composed->types[piece.length] == ArgType::kString;
    if (isText == (format != nullptr)) return false;
    piece.format = static_cast<const icu::NumberFormat *>(format);
  }
  return next == count;
}

// The place of a type of numbers among the shapes.
size_t shapeOf(ArgType type) {
  return type == ArgType::kInteger ? 0 : 1;
}

void takeShapes(QlxComposed *composed) {
  bool isTried[2] = {};
  for (int32_t i = 0; i < composed->pieceCount; ++i) {
    const ComposedPiece &piece = composed->pieces[i];
    if (!piece.format) continue;
    const ArgType type = composed->types[piece.length];
    const size_t place = shapeOf(type);
    if (std::exchange(isTried[place], true)) continue;
    composed->isShaped[place] = qlxTakeNumberShape(&composed->shapes[place], piece.format, type);
  }
}

}  // namespace

bool qlxCompose(QlxComposed *composed, std::u16string_view pattern, const UMessageFormat *message) {
  *composed = {};
  if (!Parser(pattern, composed).parse() || !takeFormats(composed, message)) return false;
  takeShapes(composed);
  return true;
}

// ---- Putting together

static bool readArguments(const QlxComposed *composed, va_list *args, Arguments *values) {
  va_list copy;
  va_copy(copy, *args);
  bool whole = true;
  for (int32_t i = 0; i < composed->argumentCount; ++i) {
    Argument &value = (*values)[static_cast<size_t>(i)];
    if (composed->types[i] == ArgType::kString) {
      value.text = va_arg(copy, const UChar *);
      whole = whole && value.text;
      value.length = value.text ? static_cast<uint32_t>(cxUnitsLength(value.text)) : 0;
    } else if (composed->types[i] == ArgType::kInteger) {
      value.integer = va_arg(copy, int32_t);
    } else {
      value.number = va_arg(copy, double);
    }
  }
  va_end(copy);
  return whole;
}

namespace {

// Puts a text together behind a buffer's own, which ends with its terminator only at the end.
class Composer {
 public:
  Composer(CxUStringBuff *text, const QlxComposed *composed, const Arguments &values)
      : text_(text), composed_(*composed), values_(values) {}

  bool compose() {
    const uint32_t before = text_->length;
    const std::span pieces{composed_.pieces, static_cast<size_t>(composed_.pieceCount)};
    const bool whole =
        std::ranges::all_of(pieces, [this](const ComposedPiece &piece) { return append(piece); });
    if (!whole) text_->length = before;
    if (text_->data) *end() = 0;
    return whole;
  }

 private:
  UChar *end() { return text_->data + text_->length; }

  bool reserve(uint32_t units) {
    return cxUStringBuffFits(text_, units) || cxUStringBuffHasCapacity(text_, units);
  }

  bool appendUnits(const UChar *units, uint32_t length) {
    if (!reserve(length)) return false;
    std::memcpy(end(), units, length * sizeof(UChar));
    text_->length += length;
    return true;
  }

  bool append(const ComposedPiece &piece) {
    if (piece.text) return appendUnits(piece.text, static_cast<uint32_t>(piece.length));
    const Argument &value = values_[static_cast<size_t>(piece.length)];
    const ArgType type = composed_.types[piece.length];
    if (type == ArgType::kString) return appendUnits(value.text, value.length);
    return appendShaped(type, value) || appendFormatted(type, value, *piece.format);
  }

  bool appendShaped(ArgType type, const Argument &value) {
    const size_t place = shapeOf(type);
    if (!composed_.isShaped[place] || !reserve(kMaxShapedUnits)) return false;
    const NumberShape &shape = composed_.shapes[place];
    const UChar *behind = type == ArgType::kInteger
                              ? qlxWriteShapedInteger(shape, value.integer, end())
                              : qlxWriteShapedDouble(shape, value.number, end());
    if (behind) text_->length = static_cast<uint32_t>(behind - text_->data);
    return behind;
  }

  bool appendFormatted(ArgType type, const Argument &value, const icu::NumberFormat &format) {
    icu::UnicodeString number;
    if (type == ArgType::kInteger)
      format.format(value.integer, number);
    else
      format.format(value.number, number);
    return appendUnits(number.getBuffer(), static_cast<uint32_t>(number.length()));
  }

  CxUStringBuff *text_;
  const QlxComposed &composed_;
  const Arguments &values_;
};

}  // namespace

bool qlxAppendComposed(CxUStringBuff *text, const QlxComposed *composed, va_list *args) {
  Arguments values;
  return readArguments(composed, args, &values) && Composer(text, composed, values).compose();
}
