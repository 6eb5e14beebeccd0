#include "QlxRecordText.h"

#include "QlxFormatted.h"
#include "QlxLoggedEvent.h"

RecordText &RecordText::number(QlxCachedNumber format, double number) {
  if (!line_) return by(qlxAppendCachedNumber, format, number);
  CachedBuffer text;
  if (!qlxAppendCachedNumber(text.get(), format, number)) return toLine(false);
  return *this << std::u16string_view{text.get()->data, text.get()->length};
}

bool RecordText::isWholeFor(Event *event) const {
  if (text_ && isLost(text_)) qlxMissMemory(event);
  return isWhole();
}

void RecordText::lose() {
  CxUStringBuffDiscard(text_);
  text_->capacity = 1;
}
