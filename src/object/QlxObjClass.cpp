#include "QlxObjClass.h"

#include <array>

#include <qlx/class/containers.h>
#include <qlx/class/message.h>
#include <qlx/memory.h>

#include "util/CxOwned.h"

static constexpr int32_t kKinds = 4;  // Logger, Filter, Handler, Formatter: consecutive numbers

static StringToObjClassMap *gClasses;             // owns the records
static std::array<StringGroup *, kKinds> gNames;  // class names by kind

// ---- Records

void qlxFreeObjClass(ObjClass *objClass) {
  if (!objClass) return;
  OslMemoryFree(const_cast<char *>(objClass->name));
  qlxIntlFreeI18Msg(objClass->description);
  OslMemoryFree(objClass);
}

ObjClass *qlxReturnObjClass(ObjClass *objClass) {
  return objClass;
}

void qlxIgnoreObjClass(void) {}

ObjClass *qlxInitObjectClass(const char *className, int32_t kind, I18Msg *description,
                             fAllocVars allocVars, fFreeVars freeVars, fCfgChange cfgChange) {
  if (!className || qlxToolkitGetClassDef(className)) return nullptr;
  Owned<ObjClass, qlxFreeObjClass> objClass{
      static_cast<ObjClass *>(OslMemoryCalloc(1, sizeof(ObjClass)))};
  if (!objClass) return nullptr;
  objClass->kind = kind;
  objClass->name = OslStringDup(className);
  objClass->description = qlxIntlCopyI18Msg(description);
  if (!objClass->name || (description && !objClass->description)) return nullptr;
  objClass->fAllocVars = allocVars;
  objClass->fFreeVars = freeVars;
  objClass->fCfgChange = cfgChange;
  return objClass.release();
}

// ---- The registry

bool qlxMakeClassRegistry(void) {
  if (gClasses) return false;
  gClasses = qlxIntlAllocStringToObjClassMap();
  if (!gClasses) return false;
  for (StringGroup *&names : gNames) names = qlxIntlAllocStringGroup();
  return true;
}

static StringGroup *namesOfKind(int32_t kind) {
  return kind >= Logger && kind < Logger + kKinds ? gNames[static_cast<size_t>(kind - Logger)]
                                                  : nullptr;
}

// A record may stand there under several names.
static bool isListedFrom(const StringToObjClassMapNode *node, const ObjClass *objClass) {
  while (node && node->value != objClass) node = node->next;
  return node;
}

bool qlxIsRegisteredClass(const ObjClass *objClass) {
  return isListedFrom(qlxIntlStringToObjClassMapIterator(gClasses), objClass);
}

void qlxRegisterClass(const char *className, ObjClass *objClass) {
  if (!qlxToolkitGetClassDef(className) &&
      qlxIntlStringToObjClassMapPut(gClasses, className, objClass)) {
    qlxIntlStringGroupAdd(namesOfKind(objClass->kind), className);
  } else if (!qlxIsRegisteredClass(objClass)) {
    qlxFreeObjClass(objClass);
  }
}

ObjClass *qlxToolkitGetClassDef(const char *className) {
  return qlxIntlStringToObjClassMapGet(gClasses, className);
}

StringGroupNode *qlxToolkitFetchClassnames(int32_t kind) {
  return qlxIntlStringGroupIterator(namesOfKind(kind));
}

void qlxFreeClassRegistry(void) {
  for (StringToObjClassMapNode *it = qlxIntlStringToObjClassMapIterator(gClasses); it;
       it = it->next) {
    if (!isListedFrom(it->next, it->value)) qlxFreeObjClass(it->value);
  }
  qlxIntlFreeStringToObjClassMap(gClasses);
  gClasses = nullptr;
  for (StringGroup *&names : gNames) {
    qlxIntlFreeStringGroup(names);
    names = nullptr;
  }
}
