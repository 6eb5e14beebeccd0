/**
 * @file
 * Message identifiers of events, for class operations. The API lock is held, except where a
 * function says that it needs none. A returned string is new; the caller frees it with
 * OslMemoryFree().
 */
#ifndef QLX_CLASS_MSGID_H
#define QLX_CLASS_MSGID_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return the identifier that the text starts with, or null; null for null. Needs no lock. */
QLX_API char *qlxPDXMLGetMessageID(const char *text);

/** @return the identifier that the text starts with, or null; null for null. Needs no lock. */
QLX_API char *qlxPDXMLUGetMessageID(const UChar *text);

/**
 * Makes sure that an event has a message identifier: when it has none, its message is bound and the
 * identifier that the text starts with is stored, "" when there is none. A null event is ignored.
 *
 * @param formatter  not used, may be null
 * @param args       the log call's arguments; null is an empty list
 */
QLX_API void qlxPDXMLUFormatterCacheMessageID(QlxObject *formatter, Event *event, va_list *args);

QLX_END_DECLS

#endif
