#include "QlxRecordText.h"

#include "QlxBoundText.h"
#include "QlxEvent.h"
#include "QlxI18Msg.h"

RecordText &RecordText::number(QlxCachedNumber format, double number) {
  if (!line_) return by(qlxAppendCachedNumber, format, number);
  CachedBuffer digits;
  if (!qlxAppendCachedNumber(digits.get(), format, number)) return toLine(false);
  return *this << digits.text();
}

// A message that cannot be bound is empty; the message tells why.
RecordText &RecordText::message(Event *event, va_list *args) {
  if (line_) return *this << BoundText().bind(event, args);
  qlxUseEventLocale(event);
  if (text_ && !isLost(text_)) qlxIntlBindI18MsgTo(event->message, args, text_);
  return *this;
}

bool RecordText::isWholeFor(Event *event) const {
  if (text_ && isLost(text_)) qlxMissMemory(event);
  return isWhole();
}

void RecordText::losePiece() {
  if (missing_) return qlxMissMemory(missing_);
  CxUStringBuffDiscard(text_);
  text_->capacity = 1;
}
