// Any units as a message's pattern: where ICU can read it, its levels are those that ICU counts;
// where it cannot, ICU comes no deeper than what is told. So nothing is refused that ICU takes at
// the limit, and nothing deeper gets to it.
#include "text/QlxPatternNesting.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include <unicode/messagepattern.h>

static void require(bool holds) {
  if (!holds) std::abort();
}

// Words that patterns are made of, so that levels come quickly.
static constexpr const char16_t *kWords[] = {
    u"{0,select,other{",
    u"{0,plural,other{",
    u"{0,choice,0#",
    u"{0,selectordinal,offset:1 =1{",
    u"{0,number,",
    u"{0,date,",
    u"}}",
    u"}",
    u"'{'",
    u"''",
    u"'|'",
    u"'#",
    u"|1<",
    u"other{",
    u"\u2264",
    u"\u200E",
};

// A byte below 16 is a word; any other is a unit.
static std::u16string unitsOf(const uint8_t *data, size_t size) {
  std::u16string units;
  for (const uint8_t byte : std::vector<uint8_t>(data, data + size)) {
    if (byte < std::size(kWords))
      units += kWords[byte];
    else
      units += static_cast<char16_t>(byte);
  }
  return units;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::u16string units = unitsOf(data, size);
  const std::vector<char16_t> block(units.begin(), units.end());  // of its own size
  const int found = qlxPatternNesting({block.data(), block.size()});
  require(found >= 0 && found <= kMaxPatternNesting + 1);
  UErrorCode status = U_ZERO_ERROR;
  icu::MessagePattern pattern(status);
  pattern.parse(icu::UnicodeString(units.data(), static_cast<int32_t>(units.size())), nullptr,
                status);
  int nesting = 0;
  for (int32_t i = 0; i < pattern.countParts(); ++i)
    if (pattern.getPartType(i) == UMSGPAT_PART_TYPE_MSG_START)
      nesting = std::max(nesting, static_cast<int>(pattern.getPart(i).getValue()));
  nesting = std::min(nesting, kMaxPatternNesting + 1);
  require(U_SUCCESS(status) ? found == nesting : found >= nesting);
  return 0;
}
