#include "support/FailingMemory.h"
#include "support/HostTest.h"

namespace {

class ObjectTest : public HostTest {
 protected:
  static uint32_t countOf(const char *name) {
    const ApiLock lock;
    const ObjectRef found{qlxToolkitGetObjInstance(name)};
    return found ? found->refCount - 1 : 0;
  }
};

// ---- Finding

TEST_F(ObjectTest, IsMadeOnceAndSharedFromThenOn) {
  const Handle a = get("a", "qlx_basiclogger");
  ASSERT_NE(a, nullptr);
  EXPECT_EQ(a->refCount, 2u);
  const Handle again = get("a", "qlx_basiclogger"), byName = get("a");
  EXPECT_EQ(again, a);
  EXPECT_EQ(byName, a);
  EXPECT_EQ(a->refCount, 4u);
}

TEST_F(ObjectTest, AnotherClassGivesNullAndLeavesTheObjectAlone) {
  const Handle a = get("a", "qlx_basiclogger");
  EXPECT_EQ(get("a", "qlx_consolehandler"), nullptr);
  EXPECT_EQ(get("a", "QLX_BASICLOGGER"), nullptr);
  EXPECT_EQ(get("a", "unknown"), nullptr);
  EXPECT_EQ(a->refCount, 2u);
  EXPECT_STREQ(a->objClass->name, "qlx_basiclogger");
  EXPECT_EQ(get("a"), a);
}

TEST_F(ObjectTest, NamesAreToldApartByCase) {
  const Handle a = get("a", "qlx_basiclogger"), upper = get("A", "qlx_basiclogger");
  EXPECT_NE(a, upper);
}

TEST_F(ObjectTest, HasNoNameNoObject) {
  EXPECT_EQ(QlxGetObject(nullptr, "qlx_basiclogger"), nullptr);
  EXPECT_EQ(QlxGetObject(nullptr, nullptr), nullptr);
}

TEST_F(ObjectTest, IsNotMadeOfAnUnknownClass) {
  EXPECT_EQ(get("a", "unknown"), nullptr);
  EXPECT_FALSE(exists("a"));
}

TEST_F(ObjectTest, IsNotMadeWithoutAConfiguredClass) {
  EXPECT_EQ(get("a"), nullptr);
  configure("b", "className", "unknown");
  EXPECT_EQ(get("b"), nullptr);
}

TEST_F(ObjectTest, TakesItsClassFromItsConfiguration) {
  configure("a", "className", "qlx_basiclogger");
  const Handle a = get("a");
  ASSERT_NE(a, nullptr);
  EXPECT_STREQ(a->objClass->name, "qlx_basiclogger");
}

TEST_F(ObjectTest, TakesItsClassFromAParentOfItsConfiguration) {
  configure("a", "className", "qlx_consolehandler");
  const Handle child = get("a.b.c");
  ASSERT_NE(child, nullptr);
  EXPECT_STREQ(child->objClass->name, "qlx_consolehandler");
}

TEST_F(ObjectTest, AClassThatIsGivenBeatsTheConfigured) {
  configure("a", "className", "qlx_consolehandler");
  const Handle a = get("a", "qlx_basiclogger");
  ASSERT_NE(a, nullptr);
  EXPECT_STREQ(a->objClass->name, "qlx_basiclogger");
}

TEST_F(ObjectTest, LookingForAClassGivesTheConfigurationBack) {
  configure("a", "className", "unknown");
  const ObjCfg *cfg = QlxLogMgrGetCfg("a");
  EXPECT_EQ(get("a"), nullptr);
  EXPECT_EQ(cfg->refCount, 2u);
  QlxReleaseObjCfg(const_cast<ObjCfg *>(cfg));
}

// ---- A new object

TEST_F(ObjectTest, ANewLoggerStartsAtDebugMinWithNothingElse) {
  const Handle logger = get("a", "qlx_basiclogger");
  EXPECT_EQ(logger->kind1.level, 3000);
  EXPECT_EQ(logger->enabled, 1);
  EXPECT_EQ(logger->kind2.listeners, nullptr);
  EXPECT_EQ(logger->props, nullptr);
  EXPECT_EQ(logger->vars, nullptr);
  EXPECT_STREQ(logger->name, "a");
}

TEST_F(ObjectTest, ANewFilterStartsAtLevelZero) {
  const Handle filter = get("a", "qlx_levelfilter");
  EXPECT_EQ(filter->kind1.level, 0);
  EXPECT_EQ(filter->kind2.listeners, nullptr);
  EXPECT_EQ(filter->enabled, 1);
}

TEST_F(ObjectTest, ANewFormatterHasNoneOfItsThreeTexts) {
  const Handle formatter = get("a", "qlx_basicformatter");
  EXPECT_EQ(formatter->kind1.separator, nullptr);
  EXPECT_EQ(formatter->kind2.dateTimeFormat, nullptr);
  EXPECT_EQ(formatter->kind3.locale, nullptr);
}

TEST_F(ObjectTest, ANewHandlerHasTheSharedDefaultFormatter) {
  const uint32_t before = countOf("quill.defaultFormatter");
  const Handle handler = get("a", HostClasses::kHandler), other = get("b", HostClasses::kHandler);
  const Handle formatter = get("quill.defaultFormatter");
  EXPECT_EQ(handler->kind2.formatter, formatter.get());
  EXPECT_EQ(other->kind2.formatter, formatter.get());
  EXPECT_EQ(handler->kind1.listeners, nullptr);
  EXPECT_EQ(handler->kind3.word, 0u);
  EXPECT_EQ(formatter->refCount, before + 3);
}

TEST_F(ObjectTest, TheFirstHandlerMakesTheDefaultFormatter) {
  QlxCloseToolkit();
  host.emplace();
  EXPECT_FALSE(exists("quill.defaultFormatter"));
  const Handle handler = get("a", HostClasses::kHandler);
  const Handle formatter = get("quill.defaultFormatter");
  ASSERT_NE(formatter, nullptr);
  EXPECT_STREQ(formatter->objClass->name, "qlx_basicformatter");
  EXPECT_EQ(handler->kind2.formatter, formatter.get());
  EXPECT_EQ(formatter->refCount, 3u);
}

TEST_F(ObjectTest, AHandlerNamedAsTheDefaultFormatterFindsTheNameTaken) {
  QlxCloseToolkit();
  host.emplace();
  EXPECT_EQ(get("quill.defaultFormatter", HostClasses::kHandler), nullptr);
  EXPECT_EQ(host->count("alloc"), 1);
  EXPECT_EQ(host->count("free"), 1);
  EXPECT_FALSE(exists("quill.defaultFormatter"));
}

TEST_F(ObjectTest, HasTheVariablesOfItsClass) {
  const Handle object = get("a", HostClasses::kLogger);
  EXPECT_EQ(host->takeCalls(), "alloc|");
  EXPECT_NE(object->vars, nullptr);
}

TEST_F(ObjectTest, IsConfiguredBeforeAnybodySeesIt) {
  configure("a", "logging", "off");
  configure("a.b", "own", "1");
  const Handle object = get("a.b", HostClasses::kLogger);
  EXPECT_EQ(host->takeCalls(), "alloc|change a.b=logging|change a.b=own|");
  EXPECT_EQ(object->enabled, 0);
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "own", nullptr)), "1");
}

TEST_F(ObjectTest, IsConfiguredOnceOnly) {
  configure("a", "key", "1");
  const Handle object = get("a", HostClasses::kLogger);
  host->calls.clear();
  const Handle again = get("a", HostClasses::kLogger);
  EXPECT_EQ(host->takeCalls(), "");
}

TEST_F(ObjectTest, MayNameItselfAsItsListener) {
  configure("a", "className", HostClasses::kHandler);
  configure("a", "listenerNames", "a");
  const Handle object = get("a");
  ASSERT_NE(object, nullptr);
  EXPECT_EQ(listenersOf(object), "a|");
  EXPECT_EQ(object->refCount, 3u);
}

TEST_F(ObjectTest, OutlivesTheReferencesThatItsConfigurationGivesBack) {
  configure("p", "className", HostClasses::kHandler);
  configure("p", "listenerNames", "p.a");
  configure("p.a", "listenerNames", "p.a");  // empties the group that holds it, and takes it again
  const Handle handler = get("p.a");
  ASSERT_NE(handler, nullptr);
  EXPECT_EQ(host->count("free"), 0);
  configure("f", "className", HostClasses::kFormatter);
  configure("f", "listenerNames", "f");  // refused
  const Handle formatter = get("f");
  ASSERT_NE(formatter, nullptr);
  EXPECT_EQ(formatter->refCount, 2u);
  EXPECT_EQ(host->count("free"), 0);
}

TEST_F(ObjectTest, MayNameOneThatNamesItBack) {
  for (const char *name : {"a", "b"}) configure(name, "className", HostClasses::kHandler);
  configure("a", "listenerNames", "b");
  configure("b", "listenerNames", "a");
  const Handle a = get("a"), b = get("b");
  EXPECT_EQ(listenersOf(a), "b|");
  EXPECT_EQ(listenersOf(b), "a|");
}

TEST_F(ObjectTest, IsNotMadeWhenItsOwnClassMadeTheNameMeanwhile) {
  QlxObject *made = nullptr;
  host->onAlloc = [&] {
    if (!made) made = qlxIntlGetObject("a", "qlx_basiclogger");
  };
  EXPECT_EQ(get("a", HostClasses::kHandler), nullptr);
  EXPECT_EQ(host->takeCalls(), "alloc|free|");
  ASSERT_NE(made, nullptr);
  EXPECT_EQ(made->refCount, 2u);
  EXPECT_EQ(get("a").get(), made);
  QlxReleaseObject(made);
}

TEST_F(ObjectTest, IsMadeWithoutVariablesAndToldSo) {
  QlxAddLoggerClass(
      "novars", nullptr, [] { return static_cast<void *>(nullptr); },
      [](void *vars) { EXPECT_EQ(vars, nullptr); }, nullptr, nullptr);
  const Handle object = get("a", "novars");
  ASSERT_NE(object, nullptr);
  EXPECT_EQ(object->vars, nullptr);
}

// With each of its allocations failing in turn, and then all from there on.
TEST_F(ObjectTest, IsMadeWholeOrNotAtAllWhenMemoryRanOut) {
  configure("p", "className", HostClasses::kHandler);
  configure("p", "logging", "on");
  { const Handle warm = get("p.x"); }  // the configurations
  for (const bool all : {false, true}) {
    uint64_t failures = 1;
    for (uint64_t n = 1; failures > 0; ++n) {
      FailingMemory memory;
      all ? memory.failFrom(n) : memory.failOnce(n);
      {
        const Handle object = get("p.x");
        failures = memory.failures();
        memory.failNone();
        EXPECT_EQ(object != nullptr, exists("p.x"));
        EXPECT_STREQ(object ? object->name : "p.x", "p.x");
      }
      EXPECT_FALSE(exists("p.x"));
      EXPECT_EQ(memory.live(), 0) << n;
    }
  }
}

// ---- Counting

TEST_F(ObjectTest, IsDestroyedWhenOnlyTheRegistryIsLeft) {
  Handle object = get("a", HostClasses::kLogger);
  EXPECT_EQ(QlxAcquireObject(object.get()), object.get());
  EXPECT_EQ(object->refCount, 3u);
  QlxReleaseObject(object.get());
  EXPECT_TRUE(exists("a"));
  host->calls.clear();
  object.reset();
  EXPECT_FALSE(exists("a"));
  EXPECT_EQ(host->takeCalls(), "free|");
}

TEST_F(ObjectTest, NullIsNeitherCountedNorReleased) {
  EXPECT_EQ(QlxAcquireObject(nullptr), nullptr);
  QlxReleaseObject(nullptr);
}

TEST_F(ObjectTest, AHandlerIsClosedOnceBeforeItsVariablesGo) {
  Handle handler = get("a", HostClasses::kHandler);
  host->calls.clear();
  host->onClose = [](QlxObject *object) {
    EXPECT_STREQ(object->name, "a");
    EXPECT_NE(object->vars, nullptr);
    EXPECT_NE(object->kind2.formatter, nullptr);
    const ObjectRef found{qlxToolkitGetObjInstance("a")};
    EXPECT_EQ(found, nullptr);  // its name is free already
  };
  handler.reset();
  EXPECT_EQ(host->takeCalls(), "close a|free|");
}

TEST_F(ObjectTest, NoOtherKindIsClosed) {
  for (const char *name : {HostClasses::kLogger, HostClasses::kFilter, HostClasses::kFormatter}) {
    get(name, name);
    EXPECT_EQ(host->takeCalls(), "alloc|free|");
  }
}

TEST_F(ObjectTest, ADestroyedOneReleasesItsListenersAndItsFormatter) {
  Handle handler = get("a", HostClasses::kHandler);
  {
    const Handle listener = get("b", HostClasses::kHandler),
                 formatter = get("f", "qlx_basicformatter");
    QlxAddListener(handler.get(), listener.get());
    QlxHandlerSetFormatter(handler.get(), formatter.get());
  }
  EXPECT_TRUE(exists("b"));
  EXPECT_TRUE(exists("f"));
  handler.reset();
  EXPECT_FALSE(exists("b"));
  EXPECT_FALSE(exists("f"));
}

TEST_F(ObjectTest, ADestroyedFormatterFreesItsThreeTexts) {
  get("a", "qlx_basicformatter");  // its configuration stays
  const FailingMemory memory;
  {
    const Handle formatter = get("a", "qlx_basicformatter");
    for (const char *key : {"separator", "dateTimeFormat", "locale"}) {
      QlxSetObjProp(formatter.get(), key, "x");
    }
    EXPECT_NE(formatter->kind1.separator, nullptr);
  }
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(ObjectTest, ANameIsFreeAgainOnceItsObjectIsDestroyed) {
  get("a", HostClasses::kHandler);
  const Handle other = get("a", "qlx_basiclogger");
  EXPECT_NE(other, nullptr);
}

TEST_F(ObjectTest, AClassMayMakeTheNameAnewWhileItsObjectIsDestroyed) {
  Handle first = get("a", HostClasses::kHandler);
  QlxObject *second = nullptr;
  host->onClose = [&](QlxObject *) {
    if (!second) second = qlxIntlGetObject("a", "qlx_basiclogger");
  };
  first.reset();
  EXPECT_TRUE(exists("a"));
  EXPECT_EQ(get("a").get(), second);
  QlxReleaseObject(second);
}

TEST_F(ObjectTest, ADestroyedOneLeavesItsNameToAnObjectThatTookIt) {
  const Handle first = get("a", HostClasses::kLogger), second = get("b", HostClasses::kLogger);
  const ApiLock lock;
  qlxIntlAcquireObject(first.get());
  qlxToolkitAddObjInstance("a", second.get());
  qlxIntlReleaseObject(first.get());  // which leaves one reference
  EXPECT_EQ(first->objClass, nullptr);
  const ObjectRef found{qlxToolkitGetObjInstance("a")};
  EXPECT_EQ(found.get(), second.get());
  qlxToolkitRemObjInstance("a");
}

TEST_F(ObjectTest, AClassMayTakeAndGiveBackTheObjectThatIsDestroyed) {
  Handle object = get("a", HostClasses::kHandler);
  QlxObject *raw = object.get();
  const auto takeAndGive = [raw] {
    qlxIntlAcquireObject(raw);
    qlxIntlReleaseObject(raw);
  };
  host->onClose = [&](QlxObject *closing) {
    takeAndGive();
    EXPECT_NE(closing->vars, nullptr);
  };
  host->onFree = [&](void *) { takeAndGive(); };
  host->calls.clear();
  object.reset();
  EXPECT_EQ(host->takeCalls(), "close a|free|");
}

TEST_F(ObjectTest, AReferenceTakenWhileTheObjectIsDestroyedHoldsAnInertOne) {
  Handle object = get("a", HostClasses::kHandler);
  QlxObject *kept = nullptr;
  host->onClose = [&](QlxObject *closing) { kept = qlxIntlAcquireObject(closing); };
  object.reset();
  ASSERT_NE(kept, nullptr);
  EXPECT_EQ(kept->objClass, nullptr);
  EXPECT_EQ(QlxGetObjectName(kept), nullptr);
  QlxReleaseObject(kept);
}

TEST_F(ObjectTest, WhatIsDestroyedFindsTheOneThatHeldItInert) {
  Handle outer = get("outer", HostClasses::kHandler);
  {
    const Handle inner = get("inner", HostClasses::kHandler);
    QlxAddListener(outer.get(), inner.get());
    QlxSetObjProp(outer.get(), "key", "value");
  }
  QlxObject *raw = outer.get();
  host->onClose = [raw](QlxObject *closing) {
    if (closing == raw) return;
    EXPECT_EQ(qlxIntlGetObjProp(raw, "key", nullptr), nullptr);
    EXPECT_EQ(qlxIntlSetObjProp(raw, "key", "value"), 0);
    EXPECT_EQ(qlxIntlAddListener(raw, closing), 0);
  };
  host->calls.clear();
  outer.reset();
  EXPECT_EQ(host->takeCalls(), "close outer|close inner|free|free|");
}

TEST_F(ObjectTest, TakingANameFromTheRegistryDestroysWhenOneHolderIsLeft) {
  const Handle object = get("a", HostClasses::kHandler);
  Handle other = get("a");
  {
    const ApiLock lock;
    qlxToolkitRemObjInstance("a");
  }
  EXPECT_NE(object->objClass, nullptr);
  other.reset();
  EXPECT_EQ(object->objClass, nullptr);
}

TEST_F(ObjectTest, TakingANameFromTheRegistryLeavesTheHandleInert) {
  const Handle object = get("a", HostClasses::kHandler);
  host->calls.clear();
  {
    const ApiLock lock;
    qlxToolkitRemObjInstance("a");
  }
  EXPECT_EQ(host->takeCalls(), "close a|free|");
  EXPECT_EQ(object->objClass, nullptr);
  EXPECT_EQ(object->refCount, 1u);
}

// ---- What an object tells

TEST_F(ObjectTest, HandsOutCopiesOfItsName) {
  const Handle object = get("a", "qlx_basiclogger");
  char *name = QlxGetObjectName(object.get());
  EXPECT_STREQ(name, "a");
  EXPECT_NE(name, object->name);
  OslMemoryFree(name);
  EXPECT_EQ(QlxGetObjectName(nullptr), nullptr);
}

TEST_F(ObjectTest, HandsOutTheDescriptionOfItsClass) {
  I18Msg *description = QlxAllocUI18Msg(nullptr, nullptr, u"what it is");
  QlxAddLoggerClass("described", description, nullptr, nullptr, nullptr, nullptr);
  QlxFreeI18Msg(description);
  const Handle object = get("a", "described"), plain = get("b", "qlx_basiclogger");
  UChar *text = QlxGetObjectDesc(object.get());
  EXPECT_EQ(std::u16string(text), u"what it is");
  OslMemoryFree(text);
  EXPECT_EQ(QlxGetObjectDesc(plain.get()), nullptr);
  EXPECT_EQ(QlxGetObjectDesc(nullptr), nullptr);
}

TEST_F(ObjectTest, IsEqualToItselfOnly) {
  const Handle a = get("a", "qlx_basiclogger"), b = get("b", "qlx_basiclogger");
  const ApiLock lock;  // comparing takes none: this one is not recursive
  EXPECT_EQ(QlxAreObjectsEqual(a.get(), a.get()), 1);
  EXPECT_EQ(QlxAreObjectsEqual(a.get(), b.get()), 0);
  EXPECT_EQ(QlxAreObjectsEqual(a.get(), nullptr), 0);
  EXPECT_EQ(QlxAreObjectsEqual(nullptr, nullptr), 1);
}

TEST_F(ObjectTest, TheEnabledFlagKeepsTheLowEightBits) {
  const Handle object = get("a", "qlx_basiclogger");
  EXPECT_EQ(QlxIsObjectEnabled(object.get()), 1);
  QlxSetObjectEnabled(object.get(), 2);
  EXPECT_EQ(QlxIsObjectEnabled(object.get()), 2);
  QlxSetObjectEnabled(object.get(), 256);
  EXPECT_EQ(QlxIsObjectEnabled(object.get()), 0);
  QlxSetObjectEnabled(object.get(), 0x101);
  EXPECT_EQ(QlxIsObjectEnabled(object.get()), 1);
  EXPECT_EQ(QlxIsObjectEnabled(nullptr), 0);
  QlxSetObjectEnabled(nullptr, 1);
}

TEST_F(ObjectTest, AFilterIsAskedThroughItsClass) {
  const Handle filter = get("f", HostClasses::kFilter), logger = get("l", HostClasses::kLogger);
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event, nullptr), 1);
  host->answer = 0;
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event, nullptr), 0);
  host->answer = 1;
  host->calls.clear();
  EXPECT_EQ(QlxIsLoggableByFilter(logger.get(), event, nullptr), 0);
  EXPECT_EQ(QlxIsLoggableByFilter(nullptr, event, nullptr), 0);
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), nullptr, nullptr), 0);
  EXPECT_EQ(host->takeCalls(), "");
  QlxFreeEvent(event);
}

TEST_F(ObjectTest, AFilterWithoutTheOperationSaysNo) {
  const Handle filter = get("f", HostClasses::kFilter);
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  const auto operation = filter->objClass->op2.fIsLoggable;
  filter->objClass->op2.fIsLoggable = nullptr;
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event, nullptr), 0);
  filter->objClass->op2.fIsLoggable = operation;
  QlxFreeEvent(event);
}

}  // namespace
