// What groups, lists and maps have in common: every behaviour with all instances, through the
// public functions and through the twins.
#include <string>
#include <thread>

#include "object/QlxLocked.h"
#include "support/ContainerTest.h"
#include "support/FreshProcess.h"
#include "support/OwnThread.h"

namespace {

using PublicContainers =
    ::testing::Types<QlxStringGroupApi, QlxListenerGroupApi, QlxStringListApi, QlxParmListApi,
                     QlxStringToStringMapApi, QlxStringToObjMapApi, QlxStringToObjCfgMapApi,
                     QlxStringToObjClassMapApi>;

using AllContainers = Joined<AllGroups, Joined<AllLists, AllMaps>>;
TYPED_TEST_SUITE(ContainerTest, AllContainers, ApiNames);

TYPED_TEST(ContainerTest, IsEmptyAtFirst) {
  ASSERT_NE(this->container, nullptr);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(TypeParam::iterator(this->container), nullptr);
  EXPECT_EQ(TypeParam::hasNext(nullptr), 0);
}

TYPED_TEST(ContainerTest, KeepsTheOrderOfInsertion) {
  this->fill();
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
  if constexpr (kHasKeys<TypeParam>) {
    EXPECT_EQ(this->keys(), "abc");
  }
}

TYPED_TEST(ContainerTest, IteratesFromHeadToTail) {
  this->fill();
  int seen = 0;
  for (auto *it = TypeParam::iterator(this->container); TypeParam::hasNext(it) == 1;
       it = TypeParam::next(it)) {
    auto *handed = handOut<TypeParam>(it);
    EXPECT_TRUE(this->elements.is(handed, seen++));
    this->elements.discard(handed);
  }
  EXPECT_EQ(seen, 3);
}

TYPED_TEST(ContainerTest, HandsOutWhatTheCallerMustGiveBack) {
  this->fill();
  auto *node = this->container->head;
  auto *handed = handOut<TypeParam>(node);
  EXPECT_EQ(handed != node->value, this->elements.kCopied);
  EXPECT_EQ(this->elements.references(0), 2 * this->oneIfCounted());
  this->elements.discard(handed);
}

TYPED_TEST(ContainerTest, DisposesOfItsElementsWhenFreed) {
  const FailingMemory memory;
  auto *other = TypeParam::alloc();
  for (int i = 0; i < 3; i++) insert<TypeParam>(other, this->elements, i);
  TypeParam::free(other);
  EXPECT_EQ(memory.live(), 0);
  for (int i = 0; i < 3; i++) EXPECT_EQ(this->elements.references(i), 0);
}

TYPED_TEST(ContainerTest, IgnoresNull) {
  this->fill();
  TypeParam::free(nullptr);
  EXPECT_EQ(insert<TypeParam>(nullptr, this->elements, 0), 0);
  EXPECT_EQ(TypeParam::iterator(nullptr), nullptr);
  EXPECT_EQ(TypeParam::next(nullptr), nullptr);
  EXPECT_EQ(handOut<TypeParam>(this->container->tail->next), nullptr);
  EXPECT_EQ(this->content(), (Numbers{0, 1, 2}));
}

// A map may lose a value that it has a key for, so what it gets here has none.
TYPED_TEST(ContainerTest, StaysAsItIsWhenMemoryRunsOut) {
  insert<TypeParam>(this->container, this->elements, 0);
  const auto element = kHasKeys<TypeParam> ? nullptr : this->elements.at(1);
  const int number = kHasKeys<TypeParam> ? ElementKind::kCount : 1;
  failEachAllocation([&] { return insert<TypeParam>(this->container, "key", element); },
                     [&](int n, uint8_t done) {
                       EXPECT_EQ(done, n == 0);
                       EXPECT_EQ(this->content(), n == 0 ? (Numbers{0, number}) : Numbers{0});
                     });
  EXPECT_EQ(this->elements.references(1), element ? this->oneIfCounted() : 0);
}

TYPED_TEST(ContainerTest, IsNullWhenItCannotBeAllocated) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(TypeParam::alloc(), nullptr);
}

// ---- Removing at an iterator: groups and lists

template <typename Api>
class IterRemTest : public ContainerTest<Api> {};
using IterRemContainers = Joined<AllGroups, AllLists>;
TYPED_TEST_SUITE(IterRemTest, IterRemContainers, ApiNames);

TYPED_TEST(IterRemTest, OnEveryNodeEmptiesTheContainerAndEndsWithNull) {
  this->fill();
  int steps = 0;
  auto *it = TypeParam::iterator(this->container);
  for (; it && steps < 3; steps++) it = TypeParam::iterRem(it);
  EXPECT_EQ(it, nullptr);
  EXPECT_EQ(steps, 3);
  EXPECT_EQ(this->content(), Numbers{});
  EXPECT_EQ(this->elements.references(0), 0);
}

TYPED_TEST(IterRemTest, GivesTheSuccessorWhichOutlivesTheRemoval) {
  this->fill();
  auto *successor = this->container->head->next->next;
  EXPECT_EQ(TypeParam::iterRem(this->container->head->next), successor);
  EXPECT_EQ(this->content(), (Numbers{0, 2}));
  EXPECT_EQ(this->container->tail, successor);
}

// ---- Removing by what an element is known by: groups and maps

// Whether the work makes the container smaller.
template <typename Head, typename Work>
bool shrinks(Head *container, Work work) {
  const size_t before = chain(container).size();
  work();
  return chain(container).size() < before;
}

template <typename Api>
class RemTest : public ContainerTest<Api> {
 protected:
  // Whether it removes one; a group says so.
  bool rem(int i) {
    uint8_t answer = 0;
    const bool removed = shrinks(this->container, [&] {
      const auto id = idOf<Api>(this->elements, i);
      if constexpr (kHasKeys<Api>)
        Api::rem(this->container, id);
      else
        answer = Api::rem(this->container, id);
    });
    EXPECT_TRUE(kHasKeys<Api> || answer == removed);
    return removed;
  }
};
using RemContainers = Joined<AllGroups, AllMaps>;
TYPED_TEST_SUITE(RemTest, RemContainers, ApiNames);

TYPED_TEST(RemTest, RemovesTheElementThatMatches) {
  for (int gone = 0; gone < 3; gone++) {
    this->fill();
    Numbers rest{0, 1, 2};
    rest.erase(rest.begin() + gone);
    EXPECT_TRUE(this->rem(gone));
    EXPECT_EQ(this->content(), rest);
    EXPECT_EQ(this->elements.references(gone), 0);
    for (int i : rest) EXPECT_TRUE(this->rem(i));
    EXPECT_EQ(this->content(), Numbers{});
  }
}

TYPED_TEST(RemTest, RemovesNothingThatIsNotThere) {
  insert<TypeParam>(this->container, this->elements, 0);
  EXPECT_FALSE(this->rem(1));
  EXPECT_EQ(this->content(), Numbers{0});
}

TYPED_TEST(RemTest, PutsARemovedElementAtTheTail) {
  this->fill();
  this->rem(0);
  EXPECT_EQ(insert<TypeParam>(this->container, this->elements, 0), 1);
  EXPECT_EQ(this->content(), (Numbers{1, 2, 0}));
}

// ---- The lock

// The functions that did anything, and those that did not.
struct Answers {
  void note(const char *function, bool answered) {
    (answered ? given : refused) += std::string(function) + "|";
  }
  std::string given, refused;
};

template <typename Api>
void makeEach(typename Api::Head *container, Elements<Api> &elements, Answers &answers) {
  const auto noteMade = [&](const char *function, typename Api::Head *made) {
    answers.note(function, made);
    if (made) Api::free(made);
  };
  noteMade("alloc", Api::alloc());
  if constexpr (requires { Api::copy; }) noteMade("copy", Api::copy(container));
  answers.note("insert", insert<Api>(container, elements, 2));
}

template <typename Api>
void lookUpEach(typename Api::Head *map, Elements<Api> &elements, Answers &answers) {
  auto *const found = Api::get(map, kKeys[0]);
  answers.note("get", found);
  elements.discard(found);
  answers.note("hasKey", Api::hasKey(map, kKeys[0]));
  answers.note("getKey", OwnedStr{Api::getKey(map->head)} != nullptr);
}

template <typename Api>
void iterateEach(typename Api::Head *container, Elements<Api> &elements, Answers &answers) {
  answers.note("iterator", Api::iterator(container));
  answers.note("hasNext", Api::hasNext(container->head));
  answers.note("next", Api::next(container->head));
  auto *const handed = handOut<Api>(container->head);
  answers.note("handOut", handed);
  elements.discard(handed);
}

template <typename Api>
void removeEach(typename Api::Head *container, Elements<Api> &elements, Answers &answers) {
  if constexpr (requires { Api::rem; })
    answers.note("rem", shrinks(container, [&] { Api::rem(container, idOf<Api>(elements, 0)); }));
  if constexpr (requires { Api::iterRem; })
    answers.note("iterRem", shrinks(container, [&] { Api::iterRem(container->head); }));
}

// Calls each function that takes the lock when it is public, but `free` and `sort`.
template <typename Api>
Answers callEach(typename Api::Head *container, Elements<Api> &elements) {
  Answers answers;
  makeEach<Api>(container, elements, answers);
  iterateEach<Api>(container, elements, answers);
  if constexpr (kHasKeys<Api>) lookUpEach<Api>(container, elements, answers);
  removeEach<Api>(container, elements, answers);
  return answers;
}

// A container with the first two elements, made and freed by the twins.
template <typename Api>
struct Filled {
  using Twins = typename Api::Twins;
  Filled() {
    for (int i = 0; i < 2; i++) EXPECT_EQ(insert<Twins>(container, elements, i), 1);
  }
  ~Filled() { Twins::free(container); }

  Elements<Api> elements;
  typename Api::Head *const container = Twins::alloc();
};

// Counts what is allocated under the lock and what is not.
struct LockWatch : CxMemoryHook {
  LockWatch() : CxMemoryHook{look, [](CxMemoryHook *) {}, [](CxMemoryHook *) {}} {
    cxIntlSetMemoryHook(this);
  }
  ~LockWatch() { cxIntlSetMemoryHook(nullptr); }

  static bool look(CxMemoryHook *hook) {
    LockWatch *const self = static_cast<LockWatch *>(hook);
    ++(isCancellable() ? self->outside : self->inside);  // who holds the lock is not cancelled
    return true;
  }
  int inside = 0, outside = 0;
};

template <typename Api>
class ContainerLockTest : public ::testing::Test {};
TYPED_TEST_SUITE(ContainerLockTest, PublicContainers, ApiNames);

TYPED_TEST(ContainerLockTest, IsHeldWhereMemoryIsNeeded) {
  { const ApiLock made; }
  Filled<TypeParam> filled;
  const LockWatch watch;
  EXPECT_EQ(callEach<TypeParam>(filled.container, filled.elements).refused, "");
  EXPECT_GT(watch.inside, 0);
  EXPECT_EQ(watch.outside, 0);
}

template <typename Api>
class ContainerLockDeathTest : public ::testing::Test {};
TYPED_TEST_SUITE(ContainerLockDeathTest, PublicContainers, ApiNames);

TYPED_TEST(ContainerLockDeathTest, NothingHappensWhenTheLockCannotBeTaken) {
  inFreshProcess([] {
    Filled<TypeParam> filled;
    {
      FailingMemory memory;
      memory.failFrom(1);
      EXPECT_EQ(callEach<TypeParam>(filled.container, filled.elements).given, "");
      TypeParam::free(filled.container);
    }
    EXPECT_EQ(numbersIn(filled.container, filled.elements), (Numbers{0, 1}));
  });
}

TYPED_TEST(ContainerLockDeathTest, TheTwinsTakeNoLock) {
  inFreshProcess([] {
    {
      Filled<TypeParam> filled;
      using Twins = typename TypeParam::Twins;
      EXPECT_EQ(callEach<Twins>(filled.container, filled.elements).refused, "");
    }
    FailingMemory memory;
    memory.failFrom(1);
    EXPECT_EQ(qlxAPIMutexLock(), 0);  // the first to ask for it
  });
}

template <typename Api>
class ContainerThreadTest : public ::testing::Test {};
using TextContainers =
    ::testing::Types<QlxStringGroupApi, QlxStringListApi, QlxStringToStringMapApi>;
TYPED_TEST_SUITE(ContainerThreadTest, TextContainers, ApiNames);

TYPED_TEST(ContainerThreadTest, PublicCallsOfManyThreadsLoseNothing) {
  auto *container = TypeParam::alloc();
  const auto insertAll = [container](char mark) {
    std::string text(1, mark);
    for (int i = 0; i < 100; i++) {
      text += mark;
      EXPECT_EQ(insert<TypeParam>(container, text.c_str(), text.c_str()), 1);
    }
  };
  std::thread one{insertAll, 'a'}, two{insertAll, 'b'}, three{insertAll, 'c'};
  one.join();
  two.join();
  three.join();
  EXPECT_EQ(chain(container).size(), 300u);
  TypeParam::free(container);
}

}  // namespace
