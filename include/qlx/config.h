/**
 * @file
 * Configurations and the log manager that holds them.
 *
 * A configuration is a named, counted set of string properties. It inherits the properties that it
 * does not set from its parent, which the dots of the names decide: "a.b" is the parent of "a.b.c".
 * The log manager is the one registry of configurations; it lives from QlxOpenToolkit() to
 * QlxCloseToolkit().
 *
 * For every function here: it takes the API lock, and gives 0, null or nothing when the lock cannot
 * be taken; a null argument gives 0, null or nothing; a returned `char *` is a new string that the
 * caller frees with OslMemoryFree(); a returned configuration is a counted reference that the
 * caller gives back with QlxReleaseObjCfg(); arguments are borrowed and copied where they are kept.
 * Inside the library, and from class operations, call the qlxIntl... twins (qlx/class/config.h).
 */
#ifndef QLX_CONFIG_H
#define QLX_CONFIG_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return a new, unregistered configuration with one reference; null when memory ran out */
QLX_API ObjCfg *QlxAllocObjCfg(const char *name);

/** Adds a reference. @return cfg */
QLX_API ObjCfg *QlxAcquireObjCfg(ObjCfg *cfg);

/** Gives a reference back; the last one frees the configuration. */
QLX_API void QlxReleaseObjCfg(ObjCfg *cfg);

QLX_API char *QlxObjCfgGetName(ObjCfg *cfg);

/** @return 1 when the configuration was made while the properties file was read */
QLX_API uint8_t QlxObjCfgIsFromFile(ObjCfg *cfg);
QLX_API void QlxObjCfgSetFromFile(ObjCfg *cfg, uint8_t flag);

/** @return the parent, which the log manager makes when it is missing; null directly under "/", and
 *  for an unregistered one that names itself */
QLX_API ObjCfg *QlxObjCfgGetParent(ObjCfg *cfg);

/** Records the parent's name. Does not make `cfg` a child of it: see QlxObjCfgAddChild(). */
QLX_API void QlxObjCfgSetParent(ObjCfg *cfg, ObjCfg *parent);

/** Adds the child's name, once, and makes `cfg` its parent. */
QLX_API void QlxObjCfgAddChild(ObjCfg *cfg, ObjCfg *child);

/** Removes the child's name. Deliberate: the child keeps its parent name. */
QLX_API void QlxObjCfgRemChild(ObjCfg *cfg, ObjCfg *child);

/** @return an iterator (QlxStringGroupIter...) over the children's names, valid while none changes
 */
QLX_API StringGroupNode *QlxObjCfgChildrenNames(ObjCfg *cfg);

/** @return an iterator (QlxStringToStringMapIter...) over the own properties, in order of setting
 */
QLX_API StringToStringMapNode *QlxObjCfgProperties(ObjCfg *cfg);

/**
 * Reads a property of the configuration or of the nearest ancestor that sets it. An empty value
 * counts as set. A chain of parents that comes back to a name already visited ends there.
 *
 * @param found  optional; becomes 1 when a value came back, otherwise 0
 */
QLX_API char *QlxGetInheritedObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found);

/** The same as QlxGetInheritedObjCfgProp(). */
QLX_API char *QlxGetObjCfgProp(ObjCfg *cfg, const char *key, uint8_t *found);

/*
 * Typed reads: the inherited value, converted by the rules of qlx/props.h. `found` (optional)
 * becomes 1 when the conversion succeeded; otherwise it is 0 and the result 0 or 0.0.
 */
QLX_API uint8_t QlxGetObjCfgPropBool(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API int32_t QlxGetObjCfgPropInt(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API int64_t QlxGetObjCfgPropLong(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API float QlxGetObjCfgPropFloat(ObjCfg *cfg, const char *key, uint8_t *found);
QLX_API double QlxGetObjCfgPropDouble(ObjCfg *cfg, const char *key, uint8_t *found);

/**
 * Sets an own property. Tells no object: objects get a configuration when they are made, or by
 * QlxLogMgrApplyCfg().
 *
 * @param value  null is stored too: the key is there, and reads as if it were not set
 * @return 1 when stored
 */
QLX_API uint8_t QlxSetObjCfgProp(ObjCfg *cfg, const char *key, const char *value);

/* Typed writes, in the text forms of qlx/props.h. */
QLX_API uint8_t QlxSetObjCfgPropBool(ObjCfg *cfg, const char *key, uint8_t value);
QLX_API void QlxSetObjCfgPropInt(ObjCfg *cfg, const char *key, int32_t value);
QLX_API void QlxSetObjCfgPropLong(ObjCfg *cfg, const char *key, int64_t value);
QLX_API void QlxSetObjCfgPropFloat(ObjCfg *cfg, const char *key, float value);
QLX_API void QlxSetObjCfgPropDouble(ObjCfg *cfg, const char *key, double value);

/* ---- Log manager ---- */

/** Registers a configuration and links it below its nearest parent; a known name is ignored. */
QLX_API void QlxLogMgrAddCfg(ObjCfg *cfg);

/** Takes a configuration out; its children move to its parent (without a parent they keep its name
 *  as their parent's). Objects are not told. */
QLX_API void QlxLogMgrRemCfg(ObjCfg *cfg);

/** Takes a registered configuration out and adds it again, after its name or parent changed. */
QLX_API void QlxLogMgrUpdateCfg(ObjCfg *cfg);

/** @return the configuration of that name, made and registered when unknown; null for "/" */
QLX_API ObjCfg *QlxLogMgrGetCfg(const char *name);

/** @return 1 when a configuration of that name is registered */
QLX_API uint8_t QlxLogMgrHasCfg(const char *name);

/**
 * Sets the properties of the named configuration on an object, ancestors' properties first; each
 * one reaches the object's class.
 *
 * @return 1, or 0 for a null object, "/" or a configuration that cannot be made
 */
QLX_API uint8_t QlxLogMgrApplyCfg(QlxObject *object, const char *name);

/** @return an iterator (QlxStringGroupIter...) over all names, valid while none is removed */
QLX_API StringGroupNode *QlxLogMgrConfigNames(void);

QLX_END_DECLS

#endif
