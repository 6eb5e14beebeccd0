#include "StopSignal.h"

#include <cerrno>
#include <csignal>
#include <cstdint>

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

// Readable once a signal came. An event, not a flag: a flag set just before poll() would be missed.
static int stopEvent = -1;

static void requestStop(int) {
  const int error = errno;
  const uint64_t one = 1;
  [[maybe_unused]] const ssize_t written = write(stopEvent, &one, sizeof one);
  errno = error;
}

StopSignal::StopSignal() {
  stopEvent = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
  struct sigaction action = {};
  action.sa_handler = requestStop;
  action.sa_flags = SA_RESTART | SA_RESETHAND;
  sigaction(SIGINT, &action, nullptr);
  sigaction(SIGTERM, &action, nullptr);
}

bool StopSignal::waitReadable(int descriptor) const {
  struct pollfd waits[] = {{stopEvent, POLLIN, 0}, {descriptor, POLLIN, 0}};
  while (poll(waits, 2, -1) < 0 && errno == EINTR) continue;
  return waits[0].revents == 0;
}

bool StopSignal::requested() const {
  struct pollfd wait = {stopEvent, POLLIN, 0};
  return poll(&wait, 1, 0) > 0;
}
