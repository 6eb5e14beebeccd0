// Configurations: named, counted sets of properties that inherit from a parent. Parents and
// children are held by name; the log manager finds them.
#include "QlxObjConfig.h"

#include <qlx/class/containers.h>
#include <qlx/class/props.h>
#include <qlx/config.h>
#include <qlx/memory.h>
#include <qlx/props.h>

#include "object/QlxLocked.h"
#include "QlxProps.h"

static const ConfigRegistry *gRegistry;  // null before the log manager was there

void qlxSetConfigRegistry(const ConfigRegistry *registry) {
  gRegistry = registry;
}

static void destroyObjCfg(ObjCfg *cfg) {
  OslMemoryFree(cfg->name);
  OslMemoryFree(cfg->parentName);
  qlxIntlFreeStringGroup(cfg->children);
  qlxIntlFreeStringToStringMap(cfg->props);
  OslMemoryFree(cfg);
}

ObjCfg *qlxIntlAllocObjCfg(const char *name) {
  if (!name) return nullptr;
  auto *cfg = static_cast<ObjCfg *>(OslMemoryCalloc(1, sizeof(ObjCfg)));
  if (!cfg) return nullptr;
  cfg->refCount = 1;
  cfg->name = OslStringDup(name);
  if (cfg->name) return cfg;
  destroyObjCfg(cfg);
  return nullptr;
}

ObjCfg *qlxIntlAcquireObjCfg(ObjCfg *cfg) {
  if (cfg) ++cfg->refCount;
  return cfg;
}

void qlxIntlReleaseObjCfg(ObjCfg *cfg) {
  if (cfg && --cfg->refCount == 0) destroyObjCfg(cfg);
}

char *qlxIntlObjCfgGetName(ObjCfg *cfg) {
  return cfg ? OslStringDup(cfg->name) : nullptr;
}

uint8_t qlxIntlObjCfgIsFromFile(ObjCfg *cfg) {
  return cfg ? cfg->fromFile : 0;
}

void qlxIntlObjCfgSetFromFile(ObjCfg *cfg, uint8_t flag) {
  if (cfg) cfg->fromFile = flag;
}

static bool isParentNamed(const ObjCfg *cfg, const char *name) {
  return OslStringCmp(cfg->parentName, name) == 0;
}

// One that names itself as its parent makes no namesake.
ObjCfg *qlxIntlObjCfgGetParent(ObjCfg *cfg) {
  if (!cfg || !gRegistry) return nullptr;
  if (isParentNamed(cfg, cfg->name) && !gRegistry->has(cfg->name)) return nullptr;
  return gRegistry->get(cfg->parentName);
}

void qlxSetParentName(ObjCfg *cfg, const char *parentName) {
  if (isParentNamed(cfg, parentName)) return;
  char *copy = OslStringDup(parentName);
  if (!copy) return;
  const OwnedStr old{cfg->parentName};
  cfg->parentName = copy;
  if (gRegistry) gRegistry->childStrays(old.get());
}

void qlxIntlObjCfgSetParent(ObjCfg *cfg, ObjCfg *parent) {
  if (cfg && parent) qlxSetParentName(cfg, parent->name);
}

void qlxIntlObjCfgAddChild(ObjCfg *cfg, ObjCfg *child) {
  if (!cfg || !child) return;
  if (!cfg->children) cfg->children = qlxIntlAllocStringGroup();
  cfg->childrenLinked = 0;
  qlxIntlStringGroupAdd(cfg->children, child->name);
  qlxIntlObjCfgSetParent(child, cfg);
}

void qlxIntlObjCfgRemChild(ObjCfg *cfg, ObjCfg *child) {
  if (!cfg || !child) return;
  qlxIntlStringGroupRem(cfg->children, child->name);
  qlxIntlObjCfgSetParent(child, nullptr);  // Deliberate: does nothing, the old parent name stays
}

StringGroupNode *qlxIntlObjCfgChildrenNames(ObjCfg *cfg) {
  return cfg ? qlxIntlStringGroupIterator(cfg->children) : nullptr;
}

StringToStringMapNode *qlxIntlObjCfgProperties(ObjCfg *cfg) {
  return cfg ? qlxIntlStringToStringMapIterator(cfg->props) : nullptr;
}

// ---- Inherited lookup

// The stored value of the nearest configuration that holds the key, or null. It stays valid while
// the log manager keeps that configuration.
static const char *peekInherited(ObjCfg *cfg, const char *key) {
  ObjCfgRef current{qlxIntlAcquireObjCfg(cfg)};
  // A chain of parents may come back to itself: to the first one, which need not be registered, by
  // its name; to another one by Brent's test: `mark` moves up to the walker at every power of two.
  const ObjCfg *mark = nullptr;
  for (uint32_t steps = 0, limit = 1; current && current.get() != mark; ++steps) {
    if (const char *value = qlxPeekMapProp(current->props, key)) return value;
    if (steps == limit) {
      limit *= 2;
      mark = current.get();
    }
    if (isParentNamed(current.get(), cfg->name)) break;
    current.reset(qlxIntlObjCfgGetParent(current.get()));
  }
  return nullptr;
}

char *qlxIntlGetInheritedObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found) {
  char *value = cfg && key ? OslStringDup(peekInherited(cfg, key)) : nullptr;
  if (found) *found = value != nullptr;
  return value;
}

char *qlxIntlGetObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found) {
  return qlxIntlGetInheritedObjCfgProp(cfg, key, found);
}

// ---- Setting

static StringToStringMap *fetchProps(ObjCfg *cfg) {
  if (!cfg) return nullptr;
  if (!cfg->props) cfg->props = qlxIntlAllocStringToStringMap();
  return cfg->props;
}

uint8_t qlxIntlSetObjCfgProp(ObjCfg *cfg, const char *key, const char *value) {
  return QlxSetMapProp(fetchProps(cfg), key, value);
}

uint8_t qlxIntlSetObjCfgPropBool(ObjCfg *cfg, const char *key, uint8_t value) {
  return QlxSetMapPropBool(fetchProps(cfg), key, value);
}

#define QLX_CONFIG_GETTER(Type, T, Conversion)                                 \
  T qlxIntlGetObjCfgProp##Type(ObjCfg *cfg, const char *key, uint8_t *found) { \
    return Conversion(cfg && key ? peekInherited(cfg, key) : nullptr, found);  \
  }                                                                            \
  T QlxGetObjCfgProp##Type(ObjCfg *cfg, const char *key, uint8_t *found) {     \
    return qlxLocked<qlxIntlGetObjCfgProp##Type>(cfg, key, found);             \
  }

#define QLX_CONFIG_PROPERTY(Type, T, Conversion)                           \
  QLX_CONFIG_GETTER(Type, T, Conversion)                                   \
  void qlxIntlSetObjCfgProp##Type(ObjCfg *cfg, const char *key, T value) { \
    QlxSetMapProp##Type(fetchProps(cfg), key, value);                      \
  }                                                                        \
  void QlxSetObjCfgProp##Type(ObjCfg *cfg, const char *key, T value) {     \
    qlxLocked<qlxIntlSetObjCfgProp##Type>(cfg, key, value);                \
  }

QLX_CONFIG_GETTER(Bool, uint8_t, qlxPropStrToBool)  // its setter answers whether it stored
QLX_CONFIG_PROPERTY(Int, int32_t, qlxPropStrToInt32)
QLX_CONFIG_PROPERTY(Long, int64_t, qlxPropStrToInt64)
QLX_CONFIG_PROPERTY(Float, float, qlxPropStrToFloat32)
QLX_CONFIG_PROPERTY(Double, double, qlxPropStrToFloat64)

#undef QLX_CONFIG_PROPERTY
#undef QLX_CONFIG_GETTER

// Public functions (the rest of the typed family stands with its rows above)

ObjCfg *QlxAllocObjCfg(const char *name) {
  return qlxLocked<qlxIntlAllocObjCfg>(name);
}
ObjCfg *QlxAcquireObjCfg(ObjCfg *cfg) {
  return qlxLocked<qlxIntlAcquireObjCfg>(cfg);
}
void QlxReleaseObjCfg(ObjCfg *cfg) {
  qlxLocked<qlxIntlReleaseObjCfg>(cfg);
}
char *QlxObjCfgGetName(ObjCfg *cfg) {
  return qlxLocked<qlxIntlObjCfgGetName>(cfg);
}
uint8_t QlxObjCfgIsFromFile(ObjCfg *cfg) {
  return qlxLocked<qlxIntlObjCfgIsFromFile>(cfg);
}

void QlxObjCfgSetFromFile(ObjCfg *cfg, uint8_t flag) {
  qlxLocked<qlxIntlObjCfgSetFromFile>(cfg, flag);
}

ObjCfg *QlxObjCfgGetParent(ObjCfg *cfg) {
  return qlxLocked<qlxIntlObjCfgGetParent>(cfg);
}

void QlxObjCfgSetParent(ObjCfg *cfg, ObjCfg *parent) {
  qlxLocked<qlxIntlObjCfgSetParent>(cfg, parent);
}

void QlxObjCfgAddChild(ObjCfg *cfg, ObjCfg *child) {
  qlxLocked<qlxIntlObjCfgAddChild>(cfg, child);
}
void QlxObjCfgRemChild(ObjCfg *cfg, ObjCfg *child) {
  qlxLocked<qlxIntlObjCfgRemChild>(cfg, child);
}

StringGroupNode *QlxObjCfgChildrenNames(ObjCfg *cfg) {
  return qlxLocked<qlxIntlObjCfgChildrenNames>(cfg);
}

StringToStringMapNode *QlxObjCfgProperties(ObjCfg *cfg) {
  return qlxLocked<qlxIntlObjCfgProperties>(cfg);
}

char *QlxGetInheritedObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found) {
  return qlxLocked<qlxIntlGetInheritedObjCfgProp>(cfg, key, found);
}

char *QlxGetObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found) {
  return qlxLocked<qlxIntlGetObjCfgProp>(cfg, key, found);
}

uint8_t QlxSetObjCfgProp(ObjCfg *cfg, const char *key, const char *value) {
  return qlxLocked<qlxIntlSetObjCfgProp>(cfg, key, value);
}

uint8_t QlxSetObjCfgPropBool(ObjCfg *cfg, const char *key, uint8_t value) {
  return qlxLocked<qlxIntlSetObjCfgPropBool>(cfg, key, value);
}
