// Class records: made, registered by name, found and freed.
#ifndef QLX_SRC_QLXOBJCLASS_H
#define QLX_SRC_QLXOBJCLASS_H

#include <cstdarg>

#include <qlx/class/object.h>
#include <qlx/class/toolkit.h>

class RecordText;

// What a class of the library can do beyond its operations, which are those that a host's may have.
struct QlxOwnClass {
  // Its operations take an event whose source is only noted (record/QlxLoggedEvent.h).
  bool takesNotes;

  // A formatter's: appends what fFormat gives to a record on its way, as text or as bytes. False
  // where it has no text, or the record is not whole.
  bool (*append)(QlxObject *formatter, Event *event, va_list *args, RecordText &record);
};

// Of the classes that are no formatters.
inline constexpr QlxOwnClass kTakesNotes = {.takesNotes = true, .append = nullptr};
inline constexpr QlxOwnClass kTakesNoNotes = {.takesNotes = false, .append = nullptr};

QLX_BEGIN_DECLS

/** Hands a record out of the class registry: records are not counted. */
ObjClass *qlxReturnObjClass(ObjClass *objClass);

/** Does nothing: the registry's map does not own its records. */
void qlxIgnoreObjClass(void);

QLX_END_DECLS

/** Makes the registry. False when it is there already, or memory ran out. */
bool qlxMakeClassRegistry(void);

/** Whether a record is registered, under any name. */
bool qlxIsRegisteredClass(const ObjClass *objClass);

/** As qlxToolkitAddClassDef(), in a registry that has been made. */
void qlxRegisterClass(const char *className, ObjClass *objClass);

/** Frees the registry and its records. */
void qlxFreeClassRegistry(void);

#endif
