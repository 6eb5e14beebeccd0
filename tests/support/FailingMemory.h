// Counts the library's allocations and makes chosen ones fail, while it lives. One at a time; other
// threads may allocate meanwhile, but none may do so while it goes.
#ifndef QLX_TESTS_FAILINGMEMORY_H
#define QLX_TESTS_FAILINGMEMORY_H

#include <atomic>
#include <cstdint>

#include "util/CxMemory.h"

class FailingMemory : private CxMemoryHook {
 public:
  FailingMemory() : CxMemoryHook{mayAllocateIn, allocatedIn, freedIn} { cxIntlSetMemoryHook(this); }
  ~FailingMemory() { cxIntlSetMemoryHook(nullptr); }
  FailingMemory(const FailingMemory &) = delete;
  FailingMemory &operator=(const FailingMemory &) = delete;

  // The n-th allocation from now fails (1 is the next one); those before and after it succeed.
  void failOnce(uint64_t n) { plan(n, n); }

  // The n-th allocation from now and all after it fail.
  void failFrom(uint64_t n) { plan(n, UINT64_MAX); }

  // All succeed from now on.
  void failNone() { plan(UINT64_MAX, 0); }

  // Calls that had to allocate, failed ones too, since the last plan or else since the beginning. A
  // call to make a block larger is one.
  uint64_t attempts() const { return attempts_; }

  // How many of the attempts were made to fail.
  uint64_t failures() const { return failures_; }

  // Blocks allocated less blocks freed, since the beginning; plans do not change it.
  int64_t live() const { return live_; }

 private:
  static FailingMemory *self(CxMemoryHook *hook) { return static_cast<FailingMemory *>(hook); }

  static bool mayAllocateIn(CxMemoryHook *hook) {
    FailingMemory *const memory = self(hook);
    const uint64_t number = ++memory->attempts_;
    if (number < memory->firstFailing_ || number > memory->lastFailing_) return true;
    ++memory->failures_;
    return false;
  }
  static void allocatedIn(CxMemoryHook *hook) { ++self(hook)->live_; }
  static void freedIn(CxMemoryHook *hook) { --self(hook)->live_; }

  void plan(uint64_t first, uint64_t last) {
    attempts_ = 0;
    failures_ = 0;
    firstFailing_ = first;
    lastFailing_ = last;
  }

  std::atomic<uint64_t> attempts_{0};
  std::atomic<uint64_t> failures_{0};
  std::atomic<int64_t> live_{0};
  std::atomic<uint64_t> firstFailing_{UINT64_MAX};  // numbers of attempts, from 1
  std::atomic<uint64_t> lastFailing_{0};
};

#endif
