// Any decimal format and any number: what a shape writes is what the format writes.
#include <cstdlib>
#include <cstring>
#include <iterator>

#include <unicode/dcfmtsym.h>
#include <unicode/decimfmt.h>

#include "text/QlxNumberShape.h"

static void require(bool holds) {
  if (!holds) std::abort();
}

namespace {

// Takes values from the front of the input; zeros behind its end.
class Input {
 public:
  Input(const uint8_t *data, size_t size) : at_(data), end_(data + size) {}

  bool isEmpty() const { return at_ == end_; }

  template <typename Value>
  Value take() {
    uint8_t bytes[sizeof(Value)] = {};
    for (size_t i = 0; i < sizeof bytes && !isEmpty(); ++i) bytes[i] = *at_++;
    Value value;
    std::memcpy(&value, bytes, sizeof value);
    return value;
  }

 private:
  const uint8_t *at_, *const end_;
};

}  // namespace

static constexpr const char *kLocales[] = {"en", "de_CH", "hi", "ar_EG", "bn", "fa", "sv", "he"};

static void change(icu::DecimalFormat *format, Input *input) {
  format->setMaximumFractionDigits(input->take<uint8_t>() % 9);
  format->setGroupingUsed(static_cast<UBool>(input->take<uint8_t>() % 4 != 0));
  format->setGroupingSize(input->take<uint8_t>() % 10);
  format->setSecondaryGroupingSize(input->take<uint8_t>() % 10);
  format->setMinimumGroupingDigits(input->take<uint8_t>() % 10);
  icu::UnicodeString affix;
  for (int left = input->take<uint8_t>() % 9; left > 0; --left)
    affix.append(static_cast<UChar>(input->take<uint8_t>()));
  if (!affix.isEmpty()) format->setNegativePrefix(affix);
}

template <typename Number>
static void check(const icu::NumberFormat &format, Number value, const UChar *text,
                  const UChar *end) {
  if (!end) return;
  icu::UnicodeString expected;
  format.format(value, expected);
  require(expected == icu::UnicodeString(false, text, static_cast<int32_t>(end - text)));
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  Input input(data, size);
  UErrorCode status = U_ZERO_ERROR;
  const icu::Locale locale(kLocales[input.take<uint8_t>() % std::size(kLocales)]);
  icu::DecimalFormat format("#,##0.###", new icu::DecimalFormatSymbols(locale, status), status);
  if (U_FAILURE(status)) return 0;
  change(&format, &input);
  NumberShape doubles, integers;
  const bool hasDoubles = qlxTakeNumberShape(&doubles, &format, ArgType::kDouble);
  const bool hasIntegers = qlxTakeNumberShape(&integers, &format, ArgType::kInteger);
  while (!input.isEmpty()) {
    UChar text[kMaxShapedUnits];
    const auto number = input.take<double>();
    if (hasDoubles) check(format, number, text, qlxWriteShapedDouble(doubles, number, text));
    const auto integer = input.take<int32_t>();
    if (hasIntegers) check(format, integer, text, qlxWriteShapedInteger(integers, integer, text));
  }
  return 0;
}
