// 8-bit strings: the runtime library's routines, each behind its rule for null.
#include <qlx/memory.h>

#include <cstdio>
#include <cstring>
#include <strings.h>

static constexpr uint32_t kNoString = 0xFFFFFFFF;  // the span of a null string

// How two strings compare when one is null; 0: both are there, compare them.
static int32_t compareNulls(const char *a, const char *b) {
  if (!a) return 1;  // Deliberate: also against null
  return b ? 0 : -1;
}

int32_t OslStringCmp(const char *a, const char *b) {
  const int32_t nulls = compareNulls(a, b);
  return nulls ? nulls : strcmp(a, b);
}

int32_t OslStringNCmp(const char *a, const char *b, uint32_t count) {
  const int32_t nulls = compareNulls(a, b);
  return nulls ? nulls : strncmp(a, b, count);
}

int32_t OslStringICmp(const char *a, const char *b) {
  const int32_t nulls = compareNulls(a, b);
  return nulls ? nulls : strcasecmp(a, b);
}

int32_t OslStringNICmp(const char *a, const char *b, uint32_t count) {
  const int32_t nulls = compareNulls(a, b);
  return nulls ? nulls : strncasecmp(a, b, count);
}

char *OslStringCat(char *destination, const char *source) {
  if (!destination || !source) return destination;
  return strcat(destination, source);
}

char *OslStringNCat(char *destination, const char *source, uint32_t count) {
  if (!destination || !source) return destination;
  return strncat(destination, source, count);
}

char *OslStringCpy(char *destination, const char *source) {
  if (!destination) return nullptr;
  return strcpy(destination, source ? source : "");
}

char *OslStringNCpy(char *destination, const char *source, uint32_t count) {
  if (!destination) return nullptr;
  if (!source) {
    destination[0] = '\0';  // Deliberate: whatever the count
    return destination;
  }
  return strncpy(destination, source, count);
}

char *OslStringDup(const char *string) {
  if (!string) return nullptr;
  const size_t size = strlen(string) + 1;
  if (size > UINT32_MAX) return nullptr;
  void *const copy = OslMemoryMalloc(static_cast<uint32_t>(size));
  return copy ? static_cast<char *>(memcpy(copy, string, size)) : nullptr;
}

uint32_t OslStringLen(const char *string) {
  return string ? static_cast<uint32_t>(strlen(string)) : 0;
}

char *OslStringChr(const char *string, int32_t character) {
  return string ? const_cast<char *>(strchr(string, character)) : nullptr;
}

char *OslStringRChr(const char *string, int32_t character) {
  return string ? const_cast<char *>(strrchr(string, character)) : nullptr;
}

char *OslStringStr(const char *string, const char *needle) {
  return string && needle ? const_cast<char *>(strstr(string, needle)) : nullptr;
}

char *OslStringStrpbrk(const char *string, const char *set) {
  return string && set ? const_cast<char *>(strpbrk(string, set)) : nullptr;
}

uint32_t OslStringStrcspn(const char *string, const char *set) {
  if (!string) return kNoString;
  return set ? static_cast<uint32_t>(strcspn(string, set)) : OslStringLen(string);
}

uint32_t OslStringStrspn(const char *string, const char *set) {
  if (!string) return kNoString;
  return set ? static_cast<uint32_t>(strspn(string, set)) : 0;
}

int32_t OslStringSprintf(char *destination, const char *format, ...) {
  va_list args;
  va_start(args, format);
  const int32_t written = vsprintf(destination, format, args);
  va_end(args);
  return written;
}
