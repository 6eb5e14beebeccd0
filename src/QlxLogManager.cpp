// The log manager: the one registry of configurations. It links each to its parent by the dots of
// the names and makes unknown ones on first reference.
#include "QlxLogManager.h"

#include <qlx/class/containers.h>
#include <qlx/config.h>
#include <qlx/memory.h>

#include "object/QlxLocked.h"
#include "QlxObjConfig.h"

static constexpr const char *kRoot = "/";

static struct {
  StringToObjCfgMap *configs;  // one counted reference to each
  StringGroup *configNames;    // the same names, in order of registration
  bool initialised;
} gLogMgr;

static void childStrays(const char *parentName);

static void freeRegistries() {
  qlxIntlFreeStringGroup(gLogMgr.configNames);
  qlxIntlFreeStringToObjCfgMap(gLogMgr.configs);
  gLogMgr = {};
}

// What configurations ask the registry that they are in.
static constexpr ConfigRegistry kRegistry = {
    .has = qlxIntlLogMgrHasCfg,
    .get = qlxIntlLogMgrGetCfg,
    .childStrays = childStrays,
};

void qlxInitLogMgr(void) {
  qlxSetConfigRegistry(&kRegistry);
  if (gLogMgr.initialised) return;
  gLogMgr.configNames = qlxIntlAllocStringGroup();
  gLogMgr.configs = qlxIntlAllocStringToObjCfgMap();
  gLogMgr.initialised = gLogMgr.configNames && gLogMgr.configs;
  if (!gLogMgr.initialised) freeRegistries();
}

void qlxCloseLogMgr(void) {
  if (gLogMgr.initialised) freeRegistries();
}

static bool isRoot(const char *name) {
  return OslStringCmp(name, kRoot) == 0;
}

uint8_t qlxIntlLogMgrHasCfg(const char *name) {
  return qlxIntlStringToObjCfgMapHasKey(gLogMgr.configs, name);
}

// ---- Parents

// The stored parent name, found and stored first when there is none; null for none.
static const char *fetchParentName(ObjCfg *cfg) {
  if (cfg->parentName) return cfg->parentName;
  const OwnedStr prefix{OslStringDup(cfg->name)};
  while (char *dot = OslStringRChr(prefix.get(), '.')) {
    *dot = '\0';
    if (!qlxIntlLogMgrHasCfg(prefix.get())) continue;
    qlxSetParentName(cfg, prefix.get());
    break;
  }
  return cfg->parentName;
}

char *qlxLogMgrGetParentConfigName(ObjCfg *cfg) {
  if (!cfg) return nullptr;
  const char *name = fetchParentName(cfg);
  return OslStringDup(name ? name : kRoot);
}

// A configuration that names itself as its parent counts as having none.
static ObjCfg *fetchParent(ObjCfg *cfg) {
  const char *name = fetchParentName(cfg);
  return OslStringCmp(name, cfg->name) == 0 ? nullptr : qlxIntlLogMgrGetCfg(name);
}

// ---- Children. They are walked over a snapshot of their names, since the walk moves them.

using NameList = Owned<StringList, qlxIntlFreeStringList>;

static NameList copyChildrenNames(ObjCfg *cfg) {
  NameList names{qlxIntlAllocStringList()};
  for (StringGroupNode *it = qlxIntlObjCfgChildrenNames(cfg); it; it = it->next) {
    qlxIntlStringListAppend(names.get(), it->value);
  }
  return names;
}

template <typename Visit>
static void forEachChild(ObjCfg *cfg, Visit visit) {
  const NameList names = copyChildrenNames(cfg);
  for (StringListNode *it = qlxIntlStringListIterator(names.get()); it; it = it->next) {
    if (const ObjCfgRef child{qlxIntlLogMgrGetCfg(it->value)}) visit(child.get());
  }
}

static bool storesParent(const ObjCfg *child, const ObjCfg *parent) {
  return OslStringCmp(child->parentName, parent->name) == 0;
}

static bool isLinkedChild(const ObjCfg *parent, const char *name) {
  const StringToObjCfgMapNode *child = qlxIntlStringToObjCfgMapGetNode(gLogMgr.configs, name);
  return child && storesParent(child->value, parent);
}

// Whether a walk over the children would find none to move. Once it is so it stays so, until
// somebody adds a child or a child gets another parent: the walk is not repeated for each sibling.
static bool areChildrenLinked(ObjCfg *parent) {
  if (parent->childrenLinked) return true;
  for (StringGroupNode *it = qlxIntlObjCfgChildrenNames(parent); it; it = it->next) {
    if (!isLinkedChild(parent, it->value)) return false;
  }
  parent->childrenLinked = 1;
  return true;
}

static void childStrays(const char *parentName) {
  const StringToObjCfgMapNode *parent =
      qlxIntlStringToObjCfgMapGetNode(gLogMgr.configs, parentName);
  if (parent) parent->value->childrenLinked = 0;
}

// Adds a registered child.
static void linkChild(ObjCfg *parent, ObjCfg *child) {
  const uint8_t linked = parent->childrenLinked;
  qlxIntlObjCfgAddChild(parent, child);
  parent->childrenLinked = linked && storesParent(child, parent);
}

static void moveChild(ObjCfg *from, ObjCfg *to, ObjCfg *child) {
  qlxIntlObjCfgRemChild(from, child);
  linkChild(to, child);
}

static void moveStrays(ObjCfg *from, ObjCfg *to) {
  if (areChildrenLinked(from)) return;
  forEachChild(from, [&](ObjCfg *child) {
    fetchParentName(child);
    if (!storesParent(child, from)) moveChild(from, to, child);
  });
}

// ---- Registry

void qlxIntlLogMgrAddCfg(ObjCfg *cfg) {
  if (!cfg || !gLogMgr.initialised || isRoot(cfg->name) || qlxIntlLogMgrHasCfg(cfg->name)) return;
  if (!qlxIntlStringToObjCfgMapPut(gLogMgr.configs, cfg->name, cfg)) return;
  cfg->childrenLinked = 0;
  if (const ObjCfgRef parent{fetchParent(cfg)}) {
    qlxIntlObjCfgSetParent(cfg, parent.get());
    moveStrays(parent.get(), cfg);
    linkChild(parent.get(), cfg);
  }
  qlxIntlStringGroupAdd(gLogMgr.configNames, cfg->name);
}

ObjCfg *qlxIntlLogMgrGetCfg(const char *name) {
  if (!name || !gLogMgr.initialised) return nullptr;
  if (ObjCfg *known = qlxIntlStringToObjCfgMapGet(gLogMgr.configs, name)) return known;
  ObjCfgRef made{qlxIntlAllocObjCfg(name)};
  qlxIntlLogMgrAddCfg(made.get());
  // Adding may have changed the parent name that was asked for.
  return made && qlxIntlLogMgrHasCfg(made->name) ? made.release() : nullptr;
}

// It leaves the registry last: a parent or child that is missing is made here, which looks at other
// configurations' children by name, and would make one of this name anew.
void qlxIntlLogMgrRemCfg(ObjCfg *cfg) {
  if (!cfg || !qlxIntlLogMgrHasCfg(cfg->name)) return;
  const ObjCfgRef removed{qlxIntlStringToObjCfgMapGet(gLogMgr.configs, cfg->name)};
  if (const ObjCfgRef parent{fetchParent(removed.get())}) {
    for (ObjCfg *lister : {parent.get(), removed.get()}) {
      qlxIntlObjCfgRemChild(lister, removed.get());
    }
    forEachChild(removed.get(),
                 [&](ObjCfg *child) { moveChild(removed.get(), parent.get(), child); });
  }
  qlxIntlStringToObjCfgMapRem(gLogMgr.configs, removed->name);
  qlxIntlStringGroupRem(gLogMgr.configNames, removed->name);
}

void qlxIntlLogMgrUpdateCfg(ObjCfg *cfg) {
  if (!cfg || !qlxIntlLogMgrHasCfg(cfg->name)) return;
  const ObjCfgRef held{qlxIntlAcquireObjCfg(cfg)};
  qlxIntlLogMgrRemCfg(cfg);
  qlxIntlLogMgrAddCfg(cfg);
}

StringGroupNode *qlxIntlLogMgrConfigNames(void) {
  return qlxIntlStringGroupIterator(gLogMgr.configNames);
}

uint8_t qlxLogMgrAddCfgFromFile(const char *configName, const char *propertyName,
                                const char *value) {
  if (!configName || !*configName || !propertyName || !*propertyName || !value) return 0;
  const uint8_t existed = qlxIntlLogMgrHasCfg(configName);
  const ObjCfgRef cfg{qlxIntlLogMgrGetCfg(configName)};
  if (!cfg) return 0;
  if (!existed) qlxIntlObjCfgSetFromFile(cfg.get(), 1);
  return qlxIntlSetObjCfgProp(cfg.get(), propertyName, value);
}

// ---- What is inherited

namespace {

// A configuration and its ancestors, nearest first, each counted; a chain of parents that comes
// back to one already in it ends there.
class Lineage {
 public:
  explicit Lineage(ObjCfg *cfg) {
    for (ObjCfgRef next{cfg}; next && !contains(next.get()); next.reset(fetchParent(top()))) {
      if (!reserve()) break;
      members_.get()[count_++] = next.release();
    }
  }
  ~Lineage() {
    for (uint32_t i = 0; i < count_; ++i) qlxIntlReleaseObjCfg(members_.get()[i]);
  }
  Lineage(const Lineage &) = delete;
  Lineage &operator=(const Lineage &) = delete;

  uint32_t count() const { return count_; }
  ObjCfg *operator[](uint32_t i) const { return members_.get()[i]; }

 private:
  ObjCfg *top() const { return members_.get()[count_ - 1]; }

  bool contains(const ObjCfg *cfg) const {
    for (uint32_t i = 0; i < count_; ++i) {
      if (members_.get()[i] == cfg) return true;
    }
    return false;
  }

  bool reserve() {
    if (count_ < capacity_) return true;
    const uint32_t wanted = capacity_ ? capacity_ * 2 : 8;
    void *grown = OslMemoryRealloc(members_.get(), wanted * sizeof(ObjCfg *));
    if (!grown) return false;
    (void)members_.release();
    members_.reset(static_cast<ObjCfg **>(grown));
    capacity_ = wanted;
    return true;
  }

  Owned<ObjCfg *, OslMemoryFree> members_;
  uint32_t count_ = 0, capacity_ = 0;
};

}  // namespace

// Ancestors first, so that the value set nearest to the configuration itself is the last.
bool qlxVisitInherited(const char *name, QlxObject *object, QlxVisitProperty visit) {
  const Lineage lineage{qlxIntlLogMgrGetCfg(name)};
  for (uint32_t i = lineage.count(); i-- > 0;) {
    for (StringToStringMapNode *it = qlxIntlObjCfgProperties(lineage[i]); it; it = it->next) {
      visit(object, it->key, it->value);
    }
  }
  return lineage.count() > 0;
}

// Public functions

void QlxLogMgrAddCfg(ObjCfg *cfg) {
  qlxLocked<qlxIntlLogMgrAddCfg>(cfg);
}
void QlxLogMgrRemCfg(ObjCfg *cfg) {
  qlxLocked<qlxIntlLogMgrRemCfg>(cfg);
}
void QlxLogMgrUpdateCfg(ObjCfg *cfg) {
  qlxLocked<qlxIntlLogMgrUpdateCfg>(cfg);
}
ObjCfg *QlxLogMgrGetCfg(const char *name) {
  return qlxLocked<qlxIntlLogMgrGetCfg>(name);
}
uint8_t QlxLogMgrHasCfg(const char *name) {
  return qlxLocked<qlxIntlLogMgrHasCfg>(name);
}

StringGroupNode *QlxLogMgrConfigNames(void) {
  return qlxLocked<qlxIntlLogMgrConfigNames>();
}
