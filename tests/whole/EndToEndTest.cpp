// Whole configurations: a properties file in, the bytes of the files and of the standard output
// stream out. Time is data: a filter class of the test's sets every event's time.
#include <gtest/gtest.h>

#include <memory>
#include <string>

#include <qlx/qlx.h>

#include "support/CaptureStdout.h"
#include "support/Handle.h"
#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/Status.h"
#include "support/TempDir.h"
#include "support/WorkingDir.h"

namespace {

constexpr double kTime = 1155718135123;  // 2006-08-16 08:48:55.123 UTC

uint8_t setTime(QlxObject *, Event *event, va_list *) {
  event->time = kTime;
  return 1;
}

class EndToEndTest : public ::testing::Test {
 protected:
  void SetUp() override {
    IcuDefaults::setLocale("en_US");
    IcuDefaults::setZone(u"Europe/Berlin");
    IcuDefaults::setCodePage("UTF-8");
    QlxAddFilterClass("test_clock", nullptr, nullptr, nullptr, QlxBasicObjectFCfgChange, nullptr,
                      setTime, nullptr);
  }
  void TearDown() override { QlxCloseToolkit(); }

  void open(const std::string &properties) {
    dir.write("log.properties", properties);
    CxStatus status = kSuccess;
    ASSERT_EQ(QlxOpenToolkit(dir.path("log.properties").c_str(), &status), 1) << status;
  }

  static Handle get(const char *name) { return Handle{QlxGetObject(name, nullptr)}; }

  std::string read(const char *name) { return dir.has(name) ? dir.read(name) : "<none>"; }

  IcuDefaults defaults;
  TempDir dir;
  WorkingDir here{dir.path()};  // names without a directory are the test's own
};

TEST_F(EndToEndTest, OneLoggerToTheConsole) {
  open(R"(
# the smallest configuration
app.className = qlx_basiclogger
app.listenerNames = clock
clock.className = test_clock
clock.listenerNames = console
console.className = qlx_consolehandler
)");
  CaptureStdout out;
  {
    const Handle logger = get("app");
    QlxLogUText(logger.get(), u"started");
    QlxLogDebugMin(logger.get(), "main.c", "main", 42, u"{0} of {1}", u"one", u"two");
    QlxLogDebugMid(logger.get(), "main.c", "main", 43, u"below the threshold");
  }
  EXPECT_EQ(out.bytes(),
            "2006-08-16 10:48:55.123+02:00 started\n"
            "\n"
            "2006-08-16 10:48:55.123+02:00 main.c main 42 one of two\n"
            "\n");
}

TEST_F(EndToEndTest, EverythingToAFileAndWarningsToTheConsole) {
  open(R"(
app.className=qlx_basiclogger
app.level=ALL
app.listenerNames=clock
clock.className=test_clock
clock.listenerNames=file warnings
warnings.className=qlx_levelfilter
warnings.level=WARN
warnings.listenerNames=console
console.className=qlx_consolehandler
console.formatterName=brief
brief.className=qlx_basicformatter
brief.dateTimeFormat=HH:mm
brief.separator=\ |\u0020
file.className=qlx_filehandler
file.fileName=logs/app.log
)");
  CaptureStdout out;
  {
    const Handle logger = get("app");
    QlxLogDebugMax(logger.get(), nullptr, nullptr, 0, u"detail");
    QlxLogInfo(logger.get(), nullptr, nullptr);  // a message without bundle and key has no text
    QlxLogWarn(logger.get(), nullptr, nullptr);
    QlxLogUText(logger.get(), u"without level");
  }
  EXPECT_EQ(out.bytes(),
            "10:48 | \n"
            "\n"
            "10:48 | without level\n"
            "\n");
  EXPECT_EQ(read("logs/app.log"),
            "2006-08-16 10:48:55.123+02:00 detail\n"
            "2006-08-16 10:48:55.123+02:00 \n"
            "2006-08-16 10:48:55.123+02:00 \n"
            "2006-08-16 10:48:55.123+02:00 without level\n");
}

TEST_F(EndToEndTest, ARollingFile) {
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=file
file.className=qlx_filehandler
file.fileName=roll.log
file.maxFileBytes=16
file.maxFiles=3
file.formatterName=brief
brief.className=qlx_basicformatter
brief.dateTimeFormat='T'
)");
  const Handle logger = get("app");
  for (int32_t i = 1; i <= 8; ++i) {
    const QlxLogResult result = QlxLogUText(logger.get(), u"event {0,number,integer}", i);
    EXPECT_EQ(result.statusKind, '-');
  }
  EXPECT_EQ(read("roll.log"), "T event 7\nT event 8\n");
  EXPECT_EQ(read("roll1.log"), "T event 5\nT event 6\n");
  EXPECT_EQ(read("roll2.log"), "T event 3\nT event 4\n");
  EXPECT_EQ(read("roll3.log"), "<none>");
}

TEST_F(EndToEndTest, ANameThatEndsInADigitAndEmptiedAtTheStart) {
  dir.write("trace5_.log", "of an earlier run\n");
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=file
file.className=qlx_filehandler
file.fileName=trace5.log
file.appending=FALSE
file.maxFileSize=1
file.maxFiles=2
file.formatterName=brief
brief.className=qlx_basicformatter
brief.dateTimeFormat=
brief.separator=
)");
  const Handle logger = get("app");
  for (const char16_t *text : {u"1", u"2", u"3"}) QlxLogUText(logger.get(), text);
  EXPECT_EQ(read("trace5_.log"), "3\n");
  EXPECT_EQ(read("trace5_1.log"), "2\n");
  EXPECT_EQ(read("trace5_2.log"), "<none>");
}

TEST_F(EndToEndTest, SettingsInheritedFromTheNamesAbove) {
  open(R"(
files.className=qlx_filehandler
files.maxFileBytes=8
files.maxFiles=2
files.formatterName=brief
files.small.fileName=small.log
files.large.fileName=large.log
files.large.maxFileBytes=1000
brief.className=qlx_basicformatter
brief.dateTimeFormat='T'
app.className=qlx_basiclogger
app.listenerNames=files.small files.large
)");
  const Handle logger = get("app");
  for (const char16_t *text : {u"first", u"second", u"third"}) QlxLogUText(logger.get(), text);
  EXPECT_EQ(read("small.log"), "T third\n");
  EXPECT_EQ(read("small1.log"), "T second\n");
  EXPECT_EQ(read("large.log"), "T first\nT second\nT third\n");
}

TEST_F(EndToEndTest, AChainThroughTwoHandlers) {
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=file
file.className=qlx_filehandler
file.fileName=first.log
file.listenerNames=second console
file.formatterName=plain
second.className=qlx_filehandler
second.fileName=second.log
second.formatterName=plain
console.className=qlx_consolehandler
console.formatterName=plain
plain.className=qlx_basicformatter
plain.dateTimeFormat='>'
)");
  CaptureStdout out;
  QlxLogUText(get("app").get(), u"{0}", u"once");
  EXPECT_EQ(read("first.log"), "> once\n");
  EXPECT_EQ(read("second.log"), "> once\n");
  EXPECT_EQ(out.bytes(), "> once\n\n");
}

TEST_F(EndToEndTest, LocalizedMessagesInTwoLanguagesAtOnce) {
  const ResourceBundles messages;
  ASSERT_TRUE(messages.add("root", R"(done { "{0} wrote {1,number,integer} lines" })"));
  ASSERT_TRUE(messages.add("de", R"(done { "{0} hat {1,number,integer} Zeilen geschrieben" })"));
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=english german
english.className=qlx_filehandler
english.fileName=english.log
english.formatterName=english.formatter
english.formatter.className=qlx_basicformatter
english.formatter.dateTimeFormat='-'
english.formatter.locale=en_US
german.className=qlx_filehandler
german.fileName=german.log
german.formatterName=german.formatter
german.formatter.className=qlx_basicformatter
german.formatter.dateTimeFormat='-'
german.formatter.locale=de_DE
)");
  const Handle logger = get("app");
  const QlxLogResult result =
      QlxLogInfo(logger.get(), messages.path().c_str(), "done", u"J\u00f6rg", int32_t{12345});
  EXPECT_EQ(result.statusKind, '-');
  EXPECT_LE(result.msgStatus, 0);
  EXPECT_EQ(read("english.log"), "- J\xc3\xb6rg wrote 12,345 lines\n");
  EXPECT_EQ(read("german.log"), "- J\xc3\xb6rg hat 12.345 Zeilen geschrieben\n");
}

TEST_F(EndToEndTest, ADisabledHandlerAndADisabledLogger) {
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=silent file
silent.className=qlx_filehandler
silent.fileName=silent.log
silent.logging=Off
file.className=qlx_filehandler
file.fileName=file.log
file.formatterName=plain
plain.className=qlx_basicformatter
plain.dateTimeFormat='-'
off.className=qlx_basiclogger
off.logging=false
off.listenerNames=file
)");
  QlxLogUText(get("app").get(), u"seen");
  QlxLogUText(get("off").get(), u"not seen");
  EXPECT_EQ(read("silent.log"), "<none>");
  EXPECT_EQ(read("file.log"), "- seen\n");
}

TEST_F(EndToEndTest, ChangesWhileTheProgramRuns) {
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=file
file.className=qlx_filehandler
file.fileName=one.log
file.formatterName=plain
plain.className=qlx_basicformatter
plain.dateTimeFormat='-'
filter.className=qlx_levelfilter
filter.level=OFF
filter.listenerNames=file
)");
  const Handle logger = get("app");
  const Handle file = get("file");
  const Handle plain = get("plain");
  QlxLogUText(logger.get(), u"1");
  QlxSetObjProp(file.get(), "fileName", "two.log");
  QlxLogUText(logger.get(), u"2");
  QlxSetObjProp(plain.get(), "separator", "/");
  QlxLogUText(logger.get(), u"3");
  QlxSetObjProp(logger.get(), "listenerNames", "filter");
  QlxLogWarn(logger.get(), nullptr, nullptr);
  QlxLogUText(logger.get(), u"4");
  QlxSetObjProp(file.get(), "logging", "off");
  QlxLogUText(logger.get(), u"5");
  EXPECT_EQ(read("one.log"), "- 1\n");
  EXPECT_EQ(read("two.log"), "- 2\n-/3\n-/4\n");
}

TEST_F(EndToEndTest, NoFileAtAll) {
  ASSERT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);
  const Handle formatter = get("quill.defaultFormatter");
  QlxSetObjProp(formatter.get(), "dateTimeFormat", "'default'");
  CaptureStdout out;
  QlxLogUText(get("quill.errorLogger").get(), u"to the console");
  EXPECT_EQ(out.bytes(), "default to the console\n\n");
}

TEST_F(EndToEndTest, OneDirectoryThatIsInTheWay) {
  dir.write("logs", "a file");
  open(R"(
app.className=qlx_basiclogger
app.listenerNames=lost kept
lost.className=qlx_filehandler
lost.fileName=logs/app.log
kept.className=qlx_filehandler
kept.fileName=kept.log
kept.formatterName=plain
plain.className=qlx_basicformatter
plain.dateTimeFormat='-'
)");
  const QlxLogResult result = QlxLogUText(get("app").get(), u"text");
  EXPECT_EQ((CxStatus{result.statusKind, result.statusCode}), failure(ENOTDIR));
  EXPECT_EQ(read("kept.log"), "- text\n");
  EXPECT_EQ(read("logs"), "a file");
}

}  // namespace
