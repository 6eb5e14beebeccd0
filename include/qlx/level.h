/**
 * @file
 * Level words.
 */
#ifndef QLX_LEVEL_H
#define QLX_LEVEL_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * Reads a level: a decimal number (blanks before it, anything after it), else the start of the text
 * against FATAL, ERROR, WARN, INFO, DEBUG_MIN, MIN, DEBUG_MID, MID, DEBUG_MAX, MAX, ALL, OFF in any
 * letter case ("warning" is WARN, "maximum" is MAX, which is DEBUG_MAX; MIN and MID are DEBUG_MIN
 * and DEBUG_MID). Deliberate: an empty or blank text is ALL. A number of more than 32 bits reads as
 * another one, as in qlx/props.h. Takes no lock.
 *
 * @param text  borrowed, may be null
 * @return the level; UNSPECIFIED (-9999) for null and for anything else
 */
QLX_API int32_t QlxGetLevelFromString(const char *text);

QLX_END_DECLS

#endif
