// Maps: what only they do, with all instances, through the public functions and the twins.
#include <functional>

#include "support/ContainerTest.h"

namespace {

template <typename Api>
class MapTest : public ContainerTest<Api> {};
TYPED_TEST_SUITE(MapTest, AllMaps, ApiNames);

TYPED_TEST(MapTest, KnowsOnlyItsKeys) {
  EXPECT_EQ(TypeParam::hasKey(this->container, "a"), 0);
  EXPECT_EQ(TypeParam::get(this->container, "a"), nullptr);
  this->fill();
  EXPECT_EQ(TypeParam::hasKey(this->container, "a"), 1);
  TypeParam::rem(this->container, "a");
  EXPECT_EQ(TypeParam::hasKey(this->container, "a"), 0);
}

TYPED_TEST(MapTest, CopiesTheKey) {
  char key[] = "a";
  TypeParam::put(this->container, key, this->elements.at(0));
  key[0] = 'x';
  EXPECT_EQ(this->keys(), "a");
}

TYPED_TEST(MapTest, TellsKeysApartByTheirBytes) {
  TypeParam::put(this->container, "key", this->elements.at(0));
  TypeParam::put(this->container, "Key", this->elements.at(1));
  TypeParam::put(this->container, "", this->elements.at(2));
  EXPECT_EQ(this->keys(), "keyKey");
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(TypeParam::hasKey(this->container, "KEY"), 0);
  EXPECT_EQ(TypeParam::hasKey(this->container, ""), 1);
}

TYPED_TEST(MapTest, PutOfAnExistingKeyReplacesOnlyTheValue) {
  this->fill();
  auto *node = this->container->head->next;
  const char *key = node->key;
  EXPECT_EQ(TypeParam::put(this->container, "b", this->elements.at(0)), 1);
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->content(), (Numbers{0, 0, 2}));
  EXPECT_EQ(this->container->head->next, node);
  EXPECT_EQ(node->key, key);
  EXPECT_EQ(this->elements.references(0), 2 * this->oneIfCounted());
  EXPECT_EQ(this->elements.references(1), 0);
}

TYPED_TEST(MapTest, PutOfTheSameValueAgainKeepsOneReference) {
  this->fill();
  EXPECT_EQ(TypeParam::put(this->container, "a", this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(this->elements.references(0), this->oneIfCounted());
}

TYPED_TEST(MapTest, ANullValueIsAValue) {
  EXPECT_EQ(TypeParam::put(this->container, "a", nullptr), 1);
  EXPECT_EQ(TypeParam::hasKey(this->container, "a"), 1);
  EXPECT_EQ(TypeParam::get(this->container, "a"), nullptr);
  EXPECT_EQ(TypeParam::getVal(this->container->head), nullptr);
  EXPECT_EQ(TypeParam::put(this->container, "a", this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), Numbers{0});
}

TYPED_TEST(MapTest, DisposesOfAKeyWithoutAValueWhenFreed) {
  const FailingMemory memory;
  auto *other = TypeParam::alloc();
  TypeParam::put(other, "n", nullptr);
  TypeParam::free(other);
  EXPECT_EQ(memory.live(), 0);
}

TYPED_TEST(MapTest, NullReplacesAValue) {
  this->fill();
  EXPECT_EQ(TypeParam::put(this->container, "b", nullptr), 1);
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->container->head->next->value, nullptr);
  EXPECT_EQ(this->elements.references(1), 0);
}

TYPED_TEST(MapTest, HandsOutWhatTheCallerMustGiveBack) {
  this->fill();
  auto *value = TypeParam::get(this->container, "b");
  EXPECT_TRUE(this->elements.is(value, 1));
  EXPECT_EQ(value != this->container->head->next->value, this->elements.kCopied);
  EXPECT_EQ(this->elements.references(1), 2 * this->oneIfCounted());
  this->elements.discard(value);
}

TYPED_TEST(MapTest, RemovesByItsOwnKey) {
  this->fill();
  TypeParam::rem(this->container, this->container->head->key);
  EXPECT_EQ(this->keys(), "bc");
}

TYPED_TEST(MapTest, HandsOutCopiesOfItsKeys) {
  this->fill();
  const char *const *expected = kKeys;
  for (auto *it = this->container->head; it; it = it->next) {
    const OwnedStr key{TypeParam::getKey(it)};
    EXPECT_STREQ(key.get(), *expected++);
    EXPECT_NE(key.get(), it->key);
  }
}

TYPED_TEST(MapTest, FindsAndRemovesNodes) {
  this->fill();
  EXPECT_EQ(TypeParam::getNode(this->container, "a"), this->container->head);
  EXPECT_EQ(TypeParam::getNode(this->container, "d"), nullptr);
  TypeParam::remNode(this->container, this->container->head->next);
  EXPECT_EQ(this->keys(), "ac");
  EXPECT_EQ(this->elements.references(1), 0);
}

TYPED_TEST(MapTest, LeavesTheNodeOfAnotherMapAlone) {
  this->fill();
  auto *other = TypeParam::alloc();
  TypeParam::remNode(other, this->container->head);
  EXPECT_EQ(this->keys(), "abc");
  TypeParam::free(other);
}

TYPED_TEST(MapTest, CopiesEveryKeyAndValue) {
  this->fill();
  TypeParam::put(this->container, "n", nullptr);
  auto *copy = TypeParam::copy(this->container);
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
  TypeParam::put(this->container, "a", nullptr);
  TypeParam::put(this->container, "b", nullptr);
  failEachAllocation([&] { return TypeParam::copy(this->container); },
                     [&](int n, typename TypeParam::Head *copy) {
                       EXPECT_EQ(copy == nullptr, n == 1);
                       if (!copy) return;
                       EXPECT_EQ(keysIn(copy), n == 0 ? "ab" : n <= 3 ? "b" : "a");
                       TypeParam::free(copy);
                     });
}

TYPED_TEST(MapTest, IgnoresNullArguments) {
  this->fill();
  EXPECT_EQ(TypeParam::copy(nullptr), nullptr);
  EXPECT_EQ(TypeParam::put(this->container, nullptr, this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::get(nullptr, "a"), nullptr);
  EXPECT_EQ(TypeParam::get(this->container, nullptr), nullptr);
  TypeParam::rem(nullptr, "a");
  TypeParam::rem(this->container, nullptr);
  EXPECT_EQ(TypeParam::hasKey(nullptr, "a"), 0);
  EXPECT_EQ(TypeParam::hasKey(this->container, nullptr), 0);
  EXPECT_EQ(TypeParam::getKey(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getNode(nullptr, "a"), nullptr);
  EXPECT_EQ(TypeParam::getNode(this->container, nullptr), nullptr);
  TypeParam::remNode(nullptr, this->container->head);
  TypeParam::remNode(this->container, nullptr);
  EXPECT_EQ(this->keys(), "abc");
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
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
