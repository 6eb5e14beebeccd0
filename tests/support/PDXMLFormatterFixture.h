// A test with an XML formatter in an open toolkit, events of one moment, and whole records of them.
#ifndef QLX_TESTS_PDXMLFORMATTERFIXTURE_H
#define QLX_TESTS_PDXMLFORMATTERFIXTURE_H

#include <gtest/gtest.h>

#include <string>

#include <qlx/class/event.h>
#include <qlx/class/formatter.h>
#include <qlx/class/message.h>

#include "object/QlxLocked.h"
#include "support/IcuDefaults.h"
#include "support/Take.h"
#include "support/ToolkitTest.h"
#include "util/CxOwned.h"

inline constexpr double kTime = 1155718135123.0;  // 2006-08-16 08:48:55.123 UTC
inline const std::u16string kTimeElement =
    u" <Time Millis=\"1155718135123\">2006-08-16 10:48:55.123+02:00</Time>\n";
inline const std::u16string kNoSource = u" <Source FileName=\"None\" Method=\"None\"/>\n";

class PDXMLFormatterFixture : public ToolkitTest {
 protected:
  using EventPtr = Owned<Event, QlxFreeEvent>;

  void SetUp() override {
    ToolkitTest::SetUp();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
    formatter_ = get("xml", "qlx_xmlformatter");
    ASSERT_TRUE(formatter_);
  }
  void TearDown() override {
    formatter_.reset();
    ToolkitTest::TearDown();
  }

  // An event with a text: a trace, unless it is marked.
  static EventPtr makeEvent(const UChar *text = u"text", int32_t level = INFO) {
    return stamped(QlxVaAllocUEvent(level, nullptr, nullptr, text));
  }

  static EventPtr makeMessage(const std::string &bundle, const char *key, int32_t level = WARN) {
    return stamped(QlxVaAllocUEvent(level, bundle.c_str(), key, nullptr));
  }

  static EventPtr stamped(Event *event) {
    event->time = kTime;
    return EventPtr{event};
  }

  // A message without a bundle.
  static EventPtr markedMessage(const UChar *text) {
    EventPtr event = makeEvent(text);
    event->isMessage = 1;
    return event;
  }

  void configureTo(const char *key, const char *value) {
    EXPECT_EQ(QlxSetObjProp(formatter_.get(), key, value), 1);
  }

  static std::u16string recordBy(QlxObject *formatter, Event *event, va_list *args) {
    const ApiLock lock;
    return ::take(QlxPDXMLUFormatterFFormat(formatter, event, args));
  }
  std::u16string record(const EventPtr &event) {
    return recordBy(formatter_.get(), event.get(), nullptr);
  }
  std::u16string recordWith(Event *event, ...) {
    va_list args;
    va_start(args, event);
    const std::u16string text = recordBy(formatter_.get(), event, &args);
    va_end(args);
    return text;
  }

  std::u16string startOf(const EventPtr &event) {
    const std::u16string whole = record(event);
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
    EXPECT_EQ(QlxPDXMLFormatterFGetHeader(formatter_.get()), nullptr);
  }

  IcuDefaults defaults_;
  Handle formatter_;
};

#endif
