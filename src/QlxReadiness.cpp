#include "QlxReadiness.h"

#include <array>
#include <atomic>
#include <cerrno>
#include <charconv>
#include <cstring>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

// Where the address that is a context's number leads. The ends of requests follow it.
struct Ring {
  uint32_t id;
  uint32_t places;
  uint32_t head;  // written here, when an end was taken
  uint32_t tail;  // written by the system
  uint32_t magic;
  uint32_t compatible;    // features that may be ignored
  uint32_t incompatible;  // features that may not
  uint32_t headerBytes;
};
constexpr uint32_t kMagic = 0xa10a10a1;

// One request at a time. The system then never holds the lock of the context when an event comes,
// other than by the start of the request, and can put its end into the ring at once.
constexpr unsigned kRequests = 1;

int setUpContext(unsigned requests, aio_context_t *context) {
  return static_cast<int>(syscall(SYS_io_setup, requests, context));
}
int submitRequests(aio_context_t context, long count, iocb **requests) {
  return static_cast<int>(syscall(SYS_io_submit, context, count, requests));
}
int cancelRequest(aio_context_t context, iocb *request, io_event *end) {
  return static_cast<int>(syscall(SYS_io_cancel, context, request, end));
}

Ring *ringOf(const QlxReadiness *flag) {
  return reinterpret_cast<Ring *>(flag->context);
}

bool hasEnded(const QlxReadiness *flag) {
  return std::atomic_ref(ringOf(flag)->tail).load(std::memory_order_acquire) != flag->tail;
}

void takeEnd(QlxReadiness *flag) {
  flag->tail = std::atomic_ref(ringOf(flag)->tail).load(std::memory_order_acquire);
  std::atomic_ref(ringOf(flag)->head).store(flag->tail, std::memory_order_release);
  flag->pending = flag->cancelled = 0;
}

bool readNumber(const char *path, uint64_t *number) {
  const int file = open(path, O_RDONLY | O_CLOEXEC);
  if (file == -1) return false;
  std::array<char, 32> text;
  const ssize_t bytes = read(file, text.data(), text.size());
  close(file);
  return bytes > 0 && std::from_chars(text.data(), text.data() + bytes, *number).ec == std::errc{};
}

// The limit holds for the whole system. Databases do not start without their share of it, so half
// of it stays theirs.
bool isLeft() {
  uint64_t inUse, limit;
  return readNumber(qlxAioCalls.inUse, &inUse) && readNumber(qlxAioCalls.limit, &limit) &&
         inUse + kRequests <= limit / 2;
}

bool isKnown(const Ring *ring) {
  return ring->magic == kMagic && ring->incompatible == 0 && ring->headerBytes == sizeof(Ring) &&
         ring->places != 0;
}

bool setUp(QlxReadiness *flag) {
  if (!isLeft()) return false;
  if (qlxAioCalls.setUp(kRequests, &flag->context) != 0) {
    flag->context = 0;
    return false;
  }
  if (!isKnown(ringOf(flag))) return false;
  flag->tail = ringOf(flag)->tail;
  return true;
}

}  // namespace

QlxAioCalls qlxAioCalls = {.setUp = setUpContext,
                           .submit = submitRequests,
                           .cancel = cancelRequest,
                           .inUse = "/proc/sys/fs/aio-nr",
                           .limit = "/proc/sys/fs/aio-max-nr"};

void *qlxReadinessMap(size_t bytes) {
  void *const map =
      mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (map == MAP_FAILED) return nullptr;
  if (madvise(map, bytes, MADV_WIPEONFORK) == 0) return map;
  munmap(map, bytes);
  return nullptr;
}

bool qlxReadinessStart(QlxReadiness *flag, int descriptor, uint16_t events) {
  if (flag->refused) return false;
  if (flag->pending) {
    if (!hasEnded(flag)) return false;
    takeEnd(flag);
  }
  if (flag->context == 0 && !setUp(flag)) {
    flag->refused = 1;
    return false;
  }
  flag->request = {};
  flag->request.aio_lio_opcode = IOCB_CMD_POLL;
  flag->request.aio_fildes = static_cast<uint32_t>(descriptor);
  flag->request.aio_buf = events;
  iocb *request = &flag->request;
  flag->pending = qlxAioCalls.submit(flag->context, 1, &request) == 1;
  flag->refused = !flag->pending && errno != EBADF;  // a host may have closed the descriptor
  return flag->pending;
}

bool qlxReadinessIsQuiet(const QlxReadiness *flag) {
  return flag->pending && !flag->cancelled && !hasEnded(flag);
}

void qlxReadinessEnd(QlxReadiness *flag) {
  if (!flag->pending) return;
  if (hasEnded(flag)) return takeEnd(flag);
  if (flag->cancelled) return;
  io_event none;
  qlxAioCalls.cancel(flag->context, &flag->request, &none);  // it ends in the ring, as any
  flag->cancelled = 1;
}
