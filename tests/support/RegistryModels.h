// The toolkit's registries against simple models: objects by name with their listeners, classes,
// configurations, and the passing of events. Each check opens a toolkit for itself.
#ifndef QLX_TESTS_REGISTRYMODELS_H
#define QLX_TESTS_REGISTRYMODELS_H

#include <algorithm>
#include <array>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <qlx/qlx.h>

#include "QlxLocked.h"
#include "QlxObjConfig.h"
#include "QlxObject.h"
#include "support/Choices.h"
#include "support/FailingMemory.h"
#include "support/Take.h"

namespace models {

class Toolkit {
 public:
  Toolkit() { require(QlxOpenToolkit(nullptr, nullptr) == 1); }
  ~Toolkit() { QlxCloseToolkit(); }
  Toolkit(const Toolkit &) = delete;
  Toolkit &operator=(const Toolkit &) = delete;
};

using Names = std::vector<std::string>;

inline Names namesFrom(const StringGroupNode *it) {
  Names names;
  for (; it; it = it->next) names.push_back(it->value);
  return names;
}

template <typename T>
bool has(const std::vector<T> &all, const T &one) {
  return std::find(all.begin(), all.end(), one) != all.end();
}
template <typename T>
void addOnce(std::vector<T> &all, const T &one) {
  if (!has(all, one)) all.push_back(one);
}

// ---- Objects by name, their references and their listeners

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

// ---- Passing events to listeners that change the group

// The rule: next is the first one in the group that had nothing yet.
class PassesModel {
 public:
  explicit PassesModel(Choices &choices) : choices_(choices) {
    current() = this;
    QlxAddHandlerClass("m_passes", nullptr, nullptr, nullptr, nullptr, process, nullptr, nullptr);
    owner_ = QlxGetObject("owner", "qlx_basiclogger");
    for (int i = 0; i < kCount; ++i) {
      all_[static_cast<size_t>(i)] = QlxGetObject(("h" + std::to_string(i)).c_str(), "m_passes");
    }
    const ApiLock lock;
    while (choices_.next()) {
      largest_ = 1 + choices_.below(kCount);
      changes_ = choices_.below(6);
      for (uint32_t n = choices_.below(20); n > 0; --n) change();
      pass();
    }
  }
  ~PassesModel() {
    for (QlxObject *object : all_) QlxReleaseObject(object);
    QlxReleaseObject(owner_);
    current() = nullptr;
  }
  PassesModel(const PassesModel &) = delete;
  PassesModel &operator=(const PassesModel &) = delete;

 private:
  static constexpr int kCount = 64;

  static PassesModel *&current() {
    static PassesModel *model;
    return model;
  }

  // A mismatch does not leave the library's functions: it is kept until the pass is over.
  static void process(QlxObject *object, Event *, va_list *) {
    try {
      if (!current()->mismatch_) current()->get(object);
    } catch (const Mismatch &mismatch) {
      current()->mismatch_ = mismatch;
    }
  }

  void pass() {
    had_.clear();
    Event event = {};
    QlxBasicObjectFLog(owner_, &event, nullptr);
    if (mismatch_) throw *mismatch_;
    require(next() == model_.end());
    const ListenerGroupNode *node = qlxIntlGetListeners(owner_);
    for (const int i : model_) {
      require(node && node->value == objectOf(i));
      require(objectOf(i)->refCount == 3);
      node = node->next;
    }
    require(!node);
  }

  // One has got the event.
  void get(QlxObject *object) {
    require(next() != model_.end());
    require(objectOf(*next()) == object);
    had_.insert(*next());
    for (uint32_t n = choices_.below(1 + changes_); n > 0; --n) change();
    if (!choices_.one(200)) return;
    qlxFreeListeners(owner_);
    model_.clear();
  }

  void change() {
    const int i = static_cast<int>(choices_.below(largest_));
    const auto place = std::find(model_.begin(), model_.end(), i);
    const bool there = place != model_.end();
    if (choices_.one(2)) {
      require(qlxIntlAddListener(owner_, objectOf(i)) == !there);
      if (!there) model_.push_back(i);
    } else {
      require(qlxIntlRemListener(owner_, objectOf(i)) == there);
      if (there) model_.erase(place);
    }
  }

  std::vector<int>::iterator next() {
    return std::find_if(model_.begin(), model_.end(), [&](int i) { return !had_.contains(i); });
  }
  QlxObject *objectOf(int i) const { return all_[static_cast<size_t>(i)]; }

  Choices &choices_;
  const Toolkit toolkit_;
  QlxObject *owner_ = nullptr;
  std::array<QlxObject *, kCount> all_ = {};
  std::vector<int> model_;
  std::set<int> had_;
  uint32_t largest_ = 1, changes_ = 0;
  std::optional<Mismatch> mismatch_;
};

// ---- Classes

class ClassesModel {
 public:
  explicit ClassesModel(Choices &choices) : choices_(choices) {
    readBuiltins();
    while (choices_.next()) {
      if (choices_.one(200))
        closeAndOpen();
      else if (choices_.one(3))
        addRecord(any(), any());
      else
        add(any(), choices_.below(4));
      check();
    }
  }

 private:
  using Adds = void (*)(const char *);
  static constexpr Adds kAdds[] = {
      [](const char *name) { QlxAddLoggerClass(name, {}, {}, {}, {}, {}); },
      [](const char *name) { QlxAddFilterClass(name, {}, {}, {}, {}, {}, {}, {}); },
      [](const char *name) { QlxAddHandlerClass(name, {}, {}, {}, {}, {}, {}, {}); },
      [](const char *name) { QlxAddUFormatterClass(name, {}, {}, {}, {}, {}, {}, {}, {}); },
  };
  static constexpr StringGroupNode *(*kLists[])() = {QlxGetLoggerClasses, QlxGetFilterClasses,
                                                     QlxGetHandlerClasses, QlxGetFormatterClasses};

  std::string any() { return "class" + std::to_string(choices_.below(80)); }

  static ObjClass *find(const std::string &name) {
    const ApiLock lock;
    return qlxToolkitGetClassDef(name.c_str());
  }

  void add(const std::string &name, uint32_t kind) {
    kAdds[kind](name.c_str());
    note(name, find(name));
  }

  // Under another name than its own: a record that is registered already, or a new one.
  void addRecord(const std::string &name, const std::string &own) {
    const ApiLock lock;
    ObjClass *record = qlxToolkitGetClassDef(own.c_str());
    if (!record) {
      record = qlxInitObjectClass(own.c_str(), Handler, nullptr, nullptr, nullptr, nullptr);
    }
    qlxToolkitAddClassDef(name.c_str(), record);
    note(name, record);
  }

  void note(const std::string &name, ObjClass *record) {
    if (classes_.contains(name)) return;
    require(record && record->kind >= Logger && record->kind <= Formatter);
    classes_[name] = record;
    names_[static_cast<size_t>(record->kind - Logger)].push_back(name);
  }

  void check() {
    const std::string name = any();
    const auto known = classes_.find(name);
    require(find(name) == (known == classes_.end() ? nullptr : known->second));
    for (size_t kind = 0; kind < 4; ++kind) require(namesFrom(kLists[kind]()) == names_[kind]);
  }

  void closeAndOpen() {
    QlxCloseToolkit();
    for (auto *list : kLists) require(list() == nullptr);
    require(QlxOpenToolkit(nullptr, nullptr) == 1);
    classes_.clear();
    readBuiltins();
  }

  void readBuiltins() {
    for (size_t kind = 0; kind < 4; ++kind) names_[kind] = namesFrom(kLists[kind]());
  }

  Choices &choices_;
  const Toolkit toolkit_;
  std::map<std::string, ObjClass *> classes_;
  std::array<Names, 4> names_;
};

// ---- Configurations

// What the log manager does, in plain words.
class PlainLogManager {
 public:
  struct Cfg {
    std::string name;
    std::optional<std::string> parent = std::nullopt;
    Names children = {};
    std::vector<std::pair<std::string, std::string>> props = {};
  };
  using Ref = std::shared_ptr<Cfg>;

  bool known(const std::string &name) const { return configs.contains(name); }

  void findParent(Cfg &cfg) const {
    std::string prefix = cfg.name;
    for (size_t dot; !cfg.parent && (dot = prefix.rfind('.')) != std::string::npos;) {
      prefix.resize(dot);
      if (known(prefix)) cfg.parent = prefix;
    }
  }

  // One that names itself has none.
  Ref parentOf(Cfg &cfg) {
    findParent(cfg);
    return cfg.parent && *cfg.parent != cfg.name ? get(*cfg.parent) : nullptr;
  }

  // By value: what it adds may change the parent whose name was given.
  Ref get(std::string name) {
    if (!known(name)) add(std::make_shared<Cfg>(Cfg{name}));
    return configs.at(name);
  }

  void add(const Ref &cfg) {
    if (known(cfg->name)) return;
    configs[cfg->name] = cfg;
    if (const Ref parent = parentOf(*cfg)) {
      for (const std::string &name : Names(parent->children)) {
        const Ref child = get(name);
        findParent(*child);
        if (child->parent != parent->name) move(*parent, *cfg, *child);
      }
      link(*parent, *cfg);
    }
    addOnce(names, cfg->name);
  }

  void remove(std::string name) {
    if (!known(name)) return;
    const Ref cfg = configs.at(name);
    if (const Ref parent = parentOf(*cfg)) {
      std::erase(parent->children, name);
      std::erase(cfg->children, name);
      for (const std::string &child : Names(cfg->children)) move(*cfg, *parent, *get(child));
    }
    configs.erase(name);
    std::erase(names, name);
  }

  void update(const Ref &cfg) {
    if (!known(cfg->name)) return;
    remove(cfg->name);
    add(cfg);
  }

  static void link(Cfg &parent, Cfg &child) {
    addOnce(parent.children, child.name);
    child.parent = parent.name;
  }

  static void move(Cfg &from, Cfg &to, Cfg &child) {
    std::erase(from.children, child.name);
    link(to, child);
  }

  static const std::string *ownValue(const Cfg &cfg, const std::string &key) {
    for (const auto &[name, value] : cfg.props) {
      if (name == key) return &value;
    }
    return nullptr;
  }

  // "<null>" for none. Where making a missing parent changes a chain that comes back, it counts how
  // far the walk goes before it notices: the mark moves at every power of two.
  std::string inherited(const Ref &cfg, const std::string &key) {
    Ref at = cfg, mark;
    for (uint32_t steps = 0, limit = 1; at != mark; ++steps) {
      if (const std::string *value = ownValue(*at, key)) return *value;
      if (steps == limit) {
        limit *= 2;
        mark = at;
      }
      if (!at->parent || *at->parent == cfg->name) break;
      at = get(*at->parent);
    }
    return "<null>";
  }

  // What the object has of a key that none of its own set.
  std::string applied(const std::string &name, const std::string &key) {
    std::set<std::string> seen;
    std::string value = "<null>";
    for (Ref at = get(name); at && seen.insert(at->name).second; at = parentOf(*at)) {
      const std::string *own = ownValue(*at, key);
      if (own && value == "<null>") value = *own;
    }
    return value;
  }

  std::map<std::string, Ref> configs;
  Names names;
};

class ConfigsModel {
 public:
  explicit ConfigsModel(Choices &choices) : choices_(choices) {
    for (const std::string &name : namesFrom(QlxLogMgrConfigNames())) plain_.get(name);
    for (Held &held : held_) replace(held);
    while (choices_.next()) {
      change();
      checkNames();
      check(anyHeld());
      if (choices_.step() % 16 == 0) {
        for (const auto &[name, cfg] : plain_.configs) check(registered(name), *cfg);
      }
    }
  }

 private:
  // Given back under the lock, as a host does.
  struct Release {
    void operator()(ObjCfg *cfg) const { QlxReleaseObjCfg(cfg); }
  };
  using Config = std::unique_ptr<ObjCfg, Release>;

  // A configuration that the host holds, registered or not.
  struct Held {
    Config cfg;
    PlainLogManager::Ref plain;
  };

  static constexpr char kLetters[] = "abcd";

  std::string anyName() {
    std::string name(1, kLetters[choices_.below(4)]);
    for (uint32_t n = choices_.below(3); n > 0; --n) {
      name += '.';
      name += kLetters[choices_.below(4)];
    }
    return name;
  }
  Held &anyHeld() { return held_[choices_.below(static_cast<uint32_t>(held_.size()))]; }
  std::string anyKey() { return std::string(1, kLetters[choices_.below(3)]); }

  static Config registered(const std::string &name) {
    return Config{QlxLogMgrGetCfg(name.c_str())};
  }

  void replace(Held &held) {
    const std::string name = anyName();
    if (choices_.one(2)) {
      held = {Config{QlxAllocObjCfg(name.c_str())},
              std::make_shared<PlainLogManager::Cfg>(PlainLogManager::Cfg{name})};
    } else {
      held = {registered(name), plain_.get(name)};
    }
  }

  void change() {
    if (choices_.one(64)) grows_ = !grows_;
    Held &one = anyHeld(), &other = anyHeld();
    switch (choices_.below(12)) {
      case 0:
        QlxLogMgrUpdateCfg(one.cfg.get());
        return plain_.update(one.plain);
      case 1:
        QlxObjCfgSetParent(one.cfg.get(), other.cfg.get());
        one.plain->parent = other.plain->name;
        return;
      case 2:
        QlxObjCfgAddChild(one.cfg.get(), other.cfg.get());
        return PlainLogManager::link(*one.plain, *other.plain);
      case 3:
        QlxObjCfgRemChild(one.cfg.get(), other.cfg.get());
        std::erase(one.plain->children, other.plain->name);
        return;
      case 4:
        return setProperty(one);
      case 5:
        return inherit(one);
      case 6:
        return apply(anyName());
      case 7:
      case 8:
        return replace(one);
      case 9:
        QlxLogMgrAddCfg(one.cfg.get());
        return plain_.add(one.plain);
      default:
        return grows_ ? add(anyName()) : remove();
    }
  }

  void add(const std::string &name) {
    require(registered(name) != nullptr);
    plain_.get(name);
  }

  void remove() {
    const size_t count = plain_.names.size();
    if (count == 0) return;
    const std::string name = plain_.names[choices_.below(static_cast<uint32_t>(count))];
    QlxLogMgrRemCfg(registered(name).get());
    plain_.get(name);
    plain_.remove(name);
  }

  void setProperty(Held &held) {
    const std::string key = anyKey(), value = std::to_string(choices_.below(10));
    require(QlxSetObjCfgProp(held.cfg.get(), key.c_str(), value.c_str()) == 1);
    auto &props = held.plain->props;
    const auto known =
        std::find_if(props.begin(), props.end(), [&](auto &p) { return p.first == key; });
    if (known != props.end())
      known->second = value;
    else
      props.emplace_back(key, value);
  }

  void inherit(Held &held) {
    const std::string key = anyKey();
    require(take(QlxGetInheritedObjCfgProp(held.cfg.get(), key.c_str(), nullptr)) ==
            plain_.inherited(held.plain, key));
  }

  void apply(const std::string &name) {
    QlxObject *object = QlxGetObject("m_object", "qlx_basiclogger");
    plain_.applied("m_object", "");
    const std::string key = anyKey();
    require(QlxLogMgrApplyCfg(object, name.c_str()) == 1);
    require(take(QlxGetObjProp(object, key.c_str(), nullptr)) == plain_.applied(name, key));
    QlxReleaseObject(object);
  }

  void checkNames() {
    require(namesFrom(QlxLogMgrConfigNames()) == plain_.names);
    require(plain_.names.size() == plain_.configs.size());
    for (const std::string &name : plain_.names) require(plain_.known(name));
    const std::string name = anyName();
    require(QlxLogMgrHasCfg(name.c_str()) == plain_.known(name));
  }

  void check(const Held &held) {
    check(held.cfg, *held.plain);
    const bool isRegistered =
        plain_.known(held.plain->name) && plain_.configs.at(held.plain->name) == held.plain;
    require(isRegistered ==
            (QlxLogMgrHasCfg(held.cfg->name) == 1 && registered(held.cfg->name) == held.cfg));
  }

  static void check(const Config &cfg, const PlainLogManager::Cfg &plain) {
    require(cfg->name == plain.name);
    require((cfg->parentName != nullptr) == plain.parent.has_value());
    require(!plain.parent || cfg->parentName == *plain.parent);
    require(namesFrom(QlxObjCfgChildrenNames(cfg.get())) == plain.children);
    const StringToStringMapNode *node = QlxObjCfgProperties(cfg.get());
    for (const auto &[key, value] : plain.props) {
      require(node && key == node->key && value == node->value);
      node = node->next;
    }
    require(!node);
  }

  Choices &choices_;
  const Toolkit toolkit_;
  PlainLogManager plain_;
  std::array<Held, 16> held_;
  bool grows_ = true;
};

}  // namespace models

#endif
