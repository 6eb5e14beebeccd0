// The key "utc" of the formatters, and of whom it is none.
#include <functional>
#include <memory>
#include <string>

#include <qlx/class/event.h>
#include <qlx/class/formatter.h>
#include <qlx/event.h>

#include "object/QlxLocked.h"
#include "support/IcuDefaults.h"
#include "support/ToolkitTest.h"

namespace {

constexpr double kTime = 1155725335123.0;  // 2006-08-16 10:48:55.123 UTC

class FormatterUtcTest : public ToolkitTest {
 protected:
  void SetUp() override {
    ToolkitTest::SetUp();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"Asia/Kolkata"));
    handler_ = get("handler", "qlx_consolehandler");
  }
  void TearDown() override {
    formatter_.reset();
    handler_.reset();
    ToolkitTest::TearDown();
  }

  void use(const char *className) {
    formatter_ = get(className, className);
    QlxHandlerSetFormatter(handler_.get(), formatter_.get());
  }
  void set(const char *key, const char *value) { QlxSetObjProp(formatter_.get(), key, value); }

  std::u16string record() {
    const std::unique_ptr<Event, decltype(&QlxFreeEvent)> event{
        QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text"), QlxFreeEvent};
    event->time = kTime;
    UChar *text = QlxUHandlerDoFmt(handler_.get(), event.get(), nullptr);
    const std::u16string taken = text ? text : u"<null>";
    OslMemoryFree(text);
    return taken;
  }
  bool has(const UChar *time) { return record().find(time) != std::u16string::npos; }

  IcuDefaults defaults_;
  Handle handler_, formatter_;
};

constexpr const char *kFormatters[] = {"qlx_basicformatter", "qlx_xmlformatter"};
constexpr const UChar *kUtc = u"2006-08-16 10:48:55.123+00:00";
constexpr const UChar *kLocal = u"2006-08-16 16:18:55.123+05:30";

TEST_F(FormatterUtcTest, IsOffAtFirst) {
  for (const char *className : kFormatters) {
    use(className);
    EXPECT_TRUE(has(kLocal)) << className;
  }
}

TEST_F(FormatterUtcTest, WritesTimesInUtcWithTheOffsetZero) {
  for (const char *className : kFormatters) {
    use(className);
    set("utc", "true");
    EXPECT_TRUE(has(kUtc)) << className;
  }
}

TEST_F(FormatterUtcTest, EndsWithFalseAnyOtherWordAndNoValue) {
  for (const char *className : kFormatters) {
    use(className);
    for (const char *value : {"false", "yes", "", static_cast<const char *>(nullptr)}) {
      set("utc", "TRUE");
      EXPECT_TRUE(has(kUtc));
      set("utc", value);
      EXPECT_TRUE(has(kLocal)) << (value ? value : "none");
    }
  }
}

TEST_F(FormatterUtcTest, HoldsForAPatternOfTheFormattersOwn) {
  for (const char *className : kFormatters) {
    use(className);
    set("dateTimeFormat", "HH:mm:ss.SSS XXX zzzz");
    set("utc", "true");
    EXPECT_TRUE(has(u"10:48:55.123 Z Coordinated Universal Time")) << className;
  }
}

TEST_F(FormatterUtcTest, DoesNotFollowTheDefaultZone) {
  use(kFormatters[0]);
  set("utc", "true");
  for (const UChar *zone : {u"Europe/Berlin", u"America/St_Johns", u"Africa/Monrovia"}) {
    ASSERT_TRUE(IcuDefaults::setZone(zone));
    EXPECT_TRUE(has(kUtc));
  }
}

TEST_F(FormatterUtcTest, IsEachFormattersOwn) {
  use(kFormatters[0]);
  set("utc", "true");
  const Handle other = get("other", kFormatters[0]);
  for (int i = 0; i < 3; ++i) {
    QlxHandlerSetFormatter(handler_.get(), other.get());
    EXPECT_TRUE(has(kLocal));
    QlxHandlerSetFormatter(handler_.get(), formatter_.get());
    EXPECT_TRUE(has(kUtc));
  }
}

TEST_F(FormatterUtcTest, ComesFromAConfiguration) {
  configure("made", "utc", "true");
  const Handle made = get("made", kFormatters[0]);
  QlxHandlerSetFormatter(handler_.get(), made.get());
  EXPECT_TRUE(has(kUtc));
}

TEST_F(FormatterUtcTest, HoldsForADateAlone) {
  use(kFormatters[0]);
  set("utc", "true");
  const ApiLock lock;
  UChar *date = QlxBasicUFormatterFormatDate(formatter_.get(), kTime);
  EXPECT_EQ(std::u16string(date), kUtc);
  OslMemoryFree(date);
}

TEST_F(FormatterUtcTest, IsNoKeyOfTheTraceFormatter) {
  use("qlx_vextraceformatter");
  set("utc", "true");
  EXPECT_TRUE(has(kLocal));
}

// Its variables are none of the library's, whatever they hold.
TEST_F(FormatterUtcTest, IsNoKeyOfAHostsClass) {
  static const auto alloc = []() -> void * {
    void *vars = OslMemoryMalloc(1);
    *static_cast<uint8_t *>(vars) = 1;
    return vars;
  };
  QlxAddUFormatterClass("host", nullptr, alloc, OslMemoryFree, QlxBasicFormatterFCfgChange, nullptr,
                        nullptr, nullptr, nullptr);
  use("host");
  EXPECT_TRUE(has(kLocal));
  set("utc", "true");
  EXPECT_TRUE(has(kLocal));
}

}  // namespace
