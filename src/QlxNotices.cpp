#include "QlxNotices.h"

#include <array>

#include <fcntl.h>
#include <poll.h>
#include <sys/epoll.h>
#include <sys/inotify.h>
#include <unistd.h>

#include "QlxReadiness.h"

namespace {

// Above the numbers that files usually get. When a host closes all descriptors, these are found
// closed, and they do not take the number that a handler still has for its file.
constexpr int kFirstDescriptor = 500;

// Quiet questions before the flag. A process that has its contexts ends later, by some 30 ms that
// the system takes to end those (it waits for all of its processors, twice): about as long as this
// many records have taken already.
constexpr uint32_t kQuestionsBeforeSetUp = 16384;
constexpr uint32_t kQuestionsBeforeFlag = 16;  // in a row, when there are contexts

struct Flags {
  QlxReadiness told;    // set by any notice
  QlxReadiness keeper;  // of the notices' file: without it they would end unseen when it is closed
};

// The readiness of the notices is asked of an epoll descriptor: that is the cheapest question, it
// answers with an error when a host closed it, and a flag on it is set at once.
struct Notices {
  int inotify = -1;
  int epoll = -1;
  uint32_t changes = 0;
  uint32_t quiet = 0;      // questions without a notice
  Flags *flags = nullptr;  // mapped with the first flag; zeroed in a child
};
Notices gNotices;

epoll_event interest() {
  return {.events = EPOLLIN, .data = {.ptr = &gNotices}};
}

bool areOurs() {
  epoll_event same = interest();
  return gNotices.epoll != -1 &&
         epoll_ctl(gNotices.epoll, EPOLL_CTL_MOD, gNotices.inotify, &same) == 0;
}

void forget() {
  if (gNotices.flags) {
    qlxReadinessEnd(&gNotices.flags->told);
    qlxReadinessEnd(&gNotices.flags->keeper);
  }
  gNotices.inotify = gNotices.epoll = -1;
  gNotices.quiet = 0;
  ++gNotices.changes;
}

// The same file under a higher number; -1 when there is none, or no file.
int moveUp(int descriptor) {
  if (descriptor == -1) return -1;
  const int moved = fcntl(descriptor, F_DUPFD_CLOEXEC, kFirstDescriptor);
  close(descriptor);
  return moved;
}

// What the notices say does not matter.
void readAll() {
  alignas(inotify_event) std::array<char, 4096> notices;
  while (read(gNotices.inotify, notices.data(), notices.size()) > 0) continue;
  ++gNotices.changes;
}

bool mayStartFlag() {
  const bool hasContext = gNotices.flags && gNotices.flags->told.context != 0;
  return ++gNotices.quiet >= (hasContext ? kQuestionsBeforeFlag : kQuestionsBeforeSetUp);
}

// The two have contexts of their own: of the keeper's file a worker takes note with each notice,
// and must not have the lock of the other context when the next one comes.
bool startFlag() {
  gNotices.quiet = 0;
  if (!gNotices.flags) gNotices.flags = static_cast<Flags *>(qlxReadinessMap(sizeof(Flags)));
  if (!gNotices.flags || gNotices.flags->told.refused || !areOurs()) return false;
  QlxReadiness *const keeper = &gNotices.flags->keeper;
  if (!qlxReadinessIsQuiet(keeper) && !qlxReadinessStart(keeper, gNotices.inotify, 0)) return false;
  if (qlxReadinessStart(&gNotices.flags->told, gNotices.epoll, POLLIN)) return true;
  if (gNotices.flags->told.refused) qlxReadinessEnd(keeper);
  return false;
}

// The flag is not in place any more. True: it was, and was set.
bool endFlag() {
  if (!gNotices.flags || !gNotices.flags->told.pending) return false;
  const bool isSet = !gNotices.flags->told.cancelled;
  qlxReadinessEnd(&gNotices.flags->told);
  return isSet;
}

void ask() {
  const bool told = endFlag();
  epoll_event ready;
  int count = epoll_wait(gNotices.epoll, &ready, 1, 0);
  if (count == 0 && !told) [[likely]] {
    if (!mayStartFlag() || !startFlag()) [[likely]]
      return;
    // A notice that came while the flag was put in place may set it late.
    count = epoll_wait(gNotices.epoll, &ready, 1, 0);
    if (count == 0) return;
    endFlag();
  }
  if (gNotices.flags && gNotices.flags->told.context != 0) gNotices.quiet = 0;
  if (count == 0) {
    ++gNotices.changes;  // the flag alone is reason enough to look
  } else if (count < 0) {
    qlxNoticesClose();  // closed by a host, or a filter refuses the question
  } else if (ready.data.ptr == &gNotices && areOurs()) {
    readAll();
  } else {
    forget();
  }
}

}  // namespace

bool qlxNoticesOpen(void) {
  if (areOurs()) return true;
  forget();
  const int inotify = moveUp(inotify_init1(IN_NONBLOCK | IN_CLOEXEC));
  const int epoll = inotify == -1 ? -1 : moveUp(epoll_create1(EPOLL_CLOEXEC));
  epoll_event wanted = interest();
  if (epoll != -1 && epoll_ctl(epoll, EPOLL_CTL_ADD, inotify, &wanted) == 0) {
    gNotices.inotify = inotify;
    gNotices.epoll = epoll;
    return true;
  }
  for (const int descriptor : {inotify, epoll}) {
    if (descriptor != -1) close(descriptor);
  }
  return false;
}

void qlxNoticesClose(void) {
  if (areOurs()) {
    close(gNotices.epoll);
    close(gNotices.inotify);
  }
  forget();
}

uint32_t qlxNoticesChanges(void) {
  if (!qlxNoticesAreFlagged()) ask();
  return gNotices.changes;
}

int32_t qlxNoticesWatch(const char *path, uint32_t changes) {
  return inotify_add_watch(gNotices.inotify, path, changes | IN_DONT_FOLLOW | IN_MASK_ADD);
}

void qlxNoticesUnwatch(int32_t number) {
  if (number > 0 && areOurs()) inotify_rm_watch(gNotices.inotify, number);
}

bool qlxNoticesAreFlagged(void) {
  return gNotices.flags && qlxReadinessIsQuiet(&gNotices.flags->told);
}
