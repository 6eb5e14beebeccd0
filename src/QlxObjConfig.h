// The record of a configuration, and readers that hand out what it holds without a copy.
#ifndef QLX_SRC_QLXOBJCONFIG_H
#define QLX_SRC_QLXOBJCONFIG_H

#include <qlx/class/config.h>

#include "util/CxOwned.h"

struct ObjCfg {
  uint32_t refCount;
  char *name;                // owned, never null
  char *parentName;          // owned; null directly under "/"
  StringGroup *children;     // owned names, null until the first child
  StringToStringMap *props;  // owned, null until the first property
  uint8_t fromFile;          // 1: made while the properties file was read
  // 1: each of the children is registered and stores this one's name. The log manager sets it, and
  // it holds while this one is registered.
  uint8_t childrenLinked;
};

using ObjCfgRef = Owned<ObjCfg, qlxIntlReleaseObjCfg>;  // one counted reference

/** What configurations ask the registry that they are in, where there is one. */
struct ConfigRegistry {
  uint8_t (*has)(const char *name);
  ObjCfg *(*get)(const char *name);  // counted; made when it is new; null where that cannot be
  // Told when a configuration that stored this parent name got another one.
  void (*childStrays)(const char *parentName);
};

/** The registry lasts as long as the process. */
void qlxSetConfigRegistry(const ConfigRegistry *registry);

/** Replaces the stored parent name by a copy. */
void qlxSetParentName(ObjCfg *cfg, const char *parentName);

#endif
