// The multi-process file handler: several processes append to one file. A semaphore serialises the
// size check, the rollover and the write of each record. The active file never changes its name: it
// is copied to generation 1 and truncated in place, so every process's descriptor stays valid.
#include "QlxMultiProcFileHandler.h"

#include <array>
#include <cstdio>

#include <fcntl.h>
#include <unistd.h>

#include <qlx/class/object.h>
#include <qlx/files.h>

#include "QlxClasses.h"
#include "QlxFileNames.h"
#include "QlxObject.h"
#include "QlxSharedLock.h"
#include "util/CxOwned.h"
#include "util/CxStatus.h"

static constexpr uint32_t kCopyBytes = 8192;

// ---- Rolling over

// Copies from the place of one descriptor to another; false after a read or write error.
static bool copyBytes(CxFile *from, CxFile *to) {
  std::array<char, kCopyBytes> bytes;
  for (;;) {
    int32_t count = 0;
    if (qlxFailed(CxFileRead(from, bytes.data(), kCopyBytes, &count))) return false;
    if (count == 0) return true;
    for (int32_t done = 0, written = 0; done < count; done += written) {
      const auto rest = static_cast<uint32_t>(count - done);
      if (qlxFailed(CxFileWrite(to, bytes.data() + done, rest, &written))) return false;
    }
  }
}

static void copyActiveFile(QlxFileHandlerVars *vars) {
  if (qlxFailed(CxFileSeek(&vars->file, 0, SEEK_SET))) return;
  const OwnedStr name{qlxFHGenerationName(vars, 1)};
  CxFile generation = -1;
  // Deliberate: not truncated; what the rollover has not moved away is written over.
  const CxStatus status =
      CxFileOpenMode(&generation, name.get(), O_CREAT | O_RDWR, vars->filePermission);
  if (qlxFailed(status)) {
    std::printf("ERR opening %s pre rollover\n", name ? name.get() : "");
    return;
  }
  copyBytes(&vars->file, &generation);
  CxFileFlush(&generation);
  CxFileClose(&generation);
}

void qlxMultiProcFileHandlerRollActiveLog(QlxFileHandlerVars *vars) {
  if (!vars) return;
  copyActiveFile(vars);
  // Deliberate: whatever became of the copy, so that the file never grows past its limit.
  qlxKeepFailure(nullptr, CxFileTrunc(&vars->file));
  qlxKeepFailure(nullptr, CxFileSeek(&vars->file, 0, SEEK_SET));
}

void qlxMultiProcFileHandlerDoRollover(QlxFileHandlerVars *vars) {
  if (!vars) return;
  qlxFHShiftGenerations(vars, 1);
  qlxMultiProcFileHandlerRollActiveLog(vars);
}

// ---- Opening and closing

// Opens the active file; *setUp tells why the semaphore is not there, with the file left closed.
static CxStatus openShared(QlxFileHandlerVars *vars, CxStatus *setUp) {
  if (!vars || !vars->fullName || vars->opened == 1) return kCxSuccess;
  if (vars->semReady == 0) {
    *setUp = qlxSharedLockSetUp(vars);
    qlxKeepFailure(nullptr, *setUp);
    if (qlxFailed(*setUp)) return kCxSuccess;
  }
  qlxFileHandlerMakeDirectory(vars);
  const CxStatus status = CxFileOpenMode(&vars->file, vars->fullName, O_CREAT | O_RDWR | O_APPEND,
                                         vars->filePermission);
  qlxKeepFailure(nullptr, status);
  vars->opened = !qlxFailed(status);
  return status;
}

CxStatus QlxMultiProcFileHandlerFOpenWithErr(QlxObject *handler) {
  CxStatus setUp = kCxSuccess;
  return openShared(qlxFileHandlerVars(handler), &setUp);
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
static void writeRecord(QlxFileHandlerVars *vars, Event *event, const UChar *text) {
  qlxKeepFailure(event, qlxFileHandlerMeasure(vars));
  if (qlxFileHandlerIsFull(vars)) qlxMultiProcFileHandlerDoRollover(vars);
  qlxKeepFailure(event, qlxFileHandlerWriteText(vars, text));
}

void QlxMultiProcFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || !event || !loadEnabled(handler)) return;
  CxStatus setUp = kCxSuccess;
  qlxKeepFailure(event, openShared(vars, &setUp));
  qlxKeepFailure(event, setUp);
  if (vars->opened != 1) return;  // Deliberate: the listeners do not get the event either
  if (const OwnedUStr text{qlxIntlUHandlerDoFmt(handler, event, args)}) {
    const CxStatus lock = qlxSharedLockTake(vars);
    qlxKeepFailure(event, lock);
    if (!qlxFailed(lock)) {
      writeRecord(vars, event, text.get());
      qlxMultiProcFileHandlerUnlockSem(vars);
    }
  }
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
