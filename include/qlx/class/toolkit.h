/**
 * @file
 * The API lock and the toolkit's registries, for class operations. All but the lock functions
 * expect the lock to be held.
 */
#ifndef QLX_CLASS_TOOLKIT_H
#define QLX_CLASS_TOOLKIT_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * Takes the API lock, made by the first call. The lock is not recursive: the thread that holds it
 * must call nothing that takes it. While it holds the lock, the thread cannot be cancelled
 * (pthread_cancel()), whichever its type of cancellation.
 *
 * @return 1 when the lock is held, 0 when it cannot be made or taken
 */
QLX_API uint8_t qlxAPIMutexLock(void);

/** Releases the API lock, and sets the thread's cancellation state and type as they were before the
 *  lock was taken. By the thread that took it; before the first call of the library it does
 * nothing. */
QLX_API void qlxAPIMutexUnlock(void);

/** @return the toolkit logger, borrowed; null while the toolkit is closed */
QLX_API QlxObject *qlxToolkitLogger(void);

/** @return the registered class, borrowed, or null; null for a null name */
QLX_API ObjClass *qlxToolkitGetClassDef(const char *className);

/**
 * Registers a class record under a name, its own or another; under several by several calls. The
 * registry owns it from then on. The first record of a name stays. One that is refused, as the name
 * is taken or null or memory ran out, is freed unless it is registered under another name. A null
 * record is ignored. A record that a host makes may be a copy of a registered one: its `own`
 * becomes null here, so that its operations are the host's.
 */
QLX_API void qlxToolkitAddClassDef(const char *className, ObjClass *objClass);

/** Makes the registries and registers the built-in classes, once. */
QLX_API void qlxToolkitInitObjClasses(void);

/** @return an iterator over the class names of a kind; null (empty) for any other number */
QLX_API StringGroupNode *qlxToolkitFetchClassnames(int32_t kind);

/** Registers an object; the registry takes a reference. Null name or object: ignored. */
QLX_API void qlxToolkitAddObjInstance(const char *objectName, QlxObject *object);

/** @return the object of that name with a reference for the caller, or null */
QLX_API QlxObject *qlxToolkitGetObjInstance(const char *objectName);

/**
 * Removes a name and releases the registry's reference; a null or unknown name is ignored. Like any
 * release this destroys an object that has one reference left, be it a holder's, whose handle is
 * inert then: with one holder that is now, with more when all but one have given it back. Who holds
 * the object then gives it back before the toolkit is closed, which ends registered objects only.
 */
QLX_API void qlxToolkitRemObjInstance(const char *objectName);

QLX_END_DECLS

#endif
