// The variables of the handlers that write files, and the steps that these handlers share.
#ifndef QLX_SRC_QLXFILEHANDLER_H
#define QLX_SRC_QLXFILEHANDLER_H

#include <qlx/class/handler.h>
#include <qlx/types.h>

#include "record/QlxFormatted.h"
#include "file/QlxLogFile.h"
#include "file/QlxProblems.h"

QLX_BEGIN_DECLS

struct QlxFileHandlerVars {
  CxFile file;         // the active file; -1: closed
  uint8_t opened;      // 1 while the active file is open and has its header
  uint64_t size;       // bytes in the active file: measured before, counted in a write
  int32_t maxBytes;    // a file of this size is full; compares as unsigned, so -1 is never
  int32_t maxFiles;    // generations with the active file; below 2: no rollover
  char *fullName;      // owned: path of the active file; null: there is nothing to open
  char *dirPart;       // owned: directory of all generations; null: none in the path
  char *basePart;      // owned: name up to the generation, with the "/" before it if it had one
  char *extPart;       // owned: extension without its dot; null: none
  int32_t generation;  // number at the end of the configured name
  char *encoding;      // owned: "fileEncoding", kept without effect; null at first
  uint32_t filePermission;  // of a newly made file, less the process's file-creation mask
  uint32_t dirPermission;   // of a newly made directory, exactly; of both the nine lowest bits
  uint8_t appending;        // 1: keep what an existing file holds; 0: empty it on every open
  uint8_t semReady;         // 1 once the semaphore is there
  int32_t semKey;           // key of the semaphore that processes share
  int32_t semId;            // its identifier; -1: none
  uint8_t logInternalErrs;  // kept without effect
  uint8_t keepFullFile;     // 1: a file that could not be copied is not emptied
  uint8_t stuck;            // 1: the last rollover could not move or empty the active file
  int64_t stuckSince;       // tick of the last try of a shared file's rollover that failed
  int32_t nameError;        // why there is no fullName; 0: there is, or none was asked for
  QlxLogFile log;           // what is known of the open file
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
