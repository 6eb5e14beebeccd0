// The index over long containers: what it finds, and that nobody can tell a container with one from
// a container without but by the time it takes.
#include "util/QlxIndex.h"

#include <algorithm>
#include <iterator>
#include <list>
#include <map>
#include <numeric>
#include <random>

#include "support/ContainerTest.h"
#include "util/CxHash.h"

namespace {

constexpr int kIndexedFrom = 17;

// ---- The index alone

class IndexTest : public ::testing::Test {
 protected:
  ~IndexTest() override { qlxIndexDrop(&index); }

  void add(int i, uint32_t hash) {
    ++index.count;
    ASSERT_TRUE(qlxIndexReserve(&index));
    qlxIndexAdd(&index, &nodes[i], hash);
  }
  void remove(int i, uint32_t hash) {
    --index.count;
    qlxIndexRemove(&index, &nodes[i], hash);
  }
  bool finds(int i, uint32_t hash) {
    return qlxIndexFind(index, hash, [&](void *node) { return node == &nodes[i]; }) == &nodes[i];
  }

  static constexpr int kNodes = 1000;
  char nodes[kNodes] = {};
  QlxIndex index = {};
};

TEST_F(IndexTest, TellsNodesOfTheSameHashApart) {
  for (int i = 0; i < 10; ++i) add(i, 7);
  for (int i = 0; i < 10; ++i) EXPECT_TRUE(finds(i, 7));
  EXPECT_FALSE(finds(10, 7));
  EXPECT_FALSE(finds(0, 8));
}

TEST_F(IndexTest, KeepsAQuarterOfItsSlotsFree) {
  for (int i = 0; i < kNodes; ++i) {
    add(i, static_cast<uint32_t>(i) * 77);
    ASSERT_LE(index.count * 4, index.capacity * 3);
    ASSERT_LE(index.capacity, std::max(64u, index.count * 4));
  }
  for (int i = 0; i < kNodes; ++i) EXPECT_TRUE(finds(i, static_cast<uint32_t>(i) * 77));
}

TEST_F(IndexTest, TakesANodeOutWhoseHashIsAnotherMeanwhile) {
  for (int i = 0; i < 3; ++i) add(i, 5);
  remove(1, 99);
  EXPECT_FALSE(finds(1, 5));
  EXPECT_TRUE(finds(0, 5));
  EXPECT_TRUE(finds(2, 5));
}

TEST_F(IndexTest, LeavesOthersAloneWhenANodeIsNotThere) {
  for (int i = 0; i < 3; ++i) add(i, 5);
  qlxIndexRemove(&index, &nodes[9], 5);
  for (int i = 0; i < 3; ++i) EXPECT_TRUE(finds(i, 5));
}

// Hashes around the end of the slots, so that runs go on at their beginning.
TEST_F(IndexTest, FindsWhatIsLeftInRunsAroundTheEnd) {
  std::mt19937 random(4711);
  const uint32_t hashes[] = {60, 61, 62, 63, 0, 1, 2, 124, 127, 128};
  std::map<int, uint32_t> there;
  for (int step = 0; step < 20000; ++step) {
    const int i = static_cast<int>(random() % 48);
    const auto found = there.find(i);
    if (found != there.end()) {
      remove(i, found->second);
      there.erase(found);
    } else {
      const uint32_t hash = hashes[random() % std::size(hashes)];
      add(i, hash);
      there[i] = hash;
    }
    for (const auto &[node, hash] : there) ASSERT_TRUE(finds(node, hash)) << step;
  }
  EXPECT_EQ(index.capacity, 64u);
}

TEST_F(IndexTest, HasNoSlotsWithoutMemory) {
  for (int i = 0; i < 48; ++i) add(i, 1);
  FailingMemory memory;
  memory.failFrom(1);
  index.count = 49;
  EXPECT_FALSE(qlxIndexReserve(&index));
  EXPECT_EQ(index.slots, nullptr);
  EXPECT_EQ(index.capacity, 0u);
  EXPECT_EQ(memory.live(), -1);
}

// ---- Maps and groups, long ones

std::string keyOf(int i) {
  return "key" + std::to_string(i);
}

// Of every container: put and remove the element number `i`, look for it, and what the element of a
// node is called. `put` answers what the container answers.
template <typename Kind, typename MapHead, auto Alloc, auto Free, auto Put, auto Rem, auto HasKey,
          auto GetNode, auto RemNode>
struct LongMap {
  using Head = MapHead;
  static constexpr bool kReplaces = true;
  Head *head = Alloc();
  ~LongMap() { Free(head); }
  uint8_t put(int i, int value) { return Put(head, keyOf(i).c_str(), elements.at(value)); }
  void remove(int i) { Rem(head, keyOf(i).c_str()); }
  void removeAt(int i) { RemNode(head, nodeOf(i)); }
  bool has(int i) { return HasKey(head, keyOf(i).c_str()) == 1; }
  auto *nodeOf(int i) { return GetNode(head, keyOf(i).c_str()); }
  template <typename Node>
  static std::string nameOf(const Node *node) {
    return node->key;
  }
  template <typename Node>
  int valueOf(const Node *node) {
    int i = 0;
    while (i < Kind::kCount && !elements.is(node->value, i)) ++i;
    return i;
  }
  Kind elements;
};

#define LONG_MAP(Name, Kind)                                                                 \
  struct Long##Name : LongMap<Kind, Name, qlxIntlAlloc##Name, qlxIntlFree##Name,             \
                              qlxIntl##Name##Put, qlxIntl##Name##Rem, qlxIntl##Name##HasKey, \
                              qlxIntl##Name##GetNode, qlxIntl##Name##RemNode> {              \
    static constexpr char kName[] = #Name;                                                   \
  }
LONG_MAP(StringToStringMap, Strings);
LONG_MAP(StringToObjMap, Objects);
LONG_MAP(StringToObjCfgMap, Configs);
LONG_MAP(StringToObjClassMap, Classes);
#undef LONG_MAP

struct LongStringGroup {
  static constexpr char kName[] = "StringGroup";
  using Head = StringGroup;
  static constexpr bool kReplaces = false;
  Head *head = qlxIntlAllocStringGroup();
  ~LongStringGroup() { qlxIntlFreeStringGroup(head); }
  uint8_t put(int i, int) { return qlxIntlStringGroupAdd(head, keyOf(i).c_str()); }
  void remove(int i) { qlxIntlStringGroupRem(head, keyOf(i).c_str()); }
  void removeAt(int i) { qlxIntlStringGroupIterRem(nodeOf(i)); }
  bool has(int i) { return nodeOf(i); }
  StringGroupNode *nodeOf(int i) { return QlxStringGroupGetLink(head, keyOf(i).c_str()); }
  static std::string nameOf(const StringGroupNode *node) { return node->value; }
  static int valueOf(const StringGroupNode *) { return 0; }
};

struct LongListenerGroup {
  static constexpr char kName[] = "ListenerGroup";
  using Head = ListenerGroup;
  static constexpr bool kReplaces = false;
  LongListenerGroup() {
    for (QlxObject &object : objects) object.objClass = &objClass, object.refCount = 10;
  }
  ~LongListenerGroup() { qlxIntlFreeListenerGroup(head); }
  uint8_t put(int i, int) { return qlxIntlListenerGroupAdd(head, at(i)); }
  void remove(int i) { qlxIntlListenerGroupRem(head, at(i)); }
  void removeAt(int i) { qlxIntlListenerGroupIterRem(nodeOf(i)); }
  bool has(int i) { return nodeOf(i); }
  ListenerGroupNode *nodeOf(int i) { return QlxListenerGroupGetLink(head, at(i)); }
  std::string nameOf(const ListenerGroupNode *node) {
    return keyOf(static_cast<int>(node->value - objects.data()));
  }
  static int valueOf(const ListenerGroupNode *) { return 0; }
  QlxObject *at(int i) { return &objects[static_cast<size_t>(i)]; }

  Head *head = qlxIntlAllocListenerGroup();
  ObjClass objClass = {};
  std::vector<QlxObject> objects = std::vector<QlxObject>(20000);
};

template <typename Container>
class LongContainerTest : public ::testing::Test {
 protected:
  void fill(int count) {
    for (int i = 0; i < count; ++i) ASSERT_EQ(container.put(i, i % 3), 1);
  }

  // All of [0, count) are there in their order but for those.
  void expect(int count, std::vector<int> gone = {}) {
    std::vector<std::string> expected, names;
    for (int i = 0; i < count; ++i) {
      const bool there = std::find(gone.begin(), gone.end(), i) == gone.end();
      EXPECT_EQ(container.has(i), there) << i << " of " << count;
      if (there) expected.push_back(keyOf(i));
    }
    for (auto *node : chain(container.head)) names.push_back(container.nameOf(node));
    EXPECT_EQ(names, expected) << count;
    EXPECT_FALSE(container.has(count));
  }

  Container container;
};

using LongContainers =
    ::testing::Types<LongStringToStringMap, LongStringToObjMap, LongStringToObjCfgMap,
                     LongStringToObjClassMap, LongStringGroup, LongListenerGroup>;
TYPED_TEST_SUITE(LongContainerTest, LongContainers, ApiNames);

TYPED_TEST(LongContainerTest, FindsAllAndOnlyThoseAtEverySize) {
  for (int count = 0; count < 110; ++count) {
    this->expect(count);
    ASSERT_EQ(this->container.put(count, 0), 1);
  }
  while (auto *node = this->container.head->tail) {
    const int last = static_cast<int>(chain(this->container.head).size()) - 1;
    ASSERT_EQ(this->container.nodeOf(last), node);
    this->container.remove(last);
    this->expect(last);
  }
}

TYPED_TEST(LongContainerTest, LosesFromEveryPlaceOnlyWhatIsRemoved) {
  for (const int count : {15, 16, 17, 18, 48, 49, 50}) {
    for (const int gone : {0, 1, count / 2, count - 2, count - 1}) {
      TypeParam container;
      std::swap(container.head, this->container.head);
      this->fill(count);
      this->container.remove(gone);
      this->expect(count, {gone});
      this->container.removeAt((gone + 3) % count);
      this->expect(count, {gone, (gone + 3) % count});
      std::swap(container.head, this->container.head);
    }
  }
}

// Between the sizes at which an index ends and is made: those with one have all their nodes in it.
TYPED_TEST(LongContainerTest, FindsWhatIsAddedAfterItHasShrunk) {
  for (int left = 0; left < kIndexedFrom; ++left) {
    TypeParam container;
    std::swap(container.head, this->container.head);
    this->fill(kIndexedFrom);
    std::vector<int> gone;
    for (int i = left; i < kIndexedFrom; ++i) {
      this->container.remove(i);
      gone.push_back(i);
    }
    for (int i = kIndexedFrom; i < 2 * kIndexedFrom; ++i) {
      ASSERT_EQ(this->container.put(i, 0), 1);
      this->expect(i + 1, gone);
    }
    std::swap(container.head, this->container.head);
  }
}

// What the random changes should lead to.
class Expected {
 public:
  struct Entry {
    int key, value;
  };

  bool has(int key) const { return byKey_.count(key) == 1; }
  const std::list<Entry> &order() const { return order_; }

  void put(int key, int value) {
    if (has(key))
      byKey_[key]->value = value;
    else
      byKey_[key] = order_.insert(order_.end(), {key, value});
  }
  void remove(int key) {
    if (!has(key)) return;
    order_.erase(byKey_[key]);
    byKey_.erase(key);
  }

 private:
  std::list<Entry> order_;
  std::map<int, std::list<Entry>::iterator> byKey_;
};

constexpr int kRandomKeys = 15000;

template <typename Container>
void check(Container &container, const Expected &expected) {
  auto entry = expected.order().begin();
  for (auto *node : chain(container.head)) {
    ASSERT_NE(entry, expected.order().end());
    ASSERT_EQ(container.nameOf(node), keyOf(entry->key));
    if (container.kReplaces) {
      ASSERT_EQ(container.valueOf(node), entry->value);
    }
    ++entry;
  }
  ASSERT_EQ(entry, expected.order().end());
  for (int i = 0; i < kRandomKeys; ++i) ASSERT_EQ(container.has(i), expected.has(i)) << i;
}

// Ten thousand of them, and then thirty thousand random changes.
TYPED_TEST(LongContainerTest, KeepsTheOrderOfInsertionThroughRandomChanges) {
  Expected expected;
  auto &container = this->container;
  const auto put = [&](int key, int value) {
    const bool fresh = !expected.has(key);
    ASSERT_EQ(container.put(key, value), fresh || container.kReplaces);
    expected.put(key, value);
  };
  const auto remove = [&](int key) {
    container.remove(key);
    expected.remove(key);
  };

  std::mt19937 random(20240229);
  std::vector<int> keys(10000);
  std::iota(keys.begin(), keys.end(), 0);
  std::shuffle(keys.begin(), keys.end(), random);
  for (const int key : keys) put(key, key % 3);
  check(container, expected);
  for (int step = 1; step <= 30000; ++step) {
    const int key = static_cast<int>(random() % kRandomKeys);
    const uint32_t kind = random() % 10;
    if (kind < 5)
      put(key, static_cast<int>(kind % 3));
    else if (kind < 7 || !expected.has(key))
      remove(key);
    else
      container.removeAt(key), expected.remove(key);
    if (step % 10000 == 0) check(container, expected);
  }
  while (!expected.order().empty()) {
    const auto &order = expected.order();
    remove(order.size() % 2 ? order.front().key : order.back().key);
  }
  check(container, expected);
}

// The allocation that a put makes for the index is its last one; without it the put is the same.
TYPED_TEST(LongContainerTest, IsWalkedWhereThereIsNoMemoryForTheIndex) {
  for (const int count : {kIndexedFrom, 49, 97}) {
    uint64_t attempts = 0;
    int64_t live = 0;
    {
      TypeParam same;
      for (int i = 0; i < count - 1; ++i) same.put(i, 0);
      FailingMemory memory;
      same.put(count - 1, 0);
      attempts = memory.attempts();
      live = memory.live();
    }
    TypeParam container;
    std::swap(container.head, this->container.head);
    this->fill(count - 1);
    {
      FailingMemory memory;
      memory.failOnce(attempts);
      EXPECT_EQ(this->container.put(count - 1, 0), 1);
      EXPECT_EQ(memory.failures(), 1u);
      EXPECT_EQ(memory.live(), live - 1);
      this->expect(count);
      this->container.remove(0);
      this->expect(count, {0});
      EXPECT_EQ(this->container.put(count, 0), 1);
      this->expect(count + 1, {0});
    }
    std::swap(container.head, this->container.head);
  }
}

TYPED_TEST(LongContainerTest, TriesAgainForAnIndexWithTheNextElement) {
  const FailingMemory memory;
  this->fill(kIndexedFrom - 1);
  const int64_t each = memory.live() / (kIndexedFrom - 1);
  int64_t before = memory.live();
  this->container.put(kIndexedFrom - 1, 0);
  EXPECT_EQ(memory.live() - before, each + 1);  // with the index
  for (int i = 0; i < 9; ++i) this->container.remove(i);
  before = memory.live();
  this->container.remove(9);
  EXPECT_EQ(memory.live() - before, -each - 1);  // which ends when few are left
  for (int i = 0; i < 9; ++i) this->container.put(i, 0);
  before = memory.live();
  this->container.put(9, 0);
  EXPECT_EQ(memory.live() - before, each + 1);
}

TYPED_TEST(LongContainerTest, GivesAllItsMemoryBack) {
  const FailingMemory memory;
  {
    TypeParam container;
    const int64_t empty = memory.live();
    for (int i = 0; i < 100; ++i) container.put(i, 0);
    for (int i = 0; i < 100; ++i) container.remove(i);
    EXPECT_EQ(memory.live(), empty);
    for (int i = 0; i < 100; ++i) container.put(i, 0);
  }
  EXPECT_EQ(memory.live(), 0);
}

// ---- Of their own

TEST(LongMapTest, TellsKeysOfTheSameHashApart) {
  ASSERT_EQ(cxHashText("costarring"), cxHashText("liquid"));
  StringToStringMap *map = qlxIntlAllocStringToStringMap();
  for (int i = 0; i < 20; ++i) qlxIntlStringToStringMapPut(map, keyOf(i).c_str(), "");
  qlxIntlStringToStringMapPut(map, "costarring", "1");
  EXPECT_EQ(qlxIntlStringToStringMapHasKey(map, "liquid"), 0);
  qlxIntlStringToStringMapPut(map, "liquid", "2");
  EXPECT_STREQ(qlxIntlStringToStringMapGetNode(map, "costarring")->value, "1");
  EXPECT_STREQ(qlxIntlStringToStringMapGetNode(map, "liquid")->value, "2");
  qlxIntlStringToStringMapRem(map, "costarring");
  EXPECT_STREQ(qlxIntlStringToStringMapGetNode(map, "liquid")->value, "2");
  qlxIntlFreeStringToStringMap(map);
}

TEST(LongMapTest, ForgetsANodeIntoWhichSomebodyWrote) {
  StringToStringMap *map = qlxIntlAllocStringToStringMap();
  for (int i = 0; i < 20; ++i) qlxIntlStringToStringMapPut(map, keyOf(i).c_str(), "");
  StringToStringMapNode *node = qlxIntlStringToStringMapGetNode(map, "key7");
  node->key[0] = 'K';
  qlxIntlStringToStringMapRemNode(map, node);
  EXPECT_EQ(qlxIntlStringToStringMapHasKey(map, "key7"), 0);
  EXPECT_EQ(qlxIntlStringToStringMapHasKey(map, "Key7"), 0);
  qlxIntlStringToStringMapPut(map, "key7", "new");
  EXPECT_STREQ(map->tail->key, "key7");
  EXPECT_EQ(chain(map).size(), 20u);
  qlxIntlFreeStringToStringMap(map);
}

TEST(LongMapTest, CopiesInOrder) {
  StringToStringMap *map = qlxIntlAllocStringToStringMap();
  for (int i = 0; i < 100; ++i) {
    qlxIntlStringToStringMapPut(map, keyOf(i).c_str(), std::to_string(i).c_str());
  }
  StringToStringMap *copy = qlxIntlCopyStringToStringMap(map);
  qlxIntlFreeStringToStringMap(map);
  int i = 0;
  for (auto *node : chain(copy)) {
    EXPECT_EQ(node->key, keyOf(i));
    EXPECT_EQ(node->value, std::to_string(i++));
  }
  EXPECT_EQ(i, 100);
  EXPECT_STREQ(qlxIntlStringToStringMapGetNode(copy, "key42")->value, "42");
  qlxIntlFreeStringToStringMap(copy);
}

}  // namespace
