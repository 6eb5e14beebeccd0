// The system calls of a piece of work, as the kernel tells them.
#ifndef QLX_TESTS_SEENCALLS_H
#define QLX_TESTS_SEENCALLS_H

#include <atomic>
#include <cstddef>
#include <functional>
#include <optional>
#include <set>
#include <thread>
#include <vector>

#include <linux/filter.h>
#include <linux/seccomp.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

// Puts a filter in front of the system calls of this thread and of those it starts. The result of
// the system, -1 when it has no filters.
inline int filterCalls(const std::vector<sock_filter> &filter, unsigned flags) {
  const sock_fprog program{static_cast<unsigned short>(filter.size()),
                           const_cast<sock_filter *>(filter.data())};
  prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
  return static_cast<int>(syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, flags, &program));
}

// Each of the calls fails with the error from now on. False when the system has no filters.
inline bool refuseCalls(const std::set<long> &calls, unsigned error) {
  std::vector<sock_filter> filter{
      BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
  };
  for (const long call : calls) {
    filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(call), 0, 1));
    filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | error));
  }
  filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
  return filterCalls(filter, 0) == 0;
}

// The numbers of the calls that the work makes, in a thread of its own; nothing where the system
// does not tell them. `onCall` may look at each before it is made.
inline std::optional<std::set<long>> seenCalls(
    const std::function<void()> &work, const std::function<void(long)> &onCall = [](long) {}) {
  constexpr int kNotYet = -2;
  std::atomic<int> listener{kNotYet};
  std::atomic<bool> works{false};
  std::thread worker([&] {
    listener = filterCalls({BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_USER_NOTIF)},
                           SECCOMP_FILTER_FLAG_NEW_LISTENER);
    if (listener == -1) return;
    works = true;
    work();
    works = false;
  });
  while (listener == kNotYet) std::this_thread::yield();
  std::optional<std::set<long>> seen;
  if (listener != -1) seen.emplace();
  for (pollfd end{listener, POLLIN, 0}; seen && poll(&end, 1, -1) == 1;) {
    if (end.revents & POLLHUP) break;
    seccomp_notif call = {};
    if (ioctl(listener, SECCOMP_IOCTL_NOTIF_RECV, &call) != 0) continue;
    if (works) seen->insert(call.data.nr);  // it waits in the call, so this is still true
    if (works) onCall(call.data.nr);
    seccomp_notif_resp answer = {call.id, 0, 0, SECCOMP_USER_NOTIF_FLAG_CONTINUE};
    ioctl(listener, SECCOMP_IOCTL_NOTIF_SEND, &answer);
  }
  worker.join();
  if (listener != -1) close(listener);
  return seen;
}

#endif
