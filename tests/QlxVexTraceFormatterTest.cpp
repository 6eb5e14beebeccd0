#include "support/FormatterTest.h"

#include <string>

#include "support/FailingMemory.h"
#include "support/ResourceBundles.h"
#include "support/TempDir.h"

namespace {

class VexTraceFormatterTest : public FormatterTest {
 protected:
  VexTraceFormatterTest() : FormatterTest("qlx_vextraceformatter", QlxVexTraceUFormatterFFormat) {}
};

#define START u"\x1e[2006-08-16 10:48:55.123+02:00] - "

// ---- The line

TEST_F(VexTraceFormatterTest, AnEventWithNothingHasAllSixSeparatorsAroundEmptyFields) {
  EXPECT_EQ(formatted(makeEvent()), START u"INFO  -  -  -  -  - text\n");
}

TEST_F(VexTraceFormatterTest, AFullLineHasSevenFields) {
  const EventPtr event = makeEvent(u"Started");
  set(event, "server", "alpha.example.org");
  set(event, "processId", "12");
  set(event, "threadId", "34");
  set(event, "qlx_prop_srcfile", "a.c");
  set(event, "qlx_prop_srcfunction", "f");
  set(event, "qlx_prop_srcline", "7");
  QlxSetEventMessageId(event.get(), "ABC0001I");
  EXPECT_EQ(formatted(event), START u"INFO  - alpha - p12:t34 - a.c:f(7) - ABC0001I - Started\n");
}

TEST_F(VexTraceFormatterTest, EveryLevelHasAWordOfFiveCharacters) {
  const struct {
    int32_t level;
    const char16_t *word;
  } cases[] = {
      {DEBUG_MAX, u" MAX "}, {DEBUG_MID, u" MID "},   {DEBUG_MIN, u" MIN "}, {INFO, u"INFO "},
      {WARN, u"WARN "},      {ERROR, u"ERROR"},       {FATAL, u"ERROR"},     {ALL, u"OTHER"},
      {OFF, u"OTHER"},       {UNSPECIFIED, u"OTHER"}, {INFO + 1, u"OTHER"},  {999, u"OTHER"},
      {-1000, u"OTHER"},     {INT32_MAX, u"OTHER"},   {INT32_MIN, u"OTHER"},
  };
  for (const auto &[level, word] : cases) {
    EXPECT_EQ(std::u16string(word).size(), 5u);
    EXPECT_EQ(formatted(makeEvent(u"m", level)),
              START + std::u16string(word) + u" -  -  -  -  - m\n")
        << level;
  }
}

TEST_F(VexTraceFormatterTest, TheHostIsTheServerUpToItsFirstDot) {
  const struct {
    const char *server;
    const char16_t *host;
  } cases[] = {{"alpha", u"alpha"}, {"alpha.", u"alpha"},
               {"a.b.c", u"a"},     {".alpha", u""},
               {"", u""},           {"NO_HOSTNAME", u"NO_HOSTNAME"}};
  for (const auto &[server, host] : cases) {
    const EventPtr event = makeEvent();
    set(event, "server", server);
    EXPECT_EQ(formatted(event), START u"INFO  - " + std::u16string(host) + u" -  -  -  - text\n");
  }
}

TEST_F(VexTraceFormatterTest, AColonStandsOnlyBetweenAProcessAndAThread) {
  const EventPtr process = makeEvent(), thread = makeEvent();
  set(process, "processId", "12");
  set(thread, "threadId", "34");
  EXPECT_EQ(formatted(process), START u"INFO  -  - p12 -  -  - text\n");
  EXPECT_EQ(formatted(thread), START u"INFO  -  - t34 -  -  - text\n");
}

TEST_F(VexTraceFormatterTest, ProcessAndThreadAreUnsignedEachInItsOwnWidth) {
  const EventPtr event = makeEvent();
  QlxSetEventPropLong(event.get(), "processId", -1);
  QlxSetEventPropLong(event.get(), "threadId", -1);
  EXPECT_EQ(formatted(event), START u"INFO  -  - p18446744073709551615:t4294967295 -  -  - text\n");
  set(event, "processId", "2147483647");
  set(event, "threadId", "2147483648");
  EXPECT_EQ(formatted(event), START u"INFO  -  - p2147483647:t2147483648 -  -  - text\n");
}

TEST_F(VexTraceFormatterTest, AProcessOrThreadThatIsNoNumberIsAbsent) {
  const EventPtr event = makeEvent();
  set(event, "processId", "many");
  set(event, "threadId", "34th");
  EXPECT_EQ(formatted(event), START u"INFO  -  - t34 -  -  - text\n");
}

TEST_F(VexTraceFormatterTest, TheSourceIsWhatThereIsOfFileFunctionAndLine) {
  const struct {
    const char *file, *function, *number;
    const char16_t *source;
  } cases[] = {
      {"a.c", nullptr, nullptr, u"a.c"}, {nullptr, "f", nullptr, u"f"},
      {nullptr, nullptr, "7", u"(7)"},   {"a.c", "f", nullptr, u"a.c:f"},
      {"a.c", nullptr, "7", u"a.c(7)"},  {nullptr, "f", "7", u"f(7)"},
      {"a.c", "f", "7", u"a.c:f(7)"},    {"", "", "0", u":(0)"},
      {"a.c", "f", "seven", u"a.c:f"},   {nullptr, nullptr, "-1", u"(18446744073709551615)"},
  };
  for (const auto &[file, function, number, source] : cases) {
    const EventPtr event = makeEvent();
    if (number) set(event, "qlx_prop_srcline", number);
    if (function) set(event, "qlx_prop_srcfunction", function);
    if (file) set(event, "qlx_prop_srcfile", file);
    EXPECT_EQ(formatted(event), START u"INFO  -  -  - " + std::u16string(source) + u" -  - text\n");
  }
}

TEST_F(VexTraceFormatterTest, OtherPropertiesAreNoPartOfTheLine) {
  const EventPtr event = makeEvent();
  for (const char *key : {"organization", "product", "component", "client", "serverFormat",
                          "productInstance", "correlationId", "own", "Server"}) {
    set(event, key, "value");
  }
  EXPECT_EQ(formatted(event), START u"INFO  -  -  -  -  - text\n");
}

// ---- Message and identifier

TEST_F(VexTraceFormatterTest, ReadsTheIdentifierOffTheBoundTextAndStoresItNowhere) {
  const EventPtr event = makeEvent(u"{0}0001E wrong");
  EXPECT_EQ(formattedWith(event.get(), u"ABC"),
            START u"INFO  -  -  -  - ABC0001E - ABC0001E wrong\n");
  EXPECT_EQ(event->messageId, nullptr);
}

TEST_F(VexTraceFormatterTest, AnIdentifierThatTheEventCarriesCountsAndNotItsText) {
  const EventPtr event = makeEvent(u"ABC0001E wrong");
  QlxSetEventMessageId(event.get(), "own");
  EXPECT_EQ(formatted(event), START u"INFO  -  -  -  - own - ABC0001E wrong\n");
  QlxSetEventMessageId(event.get(), "");
  EXPECT_EQ(formatted(event), START u"INFO  -  -  -  -  - ABC0001E wrong\n");
}

TEST_F(VexTraceFormatterTest, ATextThatCannotBeBoundIsEmpty) {
  const EventPtr event = makeMessage("/no/such/bundle", "key");
  EXPECT_EQ(formatted(event), START u"WARN  -  -  -  -  - \n");
  EXPECT_NE(event->message->error, 0);
  EXPECT_EQ(formatted(makeEvent(u"")), START u"INFO  -  -  -  -  - \n");
  EXPECT_EQ(formatted(makeEvent(nullptr)), START u"INFO  -  -  -  -  - \n");
}

TEST_F(VexTraceFormatterTest, TheTextStandsAsItIsSeparatorsLineEndsAndAll) {
  EXPECT_EQ(formatted(makeEvent(u"a - b\nc\u00e9\x1e")),
            START u"INFO  -  -  -  -  - a - b\nc\u00e9\x1e\n");
}

// ---- The formatter

TEST_F(VexTraceFormatterTest, NoKeyReachesIt) {
  const std::u16string before = formatted(makeEvent());
  for (const char *key : {"dateTimeFormat", "locale", "separator", "logging", "listenerNames"}) {
    set(key, "off");
  }
  EXPECT_EQ(formatter->kind1.separator, nullptr);
  EXPECT_EQ(formatter->kind2.dateTimeFormat, nullptr);
  EXPECT_EQ(formatter->kind3.locale, nullptr);
  EXPECT_EQ(formatter->enabled, 1);
  const EventPtr event = makeEvent();
  EXPECT_EQ(formatted(event), before);
  EXPECT_EQ(event->locale, nullptr);
}

TEST_F(VexTraceFormatterTest, SettingsThatItHasAllTheSameDoCount) {
  {
    const ApiLock lock;
    qlxIntlSetObjProp(formatter.get(), "dateTimeFormat", "HH:mm");
    qlxIntlSetObjProp(formatter.get(), "locale", "de");
    QlxBasicFormatterFCfgChange(formatter.get(), "dateTimeFormat");
    QlxBasicFormatterFCfgChange(formatter.get(), "locale");
  }
  const EventPtr event = makeEvent(u"{0,number,integer} left");
  EXPECT_EQ(formattedWith(event.get(), 1234), u"\x1e[10:48] - INFO  -  -  -  -  - 1.234 left\n");
  EXPECT_STREQ(event->locale, "de");
}

TEST_F(VexTraceFormatterTest, TheEventsLocaleCounts) {
  const EventPtr event = makeEvent(u"{0,number,integer} left");
  EXPECT_EQ(formattedWith(event.get(), 1234), START u"INFO  -  -  -  -  - 1,234 left\n");
  qlxSetEventLocale(event.get(), "de");
  EXPECT_EQ(formattedWith(event.get(), 1234), START u"INFO  -  -  -  -  - 1.234 left\n");
}

TEST_F(VexTraceFormatterTest, HasNeitherHeaderNorTrailerNorVariables) {
  const Handle handler = get("console", "qlx_consolehandler");
  QlxHandlerSetFormatter(handler.get(), formatter.get());
  EXPECT_EQ(QlxHandlerGetFmtHeader(handler.get()), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtTrailer(handler.get()), nullptr);
  EXPECT_EQ(formatter->vars, nullptr);
  EXPECT_EQ(formatter->objClass->fCfgChange, nullptr);
}

TEST_F(VexTraceFormatterTest, NoFormatterNoEventNoLine) {
  const EventPtr event = makeEvent();
  const Handle logger = get("log", "qlx_basiclogger");
  const ApiLock lock;
  EXPECT_EQ(QlxVexTraceUFormatterFFormat(nullptr, event.get(), nullptr), nullptr);
  EXPECT_EQ(QlxVexTraceUFormatterFFormat(formatter.get(), nullptr, nullptr), nullptr);
  EXPECT_EQ(QlxVexTraceUFormatterFFormat(logger.get(), event.get(), nullptr), nullptr);
}

// ---- Without memory

TEST_F(VexTraceFormatterTest, ALineThatLosesAPieceIsNull) {
  const EventPtr event = makeEvent(std::u16string(9000, u'x').c_str());
  set(event, "server", "alpha");
  set(event, "qlx_prop_srcfile", std::string(2000, 'f').c_str());
  const std::u16string whole = formatted(event);
  const std::u16string withoutText = whole.substr(0, whole.find(u'x')) + u"\n";
  size_t lost = 0;
  for (uint64_t nth = 1;; ++nth) {
    FailingMemory memory;
    memory.failOnce(nth);
    const std::u16string found = formatted(event);
    if (memory.failures() == 0) break;
    EXPECT_TRUE(found == u"<null>" || found == whole || found == withoutText) << nth;
    lost += found == u"<null>";
  }
  EXPECT_EQ(lost, 3U) << "the first block, and when it grows for the file and for the text";
}

// ---- A whole host

class VexTraceFileTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
    ASSERT_TRUE(bundles.add("root", R"( copied { "ABC0001I {0,number,integer} files" } )"));
    const std::string file = dir.write("app.properties", R"(
app.className = qlx_pdlogger
app.server = alpha.example.org
app.product = Quill
app.level = ALL
app.listenerNames = clock
clock.className = test_clock
clock.listenerNames = file
file.className = qlx_filehandler
file.formatterName = trace
file.fileEncoding = UTF-8
trace.className = qlx_vextraceformatter
trace.dateTimeFormat = HH
trace.locale = de
trace.logging = off
trace.listenerNames = app
file.fileName = )" + dir.path("trace.log"));
    // A filter of the host's own, which sets the events' time.
    QlxAddFilterClass("test_clock", nullptr, nullptr, nullptr, QlxBasicObjectFCfgChange, nullptr,
                      setTime, nullptr);
    ASSERT_EQ(QlxOpenToolkit(file.c_str(), nullptr), 1);
  }
  void TearDown() override { QlxCloseToolkit(); }

  static uint8_t setTime(QlxObject *, Event *event, va_list *) {
    event->time = kTime;
    return 1;
  }

  const IcuDefaults defaults;
  const TempDir dir;
  const ResourceBundles bundles;
};

TEST_F(VexTraceFileTest, AToolkitWritesItsLinesToAFileWhateverItsConfigurationSays) {
  QlxObject *logger = QlxGetObject("app", nullptr);
  const std::string start = "\x1e[2006-08-16 10:48:55.123+02:00] - ";
  const std::string here = " - alpha - p" + std::to_string(CxProcessGetCurrentID()) + ":t" +
                           std::to_string(static_cast<uint32_t>(CxThreadGetCurrentID())) + " - ";
  EXPECT_EQ(QlxLogInfo(logger, bundles.path().c_str(), "copied", 1234).msgStatus, 0);
  QlxLogDebugMid(logger, "a.c", "f", 7, u"at {0}", u"\u00e9");
  QlxLogDebugMax(logger, nullptr, "f", 7, u"deep");
  QlxLogUText(logger, u"");
  QlxReleaseObject(logger);
  QlxCloseToolkit();
  EXPECT_EQ(dir.read("trace.log"), start + "INFO " + here + " - ABC0001I - ABC0001I 1,234 files\n" +
                                       start + " MID " + here + "a.c:f(7) -  - at \xC3\xA9\n" +
                                       start + " MAX " + here + "f -  - deep\n" +  //
                                       start + "OTHER" + here + " -  - \n");
}

}  // namespace
