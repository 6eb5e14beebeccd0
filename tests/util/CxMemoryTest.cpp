#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "support/FailingMemory.h"

namespace {

TEST(CxMemoryTest, MallocOfNoBytesGivesNullWithoutAllocating) {
  const FailingMemory memory;
  EXPECT_EQ(OslMemoryMalloc(0), nullptr);
  EXPECT_EQ(memory.attempts(), 0u);
}

TEST(CxMemoryTest, CallocOfNothingGivesNullWithoutAllocating) {
  const FailingMemory memory;
  EXPECT_EQ(OslMemoryCalloc(0, 8), nullptr);
  EXPECT_EQ(OslMemoryCalloc(8, 0), nullptr);
  EXPECT_EQ(OslMemoryCalloc(0, 0), nullptr);
  EXPECT_EQ(memory.attempts(), 0u);
}

TEST(CxMemoryTest, CallocFillsWithZeroes) {
  void *const used = OslMemoryMalloc(1000);  // so that the allocator has a block full of bytes
  ASSERT_NE(used, nullptr);
  memset(used, 'x', 1000);
  OslMemoryFree(used);
  char *const block = static_cast<char *>(OslMemoryCalloc(100, 10));
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(std::string(block, 1000), std::string(1000, '\0'));
  OslMemoryFree(block);
}

TEST(CxMemoryTest, ReallocToNoBytesGivesNullAndKeepsTheBlock) {
  const FailingMemory memory;
  char *const block = static_cast<char *>(OslMemoryMalloc(6));
  ASSERT_NE(block, nullptr);
  strcpy(block, "alive");
  EXPECT_EQ(OslMemoryRealloc(block, 0), nullptr);
  EXPECT_STREQ(block, "alive");
  EXPECT_EQ(memory.live(), 1);
  OslMemoryFree(block);
  EXPECT_EQ(memory.live(), 0);
}

TEST(CxMemoryTest, ReallocOfNullAllocates) {
  const FailingMemory memory;
  void *const block = OslMemoryRealloc(nullptr, 16);
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(memory.live(), 1);
  OslMemoryFree(block);
  EXPECT_EQ(OslMemoryRealloc(nullptr, 0), nullptr);
}

TEST(CxMemoryTest, ReallocKeepsTheContents) {
  char *block = static_cast<char *>(OslMemoryMalloc(4));
  ASSERT_NE(block, nullptr);
  strcpy(block, "abc");
  block = static_cast<char *>(OslMemoryRealloc(block, 100000));
  ASSERT_NE(block, nullptr);
  EXPECT_STREQ(block, "abc");
  OslMemoryFree(block);
}

TEST(CxMemoryTest, FreeIgnoresNull) {
  const FailingMemory memory;
  OslMemoryFree(nullptr);
  EXPECT_EQ(memory.live(), 0);
}

TEST(FailingMemoryTest, FailsOneChosenAllocationOfAnyKind) {
  FailingMemory memory;
  void *(*const kinds[])() = {
      [] { return OslMemoryMalloc(8); },
      [] { return OslMemoryCalloc(2, 4); },
      [] { return OslMemoryRealloc(nullptr, 8); },
  };
  for (const auto allocate : kinds) {
    memory.failOnce(2);
    void *const first = allocate();
    void *const second = allocate();
    void *const third = allocate();
    EXPECT_NE(first, nullptr);
    EXPECT_EQ(second, nullptr);
    EXPECT_NE(third, nullptr);
    EXPECT_EQ(memory.attempts(), 3u);
    EXPECT_EQ(memory.failures(), 1u);
    EXPECT_EQ(memory.live(), 2);
    OslMemoryFree(first);
    OslMemoryFree(third);
    EXPECT_EQ(memory.live(), 0);
  }
}

TEST(FailingMemoryTest, FailsAllFromAChosenAllocationOn) {
  FailingMemory memory;
  memory.failFrom(2);
  void *const first = OslMemoryMalloc(8);
  EXPECT_NE(first, nullptr);
  EXPECT_EQ(OslMemoryMalloc(8), nullptr);
  EXPECT_EQ(OslMemoryMalloc(8), nullptr);
  EXPECT_EQ(memory.failures(), 2u);
  memory.failNone();
  void *const later = OslMemoryMalloc(8);
  EXPECT_NE(later, nullptr);
  OslMemoryFree(first);
  OslMemoryFree(later);
}

TEST(FailingMemoryTest, AFailedReallocLeavesTheBlock) {
  FailingMemory memory;
  char *const block = static_cast<char *>(OslMemoryMalloc(4));
  ASSERT_NE(block, nullptr);
  strcpy(block, "abc");
  memory.failOnce(1);
  EXPECT_EQ(OslMemoryRealloc(block, 1000), nullptr);
  EXPECT_STREQ(block, "abc");
  EXPECT_EQ(memory.live(), 1);
  OslMemoryFree(block);
}

TEST(FailingMemoryTest, MakingABlockLargerIsAnAttemptButNoNewBlock) {
  const FailingMemory memory;
  void *block = OslMemoryMalloc(4);
  block = OslMemoryRealloc(block, 4000);
  EXPECT_EQ(memory.attempts(), 2u);
  EXPECT_EQ(memory.live(), 1);
  OslMemoryFree(block);
}

TEST(FailingMemoryTest, LeavesTheAllocationsAloneWhenItIsGone) {
  {
    FailingMemory memory;
    memory.failFrom(1);
    EXPECT_EQ(OslMemoryMalloc(8), nullptr);
  }
  void *const block = OslMemoryMalloc(8);
  EXPECT_NE(block, nullptr);
  OslMemoryFree(block);
}

TEST(FailingMemoryTest, CountsTheAllocationsOfManyThreads) {
  const FailingMemory memory;
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([] {
      for (int j = 0; j < 1000; ++j) OslMemoryFree(OslMemoryMalloc(8));
    });
  }
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ(memory.attempts(), 4000u);
  EXPECT_EQ(memory.live(), 0);
}

}  // namespace
