// The product elements that are written once, in front of the first record after each header.
#include "support/FailingMemory.h"
#include "support/PDXMLFormatterFixture.h"
#include "support/TempDir.h"

namespace {

constexpr const char *kSingleFlags[] = {"singleServer", "singleProduct", "singleComponent",
                                        "singleProductId"};
const std::u16string kProducts[] = {
    u" <Server Format=\"\">x</Server>\n",
    u" <ProductId>x</ProductId>\n",
    u" <Component>x</Component>\n",
    u" <ProductInstance>x</ProductInstance>\n",
};

class PDXMLPreambleTest : public PDXMLFormatterFixture {
 protected:
  static EventPtr productEvent() {
    EventPtr event = makeEvent();
    for (const char *key : {"server", "product", "component", "productInstance"})
      QlxSetEventProp(event.get(), key, "x");
    return event;
  }
};

TEST_F(PDXMLPreambleTest, ASingleElementStandsBeforeTheFirstRecordAndInNone) {
  for (size_t single = 0; single < std::size(kSingleFlags); ++single) {
    for (const char *flag : kSingleFlags) set(flag, "false");
    set(kSingleFlags[single], "true");
    resetHeader();
    std::u16string others;
    for (size_t i = 0; i < std::size(kProducts); ++i)
      if (i != single) others += kProducts[i];
    EXPECT_EQ(formatted(productEvent()), kProducts[single] + trace(others)) << kSingleFlags[single];
    EXPECT_EQ(formatted(productEvent()), trace(others)) << kSingleFlags[single];
  }
}

TEST_F(PDXMLPreambleTest, AllSingleElementsStandInTheirOrder) {
  for (const char *flag : kSingleFlags) set(flag, "true");
  std::u16string all;
  for (const std::u16string &element : kProducts) all += element;
  EXPECT_EQ(formatted(productEvent()), all + trace());
  EXPECT_EQ(formatted(productEvent()), trace());
  for (const char *flag : kSingleFlags) set(flag, "false");
  EXPECT_EQ(formatted(productEvent()), trace(all));
}

TEST_F(PDXMLPreambleTest, EachHeaderMakesItDueAgain) {
  set("singleProduct", "true");
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "product", "x");
  for (int opened = 0; opened < 3; ++opened) {
    EXPECT_EQ(formatted(event), kProducts[1] + trace());
    EXPECT_EQ(formatted(event), trace());
    resetHeader();
  }
}

TEST_F(PDXMLPreambleTest, AFirstRecordWithoutTheElementLeavesItOutForGood) {
  set("singleProduct", "true");
  EXPECT_EQ(formatted(makeEvent()), trace());
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "product", "x");
  EXPECT_EQ(formatted(event), trace());
}

TEST_F(PDXMLPreambleTest, AFileHasItAtEachOpening) {
  const TempDir dir;
  const Handle handler = get("handler", "qlx_filehandler");
  QlxHandlerSetFormatter(handler.get(), formatter.get());
  const std::string path = dir.path("app.xml");
  for (const auto &[key, value] : {std::pair{"fileName", path.c_str()},
                                   std::pair{"maxFileBytes", "500"}, std::pair{"maxFiles", "3"}})
    ASSERT_EQ(QlxSetObjProp(handler.get(), key, value), 1);
  set("singleProduct", "true");
  const std::u16string wide = trace();
  const std::string narrow(wide.begin(), wide.end());
  const std::string preamble = " <ProductId>x</ProductId>\n";
  ASSERT_GT(3 * narrow.size(), 500U);
  ASSERT_LT(2 * narrow.size() + preamble.size(), 500U);
  for (int i = 0; i < 4; ++i) {
    const EventPtr event = makeEvent();
    QlxSetEventProp(event.get(), "product", "x");
    const ApiLock lock;
    QlxFileUHandlerFProcess(handler.get(), event.get(), nullptr);
    EXPECT_EQ(event->status.code, 0);
  }
  EXPECT_EQ(dir.read("app1.xml"), preamble + narrow + narrow + narrow);
  EXPECT_EQ(dir.read("app.xml"), preamble + narrow);
}

// Each file has it, since it is opened by the event that is written to it next. Afterwards what one
// opening makes due is written once.
TEST_F(PDXMLPreambleTest, OfHandlersThatShareAFormatterTheOneThatWritesNextHasIt) {
  const TempDir dir;
  const Handle handlers[] = {get("first", "qlx_filehandler"), get("second", "qlx_filehandler")};
  for (const Handle &handler : handlers) {
    QlxHandlerSetFormatter(handler.get(), formatter.get());
    ASSERT_EQ(QlxSetObjProp(handler.get(), "fileName", dir.path(handler->name).c_str()), 1);
  }
  set("singleProduct", "true");
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "product", "x");
  for (int i = 0; i < 2; ++i) {
    for (const Handle &handler : handlers) {
      const ApiLock lock;
      QlxFileUHandlerFProcess(handler.get(), event.get(), nullptr);
    }
    resetHeader();
  }
  const std::u16string wide = trace();
  const std::string record(wide.begin(), wide.end());
  const std::string preamble = " <ProductId>x</ProductId>\n";
  EXPECT_EQ(dir.read("first"), preamble + record + preamble + record);
  EXPECT_EQ(dir.read("second"), preamble + record + record);
}

// ---- Configuration

TEST_F(PDXMLPreambleTest, AFlagWhosePropertyIsGoneIsClear) {
  constexpr const char *kFlags[] = {"singleServer",    "singleProduct",  "singleComponent",
                                    "singleProductId", "forceAsMessage", "forceAsTrace"};
  for (const char *flag : kFlags) set(flag, "true");
  resetHeader();
  for (const char *flag : kFlags) clear(flag);
  std::u16string all;
  for (const std::u16string &element : kProducts) all += element;
  EXPECT_EQ(formatted(productEvent()), trace(all));
  EXPECT_TRUE(formatted(markedMessage(u"text")).starts_with(u"<Message "));
}

// ---- Without memory

TEST_F(PDXMLPreambleTest, ARecordThatLosesAPieceIsNullAndItsPreambleStaysDue) {
  set("singleServer", "true");
  const EventPtr event = productEvent();
  QlxSetEventProp(event.get(), "long", std::string(4000, 'x').c_str());
  const std::u16string whole = formatted(event);
  size_t lost = 0;
  for (uint64_t nth = 1;; ++nth) {
    resetHeader();
    {
      FailingMemory memory;
      memory.failOnce(nth);
      const std::u16string found = formatted(event);
      if (memory.failures() == 0) break;
      const bool withoutText = has(found, u"<![CDATA[]]></LogText>");
      EXPECT_TRUE(found == u"<null>" || found == whole || withoutText) << nth;
      if (found != u"<null>") continue;
    }
    ++lost;
    EXPECT_EQ(formatted(event), whole) << "with its preamble, after " << nth;
  }
  EXPECT_GE(lost, 2U) << "the first block, and when it grows";
}

}  // namespace
