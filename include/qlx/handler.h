/**
 * @file
 * A handler and its formatter.
 *
 * For every function here: it takes the API lock; an object that is null or no handler gives null
 * or nothing, and so does a lock that cannot be taken; returned text is new and the caller frees it
 * with OslMemoryFree().
 */
#ifndef QLX_HANDLER_H
#define QLX_HANDLER_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return the formatter with a reference for the caller, or null */
QLX_API QlxObject *QlxHandlerGetFormatter(QlxObject *handler);

/** Makes the handler hold a reference to another formatter; null leaves it without one, an inert
 *  handle changes nothing. */
QLX_API void QlxHandlerSetFormatter(QlxObject *handler, QlxObject *formatter);

/** @return what the formatter writes when a destination is opened, or null */
QLX_API char *QlxHandlerGetFmtHeader(QlxObject *handler);

/** @return what the formatter writes when a destination is closed, or null */
QLX_API char *QlxHandlerGetFmtTrailer(QlxObject *handler);

/** @return the formatter's text for an event, or null */
QLX_API UChar *QlxUHandlerDoFmt(QlxObject *handler, Event *event, va_list *args);

QLX_END_DECLS

#endif
