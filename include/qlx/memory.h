/**
 * @file
 * Memory, 8-bit strings and single characters: the runtime library's routines behind a fixed rule
 * for null pointers and zero sizes. Every block of this library comes from here.
 *
 * Strings are null-terminated bytes. Sizes, lengths and counts are bytes. A block that one of these
 * functions returns belongs to the caller, who frees it with OslMemoryFree(); every other pointer
 * is borrowed, and a returned pointer into a string lives as long as that string. Nothing here
 * takes a lock or keeps state. Nothing reports an error: an allocation that fails gives null.
 */
#ifndef QLX_MEMORY_H
#define QLX_MEMORY_H

#include <qlx/base.h>

QLX_BEGIN_DECLS

/* ---- Memory ------------------------------------------------------------------------------ */

/** @return a new block of `size` bytes; null for 0 */
QLX_API void *OslMemoryMalloc(uint32_t size);

/** @return a new zero-filled block of `count * size` bytes; null when either is 0 */
QLX_API void *OslMemoryCalloc(uint32_t count, uint32_t size);

/**
 * Changes a block's size; a null block allocates.
 *
 * @return the block, perhaps moved. Null when memory ran out and for size 0: the old block is then
 *         untouched and still the caller's
 */
QLX_API void *OslMemoryRealloc(void *block, uint32_t size);

/** Frees a block; null is ignored. */
QLX_API void OslMemoryFree(void *block);

/* ---- Strings ----------------------------------------------------------------------------- */

/**
 * Compares two strings.
 *
 * Deliberate: a null `a` compares as 1, also with a null `b`, so two nulls are never equal; else a
 * null `b` compares as -1.
 *
 * @return below, equal to or above 0, as strcmp()
 */
QLX_API int32_t OslStringCmp(const char *a, const char *b);

/** As OslStringCmp(), at most `count` bytes; the null rule holds for a count of 0 too. */
QLX_API int32_t OslStringNCmp(const char *a, const char *b, uint32_t count);

/** As OslStringCmp(), without regard to case. */
QLX_API int32_t OslStringICmp(const char *a, const char *b);

/** As OslStringNCmp(), without regard to case. */
QLX_API int32_t OslStringNICmp(const char *a, const char *b, uint32_t count);

/** Appends; a null source appends nothing. @return the destination, which may be null */
QLX_API char *OslStringCat(char *destination, const char *source);

/** Appends at most `count` bytes and a terminator. @return as OslStringCat() */
QLX_API char *OslStringNCat(char *destination, const char *source, uint32_t count);

/** Copies; a null source makes the destination empty. @return the destination, which may be null */
QLX_API char *OslStringCpy(char *destination, const char *source);

/**
 * Copies at most `count` bytes and fills the rest of them with zero bytes; a source of `count`
 * bytes or more leaves NO terminator.
 *
 * Deliberate: a null source makes the destination empty whatever the count, so that it writes one
 * byte for a count of 0 too.
 *
 * @return the destination, which may be null
 */
QLX_API char *OslStringNCpy(char *destination, const char *source, uint32_t count);

/** @return a new copy; null for null or without memory */
QLX_API char *OslStringDup(const char *string);

/** @return the bytes before the terminator; 0 for null */
QLX_API uint32_t OslStringLen(const char *string);

/** @return the first place of the character (its low 8 bits; 0 finds the terminator), or null */
QLX_API char *OslStringChr(const char *string, int32_t character);

/** As OslStringChr(), the last place. */
QLX_API char *OslStringRChr(const char *string, int32_t character);

/** @return the first place of the needle, or null; null when either is null */
QLX_API char *OslStringStr(const char *string, const char *needle);

/** @return the first place of any byte of the set, or null; null when either is null */
QLX_API char *OslStringStrpbrk(const char *string, const char *set);

/**
 * @return how many bytes at the start are not in the set; 0xFFFFFFFF for a null string, the whole
 *         length for a null set
 */
QLX_API uint32_t OslStringStrcspn(const char *string, const char *set);

/** @return how many bytes at the start are in the set; 0xFFFFFFFF for a null string, 0 for a null
 * set */
QLX_API uint32_t OslStringStrspn(const char *string, const char *set);

/**
 * Prints into the destination, which the caller makes large enough. Nothing is checked: neither
 * argument may be null.
 *
 * @return the bytes written without the terminator, below 0 when the format failed
 */
QLX_API int32_t OslStringSprintf(char *destination, const char *format, ...)
    __attribute__((format(printf, 2, 3)));

/* ---- Characters: only the low 8 bits of the argument count; each answers 1 or 0 -------------- */

/** The codes 0x30 to 0x39, whatever the native character set. */
QLX_API uint8_t CxIsASCIIDigit(int32_t character);

/** The codes 0x41 to 0x5A and 0x61 to 0x7A, whatever the native character set. */
QLX_API uint8_t CxIsASCIIAlpha(int32_t character);

/** The ten digits of the native character set. */
QLX_API uint8_t CxIsLocalDigit(int32_t character);

/**
 * Converts a buffer in place from EBCDIC to the native character set.
 *
 * Deliberate: on ASCII hosts, the only ones there are builds for, text is never EBCDIC, so that no
 * byte changes; null is fine.
 */
QLX_API void CxETOA(char *buffer, uint32_t length);

/**
 * EBCDIC code page 1047 to ISO-8859-1, indexed by the EBCDIC byte, and a terminating zero byte. It
 * differs from the published mapping in two places: 0x15 gives 0x0A and 0x25 gives 0x85.
 */
QLX_API extern const uint8_t cxEbcdic1047ToLatin1[257];

/**
 * EBCDIC code page 037 to ISO-8859-1, as above. 32 control positions (0x04, 0x06, 0x08 ... 0x3E and
 * 0xFF) give other bytes than the published mapping.
 */
QLX_API extern const uint8_t cxEbcdic037ToLatin1[257];

QLX_END_DECLS

#endif
