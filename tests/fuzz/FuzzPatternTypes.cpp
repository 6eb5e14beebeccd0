// Any units as a message's pattern: text before and behind it changes nothing, and where ICU can
// read it too, and both have the same view of quotes, blanks and words, the types are ICU's.
#include <algorithm>
#include <cstdlib>
#include <string>
#include <vector>

#include <unicode/messagepattern.h>

#include "text/QlxPatternNesting.h"
#include "text/QlxPatternTypes.h"

static void require(bool holds) {
  if (!holds) std::abort();
}

namespace {

struct Scan {
  bool readable;
  ArgTypes types;

  bool operator==(const Scan &other) const = default;
};

}  // namespace

// In a block of its own size, so that a read past the end is seen.
static Scan scan(const std::u16string &pattern) {
  const std::vector<UChar> block(pattern.c_str(), pattern.c_str() + pattern.size() + 1);
  Scan result;
  result.readable = qlxScanPatternTypes(block.data(), &result.types);
  return result;
}

// Each byte is a unit; behind a byte 1 two of them are.
static std::u16string unitsOf(const uint8_t *data, size_t size) {
  std::u16string units;
  for (size_t i = 0; i < size; ++i) {
    const bool isWide = data[i] == 1 && i + 2 < size;
    units += isWide ? static_cast<UChar>(data[i + 1] << 8 | data[i + 2]) : data[i];
    if (isWide) i += 2;
  }
  return units.c_str();
}

static void checkSurroundings(const std::u16string &pattern, const Scan &found) {
  require(scan(u"} text {10,number} " + pattern) == found);
  if (!found.readable) return;
  require(scan(pattern + u"} text") == found);
}

static ArgType typeByIcu(const icu::MessagePattern &pattern, int32_t start) {
  const UMessagePatternArgType kind = pattern.getPart(start).getArgType();
  if (kind == UMSGPAT_ARG_TYPE_NONE) return ArgType::kString;
  if (kind == UMSGPAT_ARG_TYPE_CHOICE) return ArgType::kDouble;
  if (kind != UMSGPAT_ARG_TYPE_SIMPLE) return ArgType::kNone;
  if (!pattern.partSubstringMatches(pattern.getPart(start + 2), u"number")) return ArgType::kNone;
  const icu::MessagePattern::Part &style = pattern.getPart(start + 3);
  const bool isInteger = style.getType() == UMSGPAT_PART_TYPE_ARG_STYLE &&
                         pattern.partSubstringMatches(style, u"integer");
  return isInteger ? ArgType::kInteger : ArgType::kDouble;
}

static void compareWithIcu(const std::u16string &text, const Scan &found) {
  UErrorCode status = U_ZERO_ERROR;
  const icu::MessagePattern pattern(icu::UnicodeString(text.c_str()), nullptr, status);
  if (U_FAILURE(status) || pattern.hasNamedArguments() || qlxNestsTooDeep(text)) return;
  ArgTypes types;
  types.fill(ArgType::kNone);
  for (int32_t i = 1; i < pattern.countParts(); i = pattern.getLimitPartIndex(i) + 1) {
    if (pattern.getPartType(i) != UMSGPAT_PART_TYPE_ARG_START) continue;
    const auto index = static_cast<size_t>(pattern.getPart(i + 1).getValue());
    if (index < types.size()) types[index] = typeByIcu(pattern, i);
  }
  require(found.readable && found.types == types);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::u16string pattern = unitsOf(data, size);
  const Scan found = scan(pattern);
  checkSurroundings(pattern, found);
  const auto isPlain = [](UChar c) {
    return c > u' ' && c < 0x7F && c != u'\'' && !(c >= u'A' && c <= u'Z');
  };
  if (std::ranges::all_of(pattern, isPlain)) compareWithIcu(pattern, found);
  return 0;
}
