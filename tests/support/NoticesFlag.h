// The flag that stands for a question to the system, as tests reach it.
#ifndef QLX_TESTS_NOTICESFLAG_H
#define QLX_TESTS_NOTICESFLAG_H

#include "QlxNotices.h"
#include "QlxReadiness.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <fstream>

#include <linux/aio_abi.h>
#include <poll.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "QlxLocked.h"

inline bool isFlagged() {
  const ApiLock lock;
  return qlxNoticesAreFlagged();
}

// Asks until the answer comes from memory: how often. A request that was cancelled comes first, and
// its end may have to wait for a processor.
template <typename Ask>
int askUntilFlagged(Ask ask) {
  const auto latest = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  int count = 0;
  for (; !isFlagged(); ++count) {
    ask();
    if (std::chrono::steady_clock::now() < latest) continue;
    ADD_FAILURE() << "no flag";
    return count;
  }
  return count;
}

// Whether this machine has the requests, found out without the library. The context stays: to end
// it takes longer than the tests.
inline bool systemHasFlags() {
  static const bool has = [] {
    uint64_t inUse = 0, limit = 0;
    std::ifstream("/proc/sys/fs/aio-nr") >> inUse;
    std::ifstream("/proc/sys/fs/aio-max-nr") >> limit;
    aio_context_t context = 0;
    if (inUse + 100 > limit / 2) return false;
    if (syscall(SYS_io_setup, 1, &context) != 0) return false;
    int ends[2];
    if (pipe(ends) != 0) return false;
    static iocb request = {};
    request.aio_lio_opcode = IOCB_CMD_POLL;
    request.aio_fildes = static_cast<uint32_t>(ends[0]);
    request.aio_buf = POLLIN;
    iocb *requests = &request;
    const bool taken = syscall(SYS_io_submit, context, 1, &requests) == 1;
    for (const int end : ends) close(end);
    return taken;
  }();
  return has;
}

#endif
