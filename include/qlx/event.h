/**
 * @file
 * Events: one log request on its way through filters, handlers and formatters. An event lives for
 * its one log call; nobody keeps it.
 *
 * For every function here: it takes no lock, since events are used only by code that holds the API
 * lock or owns the event; a null event reads as an event without anything and is not written; a
 * returned `char *` or `UChar *` is new and the caller frees it with OslMemoryFree(); arguments are
 * borrowed and copied.
 */
#ifndef QLX_EVENT_H
#define QLX_EVENT_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * @param bundle, key, text  of the event's message; each may be null
 * @return a new event, stamped with the time, for QlxFreeEvent(); null when memory ran out. When it
 *         runs out for the message alone, an event without one, which binds to nothing
 */
QLX_API Event *QlxVaAllocUEvent(int32_t level, const char *bundle, const char *key,
                                const UChar *text);

/** Frees an event and all it owns; null is ignored. */
QLX_API void QlxFreeEvent(Event *event);

/** @return milliseconds since 1970-01-01 UTC; 0.0 for null */
QLX_API double QlxGetEventTime(Event *event);

/** @return the level; UNSPECIFIED (-9999) for null */
QLX_API int32_t QlxGetEventLevel(Event *event);

/** @return a copy of the message identifier, or null */
QLX_API char *QlxGetEventMessageId(Event *event);
/** Replaces the identifier; null takes it away, and so does a lack of memory. */
QLX_API void QlxSetEventMessageId(Event *event, const char *messageId);

/** @return 1 for a message, 0 for plain or debug text and for null. At first 1 for an event with a
 *          bundle; the log calls set it, to 1 for every call that takes a bundle, be it null */
QLX_API uint8_t QlxGetEventIsMessage(Event *event);
/** Any other value than 0 is a message too, and is handed out as it is. */
QLX_API void QlxSetEventIsMessage(Event *event, uint8_t flag);

/**
 * Binds the event's message in the event's locale, or the message's own when the event has none.
 * The event's locale becomes the message's and stays there.
 *
 * @param bind  a formatter's fBindMsg, normally qlxIntlBindUI18Msg(); null gives null
 * @param args  the log call's arguments; null is an empty list
 * @return the text or null
 */
QLX_API UChar *QlxBindEventUMsg(Event *event, fBindMsg bind, va_list *args);

/*
 * Named values. A getter's `found` (optional) becomes 1 when a value came back (for a typed getter:
 * was converted by the rules of qlx/props.h), otherwise 0. A setter replaces. When memory runs out
 * the key is not set, or stays without a value.
 */
QLX_API char *QlxGetEventProp(Event *event, const char *key, uint8_t *found);
QLX_API uint8_t QlxGetEventPropBool(Event *event, const char *key, uint8_t *found);
QLX_API int32_t QlxGetEventPropInt(Event *event, const char *key, uint8_t *found);
/** Deliberate: 32 bits wide here, the low half of the stored value; objects keep 64. */
QLX_API int32_t QlxGetEventPropLong(Event *event, const char *key, uint8_t *found);
QLX_API float QlxGetEventPropFloat(Event *event, const char *key, uint8_t *found);
QLX_API double QlxGetEventPropDouble(Event *event, const char *key, uint8_t *found);

/** @return 1 when the key is set, 0 for a null key and when memory ran out for it */
QLX_API uint8_t QlxSetEventProp(Event *event, const char *key, const char *value);
/** @return as QlxSetEventProp() */
QLX_API uint8_t QlxSetEventPropBool(Event *event, const char *key, uint8_t value);
QLX_API void QlxSetEventPropInt(Event *event, const char *key, int32_t value);
/** Deliberate: 32 bits wide here; objects keep 64. */
QLX_API void QlxSetEventPropLong(Event *event, const char *key, int32_t value);
QLX_API void QlxSetEventPropFloat(Event *event, const char *key, float value);
QLX_API void QlxSetEventPropDouble(Event *event, const char *key, double value);

QLX_END_DECLS

#endif
