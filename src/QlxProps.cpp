// Property values: strings in a map, read and written as typed values. These conversions are the
// only ones; objects, configurations and events are three ways to reach a map.
#include "QlxProps.h"

#include <cstdio>
#include <limits>

#include <qlx/class/containers/StringToStringMap.h>
#include <qlx/ustring.h>

#include "util/CxOwned.h"

static void report(uint8_t *ok, bool success) {
  if (ok) *ok = success;
}

uint8_t qlxPropStrToBool(const char *value, uint8_t *ok) {
  const bool isTrue = OslStringICmp(value, "true") == 0;
  report(ok, isTrue || OslStringICmp(value, "false") == 0);
  return isTrue;
}

char qlxPropStrToChar(const char *value, uint8_t *ok) {
  report(ok, value != nullptr);
  return value ? *value : '\0';
}

// Success is that exactly one value was converted: what follows it does not matter.
template <typename T>
static T scan(const char *value, const char *format, uint8_t *ok) {
  T result{};
  const bool converted = value && std::sscanf(value, format, &result) == 1;
  report(ok, converted);
  return converted ? result : T{};
}

// A plain number of digits that always fit, which is nearly every one, without the scanner's cost.
template <typename T>
static bool readDigits(const char *value, T *result) {
  constexpr int kMaxDigits = std::numeric_limits<T>::digits10;
  T number = 0;
  int digits = 0;
  for (; value[digits] >= '0' && value[digits] <= '9' && digits < kMaxDigits; ++digits) {
    number = number * 10 + (value[digits] - '0');
  }
  *result = number;
  return digits > 0 && value[digits] == '\0';
}

template <typename T>
static T scanWhole(const char *value, const char *format, uint8_t *ok) {
  T number = 0;
  if (!value || !readDigits(value, &number)) return scan<T>(value, format, ok);
  report(ok, true);
  return number;
}

int32_t qlxPropStrToInt32(const char *value, uint8_t *ok) {
  return scanWhole<int>(value, "%d", ok);
}

int64_t qlxPropStrToInt64(const char *value, uint8_t *ok) {
  return scanWhole<long long>(value, "%lld", ok);
}

float qlxPropStrToFloat32(const char *value, uint8_t *ok) {
  return scan<float>(value, "%f", ok);
}

double qlxPropStrToFloat64(const char *value, uint8_t *ok) {
  return scan<double>(value, "%lf", ok);
}

const char *qlxPeekMapProp(const StringToStringMap *map, const char *key) {
  const StringToStringMapNode *node =
      qlxIntlStringToStringMapGetNode(const_cast<StringToStringMap *>(map), key);
  return node ? node->value : nullptr;
}

char *QlxGetMapProp(StringToStringMap *map, const char *key, uint8_t *found) {
  char *copy = OslStringDup(qlxPeekMapProp(map, key));
  report(found, copy != nullptr);
  return copy;
}

uint8_t QlxSetMapProp(StringToStringMap *map, const char *key, const char *value) {
  return qlxIntlStringToStringMapPut(map, key, value);
}

uint8_t QlxGetMapPropBool(StringToStringMap *map, const char *key, uint8_t *ok) {
  return qlxPropStrToBool(qlxPeekMapProp(map, key), ok);
}

// Deliberate: only exactly 1 is true.
uint8_t QlxSetMapPropBool(StringToStringMap *map, const char *key, uint8_t value) {
  return QlxSetMapProp(map, key, value == 1 ? "true" : "false");
}

// Stores the text of a parameter; nothing when it has none.
static void setParm(StringToStringMap *map, const char *key, const Parm &parm) {
  const OwnedStr text{CxUStringParmToStr(&parm)};
  if (text) QlxSetMapProp(map, key, text.get());
}

#define QLX_MAP_PROPERTY(Name, Type, Convert, Code, member)                        \
  Type QlxGetMapProp##Name(StringToStringMap *map, const char *key, uint8_t *ok) { \
    return Convert(qlxPeekMapProp(map, key), ok);                                  \
  }                                                                                \
  void QlxSetMapProp##Name(StringToStringMap *map, const char *key, Type value) {  \
    setParm(map, key, Parm{.type = (Code), .value = {.member = value}});           \
  }

QLX_MAP_PROPERTY(Char, char, qlxPropStrToChar, ParmChar, c)
QLX_MAP_PROPERTY(Int, int32_t, qlxPropStrToInt32, ParmInt32, i)
QLX_MAP_PROPERTY(Long, int64_t, qlxPropStrToInt64, ParmInt64, l)  // writes the low word only
QLX_MAP_PROPERTY(Float, float, qlxPropStrToFloat32, ParmFloat32, f)
QLX_MAP_PROPERTY(Double, double, qlxPropStrToFloat64, ParmFloat64, d)

#undef QLX_MAP_PROPERTY
