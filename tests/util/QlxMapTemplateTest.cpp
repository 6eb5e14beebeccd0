// Maps: every behaviour with all instances, through the public functions and through the twins.
#include <functional>
#include <thread>

#include "support/ContainerApis.h"
#include "support/ContainerTest.h"

namespace {

MAP_API(Qlx, StringToStringMap, Strings);
MAP_API(qlxIntl, StringToStringMap, Strings);
MAP_API(Qlx, StringToObjMap, Objects);
MAP_API(qlxIntl, StringToObjMap, Objects);
MAP_API(Qlx, StringToObjCfgMap, Configs);
MAP_API(qlxIntl, StringToObjCfgMap, Configs);
MAP_API(Qlx, StringToObjClassMap, Classes);
MAP_API(qlxIntl, StringToObjClassMap, Classes);

using PublicMaps = ::testing::Types<QlxStringToStringMapApi, QlxStringToObjMapApi,
                                    QlxStringToObjCfgMapApi, QlxStringToObjClassMapApi>;
using AllMaps =
    ::testing::Types<QlxStringToStringMapApi, qlxIntlStringToStringMapApi, QlxStringToObjMapApi,
                     qlxIntlStringToObjMapApi, QlxStringToObjCfgMapApi, qlxIntlStringToObjCfgMapApi,
                     QlxStringToObjClassMapApi, qlxIntlStringToObjClassMapApi>;

constexpr const char *kKeys[] = {"a", "b", "c"};

template <typename Head>
std::string keysIn(Head *map) {
  std::string keys;
  for (auto *node : chain(map)) keys += node->key;
  return keys;
}

template <typename Api>
class MapTest : public ::testing::Test {
 protected:
  ~MapTest() override { Api::free(map); }

  void fill() {
    for (int i = 0; i < 3; i++) ASSERT_EQ(Api::put(map, kKeys[i], elements.at(i)), 1);
  }
  Numbers content() { return numbersIn(map, elements); }
  std::string keys() { return keysIn(map); }
  int oneIfCounted() const { return elements.kCounted ? 1 : 0; }

  typename Api::Elements elements;
  typename Api::Head *map = Api::alloc();
};

TYPED_TEST_SUITE(MapTest, AllMaps, ApiNames);

TYPED_TEST(MapTest, IsEmptyAtFirst) {
  ASSERT_NE(this->map, nullptr);
  EXPECT_EQ(this->keys(), "");
  EXPECT_EQ(TypeParam::iterator(this->map), nullptr);
  EXPECT_EQ(TypeParam::hasNext(nullptr), 0);
  EXPECT_EQ(TypeParam::hasKey(this->map, "a"), 0);
  EXPECT_EQ(TypeParam::get(this->map, "a"), nullptr);
}

TYPED_TEST(MapTest, KeepsTheOrderInWhichKeysCame) {
  this->fill();
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(MapTest, CopiesTheKey) {
  char key[] = "a";
  TypeParam::put(this->map, key, this->elements.at(0));
  key[0] = 'x';
  EXPECT_EQ(this->keys(), "a");
}

TYPED_TEST(MapTest, TellsKeysApartByTheirBytes) {
  TypeParam::put(this->map, "key", this->elements.at(0));
  TypeParam::put(this->map, "Key", this->elements.at(1));
  TypeParam::put(this->map, "", this->elements.at(2));
  EXPECT_EQ(this->keys(), "keyKey");
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(TypeParam::hasKey(this->map, "KEY"), 0);
  EXPECT_EQ(TypeParam::hasKey(this->map, ""), 1);
}

TYPED_TEST(MapTest, PutOfAnExistingKeyReplacesOnlyTheValue) {
  this->fill();
  auto *node = this->map->head->next;
  const char *key = node->key;
  EXPECT_EQ(TypeParam::put(this->map, "b", this->elements.at(0)), 1);
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->content(), (Numbers{0, 0, 2}));
  EXPECT_EQ(this->map->head->next, node);
  EXPECT_EQ(node->key, key);
  EXPECT_EQ(this->elements.references(0), 2 * this->oneIfCounted());
  EXPECT_EQ(this->elements.references(1), 0);
}

TYPED_TEST(MapTest, PutOfTheSameValueAgainKeepsOneReference) {
  this->fill();
  EXPECT_EQ(TypeParam::put(this->map, "a", this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(this->elements.references(0), this->oneIfCounted());
}

TYPED_TEST(MapTest, ANullValueIsAValue) {
  EXPECT_EQ(TypeParam::put(this->map, "a", nullptr), 1);
  EXPECT_EQ(TypeParam::hasKey(this->map, "a"), 1);
  EXPECT_EQ(TypeParam::get(this->map, "a"), nullptr);
  EXPECT_EQ(TypeParam::getVal(this->map->head), nullptr);
  EXPECT_EQ(TypeParam::put(this->map, "a", this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), Numbers{0});
}

TYPED_TEST(MapTest, NullReplacesAValue) {
  this->fill();
  EXPECT_EQ(TypeParam::put(this->map, "b", nullptr), 1);
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->map->head->next->value, nullptr);
  EXPECT_EQ(this->elements.references(1), 0);
}

TYPED_TEST(MapTest, HandsOutWhatTheCallerMustGiveBack) {
  this->fill();
  auto *value = TypeParam::get(this->map, "b");
  EXPECT_TRUE(this->elements.is(value, 1));
  EXPECT_EQ(value != this->map->head->next->value, this->elements.kCopied);
  EXPECT_EQ(this->elements.references(1), 2 * this->oneIfCounted());
  this->elements.discard(value);
}

TYPED_TEST(MapTest, RemovesAKey) {
  for (const char *gone : kKeys) {
    this->fill();
    TypeParam::rem(this->map, gone);
    std::string rest = "abc";
    rest.erase(rest.find(gone), 1);
    EXPECT_EQ(this->keys(), rest);
    EXPECT_EQ(TypeParam::hasKey(this->map, gone), 0);
    EXPECT_EQ(this->elements.references(gone[0] - 'a'), 0);
    for (const char *key : kKeys) TypeParam::rem(this->map, key);
    EXPECT_EQ(this->keys(), "");
  }
}

TYPED_TEST(MapTest, RemovesByItsOwnKey) {
  this->fill();
  TypeParam::rem(this->map, this->map->head->key);
  EXPECT_EQ(this->keys(), "bc");
}

TYPED_TEST(MapTest, RemovesNothingThatIsNotThere) {
  this->fill();
  TypeParam::rem(this->map, "d");
  EXPECT_EQ(this->keys(), "abc");
}

TYPED_TEST(MapTest, PutsARemovedKeyAtTheTail) {
  this->fill();
  TypeParam::rem(this->map, "a");
  TypeParam::put(this->map, "a", this->elements.at(0));
  EXPECT_EQ(this->keys(), "bca");
}

TYPED_TEST(MapTest, IteratesFromHeadToTail) {
  this->fill();
  int seen = 0;
  for (auto *it = TypeParam::iterator(this->map); TypeParam::hasNext(it) == 1;
       it = TypeParam::next(it)) {
    const OwnedStr key{TypeParam::getKey(it)};
    auto *value = TypeParam::getVal(it);
    EXPECT_STREQ(key.get(), kKeys[seen]);
    EXPECT_NE(key.get(), it->key);
    EXPECT_TRUE(this->elements.is(value, seen));
    EXPECT_EQ(value != it->value, this->elements.kCopied);
    EXPECT_EQ(this->elements.references(seen), 2 * this->oneIfCounted());
    this->elements.discard(value);
    seen++;
  }
  EXPECT_EQ(seen, 3);
}

TYPED_TEST(MapTest, FindsAndRemovesNodes) {
  this->fill();
  EXPECT_EQ(TypeParam::getNode(this->map, "a"), this->map->head);
  EXPECT_EQ(TypeParam::getNode(this->map, "d"), nullptr);
  TypeParam::remNode(this->map, this->map->head->next);
  EXPECT_EQ(this->keys(), "ac");
  EXPECT_EQ(this->elements.references(1), 0);
}

TYPED_TEST(MapTest, LeavesTheNodeOfAnotherMapAlone) {
  this->fill();
  auto *other = TypeParam::alloc();
  TypeParam::remNode(other, this->map->head);
  EXPECT_EQ(this->keys(), "abc");
  TypeParam::free(other);
}

TYPED_TEST(MapTest, CopiesEveryKeyAndValue) {
  this->fill();
  TypeParam::put(this->map, "n", nullptr);
  auto *copy = TypeParam::copy(this->map);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(keysIn(copy), "abcn");
  EXPECT_EQ(copy->tail->value, nullptr);
  TypeParam::rem(copy, "n");
  EXPECT_EQ(numbersIn(copy, this->elements), (Numbers{0, 1, 2}));
  EXPECT_EQ(this->elements.references(0), 2 * this->oneIfCounted());
  TypeParam::free(copy);
  EXPECT_EQ(this->elements.references(0), this->oneIfCounted());
}

TYPED_TEST(MapTest, CopyLeavesOutWhatCannotBePut) {
  TypeParam::put(this->map, "a", nullptr);
  TypeParam::put(this->map, "b", nullptr);
  failEachAllocation([&] { return TypeParam::copy(this->map); },
                     [&](int n, typename TypeParam::Head *copy) {
                       EXPECT_EQ(copy == nullptr, n == 1);
                       if (!copy) return;
                       EXPECT_EQ(keysIn(copy), n == 0 ? "ab" : n <= 3 ? "b" : "a");
                       TypeParam::free(copy);
                     });
}

TYPED_TEST(MapTest, DisposesOfItsKeysAndValuesWhenFreed) {
  const FailingMemory memory;
  auto *other = TypeParam::alloc();
  for (int i = 0; i < 3; i++) TypeParam::put(other, kKeys[i], this->elements.at(i));
  TypeParam::put(other, "n", nullptr);
  TypeParam::free(other);
  EXPECT_EQ(memory.live(), 0);
  for (int i = 0; i < 3; i++) EXPECT_EQ(this->elements.references(i), 0);
}

TYPED_TEST(MapTest, IgnoresNullArguments) {
  this->fill();
  TypeParam::free(nullptr);
  EXPECT_EQ(TypeParam::copy(nullptr), nullptr);
  EXPECT_EQ(TypeParam::put(nullptr, "a", this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::put(this->map, nullptr, this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::get(nullptr, "a"), nullptr);
  EXPECT_EQ(TypeParam::get(this->map, nullptr), nullptr);
  TypeParam::rem(nullptr, "a");
  TypeParam::rem(this->map, nullptr);
  EXPECT_EQ(TypeParam::hasKey(nullptr, "a"), 0);
  EXPECT_EQ(TypeParam::hasKey(this->map, nullptr), 0);
  EXPECT_EQ(TypeParam::iterator(nullptr), nullptr);
  EXPECT_EQ(TypeParam::next(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getKey(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getVal(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getNode(nullptr, "a"), nullptr);
  EXPECT_EQ(TypeParam::getNode(this->map, nullptr), nullptr);
  TypeParam::remNode(nullptr, this->map->head);
  TypeParam::remNode(this->map, nullptr);
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(MapTest, StaysAsItIsWhenThereIsNoMemoryForAKey) {
  TypeParam::put(this->map, "a", this->elements.at(0));
  failEachAllocation([&] { return TypeParam::put(this->map, "b", nullptr); },
                     [&](int n, uint8_t done) {
                       EXPECT_EQ(done, n == 0);
                       EXPECT_EQ(this->keys(), n == 0 ? "ab" : "a");
                     });
}

TYPED_TEST(MapTest, IsNullWhenItCannotBeAllocated) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(TypeParam::alloc(), nullptr);
}

// ---- The lock

template <typename Api>
class MapLockDeathTest : public ::testing::Test {};
TYPED_TEST_SUITE(MapLockDeathTest, PublicMaps, ApiNames);

TYPED_TEST(MapLockDeathTest, NothingHappensWhenTheLockCannotBeTaken) {
  inFreshProcess([] {
    using Twins = typename TypeParam::Twins;
    typename TypeParam::Elements elements;
    auto *map = Twins::alloc();
    for (int i = 0; i < 3; i++) Twins::put(map, kKeys[i], elements.at(i));
    auto *node = map->head;
    {
      FailingMemory memory;
      memory.failFrom(1);
      EXPECT_EQ(TypeParam::alloc(), nullptr);
      EXPECT_EQ(TypeParam::copy(map), nullptr);
      EXPECT_EQ(TypeParam::put(map, "a", elements.at(1)), 0);
      EXPECT_EQ(TypeParam::put(map, "a", nullptr), 0);
      EXPECT_EQ(TypeParam::get(map, "a"), nullptr);
      EXPECT_EQ(TypeParam::hasKey(map, "a"), 0);
      TypeParam::rem(map, "a");
      EXPECT_EQ(TypeParam::iterator(map), nullptr);
      EXPECT_EQ(TypeParam::hasNext(node), 0);
      EXPECT_EQ(TypeParam::next(node), nullptr);
      EXPECT_EQ(TypeParam::getKey(node), nullptr);
      EXPECT_EQ(TypeParam::getVal(node), nullptr);
      TypeParam::free(map);
    }
    EXPECT_EQ(numbersIn(map, elements), (Numbers{0, 1, 2}));
    Twins::free(map);
  });
}

TEST(StringToStringMapThreadTest, PublicCallsOfManyThreadsLoseNothing) {
  StringToStringMap *map = QlxAllocStringToStringMap();
  const auto put = [map](char mark) {
    std::string key(1, mark);
    for (int i = 0; i < 100; i++) {
      key += mark;
      EXPECT_EQ(QlxStringToStringMapPut(map, key.c_str(), "value"), 1);
    }
  };
  std::thread one{put, 'a'}, two{put, 'b'}, three{put, 'c'};
  one.join();
  two.join();
  three.join();
  EXPECT_EQ(chain(map).size(), 300u);
  QlxFreeStringToStringMap(map);
}

// ---- What differs between the instances

class StringToStringMapTest : public ::testing::Test {
 protected:
  ~StringToStringMapTest() override { qlxIntlFreeStringToStringMap(map); }

  StringToStringMap *map = qlxIntlAllocStringToStringMap();
};

TEST_F(StringToStringMapTest, PutsItsOwnStringsBack) {
  qlxIntlStringToStringMapPut(map, "key", "value");
  EXPECT_EQ(qlxIntlStringToStringMapPut(map, "key", map->head->value), 1);
  EXPECT_STREQ(map->head->value, "value");
  EXPECT_EQ(qlxIntlStringToStringMapPut(map, "key", map->head->value + 2), 1);
  EXPECT_STREQ(map->head->value, "lue");
  EXPECT_EQ(qlxIntlStringToStringMapPut(map, map->head->key, map->head->key), 1);
  EXPECT_STREQ(map->head->value, "key");
  EXPECT_EQ(qlxIntlStringToStringMapPut(map, map->head->key + 1, map->head->key), 1);
  EXPECT_EQ(keysIn(map), "keyey");
}

// Deliberate: with the key stored, only the value is lost, and the result is 1.
TEST_F(StringToStringMapTest, ANewKeyGetsNullWhenItsValueCannotBeCopied) {
  FailingMemory memory;
  memory.failOnce(3);  // after the node and the key
  EXPECT_EQ(qlxIntlStringToStringMapPut(map, "key", "value"), 1);
  EXPECT_EQ(memory.failures(), 1u);
  EXPECT_EQ(qlxIntlStringToStringMapHasKey(map, "key"), 1);
  EXPECT_EQ(map->head->value, nullptr);
}

TEST_F(StringToStringMapTest, TheOldValueIsGoneAlsoWhenTheNewOneCannotBeCopied) {
  qlxIntlStringToStringMapPut(map, "key", "old");
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(qlxIntlStringToStringMapPut(map, "key", "new"), 1);
  EXPECT_EQ(map->head->value, nullptr);
  EXPECT_EQ(memory.live(), -1);
}

class StringToObjMapTest : public ::testing::Test {
 protected:
  // The map's reference will be the last but one, so an object ends when the map releases it.
  StringToObjMapTest() {
    objects.objClass.fFreeVars = [](void *test) {
      const auto *map = static_cast<StringToObjMapTest *>(test)->map;
      sawItself = map->head && map->head->value;
    };
    for (QlxObject &object : objects.objects) object.refCount = 1, object.vars = this;
    sawItself = true;
    qlxIntlStringToObjMapPut(map, "key", objects.at(0));
  }
  ~StringToObjMapTest() override { qlxIntlFreeStringToObjMap(map); }

  Objects objects;
  StringToObjMap *map = qlxIntlAllocStringToObjMap();
  static inline bool sawItself;  // an object that ended found a value in the map
};

// Deliberate: the object ends although it is put again.
TEST_F(StringToObjMapTest, ReleasesTheOldValueBeforeItAcquiresTheNewOne) {
  EXPECT_EQ(qlxIntlStringToObjMapPut(map, "key", objects.at(0)), 1);
  EXPECT_EQ(objects.at(0)->objClass, nullptr);
  EXPECT_EQ(map->head->value, objects.at(0));
  EXPECT_EQ(objects.at(0)->refCount, 2u);
}

TEST_F(StringToObjMapTest, ShowsNoValueWhileItIsReplaced) {
  qlxIntlStringToObjMapPut(map, "key", objects.at(1));
  EXPECT_EQ(objects.at(0)->objClass, nullptr);
  EXPECT_FALSE(sawItself);
}

// What the end of the old value runs may change the map that is just being put into.
class ReplacingTest : public ::testing::Test {
 protected:
  ReplacingTest() {
    objects.objClass.fFreeVars = [](void *test) { static_cast<ReplacingTest *>(test)->atTheEnd(); };
    objects.at(0)->refCount = 1;
    objects.at(0)->vars = this;
    qlxIntlStringToObjMapPut(map, "key", objects.at(0));
    qlxIntlStringToObjMapPut(map, "other", objects.at(1));
  }
  ~ReplacingTest() override { qlxIntlFreeStringToObjMap(map); }

  uint8_t replace() { return qlxIntlStringToObjMapPut(map, "key", objects.at(2)); }

  Objects objects;
  StringToObjMap *map = qlxIntlAllocStringToObjMap();
  std::function<void()> atTheEnd;
};

TEST_F(ReplacingTest, TheOldValuesEndMayRemoveTheKey) {
  atTheEnd = [this] { qlxIntlStringToObjMapRem(map, "key"); };
  EXPECT_EQ(replace(), 1);
  EXPECT_EQ(keysIn(map), "otherkey");
  EXPECT_EQ(numbersIn(map, objects), (Numbers{1, 2}));
  EXPECT_EQ(objects.references(2), 1);
}

TEST_F(ReplacingTest, TheOldValuesEndMayStoreAnother) {
  atTheEnd = [this] { qlxIntlStringToObjMapPut(map, "key", objects.at(1)); };
  EXPECT_EQ(replace(), 1);
  EXPECT_EQ(keysIn(map), "keyother");
  EXPECT_EQ(numbersIn(map, objects), (Numbers{2, 1}));
  EXPECT_EQ(objects.references(1), 1);
  EXPECT_EQ(objects.references(2), 1);
}

TEST_F(ReplacingTest, TheOldValuesEndMayEmptyTheMap) {
  atTheEnd = [this] {
    while (map->head) qlxIntlStringToObjMapRemNode(map, map->head);
  };
  EXPECT_EQ(replace(), 1);
  EXPECT_EQ(keysIn(map), "key");
}

TEST_F(StringToObjMapTest, ShowsNoValueWhileItIsRemoved) {
  qlxIntlStringToObjMapRem(map, "key");
  EXPECT_EQ(objects.at(0)->objClass, nullptr);
  EXPECT_FALSE(sawItself);
}

}  // namespace
