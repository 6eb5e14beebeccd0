// The registry of classes against a simple model.
#ifndef QLX_TESTS_CLASSESMODEL_H
#define QLX_TESTS_CLASSESMODEL_H

#include <array>
#include <map>
#include <string>

#include <qlx/qlx.h>

#include "object/QlxLocked.h"
#include "support/Choices.h"
#include "support/ModelToolkit.h"

namespace models {

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
    for (size_t kind = 0; kind < 4; ++kind) require(areNames(kLists[kind](), names_[kind]));
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

}  // namespace models

#endif
