/**
 * @file
 * Growable text: CxStringBuff for 8-bit text, CxUStringBuff for UTF-16.
 *
 * A zero-filled record is an empty buffer. The first append allocates 1024 bytes; from there a
 * block doubles until it is larger than what is needed, and a block that would pass 2^30 bytes is a
 * failure. A buffer ends with Discard, or with Take, which hands its text over. Nothing here takes
 * a lock: a buffer belongs to one thread at a time.
 *
 * Appends answer 1, or 0 for a null buffer, a null text or exhausted memory, and then leave the
 * text as it was. A text may be the buffer's own, or a part of it: what it was before the call is
 * appended.
 */
#ifndef QLX_BUFFERS_H
#define QLX_BUFFERS_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/* ---- 8-bit text ---------------------------------------------------------------------------- */

/** Appends one byte, 0 too. */
QLX_API uint8_t CxStringBuffAppendChar(CxStringBuff *buffer, char byte);

/**
 * Appends a code point as one to six bytes of UTF-8, without any check for surrogates or for values
 * above 0x10FFFF. A negative value gives its low seven bits; 0x7FF takes three bytes. A form
 * without room is tried in the next longer one: the call fails only when there is no room for six
 * bytes.
 */
QLX_API uint8_t CxStringBuffAppendUTF32Char(CxStringBuff *buffer, int32_t codePoint);

/** Appends a UTF-16 code unit as the code point of its value; surrogates are not paired. */
QLX_API uint8_t CxStringBuffAppendUCS2Char(CxStringBuff *buffer, UChar unit);

/** Appends the decimal form of a signed 32-bit value. */
QLX_API uint8_t CxStringBuffAppendInt32(CxStringBuff *buffer, int32_t value);

/** Appends the decimal form of a signed 64-bit value. */
QLX_API uint8_t CxStringBuffAppendInt64(CxStringBuff *buffer, int64_t value);

/**
 * Appends the decimal form of an unsigned 64-bit value, digit by digit.
 *
 * @return 1 for every buffer but null, also when memory ended among the digits
 */
QLX_API uint8_t CxStringBuffAppendUInt64(CxStringBuff *buffer, uint64_t value);

/** Appends the decimal form in EBCDIC characters: digits 0xF0 to 0xF9, minus 0x60; nothing for 0.
 */
QLX_API uint8_t CxStringBuffAppendEBCDICInt64(CxStringBuff *buffer, int64_t value);

/** Appends a null-terminated text. */
QLX_API uint8_t CxStringBuffAppendStr(CxStringBuff *buffer, const char *text);

/**
 * Appends at most `count` bytes of a text, ending early at a zero byte; -1 is the whole text, and
 * any smaller count appends nothing. Room is made for `count` bytes, also when the text is shorter.
 */
QLX_API uint8_t CxStringBuffAppendStrN(CxStringBuff *buffer, const char *text, int32_t count);

/**
 * Inserts a text before the byte at `position`, a byte index from 0 to the buffer's length. Asks
 * for room twice, for the buffer's length again beside the text's, so it may grow where an append
 * would not.
 *
 * @return 1, or 0 as an append and for a position outside the text
 */
QLX_API uint8_t CxStringBuffInsertStr(CxStringBuff *buffer, const char *text, int32_t position);

/**
 * Hands the text over and leaves an empty buffer.
 *
 * @return the text, which the caller frees with OslMemoryFree(); null if nothing was ever appended
 */
QLX_API char *CxStringBuffTakeStr(CxStringBuff *buffer);

/** @return the text, the buffer's own until its next change; null if nothing was ever appended */
QLX_API const char *CxStringBuffPeekStr(const CxStringBuff *buffer);

/** @return a copy of the text, which the caller frees with OslMemoryFree(), or null */
QLX_API char *CxStringBuffCopyStr(const CxStringBuff *buffer);

/** Empties the text and keeps the block. */
QLX_API void CxStringBuffRestart(CxStringBuff *buffer);

/** Frees the block and leaves an empty buffer. */
QLX_API void CxStringBuffDiscard(CxStringBuff *buffer);

/**
 * Shrinks the block to the text and its terminator; an empty text gives the block back.
 *
 * @return 1 when the block shrank or went; 0 when it fits already, and when memory ran out
 */
QLX_API uint8_t CxStringBuffPack(CxStringBuff *buffer);

/* ---- UTF-16 text ----------------------------------------------------------------------------- */

/** Appends one 8-bit character, converted from the default code page; 0 appends nothing. */
QLX_API uint8_t CxUStringBuffAppendChar(CxUStringBuff *buffer, char character);

/** Appends 8-bit text, converted as CxUStringDupStrToUChar() does. */
QLX_API uint8_t CxUStringBuffAppendStr(CxUStringBuff *buffer, const char *text);

/** Appends at most `count` bytes of 8-bit text, ending at a zero byte; -1 is the whole text. */
QLX_API uint8_t CxUStringBuffAppendStrN(CxUStringBuff *buffer, const char *text, int32_t count);

/** Appends null-terminated UTF-16 text. */
QLX_API uint8_t CxUStringBuffAppendUStr(CxUStringBuff *buffer, const UChar *text);

/** Appends the sign-extended value as CxUStringBuffAppendInt64() does. */
QLX_API uint8_t CxUStringBuffAppendInt32(CxUStringBuff *buffer, int32_t value);

/** Appends the decimal form of the value's 64 bits taken as unsigned: -1 is 18446744073709551615.
 */
QLX_API uint8_t CxUStringBuffAppendInt64(CxUStringBuff *buffer, int64_t value);

/** Appends the decimal form of an unsigned 64-bit value. */
QLX_API uint8_t CxUStringBuffAppendUInt64(CxUStringBuff *buffer, uint64_t value);

/** Appends a date, milliseconds since 1970-01-01 UTC, as a whole number of the default locale. */
QLX_API uint8_t CxUStringBuffAppendUDate(CxUStringBuff *buffer, double date);

/** Appends a number of the default locale: no grouping, at most five fraction digits. */
QLX_API uint8_t CxUStringBuffAppendUDouble(CxUStringBuff *buffer, double value);

/** Hands the text over as CxStringBuffTakeStr() does. */
QLX_API UChar *CxUStringBuffTakeUStr(CxUStringBuff *buffer);

/** Empties the text and keeps the block. */
QLX_API void CxUStringBuffRestart(CxUStringBuff *buffer);

/** Frees the block and leaves an empty buffer. */
QLX_API void CxUStringBuffDiscard(CxUStringBuff *buffer);

QLX_END_DECLS

#endif
