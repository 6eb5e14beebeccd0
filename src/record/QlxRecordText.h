// A record on its way to a handler: as UTF-16, or, while all of it is ASCII, as the bytes that the
// handler writes. A formatter's code is the same for both.
#ifndef QLX_SRC_QLXRECORDTEXT_H
#define QLX_SRC_QLXRECORDTEXT_H

#include <string_view>
#include <type_traits>

#include <qlx/buffers.h>

#include "QlxBoundText.h"
#include "text/QlxDateCache.h"
#include "text/QlxNumberCache.h"
#include "util/CxAsciiLine.h"
#include "util/CxDecimal.h"
#include "util/CxUStringBuff.h"

// Appends to what it does not own: to a buffer, which runs out of memory, or to a line of bytes,
// which ends at a piece that is not ASCII or does not fit.
//
// A record is whole or nothing: when a piece cannot be appended, all that was appended is dropped,
// and what comes later is not appended any more. A loss is marked in the buffer itself (isLost()),
// so that several RecordTexts, one after the other, can build one record in it; of a marked buffer
// CxUStringBuffTakeUStr() gives null.
class RecordText {
 public:
  explicit RecordText(CxUStringBuff *text) : text_(text) {}  // null: nothing is appended
  explicit RecordText(CxAsciiLine *line) : line_(line) {}    // with the default code page UTF-8

  // From now on a piece for which a buffer has no memory is left out alone, and the event's status
  // tells it.
  void leaveOutFor(Event *event) { missing_ = event; }

  // Words of the record's own, in ASCII.
  RecordText &operator<<(std::string_view words) {
    return line_ ? toLine(line_->appendAscii(words)) : by(cxUStringBuffAppendAscii, words);
  }
  RecordText &operator<<(std::u16string_view text) {
    if (line_) return toLine(line_->append(text.data(), text.size()));
    return by(cxUStringBuffAppendUnits, text.data(), static_cast<uint32_t>(text.size()));
  }

  // Bytes of the default code page; null appends nothing.
  RecordText &value(std::string_view bytes) {
    return line_ ? toLine(line_->append(bytes)) : by(cxUStringBuffAppend, bytes);
  }
  RecordText &value(const char *bytes) { return bytes ? value(std::string_view{bytes}) : *this; }

  RecordText &number(uint64_t number) {
    char digits[kMaxDecimalDigits];
    char *const end = digits + kMaxDecimalDigits;
    const char *const first = cxDecimalBefore(end, number, '0');
    return *this << std::string_view{first, static_cast<size_t>(end - first)};
  }
  // Deliberate: a negative one has its unsigned 64-bit form.
  RecordText &number(int32_t value) { return number(static_cast<uint64_t>(int64_t{value})); }
  RecordText &number(NumberStyle format, double number);

  RecordText &date(const DateStyle &style, double time) {
    if (line_) return toLine(qlxAppendCachedDateAscii(line_, style, time));
    return by(qlxAppendCachedDate, style, time);
  }

  // The event's message, bound by the library's own binder. One that cannot be bound is empty; the
  // message tells why.
  RecordText &message(Event *event, va_list *args) {
    if (line_) return *this << BoundText().bind(event, args);
    if (text_ && !isLost(text_)) bindTo(text_, event, args);
    return *this;
  }

  bool isWhole() const { return line_ ? !isLost_ : text_ && text_->data; }
  bool isEmpty() const { return line_ ? line_->length() == 0 : !text_ || text_->length == 0; }

  // Whether it is whole; the event's status tells when memory ran out.
  bool isWholeFor(Event *event) const;

 private:
  // The mark of a loss: room without a block, which no buffer has otherwise.
  static bool isLost(const CxUStringBuff *text) { return !text->data && text->capacity > 0; }
  void losePiece();
  static void bindTo(CxUStringBuff *text, Event *event, va_list *args);

  RecordText &toLine(bool appended) {
    isLost_ |= !appended;
    return *this;
  }
  // Appends with a function that answers 0 when memory ran out.
  template <typename... Args>
  RecordText &by(uint8_t (*append)(CxUStringBuff *, Args...), std::type_identity_t<Args>... args) {
    if (text_ && !isLost(text_) && !append(text_, args...)) losePiece();
    return *this;
  }

  CxUStringBuff *text_ = nullptr;
  CxAsciiLine *line_ = nullptr;
  bool isLost_ = false;       // a line has lost a piece
  Event *missing_ = nullptr;  // whose status tells of pieces left out; null: none may be left out
};

#endif
