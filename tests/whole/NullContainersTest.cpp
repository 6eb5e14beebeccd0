// Null arguments of the containers: one set of calls for each template, for the public functions
// and for the twins.
#include <qlx/class/containers.h>
#include <qlx/class/object.h>
#include <qlx/props.h>

#include "QlxObjConfig.h"
#include "support/NullCalls.h"

namespace {

#define NULLS_OF_ITERATOR(Calls, Prefix, Name, container)  \
  Calls(Prefix##Name##Iterator, with(container), isZero);  \
  Calls(Prefix##Name##IterHasNext, with(nullptr), isZero); \
  Calls(Prefix##Name##IterNext, with(nullptr), isZero)

#define NULLS_OF_GROUP(Calls, Prefix, Name, group, element) \
  Calls(Prefix##Free##Name, with(nullptr), nothing);        \
  Calls(Prefix##Name##Add, with(group, element), isZero);   \
  Calls(Prefix##Name##Rem, with(group, element), isZero);   \
  NULLS_OF_ITERATOR(Calls, Prefix, Name, group);            \
  Calls(Prefix##Name##IterGet, with(nullptr), isZero);      \
  Calls(Prefix##Name##IterRem, with(nullptr), isZero)

#define NULLS_OF_LIST(Calls, Prefix, Name, list, element)   \
  Calls(Prefix##Free##Name, with(nullptr), nothing);        \
  Calls(Prefix##Copy##Name, with(nullptr), isZero);         \
  Calls(Prefix##Name##Append, with(list, element), isZero); \
  NULLS_OF_ITERATOR(Calls, Prefix, Name, list);             \
  Calls(Prefix##Name##IterGet, with(nullptr), isZero);      \
  Calls(Prefix##Name##IterRem, with(nullptr), isZero)

// A null value is stored.
#define NULLS_OF_MAP(Calls, Prefix, Name, map, value)                                      \
  Calls(Prefix##Free##Name, with(nullptr), nothing);                                       \
  Calls(Prefix##Copy##Name, with(nullptr), isZero);                                        \
  Calls(Prefix##Name##Put, with(map, "null", value), isZero, isZero, [&](uint8_t stored) { \
    EXPECT_EQ(stored, 1);                                                                  \
    EXPECT_EQ(Qlx##Name##HasKey(map, "null"), 1);                                          \
    EXPECT_EQ(Qlx##Name##Get(map, "null"), nullptr);                                       \
    Qlx##Name##Rem(map, "null");                                                           \
  });                                                                                      \
  Calls(Prefix##Name##Get, with(map, "key"), isZero);                                      \
  Calls(Prefix##Name##Rem, with(map, "key"), nothing);                                     \
  Calls(Prefix##Name##HasKey, with(map, "key"), isZero);                                   \
  NULLS_OF_ITERATOR(Calls, Prefix, Name, map);                                             \
  Calls(Prefix##Name##IterGetKey, with(nullptr), isZero);                                  \
  Calls(Prefix##Name##IterGetVal, with(nullptr), isZero)

// The elements that stand in a container: what was put in before is all that may be there after.
template <typename Head>
int count(const Head *head) {
  int nodes = 0;
  for (auto *node = head->head; node; node = node->next) ++nodes;
  return nodes;
}

#define NULL_GROUP_TEMPLATE(Name, element)                   \
  NULL_GROUP(Name) {                                         \
    Name *group = QlxAlloc##Name();                          \
    ASSERT_EQ(Qlx##Name##Add(group, element), 1);            \
    NULLS_OF_GROUP(NULLS, Qlx, Name, group, element);        \
    NULLS_OF_GROUP(HELD, qlxIntl, Name, group, element);     \
    NULLS(Qlx##Name##GetLink, with(group, element), isZero); \
    EXPECT_EQ(count(group), 1);                              \
    QlxFree##Name(group);                                    \
  }

#define NULL_LIST_TEMPLATE(Name, element)                       \
  NULL_GROUP(Name) {                                            \
    Name *list = QlxAlloc##Name();                              \
    ASSERT_EQ(Qlx##Name##Append(list, element), 1);             \
    NULLS_OF_LIST(NULLS, Qlx, Name, list, element);             \
    NULLS_OF_LIST(HELD, qlxIntl, Name, list, element);          \
    NULLS(QlxSort##Name, with(list, neverCompared), nothing);   \
    NULLS(Qlx##Name##GetLink, with(list, element), isZero);     \
    NULLS(Qlx##Name##GetIndex, with(list, 0), isZero);          \
    NULLS(Qlx##Name##RemLink, with(list, list->head), nothing); \
    EXPECT_EQ(count(list), 1);                                  \
    EXPECT_EQ(list->count, 1);                                  \
    QlxFree##Name(list);                                        \
  }

#define NULL_MAP_TEMPLATE(Name, value)                           \
  NULL_GROUP(Name) {                                             \
    Name *map = QlxAlloc##Name();                                \
    ASSERT_EQ(Qlx##Name##Put(map, "key", value), 1);             \
    NULLS_OF_MAP(NULLS, Qlx, Name, map, value);                  \
    NULLS_OF_MAP(HELD, qlxIntl, Name, map, value);               \
    HELD(qlxIntl##Name##GetNode, with(map, "key"), isZero);      \
    HELD(qlxIntl##Name##RemNode, with(map, map->head), nothing); \
    EXPECT_EQ(count(map), 1);                                    \
    QlxFree##Name(map);                                          \
  }

int neverCompared(const void *, const void *) {
  ADD_FAILURE();
  return 0;
}

// Elements that are held by this file too, so that no release is the last.
template <typename T>
T heldElement() {
  T element{};
  element.refCount = 1000;
  return element;
}
QlxObject theObject = heldElement<QlxObject>();
ObjCfg theCfg = heldElement<ObjCfg>();
ObjClass theClass{};
constexpr Parm kParm{.type = ParmInt32, .value = {.i = 1}};

NULL_GROUP_TEMPLATE(StringGroup, "element")
NULL_GROUP_TEMPLATE(ListenerGroup, &theObject)
NULL_LIST_TEMPLATE(StringList, "element")
NULL_LIST_TEMPLATE(ParmList, &kParm)
NULL_MAP_TEMPLATE(StringToStringMap, "value")
NULL_MAP_TEMPLATE(StringToObjMap, &theObject)
NULL_MAP_TEMPLATE(StringToObjCfgMap, &theCfg)
NULL_MAP_TEMPLATE(StringToObjClassMap, &theClass)

}  // namespace
