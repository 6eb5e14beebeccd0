// The variables of the handlers that write files, and the steps that these handlers share.
#ifndef QLX_SRC_QLXFILEHANDLER_H
#define QLX_SRC_QLXFILEHANDLER_H

#include <qlx/class/handler.h>
#include <qlx/types.h>

#include "file/QlxProblems.h"
#include "file/QlxSharedFile.h"
#include "file/QlxSharedLock.h"
#include "record/QlxFormatted.h"

QLX_BEGIN_DECLS

// What the modules of src/file know of the file, and the settings that are the handlers' own.
struct QlxFileHandlerVars : QlxSharedFile, QlxSharedLock {
  uint8_t opened;           // 1 while the active file is open and has its header
  int32_t maxBytes;         // a file of this size is full; compares as unsigned, so -1 is never
  char *encoding;           // owned: "fileEncoding", kept without effect; null at first
  uint32_t dirPermission;   // of a newly made directory, exactly: the nine lowest bits
  uint8_t appending;        // 1: keep what an existing file holds; 0: empty it on every open
  uint8_t followName;       // 1: go on in another regular file that took the name
  uint8_t logInternalErrs;  // kept without effect
};

/** Removes the oldest generation and moves every other file, the active one too, up by one. The
 *  caller sets the size to 0. Failures are reported, a missing file is none. */
void qlxFileHandlerDoRollover(QlxFileHandlerVars *vars);

/** Sets filePermission, dirPermission from up to four octal digits; other text changes nothing. */
void qlxFileHandlerCfgPerms(QlxObject *handler, const char *text);
void qlxFileHandlerCfgDirPerms(QlxObject *handler, const char *text);

/** The object's variables; null for a null object and one without variables. */
QlxFileHandlerVars *qlxFileHandlerVars(QlxObject *handler);

/** Makes the directory of the generations; a failure is reported, opening then fails by itself. */
void qlxFileHandlerMakeDirectory(const QlxFileHandlerVars *vars);

/** True when the size, as last measured, calls for a rollover. */
bool qlxFileHandlerIsFull(const QlxFileHandlerVars *vars);

/** Writes a text in the default code page. */
CxStatus qlxFileHandlerWriteText(QlxFileHandlerVars *vars, const FormattedBytes &text);

QLX_END_DECLS

#endif
