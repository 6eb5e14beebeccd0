// A test with an open toolkit, the two host classes of the tests, and the logger "log".
#ifndef QLX_TESTS_CHAINTEST_H
#define QLX_TESTS_CHAINTEST_H

#include <memory>
#include <optional>

#include "object/QlxLocked.h"
#include "support/PlainFormatter.h"
#include "support/RecordingHandler.h"
#include "support/ToolkitTest.h"

class ChainTest : public ToolkitTest {
 protected:
  void SetUp() override {
    ToolkitTest::SetUp();
    formatter.emplace();
    recorder.emplace();
    logger = get("log", "qlx_basiclogger");
  }
  void TearDown() override {
    logger.reset();
    ToolkitTest::TearDown();
  }

  // Makes an object of a class a listener of the logger.
  Handle attach(const char *name, const char *className) {
    Handle object = get(name, className);
    EXPECT_EQ(QlxAddListener(logger.get(), object.get()), 1);
    return object;
  }

  // Gives a handler a formatter of a class; "test_plainformatter" when it is not said.
  void format(const Handle &handler, const char *name = "plain",
              const char *className = PlainFormatter::kClass) {
    const Handle object = get(name, className);
    QlxHandlerSetFormatter(handler.get(), object.get());
  }

  QlxLogResult log(const char16_t *text) { return QlxLogUText(logger.get(), text); }

  // Hands an event of a level to an object as its chain would.
  static void process(const Handle &object, int32_t level, const char16_t *text = u"text") {
    const ApiLock lock;
    Event *event = QlxVaAllocUEvent(level, nullptr, nullptr, text);
    object->objClass->op1.fProcess(object.get(), event, nullptr);
    QlxFreeEvent(event);
  }

  std::optional<PlainFormatter> formatter;
  std::optional<RecordingHandler> recorder;
  Handle logger;
};

// The same with a handler of a class behind the logger, a recording one when none is said.
class HandledChainTest : public ChainTest {
 protected:
  explicit HandledChainTest(const char *name = "recording",
                            const char *className = RecordingHandler::kClass)
      : name_(name), className_(className) {}

  void SetUp() override {
    ChainTest::SetUp();
    handler = attach(name_, className_);
  }
  void TearDown() override {
    handler.reset();
    ChainTest::TearDown();
  }

  Handle handler;

 private:
  const char *name_, *className_;
};

// What has come to the recording handlers, each text with "|" behind it.
#define EXPECT_RECORDED(expected) EXPECT_EQ(recorder->texts(), expected)

#endif
