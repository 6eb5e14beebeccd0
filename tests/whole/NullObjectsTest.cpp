// Null arguments of the toolkit, classes, objects, their properties and listeners.
#include <qlx/class.h>
#include <qlx/qlx.h>

#include "support/NullCalls.h"
#include "support/OpenToolkit.h"
#include "support/TempDir.h"

namespace {

NULL_GROUP(Toolkit) {
  const TempDir dir;
  const std::string path = dir.path("good");
  dir.write("good", "a.level=INFO\n");
  dir.write("bad", "without a dot\n");
  const auto opened = [](uint8_t result) {
    EXPECT_EQ(result, 1);
    QlxCloseToolkit();
  };
  CxStatus status = failure(7);
  NULLS(QlxOpenToolkit, with(path.c_str(), &status), opened);
  EXPECT_EQ(status, failure(7));
  NULLS(QlxOpenToolkit, with(dir.path("bad").c_str(), &status), opened, isZero);
  const char *const texts[] = {"a", "b"};
  NULLS(QlxStrACat, with(2, static_cast<const char *const *>(texts), ","), givesText(""),
        givesText("ab"));
}

NULL_GROUP(Registries) {
  const OpenToolkit toolkit;
  QlxObject *object = QlxGetObject("object", "qlx_basiclogger");
  const uint32_t held = object->refCount;
  ObjClass *unnamed =
      qlxInitObjectClass("test_unnamed", Logger, nullptr, nullptr, nullptr, nullptr);
  HELD(qlxToolkitGetClassDef, with("qlx_basiclogger"), isZero);
  HELD(qlxToolkitAddClassDef, with("test_class", unnamed), nothing);
  EXPECT_EQ(qlxToolkitGetClassDef("test_class"), nullptr);
  HELD(qlxToolkitAddObjInstance, with("other", object), nothing);
  HELD(qlxToolkitGetObjInstance, with("object"), isZero);
  HELD(qlxToolkitRemObjInstance, with("object"), nothing);
  EXPECT_EQ(object->refCount, held);
  QlxReleaseObject(object);
  EXPECT_EQ(QlxGetObject("object", nullptr), nullptr);
}

// ---- Classes

void *allocVars() {
  return nullptr;
}
void freeVars(void *) {}
void changed(QlxObject *, const char *) {}
void log(QlxObject *, Event *, va_list *) {}
uint8_t isLoggable(QlxObject *, Event *, va_list *) {
  return 1;
}
void open(QlxObject *) {}
UChar *format(QlxObject *, Event *, va_list *) {
  return nullptr;
}
char *getFrame(QlxObject *) {
  return nullptr;
}
UChar *bind(I18Msg *, va_list *) {
  return nullptr;
}

// Takes the class of the call away again with everything else, so that the next call is not
// ignored.
template <typename Check>
auto registered(Check check) {
  return [=] {
    const ObjClass *made = qlxToolkitGetClassDef("test_class");
    ASSERT_NE(made, nullptr);
    check(*made);
    QlxCloseToolkit();
  };
}

void notRegistered() {
  EXPECT_EQ(qlxToolkitGetClassDef("test_class"), nullptr);
}

const auto withoutDescription =
    registered([](const ObjClass &made) { EXPECT_EQ(made.description, nullptr); });
const auto withoutAllocVars =
    registered([](const ObjClass &made) { EXPECT_EQ(made.fAllocVars, nullptr); });
const auto withoutFreeVars =
    registered([](const ObjClass &made) { EXPECT_EQ(made.fFreeVars, nullptr); });
const auto withoutCfgChange =
    registered([](const ObjClass &made) { EXPECT_EQ(made.fCfgChange, nullptr); });

// What is null for the operation of a kind is the library's own.
#define DEFAULTED(slot, own) registered([](const ObjClass &made) { EXPECT_EQ(made.slot, own); })

NULL_GROUP(Classes) {
  I18Msg *text = QlxAllocUI18Msg(nullptr, nullptr, u"description");
  NULLS_OF_BOTH(AddLoggerClass, with("test_class", text, allocVars, freeVars, changed, log),
                notRegistered, withoutDescription, withoutAllocVars, withoutFreeVars,
                withoutCfgChange, DEFAULTED(op1.fLog, QlxBasicObjectFLog));
  NULLS_OF_BOTH(AddFilterClass,
                with("test_class", text, allocVars, freeVars, changed, log, isLoggable, log),
                notRegistered, withoutDescription, withoutAllocVars, withoutFreeVars,
                withoutCfgChange, DEFAULTED(op1.fProcess, QlxBasicFilterFProcess),
                DEFAULTED(op2.fIsLoggable, QlxLevelFilterFIsLoggable),
                DEFAULTED(op3.fLog, QlxBasicObjectFLog));
  NULLS_OF_BOTH(
      AddHandlerClass, with("test_class", text, allocVars, freeVars, changed, log, open, open),
      notRegistered, withoutDescription, withoutAllocVars, withoutFreeVars, withoutCfgChange,
      DEFAULTED(op1.fProcess, QlxBasicHandlerFProcess), DEFAULTED(op2.fOpen, QlxBasicHandlerFOpen),
      DEFAULTED(op3.fClose, QlxBasicHandlerFClose));
  NULLS_OF_BOTH(
      AddUFormatterClass,
      with("test_class", text, allocVars, freeVars, changed, format, getFrame, getFrame, bind),
      notRegistered, withoutDescription, withoutAllocVars, withoutFreeVars, withoutCfgChange,
      DEFAULTED(op1.fFormat, QlxBasicUFormatterFFormat),
      DEFAULTED(op2.fGetHeader, QlxBasicFormatterFGetHeader),
      DEFAULTED(op3.fGetTrailer, QlxBasicFormatterFGetTrailer),
      DEFAULTED(op4.fBindMsg, qlxIntlBindUI18Msg));
  QlxFreeI18Msg(text);
}

NULL_GROUP(ClassRecords) {
  I18Msg *text = QlxAllocUI18Msg(nullptr, nullptr, u"description");
  const auto isMade = [](ObjClass *made) {
    ASSERT_NE(made, nullptr);
    const int fields = (made->description != nullptr) + (made->fAllocVars != nullptr) +
                       (made->fFreeVars != nullptr) + (made->fCfgChange != nullptr);
    EXPECT_EQ(fields, 3);
    qlxFreeObjClass(made);
  };
  HELD(qlxInitObjectClass, with("test_class", Logger, text, allocVars, freeVars, changed), isZero,
       isMade, isMade, isMade, isMade);
  HELD(qlxFreeObjClass, with(nullptr), nothing);
  QlxFreeI18Msg(text);
}

// ---- Objects

NULL_GROUP(Objects) {
  const OpenToolkit toolkit;
  QlxObject *filter = QlxGetObject("filter", "qlx_levelfilter");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  NULLS_OF_BOTH(GetObject, with("other", "qlx_basiclogger"), isZero);
  NULLS_OF_BOTH(AcquireObject, with(nullptr), isZero);
  NULLS_OF_BOTH(ReleaseObject, with(nullptr), nothing);
  NULLS_OF_BOTH(GetObjectName, with(nullptr), isZero);
  NULLS_OF_BOTH(GetObjectDesc, with(nullptr), isZero);
  NULLS(QlxAreObjectsEqual, with(filter, filter), isZero);
  NULLS_OF_BOTH(IsObjectEnabled, with(nullptr), isZero);
  NULLS_OF_BOTH(SetObjectEnabled, with(nullptr, 0), nothing);
  NULLS_OF_BOTH(IsLoggableByFilter, with(filter, event, nullptr), isZero, isZero, is(1));
  QlxFreeEvent(event);
  QlxReleaseObject(filter);
}

NULL_GROUP(ObjectProperties) {
  const OpenToolkit toolkit;
  uint8_t found = 7;
  QlxObject *object = QlxGetObject("object", "qlx_basiclogger");
  for (const char *value : {"true", "1"}) {
    const bool isWord = value[0] == 't';
    ASSERT_EQ(QlxSetObjProp(object, "key", value), 1);
    NULLS_OF_BOTH(GetObjProp, with(object, "key", &found), Absent{found}, Absent{found},
                  givesText(value));
    NULLS_OF_BOTH(GetObjPropBool, with(object, "key", &found), Absent{found}, Absent{found},
                  is(isWord));
    NULLS_OF_BOTH(GetObjPropInt, with(object, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
    NULLS_OF_BOTH(GetObjPropLong, with(object, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
    NULLS_OF_BOTH(GetObjPropFloat, with(object, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
    NULLS_OF_BOTH(GetObjPropDouble, with(object, "key", &found), Absent{found}, Absent{found},
                  is(!isWord));
  }
  NULLS_OF_BOTH(SetObjProp, with(object, "null", "1"), isZero, isZero, is(1));
  NULLS_OF_BOTH(SetObjPropBool, with(object, "other", 1), isZero);
  NULLS_OF_BOTH(SetObjPropInt, with(object, "other", 1), nothing);
  NULLS_OF_BOTH(SetObjPropLong, with(object, "other", 1), nothing);
  NULLS_OF_BOTH(SetObjPropFloat, with(object, "other", 1), nothing);
  NULLS_OF_BOTH(SetObjPropDouble, with(object, "other", 1), nothing);
  HELD(qlxFetchObjPropMap, with(nullptr), isZero);
  EXPECT_EQ(QlxStringToStringMapHasKey(object->props, "null"), 1);
  EXPECT_EQ(QlxStringToStringMapHasKey(object->props, "other"), 0);
  QlxReleaseObject(object);
}

NULL_GROUP(Listeners) {
  const OpenToolkit toolkit;
  QlxObject *logger = QlxGetObject("logger", "qlx_basiclogger");
  QlxObject *filter = QlxGetObject("filter", "qlx_levelfilter");
  ASSERT_EQ(QlxAddListener(logger, filter), 1);
  NULLS_OF_BOTH(AddListener, with(filter, logger), isZero);
  NULLS_OF_BOTH(RemListener, with(logger, filter), isZero);
  NULLS_OF_BOTH(GetListeners, with(nullptr), isZero);
  HELD(qlxFetchListenerGroup, with(nullptr, 1), isZero);
  EXPECT_EQ(QlxGetListeners(logger)->value, filter);
  EXPECT_EQ(QlxGetListeners(logger)->next, nullptr);
  QlxReleaseObject(filter);
  QlxReleaseObject(logger);
}

NULL_GROUP(BasicOperations) {
  const OpenToolkit toolkit;
  QlxObject *logger = QlxGetObject("logger", "qlx_basiclogger");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  ASSERT_EQ(QlxSetObjProp(logger, "logging", "off"), 1);
  QlxSetObjectEnabled(logger, 1);
  HELD(qlxNotifyObjCfgChange, with(logger, "logging"), nothing);
  HELD(QlxBasicObjectFCfgChange, with(logger, "logging"), nothing);
  HELD(QlxBasicLoggerFCfgChange, with(logger, "logging"), nothing);
  HELD(QlxLevelFilterFCfgChange, with(logger, "logging"), nothing);
  HELD(QlxBasicHandlerFCfgChange, with(logger, "logging"), nothing);
  HELD(QlxBasicFormatterFCfgChange, with(logger, "logging"), nothing);
  EXPECT_EQ(QlxIsObjectEnabled(logger), 1);
  HELD(QlxBasicObjectFLog, with(logger, event, nullptr), nothing);
  QlxFreeEvent(event);
  QlxReleaseObject(logger);
}

}  // namespace
