// Registering classes: those of the library, before any other, and those of hosts. A kind operation
// that a host leaves out is filled with the library's default here and nowhere else.
#include "QlxClasses.h"

#include <qlx/class/filter.h>
#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>
#include <qlx/class/message.h>
#include <qlx/object.h>

#include "QlxLocked.h"
#include "QlxObjClass.h"

// By kind.
static constexpr ObjClass kDefaults[] = {
    {.kind = Logger, .op1 = {.fLog = QlxBasicObjectFLog}},
    {.kind = Filter,
     .op1 = {.fProcess = QlxBasicFilterFProcess},
     .op2 = {.fIsLoggable = QlxLevelFilterFIsLoggable},
     .op3 = {.fLog = QlxBasicObjectFLog}},
    {.kind = Handler,
     .op1 = {.fProcess = QlxBasicHandlerFProcess},
     .op2 = {.fOpen = QlxBasicHandlerFOpen},
     .op3 = {.fClose = QlxBasicHandlerFClose}},
    {.kind = Formatter,
     .op1 = {.fFormat = QlxBasicUFormatterFFormat},
     .op2 = {.fGetHeader = QlxBasicFormatterFGetHeader},
     .op3 = {.fGetTrailer = QlxBasicFormatterFGetTrailer},
     .op4 = {.fBindMsg = qlxIntlBindUI18Msg}},
};

// Registers a copy of the record.
static void addClass(const ObjClass &wanted) {
  ObjClass *objClass = qlxInitObjectClass(wanted.name, wanted.kind, wanted.description,
                                          wanted.fAllocVars, wanted.fFreeVars, wanted.fCfgChange);
  if (!objClass) return;
  const ObjClass &defaults = kDefaults[wanted.kind - Logger];
  objClass->op1 = wanted.op1.fLog ? wanted.op1 : defaults.op1;
  objClass->op2 = wanted.op2.fOpen ? wanted.op2 : defaults.op2;
  objClass->op3 = wanted.op3.fLog ? wanted.op3 : defaults.op3;
  objClass->op4 = wanted.op4.fBindMsg ? wanted.op4 : defaults.op4;
  objClass->own = wanted.own;
  qlxToolkitInitObjClasses();
  qlxRegisterClass(wanted.name, objClass);
}

void qlxToolkitInitObjClasses(void) {
  if (!qlxMakeClassRegistry()) return;
#define QLX_ADD_CLASS(record) addClass(record);
  QLX_BUILTIN_CLASSES(QLX_ADD_CLASS)
#undef QLX_ADD_CLASS
}

// The first of a name stays; it may be a built-in class that is registered just now. A record that
// is new here is a host's, also when it began as a copy of one of the library's.
void qlxToolkitAddClassDef(const char *className, ObjClass *objClass) {
  if (!objClass) return;
  qlxToolkitInitObjClasses();
  if (!qlxIsRegisteredClass(objClass)) objClass->own = nullptr;
  qlxRegisterClass(className, objClass);
}

void qlxIntlAddLoggerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                           fFreeVars freeVars, fCfgChange cfgChange, fLog log) {
  addClass({.kind = Logger,
            .name = className,
            .description = description,
            .op1 = {.fLog = log},
            .fAllocVars = allocVars,
            .fFreeVars = freeVars,
            .fCfgChange = cfgChange});
}

void qlxIntlAddFilterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                           fFreeVars freeVars, fCfgChange cfgChange, fProcess process,
                           fIsLoggable isLoggable, fLog log) {
  addClass({.kind = Filter,
            .name = className,
            .description = description,
            .op1 = {.fProcess = process},
            .op2 = {.fIsLoggable = isLoggable},
            .op3 = {.fLog = log},
            .fAllocVars = allocVars,
            .fFreeVars = freeVars,
            .fCfgChange = cfgChange});
}

void qlxIntlAddHandlerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                            fFreeVars freeVars, fCfgChange cfgChange, fProcess process, fOpen open,
                            fClose close) {
  addClass({.kind = Handler,
            .name = className,
            .description = description,
            .op1 = {.fProcess = process},
            .op2 = {.fOpen = open},
            .op3 = {.fClose = close},
            .fAllocVars = allocVars,
            .fFreeVars = freeVars,
            .fCfgChange = cfgChange});
}

void qlxIntlAddUFormatterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                               fFreeVars freeVars, fCfgChange cfgChange, fFormat format,
                               fGetHeader getHeader, fGetTrailer getTrailer, fBindMsg bindMsg) {
  addClass({.kind = Formatter,
            .name = className,
            .description = description,
            .op1 = {.fFormat = format},
            .op2 = {.fGetHeader = getHeader},
            .op3 = {.fGetTrailer = getTrailer},
            .op4 = {.fBindMsg = bindMsg},
            .fAllocVars = allocVars,
            .fFreeVars = freeVars,
            .fCfgChange = cfgChange});
}

StringGroupNode *qlxIntlGetLoggerClasses(void) {
  return qlxToolkitFetchClassnames(Logger);
}
StringGroupNode *qlxIntlGetFilterClasses(void) {
  return qlxToolkitFetchClassnames(Filter);
}
StringGroupNode *qlxIntlGetHandlerClasses(void) {
  return qlxToolkitFetchClassnames(Handler);
}
StringGroupNode *qlxIntlGetFormatterClasses(void) {
  return qlxToolkitFetchClassnames(Formatter);
}

// Public functions

void QlxAddLoggerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                       fFreeVars freeVars, fCfgChange cfgChange, fLog log) {
  qlxLocked<qlxIntlAddLoggerClass>(className, description, allocVars, freeVars, cfgChange, log);
}

void QlxAddFilterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                       fFreeVars freeVars, fCfgChange cfgChange, fProcess process,
                       fIsLoggable isLoggable, fLog log) {
  qlxLocked<qlxIntlAddFilterClass>(className, description, allocVars, freeVars, cfgChange, process,
                                   isLoggable, log);
}

void QlxAddHandlerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                        fFreeVars freeVars, fCfgChange cfgChange, fProcess process, fOpen open,
                        fClose close) {
  qlxLocked<qlxIntlAddHandlerClass>(className, description, allocVars, freeVars, cfgChange, process,
                                    open, close);
}

void QlxAddUFormatterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                           fFreeVars freeVars, fCfgChange cfgChange, fFormat format,
                           fGetHeader getHeader, fGetTrailer getTrailer, fBindMsg bindMsg) {
  qlxLocked<qlxIntlAddUFormatterClass>(className, description, allocVars, freeVars, cfgChange,
                                       format, getHeader, getTrailer, bindMsg);
}

StringGroupNode *QlxGetLoggerClasses(void) {
  return qlxLocked<qlxIntlGetLoggerClasses>();
}
StringGroupNode *QlxGetFilterClasses(void) {
  return qlxLocked<qlxIntlGetFilterClasses>();
}
StringGroupNode *QlxGetHandlerClasses(void) {
  return qlxLocked<qlxIntlGetHandlerClasses>();
}
StringGroupNode *QlxGetFormatterClasses(void) {
  return qlxLocked<qlxIntlGetFormatterClasses>();
}
