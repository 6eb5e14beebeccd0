/**
 * @file
 * Operations of the formatters, for class operations of hosts' own formatters. The API lock is
 * held, except where a function says that it needs none. Returned text is new; the caller frees it
 * with OslMemoryFree().
 */
#ifndef QLX_CLASS_FORMATTER_H
#define QLX_CLASS_FORMATTER_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** The basic formatter's keys: "separator", "dateTimeFormat", "locale", and the common ones. */
QLX_API void QlxBasicFormatterFCfgChange(QlxObject *formatter, const char *key);

/** @return the event as one line of text; null for a null event or an object that is no formatter
 */
QLX_API UChar *QlxBasicUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args);

/** @return null */
QLX_API char *QlxBasicFormatterFGetHeader(QlxObject *formatter);

/** @return null */
QLX_API char *QlxBasicFormatterFGetTrailer(QlxObject *formatter);

/**
 * Formats a time in the default locale and zone by the formatter's "dateTimeFormat", or, when the
 * formatter is null or has none, as "yyyy-MM-dd HH:mm:ss.SSS" with the offset from UTC. Takes and
 * needs no lock.
 *
 * @param time  milliseconds since 1970-01-01 UTC
 */
QLX_API UChar *QlxBasicUFormatterFormatDate(QlxObject *formatter, double time);

QLX_END_DECLS

#endif
