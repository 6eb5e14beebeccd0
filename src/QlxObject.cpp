// Objects: found by name or made, configured, counted, destroyed. Properties and listeners have
// modules of their own.
#include "QlxObject.h"

#include <qlx/class/config.h>
#include <qlx/class/containers.h>
#include <qlx/class/handler.h>
#include <qlx/class/message.h>
#include <qlx/memory.h>
#include <qlx/object.h>

#include "object/QlxLocked.h"
#include "QlxLogManager.h"
#include "object/QlxInstances.h"
#include "object/QlxListeners.h"
#include "object/QlxOperation.h"

static constexpr const char *kDefaultFormatterName = "quill.defaultFormatter";
static constexpr const char *kDefaultFormatterClass = "qlx_basicformatter";

static ObjClass *configuredClass(const char *objectName) {
  const Owned<ObjCfg, qlxIntlReleaseObjCfg> cfg{qlxIntlLogMgrGetCfg(objectName)};
  const OwnedStr className{qlxIntlGetInheritedObjCfgProp(cfg.get(), "className", nullptr)};
  return qlxToolkitGetClassDef(className.get());
}

static void initKindFields(QlxObject *object) {
  switch (object->objClass->kind) {
    case Logger:
      storeLevel(object, DEBUG_MIN);
      break;
    case Handler:  // every handler starts with the shared default formatter, made on first need
      object->kind2.formatter = qlxIntlGetObject(kDefaultFormatterName, kDefaultFormatterClass);
      break;
    default:  // a filter's level is 0, everything else null
      break;
  }
}

// Frees an object that was never registered.
static void discardObject(QlxObject *object) {
  qlxIntlAcquireObject(object);
  qlxRetireObject(object);
  OslMemoryFree(object);
}

static QlxObject *makeObject(const char *objectName, ObjClass *objClass) {
  auto *object = static_cast<QlxObject *>(OslMemoryCalloc(1, sizeof(QlxObject)));
  if (!object) return nullptr;
  object->objClass = objClass;
  object->name = OslStringDup(objectName);
  storeEnabled(object, 1);
  initKindFields(object);
  if (objClass->fAllocVars) object->vars = qlxCall({objClass, "fAllocVars"}, objClass->fAllocVars);

  // The class's own operations may have made an object of this name meanwhile: that one stays.
  const ObjectRef other{qlxToolkitGetObjInstance(objectName)};
  if (!other) qlxToolkitAddObjInstance(object->name, object);
  if (object->refCount == 1) return object;
  discardObject(object);
  return nullptr;
}

QlxObject *qlxIntlGetObject(const char *objectName, const char *className) {
  if (!objectName) return nullptr;
  if (ObjectRef existing{qlxToolkitGetObjInstance(objectName)}) {
    const ObjClass *objClass = existing->objClass;
    const bool fits = objClass && (!className || OslStringCmp(objClass->name, className) == 0);
    return fits ? existing.release() : nullptr;
  }

  ObjClass *objClass = className ? qlxToolkitGetClassDef(className) : configuredClass(objectName);
  if (!objClass) return nullptr;
  QlxObject *object = makeObject(objectName, objClass);
  if (!object) return nullptr;
  // The caller's reference comes first: a "listenerNames" that names the object itself takes and
  // gives back references while the configuration is applied.
  qlxIntlAcquireObject(object);
  qlxIntlLogMgrApplyCfg(object, objectName);
  return object;
}

QlxObject *qlxIntlAcquireObject(QlxObject *object) {
  if (object) ++object->refCount;
  return object;
}

void qlxCloseHandlerOnce(QlxObject *object) {
  if (!isKind(object, Handler) || (object->marks & kMarkClosed)) return;
  object->marks |= kMarkClosed;
  const ObjClass *objClass = object->objClass;
  if (objClass->op3.fClose) qlxCall({objClass, "fClose"}, objClass->op3.fClose, object);
}

void qlxFreeVars(const ObjClass *objClass, void *vars) {
  if (objClass->fFreeVars) qlxCall({objClass, "fFreeVars"}, objClass->fFreeVars, vars);
}

static void freeContents(QlxObject *contents) {
  qlxIntlFreeStringToStringMap(contents->props);
  qlxFreeListeners(contents);
  OslMemoryFree(contents->name);
  const ObjClass *objClass = contents->objClass;
  qlxFreeVars(objClass, contents->vars);
  if (objClass->kind == Handler) qlxIntlReleaseObject(contents->kind2.formatter);
  if (objClass->kind == Formatter) {
    OslMemoryFree(contents->kind1.separator);
    OslMemoryFree(contents->kind2.dateTimeFormat);
    OslMemoryFree(contents->kind3.locale);
  }
}

void qlxRetireObject(QlxObject *object) {
  if (!object->objClass) return;
  // Inert before anything goes: an operation of a class that runs meanwhile may come back to it.
  QlxObject contents = *object;
  object->objClass = nullptr;
  object->name = nullptr;
  object->props = nullptr;
  object->vars = nullptr;
  // Also a log call without the lock may look at the level here, by a handle that outlives closing.
  std::atomic_ref(object->kind1.word).store(0, std::memory_order_relaxed);
  object->kind2.word = object->kind3.word = 0;
  storeEnabled(object, 0);
  freeContents(&contents);
}

static void removeFromRegistry(QlxObject *object) {
  const ObjectRef registered{qlxToolkitGetObjInstance(object->name)};
  if (registered.get() == object) qlxToolkitRemObjInstance(object->name);
}

static void destroyObject(QlxObject *object) {
  object->marks |= kMarkDying;
  qlxIntlAcquireObject(object);  // an operation that takes and gives back one must not free it
  removeFromRegistry(object);
  qlxCloseHandlerOnce(object);
  qlxRetireObject(object);
  --object->refCount;
}

void qlxIntlReleaseObject(QlxObject *object) {
  if (!object) return;
  --object->refCount;
  // Deliberate: destroyed at one, since the registry's own reference keeps nothing alive. Only
  // while the toolkit closes it does.
  const uint32_t last = qlxToolkitIsClosing() ? 0 : 1;
  if (object->objClass && object->refCount == last && !(object->marks & kMarkDying)) {
    destroyObject(object);
  }
  if (!object->objClass && object->refCount == 0) OslMemoryFree(object);
}

char *qlxIntlGetObjectName(QlxObject *object) {
  return object ? OslStringDup(object->name) : nullptr;
}

UChar *qlxIntlGetObjectDesc(QlxObject *object) {
  if (!object || !object->objClass) return nullptr;
  return qlxIntlBindUI18Msg(object->objClass->description, nullptr);
}

uint8_t qlxIntlIsObjectEnabled(QlxObject *object) {
  return object ? loadEnabled(object) : 0;
}

void qlxIntlSetObjectEnabled(QlxObject *object, uint32_t flag) {
  if (object && object->objClass) storeEnabled(object, static_cast<uint8_t>(flag));
}

uint8_t qlxIntlIsLoggableByFilter(QlxObject *filter, Event *event, va_list *args) {
  if (!event || !isKind(filter, Filter) || !filter->objClass->op2.fIsLoggable) return 0;
  const ObjClass *objClass = filter->objClass;
  return qlxCall({objClass, "fIsLoggable"}, objClass->op2.fIsLoggable, filter, event, args);
}

uint8_t QlxAreObjectsEqual(QlxObject *a, QlxObject *b) {
  return a == b;
}

// Public functions

QlxObject *QlxGetObject(const char *objectName, const char *className) {
  return qlxLocked<qlxIntlGetObject>(objectName, className);
}

QlxObject *QlxAcquireObject(QlxObject *object) {
  return qlxLocked<qlxIntlAcquireObject>(object);
}

void QlxReleaseObject(QlxObject *object) {
  qlxLocked<qlxIntlReleaseObject>(object);
}

char *QlxGetObjectName(QlxObject *object) {
  return qlxLocked<qlxIntlGetObjectName>(object);
}

UChar *QlxGetObjectDesc(QlxObject *object) {
  return qlxLocked<qlxIntlGetObjectDesc>(object);
}

uint8_t QlxIsObjectEnabled(QlxObject *object) {
  return qlxLocked<qlxIntlIsObjectEnabled>(object);
}

void QlxSetObjectEnabled(QlxObject *object, uint32_t flag) {
  qlxLocked<qlxIntlSetObjectEnabled>(object, flag);
}

uint8_t QlxIsLoggableByFilter(QlxObject *filter, Event *event, va_list *args) {
  return qlxLocked<qlxIntlIsLoggableByFilter>(filter, event, args);
}
