#include "QlxComposed.h"

#include <array>
#include <cstring>

#include <unicode/messagepattern.h>
#include <unicode/msgfmt.h>

#include "util/CxUStringBuff.h"

namespace {

union Argument {
  const UChar *text;
  int32_t integer;
  double number;
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
  ComposedType typeAt(int32_t start) const {
    const int32_t parts = parts_.getLimitPartIndex(start) - start;
    if (parts == 2 && parts_.getPart(start).getArgType() == UMSGPAT_ARG_TYPE_NONE) {
      return ComposedType::kText;
    }
    if (parts < 3 || !is(start + 2, UMSGPAT_PART_TYPE_ARG_TYPE, u"number")) {
      return ComposedType::kNone;
    }
    if (parts == 3) return ComposedType::kDouble;
    const bool integer = parts == 4 && is(start + 3, UMSGPAT_PART_TYPE_ARG_STYLE, u"integer");
    return integer ? ComposedType::kInteger : ComposedType::kNone;
  }

  bool addArgument(int32_t start) {
    const Part &number = parts_.getPart(start + 1);
    const ComposedType type = typeAt(start);
    if (type == ComposedType::kNone || number.getType() != UMSGPAT_PART_TYPE_ARG_NUMBER)
      return false;
    const int32_t index = number.getValue();
    if (index >= kMaxComposedArguments) return false;
    ComposedType &known = out_->types[index];
    if (known != ComposedType::kNone && known != type) return false;
    known = type;
    ComposedPiece *piece = newPiece();
    if (piece) *piece = {nullptr, index, nullptr};
    return piece;
  }

  bool hasAllArguments() {
    int32_t count = 0;
    while (count < kMaxComposedArguments && out_->types[count] != ComposedType::kNone) ++count;
    out_->argumentCount = count;
    for (; count < kMaxComposedArguments; ++count)
      if (out_->types[count] != ComposedType::kNone) return false;
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
    const bool isText = composed->types[piece.length] == ComposedType::kText;
    if (isText == (format != nullptr)) return false;
    piece.format = static_cast<const icu::NumberFormat *>(format);
  }
  return next == count;
}

}  // namespace

bool qlxCompose(QlxComposed *composed, std::u16string_view pattern, const UMessageFormat *message) {
  *composed = {};
  return Parser(pattern, composed).parse() && takeFormats(composed, message);
}

// ---- Putting together

static bool readArguments(const QlxComposed *composed, va_list *args, Arguments *values) {
  va_list copy;
  va_copy(copy, *args);
  bool whole = true;
  for (int32_t i = 0; i < composed->argumentCount; ++i) {
    Argument &value = (*values)[static_cast<size_t>(i)];
    if (composed->types[i] == ComposedType::kText) {
      value.text = va_arg(copy, const UChar *);
      whole = whole && value.text;
    } else if (composed->types[i] == ComposedType::kInteger) {
      value.integer = va_arg(copy, int32_t);
    } else {
      value.number = va_arg(copy, double);
    }
  }
  va_end(copy);
  return whole;
}

static bool appendNumber(CxUStringBuff *text, const ComposedPiece &piece, ComposedType type,
                         const Argument &value) {
  icu::UnicodeString number;
  if (type == ComposedType::kInteger)
    piece.format->format(value.integer, number);
  else
    piece.format->format(value.number, number);
  return cxUStringBuffAppendUnits(text, number.getBuffer(), static_cast<uint32_t>(number.length()));
}

static bool appendPiece(CxUStringBuff *text, const QlxComposed *composed,
                        const ComposedPiece &piece, const Arguments &values) {
  if (piece.text) {
    return cxUStringBuffAppendUnits(text, piece.text, static_cast<uint32_t>(piece.length));
  }
  const Argument &value = values[static_cast<size_t>(piece.length)];
  const ComposedType type = composed->types[piece.length];
  if (type == ComposedType::kText) return CxUStringBuffAppendUStr(text, value.text);
  return appendNumber(text, piece, type, value);
}

bool qlxAppendComposed(CxUStringBuff *text, const QlxComposed *composed, va_list *args) {
  Arguments values;
  if (!readArguments(composed, args, &values)) return false;
  const uint32_t before = text->length;
  for (int32_t i = 0; i < composed->pieceCount; ++i) {
    if (appendPiece(text, composed, composed->pieces[i], values)) continue;
    text->length = before;
    if (text->data) text->data[before] = 0;
    return false;
  }
  return true;
}
