// A host's operations that throw: the process ends with a line that names the operation.
#include <gtest/gtest.h>

#include <csetjmp>
#include <stdexcept>

#include "support/Child.h"
#include "support/OwnThread.h"
#include "support/ToolkitTest.h"

namespace {

constexpr const char *kClass = "test_throwing";

// An operation of any kind.
template <typename Result, typename... Args>
Result throwing(Args...) {
  throw std::runtime_error("of the host");
}

void *allocVars() {
  return OslMemoryMalloc(1);
}

// The objects that the rows need: each of class kClass when its kind has it, else a built-in one.
struct Chain : ToolkitTest {
  void TestBody() override {}

  static void addLogger(fLog log) {
    QlxAddLoggerClass(kClass, nullptr, nullptr, nullptr, nullptr, log);
  }
  static void addFilter(fProcess process, fIsLoggable isLoggable, fLog log) {
    QlxAddFilterClass(kClass, nullptr, nullptr, nullptr, nullptr, process, isLoggable, log);
  }
  static void addHandler(fProcess process, fOpen open, fClose close) {
    QlxAddHandlerClass(kClass, nullptr, nullptr, nullptr, nullptr, process, open, close);
  }
  static void addFormatter(fFormat format, fGetHeader header, fGetTrailer trailer, fBindMsg bind) {
    QlxAddUFormatterClass(kClass, nullptr, nullptr, nullptr, nullptr, format, header, trailer,
                          bind);
  }
  static void addWithVars(fAllocVars alloc, fFreeVars free, fCfgChange change) {
    QlxAddHandlerClass(kClass, nullptr, alloc, free, change, nullptr, nullptr, nullptr);
  }

  static void make() { const Handle object = get("object", kClass); }
  static void makeAndClose() {
    const Handle object = get("object", kClass);
    QlxCloseToolkit();
  }
  static void set() {
    const Handle object = get("object", kClass);
    QlxSetObjProp(object.get(), "key", "value");
  }
  static void log() {
    const Handle logger = get("object", kClass);
    QlxLogUText(logger.get(), u"text");
  }
  static void logToListener() {
    const Handle logger = get("logger", "qlx_basiclogger"), listener = get("object", kClass);
    QlxAddListener(logger.get(), listener.get());
    QlxLogUText(logger.get(), u"text");
  }
  static void askFilter() {
    const Handle filter = get("object", kClass);
    QlxIsLoggableByFilter(filter.get(), event(), nullptr);
  }

  static Handle handlerWithFormatter() {
    Handle handler = get("handler", "qlx_consolehandler");
    const Handle formatter = get("object", kClass);
    QlxHandlerSetFormatter(handler.get(), formatter.get());
    return handler;
  }
  static void format() {
    const Handle handler = handlerWithFormatter();
    OslMemoryFree(QlxUHandlerDoFmt(handler.get(), event(), nullptr));
  }
  static void header() { OslMemoryFree(QlxHandlerGetFmtHeader(handlerWithFormatter().get())); }
  static void trailer() { OslMemoryFree(QlxHandlerGetFmtTrailer(handlerWithFormatter().get())); }

  static Event *event() { return QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text"); }
};

struct Row {
  const char *operation;
  const char *when;
  void (*add)();
  void (*call)();
};

std::ostream &operator<<(std::ostream &out, const Row &row) {
  return out << row.operation << row.when;
}

class ThrowingOperationTest : public ToolkitTest, public ::testing::WithParamInterface<Row> {};

// The host would catch it.
void callAndCatch(const Row &row) {
  try {
    row.call();
  } catch (...) {
  }
}

TEST_P(ThrowingOperationTest, EndsTheProcessAndIsNamed) {
  const Row &row = GetParam();
  row.add();
  EXPECT_DEATH(callAndCatch(row), std::string("^qlx: an exception left the operation ") +
                                      row.operation + " of the class test_throwing\n$");
}

using C = Chain;

INSTANTIATE_TEST_SUITE_P(
    Operations, ThrowingOperationTest,
    ::testing::Values(
        Row{"fAllocVars", "", [] { C::addWithVars(throwing, nullptr, nullptr); }, C::make},
        Row{"fFreeVars", "OfTheLastReference", [] { C::addWithVars(allocVars, throwing, nullptr); },
            C::make},
        Row{"fFreeVars", "OfAClosedToolkit", [] { C::addWithVars(allocVars, throwing, nullptr); },
            C::makeAndClose},
        Row{"fCfgChange", "", [] { C::addWithVars(nullptr, nullptr, throwing); }, C::set},
        Row{"fLog", "OfALogger", [] { C::addLogger(throwing); }, C::log},
        Row{"fLog", "OfAFilter", [] { C::addFilter(nullptr, nullptr, throwing); },
            C::logToListener},
        Row{"fIsLoggable", "OfAnEvent", [] { C::addFilter(nullptr, throwing, nullptr); },
            C::logToListener},
        Row{"fIsLoggable", "OfAHostsQuestion", [] { C::addFilter(nullptr, throwing, nullptr); },
            C::askFilter},
        Row{"fProcess", "OfAFilter", [] { C::addFilter(throwing, nullptr, nullptr); },
            C::logToListener},
        Row{"fProcess", "OfAHandler", [] { C::addHandler(throwing, nullptr, nullptr); },
            C::logToListener},
        Row{"fClose", "OfTheLastReference", [] { C::addHandler(nullptr, nullptr, throwing); },
            C::make},
        Row{"fClose", "OfAClosedToolkit", [] { C::addHandler(nullptr, nullptr, throwing); },
            C::makeAndClose},
        Row{"fFormat", "", [] { C::addFormatter(throwing, nullptr, nullptr, nullptr); }, C::format},
        Row{"fGetHeader", "", [] { C::addFormatter(nullptr, throwing, nullptr, nullptr); },
            C::header},
        Row{"fGetTrailer", "", [] { C::addFormatter(nullptr, nullptr, throwing, nullptr); },
            C::trailer},
        Row{"fBindMsg", "", [] { C::addFormatter(nullptr, nullptr, nullptr, throwing); },
            C::format}),
    [](const auto &info) { return std::string(info.param.operation) + info.param.when; });

using OperationTest = ToolkitTest;

TEST_F(OperationTest, MayThrowInside) {
  Chain::addHandler(
      [](QlxObject *, Event *, va_list *) {
        try {
          throw std::runtime_error("of the host");
        } catch (const std::exception &) {
        }
      },
      nullptr, nullptr);
  Chain::logToListener();
}

TEST_F(OperationTest, FOpenIsTheHostsToCall) {
  Chain::addHandler(nullptr, throwing, nullptr);
  Chain::logToListener();
  Chain::makeAndClose();
}

// Only a thread that may be cancelled could be ended so; pthread_exit() ends any.
TEST_F(OperationTest, ThatEndsItsThreadEndsTheProcess) {
  Chain::addHandler([](QlxObject *, Event *, va_list *) { pthread_exit(nullptr); }, nullptr,
                    nullptr);
  const auto logInAThread = [] { OwnThread([] { Chain::logToListener(); }).endsCancelled(); };
  EXPECT_DEATH(logInAThread(),
               "^qlx: the end of a thread left the operation fProcess of the class test_throwing");
}

std::jmp_buf gOut;

// Nothing can notice it.
TEST_F(OperationTest, ThatJumpsOutLeavesTheLockHeld) {
  Chain::addHandler([](QlxObject *, Event *, va_list *) { std::longjmp(gOut, 1); }, nullptr,
                    nullptr);
  Child child([] {
    if (setjmp(gOut) == 0) Chain::logToListener();
    EXPECT_FALSE(isCancellable());
    qlxAPIMutexUnlock();
    EXPECT_TRUE(isCancellable());
  });
  EXPECT_EQ(child.end(), 0);
}

}  // namespace
