// Names of the generations of a log file: app.log is the active one, app1.log the newest of the
// others. Here is the text of names only; what has such a name is not looked at.
#ifndef QLX_SRC_QLXFILENAMES_H
#define QLX_SRC_QLXFILENAMES_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** The longest name of a file, with its terminator. */
typedef char QlxFileName[257];

struct QlxLogNames {
  char *fullName;      // owned: path of the active file; null: there is nothing to open
  char *dirPart;       // owned: directory of all generations; null: none in the path
  char *basePart;      // owned: name up to the generation, with the "/" before it if it had one
  char *extPart;       // owned: extension without its dot; null: none
  int32_t generation;  // number at the end of the configured name
  int32_t maxFiles;    // generations with the active file; below 2: no rollover
  int32_t nameError;   // why there is no fullName; 0: there is, or none was asked for
};

/** Place of the digit before the last dot of the whole name (before its end when it has none); -1
 *  when no digit stands there, and for null. */
int32_t qlxFHTrailingBaseDigit(const char *name);

/**
 * Splits a name into dirPart, basePart, generation and extPart, which are freed before. All are
 * empty afterwards for a null name, for one of more than 256 bytes, and when memory ran out.
 */
void qlxFHGetFileNameParts(const char *name, QlxLogNames *names);

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
char *qlxFHGenerationName(const QlxLogNames *names, int32_t generation);

/** As qlxFHGenerationName(), without memory. 0, and an empty name, for one that would have to be
 * cut, and for none. */
uint8_t qlxFHWriteName(const QlxLogNames *names, int32_t generation, QlxFileName name);

/** Success when the handler may open its file: the names of all its generations fit, or it has
 * none. A name must never be cut, since the rest of it may be the name of another file. */
CxStatus qlxFHCheckNames(const QlxLogNames *names);

QLX_END_DECLS

#endif
