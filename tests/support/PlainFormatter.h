// A host's formatter class, "test_plainformatter": the bound text and a line feed, between a header
// and a trailer that the test sets.
#ifndef QLX_TESTS_PLAINFORMATTER_H
#define QLX_TESTS_PLAINFORMATTER_H

#include <functional>
#include <optional>
#include <string>

#include <qlx/qlx.h>

class PlainFormatter {
 public:
  static constexpr const char *kClass = "test_plainformatter";

  // Registers the class; the object lives until the toolkit is closed.
  PlainFormatter() {
    current() = this;
    QlxAddUFormatterClass(kClass, nullptr, nullptr, nullptr, nullptr, format, getHeader, getTrailer,
                          nullptr);
  }
  ~PlainFormatter() { current() = nullptr; }
  PlainFormatter(const PlainFormatter &) = delete;
  PlainFormatter &operator=(const PlainFormatter &) = delete;

  std::optional<std::string> header, trailer;  // without a value: null
  bool silent = false;                         // formats to null
  int formatted = 0;                           // calls of format
  int trailersAsked = 0;                       // calls of getTrailer

  std::function<void()> inFormat, inHeader;  // what else these do first

 private:
  static PlainFormatter *&current() {
    static PlainFormatter *object;
    return object;
  }

  static UChar *format(QlxObject *, Event *event, va_list *args) {
    ++current()->formatted;
    if (current()->inFormat) current()->inFormat();
    if (current()->silent) return nullptr;
    UChar *bound = QlxBindEventUMsg(event, qlxIntlBindUI18Msg, args);
    const std::u16string line = (bound ? std::u16string(bound) : u"") + u"\n";
    OslMemoryFree(bound);
    return CxUStringDup(line.c_str());
  }

  static char *duplicate(const std::optional<std::string> &text) {
    return text ? OslStringDup(text->c_str()) : nullptr;
  }
  static char *getHeader(QlxObject *) {
    if (current()->inHeader) current()->inHeader();
    return duplicate(current()->header);
  }
  static char *getTrailer(QlxObject *) {
    ++current()->trailersAsked;
    return duplicate(current()->trailer);
  }
};

#endif
