#include "QlxFormatted.h"

#include <qlx/memory.h>

#include "QlxCachedBuffer.h"
#include "QlxEvent.h"
#include "QlxObject.h"
#include "QlxRecordText.h"
#include "object/QlxObjClass.h"
#include "object/QlxOperation.h"
#include "util/CxUString.h"
#include "util/CxUnits.h"

UChar *qlxFormatNew(QlxObject *formatter, Event *event, va_list *args,
                    bool (*append)(QlxObject *, Event *, va_list *, RecordText &)) {
  CxUStringBuff text{};
  RecordText record{&text};
  if (append(formatter, event, args, record)) return CxUStringBuffTakeUStr(&text);
  CxUStringBuffDiscard(&text);
  return nullptr;
}

bool FormattedBytes::format(const QlxObject *handler, Event *event, va_list *args) {
  QlxObject *formatter = isKind(handler, Handler) ? handler->kind2.formatter : nullptr;
  if (!isKind(formatter, Formatter)) return false;
  const KeptObject kept{formatter};  // an operation may give the handler another one
  const QlxOwnClass *own = formatter->objClass->own;
  return own ? formatByOwn(formatter, event, args) : formatByHosts(formatter, event, args);
}

void FormattedBytes::takeLine() {
  data_ = line_.data();
  length_ = line_.length();
}

bool FormattedBytes::formatByOwn(QlxObject *formatter, Event *event, va_list *args) {
  const auto append = formatter->objClass->own->append;
  const bool isUtf8 = cxUStringDefaultIsUtf8();
  if (RecordText record{&line_}; isUtf8 && append(formatter, event, args, record)) {
    takeLine();
    return true;
  }
  CachedBuffer buffer;
  RecordText record{buffer.get()};
  if (!append(formatter, event, args, record)) return qlxMissedMemory(event);
  narrow(buffer.text());
  return true;
}

bool FormattedBytes::formatByHosts(QlxObject *formatter, Event *event, va_list *args) {
  const ObjClass *objClass = formatter->objClass;
  if (!objClass->op1.fFormat) return false;
  const bool missedBefore = qlxMissedMemory(event);  // of another handler
  const OwnedUStr text{
      qlxCall({objClass, "fFormat"}, objClass->op1.fFormat, formatter, event, args)};
  if (!text) return !missedBefore && qlxMissedMemory(event);
  narrow({text.get(), cxUnitsLength(text.get())});
  return true;
}

// The text ends with a terminator.
void FormattedBytes::narrow(std::u16string_view text) {
  line_.clear();
  if (cxUStringDefaultIsUtf8() && line_.append(text.data(), text.size())) return takeLine();
  own_.reset(CxUStringDupUCharToStr(text.data()));
  data_ = own_.get();
  length_ = OslStringLen(data_);
}
