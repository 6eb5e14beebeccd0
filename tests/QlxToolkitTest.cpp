#include "QlxToolkit.h"

#include <cerrno>

#include <qlx/class/containers.h>

#include "support/CaptureStdout.h"
#include "support/FailingMemory.h"
#include "support/FreshProcess.h"
#include "support/HostTest.h"
#include "support/PlainFormatter.h"
#include "support/Status.h"
#include "support/TempDir.h"

namespace {

// The toolkit is closed when a test begins, and closed after it.
class ToolkitLifeTest : public HostTest {
 protected:
  void SetUp() override {}

  static uint8_t open(const char *file = nullptr) { return QlxOpenToolkit(file, nullptr); }

  // An object by its name, without making one.
  static Handle find(const char *name) {
    const ApiLock lock;
    return Handle{qlxToolkitGetObjInstance(name)};
  }
  static uint32_t countOf(const char *name) {
    const Handle object = find(name);
    return object ? object->refCount - 1 : 0;
  }

  static QlxObject *toolkitLogger() {
    const ApiLock lock;
    return qlxToolkitLogger();
  }

  static ObjClass *findClass(const char *name) {
    const ApiLock lock;
    return qlxToolkitGetClassDef(name);
  }

  static std::string classNames(int32_t kind) {
    const ApiLock lock;
    std::string names;
    const StringGroupNode *it = qlxToolkitFetchClassnames(kind);
    for (; it; it = it->next) names += std::string(it->value) + "|";
    return names;
  }

  // Asks everything of a handle that a host can ask.
  static void expectInert(QlxObject *object) {
    uint8_t found = 7;
    EXPECT_EQ(QlxGetObjectName(object), nullptr);
    EXPECT_EQ(QlxGetObjectDesc(object), nullptr);
    EXPECT_EQ(QlxIsObjectEnabled(object), 0);
    QlxSetObjectEnabled(object, 1);
    EXPECT_EQ(QlxIsObjectEnabled(object), 0);
    EXPECT_EQ(QlxSetObjProp(object, "logging", "on"), 0);
    EXPECT_EQ(QlxSetObjPropBool(object, "key", 1), 0);
    QlxSetObjPropInt(object, "key", 1);
    QlxSetObjPropDouble(object, "key", 1);
    EXPECT_EQ(QlxGetObjProp(object, "key", &found), nullptr);
    EXPECT_EQ(found, 0);
    EXPECT_EQ(QlxGetObjPropInt(object, "key", nullptr), 0);
    EXPECT_EQ(QlxGetListeners(object), nullptr);
    EXPECT_EQ(QlxAddListener(object, object), 0);
    EXPECT_EQ(QlxRemListener(object, object), 0);
    EXPECT_EQ(QlxIsLoggable(object, FATAL), 0);
    EXPECT_EQ(QlxIsLoggable(object, UNSPECIFIED), 0);
    EXPECT_EQ(QlxLoggerGetFLog(object), nullptr);
    EXPECT_EQ(QlxLogUText(object, u"text"), (QlxLogResult{'-', 0, 0}));
    EXPECT_EQ(QlxLogInfo(object, "b", "k"), (QlxLogResult{'-', 0, 0}));
    EXPECT_EQ(QlxHandlerGetFormatter(object), nullptr);
    QlxHandlerSetFormatter(object, object);
    EXPECT_EQ(QlxHandlerGetFormatter(object), nullptr);
    EXPECT_EQ(QlxHandlerGetFmtHeader(object), nullptr);
    Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
    EXPECT_EQ(QlxIsLoggableByFilter(object, event, nullptr), 0);
    EXPECT_EQ(QlxUHandlerDoFmt(object, event, nullptr), nullptr);
    QlxFreeEvent(event);
    EXPECT_EQ(QlxAreObjectsEqual(object, object), 1);
    EXPECT_EQ(QlxAcquireObject(object), object);
    QlxReleaseObject(object);
    {
      const ApiLock lock;
      EXPECT_EQ(qlxFetchListenerGroup(object, 1), nullptr);
      EXPECT_EQ(qlxFetchObjPropMap(object), nullptr);
      qlxNotifyObjCfgChange(object, "logging");
      QlxBasicObjectFCfgChange(object, "logging");
      QlxBasicLoggerFCfgChange(object, "level");
      EXPECT_EQ(qlxIntlLogMgrApplyCfg(object, "never made"), 0);
      EXPECT_EQ(qlxIntlLogMgrHasCfg("never made"), 0);
    }
    EXPECT_EQ(object->objClass, nullptr);
    EXPECT_EQ(object->enabled, 0);
    EXPECT_EQ(object->kind1.word, 0u);
    EXPECT_EQ(object->kind2.word, 0u);
  }

  TempDir dir;
};

// ---- Opening

TEST_F(ToolkitLifeTest, OpensWithTheErrorLoggerItsConsoleAndTheFormatter) {
  ASSERT_EQ(open(), 1);
  const Handle logger = find("quill.errorLogger"), console = find("quill.defaultConsole"),
               formatter = find("quill.defaultFormatter");
  ASSERT_TRUE(logger && console && formatter);
  EXPECT_STREQ(logger->objClass->name, "qlx_basiclogger");
  EXPECT_STREQ(console->objClass->name, "qlx_consolehandler");
  EXPECT_STREQ(formatter->objClass->name, "qlx_basicformatter");
  EXPECT_EQ(listenersOf(logger), "quill.defaultConsole|");
  EXPECT_EQ(console->kind2.formatter, formatter.get());
  EXPECT_EQ(toolkitLogger(), logger.get());
}

TEST_F(ToolkitLifeTest, HoldsTheThreeByExactlyTheReferencesThatItNeeds) {
  open();
  EXPECT_EQ(countOf("quill.errorLogger"), 2u);       // registry, toolkit
  EXPECT_EQ(countOf("quill.defaultConsole"), 3u);    // and the logger's listeners
  EXPECT_EQ(countOf("quill.defaultFormatter"), 3u);  // and the console
}

TEST_F(ToolkitLifeTest, OpeningAgainDoesNothingAndIsNotCounted) {
  open();
  CxStatus status = {'x', 7};
  EXPECT_EQ(QlxOpenToolkit(dir.path("missing").c_str(), &status), 1);  // its file is not read
  EXPECT_EQ(status, (CxStatus{'x', 7}));
  EXPECT_EQ(countOf("quill.errorLogger"), 2u);
  EXPECT_NE(toolkitLogger(), nullptr);
  QlxCloseToolkit();
  EXPECT_EQ(toolkitLogger(), nullptr);
  EXPECT_EQ(find("quill.errorLogger"), nullptr);
}

TEST_F(ToolkitLifeTest, ReadsTheFileAndLeavesTheStatusAlone) {
  CxStatus status = {'x', 7};
  EXPECT_EQ(QlxOpenToolkit(dir.write("p", "quill.errorLogger.level=ERROR\n").c_str(), &status), 1);
  EXPECT_EQ(status, (CxStatus{'x', 7}));
  EXPECT_EQ(toolkitLogger()->kind1.level, ERROR);
}

TEST_F(ToolkitLifeTest, AFileThatCannotBeOpenedLeavesNothingBehind) {
  CxStatus status = {'x', 7};
  EXPECT_EQ(QlxOpenToolkit(dir.path("missing").c_str(), &status), 0);
  EXPECT_EQ(status, failure(ENOENT));
  EXPECT_EQ(toolkitLogger(), nullptr);
  EXPECT_EQ(findClass("qlx_basiclogger"), nullptr);
  for (int32_t kind = 101; kind <= 104; ++kind) EXPECT_EQ(classNames(kind), "");
  EXPECT_EQ(find("quill.errorLogger"), nullptr);
  EXPECT_EQ(QlxLogMgrGetCfg("a"), nullptr);
  EXPECT_EQ(open(), 1);
}

TEST_F(ToolkitLifeTest, ARefusedFileGivesSuccessAsItsStatus) {
  const std::string file = dir.write("p", "good.key=1\nbad\n");
  CxStatus status = {'x', 7};
  EXPECT_EQ(QlxOpenToolkit(file.c_str(), &status), 0);
  EXPECT_EQ(status, kSuccess);
  EXPECT_EQ(QlxLogMgrHasCfg("good"), 0);
}

TEST_F(ToolkitLifeTest, NeedsNoPlaceForTheStatus) {
  EXPECT_EQ(QlxOpenToolkit(dir.path("missing").c_str(), nullptr), 0);
}

TEST_F(ToolkitLifeTest, AFailedOpenAlsoEndsWhatAHostHadMadeBefore) {
  host.emplace();
  const Handle early = get("early", HostClasses::kHandler);
  EXPECT_EQ(QlxOpenToolkit(dir.path("missing").c_str(), nullptr), 0);
  EXPECT_EQ(host->takeCalls(), "alloc|close early|free|free null|");
  EXPECT_EQ(findClass(HostClasses::kHandler), nullptr);
  expectInert(early.get());
}

TEST_F(ToolkitLifeTest, AnErrorLoggerThatIsThereIsTakenAsItIs) {
  host.emplace();
  const Handle logger = get("quill.errorLogger", HostClasses::kLogger);
  open();
  EXPECT_EQ(toolkitLogger(), logger.get());
  EXPECT_EQ(listenersOf(logger), "");
  EXPECT_EQ(find("quill.defaultConsole"), nullptr);
  EXPECT_EQ(find("quill.defaultFormatter"), nullptr);
  EXPECT_EQ(logger->refCount, 3u);
}

TEST_F(ToolkitLifeTest, AConsoleThatIsThereIsAttachedAndKeepsItsFormatter) {
  host.emplace();
  const Handle console = get("quill.defaultConsole", HostClasses::kHandler);
  QlxHandlerSetFormatter(console.get(), nullptr);
  open();
  EXPECT_EQ(listenersOf(find("quill.errorLogger")), "quill.defaultConsole|");
  EXPECT_EQ(console->kind2.formatter, nullptr);
  EXPECT_EQ(find("quill.defaultFormatter"), nullptr);
}

TEST_F(ToolkitLifeTest, AFormatterThatIsThereBecomesTheNewConsolesWhateverItsClassIs) {
  host.emplace();
  const Handle formatter = get("quill.defaultFormatter", HostClasses::kFormatter);
  open();
  EXPECT_EQ(find("quill.defaultConsole")->kind2.formatter, formatter.get());
  EXPECT_EQ(formatter->refCount, 4u);
}

TEST_F(ToolkitLifeTest, TheNewConsoleGetsTheDefaultFormatterWhateverItsConfigurationNames) {
  open(
      dir.write("p", "quill.defaultConsole.formatterName=mine\nmine.className=qlx_basicformatter\n")
          .c_str());
  const Handle console = find("quill.defaultConsole"), formatter = find("quill.defaultFormatter");
  EXPECT_EQ(take(QlxGetObjProp(console.get(), "formatterName", nullptr)), "mine");
  EXPECT_EQ(console->kind2.formatter, formatter.get());
  EXPECT_EQ(find("mine"), nullptr);
}

TEST_F(ToolkitLifeTest, OpensAgainAsNewAfterAClose) {
  host.emplace();
  open();
  configure("a", "key", "value");
  QlxCloseToolkit();
  EXPECT_EQ(open(), 1);
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(findClass(HostClasses::kLogger), nullptr);
  EXPECT_NE(findClass("qlx_basiclogger"), nullptr);
  EXPECT_EQ(countOf("quill.defaultConsole"), 3u);
}

// ---- Classes

TEST_F(ToolkitLifeTest, RegistersTheBuiltInClassesInTheirOrder) {
  open();
  EXPECT_EQ(classNames(101), "qlx_basiclogger|qlx_pdlogger|");
  EXPECT_EQ(classNames(102), "qlx_levelfilter|qlx_msgidfilter|");
  EXPECT_EQ(classNames(103), "qlx_consolehandler|qlx_filehandler|qlx_multiproc_filehandler|");
  EXPECT_EQ(classNames(104), "qlx_basicformatter|qlx_xmlformatter|qlx_vextraceformatter|");
}

TEST_F(ToolkitLifeTest, ANumberThatIsNoKindHasNoClasses) {
  open();
  for (const int32_t kind : {105, 100, 0, -1, INT32_MAX, INT32_MIN}) {
    EXPECT_EQ(classNames(kind), "") << kind;
  }
}

TEST_F(ToolkitLifeTest, RegisteringAClassBeforeAnOpenRegistersTheBuiltInOnesFirst) {
  host.emplace();
  EXPECT_EQ(classNames(101), "qlx_basiclogger|qlx_pdlogger|test_hostlogger|");
  EXPECT_EQ(classNames(103),
            "qlx_consolehandler|qlx_filehandler|qlx_multiproc_filehandler|test_hosthandler|");
  const ObjClass *builtin = findClass("qlx_basiclogger"), *own = findClass("test_hostlogger");
  open();
  EXPECT_EQ(findClass("qlx_basiclogger"), builtin);
  EXPECT_EQ(findClass("test_hostlogger"), own);
  EXPECT_EQ(classNames(101), "qlx_basiclogger|qlx_pdlogger|test_hostlogger|");
}

TEST_F(ToolkitLifeTest, AHostsClassDoesNotTakeABuiltInNameEvenBeforeAnOpen) {
  QlxAddLoggerClass("qlx_basiclogger", nullptr, nullptr, nullptr, nullptr,
                    [](QlxObject *, Event *, va_list *) {});
  EXPECT_EQ(findClass("qlx_basiclogger")->op1.fLog, QlxBasicObjectFLog);
  EXPECT_NE(findClass("qlx_basiclogger")->fCfgChange, nullptr);
  EXPECT_EQ(classNames(101), "qlx_basiclogger|qlx_pdlogger|");
}

TEST_F(ToolkitLifeTest, ARecordOfAnotherKindIsFoundAndListedNowhere) {
  open();
  const ApiLock lock;
  ObjClass *record = qlxInitObjectClass("odd", 105, nullptr, nullptr, nullptr, nullptr);
  qlxToolkitAddClassDef("odd", record);
  EXPECT_EQ(qlxToolkitGetClassDef("odd"), record);
  for (int32_t kind = 101; kind <= 105; ++kind) {
    for (const StringGroupNode *it = qlxToolkitFetchClassnames(kind); it; it = it->next) {
      EXPECT_STRNE(it->value, "odd");
    }
  }
  qlxToolkitAddClassDef("odd", record);  // again: nothing
  qlxToolkitAddClassDef("none", nullptr);
  EXPECT_EQ(qlxToolkitGetClassDef("none"), nullptr);
}

TEST_F(ToolkitLifeTest, ASecondRecordOfANameIsFreed) {
  open();
  const ApiLock lock;
  ObjClass *first = qlxInitObjectClass("twice", Logger, nullptr, nullptr, nullptr, nullptr);
  ObjClass *second = qlxInitObjectClass("twice", Logger, nullptr, nullptr, nullptr, nullptr);
  qlxToolkitAddClassDef("twice", first);
  qlxToolkitAddClassDef("twice", second);
  EXPECT_EQ(qlxToolkitGetClassDef("twice"), first);
}

TEST_F(ToolkitLifeTest, InitialisingTheClassesAgainDoesNothing) {
  open();
  const ObjClass *builtin = findClass("qlx_basiclogger");
  const ApiLock lock;
  qlxToolkitInitObjClasses();
  EXPECT_EQ(qlxToolkitGetClassDef("qlx_basiclogger"), builtin);
}

// ---- Instances

TEST_F(ToolkitLifeTest, TheRegistryHoldsAndHandsOutReferences) {
  open();
  const Handle object = get("a", "qlx_basiclogger");
  EXPECT_EQ(object->refCount, 2u);
  const Handle again = find("a");
  EXPECT_EQ(again, object);
  EXPECT_EQ(object->refCount, 3u);
  const ApiLock lock;
  qlxToolkitAddObjInstance("alias", object.get());
  EXPECT_EQ(object->refCount, 4u);
  qlxToolkitRemObjInstance("alias");
  EXPECT_EQ(object->refCount, 3u);
  qlxToolkitRemObjInstance("alias");
  EXPECT_EQ(object->refCount, 3u);
}

TEST_F(ToolkitLifeTest, TheRegistryTakesNoNullAndKnowsNone) {
  open();
  const Handle object = get("a", "qlx_basiclogger");
  const ApiLock lock;
  qlxToolkitAddObjInstance(nullptr, object.get());
  qlxToolkitAddObjInstance("b", nullptr);
  qlxToolkitRemObjInstance(nullptr);
  EXPECT_EQ(object->refCount, 2u);
  EXPECT_EQ(qlxToolkitGetObjInstance(nullptr), nullptr);
  EXPECT_EQ(qlxToolkitGetObjInstance("b"), nullptr);
}

TEST_F(ToolkitLifeTest, ObjectsCanBeMadeBeforeAnOpen) {
  host.emplace();
  const Handle early = get("early", HostClasses::kHandler);
  ASSERT_NE(early, nullptr);
  EXPECT_EQ(QlxLogMgrApplyCfg(early.get(), "early"), 0);
  EXPECT_EQ(get("other"), nullptr);
  open();
  EXPECT_EQ(find("early"), early);
  EXPECT_EQ(QlxLogMgrApplyCfg(early.get(), "early"), 1);
  EXPECT_EQ(countOf("quill.defaultFormatter"), 4u);
}

TEST_F(ToolkitLifeTest, WithoutClassesNoObjectIsMade) {
  EXPECT_EQ(get("early", "qlx_basiclogger"), nullptr);
}

// ---- Closing

TEST_F(ToolkitLifeTest, ClosingWhatWasNeverOpenedIsSafe) {
  QlxCloseToolkit();
  QlxCloseToolkit();
  EXPECT_EQ(open(), 1);
}

TEST_F(ToolkitLifeTest, ClosingEndsWhatWasMadeWithoutAnOpen) {
  host.emplace();
  const Handle early = get("early", HostClasses::kHandler);
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(), "alloc|close early|free|free null|");
  EXPECT_EQ(findClass(HostClasses::kHandler), nullptr);
}

TEST_F(ToolkitLifeTest, ClosingClosesEveryHandlerOnceWhileAllOthersAreWhole) {
  host.emplace();
  open();
  const Handle formatter = get("formatter", HostClasses::kFormatter);
  std::vector<Handle> handlers;
  for (const char *name : {"a", "b"}) {
    handlers.push_back(get(name, HostClasses::kHandler));
    QlxHandlerSetFormatter(handlers.back().get(), formatter.get());
  }
  QlxAddListener(handlers[0].get(), handlers[1].get());
  host->onClose = [&](QlxObject *handler) {
    EXPECT_NE(handler->vars, nullptr);
    EXPECT_EQ(take(qlxIntlHandlerGetFmtTrailer(handler)), "whole");
    const ObjectRef other{qlxIntlGetObject("b", nullptr)};
    EXPECT_NE(other, nullptr);
    EXPECT_EQ(listenersOf(handlers[0]), "b|");
  };
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(),
            "close a|trailer formatter|close b|trailer formatter|free|free|free|"
            "free null|free null|free null|");
}

TEST_F(ToolkitLifeTest, ClosingWritesTrailers) {
  CaptureStdout out;
  open();
  {
    PlainFormatter plain;
    plain.header = "begin";
    plain.trailer = "end";
    const Handle formatter = get("plain", PlainFormatter::kClass);
    const Handle console = get("console", "qlx_consolehandler"),
                 logger = get("l", "qlx_basiclogger");
    QlxHandlerSetFormatter(console.get(), formatter.get());
    QlxAddListener(logger.get(), console.get());
    QlxLogUText(logger.get(), u"text");
    QlxCloseToolkit();
  }
  EXPECT_EQ(out.bytes(), "begin\ntext\n\nend\n");
}

TEST_F(ToolkitLifeTest, VariablesGoBeforeListenersAndListenersBeforeTheRegistry) {
  host.emplace();
  open();
  const Handle a = get("a", HostClasses::kHandler), b = get("b", HostClasses::kHandler);
  QlxAddListener(a.get(), b.get());
  QlxAddListener(b.get(), a.get());
  int whole = 0;
  host->onFree = [&](void *vars) {
    const ObjectRef found{qlxToolkitGetObjInstance("b")};
    EXPECT_EQ(found.get(), b.get());
    for (const Handle *handle : {&a, &b}) {
      EXPECT_EQ(listenersOf(*handle) == "", vars == nullptr);
    }
    whole += vars != nullptr;
  };
  QlxCloseToolkit();
  EXPECT_EQ(whole, 2);
}

TEST_F(ToolkitLifeTest, ObjectsThatHoldEachOtherAreFreed) {
  host.emplace();
  open();
  {
    const Handle a = get("a", HostClasses::kHandler), b = get("b", HostClasses::kHandler);
    QlxAddListener(a.get(), b.get());
    QlxAddListener(b.get(), a.get());
    QlxAddListener(a.get(), a.get());
  }
  EXPECT_TRUE(exists("a"));
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->count("close a"), 1);
  EXPECT_EQ(host->count("close b"), 1);
}

TEST_F(ToolkitLifeTest, ManyObjectsAreClosed) {
  host.emplace();
  open();
  std::vector<Handle> all;
  for (int i = 0; i < 300; ++i) {
    all.push_back(get(("h" + std::to_string(i)).c_str(), HostClasses::kHandler));
  }
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->count("free"), 300);
}

TEST_F(ToolkitLifeTest, FreesAllMemory) {
  open();  // what is made once for the process is made here
  QlxCloseToolkit();
  const FailingMemory memory;
  host.emplace();
  open(dir.write("p",
                 "a.className=qlx_levelfilter\na.listenerNames=b b.c\n"
                 "b.className=qlx_consolehandler\nb.c.formatterName=f\n"
                 "f.className=qlx_basicformatter\nf.separator=;\n")
           .c_str());
  get("a");
  QlxCloseToolkit();
  EXPECT_EQ(memory.live(), 0);
}

// ---- Classes' operations while the toolkit closes

TEST_F(ToolkitLifeTest, WhatAnOperationMakesMeanwhileIsClosedToo) {
  host.emplace();
  open();
  const Handle first = get("first", HostClasses::kHandler);
  Handle kept;
  host->onClose = [&](QlxObject *handler) {
    if (std::string(handler->name) != "first") return;
    kept.reset(qlxIntlGetObject("kept", HostClasses::kHandler));
    qlxIntlReleaseObject(qlxIntlGetObject("released", HostClasses::kHandler));
  };
  host->calls.clear();
  QlxCloseToolkit();
  for (const char *call : {"close first", "close kept", "close released"}) {
    EXPECT_EQ(host->count(call), 1) << call;
  }
  EXPECT_EQ(host->count("free"), 3);
}

TEST_F(ToolkitLifeTest, WhatFreeingVariablesMakesIsClosedBeforeItsOwnVariablesGo) {
  host.emplace();
  open();
  const Handle first = get("first", HostClasses::kLogger);
  Handle late;
  host->onFree = [&](void *vars) {
    if (vars && !late) late.reset(qlxIntlGetObject("late", HostClasses::kHandler));
  };
  host->onClose = [](QlxObject *handler) { EXPECT_NE(handler->vars, nullptr); };
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(), "free|alloc|close late|free|free null|free null|");
}

TEST_F(ToolkitLifeTest, WhatTheLastCallOfAClassMakesIsClosedToo) {
  host.emplace();
  open();
  const Handle first = get("first", HostClasses::kLogger);
  Handle late;
  host->onFree = [&](void *vars) {
    if (!vars && !late) late.reset(qlxIntlGetObject("late", HostClasses::kHandler));
  };
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(), "free|free null|alloc|close late|free|free null|");
}

TEST_F(ToolkitLifeTest, AnOperationMayMakeAnObjectThatListensToItself) {
  host.emplace();
  open();
  const Handle first = get("first", HostClasses::kHandler);
  host->onClose = [](QlxObject *handler) {
    if (std::string(handler->name) != "first") return;
    const ObjectRef own{qlxIntlGetObject("own", HostClasses::kHandler)};
    qlxIntlAddListener(own.get(), own.get());
  };
  QlxCloseToolkit();
  EXPECT_EQ(host->count("close own"), 1);
}

TEST_F(ToolkitLifeTest, AnOperationMayReleaseWhatItsVariablesHold) {
  host.emplace();
  open();
  QlxObject *held = get("held", HostClasses::kLogger).release();
  const Handle holder = get("holder", HostClasses::kLogger);
  host->onFree = [&](void *vars) {
    if (!vars || !held) return;
    qlxIntlReleaseObject(std::exchange(held, nullptr));
  };
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(), "free|free|free null|free null|");
}

TEST_F(ToolkitLifeTest, AnOperationMayTakeNamesFromTheRegistry) {
  host.emplace();
  open();
  const Handle logger = get("l", HostClasses::kLogger);
  for (const char *name : {"a", "b", "c", "d", "e"}) {
    const Handle object = get(name, HostClasses::kHandler);
    QlxAddListener(logger.get(), object.get());  // which alone holds it then
  }
  host->onClose = [](QlxObject *handler) {
    if (std::string(handler->name) != "c") return;
    for (const char *name : {"b", "c", "d", "nobody"}) qlxToolkitRemObjInstance(name);
  };
  host->calls.clear();
  QlxCloseToolkit();
  for (const char *call : {"close a", "close b", "close c", "close d", "close e"}) {
    EXPECT_EQ(host->count(call), 1) << call;
  }
}

TEST_F(ToolkitLifeTest, AnOperationMayTakeItsOwnObjectFromTheRegistry) {
  host.emplace();
  open();
  const Handle first = get("first", HostClasses::kHandler);
  host->onClose = [](QlxObject *handler) {
    if (std::string(handler->name) == "first") {
      const ObjectRef own{qlxIntlGetObject("own", HostClasses::kHandler)};
    } else {
      qlxToolkitRemObjInstance("own");  // what alone holds it
      EXPECT_STREQ(handler->name, "own");
    }
  };
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(), "close first|alloc|close own|free|free|free null|");
}

TEST_F(ToolkitLifeTest, AnOperationMayChangeListenersAndPropertiesOfAnything) {
  host.emplace();
  open();
  const Handle a = get("a", HostClasses::kHandler), b = get("b", HostClasses::kHandler);
  const auto change = [&] {
    for (QlxObject *object : {a.get(), b.get()}) {
      qlxIntlSetObjProp(object, "key", "value");
      qlxIntlSetObjProp(object, "listenerNames", "a b");
      qlxIntlAddListener(object, b.get());
      qlxIntlAddListener(object, object);
      qlxIntlHandlerSetFormatter(object, nullptr);
      OslMemoryFree(qlxIntlGetObjProp(object, "key", nullptr));
    }
    const ObjectRef found{qlxIntlGetObject("a", nullptr)};
    qlxIntlSetObjProp(found.get(), "key", "other");
  };
  host->onClose = [&](QlxObject *) { change(); };
  host->onFree = [&](void *) { change(); };
  QlxCloseToolkit();
  expectInert(a.get());
  expectInert(b.get());
}

TEST_F(ToolkitLifeTest, AnOperationMayReportThroughTheToolkitLogger) {
  host.emplace();
  open();
  const Handle a = get("a", HostClasses::kHandler);
  const auto report = [] {
    QlxLogResult result;
    qlxIntlLogVA(&result, DEBUG_MIN, nullptr, "key");
  };
  QlxSetObjProp(find("quill.errorLogger").get(), "listenerNames", "a");
  host->onClose = [&](QlxObject *) { report(); };
  host->onFree = [&](void *) { report(); };
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->count("close a"), 1);
  EXPECT_GE(host->count("process a"), 1);
}

TEST_F(ToolkitLifeTest, AnInertHandleMayBeRegisteredAgainByAnOperation) {
  host.emplace();
  open();
  const Handle old = get("old", HostClasses::kLogger);
  QlxCloseToolkit();
  host.emplace();
  open();
  const Handle taken = get("taken", HostClasses::kLogger);
  {
    const ApiLock lock;
    qlxToolkitRemObjInstance("taken");
    EXPECT_EQ(taken->objClass, nullptr);
    qlxToolkitAddObjInstance("taken", taken.get());
    qlxToolkitAddObjInstance("old", old.get());
  }
  EXPECT_EQ(get("old", HostClasses::kLogger), nullptr);
  QlxCloseToolkit();
  EXPECT_EQ(old->refCount, 1u);
  EXPECT_EQ(taken->refCount, 1u);
}

TEST_F(ToolkitLifeTest, AnObjectWithTwoNamesIsTakenApartOnce) {
  host.emplace();
  open();
  const Handle object = get("a", HostClasses::kHandler);
  {
    const ApiLock lock;
    qlxToolkitAddObjInstance("alias", object.get());
  }
  host->calls.clear();
  QlxCloseToolkit();
  EXPECT_EQ(host->takeCalls(), "close a|free|free null|");
  EXPECT_EQ(object->refCount, 1u);
}

// ---- Inert handles

TEST_F(ToolkitLifeTest, AHeldHandleIsInertAfterACloseAndAfterANewOpen) {
  open();
  std::vector<Handle> handles;
  for (const char *name :
       {"qlx_basiclogger", "qlx_levelfilter", "qlx_consolehandler", "qlx_basicformatter"}) {
    handles.push_back(get(name, name));
    QlxSetObjProp(handles.back().get(), "key", "value");
  }
  QlxAddListener(handles[0].get(), handles[2].get());
  QlxCloseToolkit();
  for (const Handle &handle : handles) expectInert(handle.get());
  open();
  for (const Handle &handle : handles) expectInert(handle.get());
  const Handle anew = get("qlx_basiclogger", "qlx_basiclogger");
  EXPECT_NE(anew, handles[0]);
  EXPECT_EQ(QlxAddListener(anew.get(), handles[2].get()), 0);
  EXPECT_EQ(QlxRemListener(anew.get(), handles[2].get()), 0);
  const Handle console = find("quill.defaultConsole"), formatter = find("quill.defaultFormatter");
  QlxHandlerSetFormatter(console.get(), handles[3].get());
  EXPECT_EQ(console->kind2.formatter, formatter.get());
}

TEST_F(ToolkitLifeTest, TheHeaderGoesWithTheHostsLastRelease) {
  open();
  QlxCloseToolkit();
  const FailingMemory memory;
  open();
  Handle handle = get("a", "qlx_basiclogger");
  Handle second{QlxAcquireObject(handle.get())};
  QlxCloseToolkit();
  EXPECT_EQ(memory.live(), 1);
  EXPECT_EQ(handle->refCount, 2u);
  handle.reset();
  EXPECT_EQ(memory.live(), 1);
  second.reset();
  EXPECT_EQ(memory.live(), 0);
}

// ---- The end of a process

QlxObject *gLogger;
HostClasses *gHost;

void logAtExit() {
  QlxLogUText(gLogger, u"text");
  if (gHost->count("log l") != 1) _exit(1);
}
void logAtExitClosed() {
  QlxLogUText(gLogger, u"text");
  if (gHost->count("log l") != 0) _exit(1);
  QlxReleaseObject(gLogger);
  QlxCloseToolkit();
}

struct LogsWhenItGoes {
  ~LogsWhenItGoes() { logAtExit(); }
};

TEST(ToolkitExitTest, AnAtexitHandlerMayLogWhileTheToolkitIsOpen) {
  inFreshProcess([] {
    QlxOpenToolkit(nullptr, nullptr);
    gHost = new HostClasses;
    gLogger = QlxGetObject("l", HostClasses::kLogger);
    std::atexit(logAtExit);
  });
}

TEST(ToolkitExitTest, AnAtexitHandlerMayUseAHandleAfterTheToolkitWasClosed) {
  inFreshProcess([] {
    std::atexit(logAtExitClosed);
    QlxOpenToolkit(nullptr, nullptr);
    gHost = new HostClasses;
    gLogger = QlxGetObject("l", HostClasses::kLogger);
    QlxCloseToolkit();
  });
}

TEST(ToolkitExitTest, AStaticDestructorMayLog) {
  inFreshProcess([] {
    static const LogsWhenItGoes logs;
    QlxOpenToolkit(nullptr, nullptr);
    gHost = new HostClasses;
    gLogger = QlxGetObject("l", HostClasses::kLogger);
  });
}

// ---- Without memory

// With each of its allocations failing in turn, and then all from there on.
TEST_F(ToolkitLifeTest, OpensOrFailsAndClosesWhenMemoryRanOut) {
  const std::string file = dir.write("p", "a.className=qlx_levelfilter\n");
  const Handle warm = get("warm", "qlx_basiclogger");  // makes the lock
  for (const char *path : {static_cast<const char *>(nullptr), file.c_str()}) {
    for (const bool all : {false, true}) {
      uint64_t failures = 1;
      for (uint64_t n = 1; failures > 0; ++n) {
        FailingMemory memory;
        all ? memory.failFrom(n) : memory.failOnce(n);
        CxStatus status = {'x', 7};
        const uint8_t opened = QlxOpenToolkit(path, &status);
        failures = memory.failures();
        EXPECT_EQ(opened || path, 1);  // without a file nothing makes it fail
        EXPECT_EQ(toolkitLogger() != nullptr, opened && find("quill.errorLogger"));
        if (!opened) {
          EXPECT_EQ(find("quill.errorLogger"), nullptr);
        }
        QlxCloseToolkit();
        EXPECT_EQ(memory.live(), 0) << n;
      }
    }
  }
}

}  // namespace
