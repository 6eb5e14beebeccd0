// The variables of the handlers that write files, and the steps that these handlers share.
#ifndef QLX_SRC_QLXFILEHANDLER_H
#define QLX_SRC_QLXFILEHANDLER_H

#include <qlx/class/handler.h>
#include <qlx/types.h>

#include "QlxFileWatch.h"
#include "QlxFormatted.h"

QLX_BEGIN_DECLS

typedef struct QlxFileHandlerVars {
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
  uint32_t dirPermission;   // of a newly made directory, exactly
  uint8_t appending;        // 1: keep what an existing file holds; 0: empty it on every open
  uint8_t semReady;         // 1 once the semaphore is there
  int32_t semKey;           // key of the semaphore that processes share
  int32_t semId;            // its identifier; -1: none
  uint8_t logInternalErrs;  // kept without effect
  QlxFileWatch watch;       // of the active file while it is open
} QlxFileHandlerVars;

/** Removes the oldest generation and moves every other file, the active one too, up by one. The
 *  active file is closed; the caller sets the size to 0. Failures are reported, a missing file is
 *  none. */
void qlxFileHandlerDoRollover(QlxFileHandlerVars *vars);

/** Sets filePermission, dirPermission from up to four octal digits; other text changes nothing. */
void qlxFileHandlerCfgPerms(QlxObject *handler, const char *text);
void qlxFileHandlerCfgDirPerms(QlxObject *handler, const char *text);

/** The object's variables; null for a null object and one without variables. */
QlxFileHandlerVars *qlxFileHandlerVars(QlxObject *handler);

inline bool qlxFailed(CxStatus status) {
  return status.kind != '-';
}

/** Reports a failure, and stores it in the event; a success changes nothing. */
void qlxKeepFailure(Event *event, CxStatus status);

/** Makes the directory of the generations; a failure is reported, opening then fails by itself. */
void qlxFileHandlerMakeDirectory(const QlxFileHandlerVars *vars);

/** Sets the size to that of the open file, which sees other writers' bytes too. */
CxStatus qlxFileHandlerMeasure(QlxFileHandlerVars *vars);

/** True when the size, as last measured, calls for a rollover. */
bool qlxFileHandlerIsFull(const QlxFileHandlerVars *vars);

/** Writes all of it; the size counts what was written, also of a write that fails in the end. */
CxStatus qlxFileHandlerWrite(QlxFileHandlerVars *vars, const char *bytes, uint32_t length);

/** Writes a text in the default code page. */
CxStatus qlxFileHandlerWriteText(QlxFileHandlerVars *vars, const FormattedBytes &text);

QLX_END_DECLS

#endif
