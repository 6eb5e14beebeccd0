// Every allocation of a host's life fails once, alone and with all after it: opening with a file,
// making objects, logging to the console and to rolling files, changing settings at run time,
// closing. No crash, no leak, results that say no more than happened, and a library that works
// again afterwards.
#include <gtest/gtest.h>

#include <algorithm>
#include <iostream>
#include <memory>
#include <string>

#include <qlx/class.h>
#include <qlx/qlx.h>

#include "support/CaptureStdout.h"
#include "support/EveryFailure.h"
#include "support/FailureResult.h"
#include "support/Handle.h"
#include "support/ResourceBundles.h"
#include "support/Status.h"
#include "support/TempDir.h"
#include "support/WorkingDir.h"

namespace {

class ToolkitAllocationFailureTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(bundles_.add("root", R"(
      copied { "Copied {1,number,integer} files from {0}, {2,number,percent} done" }
      long { ")" + std::string(2000, 'x') +
                                         R"(" }
    )"));
    dir_.write("app.properties", R"(
app.className = qlx_basiclogger
app.level = ALL
app.listenerNames = filter console
filter.className = qlx_levelfilter
filter.level = DEBUG_MID
filter.listenerNames = file
file.className = qlx_filehandler
file.maxFileBytes = 4000
file.formatterName = text
console.className = qlx_consolehandler
console.formatterName = text
text.className = qlx_basicformatter
text.dateTimeFormat = yyyy-MM-dd
text.locale = de
file.fileName = )" + dir_.path("logs/app.log"));
  }

  std::string config() const { return dir_.path("app.properties"); }

  // One call of each kind: a message with parameters, a long one, texts with and without a source.
  void logAll(const Tries &tries, QlxObject *logger) const {
    const std::string name = bundles_.path();
    expectResult(tries, QlxLogInfo(logger, name.c_str(), "copied", u"home", 7, 0.5));
    expectResult(tries, QlxLogError(logger, name.c_str(), "long"));
    expectResult(tries, QlxLogUText(logger, u"a text for {0}", u"everybody"));
    expectResult(tries, QlxLogDebugMid(logger, "main.c", "main", 42, u"it''s {0}", u"me"));
    expectResult(tries, QlxLogDebugMax(logger, "main.c", nullptr, 43, u"not for the file"));
  }

  // After a failure: open, log, close, and the line is in the file.
  void expectWorking() const {
    std::filesystem::remove(dir_.path("logs/app.log"));
    ASSERT_EQ(QlxOpenToolkit(config().c_str(), nullptr), 1);
    {
      const Handle logger{QlxGetObject("app", nullptr)};
      const Handle formatter{QlxGetObject("text", nullptr)};
      ASSERT_NE(logger, nullptr);
      ASSERT_EQ(QlxSetObjProp(formatter.get(), "dateTimeFormat", "'-'"), 1);
      const QlxLogResult result =
          QlxLogInfo(logger.get(), bundles_.path().c_str(), "copied", u"home", 7, 0.5);
      EXPECT_EQ(result.statusKind, '-');
      EXPECT_EQ(result.msgStatus, 0);
    }
    QlxCloseToolkit();
    ASSERT_EQ(dir_.read("logs/app.log"), "- Copied 7 files from home, 50\u00a0% done\n");
  }

  template <typename Scenario>
  void withEveryFailureOf(Scenario scenario) {
    const WorkingDir working(dir_.path());  // for what lost its file's name
    CaptureStdout console;
    withEveryFailure(scenario, [this] { expectWorking(); });
    const std::string printed = console.bytes();
    if (HasFailure()) std::cerr << printed.substr(std::min(printed.find("tests/"), printed.size()));
    // A handler whose configuration could not be read has the name that a new one has.
    std::filesystem::remove(dir_.path("default.log"));
    EXPECT_EQ(dir_.list(), (std::vector<std::string>{"app.properties", "logs"}));
  }

  const TempDir dir_;
  const ResourceBundles bundles_;
};

TEST_F(ToolkitAllocationFailureTest, OpensWithAFileOrStaysClosed) {
  withEveryFailureOf([this](Tries &tries) {
    CxStatus status = failure(7);
    const uint8_t opened = tries.mayFail(QlxOpenToolkit(config().c_str(), &status));
    EXPECT_EQ(status, opened ? failure(7) : kSuccess);
    if (!opened) {
      EXPECT_EQ(qlxToolkitLogger(), nullptr);
      EXPECT_EQ(QlxLogMgrConfigNames(), nullptr);
      EXPECT_EQ(QlxGetLoggerClasses(), nullptr);
    }
    tries.mayFail(QlxOpenToolkit(nullptr, nullptr));
    QlxCloseToolkit();
  });
}

TEST_F(ToolkitAllocationFailureTest, OpensWithoutAFile) {
  withEveryFailureOf([](Tries &tries) {
    EXPECT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);  // not even a missing logger is a failure
    const Handle logger{tries.mayFail(QlxGetObject("quill.errorLogger", nullptr))};
    expectResult(tries, QlxLogUText(logger.get(), u"text"));
    QlxCloseToolkit();
    expectResult(tries, QlxLogUText(logger.get(), u"text"));
  });
}

TEST_F(ToolkitAllocationFailureTest, LogsWhatItCan) {
  withEveryFailureOf([this](Tries &tries) {
    QlxOpenToolkit(config().c_str(), nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("app", nullptr))};
      logAll(tries, logger.get());
      logAll(tries, logger.get());  // with what is held now, and over a roll
    }
    QlxCloseToolkit();
  });
}

TEST_F(ToolkitAllocationFailureTest, ChangesSettingsWhileItLogs) {
  withEveryFailureOf([this](Tries &tries) {
    QlxOpenToolkit(config().c_str(), nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("app", nullptr))};
      const Handle file{tries.mayFail(QlxGetObject("file", nullptr))};
      const Handle formatter{tries.mayFail(QlxGetObject("text", nullptr))};
      const std::string other = dir_.path("logs/other1.log");
      const struct {
        QlxObject *object;
        const char *key, *value;
      } changes[] = {
          {file.get(), "filePermission", "600"},
          {file.get(), "fileEncoding", "UTF-8"},
          {file.get(), "formatterName", "quill.defaultFormatter"},
          {file.get(), "formatterName", "text"},
          {formatter.get(), "separator", " | "},
          {formatter.get(), "dateTimeFormat", "HH:mm:ss.SSS"},
          {formatter.get(), "locale", "ja"},
          {logger.get(), "listenerNames", "file console filter app"},
          {logger.get(), "level", "INFO"},
          {logger.get(), "logging", "off"},
          {logger.get(), "logging", "on"},
          {logger.get(), "listenerNames", "filter"},
          {file.get(), "fileName", other.c_str()},
          {file.get(), "maxFiles", "2"},
          {file.get(), "appending", "false"},
      };
      for (const auto &change : changes) {
        tries.mayFail(QlxSetObjProp(change.object, change.key, change.value));
        expectResult(tries, QlxLogUText(logger.get(), u"after a change"));
      }
      QlxSetObjPropInt(file.get(), "maxFileBytes", 100);
      tries.mayFail(QlxSetObjPropBool(file.get(), "appending", 1));
      logAll(tries, logger.get());
    }
    QlxCloseToolkit();
  });
}

TEST_F(ToolkitAllocationFailureTest, AddsAndRemovesListeners) {
  withEveryFailureOf([](Tries &tries) {
    QlxOpenToolkit(nullptr, nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("log", "qlx_basiclogger"))};
      QlxObject *many[20];
      for (int i = 0; i < 20; ++i) {  // more than a log call has room for without memory
        many[i] =
            tries.mayFail(QlxGetObject(("filter" + std::to_string(i)).c_str(), "qlx_levelfilter"));
        tries.mayFail(QlxAddListener(logger.get(), many[i]));
      }
      expectResult(tries, QlxLogUText(logger.get(), u"text"));
      for (QlxObject *object : many) {
        tries.mayFail(QlxRemListener(logger.get(), object));
        QlxReleaseObject(object);
      }
      EXPECT_EQ(QlxGetListeners(logger.get()), nullptr);
    }
    QlxCloseToolkit();
  });
}

TEST_F(ToolkitAllocationFailureTest, ChangesConfigurations) {
  withEveryFailureOf([this](Tries &tries) {
    QlxOpenToolkit(config().c_str(), nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("app", nullptr))};
      const CfgHandle top{tries.mayFail(QlxLogMgrGetCfg("x"))};
      const CfgHandle leaf{tries.mayFail(QlxLogMgrGetCfg("x.y.z"))};
      const CfgHandle middle{tries.mayFail(QlxAllocObjCfg("x.y"))};
      tries.mayFail(QlxSetObjCfgProp(top.get(), "level", "WARN"));
      tries.mayFail(QlxSetObjCfgProp(middle.get(), "className", "qlx_basiclogger"));
      QlxLogMgrAddCfg(middle.get());
      QlxObjCfgAddChild(middle.get(), leaf.get());
      QlxObjCfgRemChild(top.get(), leaf.get());
      QlxLogMgrUpdateCfg(leaf.get());
      uint8_t found = 7;
      OslMemoryFree(tries.mayFail(QlxGetObjCfgProp(leaf.get(), "level", &found)));
      const CfgHandle parent{tries.mayFail(QlxObjCfgGetParent(leaf.get()))};
      const Handle made{tries.mayFail(QlxGetObject("x.y.z", nullptr))};
      tries.mayFail(QlxLogMgrApplyCfg(logger.get(), "x.y.z"));
      expectResult(tries, QlxLogError(made.get(), bundles_.path().c_str(), "long"));
      QlxLogMgrRemCfg(middle.get());
      EXPECT_EQ(QlxLogMgrHasCfg("x.y"), 0);
    }
    QlxCloseToolkit();
  });
}

// ---- A host's own classes

void *allocVars() {
  return OslMemoryMalloc(1);
}

void freeVars(void *vars) {
  OslMemoryFree(vars);
}

char *header(QlxObject *) {
  return OslStringDup("begin");
}

char *trailer(QlxObject *) {
  return OslStringDup("end");
}

void expectWholeClasses(const I18Msg *description) {
  for (const char *name : {"my_logger", "my_filter", "my_handler", "my_formatter"}) {
    const ObjClass *made = qlxToolkitGetClassDef(name);
    if (!made) continue;
    EXPECT_STREQ(made->name, name);
    EXPECT_EQ(made->description != nullptr, description != nullptr);
  }
}

TEST_F(ToolkitAllocationFailureTest, RegistersAHostsClasses) {
  withEveryFailureOf([this](Tries &tries) {
    I18Msg *text = tries.mayFail(QlxAllocUI18Msg(nullptr, nullptr, u"described"));
    QlxAddLoggerClass("my_logger", text, allocVars, freeVars, nullptr, nullptr);
    QlxAddFilterClass("my_filter", text, allocVars, freeVars, nullptr, nullptr, nullptr, nullptr);
    QlxAddHandlerClass("my_handler", text, QlxFileHandlerFAllocVars, QlxFileHandlerFFreeVars,
                       QlxFileHandlerFCfgChange, QlxFileUHandlerFProcess, QlxFileHandlerFOpen,
                       QlxFileHandlerFClose);
    QlxAddUFormatterClass("my_formatter", text, nullptr, nullptr, nullptr, nullptr, header, trailer,
                          nullptr);
    expectWholeClasses(text);
    QlxFreeI18Msg(text);
    QlxOpenToolkit(config().c_str(), nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("mylogger", "my_logger"))};
      const Handle filter{tries.mayFail(QlxGetObject("myfilter", "my_filter"))};
      const Handle handler{tries.mayFail(QlxGetObject("myhandler", "my_handler"))};
      const Handle formatter{tries.mayFail(QlxGetObject("myformatter", "my_formatter"))};
      OslMemoryFree(tries.mayFail(QlxGetObjectName(logger.get())));
      OslMemoryFree(tries.mayFail(QlxGetObjectDesc(logger.get())));
      const std::string path = dir_.path("logs/own.log");
      // A file's name that is not stored leaves the handler without a file.
      QlxSetObjProp(handler.get(), "fileName", path.c_str());
      QlxHandlerSetFormatter(handler.get(), formatter.get());
      OslMemoryFree(tries.mayFail(QlxHandlerGetFmtHeader(handler.get())));
      tries.mayFail(QlxAddListener(logger.get(), filter.get()));
      tries.mayFail(QlxAddListener(filter.get(), handler.get()));
      logAll(tries, logger.get());
    }
    QlxCloseToolkit();
  });
}

// ---- The API lock

// In a process of its own, where nothing has made the lock yet.
TEST(ApiLockAllocationFailureTest, WithoutItsLockTheLibraryDoesNothing) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const auto checkAll = [] {
    FailingMemory memory;
    memory.failFrom(1);
    CxStatus status = failure(7);
    bool good = QlxOpenToolkit(nullptr, &status) == 0 && status == failure(7);
    QlxCloseToolkit();
    good = good && !QlxGetObject("log", "qlx_basiclogger") && !QlxAllocStringGroup() &&
           !QlxLogMgrGetCfg("a") && qlxAPIMutexLock() == 0;
    qlxAPIMutexUnlock();
    good = good && memory.live() == 0;
    memory.failNone();
    good = good && QlxOpenToolkit(nullptr, nullptr) == 1;
    QlxCloseToolkit();
    return good;
  };
  EXPECT_EXIT(std::_Exit(checkAll() ? 0 : 1), ::testing::ExitedWithCode(0), "");
}

}  // namespace
