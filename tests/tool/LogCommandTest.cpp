// The command `qlx log`, started as a user starts it: its output, its files and its exit status.
#include <gtest/gtest.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include <fcntl.h>
#include <pty.h>
#include <unistd.h>

#include "support/SemaphoreKey.h"
#include "support/TempDir.h"
#include "tool/Process.h"

namespace {

class LogCommandTest : public ::testing::Test {
 protected:
  // Records go to app.log, as the text alone.
  void SetUp() override {
    dir.write("app.properties", file() +
                                    "app.logger.className=qlx_basiclogger\n"
                                    "app.logger.listenerNames=app.file\n");
  }

  static std::string file() {
    return "app.file.className=qlx_filehandler\n"
           "app.file.fileName=app.log\n"
           "app.file.formatterName=app.formatter\n" +
           formatter();
  }
  static std::string formatter() {
    return "app.formatter.className=qlx_basicformatter\n"
           "app.formatter.dateTimeFormat='>'\n"
           "app.formatter.separator=\n";
  }

  std::vector<std::string> arguments(const std::vector<std::string> &more) const {
    std::vector<std::string> all = {"log", "--config", "app.properties", "--logger", "app.logger"};
    all.insert(all.end(), more.begin(), more.end());
    return all;
  }

  Outcome log(const std::string &input, const std::vector<std::string> &more = {},
              const Process::Environment &environment = {}) {
    Process run(arguments(more), dir.path(), environment);
    run.write(input);
    return run.finish();
  }

  bool hasLogged() const { return std::filesystem::exists(dir.path("app.log")); }

  static constexpr const char *kMessages = QLX_EXAMPLE_MESSAGES;
  const TempDir dir;
};

TEST_F(LogCommandTest, LogsEachLineOfStandardInput) {
  const Outcome outcome = log("one\ntwo\n");
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(dir.read("app.log"), ">one\n>two\n");
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err, "");
}

TEST_F(LogCommandTest, LogsTheLinesOfTheNamedFilesInTheirOrder) {
  dir.write("a.txt", "a\n");
  dir.write("b.txt", "b\n");
  EXPECT_EQ(log("from standard input\n", {"b.txt", "-", "a.txt"}).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">b\n>from standard input\n>a\n");
}

TEST_F(LogCommandTest, WritesToTheConsoleWithAnEmptyLineAfterEachRecord) {
  dir.write("app.properties", formatter() +
                                  "app.logger.className=qlx_basiclogger\n"
                                  "app.logger.listenerNames=app.console\n"
                                  "app.console.className=qlx_consolehandler\n"
                                  "app.console.formatterName=app.formatter\n");
  EXPECT_EQ(log("one\n").out, ">one\n\n");
}

TEST_F(LogCommandTest, TakesALineAsTextAndNeverAsAPattern) {
  const std::string lines = "{0} {1} '{0}' it's }{ '' {\n";
  EXPECT_EQ(log(lines).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">" + lines);
}

TEST_F(LogCommandTest, KeepsEmptyLinesCarriageReturnsAndBlanks) {
  EXPECT_EQ(log("\n  a\t\r\n\n").status, 0);
  EXPECT_EQ(dir.read("app.log"), ">\n>  a\t\r\n>\n");
}

TEST_F(LogCommandTest, LogsALastLineWithoutALineFeed) {
  EXPECT_EQ(log("one\ntwo").status, 0);
  EXPECT_EQ(dir.read("app.log"), ">one\n>two\n");
}

TEST_F(LogCommandTest, LogsNothingForAnEmptyInput) {
  EXPECT_EQ(log("").status, 0);
  EXPECT_FALSE(hasLogged());
}

TEST_F(LogCommandTest, GivesUtf8BackAsItCameAlsoInTheCLocale) {
  const std::string line = "Gr\u00FC\u00DFe, \u65E5\u672C, \U0001F600\n";
  for (const char *locale : {"C.UTF-8", "C", "POSIX"}) {
    dir.write("app.log", "");
    EXPECT_EQ(log(line, {}, {{"LC_ALL", locale}}).status, 0);
    EXPECT_EQ(dir.read("app.log"), ">" + line) << locale;
  }
}

TEST_F(LogCommandTest, ReplacesBytesThatAreNoTextAndNul) {
  using namespace std::string_literals;
  EXPECT_EQ(log("a\xFFz\nb\0z\nc\xE2\x82\n"s).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">a\uFFFDz\n>b\uFFFDz\n>c\uFFFD\n");
}

TEST_F(LogCommandTest, ReplacesACharacterThatTheEndOfTheInputCuts) {
  EXPECT_EQ(log("a\xE2\x82").status, 0);
  EXPECT_EQ(dir.read("app.log"), ">a\uFFFD\n");
}

TEST_F(LogCommandTest, LogsALineOfAMebibyteWhole) {
  const std::string line(1 << 20, 'x');
  EXPECT_EQ(log(line + "\nnext\n").status, 0);
  EXPECT_EQ(dir.read("app1.log"), ">" + line + "\n");  // which fills the first generation
  EXPECT_EQ(dir.read("app.log"), ">next\n");
}

TEST_F(LogCommandTest, CutsALongerLineIntoRecordsBetweenCharacters) {
  dir.write("app.properties", dir.read("app.properties") + "app.file.maxFiles=1\n");
  // The two bytes of the last character stand on both sides of the limit.
  const std::string head((1 << 20) - 1, 'x');
  EXPECT_EQ(log(head + "\u00FC and more\nnext\n").status, 0);
  EXPECT_EQ(dir.read("app.log"), ">" + head + "\n>\u00FC and more\n>next\n");
}

TEST_F(LogCommandTest, LogsAtTheGivenLevelBehindTheThreshold) {
  dir.write("app.properties", dir.read("app.properties") + "app.logger.level=WARN\n");
  EXPECT_EQ(log("default\n").status, 0);  // INFO: suppressed, which is no failure
  EXPECT_FALSE(hasLogged());
  EXPECT_EQ(log("word\n", {"--level", "error"}).status, 0);
  EXPECT_EQ(log("number\n", {"--level", "5000"}).status, 0);
  EXPECT_EQ(log("below\n", {"--level", "4999"}).status, 0);
  EXPECT_EQ(log("without one\n", {"--level=-9999"}).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">word\n>number\n>without one\n");
}

TEST_F(LogCommandTest, PassesTheLevelOnToFilters) {
  dir.write("app.properties", file() +
                                  "app.logger.className=qlx_basiclogger\n"
                                  "app.logger.listenerNames=app.filter\n"
                                  "app.filter.className=qlx_levelfilter\n"
                                  "app.filter.level=WARN\n"
                                  "app.filter.listenerNames=app.file\n");
  EXPECT_EQ(log("low\n").status, 0);
  EXPECT_EQ(log("high\n", {"--level", "WARN"}).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">high\n");
}

// ---- Messages

TEST_F(LogCommandTest, LogsOneMessageWithArgumentsOfThePatternsTypes) {
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "copied", "disk", "1250"}).status, 0);
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "filling", "/var", "0.5"}).status, 0);
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "lost", "{0}", "too many"}).status, 0);
  EXPECT_EQ(dir.read("app.log"),
            ">Copied 1250 files from disk\n"
            ">/var is 50% full\n"
            ">Lost the connection to {0}\n");
}

TEST_F(LogCommandTest, LogsAMessageInTheFormattersLocale) {
  dir.write("app.properties", dir.read("app.properties") + "app.formatter.locale=de\n");
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "copied", "disk", "1250"}).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">1.250 Dateien von disk kopiert\n");
}

TEST_F(LogCommandTest, FailsForAKeyThatTheBundleDoesNotHave) {
  const Outcome outcome = log("", {"--bundle", kMessages, "--key", "nothing", "a"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err, "qlx: a record failed: U_MISSING_RESOURCE_ERROR\n");
}

TEST_F(LogCommandTest, TakesMissingArgumentsAsWrongUsage) {
  const Outcome outcome = log("", {"--bundle", kMessages, "--key", "copied", "disk"});
  EXPECT_EQ(outcome.status, 2);
  EXPECT_EQ(outcome.err, "qlx: copied: the message has 2 arguments, not 1\n");
  EXPECT_FALSE(hasLogged());
}

TEST_F(LogCommandTest, TakesAWordInPlaceOfANumberAsWrongUsage) {
  for (const char *word : {"many", "12x", "1.5", "", "99999999999"}) {
    const Outcome outcome = log("", {"--bundle", kMessages, "--key", "copied", "disk", word});
    EXPECT_EQ(outcome.status, 2) << word;
  }
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "filling", "/var", "half"}).err,
            "qlx: filling: argument {1} is a number, not \"half\"\n");
}

TEST_F(LogCommandTest, LogsAMessageOnlyAboveTheThreshold) {
  dir.write("app.properties", dir.read("app.properties") + "app.logger.level=WARN\n");
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "lost", "a"}).status, 0);
  EXPECT_EQ(log("", {"--bundle", kMessages, "--key", "lost", "b", "--level", "WARN"}).status, 0);
  EXPECT_EQ(dir.read("app.log"), ">Lost the connection to b\n");
}

// ---- Failures

TEST_F(LogCommandTest, TakesAnUnknownLevelWordAsWrongUsage) {
  const Outcome outcome = log("", {"--level", "LOUD"});
  EXPECT_EQ(outcome.status, 2);
  EXPECT_NE(outcome.err.find("\"LOUD\" is neither a number nor"), std::string::npos);
}

TEST_F(LogCommandTest, AnswersWrongUsageWithStatusTwo) {
  const std::vector<std::vector<std::string>> wrong = {
      {"log"},                                                         // no logger
      {"log", "--logger"},                                             // no name
      {"log", "--logger", "app.logger", "--color"},                    // unknown
      {"log", "--logger", "app.logger", "--bundle", kMessages},        // no key
      {"log", "--logger", "app.logger", "--key", "lost", "argument"},  // no bundle
  };
  for (const auto &arguments : wrong) {
    const Outcome outcome = Process(arguments, dir.path()).finish();
    EXPECT_EQ(outcome.status, 2) << arguments.size();
    EXPECT_NE(outcome.err, "");
  }
}

TEST_F(LogCommandTest, FailsWithTheSystemsTextForAConfigurationThatIsNotThere) {
  const Outcome outcome =
      Process({"log", "--config", "none.properties", "--logger", "app.logger"}, dir.path())
          .finish();
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err, "qlx: none.properties: No such file or directory\n");
}

TEST_F(LogCommandTest, FailsForAConfigurationThatIsRefused) {
  dir.write("app.properties", "nodot=1\n");
  const Outcome outcome = log("");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err,
            "qlx: app.properties: a line of it cannot be read, or its key names no "
            "configuration\n");
}

TEST_F(LogCommandTest, FailsForANameThatIsNoLogger) {
  for (const char *name : {"app.nobody", "app.file"}) {
    const Outcome outcome =
        Process({"log", "--config", "app.properties", "--logger", name}, dir.path()).finish();
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.err,
              "qlx: " + std::string(name) + ": no logger of this name is configured\n");
  }
}

TEST_F(LogCommandTest, FailsForAnInputThatIsNotThereAndLogsTheOthers) {
  dir.write("a.txt", "a\n");
  const Outcome outcome = log("", {"none.txt", ".", "a.txt"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err,
            "qlx: none.txt: No such file or directory\n"
            "qlx: .: Is a directory\n");
  EXPECT_EQ(dir.read("app.log"), ">a\n");
}

TEST_F(LogCommandTest, TellsTheSystemsErrorOnceWhenRecordsCannotBeWritten) {
  dir.write("app.properties", dir.read("app.properties") + "app.file.fileName=app.d\n");
  ASSERT_EQ(mkdir(dir.path("app.d").c_str(), 0777), 0);  // a folder cannot be opened for writing
  const Outcome outcome = log("one\ntwo\nthree\n");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err, "qlx: a record failed: Is a directory\n");
}

TEST_F(LogCommandTest, TellsOnceOfRolloversThatFailedAndSucceedsWhenTheRecordsAreWritten) {
  ASSERT_EQ(system(("mkdir -p " + dir.path("app1.log/occupied")).c_str()), 0);
  const std::string old = dir.read("app.properties") + "app.file.maxFileBytes=1\n";
  dir.write("app.properties", old + "app.file.maxFiles=2\n");
  const Outcome outcome = log("one\ntwo\nthree\n");
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err, "qlx: " + std::filesystem::canonical(dir.path()).string() +
                             "/app.log: written, but not rolled over: Is a directory\n");
  EXPECT_EQ(dir.read("app.log"), ">one\n>two\n>three\n");
}

TEST_F(LogCommandTest, TellsOfASharedFileThatCouldNotBeCopiedAndSucceedsWhenTheRecordsAreWritten) {
  const SemaphoreKey key;
  ASSERT_EQ(system(("mkdir -p " + dir.path("app1.log/occupied")).c_str()), 0);
  const std::string old = dir.read("app.properties") + "app.file.maxFileBytes=1\n";
  dir.write("app.properties", old + "app.file.className=qlx_multiproc_filehandler\n" +
                                  "app.file.maxFiles=2\napp.file.keepFullFile=true\n" +
                                  "app.file.MPFileSemKey=" + key.text() + "\n");
  const Outcome outcome = log("one\ntwo\n");
  EXPECT_EQ(outcome.status, 0);
  EXPECT_NE(outcome.err.find("written, but not rolled over"), std::string::npos) << outcome.err;
  EXPECT_EQ(dir.read("app.log"), ">one\n>two\n");
}

TEST_F(LogCommandTest, FailsWhenStandardOutputCannotBeWritten) {
  dir.write("app.properties", formatter() +
                                  "app.logger.className=qlx_basiclogger\n"
                                  "app.logger.listenerNames=app.console\n"
                                  "app.console.className=qlx_consolehandler\n");
  const int full = open("/dev/full", O_WRONLY | O_CLOEXEC);
  Process run(arguments({}), dir.path(), {}, -1, full);
  run.write("one\ntwo\n");
  const Outcome outcome = run.finish();
  close(full);
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err, "qlx: a record failed: standard output cannot be written\n");
}

TEST_F(LogCommandTest, WritesNoRecordIntoTheConsolesPlaceWhenStandardOutputIsClosed) {
  dir.write("app.properties", dir.read("app.properties") +
                                  "app.logger.listenerNames=app.file app.console\n"
                                  "app.console.className=qlx_consolehandler\n"
                                  "app.console.formatterName=app.formatter\n");
  const std::string shell =
      "exec " QLX_COMMAND " log --config app.properties --logger app.logger >&- <a.txt";
  dir.write("a.txt", "a\nb\n");
  EXPECT_EQ(system(("cd " + dir.path() + " && " + shell).c_str()), 0);
  EXPECT_EQ(dir.read("app.log"), ">a\n>b\n");
}

// ---- Signals and terminals

class LogCommandSignalTest : public LogCommandTest, public ::testing::WithParamInterface<int> {};

TEST_P(LogCommandSignalTest, EndsTheInputWithEverythingWritten) {
  dir.write("app.properties", dir.read("app.properties") +
                                  "app.logger.listenerNames=app.file app.console\n"
                                  "app.console.className=qlx_consolehandler\n"
                                  "app.console.formatterName=app.formatter\n");
  Process run(arguments({}), dir.path());
  run.write("one\ntwo\nunfinished");  // one write, which a single read takes over
  run.waitForOutput(">two\n\n");
  run.signal(GetParam());  // the input stays open
  run.waitForOutput(">unfinished\n\n");
  const Outcome outcome = run.finish();
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(dir.read("app.log"), ">one\n>two\n>unfinished\n");
}

INSTANTIATE_TEST_SUITE_P(Stop, LogCommandSignalTest, ::testing::Values(SIGINT, SIGTERM));

TEST_F(LogCommandTest, GoesOnForTheFilesWhenTheConsolesReaderWentAway) {
  dir.write("app.properties", dir.read("app.properties") +
                                  "app.logger.listenerNames=app.console app.file\n"
                                  "app.console.className=qlx_consolehandler\n");
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
  close(ends[0]);
  Process run(arguments({}), dir.path(), {}, -1, ends[1]);
  close(ends[1]);
  run.write("one\ntwo\n");
  EXPECT_EQ(run.finish().status, 1);
  EXPECT_EQ(dir.read("app.log"), ">one\n>two\n");
}

static constexpr const char *kNoTerminal = "no pseudo terminals here";

// Standard error is a terminal here; what it shows comes back. Nothing where the machine makes
// none.
static std::optional<std::string> shownOnATerminal(const std::vector<std::string> &arguments,
                                                   const TempDir &dir) {
  int terminal, process;
  if (openpty(&terminal, &process, nullptr, nullptr, nullptr) != 0) return std::nullopt;
  std::string shown;
  {
    Process run(arguments, dir.path(), {}, -1, -1, process);
    close(process);
    char buffer[4096];
    ssize_t count;
    while ((count = read(terminal, buffer, sizeof buffer)) > 0) shown.append(buffer, count);
    EXPECT_EQ(run.finish().status, 0);
  }
  close(terminal);
  return shown;
}

TEST_F(LogCommandTest, ShowsProgressOnATerminalForALongFile) {
  std::string lines;
  while (lines.size() < (4 << 20)) lines += std::string(4095, 'x') + "\n";
  dir.write("long.txt", lines);
  const std::optional<std::string> shown = shownOnATerminal(arguments({"long.txt"}), dir);
  if (!shown) GTEST_SKIP() << kNoTerminal;
  EXPECT_NE(shown->find("% of long.txt, "), std::string::npos) << *shown;
  EXPECT_TRUE(shown->ends_with("\r\033[K")) << *shown;  // and takes it away
}

TEST_F(LogCommandTest, ShowsNoProgressForAShortFile) {
  dir.write("short.txt", "one\n");
  const std::optional<std::string> shown = shownOnATerminal(arguments({"short.txt"}), dir);
  if (!shown) GTEST_SKIP() << kNoTerminal;
  EXPECT_EQ(*shown, "");
}

TEST_F(LogCommandTest, ShowsNoProgressWithoutATerminal) {
  dir.write("long.txt", std::string(5 << 20, '\n'));
  dir.write("app.properties", dir.read("app.properties") + "app.logger.level=OFF\n");
  EXPECT_EQ(log("", {"long.txt"}).err, "");
}

TEST_F(LogCommandTest, ShowsItsOptionsAndItsVersion) {
  const Outcome help = Process({"log", "--help"}, dir.path()).finish();
  EXPECT_EQ(help.status, 0);
  for (const char *option : {"--config", "--logger", "--level", "--bundle", "--key"}) {
    EXPECT_NE(help.out.find(option), std::string::npos) << option;
  }
}

}  // namespace
