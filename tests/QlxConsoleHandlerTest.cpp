#include "support/CaptureStdout.h"
#include "support/ChainTest.h"

namespace {

class ConsoleHandlerTest : public HandledChainTest {
 protected:
  ConsoleHandlerTest() : HandledChainTest("console", "qlx_consolehandler") {}

  void SetUp() override {
    HandledChainTest::SetUp();
    format(handler);
  }
  void TearDown() override {
    formatter->trailer.reset();  // what is still open writes none outside of a capture
    HandledChainTest::TearDown();
  }

  void forward() {
    const Handle next = get("recording", RecordingHandler::kClass);
    QlxAddListener(handler.get(), next.get());
  }

  void close() {
    const ApiLock lock;
    QlxConsoleHandlerFClose(handler.get());
  }

  void open() {
    const ApiLock lock;
    QlxConsoleHandlerFOpen(handler.get());
  }
};

TEST_F(ConsoleHandlerTest, FollowsEachTextWithALineFeedOfItsOwn) {
  CaptureStdout out;
  log(u"first");
  log(u"second");
  EXPECT_EQ(out.bytes(), "first\n\nsecond\n\n");
}

TEST_F(ConsoleHandlerTest, WritesTheHeaderOnceBeforeTheFirstRecord) {
  formatter->header = "head";
  CaptureStdout out;
  log(u"first");
  log(u"second");
  EXPECT_EQ(out.bytes(), "head\nfirst\n\nsecond\n\n");
}

TEST_F(ConsoleHandlerTest, WritesTheHeaderOnceWhenItIsOpenedFirst) {
  formatter->header = "head";
  CaptureStdout out;
  open();
  open();
  log(u"first");
  EXPECT_EQ(out.bytes(), "head\nfirst\n\n");
}

TEST_F(ConsoleHandlerTest, WritesTheTrailerOnceAndTheHeaderAgainAfterIt) {
  formatter->header = "head";
  formatter->trailer = "tail";
  CaptureStdout out;
  close();  // closed already
  log(u"first");
  close();
  close();
  log(u"second");
  EXPECT_EQ(out.bytes(), "head\nfirst\n\ntail\nhead\nsecond\n\n");
}

TEST_F(ConsoleHandlerTest, ChangesItsStateWithoutHeaderAndTrailerToo) {
  CaptureStdout out;
  open();
  formatter->header = "head";
  log(u"first");
  close();
  log(u"second");
  EXPECT_EQ(out.bytes(), "first\n\nhead\nsecond\n\n");
}

TEST_F(ConsoleHandlerTest, WritesTheTrailerWhenItGoes) {
  formatter->trailer = "tail";
  CaptureStdout out;
  log(u"only");
  QlxRemListener(logger.get(), handler.get());
  handler.reset();
  EXPECT_EQ(out.bytes(), "only\n\ntail\n");
}

TEST_F(ConsoleHandlerTest, WritesNothingWithoutAFormatterAndForwardsAllTheSame) {
  forward();
  QlxHandlerSetFormatter(handler.get(), nullptr);
  CaptureStdout out;
  log(u"text");
  EXPECT_EQ(out.bytes(), "");
  EXPECT_RECORDED(u"text|");
}

TEST_F(ConsoleHandlerTest, IsOpenedByAnEventThatNoFormatterFormats) {
  CaptureStdout out;
  QlxHandlerSetFormatter(handler.get(), nullptr);
  log(u"text");
  format(handler);
  formatter->header = "head";
  log(u"next");
  EXPECT_EQ(out.bytes(), "next\n\n");
}

TEST_F(ConsoleHandlerTest, WritesNothingForATextOfNullAndForwardsAllTheSame) {
  forward();
  formatter->silent = true;
  CaptureStdout out;
  log(u"text");
  EXPECT_EQ(out.bytes(), "");
  EXPECT_RECORDED(u"text|");
}

TEST_F(ConsoleHandlerTest, ForwardsTheEventAndTheArguments) {
  forward();
  CaptureStdout out;
  QlxLogUText(logger.get(), u"{0}!", u"hello");
  EXPECT_EQ(out.bytes(), "hello!\n\n");
  EXPECT_RECORDED(u"hello!|");
}

TEST_F(ConsoleHandlerTest, WritesAndForwardsNothingWhileItIsDisabled) {
  forward();
  formatter->header = "head";
  QlxSetObjectEnabled(handler.get(), 0);
  CaptureStdout out;
  log(u"text");
  EXPECT_EQ(out.bytes(), "");
  EXPECT_RECORDED(u"");
}

TEST_F(ConsoleHandlerTest, WritesAnEmptyLineAfterEachBasicRecord) {
  format(handler, "basic", "qlx_basicformatter");
  const Handle basic = get("basic");
  QlxSetObjProp(basic.get(), "dateTimeFormat", "'T'");
  CaptureStdout out;
  log(u"first");
  log(u"second");
  EXPECT_EQ(out.bytes(), "T first\n\nT second\n\n");
}

TEST_F(ConsoleHandlerTest, KeepsTheOrderWithWhatTheHostPrintsItself) {
  CaptureStdout out;
  std::printf("before\n");
  log(u"text");
  std::printf("after\n");
  EXPECT_EQ(out.bytes(), "before\ntext\n\nafter\n");
}

TEST_F(ConsoleHandlerTest, IgnoresEveryEventWithoutVariables) {
  QlxRemListener(logger.get(), handler.get());
  handler = getWithoutVariables("without", "qlx_consolehandler");
  QlxAddListener(logger.get(), handler.get());
  format(handler);
  forward();
  CaptureStdout out;
  log(u"text");
  open();
  close();
  EXPECT_EQ(out.bytes(), "");
  EXPECT_RECORDED(u"");
}

TEST_F(ConsoleHandlerTest, IgnoresNull) {
  QlxConsoleHandlerFOpen(nullptr);
  QlxConsoleHandlerFClose(nullptr);
  QlxConsoleHandlerFFreeVars(nullptr);
  QlxConsoleUHandlerFProcess(nullptr, nullptr, nullptr);
  formatter->header = "head";
  CaptureStdout out;
  QlxConsoleUHandlerFProcess(handler.get(), nullptr, nullptr);
  EXPECT_EQ(out.bytes(), "");
}

}  // namespace
