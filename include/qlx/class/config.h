/**
 * @file
 * Twins of qlx/config.h for class operations: the same arguments and results, with the API lock
 * held by the caller.
 */
#ifndef QLX_CLASS_CONFIG_H
#define QLX_CLASS_CONFIG_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

QLX_API ObjCfg *qlxIntlAllocObjCfg(const char *name);
QLX_API ObjCfg *qlxIntlAcquireObjCfg(ObjCfg *cfg);
QLX_API void qlxIntlReleaseObjCfg(ObjCfg *cfg);
QLX_API char *qlxIntlObjCfgGetName(ObjCfg *cfg);
QLX_API uint8_t qlxIntlObjCfgIsFromFile(ObjCfg *cfg);
QLX_API void qlxIntlObjCfgSetFromFile(ObjCfg *cfg, uint8_t flag);
QLX_API ObjCfg *qlxIntlObjCfgGetParent(ObjCfg *cfg);
QLX_API void qlxIntlObjCfgSetParent(ObjCfg *cfg, ObjCfg *parent);
QLX_API void qlxIntlObjCfgAddChild(ObjCfg *cfg, ObjCfg *child);
QLX_API void qlxIntlObjCfgRemChild(ObjCfg *cfg, ObjCfg *child);
QLX_API StringGroupNode *qlxIntlObjCfgChildrenNames(ObjCfg *cfg);
QLX_API StringToStringMapNode *qlxIntlObjCfgProperties(ObjCfg *cfg);
QLX_API char *qlxIntlGetInheritedObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API char *qlxIntlGetObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API uint8_t qlxIntlGetObjCfgPropBool(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API int32_t qlxIntlGetObjCfgPropInt(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API int64_t qlxIntlGetObjCfgPropLong(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API float qlxIntlGetObjCfgPropFloat(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API double qlxIntlGetObjCfgPropDouble(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API uint8_t qlxIntlSetObjCfgProp(ObjCfg *cfg, const char *key, const char *value);
QLX_API uint8_t qlxIntlSetObjCfgPropBool(ObjCfg *cfg, const char *key, uint8_t value);
QLX_API void qlxIntlSetObjCfgPropInt(ObjCfg *cfg, const char *key, int32_t value);
QLX_API void qlxIntlSetObjCfgPropLong(ObjCfg *cfg, const char *key, int64_t value);
QLX_API void qlxIntlSetObjCfgPropFloat(ObjCfg *cfg, const char *key, float value);
QLX_API void qlxIntlSetObjCfgPropDouble(ObjCfg *cfg, const char *key, double value);

QLX_API void qlxIntlLogMgrAddCfg(ObjCfg *cfg);
QLX_API void qlxIntlLogMgrRemCfg(ObjCfg *cfg);
QLX_API void qlxIntlLogMgrUpdateCfg(ObjCfg *cfg);
QLX_API ObjCfg *qlxIntlLogMgrGetCfg(const char *name);
QLX_API uint8_t qlxIntlLogMgrHasCfg(const char *name);
QLX_API uint8_t qlxIntlLogMgrApplyCfg(QlxObject *object, const char *name);
QLX_API StringGroupNode *qlxIntlLogMgrConfigNames(void);

QLX_END_DECLS

#endif
