// A handle that a host kept over the closing of the toolkit.
#ifndef QLX_TESTS_INERTHANDLE_H
#define QLX_TESTS_INERTHANDLE_H

#include <gtest/gtest.h>

#include <qlx/qlx.h>

#include "object/QlxLocked.h"
#include "QlxLogManager.h"
#include "QlxObject.h"
#include "support/Status.h"

// Asks everything of a handle that a host can ask, and expects that it does nothing.
inline void expectInert(QlxObject *object) {
  uint8_t found = 7;
  EXPECT_EQ(QlxGetObjectName(object), nullptr);
  EXPECT_EQ(QlxGetObjectDesc(object), nullptr);
  EXPECT_EQ(QlxIsObjectEnabled(object), 0);
  QlxSetObjectEnabled(object, 1);
  EXPECT_EQ(QlxIsObjectEnabled(object), 0);
  EXPECT_EQ(QlxSetObjProp(object, "logging", "on"), 0);
  EXPECT_EQ(QlxSetObjPropBool(object, "key", 1), 0);
  QlxSetObjPropInt(object, "key", 1);
  QlxSetObjPropDouble(object, "key", 1);
  EXPECT_EQ(QlxGetObjProp(object, "key", &found), nullptr);
  EXPECT_EQ(found, 0);
  EXPECT_EQ(QlxGetObjPropInt(object, "key", nullptr), 0);
  EXPECT_EQ(QlxGetListeners(object), nullptr);
  EXPECT_EQ(QlxAddListener(object, object), 0);
  EXPECT_EQ(QlxRemListener(object, object), 0);
  EXPECT_EQ(QlxIsLoggable(object, FATAL), 0);
  EXPECT_EQ(QlxIsLoggable(object, UNSPECIFIED), 0);
  EXPECT_EQ(QlxLoggerGetFLog(object), nullptr);
  EXPECT_EQ(QlxLogUText(object, u"text"), (QlxLogResult{'-', 0, 0}));
  EXPECT_EQ(QlxLogInfo(object, "b", "k"), (QlxLogResult{'-', 0, 0}));
  EXPECT_EQ(QlxHandlerGetFormatter(object), nullptr);
  QlxHandlerSetFormatter(object, object);
  EXPECT_EQ(QlxHandlerGetFormatter(object), nullptr);
  EXPECT_EQ(QlxHandlerGetFmtHeader(object), nullptr);
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  EXPECT_EQ(QlxIsLoggableByFilter(object, event, nullptr), 0);
  EXPECT_EQ(QlxUHandlerDoFmt(object, event, nullptr), nullptr);
  QlxFreeEvent(event);
  EXPECT_EQ(QlxAreObjectsEqual(object, object), 1);
  EXPECT_EQ(QlxAcquireObject(object), object);
  QlxReleaseObject(object);
  {
    const ApiLock lock;
    EXPECT_EQ(qlxFetchListenerGroup(object, 1), nullptr);
    EXPECT_EQ(qlxFetchObjPropMap(object), nullptr);
    qlxNotifyObjCfgChange(object, "logging");
    QlxBasicObjectFCfgChange(object, "logging");
    QlxBasicLoggerFCfgChange(object, "level");
    EXPECT_EQ(qlxIntlLogMgrApplyCfg(object, "never made"), 0);
    EXPECT_EQ(qlxIntlLogMgrHasCfg("never made"), 0);
  }
  EXPECT_EQ(object->objClass, nullptr);
  EXPECT_EQ(object->enabled, 0);
  EXPECT_EQ(object->kind1.word, 0u);
  EXPECT_EQ(object->kind2.word, 0u);
}

#endif
