// The file handler: each event's text at the end of a file that rolls over by size into numbered
// generations. Every event looks at the file first, so that a file which was deleted or moved away
// is made again, other writers' bytes count, and a full file is rolled before the event is written.
#include "QlxFileHandler.h"

#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

#include <qlx/class/object.h>
#include <qlx/files.h>
#include <qlx/memory.h>
#include <qlx/toolkit.h>

#include "QlxClasses.h"
#include "QlxConfigKeys.h"
#include "QlxFileNames.h"
#include "QlxObject.h"
#include "util/CxFile.h"
#include "util/CxStatus.h"

static constexpr const char *kFirstFileName = "default.log";
static constexpr int32_t kFirstMaxBytes = 1048576;
static constexpr int32_t kDefaultMaxBytes =
    1024;  // Deliberate: of an absent key, not the first one
static constexpr int32_t kDefaultMaxFiles = 3;
static constexpr uint32_t kFirstFilePermission = 0744;
static constexpr uint32_t kFirstDirPermission = 0771;
static constexpr int32_t kFirstSemKey = 31821;

// ---- The variables

static void nameActiveFile(QlxFileHandlerVars *vars, const char *name) {
  qlxFHGetFileNameParts(name, vars);
  OslMemoryFree(vars->fullName);
  vars->fullName = qlxFHGenerationName(vars, vars->generation);
}

static void closeFile(QlxFileHandlerVars *vars) {
  vars->opened = 0;
  qlxFileWatchEnd(&vars->watch);
  if (vars->file != -1) qlxKeepFailure(nullptr, CxFileClose(&vars->file));
}

void *QlxFileHandlerFAllocVars(void) {
  auto *vars = static_cast<QlxFileHandlerVars *>(OslMemoryCalloc(1, sizeof(QlxFileHandlerVars)));
  if (!vars) return nullptr;
  vars->file = -1;
  vars->maxBytes = kFirstMaxBytes;
  vars->maxFiles = kDefaultMaxFiles;
  vars->filePermission = kFirstFilePermission;
  vars->dirPermission = kFirstDirPermission;
  vars->appending = 1;
  vars->semKey = kFirstSemKey;
  vars->semId = -1;
  vars->logInternalErrs = 1;
  nameActiveFile(vars, kFirstFileName);
  if (vars->fullName) return vars;
  QlxFileHandlerFFreeVars(vars);
  return nullptr;
}

void QlxFileHandlerFFreeVars(void *block) {
  auto *vars = static_cast<QlxFileHandlerVars *>(block);
  if (!vars) return;
  closeFile(vars);
  for (char *text :
       {vars->fullName, vars->dirPart, vars->basePart, vars->extPart, vars->encoding}) {
    OslMemoryFree(text);
  }
  OslMemoryFree(vars);
}

QlxFileHandlerVars *qlxFileHandlerVars(QlxObject *handler) {
  return handler ? static_cast<QlxFileHandlerVars *>(handler->vars) : nullptr;
}

void qlxKeepFailure(Event *event, CxStatus status) {
  if (!qlxFailed(status)) return;
  QlxReportPlatformErr(status);
  if (event) event->status = status;
}

// ---- The bytes of the active file

// The end of an append-mode file costs a tenth of its status; without that mode the seek would move
// the place of the next write.
CxStatus qlxFileHandlerMeasure(QlxFileHandlerVars *vars) {
  int64_t size = vars->appending == 1 ? lseek(vars->file, 0, SEEK_END) : -1;
  CxStatus status = kCxSuccess;
  if (size < 0) status = CxFileGetSize(&vars->file, &size);
  if (!qlxFailed(status)) vars->size = static_cast<uint64_t>(size);
  return status;
}

bool qlxFileHandlerIsFull(const QlxFileHandlerVars *vars) {
  // Deliberate: a negative limit is as unsigned the largest of all, and 0 is always reached.
  return vars->maxFiles > 1 && vars->size >= static_cast<uint64_t>(int64_t{vars->maxBytes});
}

CxStatus qlxFileHandlerWrite(QlxFileHandlerVars *vars, const char *bytes, uint32_t length) {
  return cxIntlFileWriteAll(&vars->file, bytes, length, &vars->size);
}

CxStatus qlxFileHandlerWriteText(QlxFileHandlerVars *vars, const FormattedBytes &text) {
  if (!text.data()) return cxFailure(ENOMEM);
  return qlxFileHandlerWrite(vars, text.data(), text.length());
}

// Writes a header or a trailer and frees it; null writes nothing.
static CxStatus writeFrame(QlxFileHandlerVars *vars, char *frame) {
  const OwnedStr text{frame};
  return qlxFileHandlerWrite(vars, text.get(), OslStringLen(text.get()));
}

// ---- Opening and closing

void qlxFileHandlerMakeDirectory(const QlxFileHandlerVars *vars) {
  CxFilePath path;
  CxInitFilePath(&path, vars->dirPart);
  qlxKeepFailure(nullptr, cxStatusOf(CxFilePathMkdirs(&path, vars->dirPermission)));
}

static CxStatus openFile(QlxFileHandlerVars *vars) {
  const int32_t existing = vars->appending == 1 ? O_APPEND : O_TRUNC;
  return CxFileOpenMode(&vars->file, vars->fullName, O_CREAT | O_RDWR | existing,
                        vars->filePermission);
}

static void rollOver(QlxObject *handler, QlxFileHandlerVars *vars) {
  QlxFileHandlerFClose(handler);  // the trailer goes into the full file
  qlxFileHandlerDoRollover(vars);
  vars->size = 0;
}

// Whether the open file can take the next event; if not it is closed. Deliberate: another regular
// file under its name is not noticed, what is open goes on.
static bool staysOpen(QlxObject *handler, QlxFileHandlerVars *vars) {
  if (!qlxFileWatchFindsFile(&vars->watch, vars->fullName)) {
    QlxFileHandlerFClose(handler);
    return false;
  }
  const CxStatus status = qlxFileHandlerMeasure(vars);
  if (qlxFailed(status)) {
    qlxKeepFailure(nullptr, status);
    closeFile(vars);
    return false;
  }
  if (!qlxFileHandlerIsFull(vars)) return true;
  rollOver(handler, vars);
  return false;
}

// Opens the active file with room for an event, behind its header.
static CxStatus openForEvent(QlxObject *handler, QlxFileHandlerVars *vars) {
  CxStatus status = openFile(vars);
  if (!qlxFailed(status)) status = qlxFileHandlerMeasure(vars);
  if (!qlxFailed(status) && qlxFileHandlerIsFull(vars)) {
    vars->opened = 1;  // what is open is closed with its trailer
    rollOver(handler, vars);
    status = openFile(vars);
  }
  if (qlxFailed(status)) return status;
  return writeFrame(vars, qlxIntlHandlerGetFmtHeader(handler));
}

CxStatus QlxFileHandlerFOpenWithErr(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || !vars->fullName) return kCxSuccess;
  if (vars->opened == 1 && staysOpen(handler, vars)) return kCxSuccess;
  qlxFileHandlerMakeDirectory(vars);
  const CxStatus status = openForEvent(handler, vars);
  if (qlxFailed(status)) {
    qlxKeepFailure(nullptr, status);
    closeFile(vars);
  } else {
    vars->opened = 1;
  }
  return status;
}

void QlxFileHandlerFOpen(QlxObject *handler) {
  QlxFileHandlerFOpenWithErr(handler);
}

void QlxFileHandlerFClose(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || vars->opened != 1) return;
  qlxKeepFailure(nullptr, writeFrame(vars, qlxIntlHandlerGetFmtTrailer(handler)));
  closeFile(vars);
}

// Formatting has effects of its own on the event, so it is done without an open file too.
static void formatAndWrite(QlxObject *handler, QlxFileHandlerVars *vars, Event *event,
                           va_list *args) {
  const FormattedBytes text{handler, event, args};
  if (text && vars->opened == 1) qlxKeepFailure(event, qlxFileHandlerWriteText(vars, text));
}

void QlxFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || !event || !loadEnabled(handler)) return;
  qlxKeepFailure(event, QlxFileHandlerFOpenWithErr(handler));
  formatAndWrite(handler, vars, event, args);
  QlxBasicObjectFLog(handler, event, args);
}

// ---- Configuration

// Every setting takes effect when the next event opens the file again.
static QlxFileHandlerVars *closeForChange(QlxObject *handler) {
  QlxFileHandlerFClose(handler);
  return qlxFileHandlerVars(handler);
}

template <int32_t QlxFileHandlerVars::*Field, int32_t Absent>
static void applyInt(QlxObject *handler, const char *key) {
  uint8_t found = 0;
  const int32_t value = qlxIntlGetObjPropInt(handler, key, &found);
  closeForChange(handler)->*Field = found ? value : Absent;
}

// Deliberate: both keys of a boolean read the property "appending".
static uint8_t appendingProperty(QlxObject *handler) {
  uint8_t found = 0;
  const uint8_t value = qlxIntlGetObjPropBool(handler, "appending", &found);
  return found ? value : 1;
}

static void applyAppending(QlxObject *handler, const char *) {
  closeForChange(handler)->appending = appendingProperty(handler);
}

static void applyLogInternalErrs(QlxObject *handler, const char *) {
  qlxFileHandlerVars(handler)->logInternalErrs = appendingProperty(handler);
}

static void applyFileName(QlxObject *handler, const char *key) {
  const OwnedStr name{qlxIntlGetObjProp(handler, key, nullptr)};
  const OwnedStr closedName{qlxFHCloseBaseDigits(name.get())};
  nameActiveFile(closeForChange(handler), closedName.get());
}

static void applyEncoding(QlxObject *handler, const char *key) {
  QlxFileHandlerVars *vars = closeForChange(handler);
  OslMemoryFree(vars->encoding);
  vars->encoding = qlxIntlGetObjProp(handler, key, nullptr);
}

static void readMode(uint32_t *mode, const char *text) {
  unsigned value = 0;
  if (text && sscanf(text, "%4o", &value) == 1) *mode = value;
}

void qlxFileHandlerCfgPerms(QlxObject *handler, const char *text) {
  if (auto *vars = qlxFileHandlerVars(handler)) readMode(&vars->filePermission, text);
}

void qlxFileHandlerCfgDirPerms(QlxObject *handler, const char *text) {
  if (auto *vars = qlxFileHandlerVars(handler)) readMode(&vars->dirPermission, text);
}

template <void (*Parse)(QlxObject *, const char *)>
static void applyPermission(QlxObject *handler, const char *key) {
  const OwnedStr text{qlxIntlGetObjProp(handler, key, nullptr)};
  if (!text) return;
  QlxFileHandlerFClose(handler);
  Parse(handler, text.get());
}

static constexpr ConfigKey kFileHandlerKeys[] = {
    {"fileName", applyFileName},
    {"maxFileSize", applyInt<&QlxFileHandlerVars::maxBytes, kDefaultMaxBytes>},
    {"maxFileBytes", applyInt<&QlxFileHandlerVars::maxBytes, kDefaultMaxBytes>},
    {"maxFiles", applyInt<&QlxFileHandlerVars::maxFiles, kDefaultMaxFiles>},
    {"appending", applyAppending},
    {"filePermission", applyPermission<qlxFileHandlerCfgPerms>},
    {"dirPermission", applyPermission<qlxFileHandlerCfgDirPerms>},
    {"fileEncoding", applyEncoding},
    {"MPFileSemKey", applyInt<&QlxFileHandlerVars::semKey, 0>},
    {"logInternalErrs", applyLogInternalErrs},
};

void QlxFileHandlerFCfgChange(QlxObject *handler, const char *key) {
  if (!key || !qlxFileHandlerVars(handler)) return;
  if (qlxApplyConfigKey(kFileHandlerKeys, handler, key)) return;
  QlxFileHandlerFClose(handler);
  QlxBasicHandlerFCfgChange(handler, key);
}

const ObjClass qlxFileHandlerClass = {
    .kind = Handler,
    .name = "qlx_filehandler",
    .description = nullptr,
    .op1 = {.fProcess = QlxFileUHandlerFProcess},
    .op2 = {.fOpen = QlxFileHandlerFOpen},
    .op3 = {.fClose = QlxFileHandlerFClose},
    .fAllocVars = QlxFileHandlerFAllocVars,
    .fFreeVars = QlxFileHandlerFFreeVars,
    .fCfgChange = QlxFileHandlerFCfgChange,
};
