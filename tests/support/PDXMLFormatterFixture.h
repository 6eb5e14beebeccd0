// A test with the XML formatter, and the parts of its records.
#ifndef QLX_TESTS_PDXMLFORMATTERFIXTURE_H
#define QLX_TESTS_PDXMLFORMATTERFIXTURE_H

#include "support/FormatterTest.h"

inline const std::u16string kTimeElement =
    u" <Time Millis=\"1155718135123\">2006-08-16 10:48:55.123+02:00</Time>\n";
inline const std::u16string kNoSource = u" <Source FileName=\"None\" Method=\"None\"/>\n";

class PDXMLFormatterFixture : public FormatterTest {
 protected:
  PDXMLFormatterFixture() : FormatterTest("qlx_xmlformatter", QlxPDXMLUFormatterFFormat) {}

  // A message without a bundle.
  static EventPtr markedMessage(const UChar *text) {
    EventPtr event = makeEvent(text);
    event->isMessage = 1;
    return event;
  }

  std::u16string startOf(const EventPtr &event) {
    const std::u16string whole = formatted(event);
    return whole.substr(0, whole.find(u'\n') + 1);
  }

  static bool has(const std::u16string &record, const std::u16string &part) {
    return record.find(part) != std::u16string::npos;
  }

  static std::u16string trace(const std::u16string &inner = u"", const std::u16string &end = u"") {
    return u"<Trace Level=\"INFO\">\n" + kTimeElement + inner +
           u" <LogText><![CDATA[text]]></LogText>\n" + kNoSource + end + u"</Trace>\n";
  }

  void resetHeader() {
    const ApiLock lock;
    EXPECT_EQ(QlxPDXMLFormatterFGetHeader(formatter.get()), nullptr);
  }
};

#endif
