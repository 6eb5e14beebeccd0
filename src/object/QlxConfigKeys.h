// A class's configuration keys as rows: the key, compared exactly, and what a change of it does.
#ifndef QLX_SRC_QLXCONFIGKEYS_H
#define QLX_SRC_QLXCONFIGKEYS_H

#include <span>

#include <qlx/memory.h>
#include <qlx/types.h>

struct ConfigKey {
  const char *key;
  void (*apply)(QlxObject *object, const char *key);
};

// Applies the row of the key; false when the class does not know the key.
inline bool qlxApplyConfigKey(std::span<const ConfigKey> rows, QlxObject *object, const char *key) {
  for (const ConfigKey &row : rows) {
    if (OslStringCmp(row.key, key) != 0) continue;
    row.apply(object, key);
    return true;
  }
  return false;
}

#endif
