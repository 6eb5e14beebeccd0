// XML records and trace lines on their two ways: straight as bytes, and as UTF-16 that is narrowed.
#include "object/QlxObjClass.h"
#include "record/QlxCachedBuffer.h"
#include "record/QlxFormatted.h"

#include <cstdarg>
#include <functional>
#include <random>
#include <string>

#include <qlx/class/event.h>
#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>

#include "record/QlxLoggedEvent.h"
#include "record/QlxRecordText.h"
#include "support/ChainTest.h"
#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/Take.h"
#include "util/CxOwned.h"
#include "util/CxUString.h"
#include "text/QlxNumberCache.h"

namespace {

constexpr const char *kFormatters[] = {"qlx_xmlformatter", "qlx_vextraceformatter"};

constexpr const char *kSingleFlags[] = {"singleServer", "singleProduct", "singleProductId",
                                        "singleComponent"};

constexpr const char *kKeys[] = {
    "qlx_prop_srcfile",
    "qlx_prop_srcfunction",
    "qlx_prop_srcline",
    "organization",
    "product",
    "component",
    "productInstance",
    "client",
    "server",
    "serverFormat",
    "correlationId",
    "processId",
    "threadId",
    "another",
    "",
    "thread_d",
    "SERVER",
};

constexpr const char *kValues[] = {
    nullptr, "",      "value", "host.example.com",   "]]>",        "<&\">",
    "7",     "-7",    " 12x",  "4294967295",         "4294967296", "99999999999999999999",
    "\x01",  "\n\t ", ".",     "gr\xc3\xb6\xc3\x9f", "\xff\xfe",
};

constexpr const UChar *kTexts[] = {
    u"",
    u"plain text",
    u"ABC123E an identifier",
    u"gr\u00f6\u00dfer als {0}",
    u"{0",
    u"a ]]> in it",
    u"half \xD800 a pair",
    u"ABC123{0} bound {1,number}",
    u"\x01\x1f",
    u"ABCDEF123E",
    u"it''s '{0}'",
    u"\u0141BC123E",
    u"{0}",
    u"\U0001F600 ABC",
    u"ABC123",
    u"{0} {1,number,integer} {2,number}",
};

constexpr int32_t kLevels[] = {DEBUG_MAX, DEBUG_MID,   DEBUG_MIN, INFO, WARN, ERROR,
                               FATAL,     UNSPECIFIED, 1234,      0,    -1};

constexpr double kTimes[] = {1155718135123.0, 0.0, -1.0, 1155718135123.75, 1e18};

constexpr const UChar *kArguments[] = {u"first", u"", u"\u00e4", u"123E", u"]]>"};

using EventPtr = Owned<Event, QlxFreeEvent>;

EventPtr eventOf(const UChar *text) {
  EventPtr event{QlxVaAllocUEvent(INFO, nullptr, nullptr, text)};
  event->time = kTimes[0];
  return event;
}

class RecordBytesTest : public ChainTest {
 protected:
  static constexpr const char *kNothing = "nothing";

  void SetUp() override {
    ChainTest::SetUp();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
    handler = get("console", "qlx_consolehandler");
    use(kFormatters[0]);
  }
  void TearDown() override {
    formatter.reset();
    handler.reset();
    ChainTest::TearDown();
  }

  void use(const char *className) {
    formatter = get(className, className);
    QlxHandlerSetFormatter(handler.get(), formatter.get());
  }

  // The preamble is due again.
  void restart() {
    const ApiLock lock;
    QlxPDXMLFormatterFGetHeader(formatter.get());
  }

  std::string bytes(Event *event, va_list *args) {
    FormattedBytes line;
    const bool has = line.format(handler.get(), event, args);
    return has ? std::string(line.data(), line.length()) : kNothing;
  }
  std::string wide(Event *event, va_list *args) {
    CachedBuffer buffer;
    RecordText record{buffer.get()};
    const bool has = formatter->objClass->own->append(formatter.get(), event, args, record);
    return has ? ::take(CxUStringDupUCharToStr(buffer.get()->data)) : kNothing;
  }
  std::string own(Event *event, va_list *args) {
    const OwnedUStr text{qlxIntlUHandlerDoFmt(handler.get(), event, args)};
    return text ? ::take(CxUStringDupUCharToStr(text.get())) : kNothing;
  }
  // Whether it is written straight as bytes.
  bool isStraight(Event *event, ...) {
    va_list args;
    va_start(args, event);
    const ApiLock lock;
    CxAsciiLine line;
    RecordText record{&line};
    const bool straight = formatter->objClass->own->append(formatter.get(), event, &args, record);
    va_end(args);
    return straight;
  }

  using Way = std::string (RecordBytesTest::*)(Event *, va_list *);

  std::string made(Way way, Event *event, ...) {
    va_list args;
    va_start(args, event);
    const ApiLock lock;
    const std::string record = (this->*way)(event, &args);
    va_end(args);
    return record;
  }

  // Of an equal event each, with the preamble and then without.
  std::string compare(const std::function<EventPtr()> &make, const UChar *argument = u"",
                      int32_t whole = 0, double number = 0) {
    std::string wanted[2];
    for (const Way way : {&RecordBytesTest::own, &RecordBytesTest::wide, &RecordBytesTest::bytes}) {
      restart();
      for (std::string &expected : wanted) {
        const EventPtr event = make();
        const std::string got = made(way, event.get(), argument, whole, number);
        if (way == &RecordBytesTest::own) expected = got;
        EXPECT_EQ(got, expected);
      }
    }
    return wanted[0];
  }

  // What a log call's event with a noted source becomes.
  std::string noted(const EventSource &source) {
    const ApiLock lock;
    const LoggedEvent event{DEBUG_MIN, u"text", source};
    event->time = kTimes[0];
    const std::string ascii = bytes(event.get(), nullptr);
    EXPECT_EQ(wide(event.get(), nullptr), ascii);
    EXPECT_NE(qlxNotedEventSource(event.get()), nullptr) << "nobody looked at the properties";
    qlxSettleNotedEvent();
    EXPECT_EQ(bytes(event.get(), nullptr), ascii);
    EXPECT_EQ(wide(event.get(), nullptr), ascii);
    return ascii;
  }

  IcuDefaults defaults;
  Handle handler, formatter;
};

TEST_F(RecordBytesTest, HaveTheBytesOfTheFormattersOwnTextForAnyEvent) {
  std::minstd_rand random(20060816);
  const auto oneOf = [&](const auto &all) { return all[random() % std::size(all)]; };
  int nonAscii = 0, records = 0;
  for (int round = 0; round < 3000; ++round) {
    SCOPED_TRACE(round);
    use(oneOf(kFormatters));
    for (const char *flag : kSingleFlags)
      QlxSetObjProp(formatter.get(), flag, random() % 2 ? "true" : "false");
    const UChar *text = oneOf(kTexts);
    const auto seed = random();
    const auto make = [&] {
      std::minstd_rand own(seed);
      EventPtr event = eventOf(text);
      event->level = kLevels[own() % std::size(kLevels)];
      event->time = kTimes[own() % std::size(kTimes)];
      event->isMessage = own() % 2;
      if (own() % 4 == 0) QlxSetEventMessageId(event.get(), own() % 2 ? "" : "MINE");
      const uint32_t rarity = 1 + own() % 12;
      for (const char *key : kKeys) {
        const char *value = kValues[own() % std::size(kValues)];
        if (own() % rarity == 0) QlxSetEventProp(event.get(), key, value);
      }
      return event;
    };
    const std::string record = compare(make, oneOf(kArguments), static_cast<int32_t>(random()),
                                       static_cast<double>(random()) / 7);
    nonAscii += record.find_first_of("\xc3\xc5\xef\xf0") != std::string::npos;
    ++records;
    ASSERT_FALSE(HasFailure());
  }
  EXPECT_GT(nonAscii, records / 10);
  EXPECT_LT(nonAscii, records * 9 / 10);
}

TEST_F(RecordBytesTest, AreStraightlyBytesWhenAllIsAsciiAndFits) {
  for (const char *className : kFormatters) {
    SCOPED_TRACE(className);
    use(className);
    EXPECT_TRUE(isStraight(eventOf(u"plain").get()));
    EXPECT_TRUE(isStraight(eventOf(u"{0}").get(), u"bound"));
    EXPECT_FALSE(isStraight(eventOf(u"\u00e4").get()));
    EXPECT_FALSE(isStraight(eventOf(u"{0}").get(), u"\u00e4"));
    EXPECT_FALSE(isStraight(eventOf(std::u16string(5000, u'x').c_str()).get()));
    const EventPtr event = eventOf(u"plain");
    QlxSetEventProp(event.get(), "qlx_prop_srcfile", "\xc3\xa4");
    EXPECT_FALSE(isStraight(event.get()));
  }
}

TEST_F(RecordBytesTest, AreWholeWhateverTheirLength) {
  for (const char *className : kFormatters) {
    use(className);
    for (size_t length = 3700; length < 4100; ++length) {
      const std::u16string text(length, u'x');
      compare([&] { return eventOf(text.c_str()); });
    }
  }
}

TEST_F(RecordBytesTest, HaveThePreambleOnceWhicheverWayTheFirstOneTakes) {
  QlxSetObjProp(formatter.get(), "singleProductId", "true");
  const auto countOf = [&](const UChar *text) {
    const EventPtr event = eventOf(text);
    QlxSetEventProp(event.get(), "productInstance", "x");
    const ApiLock lock;
    return bytes(event.get(), nullptr).find(" <ProductInstance>x</ProductInstance>\n");
  };
  for (const UChar *first : {u"plain", u"\u00e4"}) {
    restart();
    EXPECT_EQ(countOf(first), 0U);
    EXPECT_EQ(countOf(u"plain"), std::string::npos);
    EXPECT_EQ(countOf(u"\u00e4"), std::string::npos);
  }
}

TEST_F(RecordBytesTest, HaveABundlesMessageAndItsParameters) {
  const ResourceBundles bundles;
  ASSERT_TRUE(bundles.add("root", "KEY { \"ABC123E {0} {1,number,integer} {2,number}\" }"));
  const std::string bundle = bundles.path();
  for (const UChar *argument : {u"alice", u"\u00e4"}) {
    const auto make = [&] {
      EventPtr event{QlxVaAllocUEvent(INFO, bundle.c_str(), "KEY", nullptr)};
      event->time = kTimes[0];
      return event;
    };
    EXPECT_NE(compare(make, argument, -5, 2.75).find("<Param><![CDATA[-5]]></Param>"),
              std::string::npos);
  }
}

TEST_F(RecordBytesTest, HaveANotedSourceAsItsPropertiesWouldHaveIt) {
  struct {
    EventSource source;
    const char *xml, *trace;
  } const cases[] = {
      {{"file.c", "run", 42},
       "<Source FileName=\"file.c\" Method=\"run\" Line=\"42\"/>",
       " - file.c:run(42) - "},
      {{"file.c", nullptr, -1},
       "<Source FileName=\"file.c\" Line=\"18446744073709551615\"/>",
       " - file.c(18446744073709551615) - "},
      {{nullptr, "run", 42}, "<Source FileName=\"None\" Method=\"None\"/>", " -  - run - "},
      {{nullptr, nullptr, 42}, "<Source FileName=\"None\" Method=\"None\"/>", " -  -  - "},
  };
  for (const auto &each : cases) {
    use(kFormatters[0]);
    EXPECT_NE(noted(each.source).find(each.xml), std::string::npos) << each.xml;
    use(kFormatters[1]);
    EXPECT_NE(noted(each.source).find(each.trace), std::string::npos) << each.trace;
  }
}

TEST_F(RecordBytesTest, NeedNoMemoryOnceTheirKindWasMade) {
  for (const char *className : kFormatters) {
    use(className);
    const EventPtr event = eventOf(u"plain text");
    const ApiLock lock;
    for (int i = 0; i < 3; ++i) bytes(event.get(), nullptr);
    FailingMemory memory;
    FormattedBytes line;
    EXPECT_TRUE(line.format(handler.get(), event.get(), nullptr));
    EXPECT_EQ(memory.attempts(), 0U);
  }
}

// ---- A line that is built

TEST(RecordTextTest, ALineThatLostAPieceStaysLost) {
  CxAsciiLine line;
  RecordText out(&line);
  out << std::string_view{"a"};
  EXPECT_TRUE(out.isWhole());
  out.value("\xc3\xa4") << std::string_view{"b"};
  EXPECT_FALSE(out.isWhole());
  out.value("c").number(7) << std::u16string_view{u"d"};
  EXPECT_FALSE(out.isWhole());
}

TEST(RecordTextTest, NumbersAreTheSameInBothKindsOfText) {
  CxAsciiLine line;
  CxUStringBuff buffer{};
  RecordText ascii(&line), wide(&buffer);
  for (RecordText *out : {&ascii, &wide}) {
    out->number(uint64_t{0}) << std::string_view{" "};
    out->number(UINT64_MAX) << std::string_view{" "};
    out->number(int32_t{-1}) << std::string_view{" "};
    out->number(kWholeNumber, -12.0) << std::string_view{" "};
    out->number(kFraction, 2.75);
    EXPECT_TRUE(out->isWhole());
  }
  const char *wanted = "0 18446744073709551615 18446744073709551615 -12 2.75";
  EXPECT_EQ(std::string(line.data(), line.length()), wanted);
  EXPECT_EQ(::take(CxUStringDupUCharToStr(buffer.data)), wanted);
  CxUStringBuffDiscard(&buffer);
}

TEST(RecordTextTest, ANullValueAppendsNothing) {
  CxAsciiLine line;
  RecordText out(&line);
  out.value(static_cast<const char *>(nullptr));
  EXPECT_TRUE(out.isWhole());
  EXPECT_EQ(line.length(), 0U);
}

}  // namespace
