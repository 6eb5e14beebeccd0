// The message-identifier parser: a table of layouts, each so many letters and so many digits before
// a severity.
#include <qlx/kmsid.h>

#include <cstring>

#include <qlx/memory.h>

namespace {

struct Layout {
  int32_t letters;
  int32_t digits;
  const char *version;
  int32_t number;
};

// Deliberate: the name of 541 carries 45 where the others have their number of letters.
constexpr Layout kLayouts[] = {
    {6, 3, "ZQX6.3.1", 631}, {5, 2, "ZQX5.2.1", 521}, {5, 4, "ZQX45.4.1", 541},
    {5, 3, "ZQX5.3.1", 531}, {4, 4, "ZQX4.4.1", 441}, {4, 3, "ZQX4.3.1", 431},
    {4, 5, "ZQX4.5.1", 451}, {3, 4, "ZQX3.4.1", 341}, {3, 3, "ZQX3.3.1", 331},
    {3, 5, "ZQX3.5.1", 351}, {3, 6, "ZQX3.6.1", 361},
};

constexpr int32_t kMaxLetters = 6;
constexpr int32_t kMaxChars = 10;  // of an identifier; nothing behind them is looked at
constexpr CxKMSIDInfo kNothing = {"", 0, 0, {}, 0};

template <typename Test>
int32_t countWhile(const char *text, int32_t limit, Test test) {
  int32_t count = 0;
  while (count < limit && test(text[count])) ++count;
  return count;
}

bool isSeverity(char c) {
  return c == 'I' || c == 'W' || c == 'E';
}

CxKMSIDInfo describe(const Layout &layout, const char *text) {
  CxKMSIDInfo info = kNothing;
  info.version = layout.version;
  info.number = layout.number;
  info.length = layout.letters + layout.digits + 1;
  const auto length = static_cast<size_t>(info.length);
  std::memcpy(info.id, text, length);
  if (length < sizeof info.id) info.severity = text[length - 1];
  return info;
}

}  // namespace

CxKMSIDInfo CxParseKMSID(const char *text) {
  if (!text) return kNothing;
  const int32_t letters = countWhile(text, kMaxLetters, CxIsASCIIAlpha);
  const int32_t digits = countWhile(text + letters, kMaxChars - 1 - letters, CxIsASCIIDigit);
  if (!isSeverity(text[letters + digits])) return kNothing;
  for (const Layout &layout : kLayouts) {
    if (layout.letters == letters && layout.digits == digits) return describe(layout, text);
  }
  return kNothing;
}
