#include <qlx/kmsid.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <string>
#include <string_view>

namespace {

struct Layout {
  std::string_view pattern;  // L a letter, D a digit, S a severity
  const char *version;
  int32_t number;
};

constexpr Layout kLayouts[] = {
    {"LLLLLLDDDS", "ZQX6.3.1", 631},  {"LLLLLDDS", "ZQX5.2.1", 521},
    {"LLLLLDDDDS", "ZQX45.4.1", 541}, {"LLLLLDDDS", "ZQX5.3.1", 531},
    {"LLLLDDDDS", "ZQX4.4.1", 441},   {"LLLLDDDS", "ZQX4.3.1", 431},
    {"LLLLDDDDDS", "ZQX4.5.1", 451},  {"LLLDDDDS", "ZQX3.4.1", 341},
    {"LLLDDDS", "ZQX3.3.1", 331},     {"LLLDDDDDS", "ZQX3.5.1", 351},
    {"LLLDDDDDDS", "ZQX3.6.1", 361},
};

std::string idOf(const CxKMSIDInfo &info) {
  return {info.id, static_cast<size_t>(info.length)};
}

// "version number length id severity", where 0 stands for the severity of what has none.
std::string parsed(const char *text) {
  const CxKMSIDInfo info = CxParseKMSID(text);
  return std::string(info.version) + " " + std::to_string(info.number) + " " +
         std::to_string(info.length) + " " + idOf(info) + " " +
         (info.severity ? info.severity : '0');
}

constexpr const char *kNothing = " 0 0  0";

// ---- Layouts

TEST(KMSIDTest, AnIdentifierIsFoundAtTheStartOfALongerText) {
  EXPECT_EQ(parsed("ABC0001E: no such file"), "ZQX3.4.1 341 8 ABC0001E E");
  EXPECT_EQ(parsed("ABC0001E"), "ZQX3.4.1 341 8 ABC0001E E");
}

TEST(KMSIDTest, EachLayoutHasItsVersionItsNumberAndItsLength) {
  EXPECT_EQ(parsed("ABCDEF123I"), "ZQX6.3.1 631 10 ABCDEF123I 0");
  EXPECT_EQ(parsed("ABCDE12W"), "ZQX5.2.1 521 8 ABCDE12W W");
  EXPECT_EQ(parsed("ABCDE123W"), "ZQX5.3.1 531 9 ABCDE123W W");
  EXPECT_EQ(parsed("ABCD123E"), "ZQX4.3.1 431 8 ABCD123E E");
  EXPECT_EQ(parsed("ABCD1234E"), "ZQX4.4.1 441 9 ABCD1234E E");
  EXPECT_EQ(parsed("ABCD12345E"), "ZQX4.5.1 451 10 ABCD12345E 0");
  EXPECT_EQ(parsed("ABC123I"), "ZQX3.3.1 331 7 ABC123I I");
  EXPECT_EQ(parsed("ABC12345I"), "ZQX3.5.1 351 9 ABC12345I I");
  EXPECT_EQ(parsed("ABC123456I"), "ZQX3.6.1 361 10 ABC123456I 0");
}

TEST(KMSIDTest, FiveLettersAndFourDigitsHaveAnIrregularVersionName) {
  EXPECT_EQ(parsed("ABCDE1234E"), "ZQX45.4.1 541 10 ABCDE1234E 0");
}

TEST(KMSIDTest, TenCharactersLeaveNoRoomForTheSeverity) {
  const CxKMSIDInfo info = CxParseKMSID("ABCDEF123E and more");
  EXPECT_EQ(info.length, 10);
  EXPECT_EQ(info.severity, 0);
  EXPECT_EQ(info.id[9], 'E') << "it is the identifier's last character";
}

TEST(KMSIDTest, AShorterIdentifierIsTerminated) {
  const CxKMSIDInfo info = CxParseKMSID("ABC123Eand more");
  EXPECT_STREQ(info.id, "ABC123E");
  EXPECT_EQ(std::count(info.id, info.id + sizeof info.id, '\0'), 3);
}

// ---- Characters

TEST(KMSIDTest, LowerCaseLettersCountAsLetters) {
  EXPECT_EQ(parsed("abC0001E"), "ZQX3.4.1 341 8 abC0001E E");
  EXPECT_EQ(parsed("azAZz12I"), "ZQX5.2.1 521 8 azAZz12I I");
}

TEST(KMSIDTest, ALowerCaseSeverityIsNone) {
  for (const char *text : {"ABC0001i", "ABC0001w", "ABC0001e"}) EXPECT_EQ(parsed(text), kNothing);
}

TEST(KMSIDTest, OnlyThreeLettersAreSeverities) {
  for (int c = 1; c < 256; ++c) {
    const std::string text = std::string("ABC123") + static_cast<char>(c);
    const bool isSeverity = c == 'I' || c == 'W' || c == 'E';
    EXPECT_EQ(CxParseKMSID(text.c_str()).length, isSeverity ? 7 : 0) << c;
  }
}

TEST(KMSIDTest, SeveritiesAreLettersToo) {
  EXPECT_EQ(parsed("WIE123E"), "ZQX3.3.1 331 7 WIE123E E");
  EXPECT_EQ(parsed("ABCE123E"), "ZQX4.3.1 431 8 ABCE123E E");
}

TEST(KMSIDTest, LettersAndDigitsAreThoseOfAscii) {
  for (const char *text : {"\xC3\x84"
                           "BC123E",
                           "ABC12\xB2"
                           "E",
                           "AB@123E", "AB[123E", "AB`123E", "AB{123E", "ABC12:E", "ABC12/E"})
    EXPECT_EQ(parsed(text), kNothing) << text;
}

// ---- What is none

TEST(KMSIDTest, NullAndAnEmptyTextAreNothing) {
  EXPECT_EQ(parsed(nullptr), kNothing);
  EXPECT_EQ(parsed(""), kNothing);
}

TEST(KMSIDTest, ATextThatEndsTooEarlyIsNothing) {
  for (const std::string_view whole : {"ABCDEF123E", "ABCDE1234E", "ABCD12345E", "ABC123456E"})
    for (size_t length = 0; length < whole.size(); ++length)
      EXPECT_EQ(parsed(std::string(whole, 0, length).c_str()), kNothing) << whole << length;
}

TEST(KMSIDTest, MoreThanSixLettersOrFewerThanThreeAreNothing) {
  for (const char *text :
       {"ABCDEFG12E", "ABCDEFG123E", "AB1234E", "A12345E", "123456E", " ABC123E"})
    EXPECT_EQ(parsed(text), kNothing) << text;
}

TEST(KMSIDTest, ANumberOfDigitsThatNoLayoutHasIsNothing) {
  for (const char *text : {"ABC12E", "ABC1234567E", "ABCD12E", "ABCD123456E", "ABCDE1E",
                           "ABCDE12345E", "ABCDEF12E", "ABCDEF1234E", "ABCDEFE", "ABCE"})
    EXPECT_EQ(parsed(text), kNothing) << text;
}

TEST(KMSIDTest, WhatFollowsTheTenthCharacterIsNotLookedAt) {
  for (const char *behind : {"", "1", "E", "x", " "}) {
    EXPECT_EQ(CxParseKMSID((std::string("ABCDEF123E") + behind).c_str()).number, 631) << behind;
    EXPECT_EQ(CxParseKMSID((std::string("ABC123456E") + behind).c_str()).number, 361) << behind;
  }
}

// ---- All texts, by class of character

bool fits(char wanted, char c) {
  const bool isLetter = (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
  if (wanted == 'L') return isLetter;
  if (wanted == 'D') return c >= '0' && c <= '9';
  return c == 'I' || c == 'W' || c == 'E';
}

// The layout of a text: the first whose pattern its start has.
const Layout *layoutOf(std::string_view text) {
  for (const Layout &layout : kLayouts) {
    size_t at = 0;
    while (at < layout.pattern.size() && at < text.size() && fits(layout.pattern[at], text[at]))
      ++at;
    if (at == layout.pattern.size()) return &layout;
  }
  return nullptr;
}

bool agrees(std::string_view text, const CxKMSIDInfo &info) {
  const Layout *layout = layoutOf(text);
  CxKMSIDInfo wanted{layout ? layout->version : "", layout ? layout->number : 0, 0, {}, 0};
  if (layout) {
    wanted.length = static_cast<int32_t>(layout->pattern.size());
    text.copy(wanted.id, layout->pattern.size());
    if (wanted.length < 10) wanted.severity = text[layout->pattern.size() - 1];
  }
  return std::strcmp(info.version, wanted.version) == 0 && info.number == wanted.number &&
         info.length == wanted.length && info.severity == wanted.severity &&
         std::memcmp(info.id, wanted.id, sizeof wanted.id) == 0;
}

// Every text of up to ten characters, one of each class: a letter, a letter that is a severity, a
// digit, a letter of lower case, and something else. A start that is none is made a bit longer
// only.
class EveryText {
 public:
  void compare() {
    check();
    const bool hopeless =
        length_ > 4 && !(fits('L', text_[0]) && fits('L', text_[1]) && fits('L', text_[2]));
    if (length_ == kMaxChars || hopeless) return;
    for (const char c : {'Q', 'W', '7', 'e', '-'}) {
      text_[length_++] = c;
      compare();
      text_[--length_] = 0;
    }
  }

  size_t checked() const { return checked_; }
  size_t recognised() const { return recognised_; }

 private:
  static constexpr size_t kMaxChars = 10;

  void check() {
    const CxKMSIDInfo info = CxParseKMSID(text_);
    ++checked_;
    recognised_ += info.length > 0;
    if (!agrees({text_, length_}, info)) ADD_FAILURE() << text_ << ": " << parsed(text_);
  }

  char text_[kMaxChars + 1] = {};
  size_t length_ = 0;
  size_t checked_ = 0;
  size_t recognised_ = 0;
};

TEST(KMSIDTest, EveryTextOfTenCharactersIsReadAsItsLayoutSays) {
  EveryText texts;
  texts.compare();
  EXPECT_GT(texts.checked(), 2'500'000U);
  EXPECT_GT(texts.recognised(), 10'000U);
}

}  // namespace
