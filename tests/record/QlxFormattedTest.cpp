#include "object/QlxObjClass.h"
#include "record/QlxCachedBuffer.h"
#include "record/QlxFormatted.h"
#include "record/QlxRecordText.h"

#include <algorithm>
#include <cstdarg>
#include <limits>
#include <functional>
#include <random>
#include <string>

#include <qlx/class/containers.h>
#include <qlx/class/event.h>
#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>
#include <qlx/class/object.h>

#include "support/ChainTest.h"
#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/Take.h"
#include "util/CxOwned.h"
#include "util/CxUString.h"

namespace {

constexpr double kTimes[] = {
    1155718135123.0,
    0.0,
    -1.0,
    -86400000.0 * 365 * 200,
    1155718135123.75,
    1155718135000.0,
    253402300800000.0,
    1e18,
    -1e18,
    std::numeric_limits<double>::quiet_NaN(),
    std::numeric_limits<double>::infinity(),
};

constexpr const char *kDatePatterns[] = {
    nullptr,
    "",
    "yyyy-MM-dd HH:mm:ss.SSS",
    "HH:mm:ss",
    "'c'",
    "EEEE, d MMMM",
    "yyyy'\xe5\xb9\xb4'",
    "SSS",
    "'S' ss",
    "GGGG yyyy",
    "HH:mm:ss zzzz",
    "'",
};

constexpr const char *kSeparators[] = {nullptr, "", " ", "|", " :: ", "\xc2\xb7", "\t"};

constexpr const char *kValues[] = {
    nullptr,
    "",
    "value",
    "a value with blanks",
    ("gr\xc3\xb6\xc3\x9f"
     "e"),
    "\xff\xfe",
    "-7",
    "42",
};

constexpr const char *kLineKeys[] = {
    "qlx_prop_srcfile",
    "qlx_prop_srcfunction",
    "qlx_prop_srcline",
    "organization",
    "product",
    "component",
    "client",
    "server",
    "other",
};

constexpr const UChar *kTexts[] = {
    nullptr,
    u"",
    u"plain text",
    u"gr\u00f6\u00dfer als {0}",
    u"{0}",
    u"{0} of {1,number,integer}: {2,number}",
    u"{0} '{1}' it''s {1,number,integer}",
    u"{2,number,percent} {1,number,integer} {0}",
    u"{1,number,integer}",
    u"{0",
    u"\U0001F600 outside the plane",
    u"half \xD800 a pair",
    u"ends with a tab\t\x7f",
};

constexpr const UChar *kArguments[] = {u"first", u"", u"\u00e4", u"{0}", u"a'b"};

constexpr const char *kLocales[] = {nullptr, "en_US", "de_DE", "ar_EG", "ja_JP", "th_TH_TH", "fa"};

class FormattedTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
    handler = get("console", "qlx_consolehandler");
    basic = get("basic", "qlx_basicformatter");
    QlxHandlerSetFormatter(handler.get(), basic.get());
  }
  void TearDown() override {
    basic.reset();
    handler.reset();
    ChainTest::TearDown();
  }

  static constexpr const char *kNothing = "nothing";

  // The line as handlers get it.
  std::string bytes(Event *event, ...) {
    va_list args;
    va_start(args, event);
    const ApiLock lock;
    FormattedBytes line;
    const bool has = line.format(handler.get(), event, &args);
    va_end(args);
    return has ? std::string(line.data(), line.length()) : kNothing;
  }
  std::string wide(Event *event, ...) {
    va_list args;
    va_start(args, event);
    const ApiLock lock;
    std::string line = kNothing;
    CachedBuffer buffer;
    RecordText record{buffer.get()};
    QlxObject *formatter = handler->kind2.formatter;
    const QlxOwnClass *own = formatter ? formatter->objClass->own : nullptr;
    if (!own) {
      const OwnedUStr text{qlxIntlUHandlerDoFmt(handler.get(), event, &args)};
      if (text) line = ::take(CxUStringDupUCharToStr(text.get()));
    } else if (own->append(formatter, event, &args, record)) {
      EXPECT_EQ(buffer.get()->length, std::u16string(buffer.get()->data).size());
      line = ::take(CxUStringDupUCharToStr(buffer.get()->data));
    }
    va_end(args);
    return line;
  }

  // The formatter's own text, narrowed.
  std::string expected(Event *event, ...) {
    va_list args;
    va_start(args, event);
    const ApiLock lock;
    const OwnedUStr text{qlxIntlUHandlerDoFmt(handler.get(), event, &args)};
    va_end(args);
    return text ? ::take(CxUStringDupUCharToStr(text.get())) : kNothing;
  }

  // Each of the three in turn, of equal events.
  void compare(const std::function<Owned<Event, QlxFreeEvent>()> &make, const UChar *argument,
               int32_t whole, double number) {
    const auto a = make(), b = make(), c = make();
    const std::string wanted = expected(a.get(), argument, whole, number);
    EXPECT_EQ(bytes(b.get(), argument, whole, number), wanted);
    EXPECT_EQ(wide(c.get(), argument, whole, number), wanted);
    EXPECT_EQ(b->message->error, a->message->error);
    EXPECT_EQ(c->message->error, a->message->error);
    nonAscii += std::any_of(wanted.begin(), wanted.end(), [](char c) { return c < 0; });
    ++lines;
  }

  // A property of the formatter; null takes it away.
  void set(const char *key, const char *value) {
    if (value) {
      QlxSetObjProp(basic.get(), key, value);
      return;
    }
    const ApiLock lock;
    qlxIntlStringToStringMapRem(qlxFetchObjPropMap(basic.get()), key);
    QlxBasicFormatterFCfgChange(basic.get(), key);
  }

  IcuDefaults defaults;
  Handle handler, basic;
  int lines = 0, nonAscii = 0;
};

using EventPtr = Owned<Event, QlxFreeEvent>;

EventPtr eventOf(const UChar *text, double time = kTimes[0]) {
  EventPtr event{QlxVaAllocUEvent(INFO, nullptr, nullptr, text)};
  event->time = time;
  return event;
}

TEST_F(FormattedTest, HasTheBytesOfTheFormattersOwnTextForAnyEvent) {
  std::minstd_rand random(20060816);
  const auto oneOf = [&](const auto &all) { return all[random() % std::size(all)]; };
  const UChar *const zones[] = {u"UTC", u"Europe/Berlin", u"Asia/Kolkata", u"America/St_Johns"};
  for (int round = 0; round < 400; ++round) {
    SCOPED_TRACE(round);
    if (round % 10 == 0) {
      ASSERT_TRUE(IcuDefaults::setLocale(oneOf(kLocales)));
      ASSERT_TRUE(IcuDefaults::setZone(oneOf(zones)));
    }
    set("dateTimeFormat", oneOf(kDatePatterns));
    set("separator", oneOf(kSeparators));
    set("locale", random() % 3 == 0 ? oneOf(kLocales) : nullptr);
    for (int i = 0; i < 10; ++i) {
      const UChar *text = oneOf(kTexts);
      const double time = oneOf(kTimes);
      const char *locale = random() % 4 == 0 ? oneOf(kLocales) : nullptr;
      const auto seed = random();
      const auto make = [&] {
        std::minstd_rand own(seed);
        EventPtr event = eventOf(text, time);
        if (locale) qlxSetEventLocale(event.get(), locale);
        for (const char *key : kLineKeys) {
          const char *value = kValues[own() % std::size(kValues)];
          if (own() % 6 == 0) QlxSetEventProp(event.get(), key, value);
        }
        return event;
      };
      compare(make, oneOf(kArguments), static_cast<int32_t>(random()) - 1000000000,
              static_cast<double>(random()) / 7 - 1e8);
      ASSERT_FALSE(HasFailure());
    }
  }
  EXPECT_EQ(lines, 4000);
  EXPECT_GT(nonAscii, 500);
  EXPECT_LT(nonAscii, 3500);
}

TEST_F(FormattedTest, HasTheTimeInTheDigitsOfItsLocale) {
  for (const char *locale : {"ar_EG", "de_DE", "ja_JP", "th_TH_TH", "fa", "en_US"}) {
    SCOPED_TRACE(locale);
    ASSERT_TRUE(IcuDefaults::setLocale(locale));
    for (const double time : kTimes) compare([&] { return eventOf(u"x", time); }, u"", 0, 0);
  }
  EXPECT_GT(nonAscii, 0);
}

TEST_F(FormattedTest, IsWholeWhateverItsLength) {
  for (size_t length = 4000; length < 4200; ++length) {
    const std::u16string text(length, u'x');
    compare([&] { return eventOf(text.c_str()); }, u"", 0, 0);
    const std::u16string last = text + u"\u00e4";
    compare([&] { return eventOf(last.c_str()); }, u"", 0, 0);
    compare([] { return eventOf(u"{0}"); }, text.c_str(), 0, 0);
    const std::string value(length, 'v');
    compare(
        [&] {
          EventPtr event = eventOf(u"x");
          QlxSetEventProp(event.get(), "server", value.c_str());
          return event;
        },
        u"", 0, 0);
  }
  const std::u16string large(1 << 20, u'x');
  compare([&] { return eventOf(large.c_str()); }, u"", 0, 0);
}

TEST_F(FormattedTest, BindsItsArgumentsAnewWhenALineIsNotAscii) {
  const EventPtr event = eventOf(u"{0} {1,number,integer} \u00e4 {2,number}");
  set("dateTimeFormat", "'c'");
  EXPECT_EQ(bytes(event.get(), u"first", 2, 3.5), "c first 2 \xc3\xa4 3.5\n");
}

TEST_F(FormattedTest, AsksAHostsFormatter) {
  format(handler);
  const EventPtr event = eventOf(u"text");
  EXPECT_EQ(bytes(event.get()), "text\n");
  EXPECT_EQ(wide(event.get()), "text\n");
  EXPECT_EQ(formatter->formatted, 2);
  formatter->silent = true;
  EXPECT_EQ(bytes(event.get()), kNothing);
  EXPECT_EQ(wide(event.get()), kNothing);
}

UChar *formatOwn(QlxObject *, Event *, va_list *) {
  return CxUStringDup(u"of the host's formatter");
}

TEST_F(FormattedTest, AsksAFormatterOfAHostsCopyOfTheLibrarysRecord) {
  {
    const ApiLock lock;
    auto *copy = static_cast<ObjClass *>(OslMemoryMalloc(sizeof(ObjClass)));
    *copy = *qlxToolkitGetClassDef("qlx_basicformatter");
    copy->name = OslStringDup("test_copy");
    copy->op1.fFormat = formatOwn;
    qlxToolkitAddClassDef("test_copy", copy);
  }
  const Handle own = get("copy", "test_copy");
  QlxHandlerSetFormatter(handler.get(), own.get());
  const EventPtr event = eventOf(u"text");
  EXPECT_EQ(bytes(event.get()), "of the host's formatter");
  EXPECT_EQ(wide(event.get()), "of the host's formatter");
}

TEST_F(FormattedTest, TellsThatTheLibrarysOperationHadNoMemoryInAHostsClass) {
  QlxAddUFormatterClass("test_xml", nullptr, QlxPDXMLFormatterFAllocVars,
                        QlxPDXMLFormatterFFreeVars, nullptr, QlxPDXMLUFormatterFFormat, nullptr,
                        nullptr, nullptr);
  const Handle own = get("xml", "test_xml");
  QlxHandlerSetFormatter(handler.get(), own.get());
  int lost = 0;
  for (uint64_t nth = 1, failures = 1; failures > 0; ++nth) {
    const EventPtr event = eventOf(u"text");
    const ApiLock lock;
    FailingMemory memory;
    memory.failOnce(nth);
    FormattedBytes text;
    EXPECT_TRUE(text.format(handler.get(), event.get(), nullptr)) << nth;
    lost += text.data() == nullptr;
    failures = memory.failures();
  }
  EXPECT_GT(lost, 0);
}

TEST_F(FormattedTest, IsNothingWithoutAFormatter) {
  QlxHandlerSetFormatter(handler.get(), nullptr);
  const EventPtr event = eventOf(u"text");
  EXPECT_EQ(bytes(event.get()), kNothing);
  EXPECT_EQ(wide(event.get()), kNothing);
}

// A host's binder, which is asked once a line.
int bound;
UChar *bindOwn(I18Msg *, va_list *) {
  ++bound;
  return CxUStringDup(u"of the host's binder");
}
UChar *bindNothing(I18Msg *, va_list *) {
  ++bound;
  return nullptr;
}

TEST_F(FormattedTest, AsksTheBinderOfTheFormattersClassOnce) {
  struct {
    const char *name;
    fBindMsg bind;
    const char *line;
  } const cases[] = {{"test_binding", bindOwn, "c of the host's binder\n"},
                     {"test_unbound", bindNothing, "c \n"}};
  for (const auto &each : cases) {
    QlxAddUFormatterClass(each.name, nullptr, nullptr, nullptr, QlxBasicFormatterFCfgChange,
                          nullptr, nullptr, nullptr, each.bind);
    const Handle own = get(each.name, each.name);
    QlxSetObjProp(own.get(), "dateTimeFormat", "'c'");
    QlxHandlerSetFormatter(handler.get(), own.get());
    const EventPtr event = eventOf(u"text");
    bound = 0;
    EXPECT_EQ(bytes(event.get()), each.line);
    EXPECT_EQ(bound, 1);
    EXPECT_EQ(wide(event.get()), each.line);
    EXPECT_EQ(bound, 2);
  }
}

TEST_F(FormattedTest, TakesAnEventWithoutAMessage) {
  set("dateTimeFormat", "'c'");
  EventPtr event = eventOf(u"text");
  I18Msg *message = std::exchange(event->message, nullptr);
  EXPECT_EQ(bytes(event.get()), "c \n");
  EXPECT_EQ(wide(event.get()), "c \n");
  QlxFreeI18Msg(message);
}

TEST_F(FormattedTest, LeavesTheFormattersLocaleOnTheEvent) {
  for (const char16_t *text : {u"plain", u"\u00e4"}) {
    set("locale", "de_DE");
    const EventPtr event = eventOf(text);
    bytes(event.get());
    EXPECT_STREQ(event->locale, "de_DE");
    EXPECT_STREQ(event->message->locale, "de_DE");
  }
}

TEST_F(FormattedTest, MayBeMadeWhileAnotherIsOnItsWay) {
  set("dateTimeFormat", "'c'");
  const EventPtr outer = eventOf(u"outer \u00e4"), inner = eventOf(u"inner, and longer \u00e4");
  const ApiLock lock;
  FormattedBytes first, second;
  EXPECT_TRUE(first.format(handler.get(), outer.get(), nullptr));
  EXPECT_TRUE(second.format(handler.get(), inner.get(), nullptr));
  EXPECT_EQ(std::string(first.data(), first.length()), "c outer \u00e4\n");
  EXPECT_EQ(std::string(second.data(), second.length()), "c inner, and longer \u00e4\n");
}

}  // namespace
