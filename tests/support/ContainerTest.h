// What the tests of groups, lists and maps share: elements of every kind to fill containers with,
// one way to do what each kind of container does by its own function, a look at the chain of nodes,
// and runs with failing memory.
#ifndef QLX_TESTS_CONTAINERTEST_H
#define QLX_TESTS_CONTAINERTEST_H

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include <qlx/class/containers.h>
#include <qlx/class/object.h>
#include <qlx/class/toolkit.h>
#include <qlx/memory.h>
#include <qlx/props.h>

#include "QlxObjConfig.h"
#include "support/ContainerApis.h"
#include "support/FailingMemory.h"

// Each kind has kCount elements: at(i) is the one to put in, is(element, i) knows it again, discard
// ends what was handed out, and references(i) counts what containers and callers hold of it. They
// take no lock. Those of lists have an order: by `compare` it is that of `sorted`.
struct ElementKind {
  static constexpr int kCount = 3;
};

struct Strings : ElementKind {
  static constexpr bool kCounted = false, kCopied = true;
  const char *at(int i) const { return texts[i]; }
  bool is(const char *text, int i) const { return text && strcmp(text, texts[i]) == 0; }
  void discard(char *text) const { OslMemoryFree(text); }
  int references(int) const { return 0; }
  static int compare(const void *a, const void *b) {
    return strcmp(*static_cast<char *const *>(a), *static_cast<char *const *>(b));
  }
  const std::vector<int> sorted = {2, 0, 1};

  const char *const texts[kCount] = {"first", "second", ""};
};

struct Parms : ElementKind {
  static constexpr bool kCounted = false, kCopied = true;
  Parms() {
    parms[0].type = ParmInt32;
    parms[0].value.i = 7;
    parms[1].type = ParmString;
    parms[1].value.s = text;
    parms[2].type = ParmFloat64;
    parms[2].value.d = 0.5;
  }
  const Parm *at(int i) const { return &parms[i]; }
  bool is(const Parm *parm, int i) const { return parm && QlxCmpParms(parm, &parms[i]) == 1; }
  void discard(Parm *parm) const { QlxFreeParm(parm); }
  int references(int) const { return 0; }
  static int compare(const void *a, const void *b) {
    return (*static_cast<Parm *const *>(a))->type - (*static_cast<Parm *const *>(b))->type;
  }
  const std::vector<int> sorted = {0, 2, 1};

  char text[4] = "abc";
  Parm parms[kCount] = {};
};

// All alike, so that only identity tells one from another, and held so often by somebody else that
// no release is the last.
struct Objects : ElementKind {
  static constexpr bool kCounted = true, kCopied = false;
  Objects() {
    for (QlxObject &object : objects) object.objClass = &objClass, object.refCount = kHeld;
  }
  QlxObject *at(int i) { return &objects[i]; }
  bool is(QlxObject *object, int i) const { return object == &objects[i]; }
  void discard(QlxObject *object) const { qlxIntlReleaseObject(object); }
  int references(int i) const { return static_cast<int>(objects[i].refCount) - kHeld; }

  static constexpr int kHeld = 10;
  ObjClass objClass = {};
  QlxObject objects[kCount] = {};
};

struct Configs : ElementKind {
  static constexpr bool kCounted = true, kCopied = false;
  ObjCfg *at(int i) const { return configs[i].get(); }
  bool is(ObjCfg *config, int i) const { return config == configs[i].get(); }
  void discard(ObjCfg *config) const { qlxIntlReleaseObjCfg(config); }
  int references(int i) const { return static_cast<int>(configs[i]->refCount) - 1; }

  const ObjCfgRef configs[kCount] = {ObjCfgRef{qlxIntlAllocObjCfg("a")},
                                     ObjCfgRef{qlxIntlAllocObjCfg("b")},
                                     ObjCfgRef{qlxIntlAllocObjCfg("c")}};
};

struct Classes : ElementKind {
  static constexpr bool kCounted = false, kCopied = false;
  ObjClass *at(int i) { return &classes[i]; }
  bool is(ObjClass *objClass, int i) const { return objClass == &classes[i]; }
  void discard(ObjClass *) const {}
  int references(int) const { return 0; }

  ObjClass classes[kCount] = {};
};

// Which of them a container holds.
Strings elementsOf(char *);
Parms elementsOf(Parm *);
Objects elementsOf(QlxObject *);
Configs elementsOf(ObjCfg *);
Classes elementsOf(ObjClass *);
template <typename Api>
using Elements = decltype(elementsOf(ValueOf<Api>()));

constexpr const char *kKeys[ElementKind::kCount] = {"a", "b", "c"};

// Puts in an element; the key is for a map.
template <typename Api, typename Element>
uint8_t insert(typename Api::Head *container, const char *key, Element element) {
  if constexpr (kHasKeys<Api>)
    return Api::put(container, key, element);
  else if constexpr (requires { Api::append; })
    return Api::append(container, element);
  else
    return Api::add(container, element);
}
template <typename Api>
uint8_t insert(typename Api::Head *container, Elements<Api> &elements, int i) {
  return insert<Api>(container, kKeys[i], elements.at(i));
}

// What an iterator at the node hands out.
template <typename Api, typename Node>
ValueOf<Api> handOut(Node *node) {
  if constexpr (kHasKeys<Api>)
    return Api::getVal(node);
  else
    return Api::get(node);
}

// What a group or a map knows an element by.
template <typename Api>
auto idOf(Elements<Api> &elements, int i) {
  if constexpr (kHasKeys<Api>)
    return kKeys[i];
  else
    return elements.at(i);
}

// The nodes from head to tail; fails where the links of a container contradict each other.
template <typename Head>
auto chain(Head *container) {
  std::vector<decltype(container->head)> nodes;
  EXPECT_EQ(container->head == nullptr, container->tail == nullptr);
  for (auto *node = container->head; node; node = node->next) {
    EXPECT_EQ(node->owner, container);
    EXPECT_EQ(node->prev, nodes.empty() ? nullptr : nodes.back());
    nodes.push_back(node);
  }
  EXPECT_EQ(container->tail, nodes.empty() ? nullptr : nodes.back());
  if constexpr (requires { container->count; }) {
    EXPECT_EQ(container->count, static_cast<int32_t>(nodes.size()));
  }
  return nodes;
}

template <typename Head>
std::string keysIn(Head *map) {
  std::string keys;
  for (auto *node : chain(map)) keys += node->key;
  return keys;
}

// The numbers of a container's elements in order; kCount for one that is not known.
using Numbers = std::vector<int>;
template <typename Head, typename Kind>
Numbers numbersIn(Head *container, Kind &elements) {
  Numbers numbers;
  for (auto *node : chain(container)) {
    int i = 0;
    while (i < Kind::kCount && !elements.is(node->value, i)) i++;
    numbers.push_back(i);
  }
  return numbers;
}

// A container of an API and elements for it.
template <typename Api>
class ContainerTest : public ::testing::Test {
 protected:
  ~ContainerTest() override { Api::free(container); }

  void fill() {
    for (int i = 0; i < 3; i++) ASSERT_EQ(insert<Api>(container, elements, i), 1);
  }
  Numbers content() { return numbersIn(container, elements); }
  std::string keys() { return keysIn(container); }
  int oneIfCounted() const { return elements.kCounted ? 1 : 0; }

  Elements<Api> elements;
  typename Api::Head *container = Api::alloc();
};

// All instances of a kind.
using AllGroups = ::testing::Types<QlxStringGroupApi, qlxIntlStringGroupApi, QlxListenerGroupApi,
                                   qlxIntlListenerGroupApi>;
using AllLists =
    ::testing::Types<QlxStringListApi, qlxIntlStringListApi, QlxParmListApi, qlxIntlParmListApi>;
using AllMaps =
    ::testing::Types<QlxStringToStringMapApi, qlxIntlStringToStringMapApi, QlxStringToObjMapApi,
                     qlxIntlStringToObjMapApi, QlxStringToObjCfgMapApi, qlxIntlStringToObjCfgMapApi,
                     QlxStringToObjClassMapApi, qlxIntlStringToObjClassMapApi>;

template <typename... A, typename... B>
::testing::Types<A..., B...> join(::testing::Types<A...>, ::testing::Types<B...>);
template <typename A, typename B>
using Joined = decltype(join(A(), B()));

// Names the instance in the name of a typed test.
struct ApiNames {
  template <typename Api>
  static std::string GetName(int) {
    return Api::kName;
  }
};

// Lets the first allocation of `attempt` fail, then the second and so on until none does. Each time
// `check` gets the number of the one that failed, at last 0, and what `attempt` returned.
template <typename Attempt, typename Check>
void failEachAllocation(Attempt attempt, Check check) {
  FailingMemory memory;
  for (int n = 1; n < 20; n++) {
    memory.failOnce(n);
    const auto result = attempt();
    const bool failed = memory.failures() > 0;
    memory.failNone();
    check(failed ? n : 0, result);
    if (failed) continue;
    EXPECT_GT(n, 1);
    return;
  }
  FAIL() << "there is no end of allocations";
}

#endif
