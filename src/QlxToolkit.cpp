// The toolkit: the library's entry and exit, and its three registries: classes, class names by
// kind, and named objects.
#include "QlxToolkit.h"

#include <array>
#include <iterator>

#include <qlx/class/containers.h>
#include <qlx/class/handler.h>
#include <qlx/toolkit.h>

#include "object/QlxClasses.h"
#include "record/QlxFormatted.h"
#include "text/QlxFormatCache.h"
#include "object/QlxLocked.h"
#include "record/QlxLoggedEvent.h"
#include "QlxLogManager.h"
#include "object/QlxObjClass.h"
#include "QlxObject.h"
#include "QlxReadProps.h"
#include "util/CxThread.h"

static constexpr int32_t kKinds = 4;  // Logger, Filter, Handler, Formatter: consecutive numbers

// In the order of registration.
static constexpr const ObjClass *kBuiltinClasses[] = {
    &qlxBasicLoggerClass,          &qlxPDLoggerClass,       &qlxLevelFilterClass,
    &qlxMsgIdFilterClass,          &qlxConsoleHandlerClass, &qlxFileHandlerClass,
    &qlxMultiProcFileHandlerClass, &qlxBasicFormatterClass, &qlxPDXMLFormatterClass,
    &qlxVexTraceFormatterClass,
};

static struct {
  uint8_t open;
  QlxObject *logger;   // one of `kept`; hidden while the toolkit is closed
  QlxObject *kept[3];  // references that open obtained: error logger, console, its formatter
  StringToObjClassMap *classes;             // owns the records
  std::array<StringGroup *, kKinds> names;  // class names by kind
  StringToObjMap *instances;                // one reference to each object
  StringToObjMapNode *nextToClose;          // where the walk over `instances` goes on
  uint8_t closing;                          // 1 while the objects are taken apart
} gToolkit;

// ---- Classes

void qlxToolkitInitObjClasses(void) {
  if (gToolkit.classes) return;
  gToolkit.classes = qlxIntlAllocStringToObjClassMap();
  if (!gToolkit.classes) return;
  for (StringGroup *&names : gToolkit.names) names = qlxIntlAllocStringGroup();
  for (const ObjClass *builtin : kBuiltinClasses) qlxAddBuiltinClass(*builtin);
}

static StringGroup *namesOfKind(int32_t kind) {
  return kind >= Logger && kind < Logger + kKinds ? gToolkit.names[kind - Logger] : nullptr;
}

// A record may stand there under several names.
static bool isListedFrom(const StringToObjClassMapNode *node, const ObjClass *objClass) {
  while (node && node->value != objClass) node = node->next;
  return node;
}

void qlxToolkitAddClassDef(const char *className, ObjClass *objClass) {
  if (!objClass) return;
  qlxToolkitInitObjClasses();
  // The first of a name stays; it may be a built-in class that was registered just now.
  if (!qlxToolkitGetClassDef(className) &&
      qlxIntlStringToObjClassMapPut(gToolkit.classes, className, objClass)) {
    qlxIntlStringGroupAdd(namesOfKind(objClass->kind), className);
  } else if (!isListedFrom(qlxIntlStringToObjClassMapIterator(gToolkit.classes), objClass)) {
    qlxFreeObjClass(objClass);
  }
}

ObjClass *qlxToolkitGetClassDef(const char *className) {
  return qlxIntlStringToObjClassMapGet(gToolkit.classes, className);
}

StringGroupNode *qlxToolkitFetchClassnames(int32_t kind) {
  return qlxIntlStringGroupIterator(namesOfKind(kind));
}

static void freeClasses() {
  for (StringToObjClassMapNode *it = qlxIntlStringToObjClassMapIterator(gToolkit.classes); it;
       it = it->next) {
    if (!isListedFrom(it->next, it->value)) qlxFreeObjClass(it->value);
  }
  qlxIntlFreeStringToObjClassMap(gToolkit.classes);
  gToolkit.classes = nullptr;
  for (StringGroup *&names : gToolkit.names) {
    qlxIntlFreeStringGroup(names);
    names = nullptr;
  }
}

// ---- Instances

void qlxToolkitAddObjInstance(const char *objectName, QlxObject *object) {
  if (!objectName || !object) return;
  if (!gToolkit.instances) gToolkit.instances = qlxIntlAllocStringToObjMap();
  qlxIntlStringToObjMapPut(gToolkit.instances, objectName, object);
}

QlxObject *qlxToolkitGetObjInstance(const char *objectName) {
  return qlxIntlStringToObjMapGet(gToolkit.instances, objectName);
}

void qlxToolkitRemObjInstance(const char *objectName) {
  StringToObjMapNode *node = qlxIntlStringToObjMapGetNode(gToolkit.instances, objectName);
  if (!node) return;
  if (gToolkit.nextToClose == node) gToolkit.nextToClose = node->next;
  qlxIntlStringToObjMapRemNode(gToolkit.instances, node);
}

QlxObject *qlxToolkitLogger(void) {
  return gToolkit.open ? gToolkit.logger : nullptr;
}

// ---- Closing. Every object takes these steps, and none takes one before all have taken those
// above it: handlers are closed while their formatters still have variables to make a trailer from,
// and listeners go while everything that they look for is still registered.

uint8_t qlxToolkitIsClosing(void) {
  return gToolkit.closing;
}

static void freeVariables(QlxObject *object) {
  if (!object->objClass) return;
  if (void *vars = object->vars; vars && object->objClass->fFreeVars) {
    object->vars = nullptr;
    qlxFreeVars(object->objClass, vars);
  }
  if (object->objClass->kind == Handler) {
    const ObjectRef formatter{object->kind2.formatter};
    object->kind2.formatter = nullptr;
  }
}

static constexpr void (*kClosingSteps[])(QlxObject *) = {
    qlxCloseHandlerOnce,
    freeVariables,
    qlxFreeListeners,
    qlxRetireObject,
};

// Takes one step with every object whose next step it is. A class's operation that runs meanwhile
// may change the registry: who removes the next object moves the walk on. False: no object was
// there.
static bool takeStep(uint8_t step) {
  bool any = false;
  gToolkit.nextToClose = qlxIntlStringToObjMapIterator(gToolkit.instances);
  while (const StringToObjMapNode *node = gToolkit.nextToClose) {
    gToolkit.nextToClose = node->next;
    if (closingStepsTaken(node->value) != step) continue;
    const ObjectRef object{qlxIntlAcquireObject(node->value)};
    countClosingStep(object.get());
    kClosingSteps[step](object.get());
    any = true;
  }
  return any;
}

void qlxFreeInstancesMap(void) {
  gToolkit.closing = 1;
  // An object that a step has made starts with the first one.
  for (uint8_t step = 0; step < std::size(kClosingSteps);) step = takeStep(step) ? 0 : step + 1;
  for (QlxObject *&kept : gToolkit.kept) {
    const ObjectRef reference{kept};
    kept = nullptr;
  }
  qlxIntlFreeStringToObjMap(gToolkit.instances);
  gToolkit.instances = nullptr;
  gToolkit.closing = 0;
}

static void closeToolkit() {
  qlxCloseLogMgr();
  qlxFreeInstancesMap();
  freeClasses();
  qlxDropCachedEvent();
  qlxDropFormatted();
  qlxDropCachedFormats();
  gToolkit.open = 0;
}

// ---- Opening

// The default console handler, made with the default formatter when it is not there.
static QlxObject *fetchDefaultConsole() {
  static constexpr const char *kConsole = "quill.defaultConsole";
  static constexpr const char *kFormatter = "quill.defaultFormatter";
  if (QlxObject *existing = qlxToolkitGetObjInstance(kConsole)) return existing;
  QlxObject *console = qlxIntlGetObject(kConsole, "qlx_consolehandler");
  QlxObject *formatter = qlxToolkitGetObjInstance(kFormatter);
  if (!formatter) formatter = qlxIntlGetObject(kFormatter, "qlx_basicformatter");
  // Deliberate: also when the console's configuration named another formatter.
  qlxIntlHandlerSetFormatter(console, formatter);
  gToolkit.kept[2] = formatter;
  return console;
}

static void initToolkitLogger() {
  static constexpr const char *kErrorLogger = "quill.errorLogger";
  QlxObject *logger = qlxToolkitGetObjInstance(kErrorLogger);
  if (!logger) {
    logger = qlxIntlGetObject(kErrorLogger, "qlx_basiclogger");
    QlxObject *console = fetchDefaultConsole();
    qlxIntlAddListener(logger, console);
    gToolkit.kept[1] = console;
  }
  gToolkit.kept[0] = logger;
  gToolkit.logger = logger;
}

static uint8_t isOpen() {
  return gToolkit.open;
}

// Another thread may have opened it while this one read its file, which counts for nothing then.
static uint8_t openToolkit(const QlxPropsFile *config, CxStatus *status) {
  if (gToolkit.open) return 1;
  qlxInitLogMgr();
  qlxToolkitInitObjClasses();
  CxStatus readStatus = {'-', 0};
  if (config && !qlxDeliverProps(*config, nullptr, &readStatus)) {
    if (status) *status = readStatus;
    closeToolkit();
    return 0;
  }
  initToolkitLogger();
  gToolkit.open = 1;
  return 1;
}

// Public functions

// Reads the file between two looks, without the lock: it may be a pipe that somebody fills.
uint8_t QlxOpenToolkit(const char *configFileName, CxStatus *status) {
  if (qlxLocked<isOpen>()) return 1;
  if (!configFileName) return qlxLocked<openToolkit>(nullptr, status);
  const CxNoCancel untilItIsFreed;
  const QlxPropsFile config = qlxLoadProps(configFileName);
  return qlxLocked<openToolkit>(&config, status);
}

void QlxCloseToolkit(void) {
  qlxLocked<closeToolkit>();
}
