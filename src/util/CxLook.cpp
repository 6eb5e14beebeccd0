#include "CxLook.h"

#include <atomic>
#include <ctime>

#include "CxHooks.h"

static constexpr uint32_t kFirstLooks = 1024;  // of a process: one that logs little always looks
static constexpr uint32_t kLooksATick = 16;

static std::atomic<uint32_t> gLooks;  // up to kFirstLooks, or a little more

static int64_t coarseClock() {
  timespec now = {};
  clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
  return now.tv_sec * int64_t{1000000000} + now.tv_nsec;
}

int64_t (*cxLookTick)(void) = coarseClock;

bool cxLookAgain(CxLook *look) {
  if (gLooks.load(std::memory_order_relaxed) < kFirstLooks) {
    gLooks.fetch_add(1, std::memory_order_relaxed);
    return true;
  }
  const int64_t tick = cxLookTick();
  if (look->tick != tick) *look = {tick, 0};
  if (look->looks == kLooksATick) return false;
  ++look->looks;
  return true;
}

void cxLookRestart(void) {
  gLooks.store(0, std::memory_order_relaxed);
}

static const CxHooks gHooks{{.afterFork = [](bool isChild) {
  if (isChild) cxLookRestart();
}}};
