// The multi-process file handler: several processes append to one file. A semaphore serialises the
// size check, the rollover and the write of each record.
#include "QlxMultiProcFileHandler.h"

#include <cerrno>

#include <fcntl.h>

#include <qlx/class/object.h>

#include "QlxObject.h"
#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "util/CxStatus.h"

// ---- Rolling over

static bool mayRoll(QlxFileHandlerVars *vars) {
  return vars && !cxFailed(qlxFHCheckNames(vars));
}

void qlxMultiProcFileHandlerRollActiveLog(QlxFileHandlerVars *vars) {
  if (mayRoll(vars)) qlxSharedFileCopyAndEmpty(vars, nullptr);
}

void qlxMultiProcFileHandlerDoRollover(QlxFileHandlerVars *vars) {
  if (mayRoll(vars)) qlxSharedFileRollOver(vars, nullptr);
}

// ---- The semaphore, with its failures reported

static uint8_t succeeds(CxStatus status) {
  qlxKeepFailure(nullptr, status);
  return !cxFailed(status);
}

uint8_t qlxMultiProcFileHandlerInitSem(QlxFileHandlerVars *vars) {
  return vars && succeeds(qlxSharedLockSetUp(vars));
}

uint8_t qlxMultiProcFileHandlerLockSem(QlxFileHandlerVars *vars) {
  return vars && succeeds(qlxSharedLockTake(vars));
}

void qlxMultiProcFileHandlerUnlockSem(QlxFileHandlerVars *vars) {
  if (vars) qlxKeepFailure(nullptr, qlxSharedLockGiveBack(vars));
}

// ---- Opening and closing

// Deliberate: appends also when "appending" is off.
static CxStatus openFile(QlxFileHandlerVars *vars) {
  qlxFileHandlerMakeDirectory(vars);
  const CxStatus status = qlxLogFileOpen(vars, vars->fullName, O_APPEND);
  vars->opened = !cxFailed(status);
  if (vars->opened == 1) qlxLogFileReserve(vars);
  return status;
}

// Opens the file, if there is one to open. Without the semaphore it stays closed.
static CxStatus openShared(QlxFileHandlerVars *vars) {
  if (!vars || vars->opened == 1) return kCxSuccess;
  CxStatus status = qlxFHCheckNames(vars);
  if (cxFailed(status) || !vars->fullName) return status;
  if (vars->semReady != 1) status = qlxSharedLockSetUp(vars);
  return cxFailed(status) ? status : openFile(vars);
}

CxStatus QlxMultiProcFileHandlerFOpenWithErr(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  const CxStatus status = openShared(vars);
  qlxKeepFailure(nullptr, status);
  // Deliberate: no semaphore, no failure
  return vars && (vars->semReady == 1 || status.code == ENAMETOOLONG) ? status : kCxSuccess;
}

void QlxMultiProcFileHandlerFOpen(QlxObject *handler) {
  QlxMultiProcFileHandlerFOpenWithErr(handler);
}

void QlxMultiProcFileHandlerFClose(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || vars->opened != 1) return;
  qlxKeepFailure(nullptr, qlxLogFileClose(vars));
  vars->opened = 0;
}

// ---- Writing

// A descriptor that was taken away: what is written goes into the file of the name.
static CxStatus measureOurs(QlxFileHandlerVars *vars) {
  if (!cxFailed(qlxLogFileMeasure(vars))) return kCxSuccess;
  qlxKeepFailure(nullptr, qlxLogFileClose(vars));
  return openFile(vars);
}

// Runs while this process holds the semaphore.
static CxStatus checkSizeAndWrite(QlxFileHandlerVars *vars, Event *event,
                                  const FormattedBytes &text) {
  const CxStatus status = measureOurs(vars);
  if (cxFailed(status)) return status;
  if (qlxFileHandlerIsFull(vars) && !qlxSharedFileWaits(vars)) qlxSharedFileRollOver(vars, event);
  return qlxFileHandlerWriteText(vars, text);
}

// Deliberate: a record whose lock fails is dropped; the event tells of it.
static void writeText(QlxFileHandlerVars *vars, Event *event, const FormattedBytes &text) {
  CxStatus status = qlxSharedLockTake(vars);
  if (!cxFailed(status)) {
    status = checkSizeAndWrite(vars, event, text);
    qlxMultiProcFileHandlerUnlockSem(vars);
  }
  qlxKeepLost(event, status);
}

// The text is gone before the listeners get the event.
static void formatAndWrite(QlxObject *handler, QlxFileHandlerVars *vars, Event *event,
                           va_list *args) {
  FormattedBytes text;
  if (text.format(handler, event, args)) writeText(vars, event, text);
}

void QlxMultiProcFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || !event || !loadEnabled(handler)) return;
  qlxKeepLost(event, openShared(vars));
  if (vars->opened != 1) return;  // Deliberate: the listeners do not get the event either
  formatAndWrite(handler, vars, event, args);
  QlxBasicObjectFLog(handler, event, args);
}

const ObjClass qlxMultiProcFileHandlerClass = {
    .kind = Handler,
    .name = "qlx_multiproc_filehandler",
    .description = nullptr,
    .op1 = {.fProcess = QlxMultiProcFileUHandlerFProcess},
    .op2 = {.fOpen = QlxMultiProcFileHandlerFOpen},
    .op3 = {.fClose = QlxMultiProcFileHandlerFClose},
    .fAllocVars = QlxFileHandlerFAllocVars,
    .fFreeVars = QlxFileHandlerFFreeVars,
    .fCfgChange = QlxFileHandlerFCfgChange,
    .own = &kTakesNotes,
};
