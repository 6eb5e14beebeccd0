#include "support/ConfigTest.h"
#include "support/FailingMemory.h"

namespace {

class ObjConfigTest : public ConfigTest {};

// ---- The record

TEST_F(ObjConfigTest, IsMadeWithItsNameAndNothingElse) {
  const Config cfg = make("a.b");
  EXPECT_EQ(take(QlxObjCfgGetName(cfg.get())), "a.b");
  EXPECT_EQ(cfg->refCount, 1u);
  EXPECT_EQ(cfg->parentName, nullptr);
  EXPECT_EQ(QlxObjCfgChildrenNames(cfg.get()), nullptr);
  EXPECT_EQ(QlxObjCfgProperties(cfg.get()), nullptr);
  EXPECT_EQ(QlxObjCfgIsFromFile(cfg.get()), 0);
}

TEST_F(ObjConfigTest, IsNotRegisteredWhenMade) {
  const Config cfg = make("a");
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
}

TEST_F(ObjConfigTest, CopiesItsNameAndHandsOutCopies) {
  char name[] = "a";
  const Config cfg = make(name);
  name[0] = 'b';
  char *copy = QlxObjCfgGetName(cfg.get());
  EXPECT_STREQ(copy, "a");
  EXPECT_NE(copy, cfg->name);
  OslMemoryFree(copy);
}

TEST_F(ObjConfigTest, IsNotMadeWithoutAName) {
  EXPECT_EQ(QlxAllocObjCfg(nullptr), nullptr);
}

TEST_F(ObjConfigTest, IsNotMadeWhenMemoryRanOut) {
  FailingMemory memory;
  for (uint64_t n = 1; n <= 2; ++n) {
    memory.failOnce(n);
    EXPECT_EQ(QlxAllocObjCfg("a"), nullptr);
    EXPECT_EQ(memory.failures(), 1u);
  }
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(ObjConfigTest, CountsItsReferencesAndGoesWithTheLast) {
  const FailingMemory memory;
  ObjCfg *cfg = QlxAllocObjCfg("a");
  EXPECT_EQ(QlxAcquireObjCfg(cfg), cfg);
  EXPECT_EQ(cfg->refCount, 2u);
  QlxReleaseObjCfg(cfg);
  EXPECT_EQ(cfg->refCount, 1u);
  EXPECT_GT(memory.live(), 0);
  QlxReleaseObjCfg(cfg);
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(ObjConfigTest, FreesAllItHoldsWithTheLastReference) {
  const Config child = make("a.b"), parent = make("p");
  const FailingMemory memory;
  ObjCfg *cfg = QlxAllocObjCfg("a");
  QlxObjCfgAddChild(cfg, child.get());  // the child's parent name is the child's block
  QlxObjCfgSetParent(cfg, parent.get());
  QlxSetObjCfgProp(cfg, "key", "value");
  QlxReleaseObjCfg(cfg);
  EXPECT_EQ(memory.live(), 1);
}

TEST_F(ObjConfigTest, RemembersThatItCameFromAFile) {
  const Config cfg = make("a");
  QlxObjCfgSetFromFile(cfg.get(), 1);
  EXPECT_EQ(QlxObjCfgIsFromFile(cfg.get()), 1);
  QlxObjCfgSetFromFile(cfg.get(), 0);
  EXPECT_EQ(QlxObjCfgIsFromFile(cfg.get()), 0);
}

// ---- Parents and children

TEST_F(ObjConfigTest, HasNoParentWithoutAParentName) {
  const Config cfg = registered("a");
  EXPECT_EQ(QlxObjCfgGetParent(cfg.get()), nullptr);
}

TEST_F(ObjConfigTest, HandsOutItsParentAsACountedReference) {
  const Config parent = registered("p"), cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), parent.get());
  EXPECT_EQ(parent->refCount, 2u);
  const Config found{QlxObjCfgGetParent(cfg.get())};
  EXPECT_EQ(found, parent);
  EXPECT_EQ(parent->refCount, 3u);
}

TEST_F(ObjConfigTest, HasAMissingParentMade) {
  const Config unregistered = make("p"), cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), unregistered.get());
  const Config found{QlxObjCfgGetParent(cfg.get())};
  EXPECT_NE(found, unregistered);
  EXPECT_EQ(take(QlxObjCfgGetName(found.get())), "p");
  EXPECT_EQ(QlxLogMgrHasCfg("p"), 1);
}

TEST_F(ObjConfigTest, SettingAParentRecordsTheNameOnly) {
  const Config parent = make("p"), other = make("q"), cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), parent.get());
  EXPECT_STREQ(cfg->parentName, "p");
  EXPECT_EQ(childrenOf(parent), "");
  QlxObjCfgSetParent(cfg.get(), other.get());
  EXPECT_STREQ(cfg->parentName, "q");
}

TEST_F(ObjConfigTest, KeepsTheStringOfAParentSetAgain) {
  const Config parent = make("p"), cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), parent.get());
  const char *stored = cfg->parentName;
  QlxObjCfgSetParent(cfg.get(), parent.get());
  EXPECT_EQ(cfg->parentName, stored);
}

TEST_F(ObjConfigTest, KeepsItsParentWhenNullIsSet) {
  const Config parent = make("p"), cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), parent.get());
  QlxObjCfgSetParent(cfg.get(), nullptr);
  EXPECT_STREQ(cfg->parentName, "p");
}

TEST_F(ObjConfigTest, KeepsItsParentWhenMemoryRanOut) {
  const Config parent = make("p"), other = make("q"), cfg = make("a");
  QlxObjCfgSetParent(cfg.get(), parent.get());
  FailingMemory memory;
  memory.failOnce(1);
  QlxObjCfgSetParent(cfg.get(), other.get());
  EXPECT_STREQ(cfg->parentName, "p");
}

TEST_F(ObjConfigTest, AddsAChildOnceAndBecomesItsParent) {
  const Config cfg = make("a"), b = make("a.b"), c = make("c");
  link(cfg, b);
  link(cfg, c);
  link(cfg, b);
  EXPECT_EQ(childrenOf(cfg), "a.b|c|");
  EXPECT_STREQ(b->parentName, "a");
  EXPECT_STREQ(c->parentName, "a");
}

TEST_F(ObjConfigTest, ARemovedChildKeepsItsParentName) {
  const Config cfg = make("a"), b = make("a.b"), c = make("a.c");
  link(cfg, b);
  link(cfg, c);
  QlxObjCfgRemChild(cfg.get(), b.get());
  EXPECT_EQ(childrenOf(cfg), "a.c|");
  EXPECT_STREQ(b->parentName, "a");
}

TEST_F(ObjConfigTest, RemovesNoChildWhereThereIsNone) {
  const Config cfg = make("a"), b = make("a.b");
  QlxObjCfgRemChild(cfg.get(), b.get());
  EXPECT_EQ(childrenOf(cfg), "");
}

TEST_F(ObjConfigTest, GoesWithTheLastReferenceEvenWhileAParentListsIt) {
  const Config parent = make("a");
  const FailingMemory memory;
  Config child = make("a.b");
  link(parent, child);
  const int64_t before = memory.live();
  child.reset();
  EXPECT_LT(memory.live(), before);
  EXPECT_EQ(childrenOf(parent), "a.b|");
}

// ---- Properties

TEST_F(ObjConfigTest, KeepsPropertiesInTheOrderOfTheirFirstSetting) {
  const Config cfg = make("a");
  QlxSetObjCfgProp(cfg.get(), "x", "1");
  QlxSetObjCfgProp(cfg.get(), "y", "2");
  QlxSetObjCfgProp(cfg.get(), "x", "3");
  EXPECT_EQ(propertiesOf(cfg), "x=3|y=2|");
}

TEST_F(ObjConfigTest, SettingAPropertyTellsNobody) {
  configure("h", "logging", "on");
  const Handle object = get("h", HostClasses::kHandler);
  host->calls.clear();
  configure("h", "logging", "off");
  EXPECT_EQ(host->takeCalls(), "");
  EXPECT_EQ(take(QlxGetObjProp(object.get(), "logging", nullptr)), "on");
}

TEST_F(ObjConfigTest, AnswersWhetherItStored) {
  const Config cfg = make("a");
  EXPECT_EQ(QlxSetObjCfgProp(cfg.get(), "x", "1"), 1);
  EXPECT_EQ(QlxSetObjCfgProp(cfg.get(), nullptr, "1"), 0);
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(QlxSetObjCfgProp(cfg.get(), "y", "1"), 0);
  EXPECT_EQ(QlxSetObjCfgPropBool(cfg.get(), "y", 1), 0);
}

TEST_F(ObjConfigTest, FindsAKeyOfADistantAncestorThroughADirectLink) {
  const Config a = registered("a"), c = make("x.y.z");
  QlxSetObjCfgProp(a.get(), "key", "value");
  link(a, c);
  EXPECT_EQ(inherited(c, "key"), "value");
}

TEST_F(ObjConfigTest, FindsAKeyOfADistantAncestorThroughTheOneBetween) {
  const Config a = registered("a"), b = registered("a.b"), c = registered("a.b.c");
  QlxSetObjCfgProp(a.get(), "key", "value");
  EXPECT_STREQ(c->parentName, "a.b");
  EXPECT_EQ(inherited(c, "key"), "value");
  EXPECT_EQ(take(QlxGetObjCfgProp(c.get(), "key", nullptr)), "value");
}

TEST_F(ObjConfigTest, TheNearestOneThatHoldsTheKeyWins) {
  const Config a = registered("a"), b = registered("a.b"), c = registered("a.b.c");
  QlxSetObjCfgProp(a.get(), "key", "far");
  QlxSetObjCfgProp(b.get(), "key", "near");
  EXPECT_EQ(inherited(c, "key"), "near");
  QlxSetObjCfgProp(c.get(), "key", "own");
  EXPECT_EQ(inherited(c, "key"), "own");
}

TEST_F(ObjConfigTest, AnEmptyValueStopsTheSearch) {
  const Config a = registered("a"), b = registered("a.b");
  QlxSetObjCfgProp(a.get(), "key", "value");
  QlxSetObjCfgProp(b.get(), "key", "");
  uint8_t found = 0;
  EXPECT_EQ(take(QlxGetInheritedObjCfgProp(b.get(), "key", &found)), "");
  EXPECT_EQ(found, 1);
}

TEST_F(ObjConfigTest, TellsWhetherAValueCameBack) {
  const Config a = registered("a"), b = registered("a.b");
  QlxSetObjCfgProp(a.get(), "key", "value");
  for (const auto lookUp : {QlxGetInheritedObjCfgProp, QlxGetObjCfgProp}) {
    uint8_t found = 7;
    EXPECT_EQ(take(lookUp(b.get(), "key", &found)), "value");
    EXPECT_EQ(found, 1);
    EXPECT_EQ(take(lookUp(b.get(), "other", &found)), "<null>");
    EXPECT_EQ(found, 0);
  }
}

TEST_F(ObjConfigTest, FindsNothingForNull) {
  const Config a = registered("a");
  QlxSetObjCfgProp(a.get(), "key", "value");
  uint8_t found = 7;
  EXPECT_EQ(QlxGetInheritedObjCfgProp(nullptr, "key", &found), nullptr);
  EXPECT_EQ(found, 0);
  found = 7;
  EXPECT_EQ(QlxGetInheritedObjCfgProp(a.get(), nullptr, &found), nullptr);
  EXPECT_EQ(found, 0);
}

TEST_F(ObjConfigTest, FindsNothingWhenMemoryRanOut) {
  const Config a = registered("a");
  QlxSetObjCfgProp(a.get(), "key", "value");
  FailingMemory memory;
  memory.failOnce(1);
  uint8_t found = 7;
  EXPECT_EQ(QlxGetObjCfgProp(a.get(), "key", &found), nullptr);
  EXPECT_EQ(found, 0);
}

TEST_F(ObjConfigTest, GivesBackTheParentsThatALookupFetched) {
  const Config a = registered("a"), b = registered("a.b"), c = registered("a.b.c");
  const uint32_t counts[] = {a->refCount, b->refCount, c->refCount};
  QlxSetObjCfgProp(a.get(), "key", "1");
  EXPECT_EQ(inherited(c, "key"), "1");
  EXPECT_EQ(inherited(c, "other"), "<null>");
  EXPECT_EQ(QlxGetObjCfgPropInt(c.get(), "key", nullptr), 1);
  EXPECT_EQ(a->refCount, counts[0]);
  EXPECT_EQ(b->refCount, counts[1]);
  EXPECT_EQ(c->refCount, counts[2]);
}

TEST_F(ObjConfigTest, ALookupMakesAMissingParentAnew) {
  Config a = registered("a");
  const Config b = registered("a.b");
  QlxSetObjCfgProp(a.get(), "key", "value");
  QlxLogMgrRemCfg(a.get());
  EXPECT_STREQ(b->parentName, "a");
  EXPECT_EQ(inherited(b, "key"), "<null>");
  const Config made = registered("a");
  EXPECT_NE(made, a);
  EXPECT_EQ(propertiesOf(made), "");
}

TEST_F(ObjConfigTest, ALookupEndsWhereAParentChainComesBack) {
  const Config a = registered("a"), b = registered("b"), c = registered("c"), d = registered("d");
  QlxObjCfgSetParent(a.get(), a.get());
  EXPECT_EQ(inherited(a, "key"), "<null>");
  QlxObjCfgSetParent(a.get(), b.get());
  QlxObjCfgSetParent(b.get(), c.get());
  QlxObjCfgSetParent(c.get(), b.get());
  QlxObjCfgSetParent(d.get(), a.get());
  for (const Config *cfg : {&a, &b, &c, &d}) EXPECT_EQ(inherited(*cfg, "key"), "<null>");
  QlxSetObjCfgProp(c.get(), "key", "value");
  for (const Config *cfg : {&a, &b, &c, &d}) EXPECT_EQ(inherited(*cfg, "key"), "value");
}

TEST_F(ObjConfigTest, ALookupEndsAtOneThatNamesItself) {
  const Config known = registered("a"), unregistered = make("a");
  QlxObjCfgSetParent(unregistered.get(), known.get());
  QlxSetObjCfgProp(known.get(), "key", "value");
  EXPECT_EQ(inherited(unregistered, "key"), "<null>");
  QlxSetObjCfgProp(unregistered.get(), "key", "own");
  EXPECT_EQ(inherited(unregistered, "key"), "own");
}

TEST_F(ObjConfigTest, OneThatNamesItselfMakesNoNamesake) {
  const Config cfg = make("a"), copy = make("a");
  QlxObjCfgSetParent(cfg.get(), copy.get());
  EXPECT_EQ(inherited(cfg, "key"), "<null>");
  EXPECT_EQ(QlxGetObjCfgPropInt(cfg.get(), "key", nullptr), 0);
  EXPECT_EQ(QlxObjCfgGetParent(cfg.get()), nullptr);
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  const Config known = registered("a");
  QlxObjCfgSetParent(known.get(), cfg.get());
  const Config parent{QlxObjCfgGetParent(known.get())};
  EXPECT_EQ(parent, known);
}

TEST_F(ObjConfigTest, AChainThatComesBackToAnUnregisteredOneMakesNoNamesake) {
  const Config a = make("a"), b = registered("b"), c = registered("c");
  QlxObjCfgSetParent(a.get(), b.get());
  QlxObjCfgSetParent(b.get(), c.get());
  QlxObjCfgSetParent(c.get(), a.get());
  EXPECT_EQ(inherited(a, "key"), "<null>");
  EXPECT_EQ(QlxLogMgrHasCfg("a"), 0);
  EXPECT_EQ(configNames().find("|a|"), std::string::npos);
}

// ---- The typed family

TEST_F(ObjConfigTest, WritesTypedValuesAsTheirTexts) {
  const Config cfg = make("a");
  EXPECT_EQ(QlxSetObjCfgPropBool(cfg.get(), "yes", 1), 1);
  EXPECT_EQ(QlxSetObjCfgPropBool(cfg.get(), "no", 0), 1);
  EXPECT_EQ(QlxSetObjCfgPropBool(cfg.get(), "two", 2), 1);
  QlxSetObjCfgPropInt(cfg.get(), "int", -5);
  EXPECT_EQ(propertiesOf(cfg), "yes=true|no=false|two=false|int=-5|");
}

TEST_F(ObjConfigTest, ReadsTypedValuesOfAnAncestor) {
  const Config a = registered("a"), b = registered("a.b");
  QlxSetObjCfgPropBool(a.get(), "bool", 1);
  QlxSetObjCfgPropInt(a.get(), "int", INT32_MIN);
  QlxSetObjCfgProp(a.get(), "long", "-9223372036854775808");
  QlxSetObjCfgPropFloat(a.get(), "float", 0.5f);
  QlxSetObjCfgPropDouble(a.get(), "double", -0.25);
  uint8_t found[5] = {7, 7, 7, 7, 7};
  EXPECT_EQ(QlxGetObjCfgPropBool(b.get(), "bool", &found[0]), 1);
  EXPECT_EQ(QlxGetObjCfgPropInt(b.get(), "int", &found[1]), INT32_MIN);
  EXPECT_EQ(QlxGetObjCfgPropLong(b.get(), "long", &found[2]), INT64_MIN);
  EXPECT_EQ(QlxGetObjCfgPropFloat(b.get(), "float", &found[3]), 0.5f);
  EXPECT_EQ(QlxGetObjCfgPropDouble(b.get(), "double", &found[4]), -0.25);
  for (const uint8_t flag : found) EXPECT_EQ(flag, 1);
}

TEST_F(ObjConfigTest, WritesTheLowWordOfALong) {
  const Config cfg = make("a");
  QlxSetObjCfgPropLong(cfg.get(), "long", (int64_t{1} << 32) + 5);
  EXPECT_EQ(QlxGetObjCfgPropLong(cfg.get(), "long", nullptr), 5);
}

TEST_F(ObjConfigTest, AValueOfAnotherTypeCountsAsAbsent) {
  const Config a = registered("a"), b = registered("a.b");
  QlxSetObjCfgProp(a.get(), "key", "1");
  QlxSetObjCfgProp(b.get(), "key", "abc");  // found, and so the search stops
  uint8_t found[5] = {7, 7, 7, 7, 7};
  EXPECT_EQ(QlxGetObjCfgPropBool(b.get(), "key", &found[0]), 0);
  EXPECT_EQ(QlxGetObjCfgPropInt(b.get(), "key", &found[1]), 0);
  EXPECT_EQ(QlxGetObjCfgPropLong(b.get(), "key", &found[2]), 0);
  EXPECT_EQ(QlxGetObjCfgPropFloat(b.get(), "key", &found[3]), 0.0f);
  EXPECT_EQ(QlxGetObjCfgPropDouble(b.get(), "key", &found[4]), 0.0);
  for (const uint8_t flag : found) EXPECT_EQ(flag, 0);
}

TEST_F(ObjConfigTest, AMissingKeyHasNoTypedValue) {
  const Config cfg = make("a");
  uint8_t found = 7;
  EXPECT_EQ(QlxGetObjCfgPropInt(cfg.get(), "key", &found), 0);
  EXPECT_EQ(found, 0);
  found = 7;
  EXPECT_EQ(QlxGetObjCfgPropBool(nullptr, "key", &found), 0);
  EXPECT_EQ(found, 0);
  found = 7;
  EXPECT_EQ(QlxGetObjCfgPropDouble(cfg.get(), nullptr, &found), 0.0);
  EXPECT_EQ(found, 0);
}

TEST_F(ObjConfigTest, TypedReadsAllocateNothing) {
  const Config a = registered("a"), b = registered("a.b");
  QlxSetObjCfgProp(a.get(), "key", "1");
  const FailingMemory memory;
  EXPECT_EQ(QlxGetObjCfgPropInt(b.get(), "key", nullptr), 1);
  EXPECT_EQ(memory.attempts(), 0u);
}

}  // namespace
