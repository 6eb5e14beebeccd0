#include "QlxInstances.h"

#include <qlx/class/containers.h>

#include "QlxObjectFields.h"

static struct {
  StringToObjMap *objects;          // one reference to each
  StringToObjMapNode *nextToClose;  // where the walk over them goes on
  uint8_t closing;                  // 1 while they are taken apart
  QlxObject *logger;
} gInstances;

void qlxToolkitAddObjInstance(const char *objectName, QlxObject *object) {
  if (!objectName || !object) return;
  if (!gInstances.objects) gInstances.objects = qlxIntlAllocStringToObjMap();
  qlxIntlStringToObjMapPut(gInstances.objects, objectName, object);
}

QlxObject *qlxToolkitGetObjInstance(const char *objectName) {
  return qlxIntlStringToObjMapGet(gInstances.objects, objectName);
}

void qlxToolkitRemObjInstance(const char *objectName) {
  StringToObjMapNode *node = qlxIntlStringToObjMapGetNode(gInstances.objects, objectName);
  if (!node) return;
  if (gInstances.nextToClose == node) gInstances.nextToClose = node->next;
  qlxIntlStringToObjMapRemNode(gInstances.objects, node);
}

void qlxSetToolkitLogger(QlxObject *logger) {
  gInstances.logger = logger;
}

QlxObject *qlxToolkitLogger(void) {
  return gInstances.logger;
}

// ---- The end

uint8_t qlxToolkitIsClosing(void) {
  return gInstances.closing;
}

void qlxSetToolkitClosing(uint8_t flag) {
  gInstances.closing = flag;
}

// Who removes the object that is next moves the walk on.
bool qlxVisitInstances(uint8_t stepsTaken, void (*visit)(QlxObject *object)) {
  bool any = false;
  gInstances.nextToClose = qlxIntlStringToObjMapIterator(gInstances.objects);
  while (const StringToObjMapNode *node = gInstances.nextToClose) {
    gInstances.nextToClose = node->next;
    if (closingStepsTaken(node->value) != stepsTaken) continue;
    visit(node->value);
    any = true;
  }
  return any;
}

void qlxFreeInstances(void) {
  qlxIntlFreeStringToObjMap(gInstances.objects);
  gInstances.objects = nullptr;
}
