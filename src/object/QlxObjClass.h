// Class records, and the two trivial element operations of the map that holds them.
#ifndef QLX_SRC_QLXOBJCLASS_H
#define QLX_SRC_QLXOBJCLASS_H

#include <qlx/class/object.h>

QLX_BEGIN_DECLS

/** Hands a record out of the class registry: records are not counted. */
ObjClass *qlxReturnObjClass(ObjClass *objClass);

/** Does nothing: the registry's map does not own its records, the toolkit frees them. */
void qlxIgnoreObjClass(void);

QLX_END_DECLS

/** Registers a built-in class. */
void qlxAddBuiltinClass(const ObjClass &builtin);

#endif
