#include "QlxLogManager.h"

#include <random>

#include "support/ConfigTest.h"
#include "support/FailingMemory.h"

namespace {

class LogManagerTest : public ConfigTest {
 protected:
  // The parent's name by the rule, which also stores it.
  static std::string computeParentName(const Config &cfg) {
    const ApiLock lock;
    return take(qlxLogMgrGetParentConfigName(cfg.get()));
  }

  static void add(const Config &cfg) { QlxLogMgrAddCfg(cfg.get()); }

  static uint8_t addFromFile(const char *name, const char *key, const char *value) {
    const ApiLock lock;
    return qlxLogMgrAddCfgFromFile(name, key, value);
  }
};

// ---- Get and Has

TEST_F(LogManagerTest, MakesAndRegistersWhatIsAskedForAndUnknown) {
  EXPECT_EQ(QlxLogMgrHasCfg("x.y"), 0);
  const Config cfg = registered("x.y");
  EXPECT_EQ(take(QlxObjCfgGetName(cfg.get())), "x.y");
  EXPECT_EQ(parentNameOf(cfg), "<null>");
  EXPECT_EQ(QlxLogMgrHasCfg("x.y"), 1);
  EXPECT_EQ(QlxLogMgrHasCfg("x"), 0);
  EXPECT_EQ(QlxObjCfgIsFromFile(cfg.get()), 0);
}

TEST_F(LogManagerTest, HandsOutTheSameOneAgainAsACountedReference) {
  const Config cfg = registered("a");
  EXPECT_EQ(cfg->refCount, 2u);
  const Config again = registered("a");
  EXPECT_EQ(cfg, again);
  EXPECT_EQ(cfg->refCount, 3u);
}

TEST_F(LogManagerTest, HasNoRootAndMakesNone) {
  const std::string before = configNames();
  EXPECT_EQ(QlxLogMgrGetCfg("/"), nullptr);
  EXPECT_EQ(QlxLogMgrHasCfg("/"), 0);
  add(make("/"));
  EXPECT_EQ(QlxLogMgrHasCfg("/"), 0);
  EXPECT_EQ(configNames(), before);
}

TEST_F(LogManagerTest, HasNothingUnderNull) {
  EXPECT_EQ(QlxLogMgrGetCfg(nullptr), nullptr);
  EXPECT_EQ(QlxLogMgrHasCfg(nullptr), 0);
}

TEST_F(LogManagerTest, TellsNamesApartByCase) {
  const Config lower = registered("a"), upper = registered("A");
  EXPECT_NE(lower, upper);
}

TEST_F(LogManagerTest, ListsTheNamesInTheOrderOfRegistration) {
  const std::string before = configNames();
  const Config b = registered("b"), a = registered("a"), c = registered("b");
  EXPECT_EQ(configNames(), before + "b|a|");
  QlxLogMgrRemCfg(b.get());
  EXPECT_EQ(configNames(), before + "a|");
  add(b);
  EXPECT_EQ(configNames(), before + "a|b|");
}

// ---- Parent names

TEST_F(LogManagerTest, TheNearestRegisteredPrefixIsTheParent) {
  const Config a = registered("a"), cfg = make("a.b.c");
  EXPECT_EQ(computeParentName(cfg), "a");
  const Config ab = registered("a.b"), other = make("a.b.d");
  EXPECT_EQ(computeParentName(other), "a.b");
}

TEST_F(LogManagerTest, WithoutARegisteredPrefixTheRootIsTheParent) {
  const Config cfg = make("a.b.c"), top = make("top");
  EXPECT_EQ(computeParentName(cfg), "/");
  EXPECT_EQ(computeParentName(top), "/");
  EXPECT_EQ(parentNameOf(cfg), "<null>");
}

TEST_F(LogManagerTest, AnExplicitParentNameIsTheAnswer) {
  const Config a = registered("a"), p = make("p"), cfg = make("a.b");
  QlxObjCfgSetParent(cfg.get(), p.get());
  EXPECT_EQ(computeParentName(cfg), "p");
}

TEST_F(LogManagerTest, AParentIsStoredOnceAndForAll) {
  const Config a = registered("a"), cfg = make("a.b.c");
  EXPECT_EQ(computeParentName(cfg), "a");
  EXPECT_EQ(parentNameOf(cfg), "a");
  EXPECT_EQ(childrenOf(a), "");  // the name only
  const Config ab = registered("a.b");
  EXPECT_EQ(computeParentName(cfg), "a");
}

TEST_F(LogManagerTest, NullHasNoParentName) {
  const ApiLock lock;
  EXPECT_EQ(qlxLogMgrGetParentConfigName(nullptr), nullptr);
}

// ---- Add

TEST_F(LogManagerTest, AddsAChainFromTheTop) {
  const Config a = registered("a"), ab = registered("a.b"), abc = registered("a.b.c");
  EXPECT_EQ(parentNameOf(a), "<null>");
  EXPECT_EQ(parentNameOf(ab), "a");
  EXPECT_EQ(parentNameOf(abc), "a.b");
  EXPECT_EQ(childrenOf(a), "a.b|");
  EXPECT_EQ(childrenOf(ab), "a.b.c|");
}

TEST_F(LogManagerTest, OneAddedBetweenLaterLeavesTheOthersLinked) {
  const Config a = registered("a"), abc = registered("a.b.c"), ab = registered("a.b");
  EXPECT_EQ(parentNameOf(abc), "a");
  EXPECT_EQ(parentNameOf(ab), "a");
  EXPECT_EQ(childrenOf(a), "a.b.c|a.b|");
  EXPECT_EQ(childrenOf(ab), "");
}

TEST_F(LogManagerTest, OneAddedBeforeItsPrefixGetsTheParentWhenThatIsNextComputed) {
  const Config abc = registered("a.b.c"), a = registered("a");
  QlxSetObjCfgProp(a.get(), "key", "value");
  EXPECT_EQ(parentNameOf(abc), "<null>");
  EXPECT_EQ(childrenOf(a), "");
  EXPECT_EQ(inherited(abc, "key"), "<null>");
  EXPECT_EQ(computeParentName(abc), "a");
  EXPECT_EQ(inherited(abc, "key"), "value");
}

TEST_F(LogManagerTest, AddsAConfigurationOfTheHostsOnceAndHoldsAReference) {
  const Config first = make("a"), second = make("a");
  add(first);
  EXPECT_EQ(first->refCount, 2u);
  add(first);
  EXPECT_EQ(first->refCount, 2u);
  add(second);
  EXPECT_EQ(second->refCount, 1u);
  EXPECT_EQ(registered("a"), first);
}

TEST_F(LogManagerTest, MakesAMissingParentThatTheHostNamed) {
  const Config cfg = make("a"), p = make("p");
  QlxObjCfgSetParent(cfg.get(), p.get());
  add(cfg);
  EXPECT_EQ(QlxLogMgrHasCfg("p"), 1);
  EXPECT_EQ(childrenOf(registered("p")), "a|");
}

TEST_F(LogManagerTest, MovesTheSiblingsWhoseParentWasChangedMeanwhileAndNoOther) {
  const Config p = registered("p"), other = registered("other");
  const Config one = registered("p.1"), two = registered("p.2"), three = registered("p.3"),
               four = registered("p.4");
  for (const Config *moved : {&two, &three}) QlxObjCfgSetParent(moved->get(), other.get());
  const Config late = registered("p.late");
  EXPECT_EQ(childrenOf(p), "p.1|p.4|p.late|");
  EXPECT_EQ(childrenOf(late), "p.2|p.3|");
  EXPECT_EQ(parentNameOf(two), "p.late");
  EXPECT_EQ(parentNameOf(three), "p.late");
  EXPECT_EQ(parentNameOf(four), "p");
}

TEST_F(LogManagerTest, MovesASiblingThatTheHostPutThereByItself) {
  const Config p = registered("p"), one = registered("p.1"), other = registered("other");
  const Config stray = registered("stray");
  link(p, stray);
  QlxObjCfgSetParent(stray.get(), other.get());
  const Config late = registered("p.late");
  EXPECT_EQ(childrenOf(p), "p.1|p.late|");
  EXPECT_EQ(childrenOf(late), "stray|");
}

TEST_F(LogManagerTest, MakesASiblingAnewThatIsNotRegisteredAnyMore) {
  const Config p = registered("p"), one = registered("p.1");
  link(p, make("p.ghost"));
  const Config late = registered("p.late");
  EXPECT_EQ(QlxLogMgrHasCfg("p.ghost"), 1);
}

// Making "b.p" walks the children of "b"; making the one that is missing there moves the asker,
// whose parent name is the one that was asked for.
TEST_F(LogManagerTest, MakesAMissingParentWhoseChildGetsAnotherOneMeanwhile) {
  const Config a = registered("a"), b = registered("b"), asker = registered("c");
  const Config missing = make("a.x"), named = make("b.p");
  link(a, asker);
  link(b, missing);
  QlxObjCfgSetParent(asker.get(), named.get());
  const Config parent{QlxObjCfgGetParent(asker.get())};
  ASSERT_NE(parent, nullptr);
  EXPECT_STREQ(parent->name, "b.p");
  EXPECT_EQ(parentNameOf(asker), "a.x");
}

// Random changes by a small host, once as it is and once with every child looked at each time: the
// configurations must be linked alike.
class LinkingTest : public LogManagerTest {
 protected:
  static constexpr const char *kNames[] = {"a", "a.b", "a.c", "a.b.d", "a.b.e", "a.f", "g", "g.h"};

  std::string linkedAfter(uint32_t seed, bool forget) {
    QlxCloseToolkit();
    QlxOpenToolkit(nullptr, nullptr);
    std::vector<Config> held;
    for (const char *name : kNames) held.push_back(make(name));
    std::mt19937 random(seed);
    for (int step = 0; step < 60; ++step) {
      for (const char *name : kNames) {
        if (forget && QlxLogMgrHasCfg(name)) registered(name)->childrenLinked = 0;
      }
      change(held, random);
    }
    std::string state = configNames();
    for (const Config &cfg : held) state += stateOf(cfg);
    for (const char *name : kNames) {
      if (QlxLogMgrHasCfg(name)) state += stateOf(registered(name));
    }
    return state;
  }

 private:
  static std::string stateOf(const Config &cfg) {
    return "\n" + std::string(cfg->name) + " " + std::to_string(cfg->refCount) + " < " +
           parentNameOf(cfg) + ": " + childrenOf(cfg);
  }

  static void change(const std::vector<Config> &held, std::mt19937 &random) {
    const Config &cfg = held[random() % held.size()], &other = held[random() % held.size()];
    switch (random() % 10) {
      case 0:
        return QlxLogMgrRemCfg(cfg.get());
      case 1:
        return QlxLogMgrUpdateCfg(cfg.get());
      case 2:
        return QlxObjCfgSetParent(cfg.get(), other.get());
      case 3:
        return QlxObjCfgAddChild(cfg.get(), other.get());
      case 4:
        return QlxObjCfgRemChild(cfg.get(), other.get());
      default:
        return QlxLogMgrAddCfg(cfg.get());
    }
  }
};

TEST_F(LinkingTest, IsTheSameWhetherOrNotEveryChildIsLookedAt) {
  for (uint32_t seed = 1; seed <= 500; ++seed) {
    ASSERT_EQ(linkedAfter(seed, false), linkedAfter(seed, true)) << seed;
  }
}

TEST_F(LogManagerTest, OneThatNamesItselfAsParentIsAddedWithoutOne) {
  const Config cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), cfg.get());
  add(cfg);
  EXPECT_EQ(childrenOf(cfg), "");
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 1);
}

TEST_F(LogManagerTest, TwoThatNameEachOtherAreBothAdded) {
  const Config a = make("a"), b = make("b");
  QlxObjCfgSetParent(a.get(), b.get());
  QlxObjCfgSetParent(b.get(), a.get());
  add(a);
  add(b);
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 1);
  EXPECT_EQ(QlxLogMgrHasCfg("b"), 1);
}

// ---- Remove

TEST_F(LogManagerTest, RemovingMovesTheChildrenToTheParent) {
  const Config a = registered("a"), ab = registered("a.b"), abc = registered("a.b.c");
  QlxLogMgrRemCfg(ab.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a.b"), 0);
  EXPECT_EQ(parentNameOf(abc), "a");
  EXPECT_EQ(childrenOf(a), "a.b.c|");
  EXPECT_EQ(childrenOf(ab), "");
}

TEST_F(LogManagerTest, RemovingMovesEveryOneOfManyChildren) {
  const Config a = registered("a"), ab = registered("a.b");
  const Config c = registered("a.b.c"), d = registered("a.b.d"), e = registered("a.b.e");
  QlxLogMgrRemCfg(ab.get());
  EXPECT_EQ(childrenOf(a), "a.b.c|a.b.d|a.b.e|");
  for (const Config *moved : {&c, &d, &e}) EXPECT_EQ(parentNameOf(*moved), "a");
}

TEST_F(LogManagerTest, RemovingATopLevelOneMovesNothing) {
  const Config a = registered("a"), ab = registered("a.b");
  QlxLogMgrRemCfg(a.get());
  EXPECT_EQ(parentNameOf(ab), "a");
  EXPECT_EQ(childrenOf(a), "a.b|");
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(QlxLogMgrHasCfg("a.b"), 1);
}

TEST_F(LogManagerTest, RemovingOneWithoutAStoredParentMovesTheChildrenToTheNearestPrefix) {
  const Config abc = registered("a.b.c"), abcd = registered("a.b.c.d"), a = registered("a");
  EXPECT_EQ(parentNameOf(abc), "<null>");
  QlxLogMgrRemCfg(abc.get());
  EXPECT_EQ(parentNameOf(abc), "a");
  EXPECT_EQ(parentNameOf(abcd), "a");
  EXPECT_EQ(childrenOf(a), "a.b.c.d|");
  EXPECT_EQ(childrenOf(abc), "");
}

TEST_F(LogManagerTest, RemovingOneThatNamesItselfMakesNoNamesakeAndMovesNothing) {
  const Config a = registered("a"), ab = registered("a.b");
  QlxObjCfgSetParent(a.get(), a.get());
  QlxLogMgrRemCfg(a.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(parentNameOf(ab), "a");
  EXPECT_EQ(childrenOf(a), "a.b|");
}

TEST_F(LogManagerTest, RemovingOneThatIsItsOwnChildMakesNoNamesake) {
  const Config p = registered("p"), a = registered("a"), child = registered("c");
  link(a, a);
  link(a, child);
  QlxObjCfgSetParent(a.get(), p.get());
  QlxLogMgrRemCfg(a.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(childrenOf(p), "c|");
}

// Making the missing parent walks the children of "q", where the one that goes is listed.
TEST_F(LogManagerTest, RemovingOneWhoseMissingParentIsMadeMeanwhileMakesNoNamesake) {
  const std::string before = configNames();
  const Config q = registered("q"), a = registered("a"), missing = make("q.p");
  link(q, a);
  QlxObjCfgSetParent(a.get(), missing.get());
  QlxLogMgrRemCfg(a.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(configNames(), before + "q|q.p|");
  EXPECT_EQ(childrenOf(q), "q.p|");
  EXPECT_EQ(childrenOf(registered("q.p")), "");
}

// Making the missing child walks the children of "q" likewise.
TEST_F(LogManagerTest, RemovingOneWhoseMissingChildIsMadeMeanwhileMakesNoNamesake) {
  const std::string before = configNames();
  const Config p = registered("p"), q = registered("q"), a = registered("a"), missing = make("q.c");
  link(q, a);
  link(p, a);
  link(a, missing);
  QlxLogMgrRemCfg(a.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(configNames(), before + "p|q|q.c|");
}

TEST_F(LogManagerTest, RemovingReleasesTheRegistrysReference) {
  const Config cfg = registered("a");
  QlxLogMgrRemCfg(cfg.get());
  EXPECT_EQ(cfg->refCount, 1u);
  QlxLogMgrRemCfg(cfg.get());  // not registered any more
  EXPECT_EQ(cfg->refCount, 1u);
}

TEST_F(LogManagerTest, RemovesOneThatOnlyTheRegistryHolds) {
  Config cfg = registered("x.y");
  ObjCfg *borrowed = cfg.get();
  cfg.reset();
  QlxLogMgrRemCfg(borrowed);
  EXPECT_EQ(QlxLogMgrHasCfg("x.y"), 0);
}

TEST_F(LogManagerTest, RemovingTellsNoObject) {
  configure("h", "logging", "off");
  const Handle object = get("h", HostClasses::kHandler);
  host->calls.clear();
  QlxLogMgrRemCfg(registered("h").get());
  EXPECT_EQ(host->takeCalls(), "");
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "logging", nullptr)), "off");
}

TEST_F(LogManagerTest, RemovingOneOfTwoThatNameEachOtherEnds) {
  const Config a = registered("a"), b = registered("b");
  link(a, b);
  link(b, a);
  QlxLogMgrRemCfg(a.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(QlxLogMgrHasCfg("b"), 1);
  EXPECT_EQ(take(QlxGetObjCfgProp(b.get(), "key", nullptr)), "<null>");
}

// ---- Update

TEST_F(LogManagerTest, UpdatingLinksAnewAfterTheParentChanged) {
  const Config a = registered("a"), p = registered("p"), ab = registered("a.b");
  QlxObjCfgSetParent(ab.get(), p.get());
  QlxLogMgrUpdateCfg(ab.get());
  EXPECT_EQ(childrenOf(p), "a.b|");
  EXPECT_EQ(parentNameOf(ab), "p");
  EXPECT_EQ(QlxLogMgrHasCfg("a.b"), 1);
  EXPECT_EQ(ab->refCount, 2u);
}

TEST_F(LogManagerTest, UpdatingMovesTheChildrenToTheParent) {
  const Config a = registered("a"), ab = registered("a.b"), abc = registered("a.b.c");
  QlxLogMgrUpdateCfg(ab.get());
  EXPECT_EQ(childrenOf(a), "a.b.c|a.b|");
  EXPECT_EQ(parentNameOf(abc), "a");
}

TEST_F(LogManagerTest, UpdatingKeepsTheOneWhoseMissingParentIsMadeMeanwhile) {
  const Config q = registered("q"), a = registered("a"), missing = make("q.p");
  link(q, a);
  QlxObjCfgSetParent(a.get(), missing.get());
  QlxLogMgrUpdateCfg(a.get());
  EXPECT_EQ(registered("a"), a);
}

TEST_F(LogManagerTest, UpdatesOneThatOnlyTheRegistryHolds) {
  Config cfg = registered("a");
  ObjCfg *borrowed = cfg.get();
  cfg.reset();
  QlxLogMgrUpdateCfg(borrowed);
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 1);
  EXPECT_EQ(registered("a").get(), borrowed);
}

TEST_F(LogManagerTest, UpdatesNothingThatIsNotRegistered) {
  const Config cfg = make("a");
  QlxLogMgrUpdateCfg(cfg.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
}

// ---- Apply

TEST_F(LogManagerTest, AppliesAncestorsFirstSoThatTheNearestValueStays) {
  const Handle object = get("object", HostClasses::kHandler);
  configure("a", "x", "of a");
  configure("a", "y", "of a");
  configure("a.b", "y", "of a.b");
  configure("a.b", "z", "of a.b");
  host->calls.clear();
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "a.b"), 1);
  EXPECT_EQ(host->takeCalls(), "change object=x|change object=y|change object=y|change object=z|");
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "x", nullptr)), "of a");
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "y", nullptr)), "of a.b");
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "z", nullptr)), "of a.b");
}

TEST_F(LogManagerTest, ApplyingComputesTheParent) {
  const Handle object = get("object", HostClasses::kHandler);
  configure("a.b.c", "x", "1");
  configure("a", "y", "2");  // after its descendant
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "a.b.c"), 1);
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "y", nullptr)), "2");
  EXPECT_EQ(parentNameOf(registered("a.b.c")), "a");
}

TEST_F(LogManagerTest, ApplyingMakesAnUnknownConfiguration) {
  const Handle object = get("object", HostClasses::kHandler);
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "unknown"), 1);
  EXPECT_EQ(QlxLogMgrHasCfg("unknown"), 1);
}

TEST_F(LogManagerTest, AppliesNothingToNullAndNothingOfTheRoot) {
  const Handle object = get("object", HostClasses::kHandler);
  EXPECT_EQ(QlxLogMgrApplyCfg(nullptr, "unknown"), 0);
  EXPECT_EQ(QlxLogMgrHasCfg("unknown"), 0);
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "/"), 0);
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), nullptr), 0);
}

TEST_F(LogManagerTest, GivesBackWhatItApplied) {
  const Handle object = get("object", HostClasses::kHandler);
  const Config a = registered("a"), ab = registered("a.b");
  const uint32_t counts[] = {a->refCount, ab->refCount};
  QlxLogMgrApplyCfg(object.get(), "a.b");
  EXPECT_EQ(a->refCount, counts[0]);
  EXPECT_EQ(ab->refCount, counts[1]);
}

TEST_F(LogManagerTest, AppliesEachOnceWhereAParentChainComesBack) {
  const Handle object = get("object", HostClasses::kHandler);
  const Config a = registered("a"), b = registered("b"), c = registered("c");
  QlxObjCfgSetParent(a.get(), b.get());
  QlxObjCfgSetParent(b.get(), c.get());
  QlxObjCfgSetParent(c.get(), b.get());
  for (const char *name : {"a", "b", "c"}) configure(name, name, "1");
  host->calls.clear();
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "a"), 1);
  EXPECT_EQ(host->takeCalls(), "change object=c|change object=b|change object=a|");

  QlxObjCfgSetParent(c.get(), c.get());
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "c"), 1);
  EXPECT_EQ(host->takeCalls(), "change object=c|");
}

TEST_F(LogManagerTest, AppliesALongChainOfAncestors) {
  const Handle object = get("object", HostClasses::kHandler);
  std::string name = "n", expected;
  for (int i = 0; i < 50; ++i, name += ".n") {
    configure(name.c_str(), std::to_string(i).c_str(), "1");
    expected += "change object=" + std::to_string(i) + "|";
  }
  host->calls.clear();
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), name.substr(0, name.size() - 2).c_str()), 1);
  EXPECT_EQ(host->takeCalls(), expected);
}

TEST_F(LogManagerTest, AClassMayChangeTheConfigurationThatIsBeingApplied) {
  const Handle object = get("object", HostClasses::kHandler);
  configure("a", "x", "old");
  configure("a", "y", "old");
  host->onChange = [](QlxObject *, const char *) {
    const ObjCfgRef cfg{qlxIntlLogMgrGetCfg("a")};
    qlxIntlSetObjCfgProp(cfg.get(), "x", "new");
    qlxIntlSetObjCfgProp(cfg.get(), "y", "new");
    qlxIntlLogMgrRemCfg(cfg.get());
  };
  EXPECT_EQ(QlxLogMgrApplyCfg(object.get(), "a"), 1);
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "x", nullptr)), "old");
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "y", nullptr)), "new");
}

// ---- From a file

TEST_F(LogManagerTest, TakesPairsFromAFile) {
  EXPECT_EQ(addFromFile("f", "key", "value"), 1);
  EXPECT_EQ(addFromFile("f", "empty", ""), 1);
  const Config cfg = registered("f");
  EXPECT_EQ(propertiesOf(cfg), "key=value|empty=|");
  EXPECT_EQ(QlxObjCfgIsFromFile(cfg.get()), 1);
  EXPECT_EQ(cfg->refCount, 2u);
}

TEST_F(LogManagerTest, MarksOnlyTheOnesThatAFileMade) {
  const Config cfg = registered("f");
  EXPECT_EQ(addFromFile("f", "key", "value"), 1);
  EXPECT_EQ(QlxObjCfgIsFromFile(cfg.get()), 0);
}

TEST_F(LogManagerTest, RefusesAFilesPairWithoutNames) {
  const std::string before = configNames();
  EXPECT_EQ(addFromFile(nullptr, "key", "value"), 0);
  EXPECT_EQ(addFromFile("f", nullptr, "value"), 0);
  EXPECT_EQ(addFromFile("f", "key", nullptr), 0);
  EXPECT_EQ(addFromFile("", "key", "value"), 0);
  EXPECT_EQ(addFromFile("f", "", "value"), 0);
  EXPECT_EQ(addFromFile("/", "key", "value"), 0);
  EXPECT_EQ(configNames(), before);
}

// ---- Life

TEST_F(LogManagerTest, IsEmptyAndTakesNothingWhileTheToolkitIsClosed) {
  QlxCloseToolkit();
  const Config cfg = make("a");
  add(cfg);
  QlxLogMgrUpdateCfg(cfg.get());
  QlxLogMgrRemCfg(cfg.get());
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(QlxLogMgrGetCfg("a"), nullptr);
  EXPECT_EQ(QlxLogMgrConfigNames(), nullptr);
  EXPECT_EQ(addFromFile("f", "key", "value"), 0);
  EXPECT_EQ(computeParentName(make("a.b")), "/");
}

TEST_F(LogManagerTest, AHeldConfigurationOutlivesTheToolkit) {
  const Config a = registered("a"), ab = registered("a.b");
  QlxSetObjCfgProp(a.get(), "key", "value");
  QlxCloseToolkit();
  EXPECT_EQ(a->refCount, 1u);
  EXPECT_EQ(inherited(a, "key"), "value");
  EXPECT_EQ(inherited(ab, "key"), "<null>");
  EXPECT_EQ(QlxObjCfgGetParent(ab.get()), nullptr);
}

TEST_F(LogManagerTest, ForgetsEverythingWhenTheToolkitIsClosed) {
  configure("a", "key", "value");
  QlxCloseToolkit();
  QlxOpenToolkit(nullptr, nullptr);
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
}

TEST_F(LogManagerTest, StaysClosedWhenMemoryForItRanOut) {
  QlxCloseToolkit();
  const ApiLock lock;
  FailingMemory memory;
  for (uint64_t n = 1; n <= 2; ++n) {
    memory.failOnce(n);
    qlxInitLogMgr();
    EXPECT_EQ(memory.failures(), 1u);
    EXPECT_EQ(qlxIntlLogMgrGetCfg("a"), nullptr);
  }
  EXPECT_EQ(memory.live(), 0);
}

// With each of its allocations failing in turn, and then all from there on.
TEST_F(LogManagerTest, LosesNothingAndHandsOutOnlyWhatIsRegisteredWhenMemoryRanOut) {
  const Handle object = get("object", HostClasses::kHandler);
  for (const bool all : {false, true}) {
    uint64_t failures = 1;
    for (uint64_t n = 1; failures > 0; ++n) {
      configure("m", "key", "value");
      FailingMemory memory;
      all ? memory.failFrom(n) : memory.failOnce(n);
      for (const char *name : {"m.a", "m.a.b", "m.c", "m.a.b.c"}) {
        const Config cfg = registered(name);
        EXPECT_EQ(QlxLogMgrHasCfg(name), cfg != nullptr) << name << n;
        QlxLogMgrUpdateCfg(cfg.get());
      }
      QlxLogMgrRemCfg(registered("m.a").get());
      addFromFile("m.d", "key", "value");
      QlxLogMgrApplyCfg(object.get(), "m.a.b.c");
      failures = memory.failures();
      for (const char *name : {"m.a", "m.a.b", "m.c", "m.a.b.c", "m.d", "m"}) {
        QlxLogMgrRemCfg(registered(name).get());
      }
    }
  }
}

}  // namespace
