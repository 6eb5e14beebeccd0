// Composed messages against ICU's own, over generated patterns, locales and values. Patterns are
// generated from a fixed seed; QLX_COMPOSED_ROUNDS multiplies their number for a longer campaign.
#include "text/QlxComposed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include <unicode/umsg.h>
#include <unicode/ustring.h>

#include <qlx/buffers.h>

#include "util/CxUStringBuff.h"
#include "text/QlxMessageCache.h"

#include "support/FailingMemory.h"
#include "support/FormatResult.h"
#include "support/IcuDefaults.h"
#include "support/Locales.h"
#include "support/RandomNumbers.h"

namespace {

// A pattern parsed for this call alone.
FormatResult anew(const char *locale, const std::u16string &pattern, va_list *args) {
  for (size_t room = 1024;; room *= 64) {
    std::vector<UChar> text(room);
    va_list copy;
    va_copy(copy, *args);
    UErrorCode status = U_ZERO_ERROR;
    u_vformatMessage(locale, pattern.c_str(), static_cast<int32_t>(pattern.size()), text.data(),
                     static_cast<int32_t>(room), copy, &status);
    va_end(copy);
    if (status == U_BUFFER_OVERFLOW_ERROR || status == U_STRING_NOT_TERMINATED_WARNING) continue;
    if (U_FAILURE(status)) return {u"", status};
    return {text.data(), 0};
  }
}

FormatResult heldOnce(const char *locale, const std::u16string &pattern, va_list *args) {
  CxUStringBuff text{};
  UErrorCode status = U_ZERO_ERROR;
  const uint32_t units = qlxAppendCachedMessage(&text, locale, pattern.c_str(), args, &status);
  const FormatResult result{text.data ? text.data : u"", U_FAILURE(status) ? status : 0};
  EXPECT_EQ(units, result.text.size());
  CxUStringBuffDiscard(&text);
  return result;
}

// A parsed pattern, taken apart when that can be done.
class Message {
 public:
  Message(const char *locale, const std::u16string &pattern) : pattern_(pattern) {
    UErrorCode status = U_ZERO_ERROR;
    format_.adoptInstead(umsg_open(pattern_.c_str(), static_cast<int32_t>(pattern_.size()), locale,
                                   nullptr, &status));
    isComposed_ = U_SUCCESS(status) && qlxCompose(&composed_, pattern_, format_.getAlias());
  }

  bool isComposed() const { return isComposed_; }
  int32_t pieces() const { return composed_.pieceCount; }

  bool append(CxUStringBuff *text, ...) const {
    va_list args;
    va_start(args, text);
    const bool appended = qlxAppendComposed(text, &composed_, &args);
    va_end(args);
    return appended;
  }

 private:
  std::u16string pattern_;
  icu::LocalUMessageFormatPointer format_;
  QlxComposed composed_;
  bool isComposed_;
};

bool isComposed(const std::u16string &pattern) {
  return Message("en", pattern).isComposed();
}

// ---- Calls whose arguments have types that are known only when they are made

enum class Type { kText, kInteger, kDouble };

constexpr size_t kChosen = 4;  // arguments of any type; those behind them take turns

struct Value {
  const UChar *text;
  int32_t integer;
  double number;
};

Type typeOf(const std::array<Type, kChosen> &types, size_t argument) {
  return argument < kChosen ? types[argument] : static_cast<Type>(argument % 3);
}

struct Case {
  const char *locale;
  std::u16string pattern;
  std::array<Type, kChosen> types;
  std::array<Value, 12> values;
};

void compareList(const Case *test, ...) {
  va_list args;
  va_start(args, test);
  const FormatResult expected = anew(test->locale, test->pattern, &args);
  for (int round = 0; round < 2; ++round)  // parsed in this call, and before it
    EXPECT_EQ(heldOnce(test->locale, test->pattern, &args), expected)
        << toUtf8(test->pattern) << " in " << (test->locale ? test->locale : "null") << " with "
        << test->values[0].integer << " and " << test->values[0].number << ", round " << round;
  va_end(args);
}

template <typename... Args>
void compareRest(const Case &test, Args... args) {
  const auto &v = test.values;
  static_assert(kChosen == 4);
  compareList(&test, args..., v[4].integer, v[5].number, v[6].text, v[7].integer, v[8].number,
              v[9].text, v[10].integer, v[11].number);
}

template <typename... Args>
void compare(const Case &test, Args... args) {
  constexpr size_t kNext = sizeof...(Args);
  if constexpr (kNext == kChosen) {
    compareRest(test, args...);
  } else {
    const Value &value = test.values[kNext];
    if (test.types[kNext] == Type::kText) {
      compare(test, args..., value.text);
    } else if (test.types[kNext] == Type::kInteger) {
      compare(test, args..., value.integer);
    } else {
      compare(test, args..., value.number);
    }
  }
}

// ---- What cases are made of

const std::u16string &longText() {
  static const std::u16string text = [] {
    std::u16string made;
    for (int i = 0; i < 1500; ++i) made += static_cast<char16_t>(0x20 + i % 0x300);
    return made;
  }();
  return text;
}

const UChar *const kTexts[] = {u"value",        u"",       u"{0} it's '#' |",
                               u"\U0001F600",   u"\xD800", u"\xDC00\xD800",
                               u"\x00E4\x0661", u"a",      longText().c_str()};

constexpr int32_t kIntegers[] = {
    0,     1,       -1,        2,         5,    10,         999,           1000,
    -1000, 1234567, INT32_MAX, INT32_MIN, 9999, 1000000000, INT32_MIN + 1, -99999};

const double kNumbers[] = {0.0,
                           -0.0,
                           1,
                           -1,
                           0.5,
                           1.5,
                           2.5,
                           -2.5,
                           0.0005,
                           0.0015,
                           1234.5678,
                           -1234567.8915,
                           1e15 + 0.5,
                           9007199254740992.0,
                           9007199254740993.0,
                           1e21,
                           1e300,
                           DBL_MAX,
                           -DBL_MAX,
                           DBL_MIN,
                           DBL_TRUE_MIN,
                           -DBL_TRUE_MIN,
                           2147483648.0,
                           -2147483649.0,
                           9999.9995,
                           0.1 + 0.2,
                           std::numeric_limits<double>::quiet_NaN(),
                           -std::numeric_limits<double>::quiet_NaN(),
                           std::numeric_limits<double>::infinity(),
                           -std::numeric_limits<double>::infinity()};

const UChar *const kLiterals[] = {u"text ",      u"''",     u"'{'",    u"'{0}'",       u"it's",
                                  u"l''objet ",  u"#",      u"|",      u"\U0001F600",  u"\xD800",
                                  u"\xDC00",     u" \t\n ", u"",       u"'}' '{''}' ", u"\x200E",
                                  u"<&\x00E4>:", u"-",      u"\xFEFF", u"''''"};

// % is the argument's number, ^ that of a text.
const UChar *const kPlainTexts[] = {u"{%}", u"{ % }", u"{\t%\n}", u"{\x200E%}"};
const UChar *const kPlainIntegers[] = {u"{%,number,integer}", u"{ % , number , integer }",
                                       u"{%,number,integer }", u"{%,number, integer}"};
const UChar *const kPlainNumbers[] = {u"{%,number}", u"{ % , number }", u"{%,\tnumber}"};

const UChar *const kOtherTexts[] = {u"{%,select,value{first}other{rest}}",
                                    u"{%,select,a{[{^}]}other{'{'{%}'}'}}"};
const UChar *const kOtherIntegers[] = {u"{%,NUMBER,integer}", u"{%,number,INTEGER}"};
const UChar *const kOtherNumbers[] = {u"{%,Number}",
                                      u"{%,number,percent}",
                                      u"{%,number,currency}",
                                      u"{%,number,#.##}",
                                      u"{%,number,#,##0.0#;(#)}",
                                      u"{%,number,::compact-short}",
                                      u"{%,number,'{'#'}'}",
                                      u"{%,choice,0#none|1#one|1<more than {%,number}}",
                                      u"{%,choice,0#{^}|1#one {^}}",
                                      u"{%,plural,=0{none}one{# of {^}}other{# of {^}}}",
                                      u"{%,plural,offset:1 one{'#' #}other{#}}",
                                      u"{%,selectordinal,one{#st}two{#nd}other{#th}}",
                                      u"{%,number,}"};

// What a pattern cannot have, or what is no argument of ours.
const UChar *const kBroken[] = {u"{name}",
                                u"{0",
                                u"}",
                                u"{}",
                                u"{-1}",
                                u"{01}",
                                u"{0,}",
                                u"{0,number,",
                                u"{0 1}",
                                u"{99999999999}",
                                u"{0,{1}}",
                                u"{0;1}",
                                u"{0,nonsense}",
                                u"{name,number}"};

// With arguments of other types than a pattern asks for, or with some of them left out, ICU may
// read any of them as a text: all of them are texts then.
class Generator {
 public:
  explicit Generator(uint32_t seed) : random_(seed) {}

  Case next(const char *locale) {
    Case test{locale, u"", {}, {}};
    for (Type &type : test.types) type = static_cast<Type>(below(3));
    for (Value &value : test.values) value = {pick(kTexts), pick(kIntegers), pick(kNumbers)};
    if (isOneIn(12)) test.values[below(kChosen)].text = nullptr;
    const uint32_t kind = below(16);
    if (kind == 0) {
      test.pattern = isOneIn(2) ? twiceAsNumbers(&test) : alsoAsNumber(&test);
    } else if (kind <= 3) {
      test.pattern = looseTexts(&test);
    } else {
      test.pattern = sound(test);
    }
    return test;
  }

 private:
  uint32_t below(size_t end) { return static_cast<uint32_t>(random_() % end); }
  bool isOneIn(uint32_t count) { return below(count) == 0; }

  template <typename T, size_t n>
  T pick(T const (&table)[n]) {
    return table[below(n)];
  }

  // With every argument from 0 on, in any order and some more than once.
  std::u16string sound(const Case &test) {
    const bool hasOthers = isOneIn(4);
    const size_t used = 1 + below(isOneIn(10) ? test.values.size() : kChosen);
    std::u16string made;
    for (const size_t argument : order(0, used)) {
      for (size_t more = below(3); more > 0; --more) made += pick(kLiterals);
      made += argumentOf(test, argument, used, hasOthers && isOneIn(2));
    }
    if (isOneIn(2)) made += pick(kLiterals);
    if (isOneIn(10)) made += u'\'';
    if (isOneIn(25)) made += pick(kBroken);
    return made;
  }

  // With gaps, and with quotes that begin or end anywhere.
  std::u16string looseTexts(Case *test) {
    test->types.fill(Type::kText);
    std::u16string made;
    for (const size_t argument : order(below(kChosen), kChosen)) {
      for (size_t more = below(3); more > 0; --more) made += pick(kLiterals);
      if (isOneIn(4)) made += u'\'';
      if (!isOneIn(4)) made += argumentOf(*test, argument, kChosen, isOneIn(8));
    }
    return made;
  }

  std::u16string alsoAsNumber(Case *test) {
    test->types.fill(Type::kText);
    for (Value &value : test->values)
      if (!value.text) value.text = u"no null";
    return isOneIn(2) ? u"{0} {0,number} {1}" : u"{1} {0,number}{0}";
  }

  std::u16string twiceAsNumbers(Case *test) {
    for (Type &type : test->types) type = isOneIn(2) ? Type::kInteger : Type::kDouble;
    return isOneIn(2) ? u"{0,number}{0,number,integer}"
                      : u"{1,number} {0,number,integer} {0,number}";
  }

  std::vector<size_t> order(size_t first, size_t end) {
    std::vector<size_t> made;
    for (size_t argument = first; argument < end; ++argument) made.push_back(argument);
    for (size_t more = below(isOneIn(8) ? 30 : 3); more > 0; --more)
      made.push_back(made[below(made.size())]);
    std::shuffle(made.begin(), made.end(), random_);
    return made;
  }

  const UChar *formOf(Type type, bool other) {
    if (type == Type::kText) return other ? pick(kOtherTexts) : pick(kPlainTexts);
    if (type == Type::kInteger) return other ? pick(kOtherIntegers) : pick(kPlainIntegers);
    return other ? pick(kOtherNumbers) : pick(kPlainNumbers);
  }

  std::u16string argumentOf(const Case &test, size_t argument, size_t used, bool other) {
    const Type type = typeOf(test.types, argument);
    std::u16string form = formOf(type, other);
    size_t text = 0;
    while (text < used && typeOf(test.types, text) != Type::kText) ++text;
    if (text == used && form.find(u'^') != form.npos) form = formOf(type, false);
    std::u16string made;
    for (const char16_t unit : form)
      if (unit == u'%' || unit == u'^') {
        made += number(unit == u'%' ? argument : text);
      } else {
        made += unit;
      }
    return made;
  }

  static std::u16string number(size_t value) {
    const std::string digits = std::to_string(value);
    return {digits.begin(), digits.end()};
  }

  std::mt19937 random_;
};

int rounds() {
  const char *const factor = std::getenv("QLX_COMPOSED_ROUNDS");
  return factor ? std::max(1, std::atoi(factor)) : 1;
}

}  // namespace

// ---- The same bytes and the same errors

TEST(QlxComposedTest, GeneratedPatternsGiveInEveryLocaleWhatParsingAnewGives) {
  const std::vector<std::string> locales = allLocales();
  ASSERT_GT(locales.size(), 500U);
  Generator generator(20061);
  int composed = 0;
  for (int round = 0; round < 4 * rounds(); ++round)
    for (const std::string &locale : locales) {
      const Case test = generator.next(locale.c_str());
      composed += isComposed(test.pattern);
      compare(test);
      if (HasFailure()) return;
    }
  EXPECT_GT(composed, static_cast<int>(locales.size()) * rounds());
}

TEST(QlxComposedTest, EveryNumberIsInEveryLocaleWhatParsingAnewGives) {
  std::mt19937 random(7);
  RandomNumbers numbers(7);
  const std::u16string pattern = u"{0} {1,number,integer} {2,number} {3,number}";
  ASSERT_TRUE(isComposed(pattern));
  for (const std::string &locale : allLocales())
    for (int sample = 0; sample < 4 * rounds(); ++sample) {
      Case test{
          locale.c_str(), pattern, {Type::kText, Type::kInteger, Type::kDouble, Type::kDouble}, {}};
      for (Value &value : test.values) {
        value = {kTexts[random() % std::size(kTexts)], kIntegers[random() % std::size(kIntegers)],
                 kNumbers[random() % std::size(kNumbers)]};
        if (random() % 2) value.integer = numbers.integer();
        if (random() % 2) value.number = numbers.number();
      }
      compare(test);
      if (HasFailure()) return;
    }
}

TEST(QlxComposedTest, TheLongestPiecesAndTextsGiveWhatParsingAnewGives) {
  const std::u16string pattern = u"{0}" + longText() + u"{1,number}{0}" + longText();
  std::u16string value(20000, u'x');
  Case test{"de", pattern, {Type::kText, Type::kDouble, Type::kText, Type::kText}, {}};
  test.values[0].text = value.c_str();
  test.values[1].number = -1234567.5;
  for (const size_t length : {20000, 511, 510, 509, 1, 0}) {
    value.resize(length);
    test.values[0].text = value.c_str();
    compare(test);
  }
}

// ---- What is composed

TEST(QlxComposedTest, CommonPatternsAreComposed) {
  for (const UChar *pattern :
       {u"{0}", u"} {0}", u"{0} and {1}", u"{1} before {0}", u"{0} {0}",
        u"File {0} has {1,number} bytes", u"{0,number,integer} of {1,number,integer}", u"'{'{0}'}'",
        u"it''s {0}", u"it's {0}", u"l'objet {0} n'est pas l\x00E0", u"{0} 'open",
        u"{ 0 } { 1 , number }", u"{0, number, integer} { 1 , number , integer }",
        u"{0}{1}{2}{3}{4}{5}{6}{7}{8}{9}", u"no arguments, it''s", u"\U0001F600{0}\xD800"})
    EXPECT_TRUE(isComposed(pattern)) << toUtf8(pattern);
}

TEST(QlxComposedTest, OtherPatternsAreLeftToIcu) {
  for (const UChar *pattern :
       {u"{1}", u"{0} {2}", u"{0}{1}{2}{3}{4}{5}{6}{7}{8}{9}{10}", u"{0,number,percent}",
        u"{0,number,#}", u"{0,NUMBER}", u"{0,number,INTEGER}", u"{0,number,inte ger}", u"{0,date}",
        u"{0,time,short}", u"{0,choice,0#a|1#b}", u"{0,plural,other{#}}", u"{0,select,other{x}}",
        u"{name}", u"{0} {0,number}", u"{0,number} {0,number,integer}", u"{0", u"{}",
        u"{0,spellout}"})
    EXPECT_FALSE(isComposed(pattern)) << toUtf8(pattern);
}

TEST(QlxComposedTest, APatternOfOnePieceTooManyIsLeftToIcu) {
  std::u16string pattern;
  for (int32_t piece = 0; piece < kMaxComposedPieces; ++piece)
    pattern += piece % 2 == 0 ? u"{0}" : u"-";
  const Message most("en", pattern);
  EXPECT_TRUE(most.isComposed());
  EXPECT_EQ(most.pieces(), kMaxComposedPieces);
  EXPECT_FALSE(isComposed(pattern + u"{0}"));
  EXPECT_FALSE(isComposed(u"-" + pattern));
}

TEST(QlxComposedTest, ArgumentsOfEveryTypeArriveInTheirOrder) {
  CxUStringBuff text{};
  CxUStringBuffAppendStr(&text, "before ");
  EXPECT_TRUE(Message("en", u"{3}|{2,number}|{1,number,integer}|{0}|{1,number,integer}")
                  .append(&text, u"a", -7, 1234.5, u"d"));
  EXPECT_EQ(std::u16string(text.data), u"before d|1,234.5|-7|a|-7");
  EXPECT_EQ(text.length, 24U);
  CxUStringBuffDiscard(&text);
}

// ---- What fails

TEST(QlxComposedTest, ANullTextLeavesTheBufferAsItWas) {
  CxUStringBuff text{};
  CxUStringBuffAppendStr(&text, "before");
  const UChar *const null = nullptr;
  EXPECT_FALSE(Message("en", u"{0} {1}").append(&text, u"x", null));
  EXPECT_EQ(std::u16string(text.data), u"before");
  EXPECT_EQ(text.length, 6U);
  CxUStringBuffDiscard(&text);
}

TEST(QlxComposedTest, WithoutMemoryTheBufferStaysAsItWas) {
  const Message message("en", u"{0} {1} {0}");
  CxUStringBuff text{};
  CxUStringBuffAppendStr(&text, "before");
  const std::u16string value(400, u'x');
  {
    FailingMemory memory;
    memory.failFrom(1);
    EXPECT_FALSE(message.append(&text, value.c_str(), u"y"));
    EXPECT_EQ(memory.failures(), 1U) << "the first text fits the block, the second one does not";
  }
  EXPECT_EQ(std::u16string(text.data), u"before");
  EXPECT_EQ(text.length, 6U);
  CxUStringBuffDiscard(&text);
}

TEST(QlxComposedTest, WithoutMemoryNumbersAreWrittenThatFitTheBlock) {
  const Message message("en", u"{0,number,integer}|{1,number}");
  const std::u16string expected = u"-1,234|5.25";
  CxUStringBuff text{};
  const auto fill = [&](size_t room) {
    CxUStringBuffRestart(&text);
    while (text.length + 1 + room < text.capacity / sizeof(UChar))
      CxUStringBuffAppendChar(&text, 'x');
  };
  cxUStringBuffHasCapacity(&text, 0);
  for (const size_t room : {expected.size(), expected.size() - 1}) {
    fill(room);
    FailingMemory memory;
    memory.failFrom(1);
    const uint32_t before = text.length;
    EXPECT_EQ(message.append(&text, -1234, 5.25), room == expected.size());
    EXPECT_EQ(std::u16string(text.data + before), room == expected.size() ? expected : u"");
  }
  CxUStringBuffDiscard(&text);
}
