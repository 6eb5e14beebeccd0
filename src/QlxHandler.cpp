// What every handler shares: its formatter, the way to the formatter's operations, the key that
// names the formatter, and the operations of a class that brings none.
#include <qlx/class/handler.h>

#include <qlx/class/object.h>
#include <qlx/handler.h>

#include "object/QlxConfigKeys.h"
#include "object/QlxLocked.h"
#include "QlxObject.h"
#include "object/QlxOperation.h"

QlxObject *qlxIntlHandlerGetFormatter(QlxObject *handler) {
  return isKind(handler, Handler) ? qlxIntlAcquireObject(handler->kind2.formatter) : nullptr;
}

void qlxIntlHandlerSetFormatter(QlxObject *handler, QlxObject *formatter) {
  if (!isKind(handler, Handler) || (formatter && !formatter->objClass)) return;
  QlxObject *old = handler->kind2.formatter;
  handler->kind2.formatter = qlxIntlAcquireObject(formatter);  // first: it may be the old one
  qlxIntlReleaseObject(old);
}

// ---- The formatter's operations. One of them may give the handler another formatter: the one that
// it belongs to is kept until it is done.

// The class of the handler's formatter, or null.
static const ObjClass *formatterClass(const QlxObject *handler) {
  if (!isKind(handler, Handler) || !isKind(handler->kind2.formatter, Formatter)) return nullptr;
  return handler->kind2.formatter->objClass;
}

char *qlxIntlHandlerGetFmtHeader(QlxObject *handler) {
  const ObjClass *formatter = formatterClass(handler);
  if (!formatter || !formatter->op2.fGetHeader) return nullptr;
  const KeptObject kept{handler->kind2.formatter};
  return qlxCall({formatter, "fGetHeader"}, formatter->op2.fGetHeader, handler->kind2.formatter);
}

char *qlxIntlHandlerGetFmtTrailer(QlxObject *handler) {
  const ObjClass *formatter = formatterClass(handler);
  if (!formatter || !formatter->op3.fGetTrailer) return nullptr;
  const KeptObject kept{handler->kind2.formatter};
  return qlxCall({formatter, "fGetTrailer"}, formatter->op3.fGetTrailer, handler->kind2.formatter);
}

UChar *qlxIntlUHandlerDoFmt(QlxObject *handler, Event *event, va_list *args) {
  const ObjClass *formatter = formatterClass(handler);
  if (!formatter || !formatter->op1.fFormat) return nullptr;
  const KeptObject kept{handler->kind2.formatter};
  return qlxCall({formatter, "fFormat"}, formatter->op1.fFormat, handler->kind2.formatter, event,
                 args);
}

// Deliberate: a name that no object has leaves the handler without a formatter.
static void applyFormatterName(QlxObject *handler, const char *key) {
  const OwnedStr name{qlxIntlGetObjProp(handler, key, nullptr)};
  if (!name) return;
  const ObjectRef formatter{qlxIntlGetObject(name.get(), nullptr)};
  qlxIntlHandlerSetFormatter(handler, formatter.get());
}

static constexpr ConfigKey kHandlerKeys[] = {
    {"formatterName", applyFormatterName},
};

void QlxBasicHandlerFCfgChange(QlxObject *handler, const char *key) {
  if (!handler || !key) return;
  if (!qlxApplyConfigKey(kHandlerKeys, handler, key)) QlxBasicObjectFCfgChange(handler, key);
}

void QlxBasicHandlerFProcess(QlxObject *, Event *, va_list *) {}

void QlxBasicHandlerFOpen(QlxObject *) {}

void QlxBasicHandlerFClose(QlxObject *) {}

// Public functions

QlxObject *QlxHandlerGetFormatter(QlxObject *handler) {
  return qlxLocked<qlxIntlHandlerGetFormatter>(handler);
}

void QlxHandlerSetFormatter(QlxObject *handler, QlxObject *formatter) {
  qlxLocked<qlxIntlHandlerSetFormatter>(handler, formatter);
}

char *QlxHandlerGetFmtHeader(QlxObject *handler) {
  return qlxLocked<qlxIntlHandlerGetFmtHeader>(handler);
}

char *QlxHandlerGetFmtTrailer(QlxObject *handler) {
  return qlxLocked<qlxIntlHandlerGetFmtTrailer>(handler);
}

UChar *QlxUHandlerDoFmt(QlxObject *handler, Event *event, va_list *args) {
  return qlxLocked<qlxIntlUHandlerDoFmt>(handler, event, args);
}
