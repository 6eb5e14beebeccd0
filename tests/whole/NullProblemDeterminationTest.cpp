// Null arguments of message identifiers and of the classes for problem determination.
#include <cstring>

#include <qlx/class.h>
#include <qlx/qlx.h>

#include "support/NullCalls.h"
#include "support/OpenToolkit.h"

namespace {

constexpr const UChar *kText = u"ABC0001E text";

NULL_GROUP(MessageIdentifiers) {
  NULLS(CxParseKMSID, with(nullptr), [](CxKMSIDInfo info) {
    EXPECT_STREQ(info.version, "");
    EXPECT_EQ(info.length, 0);
  });
  NULLS(qlxPDXMLGetMessageID, with(nullptr), isZero);
  NULLS(qlxPDXMLUGetMessageID, with(nullptr), isZero);
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, kText);
  const auto storesId = [&] {
    EXPECT_EQ(take(QlxGetEventMessageId(event)), "ABC0001E");
    QlxSetEventMessageId(event, nullptr);
  };
  const OpenToolkit toolkit;
  QlxObject *formatter = QlxGetObject("xml", "qlx_xmlformatter");
  va_list *const noArgs = nullptr;
  HELD(
      qlxPDXMLUFormatterCacheMessageID, with(formatter, event, noArgs), storesId,
      [&] { EXPECT_EQ(QlxGetEventMessageId(event), nullptr); }, storesId);
  QlxReleaseObject(formatter);
  QlxFreeEvent(event);
}

NULL_GROUP(Wildcards) {
  NULLS(QlxPatternMatch, with("*", "text"), isZero, isZero);
  StringList *patterns = QlxMsgIdFilterGetStringList("*");
  NULLS(QlxMsgIdFilterMatchMsgId, with(patterns, "text"), isZero, isZero);
  qlxIntlFreeStringList(patterns);
  NULLS(QlxMsgIdFilterGetStringList, with(nullptr), [](StringList *list) {
    ASSERT_NE(list, nullptr);
    EXPECT_EQ(qlxIntlStringListIterator(list), nullptr);
    qlxIntlFreeStringList(list);
  });
}

NULL_GROUP(MessageIdentifierFilters) {
  const OpenToolkit toolkit;
  QlxObject *filter = QlxGetObject("filter", "qlx_msgidfilter");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, kText);
  HELD(QlxMsgIdFilterFFreeVars, with(nullptr), nothing);
  HELD(QlxMsgIdFilterFCfgChange, with(filter, "msgIds"), nothing);
  HELD(QlxMsgIdFilterFIsLoggable, with(filter, event, nullptr), isZero, isZero, is(1));
  QlxFreeEvent(event);
  QlxReleaseObject(filter);
}

NULL_GROUP(ProblemDeterminationLoggers) {
  const OpenToolkit toolkit;
  QlxObject *logger = QlxGetObject("logger", "qlx_pdlogger");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, kText);
  HELD(QlxPDLoggerFFreeVars, with(nullptr), nothing);
  HELD(QlxPDLoggerFCfgChange, with(logger, "server"), nothing);
  HELD(QlxPDLoggerFLog, with(logger, event, nullptr), nothing);
  EXPECT_EQ(take(QlxGetEventMessageId(event)), "ABC0001E");  // without arguments too
  QlxFreeEvent(event);
  QlxReleaseObject(logger);
}

NULL_GROUP(XmlAndTraceFormatters) {
  const OpenToolkit toolkit;
  QlxObject *xml = QlxGetObject("xml", "qlx_xmlformatter");
  QlxObject *trace = QlxGetObject("trace", "qlx_vextraceformatter");
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, kText);
  const auto hasText = [](UChar *record) {
    EXPECT_NE(take(record).find(kText), std::u16string::npos);
  };
  HELD(QlxPDXMLFormatterFFreeVars, with(nullptr), nothing);
  HELD(QlxPDXMLFormatterFCfgChange, with(xml, "singleServer"), nothing);
  HELD(QlxPDXMLFormatterFGetHeader, with(nullptr), isZero);
  HELD(QlxPDXMLFormatterFGetTrailer, with(nullptr), isZero);
  HELD(QlxPDXMLUFormatterFFormat, with(xml, event, nullptr), isZero, isZero, hasText);
  HELD(QlxVexTraceUFormatterFFormat, with(trace, event, nullptr), isZero, isZero, hasText);
  QlxFreeEvent(event);
  for (QlxObject *held : {xml, trace}) QlxReleaseObject(held);
}

}  // namespace
