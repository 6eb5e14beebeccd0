// The one way to an operation of a class.
//
// A host's operation may look at an event's properties, or log: what is noted of the source of the
// event on its way becomes properties before any operation that is not marked as one that takes
// notes (QlxOwnClass). And it may be C++ that throws: an exception that left it would leave the API
// lock held for ever, so it ends the process, with a line that names the operation.
#ifndef QLX_SRC_QLXOPERATION_H
#define QLX_SRC_QLXOPERATION_H

#include <type_traits>

#include <qlx/types.h>

#include "QlxObjClass.h"

struct QlxOperationName {
  const ObjClass *objClass;
  const char *operation;
};

// The way for a host's. Defined where exceptions are compiled, for the signatures that operations
// have.
template <typename Result, typename... Args>
Result qlxCallHosts(QlxOperationName name, Result (*operation)(Args...),
                    std::type_identity_t<Args>... args) noexcept;

// Calls an operation, which is not null.
template <typename Result, typename... Args>
Result qlxCall(QlxOperationName name, Result (*operation)(Args...),
               std::type_identity_t<Args>... args) {
  const QlxOwnClass *own = name.objClass->own;
  return own && own->takesNotes ? operation(args...) : qlxCallHosts(name, operation, args...);
}

#endif
