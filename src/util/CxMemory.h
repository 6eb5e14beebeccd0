// The switch behind the allocation functions: an installed hook counts allocations and makes chosen
// ones fail. Only tests install one; without it an allocation costs one relaxed load more.
#ifndef QLX_SRC_CXMEMORY_H
#define QLX_SRC_CXMEMORY_H

#include <qlx/memory.h>

QLX_BEGIN_DECLS

// All operations are called from any thread, at the same time, and allocate nothing themselves.
typedef struct CxMemoryHook CxMemoryHook;
struct CxMemoryHook {
  bool (*mayAllocate)(CxMemoryHook *hook);  // before each call that may allocate; false fails it
  void (*allocated)(CxMemoryHook *hook);    // there is one block more
  void (*freed)(CxMemoryHook *hook);        // there is one block less
};

// Installs a hook, borrowed until it is replaced; null removes it. No thread may be inside an
// allocation function when a hook goes.
void cxIntlSetMemoryHook(CxMemoryHook *hook);

QLX_END_DECLS

#endif
