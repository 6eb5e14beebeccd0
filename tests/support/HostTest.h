// A test with an open toolkit and a host's classes.
#ifndef QLX_TESTS_HOSTTEST_H
#define QLX_TESTS_HOSTTEST_H

#include <optional>

#include "object/QlxLocked.h"
#include "support/HostClasses.h"
#include "support/ToolkitTest.h"

class HostTest : public ToolkitTest {
 protected:
  void SetUp() override {
    ToolkitTest::SetUp();
    host.emplace();
  }

  // Has an object process an event, as the chain above it would.
  static void pass(QlxObject *object, void (*operation)(QlxObject *, Event *, va_list *)) {
    const ApiLock lock;
    Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
    operation(object, event, nullptr);
    QlxFreeEvent(event);
  }

  // Whether an object of that name is registered.
  static bool exists(const char *name) {
    const ApiLock lock;
    const ObjectRef found{qlxToolkitGetObjInstance(name)};
    return found != nullptr;
  }

  // The names of an object's listeners, in order, each with "|" behind it. Takes no lock.
  static std::string listenersOf(const Handle &object) {
    std::string names;
    const ListenerGroupNode *it = qlxIntlGetListeners(object.get());
    for (; it; it = it->next) names += std::string(it->value->name) + "|";
    return names;
  }

  std::optional<HostClasses> host;
};

#endif
