#include "support/ToolkitLifeTest.h"

#include <cerrno>

#include "support/BuiltInClasses.h"
#include "support/FailingMemory.h"
#include "support/InertHandle.h"
#include "support/Status.h"

namespace {

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
  for (int32_t kind = 101; kind <= 104; ++kind) {
    EXPECT_NE(classNames(kind), "");
    EXPECT_EQ(classNames(kind), builtInNames(kind));
  }
}

TEST_F(ToolkitLifeTest, ANumberThatIsNoKindHasNoClasses) {
  open();
  for (const int32_t kind : {105, 100, 0, -1, INT32_MAX, INT32_MIN}) {
    EXPECT_EQ(classNames(kind), "") << kind;
  }
}

TEST_F(ToolkitLifeTest, RegisteringAClassBeforeAnOpenRegistersTheBuiltInOnesFirst) {
  host.emplace();
  EXPECT_EQ(classNames(101), builtInNames(101) + "test_hostlogger|");
  EXPECT_EQ(classNames(103), builtInNames(103) + "test_hosthandler|");
  const ObjClass *builtin = findClass("qlx_basiclogger"), *own = findClass("test_hostlogger");
  open();
  EXPECT_EQ(findClass("qlx_basiclogger"), builtin);
  EXPECT_EQ(findClass("test_hostlogger"), own);
  EXPECT_EQ(classNames(101), builtInNames(101) + "test_hostlogger|");
}

TEST_F(ToolkitLifeTest, AHostsClassDoesNotTakeABuiltInNameEvenBeforeAnOpen) {
  QlxAddLoggerClass("qlx_basiclogger", nullptr, nullptr, nullptr, nullptr,
                    [](QlxObject *, Event *, va_list *) {});
  EXPECT_EQ(findClass("qlx_basiclogger")->op1.fLog, QlxBasicObjectFLog);
  EXPECT_NE(findClass("qlx_basiclogger")->fCfgChange, nullptr);
  EXPECT_EQ(classNames(101), builtInNames(101));
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

TEST_F(ToolkitLifeTest, ARecordIsRegisteredUnderTheGivenName) {
  open();
  {
    const ApiLock lock;
    ObjClass *record = qlxInitObjectClass("own", Logger, nullptr, nullptr, nullptr, nullptr);
    qlxToolkitAddClassDef("other", record);
    EXPECT_EQ(qlxToolkitGetClassDef("other"), record);
    EXPECT_EQ(qlxToolkitGetClassDef("own"), nullptr);
  }
  EXPECT_EQ(classNames(101), builtInNames(101) + "other|");
}

// Deliberate: an existing object is compared with what its class calls itself.
TEST_F(ToolkitLifeTest, AnObjectIsMadeByAnyNameOfItsClassAndFoundByItsOwn) {
  open();
  const ApiLock lock;
  ObjClass *record = qlxInitObjectClass("own", Logger, nullptr, nullptr, nullptr, nullptr);
  qlxToolkitAddClassDef("other", record);
  const ObjectRef object{qlxIntlGetObject("object", "other")};
  ASSERT_NE(object, nullptr);
  EXPECT_EQ(qlxIntlGetObject("object", "other"), nullptr);
  const ObjectRef again{qlxIntlGetObject("object", "own")};
  EXPECT_EQ(again, object);
}

TEST_F(ToolkitLifeTest, ARecordOfSeveralNamesIsFreedOnce) {
  open();
  const FailingMemory memory;
  {
    const ApiLock lock;
    ObjClass *record = qlxInitObjectClass("own", Logger, nullptr, nullptr, nullptr, nullptr);
    for (const char *name : {"own", "second", "own", "second"}) qlxToolkitAddClassDef(name, record);
    qlxToolkitAddClassDef("qlx_pdlogger", record);  // taken: the record is the registry's already
    qlxToolkitAddClassDef(nullptr, record);
    EXPECT_EQ(qlxToolkitGetClassDef("own"), record);
    EXPECT_EQ(qlxToolkitGetClassDef("second"), record);
    EXPECT_NE(qlxToolkitGetClassDef("qlx_pdlogger"), record);
  }
  EXPECT_EQ(classNames(101), builtInNames(101) + "own|second|");
  const int64_t held = memory.live();
  EXPECT_GT(held, 0);
  QlxCloseToolkit();
  EXPECT_LE(memory.live(), 0);
}

TEST_F(ToolkitLifeTest, ARecordThatIsNotRegisteredIsFreed) {
  open();
  const ApiLock lock;
  const FailingMemory memory;
  for (const char *name : {"qlx_basiclogger", static_cast<const char *>(nullptr)}) {
    ObjClass *record = qlxInitObjectClass("own", Logger, nullptr, nullptr, nullptr, nullptr);
    qlxToolkitAddClassDef(name, record);
    EXPECT_EQ(memory.live(), 0);
  }
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
