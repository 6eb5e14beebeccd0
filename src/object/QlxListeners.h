// Who gets an object's events: the group of its listeners, which loggers, filters and handlers
// have.
#ifndef QLX_SRC_QLXLISTENERS_H
#define QLX_SRC_QLXLISTENERS_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** Frees an object's listener group, which releases the listeners. */
void qlxFreeListeners(QlxObject *object);

QLX_END_DECLS

#endif
