/**
 * @file
 * What every public header needs before its first declaration: the fixed-width types, ICU's UTF-16
 * code unit `UChar`, the argument list, and the marks that export a C function.
 */
#ifndef QLX_BASE_H
#define QLX_BASE_H

#include <stdarg.h>
#include <stddef.h>
#include <stdint.h>
#include <unicode/utypes.h>

#ifdef __cplusplus
#define QLX_BEGIN_DECLS extern "C" {
#define QLX_END_DECLS }
#else
#define QLX_BEGIN_DECLS
#define QLX_END_DECLS
#endif

/* Visible outside the shared library; everything else is built hidden. */
#define QLX_API __attribute__((visibility("default")))

#endif
