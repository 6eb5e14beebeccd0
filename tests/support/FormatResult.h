// What a formatting gives: the text, and ICU's error, 0 for none.
#ifndef QLX_TESTS_FORMATRESULT_H
#define QLX_TESTS_FORMATRESULT_H

#include <ostream>
#include <string>

#include <unicode/ustring.h>

inline std::string toUtf8(const std::u16string &text) {
  std::string out(text.size() * 3 + 1, '\0');
  int32_t length = 0;
  UErrorCode status = U_ZERO_ERROR;
  u_strToUTF8WithSub(out.data(), static_cast<int32_t>(out.size()), &length, text.data(),
                     static_cast<int32_t>(text.size()), 0xFFFD, nullptr, &status);
  out.resize(static_cast<size_t>(length));
  return out;
}

struct FormatResult {
  std::u16string text;
  int error;
  bool operator==(const FormatResult &) const = default;
};

inline void PrintTo(const FormatResult &result, std::ostream *out) {
  *out << '"' << toUtf8(result.text) << "\" error " << result.error;
}

#endif
