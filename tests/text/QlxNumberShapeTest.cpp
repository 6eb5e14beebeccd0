// Numbers written by a shape against those that the format itself writes. The random values have a
// fixed seed; QLX_SHAPE_ROUNDS multiplies their number for a longer campaign.
#include "text/QlxNumberShape.h"

#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <functional>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include <unicode/dcfmtsym.h>
#include <unicode/decimfmt.h>
#include <unicode/rbnf.h>

#include "support/Locales.h"
#include "support/RandomNumbers.h"

namespace {

using Format = std::unique_ptr<icu::NumberFormat>;
using Decimal = std::unique_ptr<icu::DecimalFormat>;

Format doublesOf(const char *locale) {
  UErrorCode status = U_ZERO_ERROR;
  return Format{icu::NumberFormat::createInstance(icu::Locale(locale), status)};
}

Format integersOf(const char *locale) {
  UErrorCode status = U_ZERO_ERROR;
  icu::NumberFormat *made =
      icu::NumberFormat::createInstance(icu::Locale(locale), UNUM_DECIMAL, status);
  made->setMaximumFractionDigits(0);
  made->setParseIntegerOnly(true);
  return Format{made};
}

Decimal withPattern(const char *pattern, const char *locale = "en") {
  UErrorCode status = U_ZERO_ERROR;
  return Decimal{new icu::DecimalFormat(
      pattern, new icu::DecimalFormatSymbols(icu::Locale(locale), status), status)};
}

template <typename Number>
std::string formatted(const icu::NumberFormat &format, Number value) {
  icu::UnicodeString text;
  std::string bytes;
  return format.format(value, text).toUTF8String(bytes);
}

std::string toUtf8(const UChar *text, const UChar *end) {
  std::string bytes;
  return icu::UnicodeString(text, static_cast<int32_t>(end - text)).toUTF8String(bytes);
}

std::string written(const NumberShape &shape, int32_t value) {
  UChar text[kMaxShapedUnits];
  return toUtf8(text, qlxWriteShapedInteger(shape, value, text));
}

constexpr char kLeft[] = "left to the format";

std::string written(const NumberShape &shape, double value) {
  UChar text[kMaxShapedUnits];
  const UChar *const end = qlxWriteShapedDouble(shape, value, text);
  return end ? toUtf8(text, end) : kLeft;
}

NumberShape shapeOf(const icu::NumberFormat &format, ArgType type = ArgType::kDouble) {
  NumberShape shape;
  EXPECT_TRUE(qlxTakeNumberShape(&shape, &format, type));
  return shape;
}

bool hasShape(const icu::NumberFormat &format) {
  NumberShape shape;
  return qlxTakeNumberShape(&shape, &format, ArgType::kDouble);
}

// ---- Comparing

int rounds() {
  const char *const factor = std::getenv("QLX_SHAPE_ROUNDS");
  return factor ? std::max(1, std::atoi(factor)) : 1;
}

struct Written {
  int64_t byShape, all;
};

Written compareDoubles(const icu::NumberFormat &format, int64_t count, uint64_t seed) {
  const NumberShape shape = shapeOf(format);
  RandomNumbers values(seed);
  Written seen{0, count};
  for (int64_t i = 0; i < count; ++i) {
    const double value = values.number();
    const std::string text = written(shape, value);
    if (text == kLeft) continue;
    ++seen.byShape;
    EXPECT_EQ(text, formatted(format, value)) << std::hexfloat << value;
    if (::testing::Test::HasFailure()) break;
  }
  return seen;
}

void compareIntegers(const icu::NumberFormat &format, int64_t count, uint64_t seed) {
  const NumberShape shape = shapeOf(format, ArgType::kInteger);
  RandomNumbers values(seed);
  for (int64_t i = 0; i < count && !::testing::Test::HasFailure(); ++i) {
    const int32_t value = values.integer();
    EXPECT_EQ(written(shape, value), formatted(format, value));
  }
}

}  // namespace

// ---- The same text

TEST(QlxNumberShapeTest, NumbersOfEveryLocaleAreWhatTheFormatWrites) {
  int locales = 0, shaped = 0;
  for (const std::string &locale : allLocales()) {
    const Format doubles = doublesOf(locale.c_str()), integers = integersOf(locale.c_str());
    ++locales;
    if (!hasShape(*doubles)) continue;
    ++shaped;
    compareDoubles(*doubles, 20 * rounds(), static_cast<uint64_t>(locales));
    compareIntegers(*integers, 10 * rounds(), static_cast<uint64_t>(locales));
    ASSERT_FALSE(HasFailure()) << locale;
  }
  EXPECT_GT(shaped, locales * 9 / 10);
}

TEST(QlxNumberShapeTest, NumbersOfManyKindsAreWhatTheFormatWrites) {
  Written all{0, 0};
  for (const char *locale : {"en", "de_CH", "hi", "ar_EG", "bn", "es", "pl", "fa", "en_US_POSIX",
                             "zh@numbers=hanidec", "sv", "he"}) {
    const Format format = doublesOf(locale);
    const Written seen = compareDoubles(*format, 3000 * rounds(), 7);
    compareIntegers(*integersOf(locale), 1000 * rounds(), 11);
    ASSERT_FALSE(HasFailure()) << locale;
    all = {all.byShape + seen.byShape, all.all + seen.all};
  }
  EXPECT_GT(all.byShape, all.all / 3);
  RecordProperty("writtenByShapes", std::to_string(all.byShape));
  RecordProperty("values", std::to_string(all.all));
}

TEST(QlxNumberShapeTest, EveryNumberOfFractionDigitsIsWhatTheFormatWrites) {
  for (int32_t digits = 0; digits <= 6; ++digits) {
    const Format format = doublesOf("en");
    format->setMaximumFractionDigits(digits);
    compareDoubles(*format, 2000 * rounds(), static_cast<uint64_t>(digits));
    ASSERT_FALSE(HasFailure()) << digits;
  }
}

TEST(QlxNumberShapeTest, GroupsAndAffixesAreWhatTheFormatWrites) {
  for (const char *pattern :
       {"#,##0.###", "#,##,##0.###", "#,#,##,0.##", "0.###", "#,###0.##", "'a'#,##0'b';'minus '0",
        "#,##0.#;(#,##0.#)", "<>0.###'1234567'", "+#,##0.##"}) {
    const Decimal format = withPattern(pattern);
    compareDoubles(*format, 1000 * rounds(), 3);
    compareIntegers(*format, 1000 * rounds(), 5);
    ASSERT_FALSE(HasFailure()) << pattern;
  }
  const Decimal format = withPattern("#,##0.###");
  for (int32_t digits = 1; digits < 8; ++digits) {
    format->setMinimumGroupingDigits(digits);
    compareDoubles(*format, 1000 * rounds(), 13);
    compareIntegers(*format, 1000 * rounds(), 17);
    ASSERT_FALSE(HasFailure()) << digits;
  }
}

TEST(QlxNumberShapeTest, KnownNumbersHaveTheirText) {
  const NumberShape shape = shapeOf(*doublesOf("en"));
  EXPECT_EQ(written(shape, 0.0), "0");
  EXPECT_EQ(written(shape, 2.75), "2.75");
  EXPECT_EQ(written(shape, -1234.5678), "-1,234.568");
  EXPECT_EQ(written(shape, 0.9996), "1");
  EXPECT_EQ(written(shape, 999999.9996), "1,000,000");
  EXPECT_EQ(written(shape, 0.001), "0.001");
  EXPECT_EQ(written(shape, 100.01), "100.01");
  EXPECT_EQ(written(shape, 1e12), "1,000,000,000,000");
  EXPECT_EQ(written(shape, INT32_MIN), "-2,147,483,648");
  EXPECT_EQ(written(shapeOf(*doublesOf("en_IN")), 12345678.0), "1,23,45,678");
  EXPECT_EQ(written(shapeOf(*doublesOf("de")), -1000.5), "-1.000,5");
}

// ---- What is left to the format

TEST(QlxNumberShapeTest, ValuesWhoseRoundingIsNotPlainAreLeftToTheFormat) {
  const NumberShape shape = shapeOf(*doublesOf("en"));
  constexpr double kInfinity = std::numeric_limits<double>::infinity();
  for (const double value : {-0.0, -0.0001, -DBL_TRUE_MIN, 0.0005, 1.0005, -2.0625, 1234567.8915,
                             std::nextafter(1.0005, 2), 1.2e12, -1e300, kInfinity, -kInfinity,
                             std::numeric_limits<double>::quiet_NaN()})
    EXPECT_EQ(written(shape, value), kLeft) << value;
  for (const double value : {0.0001, DBL_TRUE_MIN, 1.00051, 1.00049, 1.1e12, -1.1e12})
    EXPECT_NE(written(shape, value), kLeft) << value;
}

TEST(QlxNumberShapeTest, FormatsOfOtherClassesHaveNoShape) {
  UErrorCode status = U_ZERO_ERROR;
  EXPECT_FALSE(hasShape(*doublesOf("de@numbers=roman")));
  EXPECT_FALSE(hasShape(icu::RuleBasedNumberFormat(icu::URBNF_SPELLOUT, "en", status)));
  NumberShape shape;
  EXPECT_FALSE(qlxTakeNumberShape(&shape, nullptr, ArgType::kInteger));
}

TEST(QlxNumberShapeTest, UnusualPatternsHaveNoShape) {
  EXPECT_TRUE(hasShape(*withPattern("#,##0.###")));
  EXPECT_TRUE(hasShape(*withPattern("'six   '0'seven  '")));
  for (const char *pattern :
       {"0.###E0", "@@#", "0.00", "#,#00.##", ".00", "0.5", "*x#,##0.##", "0.##%", "0.##\u2030",
        "0.#######", "0.", "'seven  '0", "0'eight   '"})
    EXPECT_FALSE(hasShape(*withPattern(pattern))) << pattern;
}

TEST(QlxNumberShapeTest, UnusualSettingsHaveNoShape) {
  using Change = std::function<void(icu::DecimalFormat &)>;
  const Change changes[] = {
      [](auto &format) { format.setRoundingMode(icu::NumberFormat::kRoundDown); },
      [](auto &format) { format.setRoundingMode(icu::NumberFormat::kRoundHalfUp); },
      [](auto &format) { format.setRoundingIncrement(0.25); },
      [](auto &format) { format.setSignAlwaysShown(true); },
      [](auto &format) { format.setDecimalSeparatorAlwaysShown(true); },
      [](auto &format) { format.setMultiplier(3); },
      [](auto &format) { format.setMultiplierScale(-2); },
      [](auto &format) { format.setScientificNotation(true); },
      [](auto &format) { format.setSignificantDigitsUsed(true); },
      [](auto &format) { format.setFormatWidth(12); },
      [](auto &format) { format.setMinimumIntegerDigits(0); },
      [](auto &format) { format.setMinimumIntegerDigits(3); },
      [](auto &format) { format.setMaximumIntegerDigits(4); },
      [](auto &format) { format.setMinimumFractionDigits(1); },
      [](auto &format) { format.setMaximumFractionDigits(7); },
      [](auto &format) { format.setMinimumGroupingDigits(40); },
  };
  for (const Change &change : changes) {
    const Decimal format = withPattern("#,##0.###");
    change(*format);
    EXPECT_FALSE(hasShape(*format)) << "change " << &change - changes;
  }
}

TEST(QlxNumberShapeTest, SymbolsOfMoreThanOneUnitHaveNoShape) {
  using Symbols = icu::DecimalFormatSymbols;
  for (const auto symbol :
       {Symbols::kDecimalSeparatorSymbol, Symbols::kGroupingSeparatorSymbol,
        Symbols::kZeroDigitSymbol, Symbols::kOneDigitSymbol, Symbols::kNineDigitSymbol})
    for (const UChar *text : {u"xy", u"\U0001F600", u""}) {
      const Decimal format = withPattern("#,##0.###");
      Symbols symbols(*format->getDecimalFormatSymbols());
      symbols.setSymbol(symbol, text, false);
      format->setDecimalFormatSymbols(symbols);
      EXPECT_FALSE(hasShape(*format)) << symbol;
    }
  EXPECT_FALSE(hasShape(*doublesOf("ccp@numbers=native"))) << "digits of two units";
}

// Numbers of one kind do not come out as the settings say.
class OtherThanItSays : public icu::DecimalFormat {
 public:
  OtherThanItSays(UErrorCode &status, bool integers)
      : icu::DecimalFormat("#,##0.###", status), integers_(integers) {}

  using icu::DecimalFormat::format;
  icu::UnicodeString &format(double value, icu::UnicodeString &text,
                             icu::FieldPosition &position) const override {
    if (!integers_ && value == 1000) return text.append(u"1000");
    return icu::DecimalFormat::format(value, text, position);
  }
  icu::UnicodeString &format(int32_t value, icu::UnicodeString &text,
                             icu::FieldPosition &position) const override {
    if (integers_ && value == 1000) return text.append(u"1000");
    return icu::DecimalFormat::format(value, text, position);
  }

 private:
  bool integers_;
};

TEST(QlxNumberShapeTest, AFormatThatWritesAnyNumberOtherwiseHasNoShape) {
  for (const bool integers : {false, true}) {
    UErrorCode status = U_ZERO_ERROR;
    const OtherThanItSays format(status, integers);
    NumberShape shape;
    EXPECT_EQ(qlxTakeNumberShape(&shape, &format, ArgType::kDouble), integers);
    EXPECT_EQ(qlxTakeNumberShape(&shape, &format, ArgType::kInteger), !integers);
  }
}
