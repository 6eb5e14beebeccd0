// An object's own properties: the typed family over its property map, and a configuration's,
// applied to it. Every setter tells the object's class of the key, also when storing failed.
#include <qlx/class/containers.h>
#include <qlx/class/config.h>
#include <qlx/class/object.h>
#include <qlx/config.h>
#include <qlx/object.h>
#include <qlx/props.h>

#include "QlxLocked.h"
#include "QlxLogManager.h"
#include "QlxOperation.h"

static StringToStringMap *propsOf(QlxObject *object) {
  return object ? object->props : nullptr;
}

StringToStringMap *qlxFetchObjPropMap(QlxObject *object) {
  if (!object || !object->objClass) return nullptr;
  if (!object->props) object->props = qlxIntlAllocStringToStringMap();
  return object->props;
}

void qlxNotifyObjCfgChange(QlxObject *object, const char *key) {
  const ObjClass *objClass = object ? object->objClass : nullptr;
  if (!objClass || !objClass->fCfgChange) return;
  qlxCall({objClass, "fCfgChange"}, objClass->fCfgChange, object, key);
}

char *qlxIntlGetObjProp(QlxObject *object, const char *key, uint8_t *found) {
  return QlxGetMapProp(propsOf(object), key, found);
}

uint8_t qlxIntlSetObjProp(QlxObject *object, const char *key, const char *value) {
  const uint8_t stored = QlxSetMapProp(qlxFetchObjPropMap(object), key, value);
  qlxNotifyObjCfgChange(object, key);
  return stored;
}

uint8_t qlxIntlSetObjPropBool(QlxObject *object, const char *key, uint8_t value) {
  const uint8_t stored = QlxSetMapPropBool(qlxFetchObjPropMap(object), key, value);
  qlxNotifyObjCfgChange(object, key);
  return stored;
}

uint8_t qlxIntlLogMgrApplyCfg(QlxObject *object, const char *name) {
  if (!object || !object->objClass) return 0;
  return qlxVisitInherited(name, object, qlxIntlSetObjProp);
}

#define QLX_OBJECT_GETTER(Type, T)                                                \
  T qlxIntlGetObjProp##Type(QlxObject *object, const char *key, uint8_t *found) { \
    return QlxGetMapProp##Type(propsOf(object), key, found);                      \
  }                                                                               \
  T QlxGetObjProp##Type(QlxObject *object, const char *key, uint8_t *found) {     \
    return qlxLocked<qlxIntlGetObjProp##Type>(object, key, found);                \
  }

#define QLX_OBJECT_PROPERTY(Type, T)                                          \
  QLX_OBJECT_GETTER(Type, T)                                                  \
  void qlxIntlSetObjProp##Type(QlxObject *object, const char *key, T value) { \
    QlxSetMapProp##Type(qlxFetchObjPropMap(object), key, value);              \
    qlxNotifyObjCfgChange(object, key);                                       \
  }                                                                           \
  void QlxSetObjProp##Type(QlxObject *object, const char *key, T value) {     \
    qlxLocked<qlxIntlSetObjProp##Type>(object, key, value);                   \
  }

QLX_OBJECT_GETTER(Bool, uint8_t)  // its setter answers whether it stored
QLX_OBJECT_PROPERTY(Int, int32_t)
QLX_OBJECT_PROPERTY(Long, int64_t)
QLX_OBJECT_PROPERTY(Float, float)
QLX_OBJECT_PROPERTY(Double, double)

#undef QLX_OBJECT_PROPERTY
#undef QLX_OBJECT_GETTER

// Public functions (the rest of the typed family stands with its rows above)

char *QlxGetObjProp(QlxObject *object, const char *key, uint8_t *found) {
  return qlxLocked<qlxIntlGetObjProp>(object, key, found);
}

uint8_t QlxSetObjProp(QlxObject *object, const char *key, const char *value) {
  return qlxLocked<qlxIntlSetObjProp>(object, key, value);
}

uint8_t QlxSetObjPropBool(QlxObject *object, const char *key, uint8_t value) {
  return qlxLocked<qlxIntlSetObjPropBool>(object, key, value);
}

uint8_t QlxLogMgrApplyCfg(QlxObject *object, const char *name) {
  return qlxLocked<qlxIntlLogMgrApplyCfg>(object, name);
}
