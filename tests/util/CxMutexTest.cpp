#include <gtest/gtest.h>

#include <thread>

#include "support/FailingMemory.h"
#include "support/Status.h"
#include "support/WrongUseOfAMutex.h"
#include "util/CxMutex.h"

namespace {

// Whether another thread finds the mutex held.
bool isHeld(CxMutex mutex) {
  bool held = false;
  std::thread([&] {
    held = pthread_mutex_trylock(mutex) == EBUSY;
    if (!held) pthread_mutex_unlock(mutex);
  }).join();
  return held;
}

// An error-checking mutex as a handle, so that the calls have failures to report.
struct CheckingMutex {
  CheckingMutex() {
    pthread_mutexattr_t attributes;
    pthread_mutexattr_init(&attributes);
    pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_ERRORCHECK);
    pthread_mutex_init(&block, &attributes);
    pthread_mutexattr_destroy(&attributes);
  }
  ~CheckingMutex() { pthread_mutex_destroy(&block); }
  pthread_mutex_t block;
  CxMutex handle = &block;
};

TEST(CxMutexTest, LocksAndUnlocks) {
  CxMutex mutex = nullptr;
  ASSERT_EQ(CxMutexCreate(&mutex), kSuccess);
  ASSERT_NE(mutex, nullptr);
  EXPECT_FALSE(isHeld(mutex));
  EXPECT_EQ(CxMutexLock(&mutex), kSuccess);
  EXPECT_TRUE(isHeld(mutex));
  EXPECT_EQ(CxMutexUnlock(&mutex), kSuccess);
  EXPECT_FALSE(isHeld(mutex));
  EXPECT_EQ(CxMutexDestroy(&mutex), kSuccess);
}

TEST(CxMutexTest, IsNotRecursive) {
  CxMutex mutex = nullptr;
  ASSERT_EQ(CxMutexCreate(&mutex), kSuccess);
  EXPECT_EQ(CxMutexLock(&mutex), kSuccess);
  EXPECT_EQ(pthread_mutex_trylock(mutex), EBUSY);
  EXPECT_EQ(CxMutexUnlock(&mutex), kSuccess);
  EXPECT_EQ(CxMutexDestroy(&mutex), kSuccess);
}

TEST(CxMutexTest, ANullHandleIsNoMutex) {
  CxMutex none = nullptr;
  EXPECT_EQ(CxMutexLock(&none), failure(22));
  EXPECT_EQ(CxMutexUnlock(&none), failure(22));
  EXPECT_EQ(CxMutexDestroy(&none), failure(22));
}

TEST(CxMutexTest, ANullAddressIsRefused) {
  EXPECT_EQ(CxMutexCreate(nullptr), failure(22));
  EXPECT_EQ(CxMutexLock(nullptr), failure(22));
  EXPECT_EQ(CxMutexUnlock(nullptr), failure(22));
  EXPECT_EQ(CxMutexDestroy(nullptr), failure(22));
}

TEST(CxMutexTest, DestroyingTwiceIsRefusedTheSecondTime) {
  const FailingMemory memory;
  CxMutex mutex = nullptr;
  ASSERT_EQ(CxMutexCreate(&mutex), kSuccess);
  EXPECT_EQ(memory.live(), 1);
  EXPECT_EQ(CxMutexDestroy(&mutex), kSuccess);
  EXPECT_EQ(mutex, nullptr);
  EXPECT_EQ(memory.live(), 0);
  EXPECT_EQ(CxMutexDestroy(&mutex), failure(22));
}

TEST(CxMutexTest, WithoutMemoryThereIsNoHandle) {
  FailingMemory memory;
  memory.failOnce(1);
  CxMutex mutex = nullptr;
  EXPECT_EQ(CxMutexCreate(&mutex), failure(12));
  EXPECT_EQ(mutex, nullptr);
}

TEST(CxMutexTest, AFailedInitialisationFreesTheBlockAndGivesItsError) {
  const FailingMemory memory;
  pthread_mutex_t other;
  CxMutex mutex = &other;
  const CxMutexInit failing = [](pthread_mutex_t *, const pthread_mutexattr_t *) { return EAGAIN; };
  EXPECT_EQ(cxIntlMutexCreate(&mutex, failing), failure(EAGAIN));
  EXPECT_EQ(mutex, nullptr);
  EXPECT_EQ(memory.attempts(), 1u);
  EXPECT_EQ(memory.live(), 0);
}

TEST(CxMutexTest, LockAndUnlockHandOverTheErrorOfTheCall) {
  WRONG_USE_OF_A_MUTEX();
  CheckingMutex checking;
  EXPECT_EQ(CxMutexUnlock(&checking.handle), failure(EPERM));
  EXPECT_EQ(CxMutexLock(&checking.handle), kSuccess);
  EXPECT_EQ(CxMutexLock(&checking.handle), failure(EDEADLK));
  EXPECT_EQ(CxMutexUnlock(&checking.handle), kSuccess);
}

TEST(CxMutexTest, AFailedDestroyFreesTheBlockAllTheSame) {
  WRONG_USE_OF_A_MUTEX();
  const FailingMemory memory;
  CxMutex mutex = nullptr;
  ASSERT_EQ(CxMutexCreate(&mutex), kSuccess);
  ASSERT_EQ(CxMutexLock(&mutex), kSuccess);
  EXPECT_EQ(CxMutexDestroy(&mutex), failure(EBUSY));
  EXPECT_EQ(mutex, nullptr);
  EXPECT_EQ(memory.live(), 0);
}

}  // namespace
