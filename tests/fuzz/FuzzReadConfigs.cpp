// The properties reader, to live configurations: whatever a file holds, the toolkit opens or says
// that it does not, twice the same; objects are made by what it configured, and everything goes.
// Nothing is logged, so no configured file is ever opened.
#include <cstdint>
#include <cstdlib>
#include <string>

#include <sys/mman.h>
#include <unistd.h>

#include <qlx/qlx.h>

static void require(bool holds) {
  if (!holds) abort();
}

static void getObject(const char *name) {
  QlxObject *object = QlxGetObject(name, nullptr);
  OslMemoryFree(QlxGetObjectName(object));
  QlxReleaseObject(object);
}

// Every name that is listed is registered, and what it inherits can be read.
static int32_t readConfigs() {
  int32_t count = 0;
  for (StringGroupNode *it = QlxLogMgrConfigNames(); it; it = it->next, ++count) {
    require(QlxLogMgrHasCfg(it->value) == 1);
    ObjCfg *cfg = QlxLogMgrGetCfg(it->value);
    require(cfg != nullptr);
    OslMemoryFree(QlxGetInheritedObjCfgProp(cfg, "className", nullptr));
    QlxReleaseObjCfg(cfg);
  }
  return count;
}

// The number of configurations, or -1 when the file was refused.
static int32_t openAndUse(const char *path) {
  CxStatus status = {'?', 77};
  if (!QlxOpenToolkit(path, &status)) {
    require(status.kind == '-' && status.code == 0);  // refused, not unreadable
    require(QlxLogMgrConfigNames() == nullptr);
    return -1;
  }
  require(status.kind == '?');
  const int32_t count = readConfigs();
  for (const char *name : {"a", "a.b", "a.b.c", "console", "file", "filter", "formatter"}) {
    getObject(name);
  }
  QlxCloseToolkit();
  return count;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const int file = memfd_create("properties", 0);
  require(file >= 0 && write(file, data, size) == static_cast<ssize_t>(size));
  const std::string path = "/proc/self/fd/" + std::to_string(file);
  const int32_t first = openAndUse(path.c_str());
  require(openAndUse(path.c_str()) == first);
  close(file);
  return 0;
}
