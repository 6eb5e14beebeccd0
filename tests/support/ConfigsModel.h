// Configurations and the log manager against a simple model.
#ifndef QLX_TESTS_CONFIGSMODEL_H
#define QLX_TESTS_CONFIGSMODEL_H

#include <algorithm>
#include <array>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <qlx/qlx.h>

#include "QlxObjConfig.h"
#include "support/Choices.h"
#include "support/ModelToolkit.h"
#include "support/Take.h"

namespace models {

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
        for (const std::string &name : plain_.names) {
          require(plain_.known(name));
          check(registered(name), *plain_.configs.at(name));
        }
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
    require(areNames(QlxLogMgrConfigNames(), plain_.names));
    require(plain_.names.size() == plain_.configs.size());
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
    require(areNames(QlxObjCfgChildrenNames(cfg.get()), plain.children));
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
