// What the toolkit keeps to itself.
#ifndef QLX_SRC_QLXTOOLKIT_H
#define QLX_SRC_QLXTOOLKIT_H

#include <qlx/class/toolkit.h>

QLX_BEGIN_DECLS

/**
 * Takes every registered object apart and frees the registry: handlers are closed, which writes
 * their trailers, while everything that they use is still whole. Handles that a host still holds
 * become inert.
 */
void qlxFreeInstancesMap(void);

QLX_END_DECLS

#endif
