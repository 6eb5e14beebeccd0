// A test with a formatter of a class, "formatter", in an open toolkit, events of one moment, and
// what the formatter makes of them.
#ifndef QLX_TESTS_FORMATTERTEST_H
#define QLX_TESTS_FORMATTERTEST_H

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

class FormatterTest : public ToolkitTest {
 protected:
  using EventPtr = Owned<Event, QlxFreeEvent>;
  using Format = UChar *(QlxObject *, Event *, va_list *);

  // Without a format: the class's own.
  explicit FormatterTest(const char *className, Format *format = nullptr)
      : className_(className), format_(format) {}

  void SetUp() override {
    ToolkitTest::SetUp();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"Europe/Berlin"));
    formatter = get("formatter", className_);
    ASSERT_TRUE(formatter);
  }
  void TearDown() override {
    formatter.reset();
    ToolkitTest::TearDown();
  }

  // An event with a text: a trace, unless it is marked.
  static EventPtr makeEvent(const UChar *text = u"text", int32_t level = INFO) {
    return stamped(QlxVaAllocUEvent(level, nullptr, nullptr, text));
  }
  static EventPtr makeMessage(const std::string &bundle, const char *key, int32_t level = WARN) {
    return stamped(QlxVaAllocUEvent(level, bundle.c_str(), key, nullptr));
  }

  static void set(const EventPtr &event, const char *key, const char *value) {
    EXPECT_EQ(QlxSetEventProp(event.get(), key, value), 1);
  }

  // Configures the formatter.
  void set(const char *key, const char *value) {
    EXPECT_EQ(QlxSetObjProp(formatter.get(), key, value), 1);
  }

  void clear(const char *key) { ToolkitTest::clear(formatter, key); }

  // What becomes of an event, "<null>" for nothing.
  std::u16string formatted(const EventPtr &event) {
    return formattedBy(formatter.get(), event.get());
  }
  std::u16string formattedWith(const Event *event, ...) {
    va_list args;
    va_start(args, event);
    const std::u16string text = formattedBy(formatter.get(), const_cast<Event *>(event), &args);
    va_end(args);
    return text;
  }
  std::u16string formattedBy(QlxObject *object, Event *event, va_list *args = nullptr) const {
    const ApiLock lock;
    return ::take((format_ ? format_ : object->objClass->op1.fFormat)(object, event, args));
  }

  const IcuDefaults defaults;
  Handle formatter;

 private:
  static EventPtr stamped(Event *event) {
    event->time = kTime;
    return EventPtr{event};
  }

  const char *className_;
  Format *format_;
};

#endif
