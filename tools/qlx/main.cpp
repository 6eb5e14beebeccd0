// The command qlx: what it understands, and its exit status.
#include <clocale>
#include <csignal>
#include <cstdio>
#include <optional>
#include <string>

#include <fcntl.h>
#include <unistd.h>

#include <CLI/CLI.hpp>

#include <qlx/level.h>
#include <qlx/types.h>

#include "ExitStatus.h"
#include "LogCommand.h"
#include "SemCommand.h"

// Messages follow the environment; numbers in configurations do not.
static void followTheEnvironmentsLocale() {
  setlocale(LC_MESSAGES, "");
  setlocale(LC_CTYPE, "");
}

// A log file must never be opened as the descriptor that the console handler writes to.
static void fillMissingStandardStreams() {
  int descriptor;
  do {
    descriptor = open("/dev/null", O_RDWR);
  } while (descriptor >= 0 && descriptor <= 2);
  if (descriptor > 2) close(descriptor);
}

// The library's answer to a word that it does not know is the level -9999; as a number that is a
// level too.
static std::string checkLevel(const std::string &text) {
  int number;
  const bool isNumber = sscanf(text.c_str(), "%d", &number) == 1;
  if (QlxGetLevelFromString(text.c_str()) != UNSPECIFIED || isNumber) return "";
  return "\"" + text + "\" is neither a number nor one of FATAL, ERROR, WARN, INFO, DEBUG_MIN, " +
         "DEBUG_MID, DEBUG_MAX, ALL, OFF";
}

static void addLogCommand(CLI::App &app, LogOptions &options) {
  CLI::App *log = app.add_subcommand("log", "Log lines of text, or one localized message");
  log->add_option("--config", options.config, "Properties file with the configurations")
      ->type_name("FILE");
  log->add_option("--logger", options.logger, "The logger, by its name in the configuration")
      ->type_name("NAME")
      ->required();
  log->add_option("--level", options.level, "Level of what is logged: a word or a number")
      ->type_name("LEVEL")
      ->capture_default_str()
      ->check(checkLevel);
  CLI::Option *bundle =
      log->add_option("--bundle", options.bundle, "Log one message of this resource bundle")
          ->type_name("BUNDLE");
  CLI::Option *key = log->add_option("--key", options.key, "Key of the message")->type_name("KEY");
  bundle->needs(key);
  key->needs(bundle);
  log->add_option("inputs", options.inputs,
                  "Files whose lines are logged, - and none being standard input; with --bundle "
                  "the message's arguments instead, read as its pattern wants them (a date as "
                  "milliseconds since 1970)");
  log->footer(
      "Each line is one record, and only text: braces and apostrophes come out as they went in. "
      "Text is UTF-8, whatever the locale; other bytes, and NUL, become U+FFFD; a line of more "
      "than 1 MiB becomes several records. SIGINT and SIGTERM end the input.\n"
      "Exit status: 0 when every record was written, 1 when one was not, 2 for wrong usage.");
}

static std::string checkKey(const std::string &text) {
  return readSemaphoreKey(text) ? ""
                                : "\"" + text +
                                      "\" is no key: a whole number of 32 bits, decimal "
                                      "or with 0x, and not 0";
}

static CLI::Option *addKey(CLI::App *command, std::string &key) {
  return command->add_option("KEY", key, "MPFileSemKey of the handler, decimal or 0x...")
      ->type_name("")
      ->check(checkKey);
}

static void addSemCommand(CLI::App &app, std::string &key) {
  CLI::App *sem = app.add_subcommand("sem", "Semaphore sets of handlers that share a file");
  sem->require_subcommand(1);
  CLI::App *list = sem->add_subcommand("list", "Show one set, or all that look like a handler's");
  addKey(list, key);
  list->footer(
      "VALUE is 1 while no process holds the semaphore, else 0; WAITING counts the processes that "
      "wait for it; LAST PROCESS changed it last. Shown without KEY are the sets of one semaphore "
      "with mode 0666.\n"
      "Exit status: 0, 1 when there is no such set or it cannot be read, 2 for wrong usage.");
  CLI::App *remove = sem->add_subcommand("remove", "Remove one set");
  addKey(remove, key)->required();
  remove->footer(
      "End the processes that log with it first: one that goes on loses its records, each with an "
      "error. The next process that starts makes the set anew.\n"
      "Exit status: 0, 1 when there is no such set or it cannot be removed, 2 for wrong usage.");
}

static int run(const CLI::App &app, const LogOptions &options, const std::string &key) {
  const CLI::App *const command = app.get_subcommands().front();
  if (command->get_name() == "log") return runLogCommand(options);
  const std::optional<key_t> number = readSemaphoreKey(key);
  const bool isList = command->get_subcommands().front()->get_name() == "list";
  return isList ? listSemaphores(number) : removeSemaphore(*number);
}

int main(int argc, char **argv) {
  followTheEnvironmentsLocale();
  fillMissingStandardStreams();
  signal(SIGPIPE, SIG_IGN);  // a reader that goes away does not end the files' records

  CLI::App app{"qlx: configurable logging from the command line", "qlx"};
  app.set_version_flag("--version", "qlx " QLX_VERSION);
  app.require_subcommand(1);
  LogOptions options;
  addLogCommand(app, options);
  std::string key;
  addSemCommand(app, key);
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError &error) {
    return app.exit(error) == 0 ? 0 : kWrongUsage;
  }
  return run(app, options, key);
}
