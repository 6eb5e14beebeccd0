// Class records: making, registering and freeing them. A kind operation that the host leaves out is
// filled with the library's default here and nowhere else.
#include "QlxObjClass.h"

#include <qlx/class/filter.h>
#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>
#include <qlx/class/message.h>
#include <qlx/memory.h>
#include <qlx/object.h>

#include "QlxLocked.h"
#include "util/CxOwned.h"

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

void qlxIntlAddLoggerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                           fFreeVars freeVars, fCfgChange cfgChange, fLog log) {
  ObjClass *objClass =
      qlxInitObjectClass(className, Logger, description, allocVars, freeVars, cfgChange);
  if (!objClass) return;
  objClass->op1.fLog = log ? log : QlxBasicObjectFLog;
  qlxToolkitAddClassDef(className, objClass);
}

void qlxIntlAddFilterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                           fFreeVars freeVars, fCfgChange cfgChange, fProcess process,
                           fIsLoggable isLoggable, fLog log) {
  ObjClass *objClass =
      qlxInitObjectClass(className, Filter, description, allocVars, freeVars, cfgChange);
  if (!objClass) return;
  objClass->op1.fProcess = process ? process : QlxBasicFilterFProcess;
  objClass->op2.fIsLoggable = isLoggable ? isLoggable : QlxLevelFilterFIsLoggable;
  objClass->op3.fLog = log ? log : QlxBasicObjectFLog;
  qlxToolkitAddClassDef(className, objClass);
}

void qlxIntlAddHandlerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                            fFreeVars freeVars, fCfgChange cfgChange, fProcess process, fOpen open,
                            fClose close) {
  ObjClass *objClass =
      qlxInitObjectClass(className, Handler, description, allocVars, freeVars, cfgChange);
  if (!objClass) return;
  objClass->op1.fProcess = process ? process : QlxBasicHandlerFProcess;
  objClass->op2.fOpen = open ? open : QlxBasicHandlerFOpen;
  objClass->op3.fClose = close ? close : QlxBasicHandlerFClose;
  qlxToolkitAddClassDef(className, objClass);
}

void qlxIntlAddUFormatterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                               fFreeVars freeVars, fCfgChange cfgChange, fFormat format,
                               fGetHeader getHeader, fGetTrailer getTrailer, fBindMsg bindMsg) {
  ObjClass *objClass =
      qlxInitObjectClass(className, Formatter, description, allocVars, freeVars, cfgChange);
  if (!objClass) return;
  objClass->op1.fFormat = format ? format : QlxBasicUFormatterFFormat;
  objClass->op2.fGetHeader = getHeader ? getHeader : QlxBasicFormatterFGetHeader;
  objClass->op3.fGetTrailer = getTrailer ? getTrailer : QlxBasicFormatterFGetTrailer;
  objClass->op4.fBindMsg = bindMsg ? bindMsg : qlxIntlBindUI18Msg;
  qlxToolkitAddClassDef(className, objClass);
}

void qlxAddBuiltinClass(const ObjClass &c) {
  switch (c.kind) {
    case Logger:
      return qlxIntlAddLoggerClass(c.name, c.description, c.fAllocVars, c.fFreeVars, c.fCfgChange,
                                   c.op1.fLog);
    case Filter:
      return qlxIntlAddFilterClass(c.name, c.description, c.fAllocVars, c.fFreeVars, c.fCfgChange,
                                   c.op1.fProcess, c.op2.fIsLoggable, c.op3.fLog);
    case Handler:
      return qlxIntlAddHandlerClass(c.name, c.description, c.fAllocVars, c.fFreeVars, c.fCfgChange,
                                    c.op1.fProcess, c.op2.fOpen, c.op3.fClose);
    case Formatter:
      return qlxIntlAddUFormatterClass(c.name, c.description, c.fAllocVars, c.fFreeVars,
                                       c.fCfgChange, c.op1.fFormat, c.op2.fGetHeader,
                                       c.op3.fGetTrailer, c.op4.fBindMsg);
  }
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
