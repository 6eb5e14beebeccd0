/**
 * @file
 * A property list: keys and values in one growable array, for hosts that read a properties file
 * without making configurations of it; and the two functions for growable arrays it is made with.
 *
 * A zero-filled CxPropList is empty; CxPropListDiscard() ends it. The list copies what it is given.
 * Keys compare exactly and are looked for from the first entry on. A null list, key or iterator
 * answers 0 or null. What a Peek returns stays the list's own and lives until that entry changes;
 * what a Copy returns the caller frees with OslMemoryFree(). Nothing here but CxPropListRead()
 * reads a file, and nothing takes a lock: a list belongs to one thread at a time.
 */
#ifndef QLX_PROPLIST_H
#define QLX_PROPLIST_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * Reads a properties file into a list, whose earlier entries stay. Entries read before a failure
 * stay too.
 *
 * @param path    the file's name, of at most 256 bytes; backslashes separate as "/" does. What it
 *                may lead to, and the failures, are those of QlxOpenToolkit()
 * @param status  optional; written only when the system fails, never for a syntax error
 * @return 1 when the whole file was read; 0 for a null list, a syntax error, a failure of the
 * system or exhausted memory
 */
QLX_API uint8_t CxPropListRead(const char *path, CxPropList *list, CxStatus *status);

/**
 * Stores a value under a key. A key that is there keeps its place; a new one goes to the end.
 *
 * @return 1, or 0 with the list unchanged for a null argument or exhausted memory
 */
QLX_API uint8_t CxPropListPutStr(CxPropList *list, const char *key, const char *value);

/** @return the value of a key, or null; `found` is optional and becomes 1 or 0 */
QLX_API const char *CxPropListPeekStr(const CxPropList *list, const char *key, uint8_t *found);

/** @return a copy of the value of a key, or null; `found` is optional and becomes 1 or 0 */
QLX_API char *CxPropListCopyStr(const CxPropList *list, const char *key, uint8_t *found);

/** @return 1 when the key is there */
QLX_API uint8_t CxPropListHasKey(const CxPropList *list, const char *key);

/** Removes a key; the last entry moves into its place. @return 1, or 0 when the key is not there */
QLX_API uint8_t CxPropListRemove(CxPropList *list, const char *key);

/** Frees all entries and the array; the list is empty then. */
QLX_API void CxPropListDiscard(CxPropList *list);

/*
 * An iterator starts ON the first entry: read it, and while HasNext answers 1 go on with Next. A
 * removal moves the last entry to the removed one's index, so it may hide an entry from an
 * iterator.
 */

/** @return an iterator on the first entry */
QLX_API CxPropListIter CxPropListIterator(CxPropList *list);

/** @return 1 when an entry follows the current one */
QLX_API uint8_t CxPropListIterHasNext(const CxPropListIter *iter);

/** Goes to the next entry; past the last the iterator becomes {null, 0} and stays there. */
QLX_API void CxPropListIterNext(CxPropListIter *iter);

/** @return the current key, or null when there is no current entry */
QLX_API const char *CxPropListIterPeekKey(const CxPropListIter *iter);

/** @return the current value, or null when there is no current entry */
QLX_API const char *CxPropListIterPeekVal(const CxPropListIter *iter);

/** @return a copy of the current key, or null when there is no current entry */
QLX_API char *CxPropListIterCopyKey(const CxPropListIter *iter);

/** @return a copy of the current value, or null when there is no current entry */
QLX_API char *CxPropListIterCopyVal(const CxPropListIter *iter);

/**
 * Makes room in an array of any elements. Without an array it allocates exactly `needed` elements
 * and sets the count to 0; an array that is too small grows to 16 doubled until that exceeds
 * `needed`.
 *
 * @param array        the array's address, null without one; moved when it grows
 * @param capacity     elements allocated; updated
 * @param count        elements in use
 * @param needed       elements wanted
 * @param elementSize  bytes
 * @return 1 when there is room; 0, with everything as it was, for a null pointer, exhausted memory,
 * or more than 2^30 elements or 4 GiB
 */
QLX_API uint8_t CxListEnsureCapacity(void **array, int32_t *capacity, int32_t *count,
                                     int32_t needed, uint32_t elementSize);

/** Frees an array (not what its elements own) and zeroes the three; null pointers are skipped. */
QLX_API void CxListDiscard(void **array, int32_t *capacity, int32_t *count);

QLX_END_DECLS

#endif
