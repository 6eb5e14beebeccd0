// The life of an object: made by name, counted, retired. A retired object is an inert header: its
// contents are gone, its class is null, and its memory stays until the last reference is given
// back.
#ifndef QLX_SRC_QLXOBJECT_H
#define QLX_SRC_QLXOBJECT_H

#include <qlx/class/object.h>

#include "object/QlxObjectFields.h"
#include "util/CxOwned.h"

using ObjectRef = Owned<QlxObject, qlxIntlReleaseObject>;  // one counted reference

// Keeps an object, whoever else lets go of it, for a scope.
class KeptObject {
 public:
  explicit KeptObject(QlxObject *object) : object_(object) { ++object->refCount; }
  ~KeptObject() {
    // What is destroyed has the registry's reference and this one.
    if (object_->refCount > 2) {
      --object_->refCount;
    } else {
      qlxIntlReleaseObject(object_);
    }
  }
  KeptObject(const KeptObject &) = delete;
  KeptObject &operator=(const KeptObject &) = delete;

  QlxObject *get() const { return object_; }

 private:
  QlxObject *object_;
};

/** Closes a handler for good: its class's fClose runs once, whoever asks first. */
void qlxCloseHandlerOnce(QlxObject *object);

/** Has a class free the variables of an object of its; they may be null. */
void qlxFreeVars(const ObjClass *objClass, void *vars);

/** Destroys the contents; what is left is an inert header. The caller has a reference. */
void qlxRetireObject(QlxObject *object);

#endif
