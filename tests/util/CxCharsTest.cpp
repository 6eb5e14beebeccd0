#include <gtest/gtest.h>

#include <cctype>
#include <cstring>
#include <iconv.h>
#include <string>
#include <utility>
#include <vector>

#include <qlx/memory.h>

namespace {

TEST(CxCharsTest, DigitsAndLettersAreThoseOfAscii) {
  for (int c = 0; c < 256; ++c) {
    const bool digit = c >= '0' && c <= '9';
    const bool letter = c < 128 && isalpha(c);
    EXPECT_EQ(CxIsASCIIDigit(c), digit ? 1 : 0) << c;
    EXPECT_EQ(CxIsLocalDigit(c), digit ? 1 : 0) << c;
    EXPECT_EQ(CxIsASCIIAlpha(c), letter ? 1 : 0) << c;
  }
}

TEST(CxCharsTest, OnlyTheLowByteCounts) {
  for (const int32_t high : {0x100, 0x7FFFFF00, -0x100}) {
    EXPECT_EQ(CxIsASCIIDigit(high + '0'), 1);
    EXPECT_EQ(CxIsLocalDigit(high + '9'), 1);
    EXPECT_EQ(CxIsASCIIAlpha(high + 'z'), 1);
    EXPECT_EQ(CxIsASCIIDigit(high + 'a'), 0);
  }
}

TEST(CxCharsTest, EtoaChangesNoByte) {
  std::string all;
  for (int c = 0; c < 256; ++c) all.push_back(static_cast<char>(c));
  std::string converted = all;
  CxETOA(converted.data(), 256);
  EXPECT_EQ(converted, all);
  CxETOA(nullptr, 0);
  CxETOA(nullptr, 4);
}

using Exceptions = std::vector<std::pair<uint8_t, uint8_t>>;

// The system's own mapping of all 256 bytes, with some of them changed.
std::vector<uint8_t> published(const char *codePage, const Exceptions &exceptions) {
  std::string in;
  for (int c = 0; c < 256; ++c) in.push_back(static_cast<char>(c));
  std::vector<uint8_t> out(256);
  const iconv_t converter = iconv_open("ISO-8859-1", codePage);
  if (converter == reinterpret_cast<iconv_t>(-1)) {
    ADD_FAILURE() << "no converter for " << codePage;
    return out;
  }
  char *from = in.data();
  char *to = reinterpret_cast<char *>(out.data());
  size_t fromLeft = in.size();
  size_t toLeft = out.size();
  EXPECT_EQ(iconv(converter, &from, &fromLeft, &to, &toLeft), 0u);
  EXPECT_EQ(toLeft, 0u);
  iconv_close(converter);
  for (const auto &[ebcdic, latin1] : exceptions) out[ebcdic] = latin1;
  return out;
}

TEST(CxCharsTest, TheTableOfCodePage1047IsThePublishedOneWithItsLineEndsTurned) {
  const std::vector<uint8_t> table(cxEbcdic1047ToLatin1, cxEbcdic1047ToLatin1 + 256);
  EXPECT_EQ(table, published("IBM1047", {{0x15, 0x0A}, {0x25, 0x85}}));
  EXPECT_EQ(sizeof cxEbcdic1047ToLatin1, 257u);
  EXPECT_EQ(cxEbcdic1047ToLatin1[256], 0);
}

TEST(CxCharsTest, TheTableOfCodePage037IsThePublishedOneButFor32Positions) {
  const Exceptions exceptions = {
      {0x04, 0xDC}, {0x06, 0xC3}, {0x08, 0xCA}, {0x09, 0xB2}, {0x0A, 0xD5}, {0x14, 0xDB},
      {0x15, 0xDA}, {0x17, 0xC1}, {0x1A, 0xC8}, {0x1B, 0xF2}, {0x20, 0xC4}, {0x21, 0xB3},
      {0x22, 0xC0}, {0x23, 0xD9}, {0x24, 0xBF}, {0x28, 0xB4}, {0x29, 0xC2}, {0x2A, 0xC5},
      {0x2B, 0xB0}, {0x2C, 0xB1}, {0x30, 0xCD}, {0x31, 0xBA}, {0x33, 0xBC}, {0x34, 0xBB},
      {0x35, 0xC9}, {0x36, 0xCC}, {0x38, 0xB9}, {0x39, 0xCB}, {0x3A, 0xCE}, {0x3B, 0xDF},
      {0x3E, 0xFE}, {0xFF, 0x1A},
  };
  ASSERT_EQ(exceptions.size(), 32u);
  const std::vector<uint8_t> table(cxEbcdic037ToLatin1, cxEbcdic037ToLatin1 + 256);
  EXPECT_EQ(table, published("IBM037", exceptions));
  EXPECT_EQ(sizeof cxEbcdic037ToLatin1, 257u);
  EXPECT_EQ(cxEbcdic037ToLatin1[256], 0);
}

}  // namespace
