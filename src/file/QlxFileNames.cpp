// The naming of log files: a configured name is taken apart into directory, base, number and
// extension, and put together again for each generation.
#include "QlxFileNames.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>

#include <qlx/files.h>
#include <qlx/memory.h>
#include <qlx/system.h>
#include <qlx/toolkit.h>

#include "QlxProblems.h"
#include "util/CxOwned.h"
#include "util/CxStatus.h"

static constexpr uint32_t kMaxNameBytes = sizeof(QlxFileName) - 1;
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

void qlxGetNativePath(const char *name, QlxFileName buffer) {
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

static void clearParts(QlxLogNames *names) {
  replacePart(&names->dirPart, nullptr);
  replacePart(&names->basePart, nullptr);
  replacePart(&names->extPart, nullptr);
  names->generation = 0;
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
  const auto number = static_cast<int32_t>(strtol(digits, nullptr, 10));  // without digits 0
  *digits = '\0';
  return number;
}

// The working directory in `buffer`; a failure is reported and leaves it empty.
static void getCurrentDirectory(QlxFileName buffer) {
  const CxStatus status = CxProcessGetCwd(buffer, kMaxNameBytes + 1);
  if (cxFailed(status)) QlxReportPlatformErr(status);
  std::replace(buffer, buffer + OslStringLen(buffer), '\\', '/');  // as in the name
}

void qlxFHGetFileNameParts(const char *name, QlxLogNames *names) {
  if (!names) return;
  clearParts(names);
  names->nameError = OslStringLen(name) > kMaxNameBytes ? ENAMETOOLONG : 0;
  if (!name || names->nameError != 0) return;
  QlxFileName stem;
  qlxGetNativePath(name, stem);

  // Deliberate: a dot in a directory's name, with none in the file's, makes all behind it the
  // extension.
  char *dot = OslStringRChr(stem, '.');
  if (dot) names->extPart = OslStringDup(dot + 1);
  if (dot) *dot = '\0';
  names->generation = cutNumber(stem);
  // Deliberate: the base keeps the separator before it, so that names with one get "//".
  char *separator = OslStringRChr(stem, '/');
  names->basePart = cutOff(separator ? separator : stem);
  if (!*stem) getCurrentDirectory(stem);
  if (*stem) names->dirPart = OslStringDup(stem);

  const bool complete = names->basePart && (!dot || names->extPart) && (!*stem || names->dirPart);
  if (complete) return;
  clearParts(names);  // half a name could be that of somebody else's file
  names->nameError = ENOMEM;
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

char *qlxFHGenerationName(const QlxLogNames *names, int32_t generation) {
  char *name = nullptr;
  qlxSetFileNameParts(&name, names->dirPart, names->basePart, generation, names->extPart);
  return name;
}

uint8_t qlxFHWriteName(const QlxLogNames *names, int32_t generation, QlxFileName name) {
  const auto orNone = [](const char *part) { return part ? part : ""; };
  char number[kMaxNumberBytes] = "";
  if (generation != 0) OslStringSprintf(number, "%d", generation);
  name[0] = '\0';
  if (!names->basePart) return 0;
  const int length = snprintf(name, sizeof(QlxFileName), "%s%s%s%s%s%s", orNone(names->dirPart),
                              names->dirPart ? "/" : "", names->basePart, number,
                              names->extPart ? "." : "", orNone(names->extPart));
  const bool fits = length >= 0 && static_cast<uint32_t>(length) <= kMaxNameBytes;
  if (!fits) name[0] = '\0';
  return fits;
}

CxStatus qlxFHCheckNames(const QlxLogNames *names) {
  if (names->nameError != 0) return cxFailure(names->nameError);
  QlxFileName longest;
  const int32_t last = names->maxFiles > 1 ? names->maxFiles - 1 : 0;
  const bool fits = !names->fullName || qlxFHWriteName(names, last, longest);
  return cxStatusOf(fits ? 0 : ENAMETOOLONG);
}
