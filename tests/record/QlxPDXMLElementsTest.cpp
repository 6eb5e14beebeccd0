
#include <gtest/gtest.h>

#include <string>

#include <unicode/putil.h>

#include <qlx/buffers.h>
#include <qlx/class/event.h>
#include <qlx/class/message.h>
#include <qlx/event.h>

#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/Take.h"
#include "util/CxOwned.h"
#include "record/QlxPDXMLElements.h"

namespace {

using EventPtr = Owned<Event, QlxFreeEvent>;

// What an emitter appends to a record; "<null>" for nothing.
template <typename Emit>
std::u16string emitted(const Emit &emit) {
  CxUStringBuff record{};
  emit(&record);
  return take(CxUStringBuffTakeUStr(&record));
}

// ---- Words

std::u16string wordOf(int32_t level) {
  return emitted([level](CxUStringBuff *record) { qlxPDXMLEmitULevel(record, level); });
}

TEST(PDXMLLevelTest, EachNamedLevelHasItsWord) {
  const struct {
    int32_t level;
    const UChar *word;
  } kCases[] = {
      {DEBUG_MAX, u"MAX"}, {DEBUG_MID, u"MID"}, {DEBUG_MIN, u"MIN"}, {INFO, u"INFO"},
      {WARN, u"WARN"},     {ERROR, u"ERROR"},   {FATAL, u"ERROR"},
  };
  for (const auto &[level, word] : kCases) EXPECT_EQ(wordOf(level), word) << level;
}

TEST(PDXMLLevelTest, AnyOtherLevelIsOther) {
  for (const int32_t level : {0, -1, 999, 1001, 4500, 8000, int32_t{OFF}, int32_t{UNSPECIFIED}})
    EXPECT_EQ(wordOf(level), u"OTHER") << level;
}

TEST(PDXMLKeyTest, TheKeysOfOtherElementsAreNoFreeAttributes) {
  for (const char *key : {"threadId", "correlationId", "client", "qlx_prop_srcfile",
                          "qlx_prop_srcline", "qlx_prop_srcfunction", "server", "serverFormat",
                          "product", "component", "productInstance", "processId"})
    EXPECT_EQ(qlxPDXMLCheckKey(key), 0) << key;
}

TEST(PDXMLKeyTest, EveryOtherKeyIsAFreeAttribute) {
  for (const char *key : {"organization", "", "Server", "products", "produc", "qlx_prop_other"})
    EXPECT_EQ(qlxPDXMLCheckKey(key), 1) << key;
  EXPECT_EQ(qlxPDXMLCheckKey(nullptr), 1);
}

// ---- Product and source

class PDXMLElementsTest : public ::testing::Test {
 protected:
  void SetUp() override { ASSERT_TRUE(IcuDefaults::setLocale("en_US")); }

  void set(const char *key, const char *value) {
    ASSERT_EQ(QlxSetEventProp(event_.get(), key, value), 1);
  }

  std::u16string products(uint8_t component, uint8_t product, uint8_t instance, uint8_t server) {
    return emitted([&](CxUStringBuff *record) {
      qlxPDXMLEmitUProductInfo(record, event_.get(), component, product, instance, server);
    });
  }

  std::u16string source(uint8_t written = 1) {
    return emitted([&](CxUStringBuff *record) {
      EXPECT_EQ(qlxPDXMLEmitUSource(record, event_.get()), written);
    });
  }

  IcuDefaults defaults_;
  EventPtr event_{QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text")};
};

TEST_F(PDXMLElementsTest, ProductElementsHaveOneOrder) {
  for (const char *key : {"productInstance", "component", "product", "serverFormat", "server"})
    set(key, key);
  EXPECT_EQ(products(1, 1, 1, 1),
            u" <Server Format=\"serverFormat\">server</Server>\n"
            u" <ProductId>product</ProductId>\n"
            u" <Component>component</Component>\n"
            u" <ProductInstance>productInstance</ProductInstance>\n");
}

TEST_F(PDXMLElementsTest, EachProductElementIsSelectedByItsOwnFlag) {
  for (const char *key : {"productInstance", "component", "product", "server"}) set(key, "x");
  EXPECT_EQ(products(1, 0, 0, 0), u" <Component>x</Component>\n");
  EXPECT_EQ(products(0, 1, 0, 0), u" <ProductId>x</ProductId>\n");
  EXPECT_EQ(products(0, 0, 1, 0), u" <ProductInstance>x</ProductInstance>\n");
  EXPECT_EQ(products(0, 0, 0, 1), u" <Server Format=\"\">x</Server>\n");
  EXPECT_EQ(products(0, 0, 0, 0), u"<null>");
}

TEST_F(PDXMLElementsTest, AnAbsentPropertyHasNoElement) {
  EXPECT_EQ(products(1, 1, 1, 1), u"<null>");
  set("serverFormat", "IP");
  EXPECT_EQ(products(1, 1, 1, 1), u"<null>");
  set("product", "");
  EXPECT_EQ(products(1, 1, 1, 1), u" <ProductId></ProductId>\n") << "an empty one is there";
}

TEST_F(PDXMLElementsTest, ASourceHasWhatIsKnownOfIt) {
  set("qlx_prop_srcfile", "main.c");
  EXPECT_EQ(source(), u" <Source FileName=\"main.c\"/>\n");
  QlxSetEventPropInt(event_.get(), "qlx_prop_srcline", 42);
  EXPECT_EQ(source(), u" <Source FileName=\"main.c\" Line=\"42\"/>\n");
  set("qlx_prop_srcfunction", "main");
  EXPECT_EQ(source(), u" <Source FileName=\"main.c\" Method=\"main\" Line=\"42\"/>\n");
  set("qlx_prop_srcline", "no number");
  EXPECT_EQ(source(), u" <Source FileName=\"main.c\" Method=\"main\"/>\n");
}

TEST_F(PDXMLElementsTest, WithoutAFileThereIsNoSource) {
  set("qlx_prop_srcfunction", "main");
  set("qlx_prop_srcline", "42");
  EXPECT_EQ(source(0), u"<null>");
}

TEST_F(PDXMLElementsTest, ANegativeLineHasItsUnsignedForm) {
  set("qlx_prop_srcfile", "main.c");
  set("qlx_prop_srcline", "-1");
  EXPECT_EQ(source(), u" <Source FileName=\"main.c\" Line=\"18446744073709551615\"/>\n");
}

TEST_F(PDXMLElementsTest, ValuesAreNotEscaped) {
  set("product", "<a & \"b\">");
  set("qlx_prop_srcfile", "\"/><x>");
  EXPECT_EQ(products(1, 1, 1, 1), u" <ProductId><a & \"b\"></ProductId>\n");
  EXPECT_EQ(source(), u" <Source FileName=\"\"/><x>\"/>\n");
}

TEST_F(PDXMLElementsTest, NullEventsAndRecordsAreIgnored) {
  EXPECT_EQ(emitted([](auto *record) {
              qlxPDXMLEmitUProductInfo(record, nullptr, 1, 1, 1, 1);
              EXPECT_EQ(qlxPDXMLEmitUSource(record, nullptr), 0);
              qlxPDXMLEmitUTranslationInfo(record, nullptr, "bundle", nullptr);
            }),
            u"<null>");
  for (const char *key : {"product", "server", "qlx_prop_srcfile"}) set(key, "x");
  qlxPDXMLEmitULevel(nullptr, INFO);
  qlxPDXMLEmitUProductInfo(nullptr, event_.get(), 1, 1, 1, 1);
  qlxPDXMLEmitUSource(nullptr, event_.get());
  qlxPDXMLEmitUTranslationInfo(nullptr, event_.get(), "bundle", nullptr);
}

// ---- Translation

class PDXMLTranslationTest : public ::testing::Test {
 protected:
  void SetUp() override { ASSERT_TRUE(IcuDefaults::setLocale("en_US")); }

  // Patterns by key, in the root bundle.
  void add(const std::string &resources) { ASSERT_TRUE(bundles_.add("root", resources)); }

  void use(const char *key) {
    event_.reset(QlxVaAllocUEvent(INFO, bundles_.path().c_str(), key, nullptr));
  }

  std::u16string elementOf(const char *bundle, va_list *args) {
    return emitted([&](CxUStringBuff *record) {
      qlxPDXMLEmitUTranslationInfo(record, event_.get(), bundle, args);
    });
  }

  std::u16string elementWith(const char *bundle, ...) {
    va_list args;
    va_start(args, bundle);
    const std::u16string element = elementOf(bundle, &args);
    va_end(args);
    return element;
  }

  // What stands between the start and the end of the element, for the event's own bundle.
  std::u16string parameters(const char *key, ...) {
    use(key);
    va_list args;
    va_start(args, key);
    const std::u16string element = elementOf(event_->message->bundle, &args);
    va_end(args);
    const std::u16string start = startOf(event_->message->bundle, key);
    EXPECT_EQ(element.substr(0, start.size()), start);
    const std::u16string end = u"</TranslationInfo>\n";
    EXPECT_TRUE(element.ends_with(end));
    return element.substr(start.size(), element.size() - start.size() - end.size());
  }

  static std::u16string startOf(const std::string &bundle, const std::string &key) {
    return u" <TranslationInfo Resource Bundle=\"" + std::u16string(bundle.begin(), bundle.end()) +
           u"\" MsgKey=\"" + std::u16string(key.begin(), key.end()) + u"\">";
  }
  static std::u16string param(const std::u16string &value) {
    return u"<Param><![CDATA[" + value + u"]]></Param>";
  }

  IcuDefaults defaults_;
  ResourceBundles bundles_;
  EventPtr event_;
};

TEST_F(PDXMLTranslationTest, TheElementHasBundleKeyAndTypedParameters) {
  add(R"(k { "{0} {1,number,integer} {2,number} {3,choice,0#none|1#one}" })");
  EXPECT_EQ(parameters("k", u"text", 7, 2.5, 1.0),
            param(u"text") + param(u"7") + param(u"2.5") + param(u"1"));
}

TEST_F(PDXMLTranslationTest, IntegersHaveTheirMinusSign) {
  add(R"(k { "{0,number,integer}{1,number,integer}{2,number,integer}{3,number,integer}" })");
  EXPECT_EQ(parameters("k", -1, INT32_MIN, INT32_MAX, 0),
            param(u"-1") + param(u"-2147483648") + param(u"2147483647") + param(u"0"));
}

TEST_F(PDXMLTranslationTest, DoublesHaveFiveFractionDigitsAndNoGrouping) {
  add(R"(k { "{0,number}{1,number,percent}{2,number}" })");
  EXPECT_EQ(parameters("k", 1234567.8912345, -0.125, 3.0),
            param(u"1234567.89123") + param(u"-0.125") + param(u"3"));
}

TEST_F(PDXMLTranslationTest, StringsStandAsTheyAre) {
  add(R"(k { "{0}{1}{2}" })");
  EXPECT_EQ(parameters("k", u"]]> <\u4E00>", u"", static_cast<const UChar *>(nullptr)),
            param(u"]]> <\u4E00>") + param(u"") + param(u""));
}

TEST_F(PDXMLTranslationTest, ParametersEndAtTheFirstIndexWithoutAType) {
  add(R"(gap { "{0} {2}" } date { "{0,date}" } second { "{0} {1,date} {2}" } late { "{1}" })");
  EXPECT_EQ(parameters("gap", u"first", u"second", u"third"), param(u"first"));
  EXPECT_EQ(parameters("date", 0.0), u"");
  EXPECT_EQ(parameters("second", u"first", 0.0, u"third"), param(u"first"));
  EXPECT_EQ(parameters("late", u"first", u"second"), u"");
}

TEST_F(PDXMLTranslationTest, ThereAreTenParametersAtMost) {
  add(R"(k { "{10}{9}{8}{7}{6}{5}{4}{3}{2}{1}{0}{9999999999}" })");
  std::u16string ten;
  for (UChar digit = u'0'; digit <= u'9'; ++digit) ten += param({digit});
  EXPECT_EQ(parameters("k", u"0", u"1", u"2", u"3", u"4", u"5", u"6", u"7", u"8", u"9", u"10"),
            ten);
}

TEST_F(PDXMLTranslationTest, APatternThatCannotBeReadHasNoParameters) {
  add(R"(k { "{0} {x}" } quoted { "it's {0}" })");
  EXPECT_EQ(parameters("k", u"text"), u"");
  EXPECT_EQ(parameters("quoted", u"text"), u"") << "the apostrophe quotes the argument";
}

TEST_F(PDXMLTranslationTest, TheArgumentsStayUnread) {
  add(R"(k { "{0} {1,number,integer}" })");
  const auto twice = [this](const char *key, ...) {
    use(key);
    va_list args;
    va_start(args, key);
    const std::u16string first = elementOf(event_->message->bundle, &args);
    const std::u16string second = elementOf(event_->message->bundle, &args);
    va_end(args);
    EXPECT_EQ(first, second);
    EXPECT_TRUE(first.ends_with(param(u"text") + param(u"7") + u"</TranslationInfo>\n"));
  };
  twice("k", u"text", 7);
}

TEST_F(PDXMLTranslationTest, WithoutAnArgumentListNumbersAreZero) {
  add(R"(k { "{0,number,integer} {1,number} {2,choice,0#a|1#b} {4,number}" }
         date { "{0,number} {1,date} {2,number}" } )");
  const auto unlisted = [this](const char *key) {
    use(key);
    return elementOf(event_->message->bundle, nullptr).substr(startOf(bundles_.path(), key).size());
  };
  EXPECT_EQ(unlisted("k"), param(u"0") + param(u"0") + param(u"0") + u"</TranslationInfo>\n");
  EXPECT_EQ(unlisted("date"), param(u"0") + u"</TranslationInfo>\n");
}

// Deliberate: the text cannot be bound then, so there is nothing that it shows.
TEST_F(PDXMLTranslationTest, WithoutAnArgumentListAPatternWithAStringHasNoParameters) {
  add(R"(k { "{0}" } mixed { "{0,number} {1}" } behind { "{0,number} {2}" })");
  for (const char *key : {"k", "mixed", "behind"}) {
    use(key);
    EXPECT_EQ(elementOf(event_->message->bundle, nullptr),
              startOf(bundles_.path(), key) + u"</TranslationInfo>\n");
  }
}

TEST_F(PDXMLTranslationTest, AnUnknownKeyOrBundleHasNoParameters) {
  add(R"(k { "{0}" } table { inner { "{0}" } })");
  EXPECT_EQ(parameters("missing", u"text"), u"");
  EXPECT_EQ(parameters("table", u"text"), u"");
  event_.reset(QlxVaAllocUEvent(INFO, "nowhere", "k", nullptr));
  EXPECT_EQ(elementOf("nowhere", nullptr), startOf("nowhere", "k") + u"</TranslationInfo>\n");
}

TEST_F(PDXMLTranslationTest, WithoutBundleOrKeyTheAttributesAreEmpty) {
  add(R"(k { "{0}" })");
  event_.reset(QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text"));
  EXPECT_EQ(elementOf(nullptr, nullptr), startOf("", "") + u"</TranslationInfo>\n");
  EXPECT_EQ(elementWith(nullptr, u"text"), startOf("", "") + u"</TranslationInfo>\n");
  EXPECT_EQ(elementWith(bundles_.path().c_str(), u"text"),
            startOf(bundles_.path(), "") + u"</TranslationInfo>\n");
}

TEST_F(PDXMLTranslationTest, AnEventWithoutAMessageHasNoElement) {
  event_.reset(QlxVaAllocUEvent(INFO, nullptr, nullptr, nullptr));
  qlxIntlFreeI18Msg(event_->message);
  event_->message = nullptr;
  EXPECT_EQ(elementOf("bundle", nullptr), u"<null>");
}

TEST_F(PDXMLTranslationTest, ThePatternIsTheOneOfTheMessagesLocale) {
  add(R"(k { "{0}" })");
  ASSERT_TRUE(bundles_.add("de", R"(k { "{0} {1,number,integer}" })"));
  const auto inLocale = [this](const char *locale) {
    use("k");
    qlxSetI18MsgLocale(event_->message, locale);
    const std::string bundle = event_->message->bundle;
    return elementWith(bundle.c_str(), u"x", 7).substr(startOf(bundle, "k").size());
  };
  EXPECT_EQ(inLocale(nullptr), param(u"x") + u"</TranslationInfo>\n");
  EXPECT_EQ(inLocale("de_AT"), param(u"x") + param(u"7") + u"</TranslationInfo>\n");
}

// With a name that no other test uses: ICU keeps what it once found under a name.
TEST_F(PDXMLTranslationTest, AnUnknownPathIsOpenedByThePartAfterItsLastSlash) {
  const ResourceBundles own{"cutoff"};
  ASSERT_TRUE(own.add("root", R"(k { "{0}" })"));
  const std::string before = u_getDataDirectory();
  u_setDataDirectory(own.folder().c_str());
  for (const char *bundle : {"/no/such/folder/cutoff", "no/cutoff"}) {
    event_.reset(QlxVaAllocUEvent(INFO, bundle, "k", nullptr));
    EXPECT_EQ(elementWith(bundle, u"x"),
              startOf(bundle, "k") + param(u"x") + u"</TranslationInfo>\n");
  }
  u_setDataDirectory(before.c_str());
}

}  // namespace
