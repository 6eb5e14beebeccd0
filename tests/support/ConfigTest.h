// A test with an open toolkit, a host's classes, and configurations to look into.
#ifndef QLX_TESTS_CONFIGTEST_H
#define QLX_TESTS_CONFIGTEST_H

#include <memory>
#include <string>

#include "support/HostTest.h"

class ConfigTest : public HostTest {
 protected:
  using Config = CfgHandle;

  static Config make(const char *name) { return Config{QlxAllocObjCfg(name)}; }
  static Config registered(const char *name) { return Config{QlxLogMgrGetCfg(name)}; }

  static void link(const Config &parent, const Config &child) {
    QlxObjCfgAddChild(parent.get(), child.get());
  }

  // What there is, in order, each with "|" behind it.
  static std::string childrenOf(const Config &cfg) {
    return joined(QlxObjCfgChildrenNames(cfg.get()));
  }
  static std::string configNames() { return joined(QlxLogMgrConfigNames()); }
  static std::string propertiesOf(const Config &cfg) {
    std::string all;
    const StringToStringMapNode *it = QlxObjCfgProperties(cfg.get());
    for (; it; it = it->next) all += std::string(it->key) + "=" + it->value + "|";
    return all;
  }

  // The stored name, "<null>" for none.
  static std::string parentNameOf(const Config &cfg) {
    return cfg->parentName ? cfg->parentName : "<null>";
  }

  static std::string inherited(const Config &cfg, const char *key) {
    return take(QlxGetInheritedObjCfgProp(cfg.get(), key, nullptr));
  }

 private:
  static std::string joined(const StringGroupNode *it) {
    std::string names;
    for (; it; it = it->next) names += std::string(it->value) + "|";
    return names;
  }
};

#endif
