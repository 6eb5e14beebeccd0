#include "QlxRecordText.h"

#include "QlxEvent.h"
#include "QlxI18Msg.h"

RecordText &RecordText::number(NumberStyle format, double number) {
  if (!line_) return by(qlxAppendCachedNumber, format, number);
  CachedBuffer digits;
  if (!qlxAppendCachedNumber(digits.get(), format, number)) return toLine(false);
  return *this << digits.text();
}

void RecordText::bindTo(CxUStringBuff *text, Event *event, va_list *args) {
  qlxUseEventLocale(event);
  qlxIntlBindI18MsgTo(event->message, args, text);
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
