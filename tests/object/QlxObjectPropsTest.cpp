#include <qlx/props.h>

#include "support/FailingMemory.h"
#include "support/HostTest.h"

namespace {

class ObjectPropsTest : public HostTest {
 protected:
  void SetUp() override {
    HostTest::SetUp();
    object = get("o", HostClasses::kLogger);
    host->calls.clear();
  }
  void TearDown() override {
    object.reset();
    HostTest::TearDown();
  }

  std::string text(const char *key) { return take(QlxGetObjProp(object.get(), key, nullptr)); }

  Handle object;
};

TEST_F(ObjectPropsTest, AValueIsStoredAsACopyAndReadAsACopy) {
  char value[] = "value";
  EXPECT_EQ(QlxSetObjProp(object.get(), "key", value), 1);
  value[0] = 'x';
  EXPECT_EQ(text("key"), "value");
  EXPECT_EQ(QlxSetObjProp(object.get(), "key", "other"), 1);
  EXPECT_EQ(text("key"), "other");
}

TEST_F(ObjectPropsTest, EveryTypeReadsWhatItWrote) {
  EXPECT_EQ(QlxSetObjPropBool(object.get(), "bool", 1), 1);
  QlxSetObjPropInt(object.get(), "int", INT32_MIN);
  QlxSetObjPropLong(object.get(), "long", 5);
  QlxSetObjPropFloat(object.get(), "float", 0.5f);
  QlxSetObjPropDouble(object.get(), "double", -0.25);
  uint8_t found[5] = {7, 7, 7, 7, 7};
  EXPECT_EQ(QlxGetObjPropBool(object.get(), "bool", &found[0]), 1);
  EXPECT_EQ(QlxGetObjPropInt(object.get(), "int", &found[1]), INT32_MIN);
  EXPECT_EQ(QlxGetObjPropLong(object.get(), "long", &found[2]), 5);
  EXPECT_EQ(QlxGetObjPropFloat(object.get(), "float", &found[3]), 0.5f);
  EXPECT_EQ(QlxGetObjPropDouble(object.get(), "double", &found[4]), -0.25);
  for (const uint8_t flag : found) EXPECT_EQ(flag, 1);
}

TEST_F(ObjectPropsTest, ReadsALongWithSixtyFourBitsAndWritesTheLowWord) {
  QlxSetObjProp(object.get(), "long", "9223372036854775807");
  EXPECT_EQ(QlxGetObjPropLong(object.get(), "long", nullptr), INT64_MAX);
  QlxSetObjPropLong(object.get(), "long", (int64_t{1} << 32) + 5);
  EXPECT_EQ(text("long"), "5");
}

TEST_F(ObjectPropsTest, OnlyOneIsTrue) {
  for (const uint8_t value : {0, 2, 255}) {
    EXPECT_EQ(QlxSetObjPropBool(object.get(), "bool", value), 1);
    EXPECT_EQ(text("bool"), "false");
  }
  QlxSetObjPropBool(object.get(), "bool", 1);
  EXPECT_EQ(text("bool"), "true");
}

TEST_F(ObjectPropsTest, AMissingKeyIsAbsentInEveryType) {
  uint8_t found[6] = {7, 7, 7, 7, 7, 7};
  EXPECT_EQ(QlxGetObjProp(object.get(), "key", &found[0]), nullptr);
  EXPECT_EQ(QlxGetObjPropBool(object.get(), "key", &found[1]), 0);
  EXPECT_EQ(QlxGetObjPropInt(object.get(), "key", &found[2]), 0);
  EXPECT_EQ(QlxGetObjPropLong(object.get(), "key", &found[3]), 0);
  EXPECT_EQ(QlxGetObjPropFloat(object.get(), "key", &found[4]), 0.0f);
  EXPECT_EQ(QlxGetObjPropDouble(object.get(), "key", &found[5]), 0.0);
  for (const uint8_t flag : found) EXPECT_EQ(flag, 0);
}

TEST_F(ObjectPropsTest, AValueOfAnotherTypeCountsAsAbsent) {
  QlxSetObjProp(object.get(), "maxFiles", "abc");
  uint8_t found = 7;
  EXPECT_EQ(QlxGetObjPropInt(object.get(), "maxFiles", &found), 0);
  EXPECT_EQ(found, 0);
}

TEST_F(ObjectPropsTest, ReadsItsOwnMapAndNotItsConfiguration) {
  configure("o", "key", "value");
  EXPECT_EQ(text("key"), "<null>");
  QlxLogMgrApplyCfg(object.get(), "o");
  EXPECT_EQ(text("key"), "value");
}

TEST_F(ObjectPropsTest, EverySetterTellsTheClassAfterItStored) {
  std::string seen;
  host->onChange = [&](QlxObject *changed, const char *key) {
    seen += take(qlxIntlGetObjProp(changed, key, nullptr)) + "|";
  };
  QlxSetObjProp(object.get(), "string", "s");
  QlxSetObjPropBool(object.get(), "bool", 1);
  QlxSetObjPropInt(object.get(), "int", 1);
  QlxSetObjPropLong(object.get(), "long", 2);
  QlxSetObjPropFloat(object.get(), "float", 0);
  QlxSetObjPropDouble(object.get(), "double", 0);
  EXPECT_EQ(host->takeCalls(),
            "change o=string|change o=bool|change o=int|change o=long|change o=float|"
            "change o=double|");
  EXPECT_EQ(seen.substr(0, 11), "s|true|1|2|");
}

TEST_F(ObjectPropsTest, TellsTheClassAlsoWhenStoringFailed) {
  EXPECT_EQ(QlxSetObjProp(object.get(), nullptr, "value"), 0);
  EXPECT_EQ(host->takeCalls(), "change o=<null>|");
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(QlxSetObjProp(object.get(), "key", "value"), 0);
  EXPECT_EQ(QlxSetObjPropBool(object.get(), "key", 1), 0);
  QlxSetObjPropInt(object.get(), "key", 1);
  EXPECT_EQ(host->takeCalls(), "change o=key|change o=key|change o=key|");
}

TEST_F(ObjectPropsTest, KeepsTheOldValueWhenMemoryRanOutForTheMap) {
  QlxSetObjProp(object.get(), "key", "value");
  FailingMemory memory;
  memory.failFrom(1);
  EXPECT_EQ(QlxSetObjProp(object.get(), "other", "value"), 0);
  memory.failNone();
  EXPECT_EQ(text("key"), "value");
}

TEST_F(ObjectPropsTest, AClassWithoutTheOperationGetsNoKey) {
  QlxAddLoggerClass("deaf", nullptr, nullptr, nullptr, nullptr, nullptr);
  const Handle deaf = get("d", "deaf");
  EXPECT_EQ(QlxSetObjProp(deaf.get(), "logging", "off"), 1);
  EXPECT_EQ(deaf->enabled, 1);
  EXPECT_EQ(take(QlxGetObjProp(deaf.get(), "logging", nullptr)), "off");
}

TEST_F(ObjectPropsTest, ANullObjectHasNothingAndTakesNothing) {
  uint8_t found = 7;
  EXPECT_EQ(QlxGetObjProp(nullptr, "key", &found), nullptr);
  EXPECT_EQ(found, 0);
  EXPECT_EQ(QlxSetObjProp(nullptr, "key", "value"), 0);
  EXPECT_EQ(QlxSetObjPropBool(nullptr, "key", 1), 0);
  const ApiLock lock;
  EXPECT_EQ(qlxFetchObjPropMap(nullptr), nullptr);
  qlxNotifyObjCfgChange(nullptr, "key");
}

TEST_F(ObjectPropsTest, TheMapIsMadeOnFirstUseOnly) {
  EXPECT_EQ(text("key"), "<null>");
  EXPECT_EQ(object->props, nullptr);
  const ApiLock lock;
  StringToStringMap *map = qlxFetchObjPropMap(object.get());
  ASSERT_NE(map, nullptr);
  EXPECT_EQ(object->props, map);
  EXPECT_EQ(qlxFetchObjPropMap(object.get()), map);
}

TEST_F(ObjectPropsTest, ADisabledObjectStillAcceptsConfiguration) {
  QlxSetObjectEnabled(object.get(), 0);
  EXPECT_EQ(QlxSetObjProp(object.get(), "logging", "on"), 1);
  EXPECT_EQ(QlxIsObjectEnabled(object.get()), 1);
}

TEST_F(ObjectPropsTest, AClassMaySetFurtherPropertiesWhenToldOfOne) {
  host->onChange = [](QlxObject *changed, const char *key) {
    if (std::string(key) == "first") qlxIntlSetObjProp(changed, "second", "2");
  };
  QlxSetObjProp(object.get(), "first", "1");
  EXPECT_EQ(text("second"), "2");
}

}  // namespace
