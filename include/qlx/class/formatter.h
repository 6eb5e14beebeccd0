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

/** The basic formatter's keys: "separator", "dateTimeFormat", "locale", the common ones, and "utc",
 *  which has no effect on an object of a host's class: its variables are the class's own. */
QLX_API void QlxBasicFormatterFCfgChange(QlxObject *formatter, const char *key);

/**
 * The event as one line: its time, source location, product properties and message, with the
 * formatter's separator after each but the message, and a line feed. Deliberate: the formatter's
 * locale is set on the event and stays there. What cannot be appended, for want of memory, is left
 * out of the line, and the event's status is {'p', ENOMEM} then. A message that cannot be bound is
 * left out too.
 *
 * @return the line; null for a null event, for an object that is no formatter or whose class has no
 *         fBindMsg, and when there was no memory for any of it
 */
QLX_API UChar *QlxBasicUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args);

/** @return null */
QLX_API char *QlxBasicFormatterFGetHeader(QlxObject *formatter);

/** @return null */
QLX_API char *QlxBasicFormatterFGetTrailer(QlxObject *formatter);

/**
 * Formats a time in the default locale, in the default zone or with "utc" in UTC, by the
 * formatter's "dateTimeFormat", or, when the formatter is null or has none, as "yyyy-MM-dd
 * HH:mm:ss.SSS" with the offset from UTC. Takes no lock, and needs none while no other thread may
 * change the formatter.
 *
 * Deliberate: the minutes of the offset keep their sign and only the hours decide the sign before
 * it: -330 minutes are "-05:-30", -30 are "+00:-30".
 *
 * @param time  milliseconds since 1970-01-01 UTC
 * @return the text, empty for an empty pattern; null when memory ran out, and when ICU has no date
 *         format for the default locale (as for "de@numbers=nonsense")
 */
QLX_API UChar *QlxBasicUFormatterFormatDate(QlxObject *formatter, double time);

/*
 * The XML formatter: each event as a Message or a Trace element. Deliberate: nothing is escaped, in
 * attributes, content and character data.
 */
/** @return variables with every flag clear, the preamble due; null when memory ran out */
QLX_API void *QlxPDXMLFormatterFAllocVars(void);
/** Null is ignored. */
QLX_API void QlxPDXMLFormatterFFreeVars(void *vars);
/** The six flags, and the basic formatter's keys. Without variables the flags have no effect. */
QLX_API void QlxPDXMLFormatterFCfgChange(QlxObject *formatter, const char *key);
/** @return the record; null for a null event, for a formatter without variables, of another kind,
 *          or of another class of the library, and when memory ran out */
QLX_API UChar *QlxPDXMLUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args);
/** The next record has the preamble of single elements before it. @return null */
QLX_API char *QlxPDXMLFormatterFGetHeader(QlxObject *formatter);
/** @return null */
QLX_API char *QlxPDXMLFormatterFGetTrailer(QlxObject *formatter);

/**
 * The trace formatter's line: a record separator (U+001E), then time, level, host up to its first
 * dot, process and thread, source, message identifier and text, with " - " between them also where
 * a field is empty, and a line feed.
 *
 * Deliberate: the class has no fCfgChange, so no key reaches its objects, not even "logging". The
 * date pattern and the locale of a formatter that has them all the same do count.
 *
 * @return the line; null when the formatter or the event is null, for an object that is no
 * formatter, and when memory ran out
 */
QLX_API UChar *QlxVexTraceUFormatterFFormat(QlxObject *formatter, Event *event, va_list *args);

QLX_END_DECLS

#endif
