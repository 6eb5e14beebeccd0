// Ownership: what must be released is held by a unique_ptr whose deleter is the release function,
// so no function needs a cleanup ladder. Header only; nothing here allocates.
#ifndef QLX_SRC_CXOWNED_H
#define QLX_SRC_CXOWNED_H

#include <memory>

#include <qlx/memory.h>

template <auto Release>
struct ReleaseWith {
  template <typename T>
  void operator()(T *p) const noexcept {
    Release(p);
  }
};

template <typename T, auto Release>
using Owned = std::unique_ptr<T, ReleaseWith<Release>>;

using OwnedStr = Owned<char, OslMemoryFree>;
using OwnedUStr = Owned<UChar, OslMemoryFree>;

#endif
