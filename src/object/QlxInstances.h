// The registry of the named objects, and the walks over it by which they are taken apart.
#ifndef QLX_SRC_QLXINSTANCES_H
#define QLX_SRC_QLXINSTANCES_H

#include <qlx/class/toolkit.h>

/** 1 while the objects are taken apart: the registry then keeps them alive, whoever lets go of
 *  them. */
uint8_t qlxToolkitIsClosing(void);
void qlxSetToolkitClosing(uint8_t flag);

/**
 * Visits every object that has taken so many steps of closing. The visitor may change the registry,
 * and holds the object itself.
 *
 * @return whether there was one
 */
bool qlxVisitInstances(uint8_t stepsTaken, void (*visit)(QlxObject *object));

/** Frees the registry. */
void qlxFreeInstances(void);

/** The toolkit logger is borrowed; null while the toolkit is closed. */
void qlxSetToolkitLogger(QlxObject *logger);

#endif
