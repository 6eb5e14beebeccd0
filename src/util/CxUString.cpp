// UTF-16 text at the library's edges: conversion by ICU's default converter, the text of a
// parameter, and the standard output stream. ICU's converter is looked up, locked and reset for
// every string, so ASCII, which is nearly all that a log holds, is copied here instead when that is
// the same.
#include "CxUString.h"

#include <array>
#include <atomic>
#include <cstring>

#include <unicode/ucnv.h>
#include <unicode/ustdio.h>
#include <unicode/ustring.h>

#include <qlx/memory.h>

#include "CxDecimal.h"
#include "CxStatus.h"
#include "CxUnits.h"

static constexpr uint32_t kMaxParmUnits = 256;
static constexpr uint32_t kMaxBytesPerUnit = cxUStringNarrowRoom(0);

bool cxUStringIsPlainAscii(const char *text, uint32_t length) {
  uint8_t seen = 0;
  for (uint32_t i = 0; i < length; ++i) seen |= static_cast<uint8_t>(text[i]);
  return seen < 0x80 && cxUStringDefaultIsUtf8();
}

bool cxUStringWiden(UChar *out, const char *text, uint32_t length) {
  return cxWidenAscii(out, text, length) && cxUStringDefaultIsUtf8();
}

// u_uastrncpy and u_austrncpy are u_uastrcpy and u_austrcpy that stop at the end of the room: no
// converter that a host may make the default one can write past it.
uint32_t cxUStringConvert(UChar *out, const char *text, uint32_t length) {
  out[length] = 0;
  if (length > 0) u_uastrncpy(out, text, static_cast<int32_t>(length));
  return static_cast<uint32_t>(u_strlen(out));
}

// A block of `perUnit` bytes for each of `units` and of the terminator, or null.
static void *allocText(uint32_t units, uint32_t perUnit) {
  const uint64_t size = (uint64_t{units} + 1) * perUnit;
  return size > INT32_MAX ? nullptr : OslMemoryMalloc(static_cast<uint32_t>(size));
}

uint32_t cxUStringNarrow(char *out, const UChar *text, uint32_t length) {
  if (cxNarrowAscii(out, text, length) && cxUStringDefaultIsUtf8()) {
    out[length] = 0;
    return length;
  }
  const uint32_t room = cxUStringNarrowRoom(length) - 1;
  out[room] = 0;
  u_austrncpy(out, text, static_cast<int32_t>(room));
  return OslStringLen(out);
}

static char *narrow(const UChar *text, uint32_t length) {
  auto *copy = static_cast<char *>(allocText(length, kMaxBytesPerUnit));
  if (copy) cxUStringNarrow(copy, text, length);
  return copy;
}

UChar *CxUStringDupStrToUChar(const char *text) {
  if (!text) return nullptr;
  const uint32_t length = OslStringLen(text);
  auto *copy = static_cast<UChar *>(allocText(length, sizeof(UChar)));
  if (!copy) return nullptr;
  if (cxUStringWiden(copy, text, length)) {
    copy[length] = 0;
  } else {
    cxUStringConvert(copy, text, length);
  }
  return copy;
}

char *CxUStringDupUCharToStr(const UChar *text) {
  return text ? narrow(text, static_cast<uint32_t>(cxUnitsLength(text))) : nullptr;
}

UChar *CxUStringDup(const UChar *text) {
  if (!text) return nullptr;
  auto *copy =
      static_cast<UChar *>(allocText(static_cast<uint32_t>(cxUnitsLength(text)), sizeof(UChar)));
  return copy ? u_strcpy(copy, text) : nullptr;
}

using ParmText = std::array<UChar, kMaxParmUnits + 1>;

static void putDecimal(ParmText &out, int32_t value) {
  UChar digits[kMaxDecimalDigits + 2];
  UChar *const end = digits + kMaxDecimalDigits + 1;
  *end = 0;
  UChar *first = cxDecimalBefore<UChar>(end, cxMagnitude(value), u'0');
  if (value < 0) *--first = u'-';
  u_strcpy(out.data(), first);
}

// Formats with ICU, whose rules for "%f" are not C's. When the array is filled, u_snprintf adds no
// terminator: the last unit is not offered to it and stays zero.
template <typename Value>
static void putFormatted(ParmText &out, const char *format, Value value) {
  u_snprintf(out.data(), kMaxParmUnits, format, value);
}

char *CxUStringParmToStr(const Parm *parm) {
  if (!parm) return nullptr;
  ParmText text{};
  switch (parm->type) {
    case ParmByte:
    case ParmChar:
      putFormatted(text, "%c", static_cast<int>(parm->value.c));
      break;
    case ParmInt32:
    case ParmInt64:  // Deliberate: one word of the slot, which is all that is copied too
      putDecimal(text, parm->value.i);
      break;
    case ParmFloat32:
      putFormatted(text, "%f", static_cast<double>(parm->value.f));
      break;
    case ParmFloat64:
      putFormatted(text, "%f", parm->value.d);
      break;
    case ParmString:
      putFormatted(text, "%s", parm->value.s);
      break;
    default:
      return nullptr;
  }
  return CxUStringDupUCharToStr(text.data());
}

// ICU's handle on the standard output stream, cached between calls; null while a call uses it. It
// is never closed at the end, as closing has nothing to give back but memory.
static std::atomic<UFILE *> keptStdout;

// Takes the cached handle, or makes one: also when the stream or the code page is another by now.
static UFILE *takeStdout() {
  UFILE *handle = keptStdout.exchange(nullptr);
  if (handle && u_fgetfile(handle) == stdout &&
      std::strcmp(u_fgetcodepage(handle), ucnv_getDefaultName()) == 0) {
    ucnv_reset(u_fgetConverter(handle));  // each call begins as a new handle would
    return handle;
  }
  if (handle) u_fclose(handle);
  return u_finit(stdout, nullptr, nullptr);
}

static void giveBackStdout(UFILE *handle) {
  UFILE *other = keptStdout.exchange(handle);  // another thread's, when two wrote at once
  if (other) u_fclose(other);
}

CxStatus CxUStringToStdout(const UChar *text) {
  if (!text) return kCxSuccess;
  UFILE *handle = takeStdout();
  if (!handle) return kCxSuccess;
  u_file_write(text, static_cast<int32_t>(cxUnitsLength(text)), handle);
  u_fputc(u'\n', handle);
  giveBackStdout(handle);
  return kCxSuccess;
}
