// The toolkit: the library's entry and exit, and its three registries: classes, class names by
// kind, and named objects.
#include "QlxToolkit.h"

#include <array>

#include <qlx/class/containers.h>
#include <qlx/class/handler.h>
#include <qlx/toolkit.h>

#include "QlxClasses.h"
#include "QlxHeldFormats.h"
#include "QlxLocked.h"
#include "QlxLogManager.h"
#include "QlxObjClass.h"
#include "QlxObject.h"
#include "QlxReadProps.h"

static constexpr int32_t kKinds = 4;  // Logger, Filter, Handler, Formatter: consecutive numbers

// In the order of registration.
static constexpr const ObjClass *kBuiltinClasses[] = {
    &qlxBasicLoggerClass, &qlxLevelFilterClass,    &qlxConsoleHandlerClass,
    &qlxFileHandlerClass, &qlxBasicFormatterClass,
};

static struct {
  uint8_t open;
  QlxObject *logger;   // one of `kept`; hidden while the toolkit is closed
  QlxObject *kept[3];  // references that open obtained: error logger, console, its formatter
  StringToObjClassMap *classes;             // owns the records
  std::array<StringGroup *, kKinds> names;  // class names by kind
  StringToObjMap *instances;                // one reference to each object
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

void qlxToolkitAddClassDef(const char *className, ObjClass *objClass) {
  if (!objClass) return;
  qlxToolkitInitObjClasses();
  if (!qlxIntlStringToObjClassMapPut(gToolkit.classes, className, objClass)) {
    return qlxFreeObjClass(objClass);
  }
  qlxIntlStringGroupAdd(namesOfKind(objClass->kind), className);
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
    qlxFreeObjClass(it->value);
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
  qlxIntlStringToObjMapRem(gToolkit.instances, objectName);
}

QlxObject *qlxToolkitLogger(void) {
  return gToolkit.open ? gToolkit.logger : nullptr;
}

// ---- Closing

template <typename Visit>
static void forEachInstance(Visit visit) {
  for (StringToObjMapNode *it = qlxIntlStringToObjMapIterator(gToolkit.instances); it;
       it = it->next) {
    visit(it->value);
  }
}

// Takes a reference to every object that has none of the closing toolkit's yet, so that nothing is
// destroyed, and no registry entry goes, while the objects are taken apart. False: nothing was new.
static bool keepInstances() {
  bool anyNew = false;
  forEachInstance([&](QlxObject *object) {
    if (object->marks & kMarkKept) return;
    object->marks |= kMarkKept;
    qlxIntlAcquireObject(object);
    anyNew = true;
  });
  return anyNew;
}

static void freeVariables(QlxObject *object) {
  if (void *vars = object->vars; vars && object->objClass->fFreeVars) {
    object->vars = nullptr;
    object->objClass->fFreeVars(vars);
  }
  if (object->objClass->kind == Handler) {
    const ObjectRef formatter{object->kind2.formatter};
    object->kind2.formatter = nullptr;
  }
}

void qlxFreeInstancesMap(void) {
  // Handlers are closed first, while their formatters still have variables to make a trailer from.
  // What a class's operation makes meanwhile gets its turn too.
  while (keepInstances()) {
    forEachInstance(qlxCloseHandlerOnce);
    forEachInstance(freeVariables);
    forEachInstance(qlxFreeListeners);
  }
  for (QlxObject *&kept : gToolkit.kept) {
    const ObjectRef reference{kept};
    kept = nullptr;
  }
  forEachInstance([](QlxObject *object) {
    qlxRetireObject(object);
    qlxIntlReleaseObject(object);  // the reference of keepInstances()
  });
  qlxIntlFreeStringToObjMap(gToolkit.instances);
  gToolkit.instances = nullptr;
}

static void closeToolkit() {
  qlxCloseLogMgr();
  qlxFreeInstancesMap();
  freeClasses();
  qlxDropHeldFormats();
  gToolkit.open = 0;
}

// ---- Opening

// The default console handler, made with the default formatter when it is not there.
static QlxObject *fetchDefaultConsole() {
  static constexpr const char *kConsole = "quill.defaultConsole";
  if (QlxObject *existing = qlxToolkitGetObjInstance(kConsole)) return existing;
  QlxObject *console = qlxIntlGetObject(kConsole, "qlx_consolehandler");
  QlxObject *formatter = qlxIntlGetObject("quill.defaultFormatter", "qlx_basicformatter");
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

static uint8_t openToolkit(const char *configFileName, CxStatus *status) {
  if (gToolkit.open) return 1;
  qlxInitLogMgr();
  qlxToolkitInitObjClasses();
  CxStatus readStatus = {'-', 0};
  if (configFileName && !qlxDoReadProps(configFileName, nullptr, &readStatus)) {
    if (status) *status = readStatus;
    closeToolkit();
    return 0;
  }
  initToolkitLogger();
  gToolkit.open = 1;
  return 1;
}

// Public functions

uint8_t QlxOpenToolkit(const char *configFileName, CxStatus *status) {
  return qlxLocked<openToolkit>(configFileName, status);
}

void QlxCloseToolkit(void) {
  qlxLocked<closeToolkit>();
}
