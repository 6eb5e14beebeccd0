// Groups: what only they do, with both instances, through the public functions and the twins.
#include <string>

#include "support/ContainerTest.h"

namespace {

template <typename Api>
class GroupTest : public ContainerTest<Api> {};
TYPED_TEST_SUITE(GroupTest, AllGroups, ApiNames);

TYPED_TEST(GroupTest, AddsAnElementOnlyOnce) {
  this->fill();
  EXPECT_EQ(TypeParam::add(this->container, this->elements.at(1)), 0);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  if (this->elements.kCounted) {
    EXPECT_EQ(this->elements.references(1), 1);
  }
}

// Deliberate: with two equal values, which only somebody who writes into nodes can make, IterRem of
// the second removes the first.
TYPED_TEST(GroupTest, IterRemRemovesByValue) {
  this->fill();
  auto *first = this->container->head, *second = first->next;
  auto *own = second->value;
  second->value = first->value;
  EXPECT_EQ(TypeParam::iterRem(second), second->next);
  second->value = own;
  EXPECT_EQ(this->content(), (Numbers{1, 2}));
}

TYPED_TEST(GroupTest, GetLinkFindsTheNodeOfAnElement) {
  this->fill();
  EXPECT_EQ(TypeParam::getLink(this->container, this->elements.at(1)), this->container->head->next);
  TypeParam::rem(this->container, this->elements.at(1));
  EXPECT_EQ(TypeParam::getLink(this->container, this->elements.at(1)), nullptr);
}

TYPED_TEST(GroupTest, GetLinkTakesNoLock) {
  this->fill();
  ASSERT_EQ(qlxAPIMutexLock(), 1);
  EXPECT_EQ(TypeParam::getLink(this->container, this->elements.at(0)), this->container->head);
  qlxAPIMutexUnlock();
}

TYPED_TEST(GroupTest, IgnoresNullArguments) {
  this->fill();
  EXPECT_EQ(TypeParam::add(this->container, nullptr), 0);
  EXPECT_EQ(TypeParam::rem(nullptr, this->elements.at(0)), 0);
  EXPECT_EQ(TypeParam::rem(this->container, nullptr), 0);
  EXPECT_EQ(TypeParam::iterRem(nullptr), nullptr);
  EXPECT_EQ(TypeParam::getLink(nullptr, this->elements.at(0)), nullptr);
  EXPECT_EQ(TypeParam::getLink(this->container, nullptr), nullptr);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
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
