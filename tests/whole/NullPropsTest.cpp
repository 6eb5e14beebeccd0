// Null arguments of properties and configurations: property lists, parameters, typed values of maps
// and of configurations, the log manager.
#include <qlx/class.h>
#include <qlx/qlx.h>

#include "support/NullCalls.h"
#include "support/OpenToolkit.h"
#include "support/TempDir.h"

namespace {

NULL_GROUP(PropertyLists) {
  const TempDir dir;
  const std::string path = dir.path("file");
  dir.write("file", "key=value\n");
  CxPropList list{};
  CxStatus status = kSuccess;
  const auto cannotOpen = [&](uint8_t result) {
    EXPECT_EQ(result, 0);
    EXPECT_EQ(status, failure(2));
  };
  NULLS(CxPropListRead, with(path.c_str(), &list, &status), cannotOpen, isZero, is(1));
  NULLS(CxPropListPutStr, with(&list, "other", "value"), isZero);
  uint8_t found = 7;
  NULLS(CxPropListPeekStr, with(&list, "key", &found), Absent{found}, Absent{found},
        [](const char *value) { EXPECT_STREQ(value, "value"); });
  NULLS(CxPropListCopyStr, with(&list, "key", &found), Absent{found}, Absent{found},
        givesText("value"));
  NULLS(CxPropListHasKey, with(&list, "key"), isZero);
  NULLS(CxPropListRemove, with(&list, "key"), isZero);
  NULLS(CxPropListDiscard, with(&list), nothing);
  EXPECT_EQ(list.count, 1);
  CxPropListDiscard(&list);
}

NULL_GROUP(PropertyListIterators) {
  NULLS(CxPropListIterator, with(nullptr), [](CxPropListIter result) {
    EXPECT_EQ(result.list, nullptr);
    EXPECT_EQ(result.index, 0);
    EXPECT_EQ(CxPropListIterPeekKey(&result), nullptr);
  });
  NULLS(CxPropListIterHasNext, with(nullptr), isZero);
  NULLS(CxPropListIterNext, with(nullptr), nothing);
  NULLS(CxPropListIterPeekKey, with(nullptr), isZero);
  NULLS(CxPropListIterPeekVal, with(nullptr), isZero);
  NULLS(CxPropListIterCopyKey, with(nullptr), isZero);
  NULLS(CxPropListIterCopyVal, with(nullptr), isZero);
}

NULL_GROUP(GrowableArrays) {
  void *array = nullptr;
  int32_t capacity = 0;
  int32_t count = 0;
  NULLS(CxListEnsureCapacity, with(&array, &capacity, &count, 4, 8), isZero);
  EXPECT_EQ(array, nullptr);
  ASSERT_EQ(CxListEnsureCapacity(&array, &capacity, &count, 4, 8), 1);
  count = 1;
  NULLS(
      CxListDiscard, with(&array, &capacity, &count),
      [&] {
        EXPECT_NE(array, nullptr);
        EXPECT_EQ(capacity + count, 0);
        capacity = 4;
      },
      [&] {
        EXPECT_EQ(array, nullptr);
        EXPECT_EQ(capacity, 4);
        count = 1;
      },
      [&] {
        EXPECT_EQ(capacity, 0);
        EXPECT_EQ(count, 1);
      });
}

NULL_GROUP(Parms) {
  Parm parm{.type = ParmInt32, .value = {.i = 1}};
  NULLS(QlxCopyParm, with(nullptr), isZero);
  NULLS(QlxFreeParm, with(nullptr), nothing);
  NULLS(QlxCmpParms, with(&parm, &parm), isZero);
  EXPECT_EQ(QlxCmpParms(nullptr, nullptr), 1);
}

NULL_GROUP(Conversions) {
  uint8_t found = 7;
  HELD(qlxPropStrToBool, with("true", &found), Absent{found}, is(1));
  HELD(qlxPropStrToChar, with("1", &found), Absent{found}, is('1'));
  HELD(qlxPropStrToInt32, with("1", &found), Absent{found}, is(1));
  HELD(qlxPropStrToInt64, with("1", &found), Absent{found}, is(1));
  HELD(qlxPropStrToFloat32, with("1", &found), Absent{found}, is(1));
  HELD(qlxPropStrToFloat64, with("1", &found), Absent{found}, is(1));
}

NULL_GROUP(MapProperties) {
  uint8_t found = 7;
  StringToStringMap *map = QlxAllocStringToStringMap();
  ASSERT_EQ(QlxSetMapProp(map, "key", "true"), 1);
  NULLS_OF_GETTER(NULLS, QlxGetMapProp, map, givesText("true"));
  NULLS_OF_GETTER(NULLS, QlxGetMapPropBool, map, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetMapPropChar, map, is('t'));
  ASSERT_EQ(QlxSetMapProp(map, "key", "1"), 1);
  NULLS_OF_GETTER(NULLS, QlxGetMapPropInt, map, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetMapPropLong, map, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetMapPropFloat, map, is(1));
  NULLS_OF_GETTER(NULLS, QlxGetMapPropDouble, map, is(1));
  NULLS(QlxSetMapProp, with(map, "null", "1"), isZero, isZero, is(1));
  EXPECT_EQ(QlxStringToStringMapHasKey(map, "null"), 1);
  EXPECT_EQ(QlxStringToStringMapGet(map, "null"), nullptr);
  NULLS(QlxSetMapPropBool, with(map, "other", 1), isZero);
  NULLS(QlxSetMapPropChar, with(map, "other", '1'), nothing);
  NULLS(QlxSetMapPropInt, with(map, "other", 1), nothing);
  NULLS(QlxSetMapPropLong, with(map, "other", 1), nothing);
  NULLS(QlxSetMapPropFloat, with(map, "other", 1), nothing);
  NULLS(QlxSetMapPropDouble, with(map, "other", 1), nothing);
  EXPECT_EQ(QlxStringToStringMapHasKey(map, "other"), 0);
  QlxFreeStringToStringMap(map);
}

NULL_GROUP(Tokenizer) {
  NULLS(
      QlxStrTokIterator, with("ab", ","),
      [](QlxStrTok none) {
        EXPECT_EQ(QlxStrTokIterHasNext(none), 0);
        EXPECT_EQ(QlxStrTokIterGet(none), nullptr);
        EXPECT_EQ(QlxStrTokIterNext(none).cursor, nullptr);
      },
      [](QlxStrTok bytes) { EXPECT_EQ(take(QlxStrTokIterGet(bytes)), "a"); });
}

NULL_GROUP(Levels) {
  NULLS(QlxGetLevelFromString, with("INFO"), is(UNSPECIFIED));
}

// ---- Configurations

NULL_GROUP(Configurations) {
  const OpenToolkit toolkit;
  ObjCfg *cfg = QlxLogMgrGetCfg("a");
  ObjCfg *child = QlxLogMgrGetCfg("a.b");
  NULLS_OF_BOTH(AllocObjCfg, with("a"), isZero);
  NULLS_OF_BOTH(AcquireObjCfg, with(nullptr), isZero);
  NULLS_OF_BOTH(ReleaseObjCfg, with(nullptr), nothing);
  NULLS_OF_BOTH(ObjCfgGetName, with(nullptr), isZero);
  NULLS_OF_BOTH(ObjCfgIsFromFile, with(nullptr), isZero);
  NULLS_OF_BOTH(ObjCfgSetFromFile, with(nullptr, 1), nothing);
  NULLS_OF_BOTH(ObjCfgGetParent, with(nullptr), isZero);
  NULLS_OF_BOTH(ObjCfgSetParent, with(child, cfg), nothing);
  NULLS_OF_BOTH(ObjCfgAddChild, with(child, cfg), nothing);
  NULLS_OF_BOTH(ObjCfgRemChild, with(cfg, child), nothing);
  NULLS_OF_BOTH(ObjCfgChildrenNames, with(nullptr), isZero);
  NULLS_OF_BOTH(ObjCfgProperties, with(nullptr), isZero);
  ObjCfg *parent = QlxObjCfgGetParent(child);
  EXPECT_EQ(parent, cfg);
  EXPECT_EQ(QlxObjCfgChildrenNames(child), nullptr);
  EXPECT_EQ(take(QlxStringGroupIterGet(QlxObjCfgChildrenNames(cfg))), "a.b");
  for (ObjCfg *held : {parent, cfg, child}) QlxReleaseObjCfg(held);
}

NULL_GROUP(ConfigurationProperties) {
  const OpenToolkit toolkit;
  uint8_t found = 7;
  ObjCfg *cfg = QlxAllocObjCfg("cfg");
  ASSERT_EQ(QlxSetObjCfgProp(cfg, "key", "true"), 1);
  for (const char *value : {"true", "1"}) {
    const bool isWord = value[0] == 't';
    ASSERT_EQ(QlxSetObjCfgProp(cfg, "key", value), 1);
    NULLS_OF_BOTH(GetInheritedObjCfgProp, with(cfg, "key", &found), Absent{found}, Absent{found},
                  givesText(value));
    NULLS_OF_BOTH(GetObjCfgProp, with(cfg, "key", &found), Absent{found}, Absent{found},
                  givesText(value));
    NULLS_OF_BOTH(GetObjCfgPropBool, with(cfg, "key", &found), Absent{found}, Absent{found},
                  is(isWord));
    NULLS_OF_BOTH(GetObjCfgPropInt, with(cfg, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
    NULLS_OF_BOTH(GetObjCfgPropLong, with(cfg, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
    NULLS_OF_BOTH(GetObjCfgPropFloat, with(cfg, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
    NULLS_OF_BOTH(GetObjCfgPropDouble, with(cfg, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
  }
  NULLS_OF_BOTH(SetObjCfgProp, with(cfg, "null", "1"), isZero, isZero, is(1));
  NULLS_OF_BOTH(SetObjCfgPropBool, with(cfg, "other", 1), isZero);
  NULLS_OF_BOTH(SetObjCfgPropInt, with(cfg, "other", 1), nothing);
  NULLS_OF_BOTH(SetObjCfgPropLong, with(cfg, "other", 1), nothing);
  NULLS_OF_BOTH(SetObjCfgPropFloat, with(cfg, "other", 1), nothing);
  NULLS_OF_BOTH(SetObjCfgPropDouble, with(cfg, "other", 1), nothing);
  StringToStringMapNode *last = QlxStringToStringMapIterNext(QlxObjCfgProperties(cfg));
  EXPECT_EQ(take(QlxStringToStringMapIterGetKey(last)), "null");
  EXPECT_EQ(QlxStringToStringMapIterGetVal(last), nullptr);
  EXPECT_EQ(QlxStringToStringMapIterNext(last), nullptr);
  QlxReleaseObjCfg(cfg);
}

NULL_GROUP(LogManager) {
  const OpenToolkit toolkit;
  QlxObject *object = QlxGetObject("logger", "qlx_basiclogger");
  const StringGroupNode *last = QlxLogMgrConfigNames();
  while (last && last->next) last = last->next;
  NULLS_OF_BOTH(LogMgrAddCfg, with(nullptr), nothing);
  NULLS_OF_BOTH(LogMgrRemCfg, with(nullptr), nothing);
  NULLS_OF_BOTH(LogMgrUpdateCfg, with(nullptr), nothing);
  NULLS_OF_BOTH(LogMgrGetCfg, with(nullptr), isZero);
  NULLS_OF_BOTH(LogMgrHasCfg, with(nullptr), isZero);
  NULLS_OF_BOTH(LogMgrApplyCfg, with(object, "logger"), isZero);
  EXPECT_EQ(last->next, nullptr);
  QlxReleaseObject(object);
}

}  // namespace
