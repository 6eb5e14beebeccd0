/**
 * @file
 * Twins of qlx/handler.h and the operations of the built-in handlers, for class operations of
 * hosts' own handlers. The API lock is held; null handlers and handlers without variables are
 * ignored.
 */
#ifndef QLX_CLASS_HANDLER_H
#define QLX_CLASS_HANDLER_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

QLX_API QlxObject *qlxIntlHandlerGetFormatter(QlxObject *handler);
QLX_API void qlxIntlHandlerSetFormatter(QlxObject *handler, QlxObject *formatter);
QLX_API char *qlxIntlHandlerGetFmtHeader(QlxObject *handler);
QLX_API char *qlxIntlHandlerGetFmtTrailer(QlxObject *handler);
QLX_API UChar *qlxIntlUHandlerDoFmt(QlxObject *handler, Event *event, va_list *args);

/** Every handler's keys: "formatterName", and the common ones. */
QLX_API void QlxBasicHandlerFCfgChange(QlxObject *handler, const char *key);

/* What a handler class gets for an operation that it does not bring: these do nothing. */
QLX_API void QlxBasicHandlerFProcess(QlxObject *handler, Event *event, va_list *args);
QLX_API void QlxBasicHandlerFOpen(QlxObject *handler);
QLX_API void QlxBasicHandlerFClose(QlxObject *handler);

/* The console handler. */
QLX_API void *QlxConsoleHandlerFAllocVars(void);
QLX_API void QlxConsoleHandlerFFreeVars(void *vars);
QLX_API void QlxConsoleUHandlerFProcess(QlxObject *handler, Event *event, va_list *args);
QLX_API void QlxConsoleHandlerFOpen(QlxObject *handler);
QLX_API void QlxConsoleHandlerFClose(QlxObject *handler);

/* The file handler. */
QLX_API void *QlxFileHandlerFAllocVars(void);
QLX_API void QlxFileHandlerFFreeVars(void *vars);
QLX_API void QlxFileHandlerFCfgChange(QlxObject *handler, const char *key);
QLX_API void QlxFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args);
QLX_API void QlxFileHandlerFOpen(QlxObject *handler);
/** Opens the active file or keeps it open, rolling over when it is full. */
QLX_API CxStatus QlxFileHandlerFOpenWithErr(QlxObject *handler);
QLX_API void QlxFileHandlerFClose(QlxObject *handler);

QLX_END_DECLS

#endif
