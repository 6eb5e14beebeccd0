#include "support/ToolkitLifeTest.h"

#include "support/CaptureStdout.h"
#include "support/FailingMemory.h"
#include "support/InertHandle.h"
#include "support/PlainFormatter.h"

namespace {

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

}  // namespace
