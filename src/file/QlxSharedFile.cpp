// The copy of a shared file, the emptying of it, and when one that stays full is tried again.
#include "QlxSharedFile.h"

#include <array>
#include <cerrno>
#include <cstdio>

#include <fcntl.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <qlx/memory.h>

#include "QlxProblems.h"
#include "util/CxFile.h"
#include "util/CxStatus.h"

static constexpr uint32_t kCopyBytes = 8192;
static constexpr int64_t kNanosecondsBetweenTries = 1000000000;

// ---- Copying and emptying

// True for a success.
static bool keep(QlxSharedFile *shared, Event *event, CxStatus status) {
  qlxKeepRollover(event, status, shared->fullName);
  return !cxFailed(status);
}

// Copies from the place of one descriptor on to another.
static CxStatus copyBytes(CxFile *from, CxFile *to) {
  std::array<char, kCopyBytes> bytes;
  uint64_t copied = 0;
  for (;;) {
    int32_t count = 0;
    CxStatus status =
        cxUntilDone([&] { return CxFileRead(from, bytes.data(), kCopyBytes, &count); });
    if (cxFailed(status) || count == 0) return status;
    status = cxFileWriteAll(to, bytes.data(), static_cast<uint32_t>(count), &copied);
    if (cxFailed(status)) return status;
  }
}

// A file that is much larger than what is free: the copy would fill the disk first.
static CxStatus checkRoom(const QlxSharedFile *shared) {
  struct statvfs system;
  if (fstatvfs(shared->file, &system) != 0) return kCxSuccess;  // it does not say
  return cxStatusOf(shared->size / 2 > uint64_t{system.f_bfree} * system.f_frsize ? ENOSPC : 0);
}

// Whatever stands there under the name, such as a link to another file, goes: nothing else than a
// new file is written. With keepFullFile it was moved before, so what stands there is new and
// stays.
static CxStatus clearName(const QlxSharedFile *shared, const char *name) {
  if (shared->keepFullFile) return kCxSuccess;
  return cxUntilDone([&] { return cxStatusOfCall(unlink(name) == 0 || errno == ENOENT); });
}

static CxStatus makeGeneration(QlxSharedFile *shared, const char *name, CxFile *generation) {
  const auto open = [&] {
    return qlxOpenHigh(generation, name, O_CREAT | O_EXCL | O_NOFOLLOW | O_RDWR,
                       shared->filePermission);
  };
  CxStatus status = clearName(shared, name);
  if (!cxFailed(status)) status = open();
  const bool noNumbers = status.code == EMFILE || status.code == ENFILE;
  return noNumbers && qlxLogFileSpend(shared) ? open() : status;
}

static bool copyTo(CxFile *generation, QlxSharedFile *shared, Event *event) {
  bool copied = keep(shared, event, copyBytes(&shared->file, generation));
  if (!copied && shared->keepFullFile) CxFileTrunc(generation);  // should it not be removed
  copied &= keep(shared, event, cxUntilDone([&] { return CxFileFlush(generation); }));
  copied &= keep(shared, event, CxFileClose(generation));
  qlxLogFileReserve(shared);
  return copied;
}

// `made` becomes the name of the generation as soon as it is there.
static bool copyToFirstGeneration(QlxSharedFile *shared, Event *event, QlxFileName made) {
  QlxFileName name;
  qlxFHWriteName(shared, 1, name);
  CxFile generation = -1;
  if (!keep(shared, event, makeGeneration(shared, name, &generation))) {
    std::printf("ERR opening %s pre rollover\n", name);
    return false;
  }
  OslStringCpy(made, name);
  return copyTo(&generation, shared, event);
}

static bool copyActiveFile(QlxSharedFile *shared, Event *event, QlxFileName made) {
  const bool hasRoom = keep(shared, event, checkRoom(shared));
  if (!hasRoom && shared->keepFullFile) return false;
  return keep(shared, event, CxFileSeek(&shared->file, 0, SEEK_SET)) &&
         copyToFirstGeneration(shared, event, made);
}

// Who does not wait for the semaphore may have appended again before the new size is seen.
static bool emptyActiveFile(QlxSharedFile *shared, Event *event) {
  if (!keep(shared, event, qlxLogFileMeasure(shared))) return false;  // not ours any more
  const uint64_t before = shared->size;
  const auto empty = [&] { return cxStatusOfCall(ftruncate(shared->file, 0) == 0); };
  const bool emptied = keep(shared, event, cxUntilDone(empty));
  keep(shared, event, CxFileSeek(&shared->file, 0, SEEK_SET));
  const bool isSmaller = !cxFailed(qlxLogFileMeasure(shared)) && shared->size < before;
  return emptied || isSmaller;
}

bool qlxSharedFileCopyAndEmpty(QlxSharedFile *shared, Event *event) {
  QlxFileName made = "";
  const bool copied = copyActiveFile(shared, event, made);
  // Deliberate: else whatever became of the copy, so that the file never grows past its limit.
  const bool emptied = (copied || !shared->keepFullFile) && emptyActiveFile(shared, event);
  if (!emptied && made[0]) unlink(made);
  return emptied;
}

// ---- A file that stays full

bool qlxSharedFileWaits(const QlxSharedFile *shared) {
  return shared->rollFailed && cxLookTick() - shared->lastRollTry < kNanosecondsBetweenTries;
}

void qlxSharedFileRollOver(QlxSharedFile *shared, Event *event) {
  const bool mayComeAgain = shared->keepFullFile || shared->rollFailed;
  const auto makeRoom = mayComeAgain ? qlxFreeFirstGeneration : qlxShiftGenerations;
  const bool hasRoom = makeRoom(shared, event) || !shared->keepFullFile;
  shared->rollFailed = !hasRoom || !qlxSharedFileCopyAndEmpty(shared, event);
  shared->lastRollTry = cxLookTick();
}
