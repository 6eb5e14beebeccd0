// Objects by name, their references and their listeners, against a simple model.
#ifndef QLX_TESTS_OBJECTSMODEL_H
#define QLX_TESTS_OBJECTSMODEL_H

#include <algorithm>
#include <array>
#include <string>
#include <utility>
#include <vector>

#include <qlx/qlx.h>

#include "object/QlxLocked.h"
#include "QlxObject.h"
#include "support/Choices.h"
#include "support/FailingMemory.h"
#include "support/ModelToolkit.h"

namespace models {

class ObjectsModel {
 public:
  explicit ObjectsModel(Choices &choices) : choices_(choices) {
    addClasses();
    while (choices_.next()) {
      step();
      check(any());
      if (choices_.step() % 64 == 0) {
        for (int i = 0; i < kCount; ++i) check(i);
      }
      require(closed() == closes_);
    }
    closeToolkit();
    require(closed() == closes_);
  }
  // After a mismatch.
  ~ObjectsModel() { closed() = 0; }
  ObjectsModel(const ObjectsModel &) = delete;
  ObjectsModel &operator=(const ObjectsModel &) = delete;

 private:
  static constexpr int kCount = 64;

  struct Thing {
    QlxObject *object = nullptr;  // null: there is none of that name
    uint32_t kind = 0;            // index of its class
    uint32_t handles = 0;
    std::vector<int> listeners;
  };

  static constexpr const char *kClasses[] = {"m_logger", "m_filter", "m_handler", "m_formatter"};
  static constexpr uint32_t kHandlers = 2, kFormatters = 3;

  // How many handlers were closed.
  static int &closed() {
    static int count;
    return count;
  }

  static void addClasses() {
    closed() = 0;
    QlxAddLoggerClass(kClasses[0], nullptr, nullptr, nullptr, QlxBasicObjectFCfgChange, nullptr);
    QlxAddFilterClass(kClasses[1], nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
    QlxAddHandlerClass(kClasses[2], nullptr, nullptr, nullptr, QlxBasicHandlerFCfgChange, nullptr,
                       nullptr, [](QlxObject *) { ++closed(); });
    QlxAddUFormatterClass(kClasses[3], nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                          nullptr, nullptr);
  }

  static std::string nameOf(int i) { return "object" + std::to_string(i); }
  int any() { return static_cast<int>(choices_.below(kCount)); }
  Thing &thing(int i) { return things_[static_cast<size_t>(i)]; }

  // Makes many objects for some time, and then releases many.
  void step() {
    if (choices_.one(128)) grows_ = !grows_;
    const int a = any(), b = any();
    switch (choices_.below(8)) {
      case 0:
      case 1:
        return grows_ ? get(a) : release(a);
      case 2:
        return release(a);
      case 3:
        return listen(a, b);
      case 4:
        return choices_.one(3) ? rename(a) : leave(a, b);
      case 5:
        return leaveFirst(a);
      case 6:
        if (choices_.one(200)) closeAndOpen();
        return;
      default:
        return acquire(a);
    }
  }

  void get(int i) {
    Thing &it = thing(i);
    const uint32_t kind = choices_.below(5);
    const char *className = kind < 4 ? kClasses[kind] : nullptr;
    FailingMemory memory;
    if (choices_.one(16)) memory.failOnce(1 + choices_.below(8));
    QlxObject *object = QlxGetObject(nameOf(i).c_str(), className);
    if (it.object) {
      require(object == (kind == 4 || kind == it.kind ? it.object : nullptr));
    } else if (object) {
      require(kind < 4);
      it = {object, kind, 0, {}};
    } else {
      require(kind == 4 || memory.failures() > 0);
    }
    it.handles += object != nullptr;
  }

  void acquire(int i) {
    if (!thing(i).object || thing(i).handles == 0) return;
    require(QlxAcquireObject(thing(i).object) == thing(i).object);
    ++thing(i).handles;
  }

  void release(int i) {
    if (thing(i).handles == 0) return;
    --thing(i).handles;
    QlxReleaseObject(thing(i).object);
    settle(i);
  }

  void listen(int owner, int listener) {
    const bool added = takes(owner) && thing(listener).object && !listens(owner, listener);
    FailingMemory memory;
    if (choices_.one(16)) memory.failOnce(1 + choices_.below(3));
    const uint8_t done = QlxAddListener(thing(owner).object, thing(listener).object);
    require(done == added || (!done && memory.failures() > 0));
    if (done) thing(owner).listeners.push_back(listener);
  }

  void leave(int owner, int listener) {
    const bool listened = takes(owner) && listens(owner, listener);
    require(QlxRemListener(thing(owner).object, thing(listener).object) == listened);
    if (!listened) return;
    std::erase(thing(owner).listeners, listener);
    settle(listener);
  }

  void leaveFirst(int owner) {
    if (!thing(owner).listeners.empty()) leave(owner, thing(owner).listeners.front());
  }

  // Sets "listenerNames": all go, and those that are still there come.
  void rename(int owner) {
    if (!takes(owner) || thing(owner).kind == 1 || thing(owner).handles == 0) return;
    std::vector<int> named;
    std::string names;
    for (uint32_t n = choices_.below(4); n > 0; --n) {
      named.push_back(any());
      names += nameOf(named.back()) + " ";
    }
    QlxSetObjProp(thing(owner).object, "listenerNames", names.c_str());
    for (const int i : std::exchange(thing(owner).listeners, {})) settle(i);
    for (const int i : named) {
      if (thing(i).object) addOnce(thing(owner).listeners, i);
    }
  }

  bool takes(int owner) { return thing(owner).object && thing(owner).kind != kFormatters; }
  bool listens(int owner, int listener) { return has(thing(owner).listeners, listener); }

  uint32_t groupsOf(int i) {
    return static_cast<uint32_t>(std::count_if(things_.begin(), things_.end(),
                                               [&](auto &it) { return has(it.listeners, i); }));
  }

  // An object that nobody holds any more goes, and lets its listeners go.
  void settle(int i) {
    if (!thing(i).object || thing(i).handles > 0 || groupsOf(i) > 0) return;
    const Thing gone = std::exchange(thing(i), {});
    closes_ += gone.kind == kHandlers;
    for (const int listener : gone.listeners) settle(listener);
  }

  // Held handles are inert afterwards.
  void closeToolkit() {
    QlxCloseToolkit();
    for (Thing &it : things_) {
      closes_ += it.object && it.kind == kHandlers;
      for (; it.handles > 0; --it.handles) {
        require(QlxGetObjectName(it.object) == nullptr);
        require(QlxAddListener(it.object, it.object) == 0);
        require(QlxGetListeners(it.object) == nullptr);
        require(QlxIsObjectEnabled(it.object) == 0);
        QlxReleaseObject(it.object);
      }
      it = {};
    }
    require(closed() == closes_);
    closes_ = 0;
    closed() = 0;
  }

  void closeAndOpen() {
    closeToolkit();
    require(QlxOpenToolkit(nullptr, nullptr) == 1);
    addClasses();
  }

  void check(int i) {
    const Thing &it = thing(i);
    const ApiLock lock;
    const ObjectRef registered{qlxToolkitGetObjInstance(nameOf(i).c_str())};
    require(registered.get() == it.object);
    if (!it.object) return;
    require(it.object->refCount == 2 + it.handles + groupsOf(i));
    const ListenerGroupNode *node = qlxIntlGetListeners(it.object);
    for (const int listener : it.listeners) {
      require(node && node->value == thing(listener).object);
      node = node->next;
    }
    require(!node);
  }

  Choices &choices_;
  const Toolkit toolkit_;
  std::array<Thing, kCount> things_;
  int closes_ = 0;
  bool grows_ = true;
};

}  // namespace models

#endif
