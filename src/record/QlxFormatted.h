// The bytes that a handler writes for an event: the text of its formatter in the default code page.
#ifndef QLX_SRC_QLXFORMATTED_H
#define QLX_SRC_QLXFORMATTED_H

#include <string_view>

#include <qlx/types.h>

#include "util/CxAsciiLine.h"
#include "util/CxOwned.h"

class FormattedBytes {
 public:
  FormattedBytes() = default;
  FormattedBytes(const FormattedBytes &) = delete;
  FormattedBytes &operator=(const FormattedBytes &) = delete;

  // Asks the handler's formatter, once for each of these. False: there is nothing to write.
  bool format(const QlxObject *handler, Event *event, va_list *args);

  const char *data() const { return data_; }  // null when memory ran out
  uint32_t length() const { return length_; }

 private:
  bool formatByOwn(QlxObject *formatter, Event *event, va_list *args);
  bool formatByHosts(QlxObject *formatter, Event *event, va_list *args);
  void takeLine();
  void narrow(std::u16string_view text);

  CxAsciiLine line_;
  OwnedStr own_;  // the bytes when they do not fit into the line, or are not ASCII
  const char *data_ = nullptr;
  uint32_t length_ = 0;
};

// The text of a formatter of the library as its fFormat gives it: new, or null.
UChar *qlxFormatNew(QlxObject *formatter, Event *event, va_list *args,
                    bool (*append)(QlxObject *, Event *, va_list *, class RecordText &));

#endif
