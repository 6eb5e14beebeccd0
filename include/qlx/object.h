/**
 * @file
 * Classes and objects: loggers, filters, handlers and formatters, made by name, shared and counted,
 * with string properties and listeners.
 *
 * For every function here, unless it says otherwise: it takes the API lock, and gives 0, null or
 * nothing when the lock cannot be taken; a null object reads as an object without anything and is
 * not written; a returned `char *` or `UChar *` is new and the caller frees it with
 * OslMemoryFree(); arguments are borrowed and copied where they are kept. Inside the library, and
 * from class operations, call the qlxIntl... twins (qlx/class/object.h).
 */
#ifndef QLX_OBJECT_H
#define QLX_OBJECT_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/* ---- Classes ---- */

/*
 * Registers a class. The first registration of a name wins, a later one and a null name are
 * ignored. A null kind operation gets the library's default; a null fAllocVars, fFreeVars or
 * fCfgChange stays null and is skipped (a class without fCfgChange is told of no key). fFreeVars is
 * also called with null: for an object whose fAllocVars gave null, and a second time for one that
 * the toolkit's closing ends. The description may be null. A C++ exception that leaves an operation
 * ends the process with a line on standard error (qlx/class.h).
 */
QLX_API void QlxAddLoggerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                               fFreeVars freeVars, fCfgChange cfgChange, fLog log);
QLX_API void QlxAddFilterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                               fFreeVars freeVars, fCfgChange cfgChange, fProcess process,
                               fIsLoggable isLoggable, fLog log);
QLX_API void QlxAddHandlerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                                fFreeVars freeVars, fCfgChange cfgChange, fProcess process,
                                fOpen open, fClose close);
QLX_API void QlxAddUFormatterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                                   fFreeVars freeVars, fCfgChange cfgChange, fFormat format,
                                   fGetHeader getHeader, fGetTrailer getTrailer, fBindMsg bindMsg);

/* Iterators (QlxStringGroupIter...) over the names of the classes of a kind. */
QLX_API StringGroupNode *QlxGetLoggerClasses(void);
QLX_API StringGroupNode *QlxGetFilterClasses(void);
QLX_API StringGroupNode *QlxGetHandlerClasses(void);
QLX_API StringGroupNode *QlxGetFormatterClasses(void);

/* ---- Objects ---- */

/**
 * Finds an object by name or makes it, configured by the configuration of that name.
 *
 * @param className  null takes the configuration's (inherited) property "className"
 * @return the object with a reference that the caller gives back with QlxReleaseObject(); null when
 *         no class is found, when the name belongs to an object of another class, or when memory
 *         ran out
 */
QLX_API QlxObject *QlxGetObject(const char *objectName, const char *className);

/** Adds a reference. @return object */
QLX_API QlxObject *QlxAcquireObject(QlxObject *object);

/**
 * Gives a reference back. Deliberate: the registry's own reference keeps nothing alive; when only
 * that one is left the object is destroyed, a handler being closed first.
 */
QLX_API void QlxReleaseObject(QlxObject *object);

QLX_API char *QlxGetObjectName(QlxObject *object);

/** @return the description of the object's class, bound without arguments, or null */
QLX_API UChar *QlxGetObjectDesc(QlxObject *object);

/** @return 1 when both are the same object (also when both are null), else 0. Takes no lock. */
QLX_API uint8_t QlxAreObjectsEqual(QlxObject *a, QlxObject *b);

QLX_API uint8_t QlxIsObjectEnabled(QlxObject *object);

/** A disabled object (flag 0; only the low 8 bits count) passes no events on. */
QLX_API void QlxSetObjectEnabled(QlxObject *object, uint32_t flag);

/** Asks a filter. @return what its class's fIsLoggable answers, of the built-in classes 1 or 0; 0
 *  for a null event or an object that is no filter */
QLX_API uint8_t QlxIsLoggableByFilter(QlxObject *filter, Event *event, va_list *args);

/* ---- Properties ---- */

/*
 * Reads one of an object's own properties. `found` (optional) becomes 1 when a value came back (for
 * a typed getter: was converted by the rules of qlx/props.h), otherwise it is 0 and the result
 * null, 0 or 0.0.
 */
QLX_API char *QlxGetObjProp(QlxObject *object, const char *key, uint8_t *found);
QLX_API uint8_t QlxGetObjPropBool(QlxObject *object, const char *key, uint8_t *found);
QLX_API int32_t QlxGetObjPropInt(QlxObject *object, const char *key, uint8_t *found);
QLX_API int64_t QlxGetObjPropLong(QlxObject *object, const char *key, uint8_t *found);
QLX_API float QlxGetObjPropFloat(QlxObject *object, const char *key, uint8_t *found);
QLX_API double QlxGetObjPropDouble(QlxObject *object, const char *key, uint8_t *found);

/*
 * Sets a property and tells the object's class of the key, also when storing failed. The string and
 * the bool setter answer 1 when the value was stored. A null key is never stored, and the class's
 * fCfgChange is called with null: a host's tests for it, the built-in ones ignore it.
 */
QLX_API uint8_t QlxSetObjProp(QlxObject *object, const char *key, const char *value);
QLX_API uint8_t QlxSetObjPropBool(QlxObject *object, const char *key, uint8_t value);
QLX_API void QlxSetObjPropInt(QlxObject *object, const char *key, int32_t value);
QLX_API void QlxSetObjPropLong(QlxObject *object, const char *key, int64_t value);
QLX_API void QlxSetObjPropFloat(QlxObject *object, const char *key, float value);
QLX_API void QlxSetObjPropDouble(QlxObject *object, const char *key, double value);

/* ---- Listeners ---- */

/**
 * Makes `listener` get the events of `object`, after those added before; the object holds a
 * reference to it.
 *
 * @return 1 when added, 0 for one already there, a null or inert one, an object that has no
 *         listeners, and when memory ran out
 */
QLX_API uint8_t QlxAddListener(QlxObject *object, QlxObject *listener);

/** @return 1 when removed */
QLX_API uint8_t QlxRemListener(QlxObject *object, QlxObject *listener);

/** @return an iterator (QlxListenerGroupIter...), valid while none is removed; null when empty */
QLX_API ListenerGroupNode *QlxGetListeners(QlxObject *object);

QLX_END_DECLS

#endif
