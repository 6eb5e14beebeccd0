/**
 * @file
 * The conversions of property values, for class operations that have a value in hand. They take no
 * lock and own nothing.
 *
 * `ok` is optional and becomes 1 when the value had the form of its type, otherwise 0; the result
 * is 0 then, also for a null value.
 */
#ifndef QLX_CLASS_PROPS_H
#define QLX_CLASS_PROPS_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** @return 1 for "true", 0 for "false", in any mix of case; nothing else succeeds, not even blanks
 */
QLX_API uint8_t qlxPropStrToBool(const char *value, uint8_t *ok);

/** @return the first byte; an empty value is character 0 with success */
QLX_API char qlxPropStrToChar(const char *value, uint8_t *ok);

/** @return what sscanf() reads with "%d": "12abc" is 12, "0x10" is 0 */
QLX_API int32_t qlxPropStrToInt32(const char *value, uint8_t *ok);

/** @return what sscanf() reads with "%lld" */
QLX_API int64_t qlxPropStrToInt64(const char *value, uint8_t *ok);

/** @return what sscanf() reads with "%f" */
QLX_API float qlxPropStrToFloat32(const char *value, uint8_t *ok);

/** @return what sscanf() reads with "%lf" */
QLX_API double qlxPropStrToFloat64(const char *value, uint8_t *ok);

QLX_END_DECLS

#endif
