#include <gtest/gtest.h>

#include <vector>

#include "support/Status.h"
#include "support/SystemCalls.h"
#include "util/CxThread.h"

namespace {

// What a thread saw of itself.
struct Seen {
  void *argument = nullptr;
  uint64_t id = 0;
  size_t stackSize = 0;
};

void *look(void *argument) {
  Seen *const seen = static_cast<Seen *>(argument);
  seen->argument = argument;
  seen->id = CxThreadGetCurrentID();
  pthread_attr_t attributes;
  pthread_getattr_np(pthread_self(), &attributes);
  pthread_attr_getstacksize(&attributes, &seen->stackSize);
  pthread_attr_destroy(&attributes);
  return argument;
}

Seen runThread(uint32_t stackSize) {
  Seen seen;
  CxThread thread{};
  EXPECT_EQ(CxThreadCreate(&thread, stackSize, look, &seen), kSuccess);
  EXPECT_EQ(CxThreadJoin(&thread), kSuccess);
  EXPECT_EQ(seen.argument, &seen);
  EXPECT_EQ(seen.id, static_cast<uint32_t>(thread));
  return seen;
}

TEST(CxThreadTest, ThereAreThreads) {
  EXPECT_EQ(CxHasThreadSupport(), 1);
}

TEST(CxThreadTest, TheIdIsTheLowHalfOfTheHandle) {
  EXPECT_EQ(CxThreadGetCurrentID(), static_cast<uint64_t>(pthread_self()) & 0xFFFFFFFFu);
}

size_t systemsStackBytes() {
  pthread_attr_t attributes;
  size_t bytes = 0;
  pthread_getattr_default_np(&attributes);
  pthread_attr_getstacksize(&attributes, &bytes);
  pthread_attr_destroy(&attributes);
  return bytes;
}

TEST(CxThreadTest, AStackSizeOfZeroIsTheSystemsDefault) {
  EXPECT_EQ(runThread(0).stackSize, systemsStackBytes());
}

TEST(CxThreadTest, AStackSizeIsGivenToTheThread) {
  // Much more than the default: the system gives stacks of ended threads to new ones that ask for
  // less, unless they are more than four times too large.
  const size_t bytes = 8 * systemsStackBytes();
  ASSERT_LT(bytes, UINT32_MAX);
  EXPECT_EQ(runThread(static_cast<uint32_t>(bytes)).stackSize, bytes);
}

TEST(CxThreadTest, AStackSizeThatIsTooSmallFailsAndLeavesTheHandle) {
  Seen seen;
  CxThread thread = pthread_self();
  EXPECT_EQ(CxThreadCreate(&thread, 1, look, &seen), failure(EINVAL));
  EXPECT_EQ(thread, pthread_self());
  EXPECT_EQ(seen.argument, nullptr);
}

TEST(CxThreadTest, NullIsRefused) {
  CxThread thread{};
  EXPECT_EQ(CxThreadCreate(nullptr, 0, look, nullptr), failure(22));
  EXPECT_EQ(CxThreadCreate(&thread, 0, nullptr, nullptr), failure(22));
  EXPECT_EQ(CxThreadJoin(nullptr), failure(22));
}

TEST(CxThreadTest, JoinHandsOverTheErrorOfTheCall) {
  CxThread self = pthread_self();
  EXPECT_EQ(CxThreadJoin(&self), failure(EDEADLK));
}

TEST(CxThreadTest, YieldReturns) {
  CxThreadYield();
}

struct Sleep {
  uint32_t milliseconds;
  uint32_t seconds;
};

class ThreadSleep : public ::testing::TestWithParam<Sleep> {};

TEST_P(ThreadSleep, RoundsToTheNearestSecond) {
  EXPECT_EQ(cxSleepSeconds(GetParam().milliseconds), GetParam().seconds);
}

TEST_P(ThreadSleep, SleepsThoseSeconds) {
  const SystemCalls calls;
  CxThreadSleep(GetParam().milliseconds);
  unsigned total = 0;
  for (const unsigned seconds : calls.slept) total += seconds;
  EXPECT_EQ(total, GetParam().seconds);
}

INSTANTIATE_TEST_SUITE_P(Rounding, ThreadSleep,
                         ::testing::Values(Sleep{0, 0}, Sleep{499, 0}, Sleep{500, 1},
                                           Sleep{1499, 1}, Sleep{1500, 2},
                                           Sleep{0xFFFFFFFF - 500, 4294967},
                                           Sleep{0xFFFFFFFF - 499, 0}, Sleep{0xFFFFFFFF, 0}));

}  // namespace
