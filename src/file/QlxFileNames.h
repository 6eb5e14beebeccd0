// Names of the generations of a log file: app.log is the active one, app1.log the newest of the
// others.
#ifndef QLX_SRC_QLXFILENAMES_H
#define QLX_SRC_QLXFILENAMES_H

#include "QlxFileHandler.h"

QLX_BEGIN_DECLS

/** The longest name of a file, with its terminator. */
typedef char QlxFileName[257];

/** Place of the digit before the last dot of the whole name (before its end when it has none); -1
 *  when no digit stands there, and for null. */
int32_t qlxFHTrailingBaseDigit(const char *name);

/**
 * Splits a name into dirPart, basePart, generation and extPart, which are freed before. All are
 * empty afterwards for a null name, for one of more than 256 bytes, and when memory ran out.
 */
void qlxFHGetFileNameParts(const char *name, QlxFileHandlerVars *vars);

/**
 * Joins the parts to a new name in *out, whose old value is not freed; null when base is null or
 * memory ran out. A null dir or ext and a generation of 0 leave no trace.
 */
void qlxSetFileNameParts(char **out, const char *dir, const char *base, int32_t generation,
                         const char *ext);

/** Copies the first 256 bytes of a name, with each backslash as "/", and terminates. */
void qlxGetNativePath(const char *name, QlxFileName buffer);

/** A new copy of a name in which a digit that would run into a generation's number is followed by
 *  "_"; null for null. */
char *qlxFHCloseBaseDigits(const char *name);

/** The name of a generation, or null. */
char *qlxFHGenerationName(const QlxFileHandlerVars *vars, int32_t generation);

/** As qlxFHGenerationName(), without memory. 0, and an empty name, for one that would have to be
 * cut, and for none. */
uint8_t qlxFHWriteName(const QlxFileHandlerVars *vars, int32_t generation, QlxFileName name);

/** Success when the handler may open its file: the names of all its generations fit, or it has
 * none. A name must never be cut, since the rest of it may be the name of another file. */
CxStatus qlxFHCheckNames(const QlxFileHandlerVars *vars);

QLX_END_DECLS

#endif
