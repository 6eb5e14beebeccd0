#include "QlxFormatted.h"

#include <array>
#include <utility>

#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>

#include "text/QlxFormatCache.h"
#include "QlxI18Msg.h"
#include "QlxLoggedEvent.h"
#include "QlxObject.h"
#include "util/CxUString.h"
#include "util/CxUnits.h"

// A larger one is not cached for all the events after it.
static constexpr uint32_t kMaxCachedBytes = 64 * 1024;

// Those that are not in use: of a record and of the message in it. An event that is logged
// meanwhile takes new ones.
static std::array<CxUStringBuff, 2> gCache;

namespace {

// A built-in formatter's operation, and how it appends instead of making a text of its own.
struct Row {
  UChar *(*format)(QlxObject *, Event *, va_list *);
  QlxAppendEvent append;
  QlxAppendEventAscii appendAscii;
};

constexpr Row kRows[] = {
    {QlxBasicUFormatterFFormat, qlxBasicFormatterAppend, qlxBasicFormatterAppendAscii},
    {QlxPDXMLUFormatterFFormat, qlxPDXMLFormatterAppend, qlxPDXMLFormatterAppendAscii},
    {QlxVexTraceUFormatterFFormat, qlxVexTraceFormatterAppend, qlxVexTraceFormatterAppendAscii},
};

}  // namespace

static QlxObject *formatterOf(const QlxObject *handler) {
  return isKind(handler, Handler) ? handler->kind2.formatter : nullptr;
}

// Null for a host's.
static const Row *rowOf(const QlxObject *formatter) {
  if (!isKind(formatter, Formatter)) return nullptr;
  for (const Row &row : kRows)
    if (formatter->objClass->op1.fFormat == row.format) return &row;
  return nullptr;
}

UChar *qlxFormatNew(QlxAppendEvent append, QlxObject *formatter, Event *event, va_list *args) {
  CxUStringBuff text{};
  if (append(formatter, event, args, &text)) return CxUStringBuffTakeUStr(&text);
  CxUStringBuffDiscard(&text);
  return nullptr;
}

void qlxDropFormatted(void) {
  for (CxUStringBuff &cached : gCache) CxUStringBuffDiscard(&cached);
}

static CxUStringBuff takeCached() {
  for (CxUStringBuff &cached : gCache)
    if (cached.data) return std::exchange(cached, {});
  return {};
}

CachedBuffer::CachedBuffer() : buffer_(takeCached()) {
  CxUStringBuffRestart(&buffer_);
}

CachedBuffer::~CachedBuffer() {
  for (CxUStringBuff &cached : gCache)
    if (!cached.data && buffer_.data && buffer_.capacity <= kMaxCachedBytes)
      std::swap(cached, buffer_);
  CxUStringBuffDiscard(&buffer_);
}

BoundText::BoundText(Event *event, va_list *args) : text_(bind(event, args)) {}

std::u16string_view BoundText::bind(Event *event, va_list *args) {
  I18Msg *message = event->message;
  qlxUseEventLocale(event);
  if (message && !message->bundle && message->text) {
    const std::u16string_view whole{message->text, cxUnitsLength(message->text)};
    if (qlxIsPlainPattern(whole.data(), whole.size())) return whole;
  }
  CxUStringBuff *buffer = buffer_.emplace().get();
  if (!qlxIntlBindI18MsgTo(message, args, buffer)) return u"";
  return {buffer->data, buffer->length};
}

// False where there is no text, or where it has to be made in another way.
static bool formatAscii(QlxObject *handler, Event *event, va_list *args, CxAsciiLine *line) {
  QlxObject *formatter = formatterOf(handler);
  const Row *row = rowOf(formatter);
  return row && cxUStringDefaultIsUtf8() && row->appendAscii(formatter, event, args, line);
}

FormattedEvent::FormattedEvent(QlxObject *handler, Event *event, va_list *args) {
  QlxObject *formatter = formatterOf(handler);
  if (const Row *row = rowOf(formatter)) {
    has_ = row->append(formatter, event, args, buffer_.get());
    ranOut_ = !has_ && qlxMissedMemory(event);
    length_ = buffer_.get()->length;
    return;
  }
  qlxSettleEvent(event);
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
  has_ = text || text.ranOut();
  if (text) narrow(text);
}

void FormattedBytes::narrow(const FormattedEvent &text) {
  line_.clear();
  if (cxUStringDefaultIsUtf8() && line_.append(text.text(), text.length())) {
    data_ = line_.data();
    length_ = line_.length();
    return;
  }
  own_.reset(CxUStringDupUCharToStr(text.text()));
  data_ = own_.get();
  length_ = OslStringLen(data_);
}
