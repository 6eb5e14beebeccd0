// Where the failures of handlers are told: one place that tells a record that was lost from a
// rollover that failed while the record was written. The event's status, which a log call answers,
// does not: it has the last failure of either kind.
//
// All functions are called with the API lock held. A success changes nothing.
#ifndef QLX_SRC_QLXPROBLEMS_H
#define QLX_SRC_QLXPROBLEMS_H

#include <qlx/types.h>

#include "util/CxStatus.h"

QLX_BEGIN_DECLS

/** Reports a failure, and stores it in the event, which may be null. */
void qlxKeepFailure(Event *event, CxStatus status);

/** The same for a failure that cost the event's record. */
void qlxCountLost(Event *event, CxStatus status);
inline void qlxKeepLost(Event *event, CxStatus status) {
  if (cxFailed(status)) qlxCountLost(event, status);
}

/** The same for a failure that left the generations of a file as they were, or some of them. */
void qlxKeepRollover(Event *event, CxStatus status, const char *activeFile);

QLX_END_DECLS

#endif
