// The naming of log files: a configured name is taken apart into directory, base, number and
// extension, and put together again for each generation; a rollover moves the generations up.
#include "QlxFileNames.h"

#include <cerrno>
#include <cstring>
#include <utility>

#include <qlx/class/props.h>
#include <qlx/files.h>
#include <qlx/memory.h>
#include <qlx/system.h>
#include <qlx/toolkit.h>

#include "util/CxOwned.h"
#include "util/CxStatus.h"

static constexpr uint32_t kMaxNameBytes = 256;
static constexpr uint32_t kMaxNumberBytes = sizeof "-2147483648";

int32_t qlxFHTrailingBaseDigit(const char *name) {
  if (!name) return -1;
  // Deliberate: the last dot of the whole name, also when it stands in a directory's name.
  const char *dot = OslStringRChr(name, '.');
  const char *end = dot ? dot : name + OslStringLen(name);
  if (end == name || !CxIsLocalDigit(end[-1])) return -1;
  return static_cast<int32_t>(end - 1 - name);
}

char *qlxFHCloseBaseDigits(const char *name) {
  const int32_t digit = qlxFHTrailingBaseDigit(name);
  if (digit < 0) return OslStringDup(name);
  const uint32_t head = static_cast<uint32_t>(digit) + 1;
  auto *closed = static_cast<char *>(OslMemoryMalloc(OslStringLen(name) + sizeof "_"));
  if (!closed) return nullptr;
  memcpy(closed, name, head);
  closed[head] = '_';
  OslStringCpy(closed + head + 1, name + head);
  return closed;
}

void qlxGetNativePath(const char *name, char buffer[kMaxNameBytes + 1]) {
  if (!buffer) return;
  buffer[0] = '\0';
  CxFileNameGetNative(name, buffer, kMaxNameBytes);
  buffer[kMaxNameBytes] = '\0';
}

// ---- Taking a name apart

static void replacePart(char **part, char *text) {
  OslMemoryFree(*part);
  *part = text;
}

static void clearParts(QlxFileHandlerVars *vars) {
  replacePart(&vars->dirPart, nullptr);
  replacePart(&vars->basePart, nullptr);
  replacePart(&vars->extPart, nullptr);
  vars->generation = 0;
}

// Cuts what begins at `place` off its text; the new copy is null when memory ran out.
static char *cutOff(char *place) {
  char *text = OslStringDup(place);
  *place = '\0';
  return text;
}

static int32_t cutNumber(char *stem) {
  char *digits = stem + OslStringLen(stem);
  while (digits > stem && digits[-1] >= '0' && digits[-1] <= '9') --digits;
  const int32_t number = qlxPropStrToInt32(digits, nullptr);  // without digits 0
  *digits = '\0';
  return number;
}

// The working directory in `buffer`; a failure is reported and leaves it empty.
static void getCurrentDirectory(char buffer[kMaxNameBytes + 1]) {
  const CxStatus status = CxProcessGetCwd(buffer, kMaxNameBytes + 1);
  if (qlxFailed(status)) QlxReportPlatformErr(status);
}

void qlxFHGetFileNameParts(const char *name, QlxFileHandlerVars *vars) {
  if (!vars) return;
  clearParts(vars);
  if (!name || OslStringLen(name) > kMaxNameBytes) return;
  char stem[kMaxNameBytes + 1];
  qlxGetNativePath(name, stem);

  // Deliberate: a dot in a directory's name, with none in the file's, makes all behind it the
  // extension.
  char *dot = OslStringRChr(stem, '.');
  if (dot) vars->extPart = OslStringDup(dot + 1);
  if (dot) *dot = '\0';
  vars->generation = cutNumber(stem);
  // Deliberate: the base keeps the separator before it, so that names with one get "//".
  char *separator = OslStringRChr(stem, '/');
  vars->basePart = cutOff(separator ? separator : stem);
  if (!*stem) getCurrentDirectory(stem);
  if (*stem) vars->dirPart = OslStringDup(stem);

  const bool complete = vars->basePart && (!dot || vars->extPart) && (!*stem || vars->dirPart);
  if (!complete) clearParts(vars);  // half a name could be that of somebody else's file
}

// ---- Putting a name together

void qlxSetFileNameParts(char **out, const char *dir, const char *base, int32_t generation,
                         const char *ext) {
  if (!out) return;
  *out = nullptr;
  if (!base) return;
  char number[kMaxNumberBytes] = "";
  if (generation != 0) OslStringSprintf(number, "%d", generation);
  const char *const parts[] = {dir, dir ? "/" : nullptr, base, number, ext ? "." : nullptr, ext};
  *out = QlxStrACat(static_cast<int32_t>(std::size(parts)), parts, nullptr);
}

char *qlxFHGenerationName(const QlxFileHandlerVars *vars, int32_t generation) {
  char *name = nullptr;
  qlxSetFileNameParts(&name, vars->dirPart, vars->basePart, generation, vars->extPart);
  return name;
}

// ---- Moving the generations up

static void keepUnlessMissing(Event *event, CxStatus status) {
  if (status.code != ENOENT) qlxKeepFailure(event, status);
}

void qlxFHShiftGenerations(const QlxFileHandlerVars *vars, int32_t lowest, Event *event) {
  if (!vars || vars->maxFiles < 2) return;
  const int32_t last = vars->maxFiles - 1;
  OwnedStr to{qlxFHGenerationName(vars, last)};
  if (to) keepUnlessMissing(event, CxFileNameRemove(to.get()));
  for (int32_t i = last - 1; to && i >= lowest; --i) {
    OwnedStr from{qlxFHGenerationName(vars, i)};
    if (from) keepUnlessMissing(event, CxFileNameRename(from.get(), to.get()));
    to = std::move(from);
  }
  // A name that cannot be made ends the moving: the files below must not replace one that stayed.
  if (!to) qlxKeepFailure(event, cxFailure(ENOMEM));
}

void qlxFileHandlerDoRollover(QlxFileHandlerVars *vars) {
  qlxFHShiftGenerations(vars, 0, nullptr);
}
