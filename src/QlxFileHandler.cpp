// The file handler: each event's text at the end of a file that rolls over by size into numbered
// generations. Every event looks at the file first, so that a file which was deleted or moved away
// is made again, other writers' bytes count, and a full file is rolled before the event is written.
#include "QlxFileHandler.h"

#include <cerrno>
#include <cstdio>
#include <fcntl.h>

#include <qlx/class/object.h>
#include <qlx/files.h>
#include <qlx/memory.h>
#include <qlx/toolkit.h>

#include "QlxObject.h"
#include "QlxProps.h"
#include "object/QlxClasses.h"
#include "object/QlxConfigKeys.h"
#include "object/QlxObjClass.h"
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
  if (vars->basePart && !vars->fullName) vars->nameError = ENOMEM;
  vars->rollFailed = vars->torn = vars->keepWritten = 0;  // those were of another file
}

static void closeFile(QlxFileHandlerVars *vars) {
  vars->opened = 0;
  qlxKeepFailure(nullptr, qlxLogFileClose(vars));
}

void *QlxFileHandlerFAllocVars(void) {
  auto *vars = static_cast<QlxFileHandlerVars *>(OslMemoryCalloc(1, sizeof(QlxFileHandlerVars)));
  if (!vars) return nullptr;
  vars->file = vars->reserve = -1;
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

// ---- The bytes of the active file

bool qlxFileHandlerIsFull(const QlxFileHandlerVars *vars) {
  // Deliberate: a negative limit is as unsigned the largest of all, and 0 is always reached.
  return vars->rolls && vars->maxFiles > 1 &&
         vars->size >= static_cast<uint64_t>(int64_t{vars->maxBytes});
}

CxStatus qlxFileHandlerWriteText(QlxFileHandlerVars *vars, const FormattedBytes &text) {
  if (!text.data()) return cxFailure(ENOMEM);
  return qlxLogFileWrite(vars, text.data(), text.length());
}

// Writes a header or a trailer and frees it; null writes nothing.
static CxStatus writeFrame(QlxFileHandlerVars *vars, char *frame) {
  const OwnedStr text{frame};
  return qlxLogFileWrite(vars, text.get(), OslStringLen(text.get()));
}

// ---- Opening and closing

void qlxFileHandlerMakeDirectory(const QlxFileHandlerVars *vars) {
  CxFilePath path;
  CxInitFilePath(&path, vars->dirPart);
  qlxKeepFailure(nullptr, cxStatusOf(CxFilePathMkdirs(&path, vars->dirPermission & 0777)));
}

static CxStatus openFile(QlxFileHandlerVars *vars) {
  return qlxLogFileOpen(vars, vars->fullName, vars->appending == 1 ? O_APPEND : O_TRUNC);
}

void qlxFileHandlerDoRollover(QlxFileHandlerVars *vars) {
  if (vars && !cxFailed(qlxFHCheckNames(vars))) qlxMoveActiveFile(vars);
}

// False when the full file has to take the next event too.
static bool rollOver(QlxObject *handler, QlxFileHandlerVars *vars) {
  if (!qlxMoveActiveFile(vars)) return false;
  QlxFileHandlerFClose(handler);  // the trailer goes into the full file
  vars->size = 0;
  vars->keepWritten |= vars->followName;  // another writer may be the first in the new file
  return true;
}

// Closes a file to which its name leads no more. Deliberate: without followName another regular
// file under the name is not noticed, what is open goes on. With it what stands there is somebody
// else's, and appended to.
static bool leaveIfNotNamed(QlxObject *handler, QlxFileHandlerVars *vars) {
  bool isOther = false;
  const CxStatus there = qlxLogFileFindName(vars, vars->fullName, &isOther);
  if (!cxFailed(there) && !(isOther && vars->followName)) return false;
  QlxFileHandlerFClose(handler);
  const bool mayBeThere = there.code != ENOENT;  // with all that was written
  vars->keepWritten |= mayBeThere || vars->followName;
  return true;
}

// Whether the open file can take the next event; if not it is closed. Between two looks own bytes
// are counted; what the count calls full is measured.
static bool staysOpen(QlxObject *handler, QlxFileHandlerVars *vars) {
  if (!cxLookAgain(&vars->look) && !qlxFileHandlerIsFull(vars)) return true;
  const CxStatus status = qlxLogFileMeasure(vars);
  if (cxFailed(status)) {
    qlxKeepFailure(nullptr, status);
    closeFile(vars);
    vars->keepWritten = 1;
    return false;
  }
  if (!vars->rolls) return true;
  if (leaveIfNotNamed(handler, vars)) return false;
  return !qlxFileHandlerIsFull(vars) || !rollOver(handler, vars);
}

// Opens the active file with room for an event, behind its header.
static CxStatus openForEvent(QlxObject *handler, QlxFileHandlerVars *vars) {
  CxStatus status = openFile(vars);
  if (!cxFailed(status) && qlxFileHandlerIsFull(vars)) {
    vars->opened = 1;  // what is open is closed with its trailer
    if (rollOver(handler, vars)) status = openFile(vars);
  }
  if (cxFailed(status)) return status;
  return writeFrame(vars, qlxIntlHandlerGetFmtHeader(handler));
}

CxStatus QlxFileHandlerFOpenWithErr(QlxObject *handler) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars) return kCxSuccess;
  if (vars->opened == 1 && staysOpen(handler, vars)) return kCxSuccess;
  CxStatus status = qlxFHCheckNames(vars);
  if (!cxFailed(status) && !vars->fullName) return status;
  if (!cxFailed(status)) {
    qlxFileHandlerMakeDirectory(vars);
    status = openForEvent(handler, vars);
  }
  if (cxFailed(status)) {
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
  const bool isOurs = !cxFailed(qlxLogFileMeasure(vars));
  if (isOurs) qlxKeepFailure(nullptr, writeFrame(vars, qlxIntlHandlerGetFmtTrailer(handler)));
  closeFile(vars);
}

// A descriptor that was taken away since the last look: the record goes into the file of the name.
static CxStatus writeAnew(QlxObject *handler, QlxFileHandlerVars *vars,
                          const FormattedBytes &text) {
  closeFile(vars);
  const CxStatus status = QlxFileHandlerFOpenWithErr(handler);
  return cxFailed(status) ? status : qlxFileHandlerWriteText(vars, text);
}

// Formatting has effects of its own on the event, so it is done without an open file too.
static void formatAndWrite(QlxObject *handler, QlxFileHandlerVars *vars, Event *event,
                           va_list *args) {
  const bool isOpen = vars->opened == 1;  // unless a host's formatter closes it
  FormattedBytes text;
  if (!text.format(handler, event, args) || !isOpen) return;
  CxStatus status = qlxFileHandlerWriteText(vars, text);
  if (status.code == EBADF) status = writeAnew(handler, vars, text);
  qlxKeepLost(event, status);
}

void QlxFileUHandlerFProcess(QlxObject *handler, Event *event, va_list *args) {
  QlxFileHandlerVars *vars = qlxFileHandlerVars(handler);
  if (!vars || !event || !loadEnabled(handler)) return;
  qlxKeepLost(event, QlxFileHandlerFOpenWithErr(handler));
  formatAndWrite(handler, vars, event, args);
  QlxBasicObjectFLog(handler, event, args);
}

// ---- Configuration

// Every setting takes effect when the next event opens the file again.
static QlxFileHandlerVars *closeForChange(QlxObject *handler) {
  QlxFileHandlerFClose(handler);
  return qlxFileHandlerVars(handler);
}

template <auto Field, int32_t Absent>
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

template <auto Field>
static void applyBool(QlxObject *handler, const char *key) {
  uint8_t found = 0;
  const uint8_t value = qlxIntlGetObjPropBool(handler, key, &found);
  closeForChange(handler)->*Field = found ? value : 0;
}

static void applyFileName(QlxObject *handler, const char *key) {
  const char *name = qlxPeekMapProp(handler->props, key);
  const OwnedStr closedName{qlxFHCloseBaseDigits(name)};
  QlxFileHandlerVars *vars = closeForChange(handler);
  nameActiveFile(vars, closedName.get());
  if (name && !closedName) vars->nameError = ENOMEM;
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
    {"keepFullFile", applyBool<&QlxFileHandlerVars::keepFullFile>},
    {"followName", applyBool<&QlxFileHandlerVars::followName>},
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
    .own = &kTakesNotes,
};
