// Every allocation fails once: no crash, no leak, the value that says so, and a library that works
// again afterwards. Here the parts of the library one by one; the whole in
// ToolkitAllocationFailureTest.
#include <string>

#include <qlx/class.h>
#include <qlx/qlx.h>

#include "object/QlxClasses.h"
#include "text/QlxFormatCache.h"
#include "QlxObjConfig.h"
#include "support/EveryFailure.h"
#include "support/ResourceBundles.h"
#include "support/Status.h"
#include "support/Take.h"
#include "support/TempDir.h"

namespace {

constexpr int kMany = 40;  // more than the first block of a property list has room for

TEST(AllocationFailureTest, StringBuffersKeepTheirText) {
  withEveryFailure([](Tries &tries) {
    const std::string longText(3000, 'x');
    CxStringBuff text{};
    std::string expected;
    const auto append = [&](const std::string &piece, auto call) {
      if (tries.exactly(call)) expected += piece;
      EXPECT_STREQ(text.data ? text.data : "", expected.c_str());
    };
    for (int i = 0; i < 3; ++i) {
      append("abc", [&] { return CxStringBuffAppendStr(&text, "abc"); });
      append("c", [&] { return CxStringBuffAppendChar(&text, 'c'); });
      append("-7", [&] { return CxStringBuffAppendInt32(&text, -7); });
      append("xx", [&] { return CxStringBuffAppendStrN(&text, longText.c_str(), 2); });
      append(longText, [&] { return CxStringBuffAppendStr(&text, longText.c_str()); });
    }
    append("\u0100", [&] { return CxStringBuffAppendUTF32Char(&text, 0x100); });
    if (tries.exactly([&] { return CxStringBuffInsertStr(&text, longText.c_str(), 0); }))
      expected.insert(0, longText);
    EXPECT_STREQ(text.data ? text.data : "", expected.c_str());
    if (text.data) OslMemoryFree(tries.exactly([&] { return CxStringBuffCopyStr(&text); }));
    if (text.length) tries.exactly([&] { return CxStringBuffPack(&text); });
    OslMemoryFree(CxStringBuffTakeStr(&text));
  });
}

TEST(AllocationFailureTest, UnicodeStringBuffersKeepTheirText) {
  withEveryFailure([](Tries &tries) {
    const std::u16string longText(1500, u'x');
    CxUStringBuff text{};
    std::u16string expected;
    const auto append = [&](const std::u16string &piece, auto call) {
      if (tries.exactly(call)) expected += piece;
      EXPECT_EQ(std::u16string(text.data ? text.data : u""), expected);
    };
    for (int i = 0; i < 3; ++i) {
      append(u"abc", [&] { return CxUStringBuffAppendStr(&text, "abc"); });
      append(u"\u00e9", [&] { return CxUStringBuffAppendStr(&text, "\u00e9"); });
      append(u"c", [&] { return CxUStringBuffAppendChar(&text, 'c'); });
      append(u"ab", [&] { return CxUStringBuffAppendStrN(&text, "abc", 2); });
      append(u"7", [&] { return CxUStringBuffAppendInt32(&text, 7); });
      append(u"1.5", [&] { return CxUStringBuffAppendUDouble(&text, 1.5); });
      append(longText, [&] { return CxUStringBuffAppendUStr(&text, longText.c_str()); });
    }
    OslMemoryFree(CxUStringBuffTakeUStr(&text));
  });
}

TEST(AllocationFailureTest, CopiesOfTextAreNull) {
  withEveryFailure([](Tries &tries) {
    char text[] = "text";
    const Parm parm{.type = ParmString, .value = {.s = text}};
    const char *const words[] = {"a", nullptr, "b"};
    OslMemoryFree(tries.exactly([] { return OslMemoryCalloc(2, 8); }));
    OslMemoryFree(tries.exactly([&] { return OslStringDup(text); }));
    OslMemoryFree(tries.exactly([&] { return CxUStringDupStrToUChar(text); }));
    OslMemoryFree(tries.exactly([] { return CxUStringDupUCharToStr(u"text"); }));
    OslMemoryFree(tries.exactly([] { return CxUStringDup(u"text"); }));
    OslMemoryFree(tries.exactly([&] { return CxUStringParmToStr(&parm); }));
    OslMemoryFree(tries.exactly([&] { return QlxStrACat(3, words, ", "); }));
    OslMemoryFree(tries.exactly([] { return QlxStrTokIterGet(QlxStrTokIterator("a b", " ")); }));
    OslMemoryFree(tries.exactly([] { return QlxGetPlatformErrStr({'p', 2}); }));
    QlxFreeParm(tries.exactly([&] { return QlxCopyParm(&parm); }));
    QlxReportPlatformErr({'p', 2});
    CxMutex mutex = nullptr;
    const CxStatus made = CxMutexCreate(&mutex);
    EXPECT_EQ(made, mutex ? kSuccess : failure(ENOMEM));
    CxMutexDestroy(&mutex);
  });
}

TEST(AllocationFailureTest, PropertyListsStayAsTheyWere) {
  const TempDir dir;
  const std::string path = dir.write("file", "a = 1\nb = \\u0032\nb=3\n");
  withEveryFailure([&](Tries &tries) {
    CxPropList list{};
    CxStatus status = failure(7);
    tries.exactly([&] { return CxPropListRead(path.c_str(), &list, &status); });
    EXPECT_EQ(status, failure(7));  // no system error
    for (int i = 0; i < kMany; ++i) {
      const std::string key = "key" + std::to_string(i);
      const int32_t count = list.count;
      const uint8_t put =
          tries.exactly([&] { return CxPropListPutStr(&list, key.c_str(), "value"); });
      EXPECT_EQ(list.count, count + put);
      EXPECT_EQ(CxPropListHasKey(&list, key.c_str()), put);
    }
    if (CxPropListHasKey(&list, "key0")) {
      const uint8_t put = tries.exactly([&] { return CxPropListPutStr(&list, "key0", "new"); });
      EXPECT_STREQ(CxPropListPeekStr(&list, "key0", nullptr), put ? "new" : "value");
      uint8_t found = 7;
      char *copy = tries.exactly([&] { return CxPropListCopyStr(&list, "key0", &found); });
      EXPECT_EQ(found, copy != nullptr);
      OslMemoryFree(copy);
    }
    CxPropListRemove(&list, "key1");
    CxPropListDiscard(&list);
  });
}

TEST(AllocationFailureTest, ContainersOfStringsStayAsTheyWere) {
  withEveryFailure([](Tries &tries) {
    StringGroup *group = tries.exactly([] { return QlxAllocStringGroup(); });
    StringList *list = tries.exactly([] { return QlxAllocStringList(); });
    StringToStringMap *map = tries.exactly([] { return QlxAllocStringToStringMap(); });
    for (const char *text : {"a", "b", "c"}) {
      if (group) tries.exactly([&] { return QlxStringGroupAdd(group, text); });
      if (list) {
        const int32_t count = list->count;
        const uint8_t appended = tries.exactly([&] { return QlxStringListAppend(list, text); });
        EXPECT_EQ(list->count, count + appended);
      }
      // A new key may get a null value; without the key nothing is there.
      const uint8_t put = tries.mayFail(QlxStringToStringMapPut(map, text, text));
      EXPECT_EQ(QlxStringToStringMapHasKey(map, text), put);
    }
    OslMemoryFree(tries.mayFail(QlxStringGroupIterGet(QlxStringGroupIterator(group))));
    OslMemoryFree(tries.mayFail(QlxStringListIterGet(QlxStringListIterator(list))));
    OslMemoryFree(tries.mayFail(QlxStringToStringMapGet(map, "a")));
    // Deliberate: stored also when the copy of the new value failed; null took the old one's place.
    if (QlxStringToStringMapHasKey(map, "a")) {
      EXPECT_EQ(QlxStringToStringMapPut(map, "a", "other"), 1);
    }
    StringList *copy = tries.mayFail(QlxCopyStringList(list));
    EXPECT_LE(copy ? copy->count : 0, list ? list->count : 0);
    QlxFreeStringList(copy);
    QlxFreeStringToStringMap(tries.mayFail(QlxCopyStringToStringMap(map)));
    QlxStringGroupRem(group, "b");
    QlxStringToStringMapRem(map, "b");
    QlxFreeStringGroup(group);
    QlxFreeStringList(list);
    QlxFreeStringToStringMap(map);
  });
}

TEST(AllocationFailureTest, ContainersOfCountedElementsTakeNoReferenceForNothing) {
  withEveryFailure([](Tries &tries) {
    ObjCfg *cfg = tries.exactly([] { return QlxAllocObjCfg("cfg"); });
    StringToObjCfgMap *map = tries.exactly([] { return QlxAllocStringToObjCfgMap(); });
    if (cfg && map) {
      for (const char *key : {"a", "b"})
        tries.exactly([&] { return QlxStringToObjCfgMapPut(map, key, cfg); });
      StringToObjCfgMap *copy = tries.mayFail(QlxCopyStringToObjCfgMap(map));
      QlxFreeStringToObjCfgMap(copy);
    }
    QlxFreeStringToObjCfgMap(map);
    ParmList *parms = tries.exactly([] { return QlxAllocParmList(); });
    char text[] = "text";
    const Parm parm{.type = ParmString, .value = {.s = text}};
    if (parms) {
      tries.exactly([&] { return QlxParmListAppend(parms, &parm); });
      if (parms->head) QlxFreeParm(tries.exactly([&] { return QlxParmListIterGet(parms->head); }));
    }
    QlxFreeParmList(tries.mayFail(QlxCopyParmList(parms)));
    QlxFreeParmList(parms);
    EXPECT_EQ(cfg ? cfg->refCount : 1, 1U);
    QlxReleaseObjCfg(cfg);
  });
}

TEST(AllocationFailureTest, TypedPropertiesAreAbsent) {
  withEveryFailure([](Tries &tries) {
    StringToStringMap *map = tries.exactly([] { return QlxAllocStringToStringMap(); });
    QlxSetMapPropInt(map, "int", 42);
    QlxSetMapPropDouble(map, "double", 0.5);
    tries.mayFail(QlxSetMapPropBool(map, "bool", 1));
    uint8_t found = 7;
    const int32_t value = QlxGetMapPropInt(map, "int", &found);
    EXPECT_EQ(value, found ? 42 : 0);
    tries.mayFail(found);
    OslMemoryFree(tries.mayFail(QlxGetMapProp(map, "double", &found)));
    QlxFreeStringToStringMap(map);
  });
}

UChar *bind(Event *event, ...) {
  va_list args;
  va_start(args, event);
  UChar *text = QlxBindEventUMsg(event, qlxIntlBindUI18Msg, &args);
  va_end(args);
  return text;
}

// The text of an event made by hand is what it should be or null; what is held of it is dropped.
TEST(AllocationFailureTest, EventsGoOnWithWhatThereIs) {
  withEveryFailure([](Tries &tries) {
    Event *event =
        tries.mayFail(QlxVaAllocUEvent(INFO, nullptr, nullptr, u"{0} and {1,number,integer}"));
    QlxSetEventMessageId(event, "id");
    QlxSetEventMessageId(event, "other");
    qlxSetEventLocale(event, "de");
    OslMemoryFree(tries.mayFail(QlxGetEventMessageId(event)));
    OslMemoryFree(tries.mayFail(qlxGetEventLocale(event)));
    tries.mayFail(QlxSetEventProp(event, "product", "qlx"));
    QlxSetEventPropLong(event, "line", 1);
    OslMemoryFree(tries.mayFail(QlxGetEventProp(event, "product", nullptr)));
    UChar *text = tries.mayFail(bind(event, u"text", 7));
    EXPECT_EQ(std::u16string(text ? text : u"text and 7"), u"text and 7");
    OslMemoryFree(text);
    UChar *date = tries.mayFail(QlxBasicUFormatterFormatDate(nullptr, 0.0));
    OslMemoryFree(date);
    QlxFreeEvent(event);
    QlxCloseToolkit();
  });
}

TEST(AllocationFailureTest, MessagesAreCopiedWholeOrNotAtAll) {
  withEveryFailure([](Tries &tries) {
    char text[] = "text";
    const Parm parm{.type = ParmString, .value = {.s = text}};
    I18Msg *message = tries.exactly([] { return QlxAllocUI18Msg("bundle", "key", u"text"); });
    qlxSetI18MsgLocale(message, "de");
    ParmList *parms = tries.mayFail(qlxGetI18MsgParmList(message));
    tries.mayFail(QlxParmListAppend(parms, &parm));
    I18Msg *copy = tries.mayFail(QlxCopyI18Msg(message));
    if (copy) {
      EXPECT_STREQ(copy->bundle, "bundle");
      EXPECT_STREQ(copy->key, "key");
      EXPECT_EQ(std::u16string(copy->text), u"text");
    }
    EXPECT_EQ(QlxBindUI18Msg(message, nullptr), nullptr);  // there is no such bundle
    QlxFreeI18Msg(copy);
    qlxSetI18MsgLocale(message, nullptr);
    QlxFreeI18Msg(message);
  });
}

// Properties of a message event, long enough for the record's block to grow.
void describe(Event *event) {
  event->time = 1155718135123.0;
  QlxSetEventProp(event, "product", "qlx");
  QlxSetEventProp(event, "own", std::string(2000, 'x').c_str());
  QlxSetEventProp(event, "qlx_prop_srcfile", "main.c");
}

std::u16string xmlRecord(QlxObject *formatter, Event *event, ...) {
  va_list args;
  va_start(args, event);
  qlxPDXMLUFormatterCacheMessageID(formatter, event, &args);
  const std::u16string record = take(QlxPDXMLUFormatterFFormat(formatter, event, &args));
  va_end(args);
  return record;
}

// A record with its text and its identifier, when a failed bind has left them out.
std::u16string completed(std::u16string record, const std::u16string &text,
                         const std::u16string &id) {
  const auto fill = [&](const std::u16string &empty, const std::u16string &full) {
    const size_t at = record.find(empty);
    if (at != std::u16string::npos) record.replace(at, empty.size(), full);
  };
  fill(u"<LogText><![CDATA[]]>", u"<LogText><![CDATA[" + text + u"]]>");
  fill(u"Id=\"None\"", u"Id=\"" + id + u"\"");
  return record;
}

TEST(AllocationFailureTest, XmlRecordsAreWholeOrNullButForAMessageThatCannotBeBound) {
  const ResourceBundles bundles;
  ASSERT_TRUE(bundles.add("root", R"(k { "ABC001I {0} and {1,number,integer}" })"));
  Event *event = QlxVaAllocUEvent(INFO, bundles.path().c_str(), "k", nullptr);
  describe(event);
  std::u16string whole;
  withEveryFailure([&](Tries &tries) {
    qlxDropCachedFormats();
    ObjClass formatterClass = qlxPDXMLFormatterClass;
    QlxObject formatter{};
    formatter.objClass = &formatterClass;
    formatter.vars = tries.exactly([] { return QlxPDXMLFormatterFAllocVars(); });
    const std::u16string record = xmlRecord(&formatter, event, u"text", 7);
    if (whole.empty()) whole = record;
    if (tries.nothingFailed()) {
      EXPECT_EQ(record, whole);
      EXPECT_STREQ(event->messageId, "ABC001I");
    }
    if (record != u"<null>") {
      EXPECT_EQ(completed(record, u"ABC001I text and 7", u"ABC001I"), whole);
    }
    QlxPDXMLFormatterFFreeVars(formatter.vars);
    QlxSetEventMessageId(event, nullptr);
    qlxDropCachedFormats();
  });
  EXPECT_NE(whole.find(u"<Param><![CDATA[text]]></Param><Param><![CDATA[7]]></Param>"),
            std::u16string::npos);
  QlxFreeEvent(event);
}

}  // namespace
