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

/*
 * The message-identifier filter: blocks, or passes only, events whose message identifier matches
 * one of its patterns, and suppresses repeats of an identifier within a time.
 */
/** @return variables that block "*W *I", without suppression of repeats, and with a reference to
 *          the formatter "msgFormatter"; null when memory ran out */
QLX_API void *QlxMsgIdFilterFAllocVars(void);

/** Null is ignored. */
QLX_API void QlxMsgIdFilterFFreeVars(void *vars);

/** The keys "mode", "msgIds" and "msgIdRepeatTime", and the common ones. Deliberate: a key of the
 *  three without a value leaves its setting. */
QLX_API void QlxMsgIdFilterFCfgChange(QlxObject *filter, const char *key);

/** Stores the event's identifier on it, tests it, and notes the time of one that passes. Without
 *  variables (memory ran out, or the toolkit closes) the filter passes everything. @return 1 or 0;
 *  0 when the filter or the event is null */
QLX_API uint8_t QlxMsgIdFilterFIsLoggable(QlxObject *filter, Event *event, va_list *args);

/** Whether any of the patterns matches; 0 when an argument is null. Takes no lock. */
QLX_API uint8_t QlxMsgIdFilterMatchMsgId(StringList *patterns, const char *id);

/** @return a new list of the words between blanks, tabs and line ends, empty for null; the caller
 *          frees it with qlxIntlFreeStringList(). Null when memory ran out. Takes no lock. */
QLX_API StringList *QlxMsgIdFilterGetStringList(const char *text);

/**
 * Whether a text matches a pattern, in which "*" stands for any text and all else for itself. Takes
 * no lock.
 *
 * Deliberate: each piece between stars is searched once, at its first occurrence: "*W" does not
 * match "AWBW". A star after the last piece counts only when that piece is the first: "*W*" is
 * "*W", "KBB*" matches all that begins so.
 *
 * @return 1 or 0; 0 when an argument is null
 */
QLX_API uint8_t QlxPatternMatch(const char *pattern, const char *text);

QLX_END_DECLS

#endif
