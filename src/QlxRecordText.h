// A record that is being built is whole or nothing: when memory runs out for one of its pieces, all
// that was appended is dropped, and what comes later is not appended any more.
#ifndef QLX_SRC_QLXRECORDTEXT_H
#define QLX_SRC_QLXRECORDTEXT_H

#include <type_traits>

#include <qlx/buffers.h>

// Appends to a buffer that it does not own. The buffer itself remembers a loss, so that several of
// these, one after the other, build one record; CxUStringBuffTakeUStr() gives null then.
class RecordText {
 public:
  explicit RecordText(CxUStringBuff *text) : text_(text) {}

  // A null piece is an empty one.
  RecordText &operator<<(const char *piece) {
    return piece ? by(CxUStringBuffAppendStr, piece) : *this;
  }
  RecordText &operator<<(const UChar *piece) {
    return piece ? by(CxUStringBuffAppendUStr, piece) : *this;
  }

  // Appends with a function that answers 0 when memory ran out.
  template <typename... Args>
  RecordText &by(uint8_t (*append)(CxUStringBuff *, Args...), std::type_identity_t<Args>... args) {
    if (text_ && !isLost() && !append(text_, args...)) lose();
    return *this;
  }

 private:
  // Room without a block is what no buffer has otherwise.
  bool isLost() const { return !text_->data && text_->capacity > 0; }
  void lose() {
    CxUStringBuffDiscard(text_);
    text_->capacity = 1;
  }

  CxUStringBuff *text_;
};

#endif
