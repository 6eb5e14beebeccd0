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

/*
 * The console handler: writes to the standard output stream, each text with a line feed of its own.
 * The first event, or an explicit open, writes the formatter's header; closing writes its trailer.
 * A disabled handler does nothing with an event, and a null one is ignored.
 */
QLX_API void *QlxConsoleHandlerFAllocVars(void);
QLX_API void QlxConsoleHandlerFFreeVars(void *vars);
QLX_API void QlxConsoleUHandlerFProcess(QlxObject *handler, Event *event, va_list *args);
QLX_API void QlxConsoleHandlerFOpen(QlxObject *handler);
QLX_API void QlxConsoleHandlerFClose(QlxObject *handler);

/*
 * The file handler: writes to a file that rolls over by size, with the formatter's header at every
 * opening and its trailer at every closing. What fails goes to QlxReportPlatformErr(); what fails
 * while an event is processed is stored in the event's status too. A null event is ignored.
 */
/** @return variables with the initial settings; null when memory ran out */
QLX_API void *QlxFileHandlerFAllocVars(void);
/** Closes an open file, without the trailer, and frees the variables. Null is ignored. */
QLX_API void QlxFileHandlerFFreeVars(void *vars);
/** The file handler's keys, and every handler's. All but "logInternalErrs", and a permission
 *  without a value, close the file first; the next event opens it under the new setting. */
QLX_API void QlxFileHandlerFCfgChange(QlxObject *handler, const char *key);
/** Opens as QlxFileHandlerFOpenWithErr() does, writes, and passes the event on, whether or not it
 *  could be written. A disabled handler does nothing. */
QLX_API void QlxFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args);
/** QlxFileHandlerFOpenWithErr() without its answer. */
QLX_API void QlxFileHandlerFOpen(QlxObject *handler);
/**
 * Opens the active file, or keeps it open when it is still there and not full; rolls over a full
 * one. A full one that cannot be moved stays open.
 *
 * @return success also when there is nothing to open: no variables, or no file name; 36 when the
 * name of a generation would have more than 256 bytes
 */
QLX_API CxStatus QlxFileHandlerFOpenWithErr(QlxObject *handler);
/** Writes the trailer and closes; a closed file stays as it is. */
QLX_API void QlxFileHandlerFClose(QlxObject *handler);

/*
 * The multi-process file handler: a file handler whose file several processes append to, each under
 * the semaphore of "MPFileSemKey". It has the file handler's variables and keys. The file never
 * changes its name: at rollover it is copied to generation 1 and truncated.
 */
/** Opens the file, and writes under the semaphore. Deliberate: while the file cannot be opened the
 *  event is not passed on; when the semaphore fails it is, but its record is dropped. A disabled
 *  handler does nothing, and a null event is ignored. */
QLX_API void QlxMultiProcFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args);
/** QlxMultiProcFileHandlerFOpenWithErr() without its answer. */
QLX_API void QlxMultiProcFileHandlerFOpen(QlxObject *handler);
/**
 * Makes or finds the semaphore and opens the active file to append, whatever "appending" says. No
 * header, no look at the size.
 *
 * @return success also when there is nothing to open, and, with the file left closed, when the
 *         semaphore cannot be had; that failure is reported
 */
QLX_API CxStatus QlxMultiProcFileHandlerFOpenWithErr(QlxObject *handler);
/** Closes the file without a trailer. Only a configuration change writes one. */
QLX_API void QlxMultiProcFileHandlerFClose(QlxObject *handler);

/** What the file handlers of this process could not do so far. */
typedef struct QlxHandlerProblems {
  uint64_t recordsLost;     /* each is also the status of its event */
  uint64_t rolloversFailed; /* steps of rollovers; the record was written all the same, or is
                               counted above too */
  CxStatus rollover;        /* of the last of these */
  char rolloverFile[257];   /* whose rollover it was */
} QlxHandlerProblems;

/** Copies the counts. The statuses of log calls do not tell the two apart. Null is ignored. */
QLX_API void qlxIntlGetHandlerProblems(QlxHandlerProblems *problems);

QLX_END_DECLS

#endif
