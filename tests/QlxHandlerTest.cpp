#include "record/QlxFormatted.h"
#include "support/ChainTest.h"

namespace {

class HandlerTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    handler = get("recording", RecordingHandler::kClass);
    plain = get("plain", PlainFormatter::kClass);
  }
  void TearDown() override {
    handler.reset();
    plain.reset();
    ChainTest::TearDown();
  }

  // The handler's formatter, by name.
  std::string formatterName() {
    const Handle current{QlxHandlerGetFormatter(handler.get())};
    return take(QlxGetObjectName(current.get()));
  }

  Handle handler, plain;
};

TEST_F(HandlerTest, StartsWithTheDefaultFormatter) {
  EXPECT_EQ(formatterName(), "quill.defaultFormatter");
}

TEST_F(HandlerTest, HoldsAReferenceToItsFormatterAndHandsOutMore) {
  const uint32_t before = plain->refCount;
  QlxHandlerSetFormatter(handler.get(), plain.get());
  EXPECT_EQ(plain->refCount, before + 1);
  QlxObject *handedOut = QlxHandlerGetFormatter(handler.get());
  EXPECT_EQ(handedOut, plain.get());
  EXPECT_EQ(plain->refCount, before + 2);
  QlxReleaseObject(handedOut);
  QlxHandlerSetFormatter(handler.get(), nullptr);
  EXPECT_EQ(plain->refCount, before);
  EXPECT_EQ(QlxHandlerGetFormatter(handler.get()), nullptr);
}

TEST_F(HandlerTest, KeepsAFormatterAliveThatIsSetAgain) {
  QlxHandlerSetFormatter(handler.get(), plain.get());
  QlxObject *formatterAlone = plain.release();
  QlxReleaseObject(formatterAlone);  // the handler's reference is the only one now
  QlxHandlerSetFormatter(handler.get(), formatterAlone);
  EXPECT_EQ(formatterName(), "plain");
}

TEST_F(HandlerTest, TakesTheFormatterThatItsKeyNames) {
  QlxSetObjProp(handler.get(), "formatterName", "plain");
  EXPECT_EQ(formatterName(), "plain");
  EXPECT_EQ(plain->refCount, 3u);  // registry, test, handler: the look-up's own is given back
}

TEST_F(HandlerTest, LosesItsFormatterToAnUnknownName) {
  QlxSetObjProp(handler.get(), "formatterName", "nobody");
  EXPECT_EQ(formatterName(), "<null>");
}

TEST_F(HandlerTest, KeepsItsFormatterWhenTheKeyHasNoValue) {
  QlxHandlerSetFormatter(handler.get(), plain.get());
  const ApiLock lock;
  QlxBasicHandlerFCfgChange(handler.get(), "formatterName");
  EXPECT_EQ(handler->kind2.formatter, plain.get());
}

TEST_F(HandlerTest, TakesItsKeyOnlyInTheseLetterCases) {
  QlxSetObjProp(handler.get(), "FormatterName", "nobody");
  EXPECT_EQ(formatterName(), "quill.defaultFormatter");
}

TEST_F(HandlerTest, HandsOtherKeysToTheOnesThatAllObjectsShare) {
  QlxSetObjProp(handler.get(), "logging", "off");
  EXPECT_EQ(QlxIsObjectEnabled(handler.get()), 0);
}

TEST_F(HandlerTest, GivesItsFormattersHeaderTrailerAndText) {
  formatter->header = "head";
  formatter->trailer = "tail";
  QlxHandlerSetFormatter(handler.get(), plain.get());
  EXPECT_EQ(take(QlxHandlerGetFmtHeader(handler.get())), "head");
  EXPECT_EQ(take(QlxHandlerGetFmtTrailer(handler.get())), "tail");

  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"body");
  UChar *text = QlxUHandlerDoFmt(handler.get(), event, nullptr);
  EXPECT_EQ(std::u16string(text ? text : u"<null>"), u"body\n");
  OslMemoryFree(text);
  QlxFreeEvent(event);
}

// Operations of a formatter that takes itself from its handler, and then looks at itself.
QlxObject *gHandler;
std::string gNames;
void leave(QlxObject *formatter) {
  qlxIntlHandlerSetFormatter(gHandler, nullptr);
  gNames += formatter->objClass ? std::string(formatter->name) + " " : "gone ";
}

TEST_F(HandlerTest, KeepsAFormatterWhoseOperationsTakeItAwayUntilTheyAreDone) {
  QlxAddUFormatterClass(
      "test_leaving", nullptr, nullptr, nullptr, nullptr,
      [](QlxObject *formatter, Event *, va_list *) { return leave(formatter), CxUStringDup(u""); },
      [](QlxObject *formatter) { return leave(formatter), OslStringDup(""); },
      [](QlxObject *formatter) { return leave(formatter), OslStringDup(""); }, nullptr);
  gHandler = handler.get();
  gNames.clear();
  const auto set = [this] {
    const Handle leaving = get("leaving", "test_leaving");
    QlxHandlerSetFormatter(handler.get(), leaving.get());
  };
  set();
  take(QlxHandlerGetFmtHeader(handler.get()));
  set();
  take(QlxHandlerGetFmtTrailer(handler.get()));
  set();
  OslMemoryFree(QlxUHandlerDoFmt(handler.get(), nullptr, nullptr));
  set();
  {
    const ApiLock lock;
    Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"");
    FormattedBytes text;
    EXPECT_TRUE(text.format(handler.get(), event, nullptr));
    QlxFreeEvent(event);
  }
  EXPECT_EQ(gNames, "leaving leaving leaving leaving ");
}

TEST_F(HandlerTest, GivesNothingWithoutAFormatter) {
  QlxHandlerSetFormatter(handler.get(), nullptr);
  EXPECT_EQ(QlxHandlerGetFormatter(handler.get()), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtHeader(handler.get()), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtTrailer(handler.get()), nullptr);
  EXPECT_EQ(QlxUHandlerDoFmt(handler.get(), nullptr, nullptr), nullptr);
}

TEST_F(HandlerTest, GivesNothingWhenTheFormatterIsNoneOrLacksTheOperation) {
  formatter->header = formatter->trailer = "x";
  QlxHandlerSetFormatter(handler.get(), plain.get());
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"body");
  ObjClass *real = plain->objClass;

  ObjClass without = *real;
  without.op1.fFormat = nullptr;
  without.op2.fGetHeader = nullptr;
  without.op3.fGetTrailer = nullptr;
  ObjClass other = *real;
  other.kind = Logger;
  for (ObjClass *objClass : {&without, &other, static_cast<ObjClass *>(nullptr)}) {
    plain->objClass = objClass;
    EXPECT_EQ(QlxHandlerGetFmtHeader(handler.get()), nullptr);
    EXPECT_EQ(QlxHandlerGetFmtTrailer(handler.get()), nullptr);
    EXPECT_EQ(QlxUHandlerDoFmt(handler.get(), event, nullptr), nullptr);
  }
  plain->objClass = real;
  QlxFreeEvent(event);
}

TEST_F(HandlerTest, AnythingElseThanAHandlerGivesNothingAndIsNotChanged) {
  for (QlxObject *object : {logger.get(), plain.get(), static_cast<QlxObject *>(nullptr)}) {
    QlxHandlerSetFormatter(object, plain.get());
    EXPECT_EQ(QlxHandlerGetFormatter(object), nullptr);
    EXPECT_EQ(QlxHandlerGetFmtHeader(object), nullptr);
    EXPECT_EQ(QlxHandlerGetFmtTrailer(object), nullptr);
    EXPECT_EQ(QlxUHandlerDoFmt(object, nullptr, nullptr), nullptr);
  }
  EXPECT_EQ(logger->kind2.word, 0u);
  EXPECT_EQ(plain->kind2.word, 0u);
}

TEST_F(HandlerTest, GivesNothingWhenItsClassIsNotAHandlers) {
  formatter->header = formatter->trailer = "x";
  QlxHandlerSetFormatter(handler.get(), plain.get());
  ObjClass *real = handler->objClass;
  ObjClass other = *real;
  other.kind = Filter;
  handler->objClass = &other;
  EXPECT_EQ(QlxHandlerGetFormatter(handler.get()), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtHeader(handler.get()), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtTrailer(handler.get()), nullptr);
  QlxHandlerSetFormatter(handler.get(), nullptr);
  handler->objClass = real;
  EXPECT_EQ(formatterName(), "plain");
}

TEST_F(HandlerTest, AnObjectWithoutClassGivesNothingAndIsNotChanged) {
  QlxObject bare = {};
  QlxHandlerSetFormatter(&bare, plain.get());
  EXPECT_EQ(bare.kind2.word, 0u);
  EXPECT_EQ(QlxHandlerGetFormatter(&bare), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtHeader(&bare), nullptr);
}

TEST_F(HandlerTest, IgnoresNullInItsConfiguration) {
  QlxBasicHandlerFCfgChange(nullptr, "formatterName");
  QlxBasicHandlerFCfgChange(handler.get(), nullptr);
  EXPECT_EQ(formatterName(), "quill.defaultFormatter");
}

TEST_F(HandlerTest, AClassWithoutOperationsGetsOnesThatDoNothing) {
  QlxAddHandlerClass("test_idle", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  const Handle idle = get("idle", "test_idle");
  QlxAddListener(idle.get(), handler.get());
  EXPECT_EQ(idle->objClass->op1.fProcess, QlxBasicHandlerFProcess);
  EXPECT_EQ(idle->objClass->op2.fOpen, QlxBasicHandlerFOpen);
  EXPECT_EQ(idle->objClass->op3.fClose, QlxBasicHandlerFClose);
  process(idle, INFO);
  QlxBasicHandlerFOpen(idle.get());
  QlxBasicHandlerFClose(idle.get());
  QlxBasicHandlerFProcess(nullptr, nullptr, nullptr);
  EXPECT_RECORDED(u"");
}

}  // namespace
