/**
 * @file
 * Twins of qlx/object.h for class operations, with the API lock held by the caller, and the basic
 * operations that classes share.
 */
#ifndef QLX_CLASS_OBJECT_H
#define QLX_CLASS_OBJECT_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

QLX_API void qlxIntlAddLoggerClass(const char *className, I18Msg *description, fAllocVars allocVars,
                                   fFreeVars freeVars, fCfgChange cfgChange, fLog log);
QLX_API void qlxIntlAddFilterClass(const char *className, I18Msg *description, fAllocVars allocVars,
                                   fFreeVars freeVars, fCfgChange cfgChange, fProcess process,
                                   fIsLoggable isLoggable, fLog log);
QLX_API void qlxIntlAddHandlerClass(const char *className, I18Msg *description,
                                    fAllocVars allocVars, fFreeVars freeVars, fCfgChange cfgChange,
                                    fProcess process, fOpen open, fClose close);
QLX_API void qlxIntlAddUFormatterClass(const char *className, I18Msg *description,
                                       fAllocVars allocVars, fFreeVars freeVars,
                                       fCfgChange cfgChange, fFormat format, fGetHeader getHeader,
                                       fGetTrailer getTrailer, fBindMsg bindMsg);
QLX_API StringGroupNode *qlxIntlGetLoggerClasses(void);
QLX_API StringGroupNode *qlxIntlGetFilterClasses(void);
QLX_API StringGroupNode *qlxIntlGetHandlerClasses(void);
QLX_API StringGroupNode *qlxIntlGetFormatterClasses(void);

QLX_API QlxObject *qlxIntlGetObject(const char *objectName, const char *className);
QLX_API QlxObject *qlxIntlAcquireObject(QlxObject *object);
QLX_API void qlxIntlReleaseObject(QlxObject *object);
QLX_API char *qlxIntlGetObjectName(QlxObject *object);
QLX_API UChar *qlxIntlGetObjectDesc(QlxObject *object);
QLX_API uint8_t qlxIntlIsObjectEnabled(QlxObject *object);
QLX_API void qlxIntlSetObjectEnabled(QlxObject *object, uint32_t flag);
QLX_API uint8_t qlxIntlIsLoggableByFilter(QlxObject *filter, Event *event, va_list *args);

QLX_API char *qlxIntlGetObjProp(QlxObject *object, const char *key, uint8_t *found);
QLX_API uint8_t qlxIntlGetObjPropBool(QlxObject *object, const char *key, uint8_t *found);
QLX_API int32_t qlxIntlGetObjPropInt(QlxObject *object, const char *key, uint8_t *found);
QLX_API int64_t qlxIntlGetObjPropLong(QlxObject *object, const char *key, uint8_t *found);
QLX_API float qlxIntlGetObjPropFloat(QlxObject *object, const char *key, uint8_t *found);
QLX_API double qlxIntlGetObjPropDouble(QlxObject *object, const char *key, uint8_t *found);
QLX_API uint8_t qlxIntlSetObjProp(QlxObject *object, const char *key, const char *value);
QLX_API uint8_t qlxIntlSetObjPropBool(QlxObject *object, const char *key, uint8_t value);
QLX_API void qlxIntlSetObjPropInt(QlxObject *object, const char *key, int32_t value);
QLX_API void qlxIntlSetObjPropLong(QlxObject *object, const char *key, int64_t value);
QLX_API void qlxIntlSetObjPropFloat(QlxObject *object, const char *key, float value);
QLX_API void qlxIntlSetObjPropDouble(QlxObject *object, const char *key, double value);

QLX_API uint8_t qlxIntlAddListener(QlxObject *object, QlxObject *listener);
QLX_API uint8_t qlxIntlRemListener(QlxObject *object, QlxObject *listener);
QLX_API ListenerGroupNode *qlxIntlGetListeners(QlxObject *object);

/** @return the object's property map, owned by it and made on first use; null for null, for an
 * object without class, and when memory ran out */
QLX_API StringToStringMap *qlxFetchObjPropMap(QlxObject *object);

/**
 * @param create  1 makes the group when there is none
 * @return the object's listener group, owned by it; null for formatters, for null, for an object
 *         without class, and when there is none
 */
QLX_API ListenerGroup *qlxFetchListenerGroup(QlxObject *object, uint8_t create);

/** Calls the class's fCfgChange, when object, class and operation are there; with null for a null
 *  key. */
QLX_API void qlxNotifyObjCfgChange(QlxObject *object, const char *key);

/** Makes an unregistered class record without kind operations; null for a null or known name, and
 *  when memory ran out. */
QLX_API ObjClass *qlxInitObjectClass(const char *className, int32_t kind, I18Msg *description,
                                     fAllocVars allocVars, fFreeVars freeVars,
                                     fCfgChange cfgChange);

/** Frees a record that is not registered; null is ignored. */
QLX_API void qlxFreeObjClass(ObjClass *objClass);

/**
 * Passes the event to the listeners that are filters or handlers, in order; none if disabled.
 *
 * The operation of a listener may change the listeners. One that is removed before its turn does
 * not get the event; one that is added gets it at the end, up to ten thousand of them. None gets it
 * twice, also when it is removed and added again, or the group is replaced ("listenerNames"). The
 * group's reference to a listener that had the event and is removed is given back after the pass.
 */
QLX_API void QlxBasicObjectFLog(QlxObject *object, Event *event, va_list *args);

/**
 * Reacts to the keys that all classes share: "logging" and "listenerNames" (and "description...",
 * which have no effect); a null key is ignored. A class's own fCfgChange hands the keys it does not
 * know to this.
 */
QLX_API void QlxBasicObjectFCfgChange(QlxObject *object, const char *key);

QLX_END_DECLS

#endif
