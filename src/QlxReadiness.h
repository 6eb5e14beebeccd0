// A flag in memory that the system sets when a descriptor becomes readable: to ask it costs a load,
// where asking the system costs the way into it. It is the ring of an asynchronous I/O context,
// into which the system puts the end of a poll request. How soon depends on the descriptor: that of
// an epoll set at once, by whoever makes it readable; others later, by a worker of the system.
//
// All functions are called with the API lock held. Where the system has no such requests, or
// refuses them, no flag ever starts, and the caller asks the system as before.
#ifndef QLX_SRC_QLXREADINESS_H
#define QLX_SRC_QLXREADINESS_H

#include <stddef.h>
#include <stdint.h>

#include <linux/aio_abi.h>

#include <qlx/base.h>

QLX_BEGIN_DECLS

typedef struct QlxReadiness {
  aio_context_t context;  // 0: none. To end one takes the system tens of milliseconds, so it stays
  struct iocb request;
  uint32_t tail;      // of the ring, until the request ends
  uint8_t pending;    // 1: not seen to have ended
  uint8_t cancelled;  // 1: about to end, and no flag any more
  uint8_t refused;    // 1: never tried again
} QlxReadiness;

// The system's own. Tests put others in place.
typedef struct QlxAioCalls {
  int (*setUp)(unsigned requests, aio_context_t *context);
  int (*submit)(aio_context_t context, long count, struct iocb **requests);
  int (*cancel)(aio_context_t context, struct iocb *request, struct io_event *end);
  const char *inUse;  // files with the number of requests that all contexts may have,
  const char *limit;  // and with the most
} QlxAioCalls;
extern QlxAioCalls qlxAioCalls;

/**
 * Zeroed memory for flags, which stays; null: none. A child of a fork finds it zeroed again, since
 * contexts are its parent's alone, and a parent that ends takes the rings along.
 */
void *qlxReadinessMap(size_t bytes);

/**
 * Has the system set the flag with the next of the poll events. A change that falls into this call
 * may be told late: what follows must ask the system once more. Until the request ends the file
 * stays open, even when its descriptor is closed. False: there is no flag, or not yet, as long as
 * the request before has not ended.
 */
bool qlxReadinessStart(QlxReadiness *flag, int descriptor, uint16_t events);

/** Whether the flag is in place and not set. */
bool qlxReadinessIsQuiet(const QlxReadiness *flag);

/** The flag is not in place any more; the file is given back soon. */
void qlxReadinessEnd(QlxReadiness *flag);

QLX_END_DECLS

#endif
