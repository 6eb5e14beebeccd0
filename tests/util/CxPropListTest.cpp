#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include <qlx/memory.h>
#include <qlx/proplist.h>

#include "support/FailingMemory.h"
#include "support/ModelTest.h"
#include "support/PropListModel.h"
#include "support/Take.h"

namespace {

class CxPropListTest : public ::testing::Test {
 protected:
  ~CxPropListTest() override { CxPropListDiscard(&list); }

  // The entries in their order: "a=1 b=2".
  std::string entries() const {
    std::string all;
    for (int32_t i = 0; i < list.count; ++i)
      all += std::string(i ? " " : "") + list.entries[i].key + "=" + list.entries[i].value;
    return all;
  }
  void putNumbered(int32_t count) {
    for (int32_t i = list.count; i < count; ++i)
      ASSERT_EQ(CxPropListPutStr(&list, ("k" + std::to_string(i)).c_str(), "v"), 1);
  }

  CxPropList list{};
};

TEST_F(CxPropListTest, TheSameKeyTwiceKeepsItsPlaceAndTheSecondValue) {
  CxPropListPutStr(&list, "a", "1");
  CxPropListPutStr(&list, "b", "2");
  EXPECT_EQ(CxPropListPutStr(&list, "a", "3"), 1);
  EXPECT_EQ(entries(), "a=3 b=2");
}

TEST_F(CxPropListTest, KeysCompareExactly) {
  CxPropListPutStr(&list, "a", "1");
  CxPropListPutStr(&list, "A", "2");
  CxPropListPutStr(&list, "", "3");
  EXPECT_EQ(entries(), "a=1 A=2 =3");
}

TEST_F(CxPropListTest, CopiesKeysAndValues) {
  char key[] = "key";
  char value[] = "value";
  CxPropListPutStr(&list, key, value);
  key[0] = value[0] = '?';
  EXPECT_EQ(entries(), "key=value");
}

TEST_F(CxPropListTest, AValueMayBeTheListsOwn) {
  CxPropListPutStr(&list, "a", "1");
  EXPECT_EQ(CxPropListPutStr(&list, "a", list.entries[0].value), 1);
  EXPECT_EQ(CxPropListPutStr(&list, "b", list.entries[0].key), 1);
  EXPECT_EQ(entries(), "a=1 b=a");
}

TEST_F(CxPropListTest, RemovingMovesTheLastEntryIntoThePlace) {
  for (const char *key : {"a", "b", "c"}) CxPropListPutStr(&list, key, key);
  EXPECT_EQ(CxPropListRemove(&list, "a"), 1);
  EXPECT_EQ(entries(), "c=c b=b");
  EXPECT_EQ(CxPropListRemove(&list, "b"), 1);
  EXPECT_EQ(CxPropListRemove(&list, "b"), 0);
  EXPECT_EQ(entries(), "c=c");
}

TEST_F(CxPropListTest, ANullIsNotStored) {
  EXPECT_EQ(CxPropListPutStr(&list, "a", nullptr), 0);
  EXPECT_EQ(CxPropListPutStr(&list, nullptr, "1"), 0);
  EXPECT_EQ(CxPropListPutStr(nullptr, "a", "1"), 0);
  EXPECT_EQ(list.count, 0);
  CxPropListPutStr(&list, "a", "1");
  EXPECT_EQ(CxPropListPutStr(&list, "a", nullptr), 0);
  EXPECT_EQ(entries(), "a=1");
}

TEST_F(CxPropListTest, FindsCopiesAndPeeks) {
  CxPropListPutStr(&list, "a", "1");
  uint8_t found = 7;
  EXPECT_EQ(CxPropListPeekStr(&list, "a", &found), list.entries[0].value);
  EXPECT_EQ(found, 1);
  EXPECT_EQ(CxPropListPeekStr(&list, "b", &found), nullptr);
  EXPECT_EQ(found, 0);
  char *copy = CxPropListCopyStr(&list, "a", &found);
  EXPECT_NE(copy, list.entries[0].value);
  EXPECT_EQ(take(copy), "1");
  EXPECT_EQ(found, 1);
  EXPECT_EQ(CxPropListCopyStr(&list, "b", &found), nullptr);
  EXPECT_EQ(found, 0);
  EXPECT_EQ(take(CxPropListCopyStr(&list, "a", nullptr)), "1");
  EXPECT_EQ(CxPropListHasKey(&list, "a"), 1);
  EXPECT_EQ(CxPropListHasKey(&list, "b"), 0);
}

TEST_F(CxPropListTest, ANullListOrKeyFindsNothing) {
  CxPropListPutStr(&list, "a", "1");
  uint8_t found = 7;
  EXPECT_EQ(CxPropListPeekStr(nullptr, "a", &found), nullptr);
  EXPECT_EQ(found, 0);
  EXPECT_EQ(CxPropListPeekStr(&list, nullptr, nullptr), nullptr);
  EXPECT_EQ(CxPropListCopyStr(nullptr, "a", nullptr), nullptr);
  EXPECT_EQ(CxPropListHasKey(nullptr, "a"), 0);
  EXPECT_EQ(CxPropListHasKey(&list, nullptr), 0);
  EXPECT_EQ(CxPropListRemove(nullptr, "a"), 0);
  EXPECT_EQ(CxPropListRemove(&list, nullptr), 0);
  CxPropListDiscard(nullptr);
}

TEST_F(CxPropListTest, The32ndEntryDoublesTheCapacity) {
  putNumbered(1);
  EXPECT_EQ(list.capacity, 32);
  putNumbered(31);
  EXPECT_EQ(list.capacity, 32);
  putNumbered(32);
  EXPECT_EQ(list.capacity, 64);
  putNumbered(63);
  EXPECT_EQ(list.capacity, 64);
  putNumbered(64);
  EXPECT_EQ(list.capacity, 128);
  EXPECT_STREQ(CxPropListPeekStr(&list, "k0", nullptr), "v");
}

TEST_F(CxPropListTest, DiscardingLeavesAZeroRecord) {
  putNumbered(3);
  CxPropListDiscard(&list);
  EXPECT_EQ(list.count, 0);
  EXPECT_EQ(list.capacity, 0);
  EXPECT_EQ(list.entries, nullptr);
}

TEST_F(CxPropListTest, APutWithoutMemoryChangesNothingAndLosesNothing) {
  putNumbered(31);
  const std::string before = entries();
  FailingMemory memory;
  for (uint64_t nth = 1; nth <= 3; ++nth) {  // the value, the array, the key
    memory.failOnce(nth);
    EXPECT_EQ(CxPropListPutStr(&list, "new", "1"), 0) << nth;
    EXPECT_EQ(entries(), before);
  }
  memory.failOnce(1);
  EXPECT_EQ(CxPropListPutStr(&list, "k0", "other"), 0);
  EXPECT_EQ(entries(), before);
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(CxPropListTest, IteratesFromTheFirstEntryToTheLast) {
  for (const char *key : {"a", "b", "c"}) CxPropListPutStr(&list, key, "v");
  CxPropListIter iter = CxPropListIterator(&list);
  std::string keys = CxPropListIterPeekKey(&iter);
  while (CxPropListIterHasNext(&iter)) {
    CxPropListIterNext(&iter);
    keys += CxPropListIterPeekKey(&iter);
  }
  EXPECT_EQ(keys, "abc");
}

TEST_F(CxPropListTest, HasNextLooksOneAhead) {
  CxPropListPutStr(&list, "a", "1");
  CxPropListIter iter = CxPropListIterator(&list);
  EXPECT_EQ(CxPropListIterHasNext(&iter), 0);
  EXPECT_STREQ(CxPropListIterPeekKey(&iter), "a");
  CxPropListPutStr(&list, "b", "2");
  EXPECT_EQ(CxPropListIterHasNext(&iter), 1);
}

TEST_F(CxPropListTest, PastTheLastEntryAnIteratorHasNoList) {
  CxPropListPutStr(&list, "a", "1");
  CxPropListIter iter = CxPropListIterator(&list);
  CxPropListIterNext(&iter);
  EXPECT_EQ(iter.list, nullptr);
  EXPECT_EQ(iter.index, 0);
  EXPECT_EQ(CxPropListIterPeekKey(&iter), nullptr);
  CxPropListIterNext(&iter);
  EXPECT_EQ(iter.list, nullptr);
  EXPECT_EQ(iter.index, 0);
}

TEST_F(CxPropListTest, AnIteratorPeeksAndCopies) {
  CxPropListPutStr(&list, "a", "1");
  const CxPropListIter iter = CxPropListIterator(&list);
  EXPECT_EQ(CxPropListIterPeekKey(&iter), list.entries[0].key);
  EXPECT_EQ(CxPropListIterPeekVal(&iter), list.entries[0].value);
  EXPECT_EQ(take(CxPropListIterCopyKey(&iter)), "a");
  EXPECT_EQ(take(CxPropListIterCopyVal(&iter)), "1");
}

TEST_F(CxPropListTest, AnIteratorWithoutAnEntryGivesNothing) {
  CxPropListIter iter = CxPropListIterator(&list);
  EXPECT_EQ(CxPropListIterPeekKey(&iter), nullptr);
  EXPECT_EQ(CxPropListIterPeekVal(&iter), nullptr);
  EXPECT_EQ(CxPropListIterHasNext(&iter), 0);
  CxPropListPutStr(&list, "a", "1");
  CxPropListPutStr(&list, "b", "1");
  for (const int32_t index : {-1, 2, 3}) {
    iter = {&list, index};
    EXPECT_EQ(CxPropListIterPeekKey(&iter), nullptr);
    EXPECT_EQ(CxPropListIterCopyKey(&iter), nullptr);
    EXPECT_EQ(CxPropListIterCopyVal(&iter), nullptr);
    EXPECT_EQ(CxPropListIterHasNext(&iter), 0);
  }
  iter = CxPropListIterator(nullptr);
  EXPECT_EQ(CxPropListIterPeekVal(&iter), nullptr);
  EXPECT_EQ(CxPropListIterHasNext(&iter), 0);
  EXPECT_EQ(CxPropListIterPeekKey(nullptr), nullptr);
  EXPECT_EQ(CxPropListIterPeekVal(nullptr), nullptr);
  EXPECT_EQ(CxPropListIterCopyKey(nullptr), nullptr);
  EXPECT_EQ(CxPropListIterCopyVal(nullptr), nullptr);
  EXPECT_EQ(CxPropListIterHasNext(nullptr), 0);
  CxPropListIterNext(nullptr);
}

TEST(CxPropListModelTest, IsLikeTheModelThroughRandomOperations) {
  walk<models::PropListModel>(100000);
}

class CxListUtilTest : public ::testing::Test {
 protected:
  ~CxListUtilTest() override { CxListDiscard(&array, &capacity, &count); }

  uint8_t ensure(int32_t needed, uint32_t size = 4) {
    return CxListEnsureCapacity(&array, &capacity, &count, needed, size);
  }

  void *array = nullptr;
  int32_t capacity = 0;
  int32_t count = 0;
};

TEST_F(CxListUtilTest, WithoutAnArrayExactlyTheNeededIsAllocated) {
  capacity = count = 9;
  EXPECT_EQ(ensure(5), 1);
  EXPECT_NE(array, nullptr);
  EXPECT_EQ(capacity, 5);
  EXPECT_EQ(count, 0);
}

TEST_F(CxListUtilTest, GrowsTo16DoubledUntilItExceedsTheNeeded) {
  ensure(5);
  count = 3;
  static_cast<int32_t *>(array)[2] = 42;
  const void *before = array;
  EXPECT_EQ(ensure(5), 1);
  EXPECT_EQ(array, before);
  EXPECT_EQ(ensure(6), 1);
  EXPECT_EQ(capacity, 16);
  EXPECT_EQ(ensure(17), 1);
  EXPECT_EQ(capacity, 32);
  EXPECT_EQ(ensure(64), 1);
  EXPECT_EQ(capacity, 128);
  EXPECT_EQ(count, 3);
  EXPECT_EQ(static_cast<int32_t *>(array)[2], 42);
}

TEST_F(CxListUtilTest, FailuresChangeNothing) {
  EXPECT_EQ(ensure(0), 0);
  EXPECT_EQ(ensure(-1), 0);
  EXPECT_EQ(ensure(INT32_MAX), 0);
  EXPECT_EQ(ensure(1 << 20, (1 << 20) + 1), 0);  // more than 2^40 bytes
  EXPECT_EQ(array, nullptr);
  ensure(5);
  const void *before = array;
  EXPECT_EQ(ensure(1 << 30), 0);
  EXPECT_EQ(ensure(INT32_MAX), 0);
  EXPECT_EQ(ensure(1 << 30, 1), 0);
  EXPECT_EQ(ensure(1 << 20, (1 << 20) + 1), 0);
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(ensure(6), 0);
  EXPECT_EQ(array, before);
  EXPECT_EQ(capacity, 5);
}

TEST_F(CxListUtilTest, DiscardingZeroesAllThree) {
  ensure(5);
  count = 3;
  CxListDiscard(&array, &capacity, &count);
  EXPECT_EQ(array, nullptr);
  EXPECT_EQ(capacity, 0);
  EXPECT_EQ(count, 0);
}

TEST_F(CxListUtilTest, NullPointersFailAndAreSkipped) {
  EXPECT_EQ(CxListEnsureCapacity(nullptr, &capacity, &count, 1, 1), 0);
  EXPECT_EQ(CxListEnsureCapacity(&array, nullptr, &count, 1, 1), 0);
  EXPECT_EQ(CxListEnsureCapacity(&array, &capacity, nullptr, 1, 1), 0);
  ensure(1);
  CxListDiscard(&array, nullptr, nullptr);
  EXPECT_EQ(array, nullptr);
  CxListDiscard(nullptr, &capacity, &count);
  EXPECT_EQ(capacity, 0);
  CxListDiscard(nullptr, nullptr, nullptr);
}

}  // namespace
