/**
 * @file
 * Typed values: parameters (Parm), properties in a string map read and written as typed values, and
 * a tokenizer.
 *
 * No function here takes a lock: the caller holds what guards the map. Strings and parameters that
 * are returned are the caller's, strings freed with OslMemoryFree(), parameters with QlxFreeParm().
 */
#ifndef QLX_PROPS_H
#define QLX_PROPS_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/* ---- Parameters ---------------------------------------------------------------------------- */

/**
 * Copies a parameter: a ParmString with its string, a ParmInt64 with the first 32-bit word of its
 * slot only (the low word on this platform; the other becomes 0), an unknown type without its
 * value.
 *
 * @return the copy, or null for null and when memory is exhausted
 */
QLX_API Parm *QlxCopyParm(const Parm *parm);

/** Frees a parameter and the string of a ParmString; null is ignored. */
QLX_API void QlxFreeParm(Parm *parm);

/**
 * @return 1 when both parameters have the same type and value, and for two nulls; otherwise 0. Of a
 *         ParmInt64 only the first 32-bit word counts, NaN equals nothing, and neither does a value
 * of an unknown type or a null string
 */
QLX_API uint8_t QlxCmpParms(const Parm *a, const Parm *b);

/* ---- Properties in a map ------------------------------------------------------------------- */

/*
 * Keys compare exactly. A null map or key reads as an absent property. `found` and `ok` are
 * optional bytes that become 1 or 0; `ok` tells that a value was there AND had the form of its
 * type: Bool     "true" or "false" in any case, nothing else Char     any value; its first byte, 0
 * for an empty value Int, Long, Float, Double  what sscanf() reads with "%d", "%lld", "%f", "%lf":
 * blanks may come before, anything may follow Otherwise the result is 0.
 *
 * A whole number that its type has no room for counts as read and is another one: of an Int the low
 * 32 bits, so that "3000000000" is -1294967296; beyond 64 bits, the low bits of the nearest Long.
 */

/** @return a copy of the value, or null */
QLX_API char *QlxGetMapProp(StringToStringMap *map, const char *key, uint8_t *found);
/** @return 1 or 0 */
QLX_API uint8_t QlxGetMapPropBool(StringToStringMap *map, const char *key, uint8_t *ok);
/** @return the first byte of the value */
QLX_API char QlxGetMapPropChar(StringToStringMap *map, const char *key, uint8_t *ok);
/** @return the value as a 32-bit integer */
QLX_API int32_t QlxGetMapPropInt(StringToStringMap *map, const char *key, uint8_t *ok);
/** @return the value as a 64-bit integer */
QLX_API int64_t QlxGetMapPropLong(StringToStringMap *map, const char *key, uint8_t *ok);
/** @return the value as a 32-bit float */
QLX_API float QlxGetMapPropFloat(StringToStringMap *map, const char *key, uint8_t *ok);
/** @return the value as a 64-bit float */
QLX_API double QlxGetMapPropDouble(StringToStringMap *map, const char *key, uint8_t *ok);

/** Stores a copy of a string, or null. @return 1, or 0 for a null map or key or exhausted memory */
QLX_API uint8_t QlxSetMapProp(StringToStringMap *map, const char *key, const char *value);
/** Stores "true" for exactly 1, otherwise "false". @return as QlxSetMapProp() */
QLX_API uint8_t QlxSetMapPropBool(StringToStringMap *map, const char *key, uint8_t value);

/*
 * These store the text that CxUStringParmToStr() makes of the value: floats have six fraction
 * digits, and a Long is stored with its low 32 bits only. When memory is exhausted nothing is
 * stored.
 */

QLX_API void QlxSetMapPropChar(StringToStringMap *map, const char *key, char value);
QLX_API void QlxSetMapPropInt(StringToStringMap *map, const char *key, int32_t value);
QLX_API void QlxSetMapPropLong(StringToStringMap *map, const char *key, int64_t value);
QLX_API void QlxSetMapPropFloat(StringToStringMap *map, const char *key, float value);
QLX_API void QlxSetMapPropDouble(StringToStringMap *map, const char *key, double value);

/* ---- Tokenizer ------------------------------------------------------------------------------- */

/*
 * Iterator; then, while HasNext: Get (and free), Next. The position is a value that points into the
 * caller's string and delimiters, which must outlive it and are not changed.
 */

/** @return the position at the start of a string; a null string has no tokens */
QLX_API QlxStrTok QlxStrTokIterator(const char *string, const char *delims);

/** @return 1 when a token follows */
QLX_API uint8_t QlxStrTokIterHasNext(QlxStrTok state);

/** @return a copy of the token that follows, or null */
QLX_API char *QlxStrTokIterGet(QlxStrTok state);

/** @return the position behind the token that follows; at the end the same position */
QLX_API QlxStrTok QlxStrTokIterNext(QlxStrTok state);

QLX_END_DECLS

#endif
