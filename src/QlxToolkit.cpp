// The toolkit: the library's entry and exit.
#include "QlxToolkit.h"

#include <array>
#include <iterator>
#include <utility>

#include <qlx/class/containers.h>
#include <qlx/class/handler.h>
#include <qlx/class/object.h>
#include <qlx/toolkit.h>

#include "QlxLogManager.h"
#include "QlxObject.h"
#include "QlxReadProps.h"
#include "object/QlxInstances.h"
#include "object/QlxListeners.h"
#include "object/QlxLocked.h"
#include "object/QlxObjClass.h"
#include "util/CxHooks.h"
#include "util/CxThread.h"

static struct {
  uint8_t open;
  QlxObject *kept[3];  // references that open obtained: error logger, console, its formatter
} gToolkit;

// ---- Closing. Every object takes these steps, and none takes one before all have taken those
// above it: handlers are closed while their formatters still have variables to make a trailer from,
// and listeners go while everything that they look for is still registered.

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

template <uint8_t number>
static void takeStep(QlxObject *visited) {
  const ObjectRef object{qlxIntlAcquireObject(visited)};
  countClosingStep(object.get());
  kClosingSteps[number](object.get());
}

template <uint8_t... number>
static void takeAllSteps(std::integer_sequence<uint8_t, number...>) {
  // An object that a step has made starts with the first one.
  while ((qlxVisitInstances(number, takeStep<number>) || ...)) continue;
}

void qlxFreeInstancesMap(void) {
  qlxSetToolkitClosing(1);
  takeAllSteps(std::make_integer_sequence<uint8_t, std::size(kClosingSteps)>{});
  for (QlxObject *&kept : gToolkit.kept) {
    const ObjectRef reference{kept};
    kept = nullptr;
  }
  qlxFreeInstances();
  qlxSetToolkitClosing(0);
}

static void closeToolkit() {
  qlxCloseLogMgr();
  qlxFreeInstancesMap();
  qlxFreeClassRegistry();
  CxHooks::atClose();
  gToolkit.open = 0;
  qlxSetToolkitLogger(nullptr);
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
  qlxSetToolkitLogger(logger);
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
