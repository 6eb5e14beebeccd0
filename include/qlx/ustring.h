/**
 * @file
 * UTF-16 text: conversion to and from 8-bit text, copies, the text of a parameter, and printing.
 *
 * 8-bit text is in the process's default code page, ICU's default converter; what that code page
 * cannot represent is replaced as the converter does, and no conversion error is reported. Every
 * returned string is a new block that the caller frees with OslMemoryFree(); it is null for a null
 * argument, for a text whose block would pass 2 GiB, and when memory is exhausted. No lock is
 * taken.
 */
#ifndef QLX_USTRING_H
#define QLX_USTRING_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return a UTF-16 copy of 8-bit text: one code unit for each byte at most */
QLX_API UChar *CxUStringDupStrToUChar(const char *text);

/** @return an 8-bit copy of UTF-16 text: four bytes for each code unit at most */
QLX_API char *CxUStringDupUCharToStr(const UChar *text);

/** @return a copy of UTF-16 text */
QLX_API UChar *CxUStringDup(const UChar *text);

/**
 * The text of a parameter's value, by its type: ParmByte and ParmChar the byte as a character,
 * ParmInt32 decimal, ParmInt64 decimal of the first 32-bit word of its slot only (the low word on
 * this platform), ParmFloat32 and ParmFloat64 with six fraction digits, ParmString the string.
 * Texts of more than 256 UTF-16 code units are cut there.
 *
 * @return a new 8-bit string; null also for a type that is none of these
 */
QLX_API char *CxUStringParmToStr(const Parm *parm);

/**
 * Writes UTF-16 text and a line feed to the standard output stream, in the default code page. The
 * stream stays open; its buffer is the process's own. A null text writes nothing.
 *
 * @return always success
 */
QLX_API CxStatus CxUStringToStdout(const UChar *text);

QLX_END_DECLS

#endif
