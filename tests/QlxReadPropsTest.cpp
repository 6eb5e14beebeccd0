#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <string>

#include <qlx/buffers.h>
#include <qlx/proplist.h>
#include <qlx/qlx.h>

#include "object/QlxLocked.h"
#include "QlxReadProps.h"
#include "support/Descriptors.h"
#include "support/FailingMemory.h"
#include "support/Status.h"
#include "support/Take.h"
#include "support/TempDir.h"
#include "support/ToolkitTest.h"

namespace {

constexpr CxStatus kUntouched{'?', 77};

// Reads texts as files, to a property list.
class QlxReadPropsTest : public ::testing::Test {
 protected:
  ~QlxReadPropsTest() override { CxPropListDiscard(&list); }

  uint8_t read(const std::string &text) {
    dir.write("file.properties", text);
    return CxPropListRead(dir.path("file.properties").c_str(), &list, &status);
  }

  // The pairs in their order: "[a|1][b|2]".
  std::string pairs() const {
    std::string all;
    for (int32_t i = 0; i < list.count; ++i)
      all += std::string("[") + list.entries[i].key + "|" + list.entries[i].value + "]";
    return all;
  }

  TempDir dir;
  CxPropList list{};
  CxStatus status = kUntouched;
};

struct File {
  const char *text;
  uint8_t result;
  const char *pairs;
};

std::ostream &operator<<(std::ostream &out, const File &file) {
  return out << ::testing::PrintToString(file.text);
}

class QlxReadPropsFileTest : public QlxReadPropsTest, public ::testing::WithParamInterface<File> {};

TEST_P(QlxReadPropsFileTest, GivesItsPairs) {
  EXPECT_EQ(read(GetParam().text), GetParam().result);
  EXPECT_EQ(pairs(), GetParam().pairs);
  EXPECT_EQ(status, kUntouched);
}

INSTANTIATE_TEST_SUITE_P(Lines, QlxReadPropsFileTest,
                         ::testing::Values(File{"", 1, ""},                                  //
                                           File{"a.b=1\r\nc.d : 2\n", 1, "[a.b|1][c.d|2]"},  //
                                           File{"\n\r\n \n# x\n! y\n", 1, ""},               //
                                           File{"\xEF\xBB\xBFx=1\n# y\n", 1, "[x|1]"},       //
                                           File{"\xEF\xBB\xBF# x\n", 1, ""},                 //
                                           File{"\xEF\xBB\xBF", 1, ""},                      //
                                           File{"\xEF\xBBx=1\n", 1, "[\xEF\xBBx|1]"},        //
                                           File{"\xEF\xBB\xBF\xEF\xBB\xBFx=1\n", 1,
                                                "[\xEF\xBB\xBFx|1]"},                        //
                                           File{"x=\xEF\xBB\xBF\n", 1, "[x|\xEF\xBB\xBF]"},  //
                                           File{"  # note\nx=1\n", 1, "[x|1]"},              //
                                           File{"x.y value\n", 1, "[x.y|value]"},            //
                                           File{"x.y\tvalue\n", 1, "[x.y|value]"},           //
                                           File{"x.y\v\f value\n", 1, "[x.y|value]"},        //
                                           File{"  x = 1\n", 1, "[x|1]"},                    //
                                           File{"x = = :1\n", 1, "[x|= :1]"},                //
                                           File{"x #1\n", 1, "[x|#1]"},                      //
                                           File{"x!#y=1\n", 1, "[x!#y|1]"},                  //
                                           File{"x=1  \n", 1, "[x|1  ]"},                    //
                                           File{"x=\n", 1, "[x|]"},                          //
                                           File{"x=  \n", 1, "[x|]"},                        //
                                           File{"novalue=1\n", 1, "[novalue|1]"},            //
                                           File{"a=1\na=2\n", 1, "[a|2]"},                   //
                                           File{"a=1\n\r\n\rb=2\n", 1, "[a|1][b|2]"}));

INSTANTIATE_TEST_SUITE_P(SeparatorsAtTheStart, QlxReadPropsFileTest,
                         ::testing::Values(File{"=x.y=1\n", 1, "[=x.y|1]"},  //
                                           File{":x 1\n", 1, "[:x|1]"},      //
                                           File{"a=1\n  =x\n", 0, "[a|1]"},  //
                                           File{" :", 0, ""}));

INSTANTIATE_TEST_SUITE_P(EndsOfFile, QlxReadPropsFileTest,
                         ::testing::Values(File{"x.y\n", 0, ""},        //
                                           File{"x.y", 1, "[x.y|]"},    //
                                           File{"x.y  \n", 0, ""},      //
                                           File{"x.y  ", 1, "[x.y|]"},  //
                                           File{"x.y =", 1, "[x.y|]"},  //
                                           File{"x=1", 1, "[x|1]"},     //
                                           File{"x=a\\", 1, "[x|a]"},   //
                                           File{"x\\", 1, "[x|]"},      //
                                           File{"x=a\\u00", 1, "[x|a]"}, File{"# x", 1, ""}));

INSTANTIATE_TEST_SUITE_P(Continuations, QlxReadPropsFileTest,
                         ::testing::Values(File{"k.p=a\\\n   b\n", 1, "[k.p|ab]"},           //
                                           File{"k.p=a\\\r\n\t b\n", 1, "[k.p|ab]"},         //
                                           File{"k.p=a\\\n\n\nb\n", 1, "[k.p|ab]"},          //
                                           File{"k.p=a \\\n b \\\n c\n", 1, "[k.p|a b c]"},  //
                                           File{"k.p=a\\\n  \nb=1\n", 1, "[k.p|a][b|1]"},    //
                                           File{"k.p=a\\\n#b\n", 1, "[k.p|a#b]"},            //
                                           File{"k.p=a\\\n  \\ b\n", 1, "[k.p|a b]"},        //
                                           File{"k.p=\\\na\n", 1, "[k.p|a]"}));

INSTANTIATE_TEST_SUITE_P(Escapes, QlxReadPropsFileTest,
                         ::testing::Values(File{"k=\\\"\\'\\\\\\ \\\tx\n", 1, "[k|\"'\\ \tx]"},  //
                                           File{"k=\\n\n", 0, ""},                               //
                                           File{"k=\\t\n", 0, ""},                               //
                                           File{"k=\\#\n", 0, ""},                               //
                                           File{"k=\\:\n", 0, ""},                               //
                                           File{"k=\\0\n", 0, ""},                               //
                                           File{"a\\ b\\:c\\=d\\\\e=1\n", 1, "[a b:c=d\\e|1]"},  //
                                           File{"\\a=1\n", 1, "[\\a|1]"},                        //
                                           File{" \\a=1\n", 1, "[\\a|1]"},                       //
                                           File{"a\\\nb=1\n", 0, ""},                            //
                                           File{"a\\u0041=1\n", 0, ""},                          //
                                           File{"a\\#=1\n", 0, ""},                              //
                                           File{"a \\ b\n", 1, "[a| b]"}));

INSTANTIATE_TEST_SUITE_P(
    CodePoints, QlxReadPropsFileTest,
    ::testing::Values(File{"k.p=\\u0041\n", 1, "[k.p|A]"},             //
                      File{"k.p=\\U0041x\n", 1, "[k.p|Ax]"},           //
                      File{"k.p=\\u004a\n", 1, "[k.p|@]"},             //
                      File{"k.p=\\u004F\n", 1, "[k.p|E]"},             //
                      File{"k.p=\\u20ac\n", 1, "[k.p|\xE2\x80\x82]"},  // a and c are worth 0 and 2
                      File{"k.p=\\u07f5\n", 1, "[k.p|\xDD\x95]"},
                      File{"k.p=\\u0041\nk.q=\\u0041\n", 1, "[k.p|A][k.q|\xC2\x82]"},
                      File{"k.p=\\u0041\\u0001\n", 1, "[k.p|AB]"},  //
                      File{"k.p=\\u9999\\u9999\n", 1, "[k.p|\xE9\xA6\x99\xF0\x93\x8C\xB2]"},
                      File{"k.p=\\u00g1\n", 0, ""},  //
                      File{"k.p=\\u004\n", 0, ""},   //
                      File{"k.p=\\u 041\n", 0, ""}));

TEST_F(QlxReadPropsTest, ASecondLineEndByteIsIgnoredInEveryState) {
  EXPECT_EQ(read("a=\\\n\nb\n"), 1);  // a continuation is not ended by it
  EXPECT_EQ(pairs(), "[a|b]");
}

TEST_F(QlxReadPropsTest, PairsBeforeASyntaxErrorStay) {
  EXPECT_EQ(read("a=1\nb=2\nbroken\nc=3\n"), 0);
  EXPECT_EQ(pairs(), "[a|1][b|2]");
  EXPECT_EQ(status, kUntouched);
}

TEST_F(QlxReadPropsTest, BytesAreKeptAsTheyStand) {
  EXPECT_EQ(read("k\xFC=\xE4\xF6\x80\x01\n"), 1);
  EXPECT_EQ(pairs(), "[k\xFC|\xE4\xF6\x80\x01]");
}

// The last pair's value is copied once more when it is delivered again.
uint64_t allocationsOf(const std::string &path) {
  CxPropList list{};
  const FailingMemory memory;
  EXPECT_EQ(CxPropListRead(path.c_str(), &list, nullptr), 1);
  const uint64_t attempts = memory.attempts();
  CxPropListDiscard(&list);
  return attempts;
}

TEST_F(QlxReadPropsTest, TheLastPairIsDeliveredAgainAtEndOfFileUnlessACommentFollows) {
  dir.write("once", "a=1");
  dir.write("again", "a=1\n");
  dir.write("stillAgain", "a=1\r\n\r\n\n\r");
  dir.write("comment", "a=1\n#");
  dir.write("blanks", "a=1\n ");
  const uint64_t once = allocationsOf(dir.path("once"));
  EXPECT_EQ(allocationsOf(dir.path("again")), once + 1);
  EXPECT_EQ(allocationsOf(dir.path("stillAgain")), once + 1);
  EXPECT_EQ(allocationsOf(dir.path("comment")), once);
  EXPECT_EQ(allocationsOf(dir.path("blanks")), once);
}

TEST_F(QlxReadPropsTest, EarlierEntriesOfTheListStay) {
  CxPropListPutStr(&list, "old", "1");
  CxPropListPutStr(&list, "a", "1");
  EXPECT_EQ(read("a=2\n"), 1);
  EXPECT_EQ(pairs(), "[old|1][a|2]");
}

TEST_F(QlxReadPropsTest, ReadsFilesOfManyBlocksByteForByte) {
  std::string text, expected;
  for (int i = 0; i < 3000; ++i) {
    const std::string key = "k" + std::to_string(i), value(static_cast<size_t>(i % 23), 'v');
    text += key + "=" + value + "\r\n";  // its line ends fall on both sides of a block's end
    expected += "[" + key + "|" + value + "]";
  }
  EXPECT_EQ(read(text), 1);
  EXPECT_EQ(pairs(), expected);
}

// Long lists are looked up by an index, which must find what a walk finds.
TEST_F(QlxReadPropsTest, RepeatedKeysKeepTheirFirstPlaceInLongFilesToo) {
  std::string text, expected;
  for (int round = 0; round < 3; ++round) {
    for (int i = 0; i < 1000; ++i)
      text += "k" + std::to_string(i) + "=" + std::to_string(round) + "\n";
  }
  for (int i = 0; i < 1000; ++i) expected += "[k" + std::to_string(i) + "|2]";
  CxPropListPutStr(&list, "k7", "old");
  EXPECT_EQ(read(text), 1);
  EXPECT_EQ(pairs(), "[k7|2]" + std::string(expected).erase(expected.find("[k7|"), 6));
}

TEST_F(QlxReadPropsTest, OfEqualKeysInAListTheFirstOneGetsTheValue) {
  for (int i = 0; i < 100; ++i) CxPropListPutStr(&list, ("k" + std::to_string(i)).c_str(), "old");
  OslMemoryFree(list.entries[90].key);
  list.entries[90].key = OslStringDup("k80");  // as only a host can do
  EXPECT_EQ(read("k80=new\n"), 1);
  EXPECT_STREQ(list.entries[80].value, "new");
  EXPECT_STREQ(list.entries[90].value, "old");
}

TEST_F(QlxReadPropsTest, KeysAndValuesHaveNoLimit) {
  const std::string key(30000, 'k'), value(50000, 'v');
  EXPECT_EQ(read(key + "=" + value), 1);
  EXPECT_EQ(pairs(), "[" + key + "|" + value + "]");
}

TEST_F(QlxReadPropsTest, AMissingFileGivesThePlatformsStatus) {
  EXPECT_EQ(CxPropListRead(dir.path("none").c_str(), &list, &status), 0);
  EXPECT_EQ(status, failure(ENOENT));
  status = kUntouched;
  EXPECT_EQ(CxPropListRead(nullptr, &list, &status), 0);
  EXPECT_EQ(status, failure(ENOENT));
}

TEST_F(QlxReadPropsTest, AFolderGivesThePlatformsStatus) {
  EXPECT_EQ(CxPropListRead(dir.path().c_str(), &list, &status), 0);
  EXPECT_EQ(status, failure(EISDIR));
}

TEST_F(QlxReadPropsTest, TheStatusIsOptional) {
  EXPECT_EQ(CxPropListRead(dir.path("none").c_str(), &list, nullptr), 0);
  EXPECT_EQ(CxPropListRead(dir.path().c_str(), &list, nullptr), 0);
}

TEST_F(QlxReadPropsTest, WithoutAListNothingIsRead) {
  EXPECT_EQ(CxPropListRead(dir.path("none").c_str(), nullptr, &status), 0);
  EXPECT_EQ(status, kUntouched);
}

TEST_F(QlxReadPropsTest, TheFileIsClosedHoweverReadingEnds) {
  dir.write("good", "a=1\n");
  dir.write("bad", "a\n");
  const int before = openDescriptors();
  CxPropListRead(dir.path("good").c_str(), &list, nullptr);
  CxPropListRead(dir.path("bad").c_str(), &list, nullptr);
  CxPropListRead(dir.path().c_str(), &list, nullptr);
  EXPECT_EQ(openDescriptors(), before);
}

TEST_F(QlxReadPropsTest, EveryAllocationMayFail) {
  std::string text = "a=1\nb=\\u0041\nc=" + std::string(3000, 'v') + "\n";
  for (int i = 0; i < 70; ++i) text += "k" + std::to_string(i) + "=1\n";
  dir.write("f", text);
  FailingMemory memory;
  for (uint64_t nth = 1;; ++nth) {
    memory.failFrom(nth);
    CxPropList read{};
    const uint8_t result = CxPropListRead(dir.path("f").c_str(), &read, &status);
    const bool failed = memory.failures() > 0;
    CxPropListDiscard(&read);
    EXPECT_EQ(result, failed ? 0 : 1) << nth;
    ASSERT_EQ(memory.live(), 0) << nth;
    EXPECT_EQ(status, kUntouched);
    if (!failed) break;
  }
}

TEST(QlxRdprHexConvTest, LettersAreWorthZeroToFive) {
  const auto worth = [](int byte) -> int32_t {
    if (byte >= '0' && byte <= '9') return byte - '0';
    const char *letters = "abcdefABCDEF";
    const char *letter = byte ? strchr(letters, byte) : nullptr;
    return letter ? static_cast<int32_t>(letter - letters) % 6 : -1;
  };
  for (int byte = 0; byte < 256; ++byte)
    EXPECT_EQ(qlxRdprHexConv(static_cast<uint8_t>(byte)), worth(byte)) << byte;
}

// A row of the machine: the next state for each class of byte, and what is done with the byte: 'k'
// or 'v' appends it to the key or the value, 'e' delivers the pair.
struct Move {
  int32_t next;
  char action;
};
struct Row {
  int32_t state;
  Move blank, lineEnd, comment, separator, escape, other;
};

const Move kKey{kKeyChars, 'k'}, kVal{kValChars, 'v'}, kEmit{kStartLine, 'e'};

constexpr Move to(int32_t state) {
  return {state, '-'};
}

const Row kRows[] = {
    {kStartLine, to(kStartLineBlanks), to(kStartLine), to(kCommentLine), kKey, kKey, kKey},
    {kStartLineBlanks, to(kStartLineBlanks), to(kStartLine), to(kCommentLine), to(kError), kKey,
     kKey},
    {kCommentLine, to(kCommentLine), to(kStartLine), to(kCommentLine), to(kCommentLine),
     to(kCommentLine), to(kCommentLine)},
    {kKeyChars, to(kKeyEndBlanksFirst), to(kError), kKey, to(kKeyEndBlanksFinal),
     to(kKeyCharEscape), kKey},
    {kKeyCharEscape, kKey, to(kError), to(kError), kKey, kKey, to(kError)},
    {kKeyEndBlanksFirst, to(kKeyEndBlanksFirst), to(kError), kVal, to(kKeyEndBlanksFinal),
     to(kValEscape), kVal},
    {kKeyEndBlanksFinal, to(kKeyEndBlanksFinal), kEmit, kVal, kVal, to(kValEscape), kVal},
    {kValChars, kVal, kEmit, kVal, kVal, to(kValEscape), kVal},
    {kValEscape, kVal, to(kMultiLineVal), to(kError), to(kError), kVal, to(kError)},
    {kMultiLineVal, to(kMultiLineVal), kEmit, kVal, kVal, to(kValEscape), kVal},
};

Move expectedMove(const Row &row, uint8_t byte) {
  if (row.state == kValEscape && (byte == '"' || byte == '\'')) return kVal;
  if (row.state == kValEscape && (byte == 'u' || byte == 'U')) return to(kUU0);
  if (byte == '\t' || byte == '\v' || byte == '\f' || byte == ' ') return row.blank;
  if (byte == '\n' || byte == '\r') return row.lineEnd;
  if (byte == '!' || byte == '#') return row.comment;
  if (byte == ':' || byte == '=') return row.separator;
  return byte == '\\' ? row.escape : row.other;
}

class QlxRdprStateTest : public ::testing::TestWithParam<Row> {};

TEST_P(QlxRdprStateTest, MovesByTheClassOfTheByte) {
  const Row &row = GetParam();
  for (int i = 0; i < 256; ++i) {
    const auto byte = static_cast<uint8_t>(i);
    CxPropList list{};
    ReadPropsContext context{};
    context.propList = &list;
    CxStringBuffAppendStr(&context.keyBuf, "K");
    CxStringBuffAppendStr(&context.valBuf, "V");
    const Move move = expectedMove(row, byte);
    EXPECT_EQ(qlxRdprSTATE_HANDLER_FUNCS[row.state](byte, &context), move.next) << i;
    // The start of a line begins with empty buffers.
    std::string key = row.state == kStartLine ? "" : "K";
    std::string value = row.state == kStartLine ? "" : "V";
    if (move.action == 'k') key += static_cast<char>(byte);
    if (move.action == 'v') value += static_cast<char>(byte);
    EXPECT_EQ(std::string(context.keyBuf.data, context.keyBuf.length), key) << i;
    EXPECT_EQ(std::string(context.valBuf.data, context.valBuf.length), value) << i;
    EXPECT_EQ(CxPropListHasKey(&list, "K"), move.action == 'e') << i;
    CxStringBuffDiscard(&context.keyBuf);
    CxStringBuffDiscard(&context.valBuf);
    CxPropListDiscard(&list);
  }
}

INSTANTIATE_TEST_SUITE_P(States, QlxRdprStateTest, ::testing::ValuesIn(kRows),
                         [](const auto &info) { return std::to_string(info.param.state); });

TEST(QlxRdprStateTable, HasAFunctionForEachNumberButZero) {
  EXPECT_EQ(qlxRdprSTATE_HANDLER_FUNCS[0], nullptr);
  EXPECT_EQ(qlxRdprSTATE_HANDLER_FUNCS[1], qlxRdprDoStartLineState);
  EXPECT_EQ(qlxRdprSTATE_HANDLER_FUNCS[10], qlxRdprDoMultiLineValState);
  EXPECT_EQ(qlxRdprSTATE_HANDLER_FUNCS[14], qlxRdprDoUU3State);
  EXPECT_EQ(kDone, 15);
  EXPECT_EQ(kError, 16);
}

TEST(QlxRdprStateTable, ATargetThatRefusesThePairIsAnError) {
  ReadPropsContext context{};  // no key, so no target takes it
  CxPropList list{};
  context.propList = &list;
  for (const auto function :
       {qlxRdprDoKeyEndBlanksFinalState, qlxRdprDoValCharsState, qlxRdprDoMultiLineValState})
    EXPECT_EQ(function('\n', &context), kError);
}

// Reads texts as files, to the log manager.
class QlxReadConfigTest : public ToolkitTest {
 protected:
  uint8_t read(const std::string &text) {
    dir.write("file.properties", text);
    const ApiLock lock;
    return qlxDoReadProps(dir.path("file.properties").c_str(), nullptr, &status);
  }

  // A property of a configuration; "<none>" without the configuration.
  static std::string property(const char *cfg, const char *key) {
    if (!QlxLogMgrHasCfg(cfg)) return "<none>";
    ObjCfg *found = QlxLogMgrGetCfg(cfg);
    const std::string value = take(QlxGetObjCfgProp(found, key, nullptr));
    QlxReleaseObjCfg(found);
    return value;
  }

  TempDir dir;
  CxStatus status = kUntouched;
};

TEST_F(QlxReadConfigTest, TheLastDotSplitsAKeyIntoConfigurationAndProperty) {
  EXPECT_EQ(read("a.b.level=INFO\nc.d : 2\n"), 1);
  EXPECT_EQ(property("a.b", "level"), "INFO");
  EXPECT_EQ(property("c", "d"), "2");
  EXPECT_EQ(status, kUntouched);
}

TEST_F(QlxReadConfigTest, AKeyWithoutADotFailsTheRead) {
  EXPECT_EQ(read("a.b=1\nnovalue=1\nc.d=2\n"), 0);
  EXPECT_EQ(property("a", "b"), "1");
  EXPECT_EQ(property("c", "d"), "<none>");
  EXPECT_EQ(status, kUntouched);
}

TEST_F(QlxReadConfigTest, AnEmptyConfigurationNameFailsTheRead) {
  EXPECT_EQ(read(".x=1\n"), 0);
}

TEST_F(QlxReadConfigTest, AnEmptyValueIsDeliveredAsEmptyAlsoAtEndOfFile) {
  EXPECT_EQ(read("a.b=\nc.d"), 1);
  EXPECT_EQ(property("a", "b"), "");
  EXPECT_EQ(property("c", "d"), "");
}

TEST_F(QlxReadConfigTest, TheKeyIsWholeAgainAfterItsDelivery) {
  ReadPropsContext context{};
  CxStringBuffAppendStr(&context.keyBuf, "a.b.c");
  {
    const ApiLock lock;
    EXPECT_EQ(qlxRdprEmitCfg(&context), 1);
  }
  EXPECT_EQ(property("a.b", "c"), "");
  EXPECT_STREQ(CxStringBuffPeekStr(&context.keyBuf), "a.b.c");
  CxStringBuffDiscard(&context.keyBuf);
}

}  // namespace
