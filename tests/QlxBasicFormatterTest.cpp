#include "support/FormatterTest.h"

#include <string>

#include <unicode/ustring.h>

#include "object/QlxClasses.h"
#include "support/FailingMemory.h"
#include "text/QlxFormatCache.h"

namespace {

class BasicFormatterTest : public FormatterTest {
 protected:
  BasicFormatterTest() : FormatterTest("qlx_basicformatter", QlxBasicUFormatterFFormat) {}

  std::u16string date(double time) {
    return ::take(QlxBasicUFormatterFormatDate(formatter.get(), time));
  }
};

// ---- The line

TEST_F(BasicFormatterTest, ALineIsTheTimeWithItsOffsetTheMessageAndALineFeed) {
  EXPECT_EQ(formatted(makeEvent(u"message")), u"2006-08-16 10:48:55.123+02:00 message\n");
}

TEST_F(BasicFormatterTest, ADebugEventHasItsPlaceInTheSource) {
  const EventPtr event = makeEvent(u"message");
  QlxSetEventProp(event.get(), "qlx_prop_srcfile", "main.c");
  QlxSetEventPropInt(event.get(), "qlx_prop_srcline", 42);
  EXPECT_EQ(formatted(event), u"2006-08-16 10:48:55.123+02:00 main.c 42 message\n");
}

TEST_F(BasicFormatterTest, TheOrderOfTheFieldsIsFixed) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"message");
  for (const char *key : {"server", "client", "component", "product", "organization",
                          "qlx_prop_srcfunction", "qlx_prop_srcfile"})
    QlxSetEventProp(event.get(), key, key);
  QlxSetEventPropInt(event.get(), "qlx_prop_srcline", 42);
  EXPECT_EQ(formatted(event),
            u"55 qlx_prop_srcfile qlx_prop_srcfunction 42 organization product component client "
            u"server message\n");
}

TEST_F(BasicFormatterTest, OtherPropertiesAndTheLevelAreNoPartOfTheLine) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"message");
  event->level = FATAL;
  QlxSetEventProp(event.get(), "other", "value");
  QlxSetEventMessageId(event.get(), "ID");
  EXPECT_EQ(formatted(event), u"55 message\n");
}

TEST_F(BasicFormatterTest, APropertyWithAnEmptyValueIsAField) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"message");
  QlxSetEventProp(event.get(), "product", "");
  EXPECT_EQ(formatted(event), u"55  message\n");
}

TEST_F(BasicFormatterTest, TheLineNumberIsReadAsAnIntegerProperty) {
  set("dateTimeFormat", "ss");
  const struct {
    const char *value;
    const UChar *line;
  } kCases[] = {
      {"0", u"55 0 message\n"},
      {"12abc", u"55 12 message\n"},
      {"no number", u"55 message\n"},
      {"", u"55 message\n"},
      {"-1", u"55 18446744073709551615 message\n"},
      {"-2147483648", u"55 18446744071562067968 message\n"},
  };
  for (const auto &[value, expected] : kCases) {
    const EventPtr event = makeEvent(u"message");
    QlxSetEventProp(event.get(), "qlx_prop_srcline", value);
    EXPECT_EQ(formatted(event), expected) << value;
  }
}

TEST_F(BasicFormatterTest, PropertiesAndSeparatorAreReadInTheDefaultCodePage) {
  ASSERT_TRUE(IcuDefaults::setCodePage("UTF-8"));
  set("dateTimeFormat", "ss");
  set("separator", "\xC3\xA9");
  const EventPtr event = makeEvent(u"message");
  QlxSetEventProp(event.get(), "product", "\xE4\xB8\x80");
  EXPECT_EQ(formatted(event), u"55\u00E9\u4E00\u00E9message\n");
}

TEST_F(BasicFormatterTest, AMessageThatBindsToNothingLeavesSeparatorAndLineFeed) {
  set("dateTimeFormat", "ss");
  EXPECT_EQ(formatted(makeEvent(nullptr)), u"55 \n");
  EXPECT_EQ(formatted(makeEvent(u"")), u"55 \n");
  EXPECT_EQ(formatted(makeEvent(u"{0")), u"55 \n");
  const EventPtr event = makeEvent(u"message");
  qlxIntlFreeI18Msg(event->message);
  event->message = nullptr;
  EXPECT_EQ(formatted(event), u"55 \n");
}

TEST_F(BasicFormatterTest, AFailedBindIsLeftOnTheMessage) {
  const EventPtr event = makeEvent(u"{0");
  formatted(event);
  EXPECT_EQ(event->message->error, U_UNMATCHED_BRACES);
}

TEST_F(BasicFormatterTest, TheArgumentsAreBoundAndStayUnread) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"{1} {0,number}");
  EXPECT_EQ(formattedWith(event.get(), 1234.5, u"text"), u"55 text 1,234.5\n");
}

TEST_F(BasicFormatterTest, ALongLineIsWhole) {
  set("dateTimeFormat", "ss");
  const std::string value(3000, 'v');
  const std::u16string text(5000, u't');
  const EventPtr event = makeEvent(text.c_str());
  QlxSetEventProp(event.get(), "product", value.c_str());
  EXPECT_EQ(formatted(event), u"55 " + std::u16string(3000, u'v') + u" " + text + u"\n");
}

TEST_F(BasicFormatterTest, WhatIsNoFormatterAndNoEventGivesNoLine) {
  const EventPtr event = makeEvent(u"message");
  EXPECT_EQ(formattedBy(nullptr, event.get()), u"<null>");
  EXPECT_EQ(formattedBy(formatter.get(), nullptr), u"<null>");
  const Handle handler = get("handler", "qlx_consolehandler");
  EXPECT_EQ(formattedBy(handler.get(), event.get()), u"<null>");
  QlxObject retired{};
  EXPECT_EQ(formattedBy(&retired, event.get()), u"<null>");
  ObjClass withoutBinder = qlxBasicFormatterClass;
  withoutBinder.op4.fBindMsg = nullptr;
  retired.objClass = &withoutBinder;
  EXPECT_EQ(formattedBy(&retired, event.get()), u"<null>");
  ObjClass ofAnotherKind = qlxBasicFormatterClass;
  ofAnotherKind.kind = Handler;
  retired.objClass = &ofAnotherKind;
  EXPECT_EQ(formattedBy(&retired, event.get()), u"<null>");
}

TEST_F(BasicFormatterTest, HeaderAndTrailerAreNull) {
  EXPECT_EQ(QlxBasicFormatterFGetHeader(formatter.get()), nullptr);
  EXPECT_EQ(QlxBasicFormatterFGetTrailer(formatter.get()), nullptr);
  EXPECT_EQ(QlxBasicFormatterFGetHeader(nullptr), nullptr);
  EXPECT_EQ(QlxBasicFormatterFGetTrailer(nullptr), nullptr);
}

// ---- The settings

TEST_F(BasicFormatterTest, TheSeparatorStandsBetweenAllFields) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"message");
  QlxSetEventProp(event.get(), "product", "p");
  QlxSetEventPropInt(event.get(), "qlx_prop_srcline", 1);
  set("separator", " | ");
  EXPECT_EQ(formatted(event), u"55 | 1 | p | message\n");
  set("separator", "");
  EXPECT_EQ(formatted(event), u"551pmessage\n") << "an empty one joins with nothing";
  clear("separator");
  EXPECT_EQ(formatted(event), u"55 1 p message\n");
}

TEST_F(BasicFormatterTest, SettingsComeFromTheConfiguration) {
  ObjCfg *cfg = QlxAllocObjCfg("configured");
  QlxSetObjCfgProp(cfg, "className", "qlx_basicformatter");
  QlxSetObjCfgProp(cfg, "dateTimeFormat", "HH:mm");
  QlxSetObjCfgProp(cfg, "separator", ";");
  QlxSetObjCfgProp(cfg, "locale", "de");
  QlxLogMgrAddCfg(cfg);
  QlxReleaseObjCfg(cfg);
  const Handle configured = get("configured");
  ASSERT_TRUE(configured);
  const EventPtr event = makeEvent(u"message");
  EXPECT_EQ(formattedBy(configured.get(), event.get()), u"10:48;message\n");
  EXPECT_STREQ(event->locale, "de");
}

TEST_F(BasicFormatterTest, OtherKeysAreThoseOfEveryObject) {
  set("logging", "false");
  EXPECT_EQ(QlxIsObjectEnabled(formatter.get()), 0);
  set("Separator", "|");
  EXPECT_EQ(formatter->kind1.separator, nullptr) << "keys are case-sensitive";
}

TEST_F(BasicFormatterTest, AnObjectOfAnotherKindKeepsWhatItHasInThePlacesOfTheSettings) {
  const Handle logger = get("logger", "qlx_basiclogger");
  const Handle handler = get("handler", "qlx_consolehandler");
  QlxObject *formatter = handler->kind2.formatter;
  for (QlxObject *object : {logger.get(), handler.get()})
    for (const char *key : {"separator", "dateTimeFormat", "locale"}) {
      QlxSetObjProp(object, key, "x");
      const ApiLock lock;
      QlxBasicFormatterFCfgChange(object, key);
    }
  EXPECT_EQ(logger->kind1.level, DEBUG_MIN);
  EXPECT_EQ(handler->kind2.formatter, formatter);
  EXPECT_EQ(::take(QlxBasicUFormatterFormatDate(handler.get(), kTime)),
            u"2006-08-16 10:48:55.123+02:00");
}

TEST_F(BasicFormatterTest, AConfigurationChangeNeedsObjectAndKey) {
  QlxBasicFormatterFCfgChange(nullptr, "separator");
  QlxBasicFormatterFCfgChange(formatter.get(), nullptr);
  EXPECT_EQ(formatter->kind1.separator, nullptr);
}

// ---- The locale

TEST_F(BasicFormatterTest, TheFormattersLocaleStaysOnTheEvent) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"{0,number}");
  EXPECT_EQ(formattedWith(event.get(), 1234.5), u"55 1,234.5\n");
  EXPECT_EQ(event->locale, nullptr);
  set("locale", "de");
  EXPECT_EQ(formattedWith(event.get(), 1234.5), u"55 1.234,5\n");
  EXPECT_STREQ(event->locale, "de");
  EXPECT_STREQ(event->message->locale, "de");
  clear("locale");
  EXPECT_EQ(formattedWith(event.get(), 1234.5), u"55 1.234,5\n") << "what comes later sees it";
}

TEST_F(BasicFormatterTest, WithoutALocaleOfItsOwnTheEventsIsUsed) {
  set("dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"{0,number}");
  qlxSetEventLocale(event.get(), "de");
  EXPECT_EQ(formattedWith(event.get(), 1234.5), u"55 1.234,5\n");
}

TEST_F(BasicFormatterTest, TheDateIsOfTheDefaultLocaleWhateverTheFormatters) {
  set("dateTimeFormat", "MMMM");
  set("locale", "de");
  EXPECT_EQ(date(1142000000000.0), u"March");
}

// ---- The binder of a class

UChar *bindAsLocale(I18Msg *message, va_list *args) {
  EXPECT_EQ(args, nullptr);
  return message ? CxUStringDupStrToUChar(message->locale) : nullptr;
}

TEST_F(BasicFormatterTest, AClassWithABinderOfItsOwnBindsWithThat) {
  QlxAddUFormatterClass("test_binding", nullptr, nullptr, nullptr, QlxBasicFormatterFCfgChange,
                        nullptr, nullptr, nullptr, bindAsLocale);
  const Handle binding = get("binding", "test_binding");
  QlxSetObjProp(binding.get(), "dateTimeFormat", "ss");
  const EventPtr event = makeEvent(u"message");
  EXPECT_EQ(formattedBy(binding.get(), event.get()), u"55 \n");
  QlxSetObjProp(binding.get(), "locale", "fr");
  EXPECT_EQ(formattedBy(binding.get(), event.get()), u"55 fr\n");
}

// ---- The date

TEST_F(BasicFormatterTest, ADateByADefaultPatternHasTheOffsetOfItsMoment) {
  EXPECT_EQ(date(kTime), u"2006-08-16 10:48:55.123+02:00");
  EXPECT_EQ(date(1136073600000.0), u"2006-01-01 01:00:00.000+01:00");
  EXPECT_EQ(::take(QlxBasicUFormatterFormatDate(nullptr, kTime)), u"2006-08-16 10:48:55.123+02:00");
}

TEST_F(BasicFormatterTest, OnlyTheHoursDecideTheSignBeforeAnOffset) {
  const struct {
    const UChar *zone, *date;
  } kCases[] = {
      {u"UTC", u"2006-08-16 08:48:55.123+00:00"},
      {u"GMT+05:30", u"2006-08-16 14:18:55.123+05:30"},
      {u"GMT-05:00", u"2006-08-16 03:48:55.123-05:00"},
      {u"GMT-05:30", u"2006-08-16 03:18:55.123-05:-30"},
      {u"GMT-00:30", u"2006-08-16 08:18:55.123+00:-30"},
      {u"GMT-11:05", u"2006-08-15 21:43:55.123-11:-5"},
  };
  for (const auto &[zone, expected] : kCases) {
    ASSERT_TRUE(IcuDefaults::setZone(zone));
    EXPECT_EQ(date(kTime), expected);
  }
}

TEST_F(BasicFormatterTest, ADateByAConfiguredPatternHasNoOffset) {
  set("dateTimeFormat", "HH:mm");
  EXPECT_EQ(date(kTime), u"10:48");
  set("dateTimeFormat", "yyyy-MM-dd HH:mm:ss.SSS");
  EXPECT_EQ(date(kTime), u"2006-08-16 10:48:55.123") << "not for the default one's text either";
  clear("dateTimeFormat");
  EXPECT_EQ(date(kTime), u"2006-08-16 10:48:55.123+02:00");
}

TEST_F(BasicFormatterTest, AnEmptyPatternGivesAnEmptyDate) {
  set("dateTimeFormat", "");
  EXPECT_EQ(date(kTime), u"");
  EXPECT_EQ(formatted(makeEvent(u"message")), u" message\n");
}

TEST_F(BasicFormatterTest, ADateOfAnyLengthIsWhole) {
  const std::string text(2000, 'x');
  set("dateTimeFormat", ("HH'" + text + "'ss").c_str());
  EXPECT_EQ(date(kTime), u"10" + std::u16string(2000, u'x') + u"55");
}

TEST_F(BasicFormatterTest, EveryEventHasItsOwnMilliseconds) {
  const double second = kTime - 123;
  EXPECT_EQ(date(second), u"2006-08-16 10:48:55.000+02:00");
  EXPECT_EQ(date(second + 999), u"2006-08-16 10:48:55.999+02:00");
  EXPECT_EQ(date(second + 7), u"2006-08-16 10:48:55.007+02:00");
  EXPECT_EQ(date(second + 80), u"2006-08-16 10:48:55.080+02:00");
  EXPECT_EQ(date(kTime + 1000), u"2006-08-16 10:48:56.123+02:00");
}

// ---- Without memory

TEST_F(BasicFormatterTest, WithoutMemoryALineLacksFieldsOrIsNull) {
  set("locale", "de");
  const std::u16string whole = u"2006-08-16 10:48:55.123+02:00 main.c product {message}\n";
  for (const auto fail : {&FailingMemory::failOnce, &FailingMemory::failFrom})
    for (uint64_t nth = 1;; ++nth) {
      const EventPtr event = makeEvent(u"'{message}'");
      QlxSetEventProp(event.get(), "qlx_prop_srcfile", "main.c");
      QlxSetEventProp(event.get(), "product", "product");
      qlxDropCachedFormats();
      FailingMemory memory;
      (memory.*fail)(nth);
      const std::u16string text = formatted(event);
      if (memory.failures() == 0) {
        EXPECT_EQ(text, whole);
        break;
      }
      EXPECT_TRUE(text == u"<null>" || (text.size() <= whole.size() && text.back() == u'\n'))
          << nth;
    }
}

}  // namespace
