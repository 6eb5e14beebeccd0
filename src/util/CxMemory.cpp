// Memory: the runtime library's allocator behind the rules for null and zero sizes. The only place
// in the library that calls the allocator, so that one hook sees every block.
#include "CxMemory.h"

#include <atomic>
#include <cstdlib>

static std::atomic<CxMemoryHook *> installedHook;  // null but in tests

static CxMemoryHook *memoryHook() {
  if (!installedHook.load(std::memory_order_relaxed)) [[likely]]
    return nullptr;
  return installedHook.load(std::memory_order_acquire);
}

// Makes one allocating call, with the hook's leave; `adds` tells that a success is one block more.
template <typename Call>
static void *allocate(bool adds, Call call) {
  CxMemoryHook *const hook = memoryHook();
  if (!hook) [[likely]]
    return call();
  if (!hook->mayAllocate(hook)) return nullptr;
  void *const block = call();
  if (block && adds) hook->allocated(hook);
  return block;
}

void cxIntlSetMemoryHook(CxMemoryHook *hook) {
  installedHook.store(hook, std::memory_order_release);
}

void *OslMemoryMalloc(uint32_t size) {
  if (size == 0) return nullptr;
  return allocate(true, [=] { return malloc(size); });
}

void *OslMemoryCalloc(uint32_t count, uint32_t size) {
  if (count == 0 || size == 0) return nullptr;
  return allocate(true, [=] { return calloc(count, size); });
}

void *OslMemoryRealloc(void *block, uint32_t size) {
  if (size == 0) return nullptr;  // Deliberate: the block lives on
  return allocate(!block, [=] { return realloc(block, size); });
}

void OslMemoryFree(void *block) {
  if (!block) return;
  if (CxMemoryHook *const hook = memoryHook()) hook->freed(hook);
  free(block);
}
