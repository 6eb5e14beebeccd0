// The log manager's own interface to the toolkit and to the properties reader. The API lock is
// held.
#ifndef QLX_SRC_QLXLOGMANAGER_H
#define QLX_SRC_QLXLOGMANAGER_H

#include <qlx/class/config.h>

QLX_BEGIN_DECLS

/** Makes the registry of configurations, once; without memory the log manager stays closed. */
void qlxInitLogMgr(void);

/** Releases every configuration; does nothing when closed. */
void qlxCloseLogMgr(void);

/**
 * The name of the nearest registered ancestor by the dotted names, which is stored in the
 * configuration and answers every later call; "/" when there is none.
 *
 * @return a new string that the caller frees; null for null
 */
char *qlxLogMgrGetParentConfigName(ObjCfg *cfg);

/**
 * Sets a property of a configuration, which is made when it is new and then marked as read from the
 * file. The value may be empty, the two names may not.
 *
 * @return 1 when stored
 */
uint8_t qlxLogMgrAddCfgFromFile(const char *configName, const char *propertyName,
                                const char *value);

/**
 * Visits the properties of a configuration and of those that it inherits from, farthest first, with
 * the object that is to have them; a configuration of a new name is made.
 *
 * @return false when there is none of that name
 */
typedef uint8_t (*QlxVisitProperty)(QlxObject *object, const char *key, const char *value);
bool qlxVisitInherited(const char *name, QlxObject *object, QlxVisitProperty visit);

QLX_END_DECLS

#endif
