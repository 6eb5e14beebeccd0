#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "CxStringBuff.h"
#include "support/FailingMemory.h"
#include "support/Take.h"

namespace {

class CxStringBuffTest : public ::testing::Test {
 protected:
  ~CxStringBuffTest() override { CxStringBuffDiscard(&buff); }

  // All of the text, zero bytes too; checks the terminator.
  std::string text() const {
    if (!buff.data) return "<null>";
    EXPECT_EQ(buff.data[buff.length], 0);
    return {buff.data, buff.length};
  }
  void fill(size_t bytes) {
    ASSERT_EQ(CxStringBuffAppendStr(&buff, std::string(bytes, 'x').c_str()), 1);
  }

  CxStringBuff buff{};
};

TEST_F(CxStringBuffTest, TheFirstAppendToAZeroRecordTakes1024Bytes) {
  EXPECT_EQ(CxStringBuffAppendChar(&buff, 'a'), 1);
  EXPECT_EQ(text(), "a");
  EXPECT_EQ(buff.capacity, 1024u);
}

TEST_F(CxStringBuffTest, The1024thByteDoublesTheBlock) {
  fill(1023);
  EXPECT_EQ(buff.capacity, 1024u);
  EXPECT_EQ(CxStringBuffAppendChar(&buff, 'y'), 1);
  EXPECT_EQ(buff.capacity, 2048u);
  EXPECT_EQ(text(), std::string(1023, 'x') + "y");
}

TEST_F(CxStringBuffTest, GrowsUntilTheBlockExceedsWhatIsNeeded) {
  fill(2047);  // with its terminator exactly 2048 bytes
  EXPECT_EQ(buff.capacity, 4096u);
}

TEST_F(CxStringBuffTest, GrowingPastOneGibibyteFails) {
  EXPECT_EQ(cxGrownCapacity(1024, (1u << 30) - 1), 1u << 30);
  EXPECT_EQ(cxGrownCapacity(1024, 1u << 30), 0u);
  EXPECT_EQ(cxGrownCapacity(1024, uint64_t{1} << 33), 0u);
  EXPECT_EQ(cxGrownCapacity(3u << 28, (1u << 30) - 1), 0u);
  fill(3);
  buff.length = buff.capacity = (1u << 30) - 1;  // as if it were that long
  EXPECT_EQ(CxStringBuffAppendStr(&buff, "yz"), 0);
  EXPECT_EQ(buff.capacity, (1u << 30) - 1);
  buff.length = 3;
  EXPECT_EQ(text(), "xxx");
}

TEST_F(CxStringBuffTest, AppendsAnyByte) {
  CxStringBuffAppendChar(&buff, 'a');
  CxStringBuffAppendChar(&buff, 0);
  CxStringBuffAppendChar(&buff, '\xFF');
  EXPECT_EQ(text(), std::string("a\0\xFF", 3));
}

struct CodePoint {
  int32_t codePoint;
  const char *bytes;
};

class CxStringBuffUtf8Test : public ::testing::TestWithParam<CodePoint> {};

TEST_P(CxStringBuffUtf8Test, WritesTheForm) {
  CxStringBuff buff{};
  EXPECT_EQ(CxStringBuffAppendUTF32Char(&buff, GetParam().codePoint), 1);
  EXPECT_EQ(take(CxStringBuffTakeStr(&buff)), GetParam().bytes);
}

INSTANTIATE_TEST_SUITE_P(
    Forms, CxStringBuffUtf8Test,
    ::testing::Values(CodePoint{0x41, "A"}, CodePoint{0x7F, "\x7F"}, CodePoint{-1, "\x7F"},
                      CodePoint{-0x3F, "A"}, CodePoint{0x80, "\xC2\x80"},
                      CodePoint{0x7FE, "\xDF\xBE"}, CodePoint{0x7FF, "\xE0\x9F\xBF"},
                      CodePoint{0x800, "\xE0\xA0\x80"}, CodePoint{0xD800, "\xED\xA0\x80"},
                      CodePoint{0xFFFF, "\xEF\xBF\xBF"}, CodePoint{0x10000, "\xF0\x90\x80\x80"},
                      CodePoint{0x1FFFFF, "\xF7\xBF\xBF\xBF"},
                      CodePoint{0x200000, "\xF8\x88\x80\x80\x80"},
                      CodePoint{0x3FFFFFF, "\xFB\xBF\xBF\xBF\xBF"},
                      CodePoint{0x4000000, "\xFC\x84\x80\x80\x80\x80"},
                      CodePoint{INT32_MAX, "\xFD\xBF\xBF\xBF\xBF\xBF"}));

TEST_F(CxStringBuffTest, ACodePointWithoutRoomTakesTheNextLongerForm) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(CxStringBuffAppendUTF32Char(&buff, 'A'), 1);
  EXPECT_EQ(text(), "\xC1\x81");
}

TEST_F(CxStringBuffTest, ACodePointFailsOnlyWhenSixBytesHaveNoRoom) {
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxStringBuffAppendUTF32Char(&buff, 'A'), 0);
  EXPECT_EQ(memory.failures(), 6u);
  EXPECT_EQ(buff.data, nullptr);
}

TEST_F(CxStringBuffTest, ACodeUnitIsACodePointOfItsOwn) {
  EXPECT_EQ(CxStringBuffAppendUCS2Char(&buff, 0xD83D), 1);
  EXPECT_EQ(CxStringBuffAppendUCS2Char(&buff, 0xDE00), 1);
  EXPECT_EQ(text(), "\xED\xA0\xBD\xED\xB8\x80");
}

TEST_F(CxStringBuffTest, WritesDecimalNumbers) {
  for (const int64_t value :
       {int64_t{0}, int64_t{7}, int64_t{-7}, int64_t{1000}, INT64_MAX, INT64_MIN}) {
    CxStringBuffRestart(&buff);
    EXPECT_EQ(CxStringBuffAppendInt64(&buff, value), 1);
    EXPECT_EQ(text(), std::to_string(value));
  }
  CxStringBuffRestart(&buff);
  EXPECT_EQ(CxStringBuffAppendInt32(&buff, INT32_MIN), 1);
  EXPECT_EQ(text(), "-2147483648");
  for (const uint64_t value : {uint64_t{0}, uint64_t{10}, UINT64_MAX}) {
    CxStringBuffRestart(&buff);
    EXPECT_EQ(CxStringBuffAppendUInt64(&buff, value), 1);
    EXPECT_EQ(text(), std::to_string(value));
  }
}

TEST_F(CxStringBuffTest, AnUnsignedNumberSucceedsAlsoWhenMemoryEndsAmongItsDigits) {
  fill(1021);
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxStringBuffAppendUInt64(&buff, 12345), 1);
  EXPECT_EQ(text(), std::string(1021, 'x') + "12");
}

TEST_F(CxStringBuffTest, ASignedNumberIsWrittenWholeOrNotAtAll) {
  fill(1021);
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxStringBuffAppendInt64(&buff, 12345), 0);
  EXPECT_EQ(memory.attempts(), 1u);
  EXPECT_EQ(text(), std::string(1021, 'x'));
}

TEST_F(CxStringBuffTest, WritesEbcdicNumbersButNothingForZero) {
  EXPECT_EQ(CxStringBuffAppendEBCDICInt64(&buff, 0), 1);
  EXPECT_EQ(text(), "");
  EXPECT_EQ(CxStringBuffAppendEBCDICInt64(&buff, -12), 1);
  EXPECT_EQ(text(), "\x60\xF1\xF2");
  CxStringBuffRestart(&buff);
  EXPECT_EQ(CxStringBuffAppendEBCDICInt64(&buff, INT64_MIN), 1);
  EXPECT_EQ(text(),
            "\x60\xF9\xF2\xF2\xF3\xF3\xF7\xF2\xF0\xF3\xF6\xF8\xF5\xF4\xF7\xF7\xF5\xF8\xF0\xF8");
}

TEST_F(CxStringBuffTest, AppendsAtMostTheCountedBytes) {
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "abcdef", 3), 1);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "gh", -1), 1);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "ij", 100), 1);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "kl", 0), 1);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "mn", -2), 1);
  EXPECT_EQ(text(), "abcghij");
}

TEST_F(CxStringBuffTest, MakesRoomForTheCountAlsoOfAShorterText) {
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "ab", 1024), 1);
  EXPECT_EQ(text(), "ab");
  EXPECT_EQ(buff.capacity, 2048u);
}

TEST_F(CxStringBuffTest, ReadsNoFurtherThanTheCount) {
  const char unterminated[3] = {'a', 'b', 'c'};
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, unterminated, 3), 1);
  EXPECT_EQ(text(), "abc");
}

TEST_F(CxStringBuffTest, InsertsBeforeAPosition) {
  CxStringBuffAppendStr(&buff, "ad");
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "bc", 1), 1);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "<", 0), 1);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, ">", 5), 1);
  EXPECT_EQ(text(), "<abcd>");
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "x", 7), 0);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "x", -1), 0);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, nullptr, 0), 0);
  EXPECT_EQ(text(), "<abcd>");
}

TEST_F(CxStringBuffTest, InsertsIntoAnEmptyBuffer) {
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "abc", 0), 1);
  EXPECT_EQ(text(), "abc");
}

TEST_F(CxStringBuffTest, AnInsertAsksForTheLengthOnceMore) {
  fill(600);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "y", 0), 1);
  EXPECT_EQ(buff.capacity, 2048u);
}

TEST_F(CxStringBuffTest, AppendsItsOwnTextAlsoWhenTheBlockMoves) {
  fill(700);
  CxStringBuffAppendStr(&buff, "end");
  EXPECT_EQ(CxStringBuffAppendStr(&buff, buff.data), 1);
  const std::string once = std::string(700, 'x') + "end";
  EXPECT_EQ(text(), once + once);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, buff.data + 700, 3), 1);
  EXPECT_EQ(text(), once + once + "end");
}

TEST_F(CxStringBuffTest, InsertsItsOwnText) {
  CxStringBuffAppendStr(&buff, "abcd");
  EXPECT_EQ(CxStringBuffInsertStr(&buff, buff.data + 1, 2), 1);
  EXPECT_EQ(text(), "abbcdcd");
}

TEST_F(CxStringBuffTest, TakingGivesTheTextAndLeavesAZeroRecord) {
  EXPECT_EQ(CxStringBuffTakeStr(&buff), nullptr);
  CxStringBuffAppendStr(&buff, "abc");
  EXPECT_EQ(take(CxStringBuffTakeStr(&buff)), "abc");
  EXPECT_EQ(buff.length, 0u);
  EXPECT_EQ(buff.capacity, 0u);
  EXPECT_EQ(buff.data, nullptr);
}

TEST_F(CxStringBuffTest, PeeksAndCopies) {
  EXPECT_EQ(CxStringBuffPeekStr(&buff), nullptr);
  EXPECT_EQ(CxStringBuffCopyStr(&buff), nullptr);
  CxStringBuffAppendStr(&buff, "abc");
  EXPECT_EQ(CxStringBuffPeekStr(&buff), buff.data);
  char *copy = CxStringBuffCopyStr(&buff);
  EXPECT_NE(copy, buff.data);
  EXPECT_EQ(take(copy), "abc");
}

TEST_F(CxStringBuffTest, RestartKeepsTheBlockAndDiscardGivesItBack) {
  fill(3000);
  const char *block = buff.data;
  CxStringBuffRestart(&buff);
  EXPECT_EQ(text(), "");
  EXPECT_EQ(buff.data, block);
  EXPECT_EQ(buff.capacity, 4096u);
  CxStringBuffDiscard(&buff);
  EXPECT_EQ(buff.data, nullptr);
  EXPECT_EQ(buff.capacity, 0u);
  CxStringBuffRestart(&buff);
  EXPECT_EQ(buff.data, nullptr);
}

TEST_F(CxStringBuffTest, PacksToTheTextOnce) {
  CxStringBuffAppendStr(&buff, "abc");
  EXPECT_EQ(CxStringBuffPack(&buff), 1);
  EXPECT_EQ(buff.capacity, 4u);
  EXPECT_EQ(CxStringBuffPack(&buff), 0);
  EXPECT_EQ(buff.capacity, 4u);
  EXPECT_EQ(text(), "abc");
  EXPECT_EQ(CxStringBuffAppendStr(&buff, "defg"), 1);
  EXPECT_EQ(buff.capacity, 16u);
}

TEST_F(CxStringBuffTest, PackingAnEmptyTextGivesTheBlockBack) {
  EXPECT_EQ(CxStringBuffPack(&buff), 1);
  CxStringBuffAppendStr(&buff, "");
  EXPECT_NE(buff.data, nullptr);
  EXPECT_EQ(CxStringBuffPack(&buff), 1);
  EXPECT_EQ(buff.data, nullptr);
  EXPECT_EQ(buff.capacity, 0u);
}

TEST_F(CxStringBuffTest, PackingWithoutMemoryKeepsTheBlock) {
  CxStringBuffAppendStr(&buff, "abc");
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(CxStringBuffPack(&buff), 0);
  EXPECT_EQ(buff.capacity, 1024u);
  EXPECT_EQ(text(), "abc");
}

TEST_F(CxStringBuffTest, AFailedAppendLeavesTheText) {
  fill(1020);
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(CxStringBuffAppendStr(&buff, "abcd"), 0);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, "abcd", 4), 0);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, "abcd", 0), 0);
  EXPECT_EQ(CxStringBuffInsertStr(&buff, buff.data, 0), 0);
  EXPECT_EQ(CxStringBuffAppendEBCDICInt64(&buff, 1234), 0);
  EXPECT_EQ(CxStringBuffAppendUCS2Char(&buff, 0xFFFF), 1);
  EXPECT_EQ(CxStringBuffAppendChar(&buff, 'a'), 0);
  EXPECT_EQ(text(), std::string(1020, 'x') + "\xEF\xBF\xBF");
  EXPECT_EQ(buff.capacity, 1024u);
}

TEST_F(CxStringBuffTest, NullBuffersAndTextsFail) {
  EXPECT_EQ(CxStringBuffAppendChar(nullptr, 'a'), 0);
  EXPECT_EQ(CxStringBuffAppendUTF32Char(nullptr, 'a'), 0);
  EXPECT_EQ(CxStringBuffAppendUCS2Char(nullptr, 'a'), 0);
  EXPECT_EQ(CxStringBuffAppendInt32(nullptr, 1), 0);
  EXPECT_EQ(CxStringBuffAppendInt64(nullptr, 1), 0);
  EXPECT_EQ(CxStringBuffAppendUInt64(nullptr, 1), 0);
  EXPECT_EQ(CxStringBuffAppendEBCDICInt64(nullptr, 0), 0);
  EXPECT_EQ(CxStringBuffAppendEBCDICInt64(nullptr, 1), 0);
  EXPECT_EQ(CxStringBuffAppendStr(nullptr, "a"), 0);
  EXPECT_EQ(CxStringBuffAppendStrN(nullptr, "a", 1), 0);
  EXPECT_EQ(CxStringBuffInsertStr(nullptr, "a", 0), 0);
  EXPECT_EQ(CxStringBuffTakeStr(nullptr), nullptr);
  EXPECT_EQ(CxStringBuffPeekStr(nullptr), nullptr);
  EXPECT_EQ(CxStringBuffCopyStr(nullptr), nullptr);
  EXPECT_EQ(CxStringBuffPack(nullptr), 0);
  CxStringBuffRestart(nullptr);
  CxStringBuffDiscard(nullptr);
  EXPECT_EQ(CxStringBuffAppendStr(&buff, nullptr), 0);
  EXPECT_EQ(CxStringBuffAppendStrN(&buff, nullptr, -1), 0);
  EXPECT_EQ(buff.data, nullptr);
}

}  // namespace
