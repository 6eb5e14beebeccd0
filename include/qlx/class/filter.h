/**
 * @file
 * Operations of the filters, for class operations of hosts' own filters. The API lock is held.
 */
#ifndef QLX_CLASS_FILTER_H
#define QLX_CLASS_FILTER_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** Asks the class's fIsLoggable and, when it says exactly 1, calls the class's fLog. */
QLX_API void QlxBasicFilterFProcess(QlxObject *filter, Event *event, va_list *args);

/** The level filter's keys: "level" (a level word or number), and the common ones. */
QLX_API void QlxLevelFilterFCfgChange(QlxObject *filter, const char *key);

/** 1 when the threshold is 0 (none), when the event has no level, or when it reaches the threshold.
 *  `args` is not used. */
QLX_API uint8_t QlxLevelFilterFIsLoggable(QlxObject *filter, Event *event, va_list *args);

QLX_END_DECLS

#endif
