#include "object/QlxObjClass.h"

#include <qlx/memory.h>

#include "object/QlxLocked.h"
#include "support/BuiltInClasses.h"
#include "support/FailingMemory.h"
#include "support/ToolkitTest.h"

namespace {

class ObjClassTest : public ToolkitTest {
 protected:
  static ObjClass *find(const char *name) {
    const ApiLock lock;
    return qlxToolkitGetClassDef(name);
  }

  // The names of a kind's classes, in order, each with "|" behind it.
  static std::string joined(const StringGroupNode *it) {
    std::string names;
    for (; it; it = it->next) names += std::string(it->value) + "|";
    return names;
  }

  static ObjClass *init(const char *name, I18Msg *description = nullptr) {
    const ApiLock lock;
    return qlxInitObjectClass(name, Filter, description, allocVars, freeVars, cfgChange);
  }

  static void discard(ObjClass *objClass) {
    const ApiLock lock;
    qlxFreeObjClass(objClass);
  }

  // Operations to tell apart.
  static void *allocVars(void) { return nullptr; }
  static void freeVars(void *) {}
  static void cfgChange(QlxObject *, const char *) {}
  static void process(QlxObject *, Event *, va_list *) {}
  static void log(QlxObject *, Event *, va_list *) {}
  static uint8_t isLoggable(QlxObject *, Event *, va_list *) { return 1; }
  static void open(QlxObject *) {}
  static void close(QlxObject *) {}
  static UChar *format(QlxObject *, Event *, va_list *) { return nullptr; }
  static char *header(QlxObject *) { return nullptr; }
  static char *trailer(QlxObject *) { return nullptr; }
  static UChar *bind(I18Msg *, va_list *) { return nullptr; }
};

// ---- The record

TEST_F(ObjClassTest, IsMadeWithTheCommonOperationsAndNoOther) {
  char name[] = "new";
  ObjClass *made = init(name);
  name[0] = 'x';
  ASSERT_NE(made, nullptr);
  EXPECT_STREQ(made->name, "new");
  EXPECT_EQ(made->kind, Filter);
  EXPECT_EQ(made->description, nullptr);
  EXPECT_EQ(made->fAllocVars, allocVars);
  EXPECT_EQ(made->fFreeVars, freeVars);
  EXPECT_EQ(made->fCfgChange, cfgChange);
  EXPECT_EQ(made->op1.fProcess, nullptr);
  EXPECT_EQ(made->op2.fIsLoggable, nullptr);
  EXPECT_EQ(made->op3.fLog, nullptr);
  EXPECT_EQ(made->op4.fBindMsg, nullptr);
  EXPECT_EQ(find("new"), nullptr);
  discard(made);
}

TEST_F(ObjClassTest, HasACopyOfItsDescription) {
  I18Msg *description = QlxAllocUI18Msg("bundle", "key", nullptr);
  ObjClass *made = init("new", description);
  QlxFreeI18Msg(description);
  ASSERT_NE(made, nullptr);
  EXPECT_NE(made->description, description);
  EXPECT_STREQ(made->description->bundle, "bundle");
  EXPECT_STREQ(made->description->key, "key");
  discard(made);
}

TEST_F(ObjClassTest, IsNotMadeWithoutANameOrWithAKnownOne) {
  EXPECT_EQ(init(nullptr), nullptr);
  EXPECT_EQ(init("qlx_basiclogger"), nullptr);
}

TEST_F(ObjClassTest, IsNotMadeWhenMemoryRanOut) {
  I18Msg *description = QlxAllocUI18Msg("bundle", "key", nullptr);
  FailingMemory memory;
  uint64_t failures = 1;
  for (uint64_t n = 1; failures > 0; ++n) {
    memory.failOnce(n);
    ObjClass *made = init("new", description);
    failures = memory.failures();
    EXPECT_EQ(made == nullptr, failures > 0);
    discard(made);
  }
  EXPECT_EQ(memory.live(), 0);
  QlxFreeI18Msg(description);
}

TEST_F(ObjClassTest, TheMapsTwoOperationsOnRecordsAreTrivial) {
  ObjClass record = {};
  EXPECT_EQ(qlxReturnObjClass(&record), &record);
  EXPECT_EQ(qlxReturnObjClass(nullptr), nullptr);
  qlxIgnoreObjClass();
  discard(nullptr);
}

// ---- Adding

TEST_F(ObjClassTest, ALoggerClassGetsTheDefaultForWhatItLeavesOut) {
  QlxAddLoggerClass("bare", nullptr, nullptr, nullptr, nullptr, nullptr);
  const ObjClass *bare = find("bare");
  ASSERT_NE(bare, nullptr);
  EXPECT_EQ(bare->kind, Logger);
  EXPECT_EQ(bare->op1.fLog, QlxBasicObjectFLog);
  EXPECT_EQ(bare->op2.fOpen, nullptr);
  EXPECT_EQ(bare->op3.fClose, nullptr);
  EXPECT_EQ(bare->op4.fBindMsg, nullptr);
  EXPECT_EQ(bare->fAllocVars, nullptr);
  EXPECT_EQ(bare->fFreeVars, nullptr);
  EXPECT_EQ(bare->fCfgChange, nullptr);
}

TEST_F(ObjClassTest, AFilterClassGetsTheDefaultForWhatItLeavesOut) {
  QlxAddFilterClass("bare", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  const ObjClass *bare = find("bare");
  ASSERT_NE(bare, nullptr);
  EXPECT_EQ(bare->kind, Filter);
  EXPECT_EQ(bare->op1.fProcess, QlxBasicFilterFProcess);
  EXPECT_EQ(bare->op2.fIsLoggable, QlxLevelFilterFIsLoggable);
  EXPECT_EQ(bare->op3.fLog, QlxBasicObjectFLog);
  EXPECT_EQ(bare->op4.fBindMsg, nullptr);
  EXPECT_EQ(bare->fCfgChange, nullptr);
}

TEST_F(ObjClassTest, AHandlerClassGetsTheDefaultForWhatItLeavesOut) {
  QlxAddHandlerClass("bare", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  const ObjClass *bare = find("bare");
  ASSERT_NE(bare, nullptr);
  EXPECT_EQ(bare->kind, Handler);
  EXPECT_EQ(bare->op1.fProcess, QlxBasicHandlerFProcess);
  EXPECT_EQ(bare->op2.fOpen, QlxBasicHandlerFOpen);
  EXPECT_EQ(bare->op3.fClose, QlxBasicHandlerFClose);
  EXPECT_EQ(bare->op4.fBindMsg, nullptr);
  EXPECT_EQ(bare->fCfgChange, nullptr);
}

TEST_F(ObjClassTest, AFormatterClassGetsTheDefaultForWhatItLeavesOut) {
  QlxAddUFormatterClass("bare", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                        nullptr);
  const ObjClass *bare = find("bare");
  ASSERT_NE(bare, nullptr);
  EXPECT_EQ(bare->kind, Formatter);
  EXPECT_EQ(bare->op1.fFormat, QlxBasicUFormatterFFormat);
  EXPECT_EQ(bare->op2.fGetHeader, QlxBasicFormatterFGetHeader);
  EXPECT_EQ(bare->op3.fGetTrailer, QlxBasicFormatterFGetTrailer);
  EXPECT_EQ(bare->op4.fBindMsg, qlxIntlBindUI18Msg);
  EXPECT_EQ(bare->fCfgChange, nullptr);
}

TEST_F(ObjClassTest, ALoggerClassKeepsTheOperationsThatItBrings) {
  QlxAddLoggerClass("full", nullptr, allocVars, freeVars, cfgChange, log);
  const ObjClass *full = find("full");
  ASSERT_NE(full, nullptr);
  EXPECT_EQ(full->fAllocVars, allocVars);
  EXPECT_EQ(full->fFreeVars, freeVars);
  EXPECT_EQ(full->fCfgChange, cfgChange);
  EXPECT_EQ(full->op1.fLog, log);
}

TEST_F(ObjClassTest, AFilterClassKeepsTheOperationsThatItBrings) {
  QlxAddFilterClass("full", nullptr, allocVars, freeVars, cfgChange, process, isLoggable, log);
  const ObjClass *full = find("full");
  ASSERT_NE(full, nullptr);
  EXPECT_EQ(full->fAllocVars, allocVars);
  EXPECT_EQ(full->op1.fProcess, process);
  EXPECT_EQ(full->op2.fIsLoggable, isLoggable);
  EXPECT_EQ(full->op3.fLog, log);
}

TEST_F(ObjClassTest, AHandlerClassKeepsTheOperationsThatItBrings) {
  QlxAddHandlerClass("full", nullptr, allocVars, freeVars, cfgChange, process, open, close);
  const ObjClass *full = find("full");
  ASSERT_NE(full, nullptr);
  EXPECT_EQ(full->fFreeVars, freeVars);
  EXPECT_EQ(full->op1.fProcess, process);
  EXPECT_EQ(full->op2.fOpen, open);
  EXPECT_EQ(full->op3.fClose, close);
}

TEST_F(ObjClassTest, AFormatterClassKeepsTheOperationsThatItBrings) {
  QlxAddUFormatterClass("full", nullptr, allocVars, freeVars, cfgChange, format, header, trailer,
                        bind);
  const ObjClass *full = find("full");
  ASSERT_NE(full, nullptr);
  EXPECT_EQ(full->fCfgChange, cfgChange);
  EXPECT_EQ(full->op1.fFormat, format);
  EXPECT_EQ(full->op2.fGetHeader, header);
  EXPECT_EQ(full->op3.fGetTrailer, trailer);
  EXPECT_EQ(full->op4.fBindMsg, bind);
}

TEST_F(ObjClassTest, TheFirstRegistrationOfANameStays) {
  QlxAddHandlerClass("twice", nullptr, nullptr, nullptr, nullptr, process, nullptr, nullptr);
  const ObjClass *first = find("twice");
  QlxAddHandlerClass("twice", nullptr, allocVars, nullptr, nullptr, nullptr, nullptr, nullptr);
  QlxAddLoggerClass("twice", nullptr, nullptr, nullptr, nullptr, log);
  QlxAddFilterClass("twice", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  QlxAddUFormatterClass("twice", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                        nullptr);
  EXPECT_EQ(find("twice"), first);
  EXPECT_EQ(first->kind, Handler);
  EXPECT_EQ(first->op1.fProcess, process);
  EXPECT_EQ(first->fAllocVars, nullptr);
  EXPECT_EQ(joined(QlxGetLoggerClasses()).find("twice"), std::string::npos);
}

// Registers a host's copy of a record of the library under a name of its own.
static ObjClass *addCopyOf(const char *name) {
  const ApiLock lock;
  auto *copy = static_cast<ObjClass *>(OslMemoryMalloc(sizeof(ObjClass)));
  *copy = *qlxToolkitGetClassDef(name);
  copy->name = OslStringDup("copy");
  qlxToolkitAddClassDef("copy", copy);
  return copy;
}

TEST_F(ObjClassTest, ACopyOfARecordOfTheLibraryIsItsHosts) {
  ASSERT_NE(find("qlx_filehandler")->own, nullptr);
  const ObjClass *copy = addCopyOf("qlx_filehandler");
  EXPECT_EQ(find("copy"), copy);
  EXPECT_EQ(copy->own, nullptr);
}

TEST_F(ObjClassTest, ARecordOfTheLibraryStaysItsOwnUnderAnotherName) {
  ObjClass *known = find("qlx_filehandler");
  const QlxOwnClass *own = known->own;
  {
    const ApiLock lock;
    qlxToolkitAddClassDef("alias", known);
  }
  EXPECT_EQ(find("alias"), known);
  EXPECT_EQ(known->own, own);
}

TEST_F(ObjClassTest, NamesAreToldApartByCase) {
  QlxAddLoggerClass("Case", nullptr, nullptr, nullptr, nullptr, log);
  EXPECT_NE(find("Case"), nullptr);
  EXPECT_EQ(find("case"), nullptr);
}

TEST_F(ObjClassTest, AClassWithoutANameIsNotRegistered) {
  const std::string before = joined(QlxGetLoggerClasses());
  QlxAddLoggerClass(nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  EXPECT_EQ(joined(QlxGetLoggerClasses()), before);
  EXPECT_EQ(find(nullptr), nullptr);
}

TEST_F(ObjClassTest, EveryKindListsItsClassesInTheOrderOfRegistration) {
  QlxAddLoggerClass("l1", nullptr, nullptr, nullptr, nullptr, nullptr);
  QlxAddFilterClass("f1", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  QlxAddHandlerClass("h1", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
  QlxAddUFormatterClass("u1", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                        nullptr);
  QlxAddLoggerClass("l2", nullptr, nullptr, nullptr, nullptr, nullptr);
  EXPECT_EQ(joined(QlxGetLoggerClasses()), builtInNames(Logger) + "l1|l2|");
  EXPECT_EQ(joined(QlxGetFilterClasses()), builtInNames(Filter) + "f1|");
  EXPECT_EQ(joined(QlxGetHandlerClasses()), builtInNames(Handler) + "h1|");
  EXPECT_EQ(joined(QlxGetFormatterClasses()), builtInNames(Formatter) + "u1|");
}

// With each of its allocations failing in turn.
TEST_F(ObjClassTest, ARegistrationIsWholeOrAbsentWhenMemoryRanOut) {
  I18Msg *description = QlxAllocUI18Msg("bundle", "key", nullptr);
  uint64_t failures = 1;
  for (uint64_t n = 1; failures > 0; ++n) {
    const std::string name = "class" + std::to_string(n);
    FailingMemory memory;
    memory.failOnce(n);
    QlxAddLoggerClass(name.c_str(), description, nullptr, nullptr, nullptr, nullptr);
    failures = memory.failures();
    if (const ObjClass *made = find(name.c_str())) {
      EXPECT_EQ(made->name, name);
      EXPECT_NE(made->description, nullptr);
      EXPECT_EQ(made->op1.fLog, QlxBasicObjectFLog);
    } else {
      EXPECT_EQ(memory.live(), 0);
    }
  }
  QlxFreeI18Msg(description);
}

}  // namespace
