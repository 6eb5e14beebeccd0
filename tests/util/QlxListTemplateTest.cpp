// Lists: what only they do, with both instances, through the public functions and the twins.
#include <string>
#include <thread>

#include "object/QlxLocked.h"
#include "support/ContainerTest.h"
#include "support/FreshProcess.h"
#include "support/WantedLeak.h"

namespace {

template <typename Api>
class ListTest : public ContainerTest<Api> {
 protected:
  ListTest() { const ApiLock made; }  // sorting takes the lock, whose memory no test counts

  void sort() {
    const WantedLeak array;
    Api::sort(this->container, this->elements.compare);
  }
};
TYPED_TEST_SUITE(ListTest, AllLists, ApiNames);

TYPED_TEST(ListTest, HoldsAnElementTwice) {
  TypeParam::append(this->container, this->elements.at(0));
  EXPECT_EQ(TypeParam::append(this->container, this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), (Numbers{0, 0}));
  EXPECT_EQ(this->container->count, 2);
  EXPECT_NE(this->container->head->value, this->container->tail->value);
}

TYPED_TEST(ListTest, AppendsItsOwnElement) {
  this->fill();
  EXPECT_EQ(TypeParam::append(this->container, this->container->head->value), 1);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2, 0}));
}

TYPED_TEST(ListTest, IterRemRemovesExactlyItsNode) {
  this->fill();
  TypeParam::append(this->container, this->elements.at(0));
  auto *first = this->container->head;
  EXPECT_EQ(TypeParam::iterRem(this->container->tail), nullptr);
  EXPECT_EQ(this->container->head, first);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(TypeParam::iterRem(first->next), this->container->tail);
  EXPECT_EQ(this->content(), (Numbers{0, 2}));
}

TYPED_TEST(ListTest, GetLinkFindsTheFirstNodeOfAnElement) {
  this->fill();
  TypeParam::append(this->container, this->elements.at(1));
  EXPECT_EQ(TypeParam::getLink(this->container, this->elements.at(1)), this->container->head->next);
  TypeParam::iterRem(this->container->head);
  EXPECT_EQ(TypeParam::getLink(this->container, this->elements.at(0)), nullptr);
}

TYPED_TEST(ListTest, GetIndexGivesTheStoredElementItself) {
  this->fill();
  EXPECT_EQ(TypeParam::getIndex(this->container, 0), this->container->head->value);
  EXPECT_EQ(TypeParam::getIndex(this->container, 1), this->container->head->next->value);
  EXPECT_EQ(TypeParam::getIndex(this->container, 2), this->container->tail->value);
}

TYPED_TEST(ListTest, GetIndexIsNullOutsideOfTheList) {
  EXPECT_EQ(TypeParam::getIndex(this->container, 0), nullptr);
  this->fill();
  EXPECT_EQ(TypeParam::getIndex(this->container, -1), nullptr);
  EXPECT_EQ(TypeParam::getIndex(this->container, 3), nullptr);
  EXPECT_EQ(TypeParam::getIndex(this->container, INT32_MAX), nullptr);
  EXPECT_EQ(TypeParam::getIndex(this->container, INT32_MIN), nullptr);
}

TYPED_TEST(ListTest, RemLinkRemovesTheNode) {
  this->fill();
  TypeParam::remLink(this->container, this->container->head->next);
  EXPECT_EQ(this->content(), (Numbers{0, 2}));
  TypeParam::remLink(this->container, this->container->head);
  EXPECT_EQ(this->content(), Numbers{2});
  TypeParam::remLink(this->container, this->container->tail);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(this->container->count, 0);
}

TYPED_TEST(ListTest, RemLinkLeavesTheNodeOfAnotherListAlone) {
  this->fill();
  auto *other = TypeParam::copy(this->container);
  TypeParam::remLink(other, this->container->head);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(chain(other).size(), 3u);
  TypeParam::free(other);
}

TYPED_TEST(ListTest, LinkAndIndexTakeNoLock) {
  this->fill();
  ASSERT_EQ(qlxAPIMutexLock(), 1);
  EXPECT_NE(TypeParam::getLink(this->container, this->elements.at(0)), nullptr);
  EXPECT_NE(TypeParam::getIndex(this->container, 0), nullptr);
  TypeParam::remLink(this->container, this->container->head);
  qlxAPIMutexUnlock();
  EXPECT_EQ(this->content(), (Numbers{1, 2}));
}

TYPED_TEST(ListTest, CopiesEveryElement) {
  this->fill();
  auto *copy = TypeParam::copy(this->container);
  EXPECT_EQ(numbersIn(copy, this->elements), (Numbers{0, 1, 2}));
  EXPECT_NE(copy->head->value, this->container->head->value);
  TypeParam::free(copy);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(ListTest, CopyLeavesOutWhatCannotBeCopied) {
  this->fill();
  failEachAllocation([&] { return TypeParam::copy(this->container); },
                     [&](int n, typename TypeParam::Head *copy) {
                       EXPECT_EQ(copy == nullptr, n == 1);
                       if (!copy) return;
                       EXPECT_EQ(chain(copy).size(), n == 0 ? 3u : 2u);
                       TypeParam::free(copy);
                     });
}

TYPED_TEST(ListTest, SortsTheValuesAndKeepsTheNodes) {
  this->fill();
  const auto nodes = chain(this->container);
  this->sort();
  EXPECT_EQ(this->content(), this->elements.sorted);
  EXPECT_EQ(chain(this->container), nodes);
}

TYPED_TEST(ListTest, SortedValuesAreTheSameBlocks) {
  this->fill();
  auto *wasFirst = this->container->head->value;
  this->sort();
  EXPECT_EQ(TypeParam::getLink(this->container, this->elements.at(0))->value, wasFirst);
}

TYPED_TEST(ListTest, SortLeavesItsArray) {
  this->fill();
  const FailingMemory memory;
  this->sort();
  EXPECT_EQ(memory.live(), 1);
}

TYPED_TEST(ListTest, SortsAnEmptyListWithoutAnArray) {
  const FailingMemory memory;
  this->sort();
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(memory.attempts(), 0u);
}

TYPED_TEST(ListTest, SortWithoutMemoryOrComparisonChangesNothing) {
  this->fill();
  TypeParam::sort(nullptr, this->elements.compare);
  TypeParam::sort(this->container, nullptr);
  {
    FailingMemory memory;
    memory.failOnce(1);
    TypeParam::sort(this->container, this->elements.compare);
    EXPECT_EQ(memory.failures(), 1u);
  }
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(qlxAPIMutexLock(), 1);
  qlxAPIMutexUnlock();
}

TYPED_TEST(ListTest, IgnoresNullArguments) {
  this->fill();
  EXPECT_EQ(TypeParam::copy(nullptr), nullptr);
  EXPECT_EQ(TypeParam::append(this->container, nullptr), 0);
  EXPECT_EQ(TypeParam::iterRem(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getLink(nullptr, this->elements.at(0)), nullptr);
  EXPECT_EQ(TypeParam::getLink(this->container, nullptr), nullptr);
  EXPECT_EQ(TypeParam::getIndex(nullptr, 0), nullptr);
  TypeParam::remLink(nullptr, this->container->head);
  TypeParam::remLink(this->container, nullptr);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

// ---- The lock

template <typename Api>
class ListLockDeathTest : public ::testing::Test {};
using PublicLists = ::testing::Types<QlxStringListApi, QlxParmListApi>;
TYPED_TEST_SUITE(ListLockDeathTest, PublicLists, ApiNames);

TYPED_TEST(ListLockDeathTest, IsSortedUnderTheLockAndNotWithoutIt) {
  inFreshProcess([] {
    using Twins = typename TypeParam::Twins;
    Elements<TypeParam> elements;
    auto *list = Twins::alloc();
    for (int i = 0; i < 3; i++) Twins::append(list, elements.at(i));
    FailingMemory memory;
    memory.failFrom(1);
    TypeParam::sort(list, elements.compare);
    EXPECT_EQ(numbersIn(list, elements), (Numbers{0, 1, 2}));
    memory.failNone();
    const WantedLeak array;
    TypeParam::sort(list, elements.compare);
    EXPECT_EQ(numbersIn(list, elements), elements.sorted);
    memory.failFrom(1);
    EXPECT_EQ(qlxAPIMutexLock(), 1);  // made by the sort
    Twins::free(list);
  });
}

TEST(StringListThreadTest, NothingIsAppendedDuringASort) {
  StringList *list = QlxAllocStringList();
  std::thread sorter{[list] {
    const WantedLeak arrays;
    for (int i = 0; i < 100; i++) QlxSortStringList(list, Strings::compare);
  }};
  for (int i = 0; i < 300; i++) QlxStringListAppend(list, i % 2 ? "a" : "b");
  sorter.join();
  EXPECT_EQ(chain(list).size(), 300u);
  QlxFreeStringList(list);
}

// ---- What differs between the instances

TEST(StringListTest, TellsStringsApartByTheirBytes) {
  StringList *list = qlxIntlAllocStringList();
  qlxIntlStringListAppend(list, "Name");
  EXPECT_EQ(QlxStringListGetLink(list, "name"), nullptr);
  EXPECT_EQ(QlxStringListGetLink(list, std::string("Name").c_str()), list->head);
  qlxIntlFreeStringList(list);
}

TEST(ParmListTest, CopiesTheStringOfAParameter) {
  Parms parms;
  ParmList *list = qlxIntlAllocParmList();
  qlxIntlParmListAppend(list, parms.at(1));
  parms.text[0] = 'x';
  EXPECT_STREQ(list->head->value->value.s, "abc");
  EXPECT_EQ(QlxParmListGetLink(list, parms.at(1)), nullptr);
  qlxIntlFreeParmList(list);
}

TEST(ParmListTest, FindsNoParameterThatEqualsNothing) {
  Parm unknown = {};
  unknown.type = 999;
  ParmList *list = qlxIntlAllocParmList();
  EXPECT_EQ(qlxIntlParmListAppend(list, &unknown), 1);
  EXPECT_EQ(QlxParmListGetLink(list, &unknown), nullptr);
  EXPECT_EQ(QlxParmListGetLink(list, list->head->value), nullptr);
  qlxIntlFreeParmList(list);
}

}  // namespace
