// A test that opens and closes the toolkit itself, with a host's classes and a folder of its own.
#ifndef QLX_TESTS_TOOLKITLIFETEST_H
#define QLX_TESTS_TOOLKITLIFETEST_H

#include <string>

#include "QlxToolkit.h"
#include "support/HostTest.h"
#include "support/TempDir.h"

// The toolkit is closed when a test begins, and closed after it.
class ToolkitLifeTest : public HostTest {
 protected:
  void SetUp() override {}

  static uint8_t open(const char *file = nullptr) { return QlxOpenToolkit(file, nullptr); }

  // An object by its name, without making one.
  static Handle find(const char *name) {
    const ApiLock lock;
    return Handle{qlxToolkitGetObjInstance(name)};
  }
  static uint32_t countOf(const char *name) {
    const Handle object = find(name);
    return object ? object->refCount - 1 : 0;
  }

  static QlxObject *toolkitLogger() {
    const ApiLock lock;
    return qlxToolkitLogger();
  }

  static ObjClass *findClass(const char *name) {
    const ApiLock lock;
    return qlxToolkitGetClassDef(name);
  }

  static std::string classNames(int32_t kind) {
    const ApiLock lock;
    std::string names;
    const StringGroupNode *it = qlxToolkitFetchClassnames(kind);
    for (; it; it = it->next) names += std::string(it->value) + "|";
    return names;
  }

  TempDir dir;
};

#endif
