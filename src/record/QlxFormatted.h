// The text of an event on its way from a formatter to what writes it. The built-in formatters
// append to a buffer that is cached between events; a host's formatter makes a new text.
#ifndef QLX_SRC_QLXFORMATTED_H
#define QLX_SRC_QLXFORMATTED_H

#include <optional>
#include <string_view>

#include <qlx/buffers.h>
#include <qlx/types.h>

#include "util/CxAsciiLine.h"
#include "util/CxOwned.h"

QLX_BEGIN_DECLS

// Appends an event's text. Returns 1; 0 where the formatter has no text for it, or memory ran out.
typedef uint8_t (*QlxAppendEvent)(QlxObject *formatter, Event *event, va_list *args,
                                  CxUStringBuff *text);

uint8_t qlxBasicFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                CxUStringBuff *text);
uint8_t qlxPDXMLFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                CxUStringBuff *text);
uint8_t qlxVexTraceFormatterAppend(QlxObject *formatter, Event *event, va_list *args,
                                   CxUStringBuff *text);

// The same as bytes, as long as all of them are ASCII and fit.
typedef bool (*QlxAppendEventAscii)(QlxObject *formatter, Event *event, va_list *args,
                                    CxAsciiLine *line);

bool qlxBasicFormatterAppendAscii(QlxObject *formatter, Event *event, va_list *args,
                                  CxAsciiLine *line);
bool qlxPDXMLFormatterAppendAscii(QlxObject *formatter, Event *event, va_list *args,
                                  CxAsciiLine *line);
bool qlxVexTraceFormatterAppendAscii(QlxObject *formatter, Event *event, va_list *args,
                                     CxAsciiLine *line);

// The text as a formatter class's fFormat gives it: new, or null.
UChar *qlxFormatNew(QlxAppendEvent append, QlxObject *formatter, Event *event, va_list *args);

// Frees the cached buffers.
void qlxDropFormatted(void);

QLX_END_DECLS

// An empty buffer with a cached block. The API lock is held.
class CachedBuffer {
 public:
  CachedBuffer();
  ~CachedBuffer();
  CachedBuffer(const CachedBuffer &) = delete;
  CachedBuffer &operator=(const CachedBuffer &) = delete;

  CxUStringBuff *get() { return &buffer_; }
  const CxUStringBuff *get() const { return &buffer_; }

 private:
  CxUStringBuff buffer_;
};

// The message's text of an event, as qlxIntlBindUI18Msg() binds it. Good as long as the message.
class BoundText {
 public:
  BoundText(Event *event, va_list *args);

  std::u16string_view get() const { return text_; }  // never null; empty for none

 private:
  std::u16string_view bind(Event *event, va_list *args);

  std::optional<CachedBuffer> buffer_;  // of a text that is not the message's own
  std::u16string_view text_;
};

// The text that a handler's formatter makes of an event. The API lock is held.
class FormattedEvent {
 public:
  FormattedEvent(QlxObject *handler, Event *event, va_list *args);
  FormattedEvent(const FormattedEvent &) = delete;
  FormattedEvent &operator=(const FormattedEvent &) = delete;

  explicit operator bool() const { return has_; }  // false: there is nothing to write
  const UChar *text() const { return own_ ? own_.get() : buffer_.get()->data; }
  uint32_t length() const { return length_; }
  bool ranOut() const { return ranOut_; }  // there is nothing, for want of memory

 private:
  CachedBuffer buffer_;
  OwnedUStr own_;  // of a host's formatter
  uint32_t length_ = 0;
  bool has_ = false;
  bool ranOut_ = false;  // of a built-in formatter
};

// The same as bytes of the default code page, for handlers that write bytes.
class FormattedBytes {
 public:
  FormattedBytes(QlxObject *handler, Event *event, va_list *args);
  FormattedBytes(const FormattedBytes &) = delete;
  FormattedBytes &operator=(const FormattedBytes &) = delete;

  explicit operator bool() const { return has_; }  // false: there is nothing to write
  const char *data() const { return data_; }       // null when memory ran out
  uint32_t length() const { return length_; }

 private:
  void narrow(const FormattedEvent &text);

  CxAsciiLine line_;
  OwnedStr own_;  // what does not fit into the line, or is not ASCII
  const char *data_ = nullptr;
  uint32_t length_ = 0;
  bool has_ = true;
};

#endif
