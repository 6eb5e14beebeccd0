// The multi-process file handler: several processes append to one file. A semaphore serialises the
// size check, the rollover and the write of each record. The active file never changes its name: it
// is copied to generation 1 and truncated in place, so every process's descriptor stays valid.
#include "QlxMultiProcFileHandler.h"

#include <array>
#include <cerrno>
#include <cstdio>

#include <fcntl.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <qlx/class/object.h>
#include <qlx/files.h>
#include <qlx/memory.h>

#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "QlxObject.h"
#include "util/CxFile.h"
#include "util/CxStatus.h"

static constexpr uint32_t kCopyBytes = 8192;

// ---- Rolling over. Failures are reported and stored in the event, which may be null.

// True for a success.
static bool keep(QlxFileHandlerVars *vars, Event *event, CxStatus status) {
  qlxKeepRollover(event, status, vars->fullName);
  return !qlxFailed(status);
}

// Copies from the place of one descriptor on to another.
static CxStatus copyBytes(CxFile *from, CxFile *to) {
  std::array<char, kCopyBytes> bytes;
  uint64_t copied = 0;
  for (;;) {
    int32_t count = 0;
    CxStatus status =
        cxUntilDone([&] { return CxFileRead(from, bytes.data(), kCopyBytes, &count); });
    if (qlxFailed(status) || count == 0) return status;
    status = cxFileWriteAll(to, bytes.data(), static_cast<uint32_t>(count), &copied);
    if (qlxFailed(status)) return status;
  }
}

// A file that is much larger than what is free: the copy would fill the disk first.
static CxStatus checkRoom(const QlxFileHandlerVars *vars) {
  struct statvfs system;
  if (fstatvfs(vars->file, &system) != 0) return kCxSuccess;  // it does not say
  return cxStatusOf(vars->size / 2 > uint64_t{system.f_bfree} * system.f_frsize ? ENOSPC : 0);
}

// Whatever stands there under the name, such as a link to another file, goes: nothing else than a
// new file is written. With keepFullFile it was moved before, so what stands there is new and
// stays.
static CxStatus clearName(const QlxFileHandlerVars *vars, const char *name) {
  if (vars->keepFullFile) return kCxSuccess;
  return cxUntilDone([&] { return cxStatusOfCall(unlink(name) == 0 || errno == ENOENT); });
}

static CxStatus makeGeneration(QlxFileHandlerVars *vars, const char *name, CxFile *generation) {
  const auto open = [&] {
    return qlxOpenHigh(generation, name, O_CREAT | O_EXCL | O_NOFOLLOW | O_RDWR,
                       vars->filePermission);
  };
  CxStatus status = clearName(vars, name);
  if (!qlxFailed(status)) status = open();
  const bool noNumbers = status.code == EMFILE || status.code == ENFILE;
  return noNumbers && qlxLogFileSpend(vars) ? open() : status;
}

static bool copyTo(CxFile *generation, QlxFileHandlerVars *vars, Event *event) {
  bool copied = keep(vars, event, copyBytes(&vars->file, generation));
  if (!copied && vars->keepFullFile) CxFileTrunc(generation);  // should it not be removed
  copied &= keep(vars, event, cxUntilDone([&] { return CxFileFlush(generation); }));
  copied &= keep(vars, event, CxFileClose(generation));
  qlxLogFileReserve(vars);
  return copied;
}

// `made` becomes the name of the generation as soon as it is there.
static bool copyToFirstGeneration(QlxFileHandlerVars *vars, Event *event, QlxFileName made) {
  QlxFileName name;
  qlxFHWriteName(vars, 1, name);
  CxFile generation = -1;
  if (!keep(vars, event, makeGeneration(vars, name, &generation))) {
    std::printf("ERR opening %s pre rollover\n", name);
    return false;
  }
  OslStringCpy(made, name);
  return copyTo(&generation, vars, event);
}

static bool copyActiveFile(QlxFileHandlerVars *vars, Event *event, QlxFileName made) {
  const bool hasRoom = keep(vars, event, checkRoom(vars));
  if (!hasRoom && vars->keepFullFile) return false;
  return keep(vars, event, CxFileSeek(&vars->file, 0, SEEK_SET)) &&
         copyToFirstGeneration(vars, event, made);
}

// Who does not wait for the semaphore may have appended again before the new size is seen.
static bool emptyActiveFile(QlxFileHandlerVars *vars, Event *event) {
  if (!keep(vars, event, qlxLogFileMeasure(vars))) return false;  // not ours any more
  const uint64_t before = vars->size;
  const auto empty = [&] { return cxStatusOfCall(ftruncate(vars->file, 0) == 0); };
  const bool emptied = keep(vars, event, cxUntilDone(empty));
  keep(vars, event, CxFileSeek(&vars->file, 0, SEEK_SET));
  const bool isSmaller = !qlxFailed(qlxLogFileMeasure(vars)) && vars->size < before;
  return emptied || isSmaller;
}

// False when the file is as full as before; then there is no copy of it either.
static bool rollActiveFile(QlxFileHandlerVars *vars, Event *event) {
  QlxFileName made = "";
  const bool copied = copyActiveFile(vars, event, made);
  // Deliberate: else whatever became of the copy, so that the file never grows past its limit.
  const bool emptied = (copied || !vars->keepFullFile) && emptyActiveFile(vars, event);
  if (!emptied && made[0]) unlink(made);
  return emptied;
}

// ---- A file that stays full is copied once a second, and costs no older generation.

static constexpr int64_t kNanosecondsBetweenTries = 1000000000;

static bool waitsForNextTry(const QlxFileHandlerVars *vars) {
  return vars->stuck && cxLookTick() - vars->stuckSince < kNanosecondsBetweenTries;
}

static void rollOver(QlxFileHandlerVars *vars, Event *event) {
  const bool mayComeAgain = vars->keepFullFile || vars->stuck;
  const auto makeRoom = mayComeAgain ? qlxFreeFirstGeneration : qlxShiftGenerations;
  const bool hasRoom = makeRoom(vars, event) || !vars->keepFullFile;
  vars->stuck = !hasRoom || !rollActiveFile(vars, event);
  vars->stuckSince = cxLookTick();
}

static bool mayRoll(QlxFileHandlerVars *vars) {
  return vars && !qlxFailed(qlxFHCheckNames(vars));
}

void qlxMultiProcFileHandlerRollActiveLog(QlxFileHandlerVars *vars) {
  if (mayRoll(vars)) rollActiveFile(vars, nullptr);
}

void qlxMultiProcFileHandlerDoRollover(QlxFileHandlerVars *vars) {
  if (mayRoll(vars)) rollOver(vars, nullptr);
}

// ---- The semaphore, with its failures reported

static uint8_t succeeds(CxStatus status) {
  qlxKeepFailure(nullptr, status);
  return !qlxFailed(status);
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
  vars->opened = !qlxFailed(status);
  if (vars->opened == 1) qlxLogFileReserve(vars);
  return status;
}

// Opens the file, if there is one to open. Without the semaphore it stays closed.
static CxStatus openShared(QlxFileHandlerVars *vars) {
  if (!vars || vars->opened == 1) return kCxSuccess;
  CxStatus status = qlxFHCheckNames(vars);
  if (qlxFailed(status) || !vars->fullName) return status;
  if (vars->semReady != 1) status = qlxSharedLockSetUp(vars);
  return qlxFailed(status) ? status : openFile(vars);
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
  if (!qlxFailed(qlxLogFileMeasure(vars))) return kCxSuccess;
  qlxKeepFailure(nullptr, qlxLogFileClose(vars));
  return openFile(vars);
}

// Runs while this process holds the semaphore.
static CxStatus checkSizeAndWrite(QlxFileHandlerVars *vars, Event *event,
                                  const FormattedBytes &text) {
  const CxStatus status = measureOurs(vars);
  if (qlxFailed(status)) return status;
  if (qlxFileHandlerIsFull(vars) && !waitsForNextTry(vars)) rollOver(vars, event);
  return qlxFileHandlerWriteText(vars, text);
}

// Deliberate: a record whose lock fails is dropped; the event tells of it.
static void writeText(QlxFileHandlerVars *vars, Event *event, const FormattedBytes &text) {
  CxStatus status = qlxSharedLockTake(vars);
  if (!qlxFailed(status)) {
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
