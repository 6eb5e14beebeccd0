#include <algorithm>
#include <utility>

#include <qlx/class/containers.h>

#include "object/QlxListeners.h"

#include "support/FailingMemory.h"
#include "support/HostTest.h"

namespace {

class ListenersTest : public HostTest {
 protected:
  void SetUp() override {
    HostTest::SetUp();
    logger = get("log", HostClasses::kLogger);
    host->calls.clear();
  }
  void TearDown() override {
    logger.reset();
    HostTest::TearDown();
  }

  // An object of the host's class, and a listener of another one.
  static Handle attach(const Handle &to, const char *name, const char *className) {
    Handle object = get(name, className);
    EXPECT_EQ(QlxAddListener(to.get(), object.get()), 1);
    return object;
  }

  // What an event that is passed to the listeners of an object calls.
  std::string passed(const Handle &object) {
    host->calls.clear();
    pass(object.get(), QlxBasicObjectFLog);
    return host->takeCalls();
  }

  static void setListenerNames(const Handle &object, const char *names) {
    QlxSetObjProp(object.get(), "listenerNames", names);
  }

  Handle logger;
};

// ---- The group

TEST_F(ListenersTest, AreAddedInOrderAndEachOnce) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = attach(logger, "b", HostClasses::kFilter);
  EXPECT_EQ(QlxAddListener(logger.get(), a.get()), 0);
  EXPECT_EQ(listenersOf(logger), "a|b|");
  EXPECT_EQ(a->refCount, 3u);
}

TEST_F(ListenersTest, NullAndObjectsWithoutAGroupTakeNone) {
  const Handle a = get("a", HostClasses::kHandler), formatter = get("f", HostClasses::kFormatter);
  EXPECT_EQ(QlxAddListener(logger.get(), nullptr), 0);
  EXPECT_EQ(QlxAddListener(nullptr, a.get()), 0);
  EXPECT_EQ(QlxAddListener(formatter.get(), a.get()), 0);
  EXPECT_EQ(QlxRemListener(logger.get(), nullptr), 0);
  EXPECT_EQ(QlxRemListener(nullptr, a.get()), 0);
  EXPECT_EQ(QlxGetListeners(nullptr), nullptr);
  EXPECT_EQ(QlxGetListeners(formatter.get()), nullptr);
  EXPECT_EQ(a->refCount, 2u);
}

TEST_F(ListenersTest, AreRemovedAndReleased) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  attach(logger, "b", HostClasses::kHandler);
  EXPECT_EQ(QlxRemListener(logger.get(), a.get()), 1);
  EXPECT_EQ(QlxRemListener(logger.get(), a.get()), 0);
  EXPECT_EQ(listenersOf(logger), "b|");
  EXPECT_EQ(a->refCount, 2u);
}

TEST_F(ListenersTest, OneThatOnlyTheGroupHoldsIsDestroyedWhenItIsRemoved) {
  Handle a = attach(logger, "a", HostClasses::kHandler);
  QlxObject *borrowed = a.get();
  a.reset();
  EXPECT_TRUE(exists("a"));
  host->calls.clear();
  EXPECT_EQ(QlxRemListener(logger.get(), borrowed), 1);
  EXPECT_EQ(host->takeCalls(), "close a|free|");
  EXPECT_FALSE(exists("a"));
}

TEST_F(ListenersTest, RemovingFromNoneMakesNoGroup) {
  const Handle a = get("a", HostClasses::kHandler);
  QlxRemListener(logger.get(), a.get());
  EXPECT_EQ(logger->kind2.listeners, nullptr);
}

TEST_F(ListenersTest, EveryKindKeepsItsGroupInItsOwnField) {
  const Handle filter = get("f", HostClasses::kFilter), handler = get("h", HostClasses::kHandler),
               formatter = get("u", HostClasses::kFormatter);
  const ApiLock lock;
  for (QlxObject *object : {logger.get(), filter.get(), handler.get()}) {
    EXPECT_EQ(qlxFetchListenerGroup(object, 0), nullptr);
    EXPECT_EQ(qlxFetchListenerGroup(object, 2), nullptr);  // only 1 makes one
    EXPECT_NE(qlxFetchListenerGroup(object, 1), nullptr);
    EXPECT_EQ(qlxFetchListenerGroup(object, 0), qlxFetchListenerGroup(object, 1));
  }
  EXPECT_EQ(logger->kind2.listeners, qlxFetchListenerGroup(logger.get(), 0));
  EXPECT_EQ(filter->kind2.listeners, qlxFetchListenerGroup(filter.get(), 0));
  EXPECT_EQ(handler->kind1.listeners, qlxFetchListenerGroup(handler.get(), 0));
  EXPECT_EQ(qlxFetchListenerGroup(formatter.get(), 1), nullptr);
  EXPECT_EQ(qlxFetchListenerGroup(nullptr, 1), nullptr);
}

TEST_F(ListenersTest, IsNotAddedWhenMemoryRanOut) {
  const Handle a = get("a", HostClasses::kHandler);
  FailingMemory memory;
  for (uint64_t n = 1; n <= 2; ++n) {
    memory.failOnce(n);
    EXPECT_EQ(QlxAddListener(logger.get(), a.get()), 0);
    EXPECT_EQ(memory.failures(), 1u);
  }
  EXPECT_EQ(a->refCount, 2u);
}

// ---- Passing an event on

TEST_F(ListenersTest, EventsGoToFiltersAndHandlersInOrderAndToNoOtherKind) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle f = attach(logger, "f", HostClasses::kFormatter);
  const Handle b = attach(logger, "b", HostClasses::kFilter);
  const Handle l = attach(logger, "l", HostClasses::kLogger);
  const Handle c = attach(logger, "c", HostClasses::kHandler);
  EXPECT_EQ(passed(logger), "process a|ask b|process c|");
}

TEST_F(ListenersTest, ADisabledObjectPassesNothingOn) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  QlxSetObjectEnabled(logger.get(), 0);
  EXPECT_EQ(passed(logger), "");
  QlxSetObjectEnabled(logger.get(), 2);
  EXPECT_EQ(passed(logger), "process a|");
}

TEST_F(ListenersTest, PassesNothingToNobody) {
  EXPECT_EQ(passed(logger), "");
  pass(nullptr, QlxBasicObjectFLog);
  EXPECT_EQ(host->takeCalls(), "");
}

TEST_F(ListenersTest, AListenerWhoseClassHasNoOperationIsSkipped) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const auto operation = a->objClass->op1.fProcess;
  a->objClass->op1.fProcess = nullptr;
  EXPECT_EQ(passed(logger), "");
  a->objClass->op1.fProcess = operation;
}

TEST_F(ListenersTest, AreHeldWhileTheyGetTheEventAndReleasedAfterIt) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  uint32_t during = 0;
  host->onEvent = [&](QlxObject *object, Event *) { during = object->refCount; };
  passed(logger);
  EXPECT_EQ(during, 4u);
  EXPECT_EQ(a->refCount, 3u);
  EXPECT_EQ(logger->refCount, 2u);
}

TEST_F(ListenersTest, TheArgumentsArePassedThroughUntouched) {
  static va_list args;
  static const va_list *seen;
  QlxAddHandlerClass(
      "argsee", nullptr, nullptr, nullptr, nullptr,
      [](QlxObject *, Event *, va_list *list) { seen = list; }, nullptr, nullptr);
  const Handle a = attach(logger, "a", "argsee");
  const ApiLock lock;
  QlxBasicObjectFLog(logger.get(), nullptr, &args);
  EXPECT_EQ(seen, &args);
}

TEST_F(ListenersTest, ManyGetTheEventInOrder) {
  std::vector<Handle> all;
  std::string expected;
  for (int i = 0; i < 100; ++i) {
    const std::string name = "h" + std::to_string(i);
    all.push_back(attach(logger, name.c_str(), HostClasses::kHandler));
    expected += "process " + name + "|";
  }
  EXPECT_EQ(passed(logger), expected);
}

// Fifty handlers, and a logger that passes an event to them while there is no memory.
class ManyListenersTest : public ListenersTest {
 protected:
  void SetUp() override {
    ListenersTest::SetUp();
    for (int i = 0; i < 50; ++i) all.push_back(attach(logger, name(i).c_str(), host->kHandler));
    event.reset(QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text"));
    host->calls.clear();
  }
  void TearDown() override {
    all.clear();
    event.reset();
    ListenersTest::TearDown();
  }

  static std::string name(int i) { return "h" + std::to_string(i); }

  // Calls `act` while that handler has the event.
  void on(int i, std::function<void()> act) {
    host->onEvent = [this, i, act](QlxObject *handler, Event *) {
      if (handler == all[static_cast<size_t>(i)].get()) act();
    };
  }

  void remove(int i) { qlxIntlRemListener(logger.get(), all[static_cast<size_t>(i)].get()); }

  // The numbers of the handlers that got the event, in order.
  std::vector<int> passedWithoutMemory() {
    return passedWithout([](FailingMemory &memory) { memory.failFrom(1); });
  }
  template <typename Plan>
  std::vector<int> passedWithout(Plan plan) {
    {
      const ApiLock lock;
      FailingMemory memory;
      plan(memory);
      QlxBasicObjectFLog(logger.get(), event.get(), nullptr);
    }
    std::vector<int> numbers;
    for (const std::string &call : host->calls) {
      if (call.starts_with("process h")) numbers.push_back(std::stoi(call.substr(9)));
    }
    return numbers;
  }

  static std::vector<int> without(std::vector<int> gone) {
    std::vector<int> numbers;
    for (int i = 0; i < 50; ++i) {
      if (std::find(gone.begin(), gone.end(), i) == gone.end()) numbers.push_back(i);
    }
    return numbers;
  }

  int chainLength() const {
    int length = 0;
    for (auto *it = qlxIntlGetListeners(logger.get()); it; it = it->next) ++length;
    return length;
  }

  std::vector<Handle> all;
  Owned<Event, QlxFreeEvent> event;
};

TEST_F(ManyListenersTest, GetTheEventInOrderWhenMemoryRanOut) {
  EXPECT_EQ(passedWithoutMemory(), without({}));
  for (const Handle &handler : all) EXPECT_EQ(handler->refCount, 3u);
}

TEST_F(ManyListenersTest, MayRemoveThemselvesAndOthersWhenMemoryRanOut) {
  on(15, [this] {
    for (int i : {14, 15, 16, 20, 49}) remove(i);
  });
  EXPECT_EQ(passedWithoutMemory(), without({16, 20, 49}));
}

TEST_F(ManyListenersTest, GetItOnceAlsoWhenTheyAreAddedAnewMeanwhile) {
  on(3, [this] {
    for (const int i : {1, 3, 4}) {
      remove(i);
      qlxIntlAddListener(logger.get(), all[static_cast<size_t>(i)].get());
    }
  });
  std::vector<int> expected = without({4});
  expected.push_back(4);
  EXPECT_EQ(passedWithout([](FailingMemory &) {}), expected);
  EXPECT_EQ(qlxFetchListenerGroup(logger.get(), 0)->tail->value, all[4].get());
}

TEST_F(ManyListenersTest, MayFreeTheWholeGroupWhenMemoryRanOut) {
  on(3, [this] { qlxFreeListeners(logger.get()); });
  EXPECT_EQ(passedWithoutMemory(), (std::vector{0, 1, 2, 3}));
  for (const Handle &handler : all) EXPECT_EQ(handler->refCount, 2u);
}

TEST_F(ManyListenersTest, MayEachRemoveThemselvesWithoutLosingTheOthersWhenMemoryRanOut) {
  host->onEvent = [this](QlxObject *handler, Event *) {
    qlxIntlRemListener(logger.get(), handler);
  };
  EXPECT_EQ(passedWithoutMemory(), without({}));
  EXPECT_EQ(listenersOf(logger), "");
}

TEST_F(ManyListenersTest, MayEachRemoveTheNextOneWhenMemoryRanOut) {
  host->onEvent = [this](QlxObject *, Event *) {
    remove(2 * static_cast<int>(host->calls.size()) - 1);
  };
  const std::vector<int> numbers = passedWithoutMemory();
  EXPECT_EQ(numbers.size(), 25u);
  for (const int i : numbers) EXPECT_EQ(i % 2, 0);
}

TEST_F(ManyListenersTest, NeedNoMemoryToGetTheEvent) {
  uint64_t attempts = 0;
  passedWithout([](FailingMemory &) {});  // what is made once is made
  host->onEvent = nullptr;
  const ApiLock lock;
  for (const int left : {50, 3, 1}) {
    while (listenersOf(logger) != "" && chainLength() > left) remove(chainLength() - 1);
    host->calls.clear();
    host->calls.reserve(100);
    const FailingMemory memory;
    QlxBasicObjectFLog(logger.get(), event.get(), nullptr);
    attempts += memory.attempts();
    EXPECT_EQ(host->calls.size(), static_cast<size_t>(left));
  }
  EXPECT_EQ(attempts, 0u);
}

// What the last release of a listener runs may remove those that come next.
TEST_F(ManyListenersTest, MayEndAndTakeTheNextOnesAlongWhenMemoryRanOut) {
  on(0, [this] {
    remove(5);
    QlxObject *ending = all[5].release();
    qlxIntlReleaseObject(ending);
  });
  host->onClose = [this](QlxObject *) { remove(16), remove(17); };
  EXPECT_EQ(passedWithoutMemory(), without({5, 16, 17}));
  EXPECT_FALSE(exists("h5"));
}

// ---- Chains that come back

TEST_F(ListenersTest, AHandlerThatListsItselfGetsTheEventOnce) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  EXPECT_EQ(QlxAddListener(a.get(), a.get()), 1);
  EXPECT_EQ(passed(logger), "process a|");
  EXPECT_EQ(passed(logger), "process a|");  // the next event too
}

TEST_F(ListenersTest, AChainThatComesBackEndsThere) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = attach(a, "b", HostClasses::kFilter);
  const Handle c = attach(b, "c", HostClasses::kHandler);
  QlxAddListener(c.get(), a.get());
  QlxAddListener(c.get(), b.get());
  EXPECT_EQ(passed(logger), "process a|ask b|process c|");
  EXPECT_EQ(passed(b), "process c|process a|");
}

TEST_F(ListenersTest, AnObjectThatTwoBranchesReachGetsTheEventTwice) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = attach(logger, "b", HostClasses::kHandler);
  const Handle end = attach(a, "end", HostClasses::kHandler);
  QlxAddListener(b.get(), end.get());
  QlxAddListener(logger.get(), end.get());
  EXPECT_EQ(passed(logger), "process a|process end|process b|process end|process end|");
}

// ---- Changes while an event is on its way

TEST_F(ListenersTest, AListenerMayRemoveItselfAndTheNextOnes) {
  QlxObject *raw[3];
  for (int i = 0; i < 3; ++i) {
    const Handle listener = attach(logger, std::to_string(i).c_str(), HostClasses::kHandler);
    raw[i] = listener.get();
  }
  host->onEvent = [&](QlxObject *object, Event *) {
    if (object != raw[0]) return;
    for (QlxObject *listener : raw) qlxIntlRemListener(logger.get(), listener);
  };
  EXPECT_EQ(passed(logger), "process 0|close 1|free|close 2|free|close 0|free|");
  EXPECT_EQ(listenersOf(logger), "");
  EXPECT_FALSE(exists("0"));
  EXPECT_FALSE(exists("2"));
}

TEST_F(ListenersTest, AListenerMayReplaceTheWholeGroup) {
  configure("new", "className", HostClasses::kHandler);
  attach(logger, "old", HostClasses::kHandler);
  host->onEvent = [&](QlxObject *object, Event *) {
    if (std::string(object->name) != "old") return;
    qlxIntlSetObjProp(logger.get(), "listenerNames", "new");
  };
  EXPECT_EQ(passed(logger),
            "process old|change log=listenerNames|alloc|change new=className|process new|"
            "close old|free|");
  host->onEvent = nullptr;
  EXPECT_EQ(passed(logger), "process new|");
}

TEST_F(ListenersTest, AListenerMayDestroyTheObjectThatPassesTheEvent) {
  QlxObject *raw = get("other", HostClasses::kLogger).release();
  Handle holder{raw};
  attach(holder, "a", HostClasses::kHandler);
  host->onEvent = [&](QlxObject *, Event *) { qlxIntlReleaseObject(holder.release()); };
  host->calls.clear();
  pass(raw, QlxBasicObjectFLog);
  EXPECT_EQ(host->count("process a"), 1);
  EXPECT_FALSE(exists("other"));
  EXPECT_FALSE(exists("a"));
}

TEST_F(ListenersTest, AListenerThatIsAddedGetsTheEventToo) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = get("b", HostClasses::kHandler), c = get("c", HostClasses::kFilter);
  host->onEvent = [&](QlxObject *object, Event *) {
    qlxIntlAddListener(logger.get(), object == a.get() ? b.get() : c.get());
  };
  EXPECT_EQ(passed(logger), "process a|process b|ask c|");
  EXPECT_EQ(passed(logger), "process a|process b|ask c|");
}

TEST_F(ListenersTest, AListenerThatIsAddedAndRemovedAgainDoesNotGetTheEvent) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = attach(logger, "b", HostClasses::kHandler);
  const Handle c = get("c", HostClasses::kHandler);
  host->onEvent = [&](QlxObject *object, Event *) {
    if (object == a.get()) qlxIntlAddListener(logger.get(), c.get());
    if (object == b.get()) qlxIntlRemListener(logger.get(), c.get());
  };
  EXPECT_EQ(passed(logger), "process a|process b|");
  EXPECT_EQ(listenersOf(logger), "a|b|");
}

TEST_F(ListenersTest, ARemovedListenerThatNobodyElseHoldsEndsAfterItsOperation) {
  Handle a = attach(logger, "a", HostClasses::kHandler);
  QlxObject *raw = a.get();
  a.reset();
  const Handle b = attach(logger, "b", HostClasses::kHandler);
  host->onEvent = [&](QlxObject *object, Event *) {
    if (object != raw) return;
    qlxIntlRemListener(logger.get(), raw);
    EXPECT_STREQ(raw->name, "a");
    EXPECT_EQ(host->count("close a"), 0);
  };
  EXPECT_EQ(passed(logger), "process a|process b|close a|free|");
  EXPECT_FALSE(exists("a"));
}

TEST_F(ListenersTest, ListenersThatAreAlwaysAddedAnewGetTheEventOnce) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = attach(logger, "b", HostClasses::kHandler);
  host->onEvent = [&](QlxObject *, Event *) {
    for (const Handle *listener : {&a, &b}) {
      qlxIntlRemListener(logger.get(), listener->get());
      qlxIntlAddListener(logger.get(), listener->get());
    }
  };
  EXPECT_EQ(passed(logger), "process a|process b|");
  EXPECT_EQ(listenersOf(logger), "a|b|");
  EXPECT_EQ(a->refCount, 3u);
}

TEST_F(ListenersTest, ListenersThatAlwaysNameThemselvesAnewGetTheEventOnce) {
  for (const char *name : {"a", "b"}) configure(name, "className", HostClasses::kHandler);
  setListenerNames(logger, "a b");
  host->onEvent = [&](QlxObject *, Event *) {
    qlxIntlSetObjProp(logger.get(), "listenerNames", "a b");
  };
  passed(logger);
  EXPECT_EQ(listenersOf(logger), "a|b|");
  host->calls.clear();
  pass(logger.get(), QlxBasicObjectFLog);
  EXPECT_EQ(host->count("process a"), 1);
  EXPECT_EQ(host->count("process b"), 1);
}

TEST_F(ListenersTest, AnEventEndsAlsoWhereEachListenerAddsANewOne) {
  configure("h", "className", HostClasses::kHandler);
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  int made = 0;
  host->onEvent = [&](QlxObject *, Event *) {
    const std::string name = "h" + std::to_string(++made);
    const ObjectRef next{qlxIntlGetObject(name.c_str(), HostClasses::kHandler)};
    qlxIntlAddListener(logger.get(), next.get());
  };
  passed(logger);
  EXPECT_EQ(made, 10001);  // of the first one and of ten thousand added ones
  host->onEvent = nullptr;
  EXPECT_EQ(std::ranges::count(passed(logger), '|'), 10002);
}

TEST_F(ListenersTest, AnEventMayPassTheSameListenersOfTwoOwnersThatChange) {
  const Handle other = get("other", HostClasses::kLogger);
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  const Handle b = attach(logger, "b", HostClasses::kHandler);
  for (const Handle *listener : {&b, &a}) QlxAddListener(other.get(), listener->get());
  host->onEvent = [&](QlxObject *object, Event *event) {
    if (object == a.get()) QlxBasicObjectFLog(other.get(), event, nullptr);
    for (const Handle *owner : {&std::as_const(logger), &other}) {
      qlxIntlRemListener(owner->get(), object);
      qlxIntlAddListener(owner->get(), object);
    }
  };
  EXPECT_EQ(passed(logger), "process a|process b|process a|process b|");
}

TEST_F(ListenersTest, AReportOfAListenerThatIsOnTheErrorLoggersPathEndsThere) {
  const Handle errors = get("quill.errorLogger");
  const Handle a = get("a", HostClasses::kHandler);
  QlxSetObjProp(errors.get(), "listenerNames", "");
  QlxAddListener(errors.get(), a.get());
  host->onEvent = [](QlxObject *, Event *) {
    QlxLogResult result;
    qlxIntlLogVA(&result, ERROR, "bundle", "key");
  };
  EXPECT_EQ(passed(errors), "process a|");
  EXPECT_EQ(passed(a), "");
  QlxAddListener(logger.get(), a.get());
  EXPECT_EQ(passed(logger), "process a|process a|");  // its own event and its one report
}

// ---- "logging"

TEST_F(ListenersTest, FourWordsInAnyCaseSwitchAnObjectOnAndOff) {
  for (const char *on : {"on", "ON", "true", "TRUE", "True"}) {
    QlxSetObjectEnabled(logger.get(), 0);
    QlxSetObjProp(logger.get(), "logging", on);
    EXPECT_EQ(QlxIsObjectEnabled(logger.get()), 1) << on;
  }
  for (const char *off : {"off", "Off", "false", "FALSE"}) {
    QlxSetObjectEnabled(logger.get(), 1);
    QlxSetObjProp(logger.get(), "logging", off);
    EXPECT_EQ(QlxIsObjectEnabled(logger.get()), 0) << off;
  }
}

TEST_F(ListenersTest, AnyOtherWordLeavesTheFlagAsItIs) {
  for (const uint8_t flag : {0, 1, 2}) {
    QlxSetObjectEnabled(logger.get(), flag);
    for (const char *word : {"yes", "no", "1", "0", "", " on", "on ", "truely"}) {
      QlxSetObjProp(logger.get(), "logging", word);
      EXPECT_EQ(QlxIsObjectEnabled(logger.get()), flag) << word;
    }
  }
}

TEST_F(ListenersTest, AMissingValueLeavesTheFlagAsItIs) {
  QlxSetObjectEnabled(logger.get(), 0);
  const ApiLock lock;
  QlxBasicObjectFCfgChange(logger.get(), "logging");
  EXPECT_EQ(logger->enabled, 0);
}

// ---- "listenerNames"

TEST_F(ListenersTest, NamesAreTakenInOrder) {
  for (const char *name : {"a", "b"}) configure(name, "className", HostClasses::kHandler);
  setListenerNames(logger, "b a");
  EXPECT_EQ(listenersOf(logger), "b|a|");
  EXPECT_EQ(logger->kind2.listeners->head->value->refCount, 2u);  // registry and group
}

TEST_F(ListenersTest, NamesAreSplitAtSixBlanks) {
  for (const char *name : {"1", "2", "3", "4", "5", "6", "7"}) {
    configure(name, "className", HostClasses::kHandler);
  }
  setListenerNames(logger, "  1 2\t3\r4\n5\f6\v7\t\n");
  EXPECT_EQ(listenersOf(logger), "1|2|3|4|5|6|7|");
}

TEST_F(ListenersTest, ACommaIsPartOfAName) {
  configure("a,b", "className", HostClasses::kHandler);
  setListenerNames(logger, "a,b");
  EXPECT_EQ(listenersOf(logger), "a,b|");
}

TEST_F(ListenersTest, ANameGivenTwiceIsAddedOnce) {
  configure("a", "className", HostClasses::kHandler);
  setListenerNames(logger, "a a");
  EXPECT_EQ(listenersOf(logger), "a|");
}

TEST_F(ListenersTest, NewNamesReplaceTheOldListeners) {
  for (const char *name : {"a", "b"}) configure(name, "className", HostClasses::kHandler);
  setListenerNames(logger, "a");
  const ListenerGroup *old = logger->kind2.listeners;
  EXPECT_NE(old, nullptr);
  setListenerNames(logger, "b");
  EXPECT_EQ(listenersOf(logger), "b|");
  EXPECT_FALSE(exists("a"));
  EXPECT_EQ(passed(logger), "process b|");
}

TEST_F(ListenersTest, AnEmptyTextRemovesAllListeners) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  setListenerNames(logger, "");
  EXPECT_EQ(listenersOf(logger), "");
  EXPECT_EQ(a->refCount, 2u);
}

TEST_F(ListenersTest, AMissingValueRemovesAllListeners) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  {
    const ApiLock lock;
    QlxBasicObjectFCfgChange(logger.get(), "listenerNames");
  }
  EXPECT_EQ(listenersOf(logger), "");
}

TEST_F(ListenersTest, ANameWithoutAClassIsLeftOut) {
  configure("a", "className", HostClasses::kHandler);
  configure("b", "className", "unknown");
  setListenerNames(logger, "b nothing a");
  EXPECT_EQ(listenersOf(logger), "a|");
}

TEST_F(ListenersTest, AnExistingObjectIsTakenAsItIs) {
  const Handle a = get("a", HostClasses::kFilter);
  setListenerNames(logger, "a");
  EXPECT_EQ(logger->kind2.listeners->head->value, a.get());
}

TEST_F(ListenersTest, AListenerThatStaysInTheNamesIsMadeAnewWhenNobodyElseHeldIt) {
  configure("a", "className", HostClasses::kHandler);
  setListenerNames(logger, "a");
  host->calls.clear();
  setListenerNames(logger, "a");
  EXPECT_EQ(host->takeCalls(), "change log=listenerNames|close a|free|alloc|change a=className|");
}

TEST_F(ListenersTest, AFormattersNamesMakeNothingThatStays) {
  configure("a", "className", HostClasses::kHandler);
  const Handle formatter = get("f", HostClasses::kFormatter);
  setListenerNames(formatter, "a");
  EXPECT_FALSE(exists("a"));
}

// ---- The other keys

TEST_F(ListenersTest, DescriptionsAreAcceptedWithoutEffect) {
  const Handle a = attach(logger, "a", HostClasses::kHandler);
  for (const char *key : {"description", "descriptionFile", "descriptionSet", "descriptionKey",
                          "unknown", "Logging", "listenernames"}) {
    QlxSetObjProp(logger.get(), key, "off");
  }
  EXPECT_EQ(listenersOf(logger), "a|");
  EXPECT_EQ(logger->enabled, 1);
  EXPECT_EQ(QlxGetObjectDesc(logger.get()), nullptr);
}

TEST_F(ListenersTest, KeysOfNobodyAndNoKeyDoNothing) {
  const ApiLock lock;
  QlxBasicObjectFCfgChange(nullptr, "logging");
  QlxBasicObjectFCfgChange(logger.get(), nullptr);
  EXPECT_EQ(logger->enabled, 1);
}

// With each of its allocations failing in turn, and then all from there on.
TEST_F(ListenersTest, NamesAddWhatCouldBeMadeWhenMemoryRanOut) {
  for (const char *name : {"a", "b"}) configure(name, "className", HostClasses::kHandler);
  setListenerNames(logger, "a b");
  for (const bool all : {false, true}) {
    uint64_t failures = 1;
    for (uint64_t n = 1; failures > 0; ++n) {
      FailingMemory memory;
      all ? memory.failFrom(n) : memory.failOnce(n);
      setListenerNames(logger, "a b");
      failures = memory.failures();
      memory.failNone();
      const std::string listeners = listenersOf(logger);
      for (const char *name : {"a", "b"}) {
        EXPECT_EQ(exists(name), listeners.find(name) != std::string::npos) << listeners << n;
      }
    }
    EXPECT_EQ(listenersOf(logger), "a|b|");
  }
}

}  // namespace
