#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <limits>
#include <string>

#include <unicode/umsg.h>
#include <unicode/ustring.h>

#include <qlx/ustring.h>

#include "CxStringBuff.h"
#include "CxUStringBuff.h"
#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/Take.h"

namespace {

class CxUStringBuffTest : public ::testing::Test {
 protected:
  ~CxUStringBuffTest() override { CxUStringBuffDiscard(&buff); }

  // All of the text; checks the terminator.
  std::u16string text() const {
    if (!buff.data) return u"<null>";
    EXPECT_EQ(buff.data[buff.length], 0);
    return {buff.data, buff.length};
  }
  void fill(size_t units) {
    ASSERT_EQ(CxUStringBuffAppendUStr(&buff, std::u16string(units, u'x').c_str()), 1);
  }

  CxUStringBuff buff{};
};

TEST_F(CxUStringBuffTest, TheFirstAppendToAZeroRecordTakes1024Bytes) {
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, "a"), 1);
  EXPECT_EQ(text(), u"a");
  EXPECT_EQ(buff.capacity, 1024u);
  CxUStringBuffDiscard(&buff);
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, u""), 1);
  EXPECT_EQ(buff.capacity, 1024u);
}

TEST_F(CxUStringBuffTest, GrowsUntilTheBlockExceedsWhatIsNeeded) {
  fill(511);
  EXPECT_EQ(buff.capacity, 1024u);
  CxUStringBuffAppendUStr(&buff, u"y");
  EXPECT_EQ(buff.capacity, 2048u);
  EXPECT_EQ(text(), std::u16string(511, u'x') + u"y");
  CxUStringBuffAppendUStr(&buff, std::u16string(1023 - 512, u'z').c_str());
  EXPECT_EQ(buff.capacity, 2048u);
  CxUStringBuffDiscard(&buff);
  fill(1023);  // with its terminator exactly 2048 bytes
  EXPECT_EQ(buff.capacity, 4096u);
}

TEST_F(CxUStringBuffTest, GrowingPastOneGibibyteFails) {
  fill(3);
  buff.length = (1u << 29) - 1;  // as if it were that long
  buff.capacity = 1u << 30;
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, u"yz"), 0);
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, "yz"), 0);
  buff.length = 3;
  buff.capacity = 1024;
  EXPECT_EQ(text(), u"xxx");
  EXPECT_EQ(cxUStringBuffHasCapacity(&buff, UINT32_MAX), 0);
}

TEST_F(CxUStringBuffTest, ConvertsEightBitTextWithTheDefaultCodePage) {
  EXPECT_EQ(CxUStringBuffAppendStr(&buff,
                                   "Gr\xC3\xBC\xC3\x9F"
                                   "e"),
            1);
  EXPECT_EQ(CxUStringBuffAppendChar(&buff, '!'), 1);
  EXPECT_EQ(CxUStringBuffAppendChar(&buff, '\xC3'), 1);  // no whole character
  EXPECT_EQ(text(), u"Grüße!\uFFFD");
}

TEST_F(CxUStringBuffTest, WordsInAsciiAreWidenedBehindTheText) {
  std::u16string expected;
  for (size_t length = 0; length < 1200; length += length < 40 ? 1 : 97) {
    std::string words(length, 'w');
    if (length > 0) words.back() = '\x7f';
    EXPECT_EQ(cxUStringBuffAppendAscii(&buff, words), 1);
    expected.append(words.begin(), words.end());
    EXPECT_EQ(text(), expected);
  }
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(cxUStringBuffAppendAscii(&buff, std::string(1 << 16, 'x')), 0);
  EXPECT_EQ(text(), expected);
  EXPECT_EQ(cxUStringBuffAppendAscii(nullptr, "x"), 0);
}

// The contract of an append of 8-bit text, spelled out; the append itself takes shorter ways.
void appendOverACopy(CxUStringBuff *buff, const char *text) {
  UChar *copy = CxUStringDupStrToUChar(text);
  CxUStringBuffAppendUStr(buff, copy);
  OslMemoryFree(copy);
}

TEST_F(CxUStringBuffTest, GrowsByTheUnitsThatATextBecomesNotByItsBytes) {
  for (const char *piece : {"plain", "\xC3\xA4", "\xE2\x82\xAC", "\xF0\x9F\x98\x80", "a\xFF"}) {
    CxUStringBuff expected{};
    CxUStringBuffDiscard(&buff);
    std::string whole;
    for (int i = 0; i < 300; ++i) {
      appendOverACopy(&expected, piece);
      EXPECT_EQ(CxUStringBuffAppendStr(&buff, piece), 1);
      whole += piece;
    }
    appendOverACopy(&expected, whole.c_str());
    EXPECT_EQ(CxUStringBuffAppendStr(&buff, whole.c_str()), 1);
    EXPECT_EQ(text(), std::u16string(expected.data, expected.length)) << piece;
    EXPECT_EQ(buff.capacity, expected.capacity) << piece;
    CxUStringBuffDiscard(&expected);
  }
}

TEST_F(CxUStringBuffTest, AllocatesNothingButItsOwnBlock) {
  const FailingMemory memory;
  CxUStringBuffAppendStr(&buff, "plain text of some length, and more of it");
  CxUStringBuffAppendStr(&buff,
                         "Gr\xC3\xBC\xC3\x9F"
                         "e");
  CxUStringBuffAppendChar(&buff, 'c');
  CxUStringBuffAppendStrN(&buff, "counted", 3);
  CxUStringBuffAppendInt64(&buff, -1);
  CxUStringBuffAppendUDouble(&buff, 0.5);
  EXPECT_EQ(memory.attempts(), 1u);
}

TEST_F(CxUStringBuffTest, TheCharacterZeroAppendsNothing) {
  EXPECT_EQ(CxUStringBuffAppendChar(&buff, 0), 1);
  EXPECT_EQ(text(), u"");
}

TEST_F(CxUStringBuffTest, AppendsAtMostTheCountedBytes) {
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "abcdef", 3), 1);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "gh", -1), 1);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "ij", 100), 1);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "kl", 0), 1);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "mn", -2), 1);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "\xC3\xBC\xC3\xBC", 2), 1);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "\xC3\xBC", 1), 1);  // half a character
  const char unterminated[3] = {'x', 'y', 'z'};
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, unterminated, 3), 1);
  EXPECT_EQ(text(), u"abcghijü\uFFFDxyz");
}

TEST_F(CxUStringBuffTest, WritesIntegersAsUnsigned64BitNumbers) {
  EXPECT_EQ(CxUStringBuffAppendInt32(&buff, -1), 1);
  EXPECT_EQ(text(), u"18446744073709551615");
  CxUStringBuffRestart(&buff);
  EXPECT_EQ(CxUStringBuffAppendInt64(&buff, INT64_MIN), 1);
  EXPECT_EQ(text(), u"9223372036854775808");
  CxUStringBuffRestart(&buff);
  EXPECT_EQ(CxUStringBuffAppendUInt64(&buff, UINT64_MAX), 1);
  EXPECT_EQ(CxUStringBuffAppendInt32(&buff, 0), 1);
  EXPECT_EQ(CxUStringBuffAppendInt32(&buff, INT32_MAX), 1);
  EXPECT_EQ(text(), u"1844674407370955161502147483647");
}

std::u16string formatted(const char16_t *pattern, double value) {
  UChar text[2000];
  UErrorCode status = U_ZERO_ERROR;
  u_formatMessage(nullptr, pattern, u_strlen(pattern), text, 2000, &status, value);
  EXPECT_TRUE(U_SUCCESS(status));
  return text;
}

TEST_F(CxUStringBuffTest, WritesDatesAsWholeNumbers) {
  const IcuDefaults defaults;
  IcuDefaults::setLocale("en_US");
  EXPECT_EQ(CxUStringBuffAppendUDate(&buff, 1700000000123.0), 1);
  EXPECT_EQ(CxUStringBuffAppendUDate(&buff, -5.0), 1);
  EXPECT_EQ(CxUStringBuffAppendUDate(&buff, 0.0), 1);
  EXPECT_EQ(text(), u"1700000000123-50");
}

TEST_F(CxUStringBuffTest, WritesNumbersWithAtMostFiveFractionDigits) {
  const IcuDefaults defaults;
  IcuDefaults::setLocale("en_US");
  EXPECT_EQ(CxUStringBuffAppendUDouble(&buff, 1234567.5), 1);
  EXPECT_EQ(text(), u"1234567.5");
  CxUStringBuffRestart(&buff);
  EXPECT_EQ(CxUStringBuffAppendUDouble(&buff, 0.123456789), 1);
  EXPECT_EQ(text(), u"0.12346");
}

TEST_F(CxUStringBuffTest, WritesNumbersAsTheDefaultLocaleDoes) {
  const double values[] = {0.0,     -0.0,     1.5,     -2.25, 1e15,     1700000000123.0,
                           DBL_MAX, -DBL_MAX, DBL_MIN, 1e300, INFINITY, std::nan("")};
  const IcuDefaults defaults;
  for (const char *name : {"en_US", "de_DE", "sv_SE", "ar_EG", "hi@numbers=mathbold"}) {
    ASSERT_TRUE(IcuDefaults::setLocale(name));
    for (const double value : values) {
      CxUStringBuffRestart(&buff);
      EXPECT_EQ(CxUStringBuffAppendUDate(&buff, value), 1);
      EXPECT_EQ(text(), formatted(u"{0,number,#}", value)) << name << ' ' << value;
      CxUStringBuffRestart(&buff);
      EXPECT_EQ(CxUStringBuffAppendUDouble(&buff, value), 1);
      EXPECT_EQ(text(), formatted(u"{0,number,#.#####}", value)) << name << ' ' << value;
    }
  }
}

TEST_F(CxUStringBuffTest, WritesTheLongestNumbersWhole) {
  const IcuDefaults defaults;
  IcuDefaults::setLocale("en_US");
  CxUStringBuffAppendUDouble(&buff, -DBL_MAX);
  EXPECT_EQ(buff.length, 310u);
}

TEST_F(CxUStringBuffTest, AppendsItsOwnTextAlsoWhenTheBlockMoves) {
  fill(400);
  CxUStringBuffAppendUStr(&buff, u"end");
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, buff.data), 1);
  const std::u16string once = std::u16string(400, u'x') + u"end";
  EXPECT_EQ(text(), once + once);
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, buff.data + 803), 1);
  EXPECT_EQ(text(), once + once + u"end");
}

TEST_F(CxUStringBuffTest, TakingGivesTheTextAndLeavesAZeroRecord) {
  EXPECT_EQ(CxUStringBuffTakeUStr(&buff), nullptr);
  fill(3);
  EXPECT_EQ(take(CxUStringBuffTakeUStr(&buff)), u"xxx");
  EXPECT_EQ(buff.length, 0u);
  EXPECT_EQ(buff.capacity, 0u);
  EXPECT_EQ(buff.data, nullptr);
}

TEST_F(CxUStringBuffTest, RestartKeepsTheBlockAndDiscardGivesItBack) {
  fill(1000);
  CxUStringBuffRestart(&buff);
  EXPECT_EQ(text(), u"");
  EXPECT_EQ(buff.capacity, 2048u);
  CxUStringBuffDiscard(&buff);
  EXPECT_EQ(buff.data, nullptr);
  EXPECT_EQ(buff.capacity, 0u);
}

TEST_F(CxUStringBuffTest, AFailedAppendLeavesTheText) {
  fill(510);
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, "ab"), 0);
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, "\xC3\xBC\xC3\xBC"), 0);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, "abc", 2), 0);
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, u"ab"), 0);
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, buff.data), 0);
  EXPECT_EQ(CxUStringBuffAppendInt32(&buff, 12), 0);
  EXPECT_EQ(CxUStringBuffAppendUDate(&buff, 12), 0);
  EXPECT_EQ(text(), std::u16string(510, u'x'));
  EXPECT_EQ(buff.capacity, 1024u);
}

TEST_F(CxUStringBuffTest, NoBlockNoAppend) {
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, "ab"), 0);
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, "\xC3\xBC"), 0);
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, u"ab"), 0);
  EXPECT_EQ(buff.data, nullptr);
}

TEST_F(CxUStringBuffTest, NullBuffersAndTextsFail) {
  EXPECT_EQ(CxUStringBuffAppendChar(nullptr, 'a'), 0);
  EXPECT_EQ(CxUStringBuffAppendStr(nullptr, "a"), 0);
  EXPECT_EQ(CxUStringBuffAppendStr(nullptr, "\xC3\xBC"), 0);
  EXPECT_EQ(CxUStringBuffAppendStrN(nullptr, "a", 1), 0);
  EXPECT_EQ(CxUStringBuffAppendUStr(nullptr, u"a"), 0);
  EXPECT_EQ(CxUStringBuffAppendInt32(nullptr, 1), 0);
  EXPECT_EQ(CxUStringBuffAppendInt64(nullptr, 1), 0);
  EXPECT_EQ(CxUStringBuffAppendUInt64(nullptr, 1), 0);
  EXPECT_EQ(CxUStringBuffAppendUDate(nullptr, 1), 0);
  EXPECT_EQ(CxUStringBuffAppendUDouble(nullptr, 1), 0);
  EXPECT_EQ(CxUStringBuffTakeUStr(nullptr), nullptr);
  CxUStringBuffRestart(nullptr);
  CxUStringBuffDiscard(nullptr);
  EXPECT_EQ(CxUStringBuffAppendStr(&buff, nullptr), 0);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, nullptr, -1), 0);
  EXPECT_EQ(CxUStringBuffAppendStrN(&buff, nullptr, 1), 0);
  EXPECT_EQ(CxUStringBuffAppendUStr(&buff, nullptr), 0);
  EXPECT_EQ(buff.data, nullptr);
}

}  // namespace
