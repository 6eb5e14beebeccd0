#include "QlxI18Msg.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include <unicode/putil.h>

#include <qlx/buffers.h>
#include <qlx/class/containers.h>
#include <qlx/memory.h>
#include <qlx/message.h>
#include <qlx/props.h>

#include "text/QlxFormatCache.h"
#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/Take.h"
#include "util/CxOwned.h"

namespace {

using Message = Owned<I18Msg, qlxIntlFreeI18Msg>;

Message makeMessage(const char *bundle, const char *key, const UChar *text) {
  return Message{qlxIntlAllocUI18Msg(bundle, key, text)};
}

Message textMessage(const UChar *text) {
  return makeMessage(nullptr, nullptr, text);
}

class I18MsgTest : public ::testing::Test {
 protected:
  void SetUp() override { qlxDropCachedFormats(); }
  void TearDown() override { qlxDropCachedFormats(); }

  // The text that a message binds to, "<null>" for null.
  static std::u16string bindWith(I18Msg *message, ...) {
    va_list args;
    va_start(args, message);
    const std::u16string text = take(qlxIntlBindUI18Msg(message, &args));
    va_end(args);
    return text;
  }

  // A message's locale is not freed with it.
  static void clearLocale(const Message &message) { qlxSetI18MsgLocale(message.get(), nullptr); }

  IcuDefaults defaults_;
};

// ---- The record

TEST_F(I18MsgTest, ANewMessageHasCopiesOfItsTextsAndNothingElse) {
  const char bundle[] = "bundle";
  const char key[] = "key";
  const UChar text[] = u"text";
  const Message message = makeMessage(bundle, key, text);
  EXPECT_STREQ(message->bundle, "bundle");
  EXPECT_STREQ(message->key, "key");
  EXPECT_EQ(std::u16string(message->text), u"text");
  EXPECT_NE(message->bundle, bundle);
  EXPECT_NE(message->key, key);
  EXPECT_NE(message->text, text);
  EXPECT_EQ(message->parms, nullptr);
  EXPECT_EQ(message->locale, nullptr);
  EXPECT_EQ(message->error, 0);
}

TEST_F(I18MsgTest, ANewMessageMayHaveNoTexts) {
  const Message message = makeMessage(nullptr, nullptr, nullptr);
  ASSERT_TRUE(message);
  EXPECT_EQ(message->bundle, nullptr);
  EXPECT_EQ(message->key, nullptr);
  EXPECT_EQ(message->text, nullptr);
}

TEST_F(I18MsgTest, ACopyHasTextsOfItsOwnAndSharesTheLocale) {
  Message message = makeMessage("bundle", "key", u"text");
  qlxSetI18MsgLocale(message.get(), "de");
  message->error = 5;
  const Message copy{qlxIntlCopyI18Msg(message.get())};
  EXPECT_NE(copy->bundle, message->bundle);
  EXPECT_EQ(copy->locale, message->locale);
  message.reset();
  EXPECT_STREQ(copy->bundle, "bundle");
  EXPECT_STREQ(copy->key, "key");
  EXPECT_EQ(std::u16string(copy->text), u"text");
  EXPECT_STREQ(copy->locale, "de") << "freeing a message leaves the locale";
  EXPECT_EQ(copy->error, 5);
  clearLocale(copy);
}

TEST_F(I18MsgTest, ACopyHasParametersOfItsOwn) {
  Message message = textMessage(u"text");
  const Parm parm{.type = ParmInt32, .value = {.i = 7}};
  ASSERT_EQ(qlxIntlParmListAppend(qlxGetI18MsgParmList(message.get()), &parm), 1);
  const Message copy{qlxIntlCopyI18Msg(message.get())};
  ASSERT_NE(copy->parms, nullptr);
  EXPECT_NE(copy->parms, message->parms);
  message.reset();
  Parm *copied = qlxIntlParmListIterGet(qlxIntlParmListIterator(copy->parms));
  ASSERT_NE(copied, nullptr);
  EXPECT_EQ(copied->value.i, 7);
  QlxFreeParm(copied);
}

TEST_F(I18MsgTest, OnlyASharedLocaleMarksSourceAndCopy) {
  const Message message = textMessage(u"text");
  const Message early{qlxIntlCopyI18Msg(message.get())};
  EXPECT_EQ(message->shared + early->shared, 0);
  qlxSetI18MsgLocale(message.get(), "de");
  const Message copy{qlxIntlCopyI18Msg(message.get())};
  EXPECT_EQ(message->shared, 1);
  EXPECT_EQ(copy->shared, 1);
  qlxSetI18MsgLocale(message.get(), "fr");
  EXPECT_EQ(message->shared, 0) << "the new one is its own";
  clearLocale(message);
}

TEST_F(I18MsgTest, NullIsNoMessage) {
  EXPECT_EQ(qlxIntlCopyI18Msg(nullptr), nullptr);
  EXPECT_EQ(qlxIntlBindUI18Msg(nullptr, nullptr), nullptr);
  EXPECT_EQ(qlxGetI18MsgParmList(nullptr), nullptr);
  qlxIntlFreeI18Msg(nullptr);
  qlxSetI18MsgLocale(nullptr, "de");
}

TEST_F(I18MsgTest, TheParameterListIsMadeOnce) {
  const Message message = textMessage(u"text");
  ParmList *parms = qlxGetI18MsgParmList(message.get());
  ASSERT_NE(parms, nullptr);
  EXPECT_EQ(qlxGetI18MsgParmList(message.get()), parms);
  EXPECT_EQ(message->parms, parms);
  EXPECT_EQ(qlxIntlParmListIterator(parms), nullptr);
}

TEST_F(I18MsgTest, ANewLocaleFreesTheOneBefore) {
  const Message message = textMessage(u"text");
  const FailingMemory memory;
  qlxSetI18MsgLocale(message.get(), "de");
  qlxSetI18MsgLocale(message.get(), "fr");
  EXPECT_STREQ(message->locale, "fr");
  EXPECT_EQ(memory.live(), 1);
  qlxSetI18MsgLocale(message.get(), message->locale + 1);
  EXPECT_STREQ(message->locale, "r");
  qlxSetI18MsgLocale(message.get(), nullptr);
  EXPECT_EQ(message->locale, nullptr);
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(I18MsgTest, ThePublicFunctionsDoTheSameUnderTheLock) {
  I18Msg *message = QlxAllocUI18Msg(nullptr, "key", u"'{'text'}'");
  I18Msg *copy = QlxCopyI18Msg(message);
  EXPECT_STREQ(copy->key, "key");
  EXPECT_EQ(take(QlxBindUI18Msg(copy, nullptr)), u"{text}");
  QlxFreeI18Msg(copy);
  QlxFreeI18Msg(message);
  EXPECT_EQ(QlxCopyI18Msg(nullptr), nullptr);
  EXPECT_EQ(QlxBindUI18Msg(nullptr, nullptr), nullptr);
  QlxFreeI18Msg(nullptr);
}

// ---- Binding a text

TEST_F(I18MsgTest, ATextIsThePatternWhenThereIsNoBundle) {
  const Message message = textMessage(u"{1} before {0}");
  EXPECT_EQ(bindWith(message.get(), u"a", u"b"), u"b before a");
  EXPECT_EQ(message->error, 0);
}

TEST_F(I18MsgTest, TheMessagesLocaleFormatsTheArguments) {
  ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
  const Message message = textMessage(u"{0,number}");
  EXPECT_EQ(bindWith(message.get(), 1234.5), u"1,234.5");
  qlxSetI18MsgLocale(message.get(), "de_DE");
  EXPECT_EQ(bindWith(message.get(), 1234.5), u"1.234,5");
  clearLocale(message);
}

TEST_F(I18MsgTest, WithoutBundleAndTextThereIsNothingToBind) {
  const Message message = makeMessage(nullptr, "key", nullptr);
  EXPECT_EQ(bindWith(message.get(), u"x"), u"<null>");
  EXPECT_EQ(message->error, 0);
}

TEST_F(I18MsgTest, TheSameArgumentsBindTwiceAndStayUnread) {
  const Message message = textMessage(u"{0} {1,number}");
  const auto check = [](I18Msg *bound, ...) {
    va_list args;
    va_start(args, bound);
    EXPECT_EQ(take(qlxIntlBindUI18Msg(bound, &args)), u"x 2");
    EXPECT_EQ(take(qlxIntlBindUI18Msg(bound, &args)), u"x 2");
    EXPECT_EQ(std::u16string(va_arg(args, const UChar *)), u"x");
    EXPECT_EQ(va_arg(args, double), 2.0);
    va_end(args);
  };
  check(message.get(), u"x", 2.0);
}

TEST_F(I18MsgTest, AMissingArgumentListIsAnEmptyOne) {
  EXPECT_EQ(take(qlxIntlBindUI18Msg(textMessage(u"it''s plain").get(), nullptr)), u"it's plain");
  const Message needy = textMessage(u"{0}");
  EXPECT_EQ(take(qlxIntlBindUI18Msg(needy.get(), nullptr)), u"<null>");
  EXPECT_EQ(needy->error, U_ILLEGAL_ARGUMENT_ERROR);
}

TEST_F(I18MsgTest, AnEmptyTextIsNullAndNoFailure) {
  for (const UChar *pattern : {u"", u"{0}", u"{0,select,other{}}"}) {
    const Message message = textMessage(pattern);
    message->error = 99;
    EXPECT_EQ(bindWith(message.get(), u""), u"<null>");
    EXPECT_EQ(message->error, 99);
  }
}

TEST_F(I18MsgTest, AFailureIsKeptUntilTheNextOne) {
  const Message message = textMessage(u"{0");
  EXPECT_EQ(bindWith(message.get(), u"x"), u"<null>");
  EXPECT_EQ(message->error, U_UNMATCHED_BRACES);
  message->text[0] = u'x';
  message->text[1] = u'y';
  EXPECT_EQ(bindWith(message.get(), u"x"), u"xy");
  EXPECT_EQ(message->error, U_UNMATCHED_BRACES) << "a success does not clear it";
}

TEST_F(I18MsgTest, BindingIntoATextAppends) {
  CxUStringBuff text{};
  CxUStringBuffAppendStr(&text, "a ");
  EXPECT_EQ(qlxIntlBindI18MsgTo(textMessage(u"'{b}'").get(), nullptr, &text), 1);
  EXPECT_EQ(qlxIntlBindI18MsgTo(textMessage(u"{b").get(), nullptr, &text), 0);
  EXPECT_EQ(qlxIntlBindI18MsgTo(textMessage(u"").get(), nullptr, &text), 0);
  EXPECT_EQ(qlxIntlBindI18MsgTo(nullptr, nullptr, &text), 0);
  EXPECT_EQ(take(CxUStringBuffTakeUStr(&text)), u"a {b}");
}

// ---- Binding by a bundle

class I18MsgBundleTest : public I18MsgTest {
 protected:
  void SetUp() override {
    I18MsgTest::SetUp();
    ASSERT_TRUE(bundles_.add("root", R"(
      hello { "Hello {0}, {1,number}" }
      bare { "nothing but text" }
      empty { "" }
      broken { "{0" }
      table { inner { "x" } }
      number:int { 5 }
    )"));
    ASSERT_TRUE(bundles_.add("de", R"(hello { "Grüße {0}, {1,number}" })"));
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
  }

  Message message(const char *key, const UChar *text = nullptr) const {
    return makeMessage(bundles_.path().c_str(), key, text);
  }

  ResourceBundles bundles_{"messages"};
};

TEST_F(I18MsgBundleTest, TheKeySelectsThePatternInTheMessagesLocale) {
  const Message hello = message("hello");
  EXPECT_EQ(bindWith(hello.get(), u"Ann", 1234.5), u"Hello Ann, 1,234.5");
  for (const char *locale : {"de", "de_DE"}) {
    qlxSetI18MsgLocale(hello.get(), locale);
    EXPECT_EQ(bindWith(hello.get(), u"Ann", 1234.5), u"Gr\u00FC\u00DFe Ann, 1.234,5") << locale;
  }
  clearLocale(hello);
  EXPECT_EQ(hello->error, 0) << "falling back to a parent locale is no failure";
}

TEST_F(I18MsgBundleTest, WithoutALocaleTheDefaultOneOfTheMomentCounts) {
  const Message hello = message("hello");
  EXPECT_EQ(bindWith(hello.get(), u"Ann", 1.5), u"Hello Ann, 1.5");
  ASSERT_TRUE(IcuDefaults::setLocale("de_AT"));
  EXPECT_EQ(bindWith(hello.get(), u"Ann", 1.5), u"Gr\u00FC\u00DFe Ann, 1,5");
}

TEST_F(I18MsgBundleTest, AKeyOfAParentLocaleIsFound) {
  const Message bare = message("bare");
  qlxSetI18MsgLocale(bare.get(), "de");
  EXPECT_EQ(bindWith(bare.get()), u"nothing but text");
  clearLocale(bare);
}

// ICU looks for a bundle's bare name in its data folder.
class DataFolder {
 public:
  explicit DataFolder(const std::string &path) : before_(u_getDataDirectory()) {
    u_setDataDirectory(path.c_str());
  }
  ~DataFolder() { u_setDataDirectory(before_.c_str()); }

 private:
  std::string before_;
};

TEST_F(I18MsgBundleTest, AnUnknownPathIsOpenedByThePartAfterItsLastSlash) {
  const DataFolder folder{bundles_.folder()};
  for (const char *bundle : {"messages", "/no/such/folder/messages", "no/messages"}) {
    const Message hello = makeMessage(bundle, "hello", nullptr);
    EXPECT_EQ(bindWith(hello.get(), u"Ann", 2.0), u"Hello Ann, 2") << bundle;
    EXPECT_EQ(hello->error, 0) << bundle;
  }
}

TEST_F(I18MsgBundleTest, ABundleThatCannotBeOpenedIsAFailure) {
  const DataFolder folder{bundles_.folder()};
  for (const char *bundle :
       {"nosuchbundle", "/no/such/bundle", "messages/nosuchbundle", "", "/", "messages/"}) {
    const Message unknown = makeMessage(bundle, "hello", u"the text is no way out");
    const bool opens = std::string(bundle) == "messages/";
    EXPECT_EQ(bindWith(unknown.get(), u"Ann", 2.0), opens ? u"Hello Ann, 2" : u"<null>") << bundle;
    EXPECT_EQ(unknown->error, opens ? 0 : U_MISSING_RESOURCE_ERROR) << bundle;
  }
}

TEST_F(I18MsgBundleTest, AMissingKeyIsAFailureAlsoWithAText) {
  for (const char *key : {"nosuchkey", "", static_cast<const char *>(nullptr)}) {
    const Message missing = message(key, u"the text is no way out");
    EXPECT_EQ(bindWith(missing.get(), u"x"), u"<null>");
    EXPECT_EQ(missing->error, U_MISSING_RESOURCE_ERROR);
  }
}

TEST_F(I18MsgBundleTest, AKeyOfSomethingElseThanATextIsAFailure) {
  for (const char *key : {"table", "number"}) {
    const Message other = message(key);
    EXPECT_EQ(bindWith(other.get(), u"x"), u"<null>");
    EXPECT_EQ(other->error, U_RESOURCE_TYPE_MISMATCH);
  }
}

TEST_F(I18MsgBundleTest, ABundlesPatternIsFormattedAsATextIs) {
  const Message empty = message("empty");
  EXPECT_EQ(bindWith(empty.get()), u"<null>");
  EXPECT_EQ(empty->error, 0);
  const Message broken = message("broken");
  EXPECT_EQ(bindWith(broken.get(), u"x"), u"<null>");
  EXPECT_EQ(broken->error, U_UNMATCHED_BRACES);
}

TEST_F(I18MsgBundleTest, ALocaleThatIcuCannotReadDoesNoHarm) {
  const Message hello = message("hello");
  qlxSetI18MsgLocale(hello.get(), "certainly no locale");
  EXPECT_EQ(bindWith(hello.get(), u"Ann", 2.0), u"Hello Ann, 2");
  clearLocale(hello);
}

// ---- Without memory

TEST_F(I18MsgTest, WithoutMemoryAMessageIsWholeOrNull) {
  const Message source = makeMessage("bundle", "key", u"{0,number}");
  const Parm parm{.type = ParmInt32, .value = {.i = 7}};
  ASSERT_EQ(qlxIntlParmListAppend(qlxGetI18MsgParmList(source.get()), &parm), 1);
  for (const auto fail : {&FailingMemory::failOnce, &FailingMemory::failFrom})
    for (uint64_t nth = 1;; ++nth) {
      FailingMemory memory;
      (memory.*fail)(nth);
      if (const Message copy{qlxIntlCopyI18Msg(source.get())}) {
        EXPECT_TRUE(copy->bundle && copy->key && copy->text && copy->parms);
      }
      if (const Message made = textMessage(u"'{'")) {
        EXPECT_EQ(qlxGetI18MsgParmList(made.get()), made->parms);
        const std::u16string text = bindWith(made.get());
        EXPECT_EQ(text, made->error ? u"<null>" : u"{");
        EXPECT_EQ(made->error, made->error ? U_MEMORY_ALLOCATION_ERROR : 0);
      }
      qlxDropCachedFormats();
      EXPECT_EQ(memory.live(), 0);
      if (memory.failures() == 0) break;
    }
}

// ---- Printing

class PrintTest : public ::testing::Test {
 protected:
  // What a stream holds after the text was printed on it, and "!" to show that it is still open.
  static std::string printed(const UChar *text) {
    std::FILE *stream = std::tmpfile();
    qlxI18PrintUCharAsLocal(stream, text);
    std::fputc('!', stream);
    std::rewind(stream);
    std::string all(200, '\0');
    all.resize(std::fread(all.data(), 1, all.size(), stream));
    std::fclose(stream);
    return all;
  }

  IcuDefaults defaults_;
};

TEST_F(PrintTest, ATextIsFollowedByALineFeedAndTheStreamStaysOpen) {
  EXPECT_EQ(printed(u"text"), "text\n!");
  EXPECT_EQ(printed(u"text\n"), "text\n\n!");
  EXPECT_EQ(printed(u""), "\n!");
}

TEST_F(PrintTest, TheBytesAreOfTheDefaultCodePage) {
  ASSERT_TRUE(IcuDefaults::setCodePage("UTF-8"));
  EXPECT_EQ(printed(u"\u00E9\U0001F600"), "\xC3\xA9\xF0\x9F\x98\x80\n!");
}

TEST_F(PrintTest, AnotherDefaultCodePageIsUsedAtOnce) {
  if (!IcuDefaults::setCodePage("ISO-8859-1")) GTEST_SKIP() << "this ICU's is always UTF-8";
  EXPECT_EQ(printed(u"\u00E9\u4E00"), "\xE9\x1A\n!");
}

TEST_F(PrintTest, WithoutTextOrStreamNothingIsWritten) {
  EXPECT_EQ(printed(nullptr), "!");
  qlxI18PrintUCharAsLocal(nullptr, u"text");
}

}  // namespace
