// The keys of the properties that the library itself gives to events, and looks for in them.
#ifndef QLX_SRC_QLXEVENTKEYS_H
#define QLX_SRC_QLXEVENTKEYS_H

#include <cstddef>
#include <cstdint>
#include <iterator>

enum class EventKey : uint8_t {
  kSourceFile,
  kSourceFunction,
  kSourceLine,
  kOrganization,
  kProduct,
  kComponent,
  kProductInstance,
  kClient,
  kServer,
  kServerFormat,
  kCorrelationId,
  kProcessId,
  kThreadId,
  kNone,  // any other
};

// In the order of the enumeration.
inline constexpr const char *kEventKeys[] = {
    "qlx_prop_srcfile", "qlx_prop_srcfunction",
    "qlx_prop_srcline", "organization",
    "product",          "component",
    "productInstance",  "client",
    "server",           "serverFormat",
    "correlationId",    "processId",
    "threadId",
};
static_assert(std::size(kEventKeys) == static_cast<size_t>(EventKey::kNone));

constexpr const char *nameOf(EventKey key) {
  return kEventKeys[static_cast<size_t>(key)];
}

#endif
