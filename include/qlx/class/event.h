/**
 * @file
 * More of an event, for class operations. Null rules and ownership as in qlx/event.h; no lock.
 */
#ifndef QLX_CLASS_EVENT_H
#define QLX_CLASS_EVENT_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return the event's property map, owned by it and made on first use; null for null and when
 *          memory ran out */
QLX_API StringToStringMap *qlxFetchEventPropMap(Event *event);

/** @return a copy of the locale that the event binds in, or null */
QLX_API char *qlxGetEventLocale(Event *event);

/** Formatters set their locale here before they bind; what formats the event later sees it. Null
 *  takes it away, and so does a lack of memory. */
QLX_API void qlxSetEventLocale(Event *event, const char *locale);

QLX_END_DECLS

#endif
