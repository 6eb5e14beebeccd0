#include "QlxFormatted.h"

#include <utility>

#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>

#include "QlxObject.h"
#include "util/CxUString.h"
#include "util/CxUnits.h"

// A larger one is not kept for all the events after it.
static constexpr uint32_t kMaxKeptBytes = 64 * 1024;

// Empty while its text is on its way: an event that is logged meanwhile takes a new one.
static CxUStringBuff gKept;

// The built-in formatters' operations, and how each appends instead of making a text of its own.
static QlxAppendEvent appendOf(const QlxObject *formatter) {
  const auto format = isKind(formatter, Formatter) ? formatter->objClass->op1.fFormat : nullptr;
  if (format == QlxBasicUFormatterFFormat) return qlxBasicFormatterAppend;
  return nullptr;
}

UChar *qlxFormatNew(QlxAppendEvent append, QlxObject *formatter, Event *event, va_list *args) {
  CxUStringBuff text{};
  if (append(formatter, event, args, &text)) return CxUStringBuffTakeUStr(&text);
  CxUStringBuffDiscard(&text);
  return nullptr;
}

void qlxDropFormatted(void) {
  CxUStringBuffDiscard(&gKept);
}

KeptBuffer::KeptBuffer() : buffer_(std::exchange(gKept, {})) {
  CxUStringBuffRestart(&buffer_);
}

KeptBuffer::~KeptBuffer() {
  if (!gKept.data && buffer_.capacity <= kMaxKeptBytes) std::swap(gKept, buffer_);
  CxUStringBuffDiscard(&buffer_);
}

// False where there is no text, or where it has to be made in another way.
static bool formatAscii(QlxObject *handler, Event *event, va_list *args, CxAsciiLine *line) {
  QlxObject *formatter = isKind(handler, Handler) ? handler->kind2.formatter : nullptr;
  return appendOf(formatter) == qlxBasicFormatterAppend && cxUStringDefaultIsUtf8() &&
         qlxBasicFormatterAppendAscii(formatter, event, args, line);
}

FormattedEvent::FormattedEvent(QlxObject *handler, Event *event, va_list *args) {
  QlxObject *formatter = isKind(handler, Handler) ? handler->kind2.formatter : nullptr;
  if (const QlxAppendEvent append = appendOf(formatter)) {
    has_ = append(formatter, event, args, buffer_.get());
    length_ = buffer_.get()->length;
    return;
  }
  own_.reset(qlxIntlUHandlerDoFmt(handler, event, args));
  has_ = own_ != nullptr;
  length_ = own_ ? static_cast<uint32_t>(cxUnitsLength(own_.get())) : 0;
}

FormattedBytes::FormattedBytes(QlxObject *handler, Event *event, va_list *args) {
  if (formatAscii(handler, event, args, &line_)) {
    data_ = line_.data();
    length_ = line_.length();
    return;
  }
  const FormattedEvent text{handler, event, args};
  has_ = static_cast<bool>(text);
  if (has_) narrow(text);
}

void FormattedBytes::narrow(const FormattedEvent &text) {
  own_.reset(CxUStringDupUCharToStr(text.text()));
  data_ = own_.get();
  length_ = OslStringLen(data_);
}
