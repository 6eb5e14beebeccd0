// Makes chosen allocations fail while it lives, and counts blocks: what is made and not freed
// shows.
#ifndef QLX_TESTS_FAILINGMEMORY_H
#define QLX_TESTS_FAILINGMEMORY_H

#include <atomic>
#include <cstdint>

#include "CxMemory.h"

class FailingMemory {
 public:
  enum Mode { kOnce, kFromThereOn };

  // Fails the n-th allocation from now on, counted from 1; 0 only counts.
  explicit FailingMemory(int64_t nth, Mode mode = kOnce) : hook_{{may, made, freed}, nth, mode} {
    cxIntlSetMemoryHook(&hook_.functions);
  }
  ~FailingMemory() { cxIntlSetMemoryHook(nullptr); }
  FailingMemory(const FailingMemory &) = delete;
  FailingMemory &operator=(const FailingMemory &) = delete;

  int64_t asked() const { return hook_.asked; }    // allocations, failed ones too
  int64_t failed() const { return hook_.failed; }  // of these, those that failed
  int64_t blocks() const { return hook_.blocks; }  // made and not freed since it lives

 private:
  struct Hook {
    CxMemoryHook functions;  // first: the functions get its address
    int64_t nth;
    Mode mode;
    std::atomic<int64_t> asked{0}, failed{0}, blocks{0};
  };

  static Hook &self(CxMemoryHook *hook) { return *reinterpret_cast<Hook *>(hook); }
  static bool may(CxMemoryHook *hook) {
    Hook &me = self(hook);
    const int64_t now = ++me.asked;
    const bool fails = me.nth > 0 && (now == me.nth || (now > me.nth && me.mode == kFromThereOn));
    if (fails) ++me.failed;
    return !fails;
  }
  static void made(CxMemoryHook *hook) { ++self(hook).blocks; }
  static void freed(CxMemoryHook *hook) { --self(hook).blocks; }

  Hook hook_;
};

#endif
