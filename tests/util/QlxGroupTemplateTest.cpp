// Groups: every behaviour with both instances, through the public functions and through the twins.
#include <string>
#include <thread>

#include "support/ContainerApis.h"
#include "support/ContainerTest.h"

namespace {

GROUP_API(Qlx, StringGroup, Strings);
GROUP_API(qlxIntl, StringGroup, Strings);
GROUP_API(Qlx, ListenerGroup, Objects);
GROUP_API(qlxIntl, ListenerGroup, Objects);

using PublicGroups = ::testing::Types<QlxStringGroupApi, QlxListenerGroupApi>;
using AllGroups = ::testing::Types<QlxStringGroupApi, qlxIntlStringGroupApi, QlxListenerGroupApi,
                                   qlxIntlListenerGroupApi>;

template <typename Api>
class GroupTest : public ::testing::Test {
 protected:
  ~GroupTest() override { Api::free(group); }

  void fill() {
    for (int i = 0; i < 3; i++) ASSERT_EQ(Api::add(group, elements.at(i)), 1);
  }

  Numbers content() { return numbersIn(group, elements); }

  typename Api::Elements elements;
  typename Api::Head *group = Api::alloc();
};

TYPED_TEST_SUITE(GroupTest, AllGroups, ApiNames);

TYPED_TEST(GroupTest, IsEmptyAtFirst) {
  ASSERT_NE(this->group, nullptr);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(TypeParam::iterator(this->group), nullptr);
  EXPECT_EQ(TypeParam::hasNext(nullptr), 0);
}

TYPED_TEST(GroupTest, KeepsTheOrderOfInsertion) {
  this->fill();
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(GroupTest, AddsAnElementOnlyOnce) {
  this->fill();
  EXPECT_EQ(TypeParam::add(this->group, this->elements.at(1)), 0);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  if (this->elements.kCounted) {
    EXPECT_EQ(this->elements.references(1), 1);
  }
}

TYPED_TEST(GroupTest, RemovesTheElementThatMatches) {
  for (int gone = 0; gone < 3; gone++) {
    this->fill();
    Numbers rest{0, 1, 2};
    rest.erase(rest.begin() + gone);
    EXPECT_EQ(TypeParam::rem(this->group, this->elements.at(gone)), 1);
    EXPECT_EQ(this->content(), rest);
    EXPECT_EQ(this->elements.references(gone), 0);
    for (int i : rest) EXPECT_EQ(TypeParam::rem(this->group, this->elements.at(i)), 1);
    EXPECT_EQ(this->content(), Numbers{});
  }
}

TYPED_TEST(GroupTest, RemovesNothingThatIsNotThere) {
  TypeParam::add(this->group, this->elements.at(0));
  EXPECT_EQ(TypeParam::rem(this->group, this->elements.at(1)), 0);
  EXPECT_EQ(this->content(), Numbers{0});
}

TYPED_TEST(GroupTest, AddsARemovedElementAtTheTail) {
  this->fill();
  TypeParam::rem(this->group, this->elements.at(0));
  EXPECT_EQ(TypeParam::add(this->group, this->elements.at(0)), 1);
  EXPECT_EQ(this->content(), (Numbers{1, 2, 0}));
}

TYPED_TEST(GroupTest, IteratesFromHeadToTail) {
  this->fill();
  Numbers seen;
  for (auto *it = TypeParam::iterator(this->group); TypeParam::hasNext(it) == 1;
       it = TypeParam::next(it)) {
    auto *handed = TypeParam::get(it);
    const int i = static_cast<int>(seen.size());
    EXPECT_TRUE(this->elements.is(handed, i));
    seen.push_back(i);
    this->elements.discard(handed);
  }
  EXPECT_EQ(seen.size(), 3u);
}

TYPED_TEST(GroupTest, HandsOutWhatTheCallerMustGiveBack) {
  this->fill();
  auto *node = this->group->head;
  auto *handed = TypeParam::get(node);
  EXPECT_EQ(handed != node->value, this->elements.kCopied);
  EXPECT_EQ(this->elements.references(0), this->elements.kCounted ? 2 : 0);
  this->elements.discard(handed);
}

TYPED_TEST(GroupTest, IterRemOnEveryNodeEmptiesTheGroupAndEndsWithNull) {
  this->fill();
  int steps = 0;
  auto *it = TypeParam::iterator(this->group);
  for (; it && steps < 3; steps++) it = TypeParam::iterRem(it);
  EXPECT_EQ(it, nullptr);
  EXPECT_EQ(steps, 3);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(this->elements.references(0), 0);
}

TYPED_TEST(GroupTest, IterRemGivesTheSuccessorWhichOutlivesTheRemoval) {
  this->fill();
  auto *successor = this->group->head->next->next;
  EXPECT_EQ(TypeParam::iterRem(this->group->head->next), successor);
  EXPECT_EQ(this->content(), (Numbers{0, 2}));
  EXPECT_EQ(this->group->tail, successor);
}

// Deliberate: with two equal values, which only somebody who writes into nodes can make, IterRem of
// the second removes the first.
TYPED_TEST(GroupTest, IterRemRemovesByValue) {
  this->fill();
  auto *first = this->group->head, *second = first->next;
  auto *own = second->value;
  second->value = first->value;
  EXPECT_EQ(TypeParam::iterRem(second), second->next);
  second->value = own;
  EXPECT_EQ(this->content(), (Numbers{1, 2}));
}

TYPED_TEST(GroupTest, GetLinkFindsTheNodeOfAnElement) {
  this->fill();
  EXPECT_EQ(TypeParam::getLink(this->group, this->elements.at(1)), this->group->head->next);
  TypeParam::rem(this->group, this->elements.at(1));
  EXPECT_EQ(TypeParam::getLink(this->group, this->elements.at(1)), nullptr);
}

TYPED_TEST(GroupTest, GetLinkTakesNoLock) {
  this->fill();
  ASSERT_EQ(qlxAPIMutexLock(), 1);
  EXPECT_EQ(TypeParam::getLink(this->group, this->elements.at(0)), this->group->head);
  qlxAPIMutexUnlock();
}

TYPED_TEST(GroupTest, DisposesOfItsElementsWhenFreed) {
  const FailingMemory memory;
  auto *other = TypeParam::alloc();
  for (int i = 0; i < 3; i++) TypeParam::add(other, this->elements.at(i));
  TypeParam::free(other);
  EXPECT_EQ(memory.live(), 0);
  for (int i = 0; i < 3; i++) EXPECT_EQ(this->elements.references(i), 0);
}

TYPED_TEST(GroupTest, IgnoresNullArguments) {
  this->fill();
  TypeParam::free(nullptr);
  EXPECT_EQ(TypeParam::add(nullptr, this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::add(this->group, nullptr), 0);
  EXPECT_EQ(TypeParam::rem(nullptr, this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::rem(this->group, nullptr), 0);
  EXPECT_EQ(TypeParam::iterator(nullptr), nullptr);
  EXPECT_EQ(TypeParam::next(nullptr), nullptr);
  EXPECT_EQ(TypeParam::get(nullptr), nullptr);
  EXPECT_EQ(TypeParam::iterRem(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getLink(nullptr, this->elements.at(0)), nullptr);
  EXPECT_EQ(TypeParam::getLink(this->group, nullptr), nullptr);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

TYPED_TEST(GroupTest, StaysAsItIsWhenMemoryRunsOut) {
  TypeParam::add(this->group, this->elements.at(0));
  failEachAllocation([&] { return TypeParam::add(this->group, this->elements.at(1)); },
                     [&](int n, uint8_t added) {
                       EXPECT_EQ(added, n == 0);
                       EXPECT_EQ(this->content(), n == 0 ? (Numbers{0, 1}) : Numbers{0});
                     });
  EXPECT_EQ(this->elements.references(1), this->elements.kCounted ? 1 : 0);
}

TYPED_TEST(GroupTest, IsNullWhenItCannotBeAllocated) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(TypeParam::alloc(), nullptr);
}

// ---- The lock

template <typename Api>
class GroupLockDeathTest : public ::testing::Test {};
TYPED_TEST_SUITE(GroupLockDeathTest, PublicGroups, ApiNames);

TYPED_TEST(GroupLockDeathTest, NothingHappensWhenTheLockCannotBeTaken) {
  inFreshProcess([] {
    using Twins = typename TypeParam::Twins;
    typename TypeParam::Elements elements;
    auto *group = Twins::alloc();
    for (int i = 0; i < 2; i++) Twins::add(group, elements.at(i));
    auto *node = group->head;
    {
      FailingMemory memory;
      memory.failFrom(1);
      EXPECT_EQ(TypeParam::alloc(), nullptr);
      EXPECT_EQ(TypeParam::add(group, elements.at(2)), 0);
      EXPECT_EQ(TypeParam::rem(group, elements.at(0)), 0);
      EXPECT_EQ(TypeParam::iterator(group), nullptr);
      EXPECT_EQ(TypeParam::hasNext(node), 0);
      EXPECT_EQ(TypeParam::next(node), nullptr);
      EXPECT_EQ(TypeParam::get(node), nullptr);
      EXPECT_EQ(TypeParam::iterRem(node), nullptr);
      TypeParam::free(group);
    }
    EXPECT_EQ(chain(group).size(), 2u);
    Twins::free(group);
  });
}

TEST(StringGroupThreadTest, PublicCallsOfManyThreadsLoseNothing) {
  StringGroup *group = QlxAllocStringGroup();
  const auto add = [group](char mark) {
    std::string text(1, mark);
    for (int i = 0; i < 100; i++) {
      text += mark;
      EXPECT_EQ(QlxStringGroupAdd(group, text.c_str()), 1);
    }
  };
  std::thread one{add, 'a'}, two{add, 'b'}, three{add, 'c'};
  one.join();
  two.join();
  three.join();
  EXPECT_EQ(chain(group).size(), 300u);
  QlxFreeStringGroup(group);
}

// ---- What differs between the instances

TEST(StringGroupTest, TellsStringsApartByTheirBytes) {
  StringGroup *group = qlxIntlAllocStringGroup();
  EXPECT_EQ(qlxIntlStringGroupAdd(group, "name"), 1);
  EXPECT_EQ(qlxIntlStringGroupAdd(group, "Name"), 1);
  EXPECT_EQ(qlxIntlStringGroupAdd(group, std::string("name").c_str()), 0);
  EXPECT_EQ(chain(group).size(), 2u);
  qlxIntlFreeStringGroup(group);
}

TEST(StringGroupTest, TakesItsOwnStringsAsArguments) {
  StringGroup *group = qlxIntlAllocStringGroup();
  qlxIntlStringGroupAdd(group, "name");
  EXPECT_EQ(qlxIntlStringGroupAdd(group, group->head->value), 0);
  EXPECT_EQ(qlxIntlStringGroupAdd(group, group->head->value + 1), 1);
  EXPECT_STREQ(group->tail->value, "ame");
  EXPECT_EQ(qlxIntlStringGroupRem(group, group->head->value), 1);
  EXPECT_EQ(chain(group).size(), 1u);
  qlxIntlFreeStringGroup(group);
}

TEST(ListenerGroupTest, TellsObjectsApartByIdentity) {
  Objects objects;  // all alike
  ListenerGroup *group = qlxIntlAllocListenerGroup();
  EXPECT_EQ(qlxIntlListenerGroupAdd(group, objects.at(0)), 1);
  EXPECT_EQ(qlxIntlListenerGroupAdd(group, objects.at(1)), 1);
  EXPECT_EQ(QlxListenerGroupGetLink(group, objects.at(2)), nullptr);
  qlxIntlFreeListenerGroup(group);
}

TEST(ListenerGroupTest, ShowsNoObjectThatEndsByItsRemoval) {
  static ListenerGroup *group;
  static bool sawItself;
  group = qlxIntlAllocListenerGroup();
  sawItself = true;
  Objects objects;
  objects.objClass.fFreeVars = [](void *) { sawItself = group->head; };
  objects.at(0)->refCount = 1;  // so the group's reference is the last but one
  qlxIntlListenerGroupAdd(group, objects.at(0));
  qlxIntlListenerGroupRem(group, objects.at(0));
  EXPECT_FALSE(sawItself);
  qlxIntlFreeListenerGroup(group);
}

}  // namespace
