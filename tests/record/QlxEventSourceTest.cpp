// Where an event comes from is noted, and becomes properties when somebody else than the library's
// own formatter may look: whoever gets the event finds them, wherever it stands in a chain.
#include <functional>
#include <string>

#include <qlx/class/containers.h>
#include <qlx/class/filter.h>
#include <qlx/class/formatter.h>
#include <qlx/class/logger.h>
#include <qlx/class/toolkit.h>

#include "record/QlxLoggedEvent.h"
#include "support/ChainTest.h"
#include "support/SemaphoreKey.h"
#include "support/TempDir.h"

namespace {

constexpr const char *kSource =
    "qlx_prop_srcfile=file.c|qlx_prop_srcline=7|qlx_prop_srcfunction=function|";

std::string propsOf(const Event *event) {
  std::string all;
  for (const auto *it = event->props ? event->props->head : nullptr; it; it = it->next) {
    all += std::string(it->key) + "=" + (it->value ? it->value : "<null>") + "|";
  }
  return all;
}

// What a host's operation found when it got an event; each ends with "/".
std::string gFound;
std::function<void()> gInHeader, gInTrailer, gInBind;

void look(Event *event) {
  gFound += propsOf(event) + "/";
}

uint8_t ask(QlxObject *, Event *event, va_list *) {
  look(event);
  return 1;
}

void passOn(QlxObject *object, Event *event, va_list *args) {
  look(event);
  QlxBasicObjectFLog(object, event, args);
}

UChar *formatOwn(QlxObject *formatter, Event *event, va_list *args) {
  look(event);
  return QlxBasicUFormatterFFormat(formatter, event, args);
}

void actOnce(std::function<void()> &act) {
  if (const auto now = std::exchange(act, nullptr)) now();
}

UChar *bind(I18Msg *message, va_list *args) {
  actOnce(gInBind);
  return qlxIntlBindUI18Msg(message, args);
}

char *header(QlxObject *) {
  actOnce(gInHeader);
  return nullptr;
}

char *trailer(QlxObject *) {
  actOnce(gInTrailer);
  return nullptr;
}

class EventSourceTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    gFound.clear();
    recorder->alsoDo = look;
    QlxAddLoggerClass("test_logger", nullptr, nullptr, nullptr, nullptr, passOn);
    QlxAddFilterClass("test_asking", nullptr, nullptr, nullptr, nullptr, nullptr, ask, nullptr);
    QlxAddFilterClass("test_passing", nullptr, nullptr, nullptr, nullptr, nullptr,
                      QlxLevelFilterFIsLoggable, passOn);
    QlxAddUFormatterClass("test_formatter", nullptr, nullptr, nullptr, nullptr, formatOwn, nullptr,
                          nullptr, nullptr);
    QlxAddUFormatterClass("test_binding", nullptr, nullptr, nullptr, nullptr,
                          QlxBasicUFormatterFFormat, nullptr, nullptr, bind);
    QlxAddUFormatterClass("test_heading", nullptr, nullptr, nullptr, nullptr, nullptr, header,
                          trailer, nullptr);
    QlxSetObjProp(logger.get(), "level", "DEBUG_MIN");
  }

  static void debug(const Handle &log, const char16_t *text = u"text") {
    QlxLogDebugMin(log.get(), "file.c", "function", 7, text);
  }
  void debug() { debug(logger); }

  Handle attachFile(const char *name, const char *className = "qlx_filehandler") {
    Handle file = attach(name, className);
    QlxSetObjProp(file.get(), "fileName", dir.path(name).c_str());
    return file;
  }

  // A listener of a listener.
  Handle follow(const Handle &object, const char *name, const char *className) {
    Handle next = get(name, className);
    EXPECT_EQ(QlxAddListener(object.get(), next.get()), 1);
    return next;
  }

  // A file's lines from behind the date on.
  std::string linesOf(const char *name) {
    std::string all;
    std::string text = dir.read(name);
    while (!text.empty()) {
      const std::string line = text.substr(0, text.find('\n') + 1);
      text.erase(0, line.size());
      all += line.substr(line.find(' ', line.find(' ') + 1) + 1);
    }
    return all;
  }

  TempDir dir;
};

TEST_F(EventSourceTest, IsThereForAHostsHandler) {
  attach("recording", RecordingHandler::kClass);
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
}

TEST_F(EventSourceTest, IsThereForAHostsLogger) {
  const Handle own = get("own", "test_logger");
  debug(own);
  EXPECT_EQ(gFound, std::string(kSource) + "/");
}

TEST_F(EventSourceTest, IsThereForAHostsFilterThatIsAsked) {
  attach("asking", "test_asking");
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
}

TEST_F(EventSourceTest, IsThereForAHostsFilterThatPassesOn) {
  const Handle filter = attach("passing", "test_passing");
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
}

TEST_F(EventSourceTest, IsThereBehindTheLibrarysOwnFilter) {
  const Handle filter = attach("filter", "qlx_levelfilter");
  const Handle recording = follow(filter, "recording", RecordingHandler::kClass);
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
}

TEST_F(EventSourceTest, IsThereForWhoeverFollowsAFile) {
  const Handle file = attachFile("a.log");
  const Handle recording = follow(file, "recording", RecordingHandler::kClass);
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\n");
}

TEST_F(EventSourceTest, IsInTheLineBeforeAndAfterSomebodyLooked) {
  const Handle before = attachFile("before.log");
  attach("recording", RecordingHandler::kClass);
  const Handle after = attachFile("after.log");
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
  EXPECT_EQ(linesOf("before.log"), "file.c function 7 text\n");
  EXPECT_EQ(linesOf("after.log"), "file.c function 7 text\n");
}

TEST_F(EventSourceTest, IsThereForAHostsFormatter) {
  const Handle file = attachFile("a.log");
  format(file, "own", "test_formatter");
  debug();  // with the header, before which it is settled
  gFound.clear();
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\nfile.c function 7 text\n");
}

// A copy of one of the library's records is a host's, whatever it says.
TEST_F(EventSourceTest, IsThereForAFormatterWhoseClassBeganAsACopy) {
  {
    const ApiLock lock;
    ObjClass *copy = qlxInitObjectClass("test_copy", Formatter, nullptr, nullptr, nullptr, nullptr);
    const char *name = copy->name;
    *copy = *qlxToolkitGetClassDef("qlx_xmlformatter");
    copy->name = name;
    copy->op1.fFormat = formatOwn;
    qlxToolkitAddClassDef("test_copy", copy);
  }
  const Handle file = attachFile("a.log");
  format(file, "copied", "test_copy");
  debug();
  EXPECT_EQ(gFound, std::string(kSource) + "/");
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\n");
}

TEST_F(EventSourceTest, IsInALineThatAHostsOperationBinds) {
  const Handle file = attachFile("a.log");
  format(file, "own", "test_binding");
  debug();
  debug();
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\nfile.c function 7 text\n");
}

TEST_F(EventSourceTest, IsInALineThatIsNotAscii) {
  const Handle file = attachFile("a.log");
  debug(logger, u"gr\u00fc\u00df");
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 gr\u00fc\u00df\n");
}

TEST_F(EventSourceTest, IsInTheLinesOfAFileThatProcessesShare) {
  const SemaphoreKey key;
  const Handle file = attachFile("a.log", "qlx_multiproc_filehandler");
  QlxSetObjProp(file.get(), "MPFileSemKey", key.text().c_str());
  debug();
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\n");
}

TEST_F(EventSourceTest, OutlivesALogCallThatAHeaderMakes) {
  const Handle file = attachFile("a.log");
  format(file, "heading", "test_heading");
  const Handle second = get("second", "qlx_basiclogger");
  const Handle other = get("b.log", "qlx_filehandler");
  QlxSetObjProp(other.get(), "fileName", dir.path("b.log").c_str());
  QlxAddListener(second.get(), other.get());
  gInHeader = [&] {
    qlxLogUDebugEntry(nullptr, second.get(), INFO, "inner.c", "inside", 1, u"inner", nullptr);
  };
  debug();
  EXPECT_EQ(linesOf("b.log"), "inner.c inside 1 inner\n");
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\n");
}

TEST_F(EventSourceTest, OutlivesTheCallersTexts) {
  // A host may have one place for the texts of all its calls, those of its operations too.
  std::string place = "file.c";
  const auto overwrite = [&] { place = "inner"; };
  const auto log = [&] {
    place = "file.c";
    QlxLogDebugMin(logger.get(), place.c_str(), nullptr, 7, u"text");
  };
  const Handle first = attachFile("first.log");
  format(first, "heading", "test_heading");
  const Handle second = attachFile("second.log");
  gInHeader = overwrite;
  log();
  EXPECT_EQ(linesOf("first.log") + linesOf("second.log"), "file.c 7 text\nfile.c 7 text\n");

  QlxSetObjPropInt(first.get(), "maxFileBytes", 1);
  log();  // opens again
  gInTrailer = overwrite;
  log();  // rolls over
  EXPECT_FALSE(gInTrailer);
  EXPECT_EQ(linesOf("first.log"), "file.c 7 text\n");
  EXPECT_EQ(linesOf("second.log"), "file.c 7 text\nfile.c 7 text\nfile.c 7 text\n");

  const Handle third = attachFile("third.log");
  format(first, "binding", "test_binding");
  QlxSetObjPropInt(first.get(), "maxFileBytes", 1000);
  log();  // all are open
  gInBind = overwrite;
  log();
  EXPECT_FALSE(gInBind);
  EXPECT_EQ(linesOf("third.log"), "file.c 7 text\nfile.c 7 text\n");
}

TEST_F(EventSourceTest, IsNotTakenForThatOfTheNextEvent) {
  const Handle file = attachFile("a.log");
  debug();
  QlxLogUText(logger.get(), u"plain");
  QlxLogInfo(logger.get(), nullptr, nullptr);
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\nplain\n\n");
}

TEST_F(EventSourceTest, IsNotThatOfAnEventOfAHosts) {
  const Handle file = attachFile("a.log");
  format(file, "heading", "test_heading");
  gInHeader = [] {
    // Made while the logged one is on its way.
    Event *own = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"own");
    look(own);
    QlxFreeEvent(own);
  };
  debug();
  EXPECT_EQ(gFound, "/");
  EXPECT_EQ(linesOf("a.log"), "file.c function 7 text\n");
}

TEST_F(EventSourceTest, MayLackAnyOfItsParts) {
  const Handle file = attachFile("a.log");
  QlxLogDebugMin(logger.get(), nullptr, "function", 7, u"no file");
  QlxLogDebugMin(logger.get(), "file.c", nullptr, -1, u"no function");
  QlxLogDebugMin(logger.get(), nullptr, nullptr, 7, u"neither");
  QlxLogDebugMin(logger.get(), "", "", 0, u"empty");
  const std::string lines =
      "function no file\nfile.c 18446744073709551615 no function\nneither\n  0 empty\n";
  EXPECT_EQ(linesOf("a.log"), lines);
  attach("recording", RecordingHandler::kClass);
  QlxLogDebugMin(logger.get(), nullptr, "function", 7, u"no file");
  QlxLogDebugMin(logger.get(), "file.c", nullptr, -1, u"no function");
  QlxLogDebugMin(logger.get(), nullptr, nullptr, 7, u"neither");
  QlxLogDebugMin(logger.get(), "", "", 0, u"empty");
  EXPECT_EQ(gFound,
            "qlx_prop_srcfunction=function|/qlx_prop_srcfile=file.c|qlx_prop_srcline=-1|//"
            "qlx_prop_srcfile=|qlx_prop_srcline=0|qlx_prop_srcfunction=|/");
  EXPECT_EQ(linesOf("a.log"), lines + lines);
}

}  // namespace
