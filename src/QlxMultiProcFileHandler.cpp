// The multi-process file handler: several processes append to one file. A semaphore serialises the
// size check, the rollover and the write of each record. The active file never changes its name: it
// is copied to generation 1 and truncated in place, so every process's descriptor stays valid.
#include "QlxMultiProcFileHandler.h"

#include <array>
#include <cerrno>
#include <cstdio>

#include <fcntl.h>
#include <unistd.h>

#include <qlx/class/object.h>
#include <qlx/files.h>

#include "QlxClasses.h"
#include "QlxFileNames.h"
#include "QlxObject.h"
#include "QlxSharedLock.h"
#include "util/CxFile.h"
#include "util/CxOwned.h"
#include "util/CxStatus.h"

static constexpr uint32_t kCopyBytes = 8192;

// ---- Rolling over. Failures are reported and stored in the event, which may be null.

// Copies from the place of one descriptor on to another.
static CxStatus copyBytes(CxFile *from, CxFile *to) {
  std::array<char, kCopyBytes> bytes;
  uint64_t copied = 0;
  for (;;) {
    int32_t count = 0;
    CxStatus status = CxFileRead(from, bytes.data(), kCopyBytes, &count);
    if (qlxFailed(status) && status.code == EINTR) continue;
    if (qlxFailed(status) || count == 0) return status;
    status = cxIntlFileWriteAll(to, bytes.data(), static_cast<uint32_t>(count), &copied);
    if (qlxFailed(status)) return status;
  }
}

static void copyToFirstGeneration(QlxFileHandlerVars *vars, Event *event) {
  const OwnedStr name{qlxFHGenerationName(vars, 1)};
  CxFile generation = -1;
  // Deliberate: not truncated; what the rollover could not move away is written over.
  const CxStatus status =
      CxFileOpenMode(&generation, name.get(), O_CREAT | O_RDWR, vars->filePermission);
  qlxKeepFailure(event, status);
  if (qlxFailed(status)) {
    std::printf("ERR opening %s pre rollover\n", name ? name.get() : "");
    return;
  }
  qlxKeepFailure(event, copyBytes(&vars->file, &generation));
  qlxKeepFailure(event, CxFileFlush(&generation));
  qlxKeepFailure(event, CxFileClose(&generation));
}

static void rollActiveFile(QlxFileHandlerVars *vars, Event *event) {
  const CxStatus atStart = CxFileSeek(&vars->file, 0, SEEK_SET);
  qlxKeepFailure(event, atStart);
  if (!qlxFailed(atStart)) copyToFirstGeneration(vars, event);
  // Deliberate: whatever became of the copy, so that the file never grows past its limit.
  qlxKeepFailure(event, CxFileTrunc(&vars->file));
  qlxKeepFailure(event, CxFileSeek(&vars->file, 0, SEEK_SET));
}

static void rollOver(QlxFileHandlerVars *vars, Event *event) {
  qlxFHShiftGenerations(vars, 1, event);
  rollActiveFile(vars, event);
}

void qlxMultiProcFileHandlerRollActiveLog(QlxFileHandlerVars *vars) {
  if (vars) rollActiveFile(vars, nullptr);
}

void qlxMultiProcFileHandlerDoRollover(QlxFileHandlerVars *vars) {
  if (vars) rollOver(vars, nullptr);
}

// ---- Opening and closing

static CxStatus openFile(QlxFileHandlerVars *vars) {
  qlxFileHandlerMakeDirectory(vars);
  // Deliberate: appends also when "appending" is off.
  return CxFileOpenMode(&vars->file, vars->fullName, O_CREAT | O_RDWR | O_APPEND,
                        vars->filePermission);
}

// Opens the file, if there is one to open. Without the semaphore it stays closed.
static CxStatus openShared(QlxFileHandlerVars *vars) {
  if (!vars || !vars->fullName || vars->opened == 1) return kCxSuccess;
  CxStatus status = vars->semReady == 1 ? kCxSuccess : qlxSharedLockSetUp(vars);
  if (!qlxFailed(status)) status = openFile(vars);
  if (!qlxFailed(status)) vars->opened = 1;
  return status;
}

CxStatus QlxMultiProcFileHandlerFOpenWithErr(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  const CxStatus status = openShared(vars);
  qlxKeepFailure(nullptr, status);
  return vars && vars->semReady == 1 ? status : kCxSuccess;  // Deliberate: no semaphore, no failure
}

void QlxMultiProcFileHandlerFOpen(QlxObject *handler) {
  QlxMultiProcFileHandlerFOpenWithErr(handler);
}

void QlxMultiProcFileHandlerFClose(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || vars->opened != 1) return;
  qlxKeepFailure(nullptr, CxFileClose(&vars->file));
  vars->opened = 0;
}

// ---- Writing

// Runs while this process holds the semaphore.
static void checkSizeAndWrite(QlxFileHandlerVars *vars, Event *event, const FormattedBytes &text) {
  qlxKeepFailure(event, qlxFileHandlerMeasure(vars));
  if (qlxFileHandlerIsFull(vars)) rollOver(vars, event);
  qlxKeepFailure(event, qlxFileHandlerWriteText(vars, text));
}

// Deliberate: a record whose lock fails is dropped; the event tells of it.
static void writeText(QlxFileHandlerVars *vars, Event *event, const FormattedBytes &text) {
  const CxStatus lock = qlxSharedLockTake(vars);
  qlxKeepFailure(event, lock);
  if (qlxFailed(lock)) return;
  checkSizeAndWrite(vars, event, text);
  qlxMultiProcFileHandlerUnlockSem(vars);
}

// The text is gone before the listeners get the event.
static void formatAndWrite(QlxObject *handler, QlxFileHandlerVars *vars, Event *event,
                           va_list *args) {
  const FormattedBytes text{handler, event, args};
  if (text) writeText(vars, event, text);
}

void QlxMultiProcFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || !event || !loadEnabled(handler)) return;
  qlxKeepFailure(event, openShared(vars));
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
};
