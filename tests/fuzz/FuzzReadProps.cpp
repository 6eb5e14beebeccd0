// The properties reader, to a property list: whatever a file holds, the list stays whole, the
// caller's status untouched, and a second read does the same.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

#include <sys/mman.h>
#include <unistd.h>

#include <qlx/proplist.h>

static void require(bool holds) {
  if (!holds) abort();
}

static bool equal(const CxPropList &a, const CxPropList &b) {
  if (a.count != b.count) return false;
  for (int32_t i = 0; i < a.count; ++i) {
    if (strcmp(a.entries[i].key, b.entries[i].key) != 0) return false;
    if (strcmp(a.entries[i].value, b.entries[i].value) != 0) return false;
  }
  return true;
}

static void requireWhole(const CxPropList &list) {
  require(list.count == 0 || list.count < list.capacity);
  for (int32_t i = 0; i < list.count; ++i) {
    uint8_t found = 0;
    require(list.entries[i].value ==
            CxPropListPeekStr(&list, list.entries[i].key, &found));  // so no key is there twice
    require(found == 1);
  }
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const int file = memfd_create("properties", 0);
  require(file >= 0 && write(file, data, size) == static_cast<ssize_t>(size));
  const std::string path = "/proc/self/fd/" + std::to_string(file);

  CxStatus status{'?', 77};
  CxPropList first{}, second{};
  const uint8_t result = CxPropListRead(path.c_str(), &first, &status);
  require(CxPropListRead(path.c_str(), &second, &status) == result);
  require(status.kind == '?' && status.code == 77);
  requireWhole(first);
  require(equal(first, second));

  CxPropListRead(path.c_str(), &second, nullptr);  // the same pairs once more change nothing
  require(equal(first, second));
  CxPropListDiscard(&first);
  CxPropListDiscard(&second);
  close(file);
  return 0;
}
