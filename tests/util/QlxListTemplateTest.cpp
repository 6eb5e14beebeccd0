// Lists: every behaviour with both instances, through the public functions and through the twins.
#include <string>
#include <thread>
#include <vector>

#include "object/QlxLocked.h"
#include "support/ContainerApis.h"
#include "support/ContainerTest.h"
#include "support/WantedLeak.h"

namespace {

// Lists can be sorted, so their elements have an order.
struct SortedStrings : Strings {
  static int compare(const void *a, const void *b) {
    return strcmp(*static_cast<char *const *>(a), *static_cast<char *const *>(b));
  }
  const std::vector<int> sorted = {2, 0, 1};
};

struct SortedParms : Parms {
  static int compare(const void *a, const void *b) {
    return (*static_cast<Parm *const *>(a))->type - (*static_cast<Parm *const *>(b))->type;
  }
  const std::vector<int> sorted = {0, 2, 1};
};

LIST_API(Qlx, StringList, SortedStrings);
LIST_API(qlxIntl, StringList, SortedStrings);
LIST_API(Qlx, ParmList, SortedParms);
LIST_API(qlxIntl, ParmList, SortedParms);

using PublicLists = ::testing::Types<QlxStringListApi, QlxParmListApi>;
using AllLists =
    ::testing::Types<QlxStringListApi, qlxIntlStringListApi, QlxParmListApi, qlxIntlParmListApi>;

template <typename Api>
class ListTest : public ::testing::Test {
 protected:
  ListTest() { const ApiLock made; }  // sorting takes the lock, whose memory no test counts
  ~ListTest() override { Api::free(list); }

  void fill() {
    for (int i = 0; i < 3; i++) ASSERT_EQ(Api::append(list, elements.at(i)), 1);
  }
  void sort() {
    const WantedLeak array;
    Api::sort(list, elements.compare);
  }
  Numbers content() { return numbersIn(list, elements); }

  typename Api::Elements elements;
  typename Api::Head *list = Api::alloc();
};

TYPED_TEST_SUITE(ListTest, AllLists, ApiNames);

TYPED_TEST(ListTest, IsEmptyAtFirst) {
  ASSERT_NE(this->list, nullptr);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(TypeParam::iterator(this->list), nullptr);
  EXPECT_EQ(TypeParam::hasNext(nullptr), 0);
}

TYPED_TEST(ListTest, KeepsTheOrderOfAppending) {
  this->fill();
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(this->list->count, 3);
}

TYPED_TEST(ListTest, HoldsAnElementTwice) {
  TypeParam::append(this->list, this->elements.at(0));
  EXPECT_EQ(TypeParam::append(this->list, this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), (Numbers{0, 0}));
  EXPECT_EQ(this->list->count, 2);
  EXPECT_NE(this->list->head->value, this->list->tail->value);
}

TYPED_TEST(ListTest, AppendsItsOwnElement) {
  this->fill();
  EXPECT_EQ(TypeParam::append(this->list, this->list->head->value), 1);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2, 0}));
}

TYPED_TEST(ListTest, IteratesFromHeadToTailAndHandsOutCopies) {
  this->fill();
  int seen = 0;
  for (auto *it = TypeParam::iterator(this->list); TypeParam::hasNext(it) == 1;
       it = TypeParam::next(it)) {
    auto *handed = TypeParam::get(it);
    EXPECT_TRUE(this->elements.is(handed, seen++));
    EXPECT_NE(handed, it->value);
    this->elements.discard(handed);
  }
  EXPECT_EQ(seen, 3);
}

TYPED_TEST(ListTest, IterRemOnEveryNodeEmptiesTheListAndEndsWithNull) {
  this->fill();
  int steps = 0;
  auto *it = TypeParam::iterator(this->list);
  for (; it && steps < 3; steps++) it = TypeParam::iterRem(it);
  EXPECT_EQ(it, nullptr);
  EXPECT_EQ(steps, 3);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(this->list->count, 0);
}

TYPED_TEST(ListTest, IterRemRemovesExactlyItsNode) {
  this->fill();
  TypeParam::append(this->list, this->elements.at(0));
  auto *first = this->list->head;
  EXPECT_EQ(TypeParam::iterRem(this->list->tail), nullptr);
  EXPECT_EQ(this->list->head, first);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(TypeParam::iterRem(first->next), this->list->tail);
  EXPECT_EQ(this->content(), (Numbers{0, 2}));
}

TYPED_TEST(ListTest, GetLinkFindsTheFirstNodeOfAnElement) {
  this->fill();
  TypeParam::append(this->list, this->elements.at(1));
  EXPECT_EQ(TypeParam::getLink(this->list, this->elements.at(1)), this->list->head->next);
  TypeParam::iterRem(this->list->head);
  EXPECT_EQ(TypeParam::getLink(this->list, this->elements.at(0)), nullptr);
}

TYPED_TEST(ListTest, GetIndexGivesTheStoredElementItself) {
  this->fill();
  EXPECT_EQ(TypeParam::getIndex(this->list, 0), this->list->head->value);
  EXPECT_EQ(TypeParam::getIndex(this->list, 1), this->list->head->next->value);
  EXPECT_EQ(TypeParam::getIndex(this->list, 2), this->list->tail->value);
}

TYPED_TEST(ListTest, GetIndexIsNullOutsideOfTheList) {
  EXPECT_EQ(TypeParam::getIndex(this->list, 0), nullptr);
  this->fill();
  EXPECT_EQ(TypeParam::getIndex(this->list, -1), nullptr);
  EXPECT_EQ(TypeParam::getIndex(this->list, 3), nullptr);
  EXPECT_EQ(TypeParam::getIndex(this->list, INT32_MAX), nullptr);
  EXPECT_EQ(TypeParam::getIndex(this->list, INT32_MIN), nullptr);
}

TYPED_TEST(ListTest, RemLinkRemovesTheNode) {
  this->fill();
  TypeParam::remLink(this->list, this->list->head->next);
  EXPECT_EQ(this->content(), (Numbers{0, 2}));
  TypeParam::remLink(this->list, this->list->head);
  EXPECT_EQ(this->content(), Numbers{2});
  TypeParam::remLink(this->list, this->list->tail);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(this->list->count, 0);
}

TYPED_TEST(ListTest, RemLinkLeavesTheNodeOfAnotherListAlone) {
  this->fill();
  auto *other = TypeParam::copy(this->list);
  TypeParam::remLink(other, this->list->head);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(chain(other).size(), 3u);
  TypeParam::free(other);
}

TYPED_TEST(ListTest, LinkAndIndexTakeNoLock) {
  this->fill();
  ASSERT_EQ(qlxAPIMutexLock(), 1);
  EXPECT_NE(TypeParam::getLink(this->list, this->elements.at(0)), nullptr);
  EXPECT_NE(TypeParam::getIndex(this->list, 0), nullptr);
  TypeParam::remLink(this->list, this->list->head);
  qlxAPIMutexUnlock();
  EXPECT_EQ(this->content(), (Numbers{1, 2}));
}

TYPED_TEST(ListTest, CopiesEveryElement) {
  this->fill();
  auto *copy = TypeParam::copy(this->list);
  EXPECT_EQ(numbersIn(copy, this->elements), (Numbers{0, 1, 2}));
  EXPECT_NE(copy->head->value, this->list->head->value);
  TypeParam::free(copy);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(ListTest, CopyLeavesOutWhatCannotBeCopied) {
  this->fill();
  failEachAllocation([&] { return TypeParam::copy(this->list); },
                     [&](int n, typename TypeParam::Head *copy) {
                       EXPECT_EQ(copy == nullptr, n == 1);
                       if (!copy) return;
                       EXPECT_EQ(chain(copy).size(), n == 0 ? 3u : 2u);
                       TypeParam::free(copy);
                     });
}

TYPED_TEST(ListTest, SortsTheValuesAndKeepsTheNodes) {
  this->fill();
  const auto nodes = chain(this->list);
  this->sort();
  EXPECT_EQ(this->content(), this->elements.sorted);
  EXPECT_EQ(chain(this->list), nodes);
}

TYPED_TEST(ListTest, SortedValuesAreTheSameBlocks) {
  this->fill();
  auto *wasFirst = this->list->head->value;
  this->sort();
  EXPECT_EQ(TypeParam::getLink(this->list, this->elements.at(0))->value, wasFirst);
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
  TypeParam::sort(this->list, nullptr);
  {
    FailingMemory memory;
    memory.failOnce(1);
    TypeParam::sort(this->list, this->elements.compare);
    EXPECT_EQ(memory.failures(), 1u);
  }
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  EXPECT_EQ(qlxAPIMutexLock(), 1);
  qlxAPIMutexUnlock();
}

TYPED_TEST(ListTest, DisposesOfItsElementsWhenFreed) {
  const FailingMemory memory;
  auto *other = TypeParam::alloc();
  for (int i = 0; i < 3; i++) TypeParam::append(other, this->elements.at(i));
  TypeParam::free(other);
  EXPECT_EQ(memory.live(), 0);
}

TYPED_TEST(ListTest, IgnoresNullArguments) {
  this->fill();
  TypeParam::free(nullptr);
  EXPECT_EQ(TypeParam::copy(nullptr), nullptr);
  EXPECT_EQ(TypeParam::append(nullptr, this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::append(this->list, nullptr), 0);
  EXPECT_EQ(TypeParam::iterator(nullptr), nullptr);
  EXPECT_EQ(TypeParam::next(nullptr), nullptr);
  EXPECT_EQ(TypeParam::get(nullptr), nullptr);
  EXPECT_EQ(TypeParam::iterRem(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getLink(nullptr, this->elements.at(0)), nullptr);
  EXPECT_EQ(TypeParam::getLink(this->list, nullptr), nullptr);
  EXPECT_EQ(TypeParam::getIndex(nullptr, 0), nullptr);
  TypeParam::remLink(nullptr, this->list->head);
  TypeParam::remLink(this->list, nullptr);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(ListTest, StaysAsItIsWhenMemoryRunsOut) {
  TypeParam::append(this->list, this->elements.at(0));
  failEachAllocation([&] { return TypeParam::append(this->list, this->elements.at(2)); },
                     [&](int n, uint8_t appended) {
                       EXPECT_EQ(appended, n == 0);
                       EXPECT_EQ(this->content(), n == 0 ? (Numbers{0, 2}) : Numbers{0});
                     });
}

TYPED_TEST(ListTest, IsNullWhenItCannotBeAllocated) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(TypeParam::alloc(), nullptr);
}

// ---- The lock

template <typename Api>
class ListLockDeathTest : public ::testing::Test {};
TYPED_TEST_SUITE(ListLockDeathTest, PublicLists, ApiNames);

TYPED_TEST(ListLockDeathTest, NothingHappensWhenTheLockCannotBeTaken) {
  inFreshProcess([] {
    using Twins = typename TypeParam::Twins;
    typename TypeParam::Elements elements;
    auto *list = Twins::alloc();
    for (int i = 0; i < 3; i++) Twins::append(list, elements.at(i));
    auto *node = list->head;
    {
      FailingMemory memory;
      memory.failFrom(1);
      EXPECT_EQ(TypeParam::alloc(), nullptr);
      EXPECT_EQ(TypeParam::copy(list), nullptr);
      EXPECT_EQ(TypeParam::append(list, elements.at(0)), 0);
      EXPECT_EQ(TypeParam::iterator(list), nullptr);
      EXPECT_EQ(TypeParam::hasNext(node), 0);
      EXPECT_EQ(TypeParam::next(node), nullptr);
      EXPECT_EQ(TypeParam::get(node), nullptr);
      EXPECT_EQ(TypeParam::iterRem(node), nullptr);
      TypeParam::sort(list, elements.compare);
      TypeParam::free(list);
    }
    EXPECT_EQ(numbersIn(list, elements), (Numbers{0, 1, 2}));
    Twins::free(list);
  });
}

TEST(StringListThreadTest, PublicCallsOfManyThreadsLoseNothing) {
  StringList *list = QlxAllocStringList();
  const auto append = [list](const char *text) {
    for (int i = 0; i < 300; i++) EXPECT_EQ(QlxStringListAppend(list, text), 1);
  };
  std::thread one{append, "a"}, two{append, "b"}, three{append, "c"};
  one.join();
  two.join();
  three.join();
  EXPECT_EQ(chain(list).size(), 900u);
  QlxFreeStringList(list);
}

TEST(StringListThreadTest, NothingIsAppendedDuringASort) {
  StringList *list = QlxAllocStringList();
  std::thread sorter{[list] {
    const WantedLeak arrays;
    for (int i = 0; i < 100; i++) QlxSortStringList(list, SortedStrings::compare);
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
