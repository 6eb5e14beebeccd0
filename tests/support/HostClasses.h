// A host's classes, one of each kind, that write down which of their operations ran and do what a
// test asks of them, under the API lock.
#ifndef QLX_TESTS_HOSTCLASSES_H
#define QLX_TESTS_HOSTCLASSES_H

#include <functional>
#include <string>
#include <vector>

#include <qlx/qlx.h>

class HostClasses {
 public:
  static constexpr const char *kLogger = "test_hostlogger";
  static constexpr const char *kFilter = "test_hostfilter";
  static constexpr const char *kHandler = "test_hosthandler";
  static constexpr const char *kFormatter = "test_hostformatter";

  // Registers the classes; the object lives until the toolkit is closed.
  HostClasses() {
    current() = this;
    QlxAddLoggerClass(kLogger, nullptr, alloc, free, change, log);
    QlxAddFilterClass(kFilter, nullptr, alloc, free, change, nullptr, ask, nullptr);
    QlxAddHandlerClass(kHandler, nullptr, alloc, free, change, process, nullptr, close);
    QlxAddUFormatterClass(kFormatter, nullptr, alloc, free, change, format, nullptr, trailer,
                          nullptr);
  }
  ~HostClasses() { current() = nullptr; }
  HostClasses(const HostClasses &) = delete;
  HostClasses &operator=(const HostClasses &) = delete;

  // "alloc", "free", "free null", and "change", "log", "ask", "process", "close", "format",
  // "trailer" with a blank and the object's name; after "change" also "=" and the key.
  std::vector<std::string> calls;

  std::function<void()> onAlloc;
  std::function<void(void *vars)> onFree;
  std::function<void(QlxObject *, const char *key)> onChange;
  std::function<void(QlxObject *, Event *)> onEvent;  // with "log", "process" and "format"
  std::function<void(QlxObject *)> onClose;
  uint8_t answer = 1;  // of a filter

  // The calls since the last look, each with "|" behind it.
  std::string takeCalls() {
    std::string all;
    for (const std::string &call : calls) all += call + "|";
    calls.clear();
    return all;
  }

  int count(const std::string &call) const {
    int found = 0;
    for (const std::string &made : calls) found += made == call;
    return found;
  }

 private:
  static HostClasses *&current() {
    static HostClasses *object;
    return object;
  }

  static void note(const char *what, QlxObject *object) {
    current()->calls.push_back(std::string(what) + " " + object->name);
  }
  template <typename Hook, typename... Args>
  static void run(const Hook &hook, Args... args) {
    if (hook) hook(args...);
  }

  static void *alloc() {
    current()->calls.push_back("alloc");
    run(current()->onAlloc);
    return OslMemoryMalloc(1);
  }
  static void free(void *vars) {
    current()->calls.push_back(vars ? "free" : "free null");
    run(current()->onFree, vars);
    OslMemoryFree(vars);
  }
  static void change(QlxObject *object, const char *key) {
    note("change", object);
    current()->calls.back() += std::string("=") + (key ? key : "<null>");
    run(current()->onChange, object, key);
    const int32_t kind = object->objClass ? object->objClass->kind : 0;
    (kind == Handler ? QlxBasicHandlerFCfgChange : QlxBasicObjectFCfgChange)(object, key);
  }
  static void log(QlxObject *logger, Event *event, va_list *args) {
    note("log", logger);
    run(current()->onEvent, logger, event);
    QlxBasicObjectFLog(logger, event, args);
  }
  static uint8_t ask(QlxObject *filter, Event *, va_list *) {
    note("ask", filter);
    return current()->answer;
  }
  static void process(QlxObject *handler, Event *event, va_list *args) {
    note("process", handler);
    run(current()->onEvent, handler, event);
    QlxBasicObjectFLog(handler, event, args);
  }
  static void close(QlxObject *handler) {
    note("close", handler);
    run(current()->onClose, handler);
  }
  static UChar *format(QlxObject *formatter, Event *event, va_list *) {
    note("format", formatter);
    run(current()->onEvent, formatter, event);
    return nullptr;
  }
  static char *trailer(QlxObject *formatter) {
    note("trailer", formatter);
    return OslStringDup(formatter->vars ? "whole" : "broken");
  }
};

#endif
