#include "support/PDXMLFormatterFixture.h"

#include "support/ResourceBundles.h"

namespace {

class PDXMLFormatterTest : public PDXMLFormatterFixture {};

// ---- Whole records

TEST_F(PDXMLFormatterTest, AMessageHasAllItsElementsInOneOrder) {
  const ResourceBundles bundles;
  ASSERT_TRUE(bundles.add("root", R"(k { "ABC0001W File {0}, {1,number,integer} times" })"));
  const EventPtr event = makeMessage(bundles.path(), "k");
  for (const char *key :
       {"client", "correlationId", "organization", "qlx_prop_srcfunction", "qlx_prop_srcfile",
        "productInstance", "component", "product", "serverFormat", "server", "own"})
    QlxSetEventProp(event.get(), key, key);
  QlxSetEventPropInt(event.get(), "qlx_prop_srcline", 42);
  QlxSetEventPropLong(event.get(), "threadId", 7);
  QlxSetEventPropLong(event.get(), "processId", 8);
  const std::string path = bundles.path();
  EXPECT_EQ(formattedWith(event.get(), u"a.txt", -3),
            u"<Message Id=\"ABC0001W\" Severity=\"WARN\">\n" + kTimeElement +
                u" <Server Format=\"serverFormat\">server</Server>\n"
                u" <ProductId>product</ProductId>\n"
                u" <Component>component</Component>\n"
                u" <ProductInstance>productInstance</ProductInstance>\n"
                u" <LogText><![CDATA[ABC0001W File a.txt, -3 times]]></LogText>\n"
                u" <LogAttribs><Key>organization</Key><Value>organization</Value>"
                u"<Key>own</Key><Value>own</Value></LogAttribs>\n"
                u" <Source FileName=\"qlx_prop_srcfile\" Method=\"qlx_prop_srcfunction\""
                u" Line=\"42\"/>\n"
                u" <TranslationInfo Resource Bundle=\"" +
                std::u16string(path.begin(), path.end()) +
                u"\" MsgKey=\"k\"><Param><![CDATA[a.txt]]></Param><Param><![CDATA[-3]]></Param>"
                u"</TranslationInfo>\n"
                u" <CorrelationId>correlationId</CorrelationId>\n"
                u" <Principal>client</Principal>\n"
                u"</Message>\n");
}

TEST_F(PDXMLFormatterTest, ATraceHasThreadAndProcessAndNoTranslation) {
  const EventPtr event = makeEvent(u"text", DEBUG_MID);
  for (const char *key : {"client", "correlationId", "product", "own", "qlx_prop_srcfile"})
    QlxSetEventProp(event.get(), key, key);
  QlxSetEventPropLong(event.get(), "processId", 8);
  QlxSetEventPropLong(event.get(), "threadId", 7);
  EXPECT_EQ(formatted(event), u"<Trace Level=\"MID\">\n" + kTimeElement +
                                  u" <ProductId>product</ProductId>\n"
                                  u" <LogText><![CDATA[text]]></LogText>\n"
                                  u" <LogAttribs><Key>own</Key><Value>own</Value></LogAttribs>\n"
                                  u" <Source FileName=\"qlx_prop_srcfile\"/>\n"
                                  u" <Thread>7</Thread>\n"
                                  u" <Process>8</Process>\n"
                                  u" <CorrelationId>correlationId</CorrelationId>\n"
                                  u" <Principal>client</Principal>\n"
                                  u"</Trace>\n");
}

TEST_F(PDXMLFormatterTest, ATraceWithoutASourceSaysNone) {
  EXPECT_EQ(formatted(makeEvent()), trace());
}

TEST_F(PDXMLFormatterTest, AMessageWithoutASourceSaysNothing) {
  EXPECT_EQ(formatted(markedMessage(u"text")),
            u"<Message Id=\"None\" Severity=\"INFO\">\n" + kTimeElement +
                u" <LogText><![CDATA[text]]></LogText>\n"
                u" <TranslationInfo Resource Bundle=\"\" MsgKey=\"\"></TranslationInfo>\n"
                u"</Message>\n");
}

TEST_F(PDXMLFormatterTest, NothingIsEscapedAndTextMayEndItsSection) {
  const EventPtr event = makeEvent(u"<&>]]> \u4E00");
  QlxSetEventProp(event.get(), "<\">", "a]]><b>");
  EXPECT_EQ(formatted(event),
            u"<Trace Level=\"INFO\">\n" + kTimeElement +
                u" <LogText><![CDATA[<&>]]> \u4E00]]></LogText>\n"
                u" <LogAttribs><Key><\"></Key><Value>a]]><b></Value></LogAttribs>\n" +
                kNoSource + u"</Trace>\n");
}

TEST_F(PDXMLFormatterTest, AMessageThatBindsToNothingHasAnEmptyText) {
  for (const UChar *text : {u"{0", u"", static_cast<const UChar *>(nullptr)})
    EXPECT_TRUE(has(formatted(makeEvent(text)), u" <LogText><![CDATA[]]></LogText>\n"));
  const EventPtr event = makeEvent(u"{0");
  formatted(event);
  EXPECT_EQ(event->message->error, U_UNMATCHED_BRACES);
}

TEST_F(PDXMLFormatterTest, AnEventWithoutAMessageHasNeitherTextNorTranslation) {
  const EventPtr event = markedMessage(u"text");
  qlxIntlFreeI18Msg(event->message);
  event->message = nullptr;
  EXPECT_EQ(formatted(event), u"<Message Id=\"None\" Severity=\"INFO\">\n" + kTimeElement +
                                  u" <LogText><![CDATA[]]></LogText>\n</Message>\n");
}

TEST_F(PDXMLFormatterTest, WithoutFormatterVariablesOrEventThereIsNoRecord) {
  const EventPtr event = makeEvent();
  EXPECT_EQ(formattedBy(nullptr, event.get()), u"<null>");
  EXPECT_EQ(formattedBy(formatter.get(), nullptr), u"<null>");
  const Handle basic = get("basic", "qlx_basicformatter");
  EXPECT_EQ(formattedBy(basic.get(), event.get()), u"<null>");
  const Handle handler = get("handler", "qlx_filehandler");
  EXPECT_EQ(formattedBy(handler.get(), event.get()), u"<null>");
}

TEST_F(PDXMLFormatterTest, HeaderAndTrailerAreNull) {
  EXPECT_EQ(QlxPDXMLFormatterFGetHeader(formatter.get()), nullptr);
  EXPECT_EQ(QlxPDXMLFormatterFGetTrailer(formatter.get()), nullptr);
  EXPECT_EQ(QlxPDXMLFormatterFGetHeader(nullptr), nullptr);
  EXPECT_EQ(QlxPDXMLFormatterFGetTrailer(nullptr), nullptr);
}

// ---- Kind

TEST_F(PDXMLFormatterTest, OneForceAloneDecidesTheKind) {
  const struct {
    const char *asMessage, *asTrace;
    bool messageIsMessage, traceIsMessage;
  } kCases[] = {
      {"false", "false", true, false},
      {"true", "true", true, false},
      {"true", "false", true, true},
      {"false", "true", false, false},
  };
  for (const auto &[asMessage, asTrace, messageIsMessage, traceIsMessage] : kCases) {
    set("forceAsMessage", asMessage);
    set("forceAsTrace", asTrace);
    const std::u16string ofMessage = formatted(markedMessage(u"text"));
    const std::u16string ofTrace = formatted(makeEvent());
    EXPECT_EQ(ofMessage.starts_with(u"<Message "), messageIsMessage) << asMessage << asTrace;
    EXPECT_EQ(ofMessage.ends_with(u"</Message>\n"), messageIsMessage) << asMessage << asTrace;
    EXPECT_EQ(ofTrace.starts_with(u"<Message "), traceIsMessage) << asMessage << asTrace;
    EXPECT_EQ(has(ofTrace, u" <TranslationInfo"), traceIsMessage) << asMessage << asTrace;
  }
}

// ---- Start

TEST_F(PDXMLFormatterTest, WithoutALevelThereIsNoLevelAttribute) {
  EXPECT_EQ(startOf(makeEvent(u"text", UNSPECIFIED)), u"<Trace>\n");
  const EventPtr message = markedMessage(u"ABC123E");
  message->level = UNSPECIFIED;
  EXPECT_EQ(startOf(message), u"<Message Id=\"ABC123E\">\n");
}

TEST_F(PDXMLFormatterTest, FatalIsAnErrorAndAnUnnamedLevelIsOther) {
  EXPECT_EQ(startOf(makeEvent(u"text", FATAL)), u"<Trace Level=\"ERROR\">\n");
  EXPECT_EQ(startOf(makeEvent(u"text", 4500)), u"<Trace Level=\"OTHER\">\n");
  const EventPtr message = markedMessage(u"text");
  message->level = FATAL;
  EXPECT_EQ(startOf(message), u"<Message Id=\"None\" Severity=\"ERROR\">\n");
}

TEST_F(PDXMLFormatterTest, TheIdentifierIsTheEventsOrElseTheTexts) {
  const EventPtr event = markedMessage(u"ABCDEF123E: text");
  EXPECT_EQ(startOf(event), u"<Message Id=\"ABCDEF123E\" Severity=\"INFO\">\n");
  EXPECT_EQ(event->messageId, nullptr) << "formatting only reads";
  QlxSetEventMessageId(event.get(), "OWN");
  EXPECT_EQ(startOf(event), u"<Message Id=\"OWN\" Severity=\"INFO\">\n");
  EXPECT_EQ(startOf(markedMessage(u"text")), u"<Message Id=\"None\" Severity=\"INFO\">\n");
}

TEST_F(PDXMLFormatterTest, AnEmptyIdentifierIsNoneWithoutALookIntoTheText) {
  const EventPtr event = markedMessage(u"ABC123E: text");
  QlxSetEventMessageId(event.get(), "");
  EXPECT_EQ(startOf(event), u"<Message Id=\"None\" Severity=\"INFO\">\n");
}

// ---- Time and locale

TEST_F(PDXMLFormatterTest, TheTimeIsInTheConfiguredPatternBesideItsMilliseconds) {
  set("dateTimeFormat", "HH:mm");
  EXPECT_TRUE(has(formatted(makeEvent()), u" <Time Millis=\"1155718135123\">10:48</Time>\n"));
}

TEST_F(PDXMLFormatterTest, TheFormattersLocaleStaysOnTheEventAndBinds) {
  const ResourceBundles bundles;
  ASSERT_TRUE(bundles.add("root", R"(k { "{0,number}" })"));
  ASSERT_TRUE(bundles.add("de", R"(k { "{0,number} {1}" })"));
  const EventPtr event = makeMessage(bundles.path(), "k");
  set("locale", "de");
  const std::u16string german = formattedWith(event.get(), 1234.5, u"Mal");
  EXPECT_TRUE(has(german, u"<![CDATA[1.234,5 Mal]]></LogText>"));
  EXPECT_TRUE(has(german, u"<Param><![CDATA[1234.5]]></Param><Param><![CDATA[Mal]]></Param>"));
  EXPECT_STREQ(event->locale, "de");
}

TEST_F(PDXMLFormatterTest, WithoutALocaleOfItsOwnTheEventsBinds) {
  const EventPtr event = makeEvent(u"{0,number}");
  qlxSetEventLocale(event.get(), "de");
  EXPECT_TRUE(has(formattedWith(event.get(), 1234.5), u"<![CDATA[1.234,5]]>"));
  EXPECT_STREQ(event->locale, "de");
}

TEST_F(PDXMLFormatterTest, TheSeparatorIsTakenAndNotUsed) {
  set("separator", "|");
  EXPECT_STREQ(formatter->kind1.separator, "|");
  EXPECT_EQ(formatted(makeEvent()), trace());
}

// ---- Properties

TEST_F(PDXMLFormatterTest, FreeAttributesStandInTheOrderInWhichTheyWereSet) {
  const EventPtr event = makeEvent();
  for (const char *key : {"z", "product", "a", "organization"})
    QlxSetEventProp(event.get(), key, "x");
  QlxSetEventProp(event.get(), "z", "last");
  EXPECT_TRUE(has(formatted(event),
                  u" <LogAttribs><Key>z</Key><Value>last</Value><Key>a</Key><Value>x</Value>"
                  u"<Key>organization</Key><Value>x</Value></LogAttribs>\n"));
}

TEST_F(PDXMLFormatterTest, WithoutAFreeAttributeThereIsNoElementForThem) {
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "product", "p");
  EXPECT_EQ(formatted(event), trace(u" <ProductId>p</ProductId>\n"));
}

TEST_F(PDXMLFormatterTest, PropertiesAreReadInTheDefaultCodePage) {
  ASSERT_TRUE(IcuDefaults::setCodePage("UTF-8"));
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "product", "\xE4\xB8\x80");
  EXPECT_EQ(formatted(event), trace(u" <ProductId>\u4E00</ProductId>\n"));
}

TEST_F(PDXMLFormatterTest, AThreadIsUnsignedInItsThirtyTwoBitsAndAProcessInSixtyFour) {
  const EventPtr event = makeEvent();
  QlxSetEventPropLong(event.get(), "threadId", -1);
  QlxSetEventPropLong(event.get(), "processId", -1);
  EXPECT_EQ(formatted(event), trace(u"",
                                    u" <Thread>4294967295</Thread>\n"
                                    u" <Process>18446744073709551615</Process>\n"));
}

TEST_F(PDXMLFormatterTest, AThreadOrProcessThatIsNoNumberIsLeftOut) {
  const EventPtr event = makeEvent();
  QlxSetEventProp(event.get(), "threadId", "none");
  QlxSetEventProp(event.get(), "processId", "");
  EXPECT_EQ(formatted(event), trace());
}

// ---- Configuration

TEST_F(PDXMLFormatterTest, FlagsAreReadAsBooleans) {
  for (const auto &[value, isSet] : {std::pair{"TRUE", true}, std::pair{"yes", false}}) {
    set("forceAsMessage", value);
    EXPECT_EQ(startOf(makeEvent()).starts_with(u"<Message "), isSet) << value;
  }
}

TEST_F(PDXMLFormatterTest, OtherKeysAreThoseOfTheBasicFormatter) {
  set("logging", "false");
  EXPECT_EQ(QlxIsObjectEnabled(formatter.get()), 0);
  set("ForceAsMessage", "true");
  EXPECT_EQ(formatted(makeEvent()), trace()) << "keys are case-sensitive";
  QlxPDXMLFormatterFCfgChange(formatter.get(), nullptr);
  QlxPDXMLFormatterFCfgChange(nullptr, "forceAsTrace");
}

TEST_F(PDXMLFormatterTest, WithoutVariablesTheKeysOfTheBasicFormatterStillCount) {
  formatter = getWithoutVariables("without", "qlx_xmlformatter");
  set("dateTimeFormat", "HH");
  EXPECT_STREQ(formatter->kind2.dateTimeFormat, "HH");
  set("logging", "false");
  EXPECT_EQ(QlxIsObjectEnabled(formatter.get()), 0);
  set("forceAsTrace", "true");
  EXPECT_EQ(formatted(makeEvent()), u"<null>");
}

TEST_F(PDXMLFormatterTest, WithoutArgumentsTextAndParametersAreTheSameZeros) {
  const ResourceBundles bundles{"zeros"};
  ASSERT_TRUE(bundles.add("root", R"(k { "{0,number,integer} of {1,number}" } )"));
  const std::u16string all = formatted(makeMessage(bundles.path(), "k"));
  EXPECT_TRUE(has(all, u"<LogText><![CDATA[0 of 0]]></LogText>"));
  EXPECT_TRUE(has(all, u"<Param><![CDATA[0]]></Param><Param><![CDATA[0]]></Param></Tr"));
}

TEST_F(PDXMLFormatterTest, AnObjectOfAnotherKindKeepsItsVariables) {
  static char variables[] = "all stay as they are";
  QlxAddHandlerClass(
      "test_other", nullptr, [] { return static_cast<void *>(variables); }, nullptr, nullptr,
      nullptr, nullptr, nullptr);
  const Handle handler = get("handler", "test_other");
  QlxSetObjProp(handler.get(), "singleComponent", "true");
  {
    const ApiLock lock;
    QlxPDXMLFormatterFCfgChange(handler.get(), "singleComponent");
    QlxPDXMLFormatterFGetHeader(handler.get());
  }
  EXPECT_STREQ(variables, "all stay as they are");
}

}  // namespace
