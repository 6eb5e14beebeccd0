// Conversion between 8-bit text and UTF-16 into room that the caller has. ASCII text is widened and
// narrowed here while the default code page is UTF-8; all else is ICU's default converter.
#ifndef QLX_SRC_CXUSTRING_H
#define QLX_SRC_CXUSTRING_H

#include <cstring>

#include <unicode/ucnv.h>

#include <qlx/ustring.h>

QLX_BEGIN_DECLS

// Whether the default code page is UTF-8. ICU on this platform is built for that and then never
// changes it; built otherwise, all text takes the way over its converter.
inline bool cxUStringDefaultIsUtf8(void) {
  return std::strcmp(ucnv_getDefaultName(), "UTF-8") == 0;
}

// Whether `length` bytes are ASCII and mean themselves in the default code page.
bool cxUStringIsPlainAscii(const char *text, uint32_t length);

// Widens `length` bytes to as many code units, without a terminator. False, with `out` in any
// state, unless all are ASCII and mean themselves in the default code page.
bool cxUStringWiden(UChar *out, const char *text, uint32_t length);

// Converts `length` bytes without a zero among them and terminates: `out` has room for `length` + 1
// code units, and the result is never longer than the bytes. Returns its length.
uint32_t cxUStringConvert(UChar *out, const char *text, uint32_t length);

// The room that narrowing so many code units needs: four bytes for each and for the terminator.
constexpr uint32_t cxUStringNarrowRoom(uint32_t length) {
  return 4 * (length + 1);
}

// Narrows a text of `length` code units and terminates: the bytes of CxUStringDupUCharToStr() in
// the caller's room. Returns how many they are.
uint32_t cxUStringNarrow(char *out, const UChar *text, uint32_t length);

QLX_END_DECLS

#endif
