// Filters: the step that every filter class takes unless it brings its own, and the level filter,
// which drops what is below a threshold.
#include <qlx/class/filter.h>

#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/level.h>
#include <qlx/memory.h>

#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "object/QlxConfigKeys.h"
#include "QlxObject.h"
#include "object/QlxOperation.h"
#include "QlxProps.h"

void QlxBasicFilterFProcess(QlxObject *filter, Event *event, va_list *args) {
  if (!isKind(filter, Filter) || !loadEnabled(filter)) return;
  const ObjClass *objClass = filter->objClass;
  if (!objClass->op2.fIsLoggable || !objClass->op3.fLog) return;
  if (qlxCall({objClass, "fIsLoggable"}, objClass->op2.fIsLoggable, filter, event, args) == 1)
    qlxCall({objClass, "fLog"}, objClass->op3.fLog, filter, event, args);
}

// Deliberate: a key without a value, like a misspelt one, leaves no threshold that drops anything.
static void applyLevel(QlxObject *filter, const char *key) {
  storeLevel(filter, QlxGetLevelFromString(qlxPeekMapProp(filter->props, key)));
}

static constexpr ConfigKey kLevelFilterKeys[] = {
    {"level", applyLevel},
};

void QlxLevelFilterFCfgChange(QlxObject *filter, const char *key) {
  if (!filter || !key) return;
  if (!qlxApplyConfigKey(kLevelFilterKeys, filter, key)) QlxBasicObjectFCfgChange(filter, key);
}

uint8_t QlxLevelFilterFIsLoggable(QlxObject *filter, Event *event, va_list *) {
  if (!filter || !event) return 0;
  const int32_t threshold = loadLevel(filter);
  const int32_t level = QlxGetEventLevel(event);
  return threshold == ALL || level == UNSPECIFIED || level >= threshold;
}

const ObjClass qlxLevelFilterClass = {
    .kind = Filter,
    .name = "qlx_levelfilter",
    .description = nullptr,
    .op1 = {.fProcess = QlxBasicFilterFProcess},
    .op2 = {.fIsLoggable = QlxLevelFilterFIsLoggable},
    .op3 = {.fLog = QlxBasicObjectFLog},
    .fCfgChange = QlxLevelFilterFCfgChange,
    .own = &kTakesNotes,
};
