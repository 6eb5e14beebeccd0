// What the models fill containers with: of each kind kCount different elements, by number.
// `references` counts what containers and callers hold of one.
#ifndef QLX_TESTS_MODELELEMENTS_H
#define QLX_TESTS_MODELELEMENTS_H

#include <array>
#include <cstring>
#include <string>
#include <vector>

#include <qlx/class/object.h>
#include <qlx/memory.h>
#include <qlx/props.h>

#include "QlxObjConfig.h"
#include "support/ContainerApis.h"

namespace models {

constexpr int kCount = 80;
constexpr int kNull = -1;  // the number of a null value

inline const char *text(int i) {
  static const auto texts = [] {
    // Two of them have the same hash.
    std::vector<std::string> all = {"", "costarring", "liquid", "a", "A"};
    while (all.size() < kCount) all.push_back("key" + std::to_string(all.size()));
    return all;
  }();
  return texts[static_cast<size_t>(i)].c_str();
}

struct Strings {
  static constexpr int kCopyAllocations = 1;
  const char *at(int i) const { return text(i); }
  bool is(const char *stored, int i) const { return stored && strcmp(stored, at(i)) == 0; }
  void discard(char *handedOut) const { OslMemoryFree(handedOut); }
  int references(int) const { return 0; }
  static constexpr bool kCounted = false;
  static int compare(const void *a, const void *b) {
    return strcmp(*static_cast<char *const *>(a), *static_cast<char *const *>(b));
  }
  bool isBefore(int a, int b) const { return strcmp(at(a), at(b)) < 0; }
};

struct Parms {
  Parms() {
    for (int i = 0; i < kCount; ++i) {
      parms[static_cast<size_t>(i)].type = ParmInt32;
      parms[static_cast<size_t>(i)].value.i = i * 7 % kCount;
    }
  }
  const Parm *at(int i) const { return &parms[static_cast<size_t>(i)]; }
  bool is(const Parm *stored, int i) const { return stored && QlxCmpParms(stored, at(i)) == 1; }
  void discard(Parm *handedOut) const { QlxFreeParm(handedOut); }
  int references(int) const { return 0; }
  static constexpr bool kCounted = false;
  static constexpr int kCopyAllocations = 1;
  static int compare(const void *a, const void *b) {
    return (*static_cast<Parm *const *>(a))->value.i - (*static_cast<Parm *const *>(b))->value.i;
  }
  bool isBefore(int a, int b) const { return at(a)->value.i < at(b)->value.i; }

  std::array<Parm, kCount> parms = {};
};

// Every fifth one is retired; all are held so often by somebody else that no release is the last.
struct Objects {
  Objects() {
    for (int i = 0; i < kCount; ++i) {
      at(i)->objClass = i % 5 ? &objClass : nullptr;
      at(i)->refCount = kHeld;
    }
  }
  QlxObject *at(int i) { return &objects[static_cast<size_t>(i)]; }
  bool is(QlxObject *stored, int i) { return stored == at(i); }
  void discard(QlxObject *handedOut) const { qlxIntlReleaseObject(handedOut); }
  int references(int i) { return static_cast<int>(at(i)->refCount) - kHeld; }
  static constexpr bool kCounted = true;
  static constexpr int kCopyAllocations = 0;

  static constexpr int kHeld = 10;
  ObjClass objClass = {};
  std::array<QlxObject, kCount> objects = {};
};

struct Configs {
  Configs() {
    for (int i = 0; i < kCount; ++i) configs[static_cast<size_t>(i)].reset(qlxIntlAllocObjCfg("a"));
  }
  ObjCfg *at(int i) const { return configs[static_cast<size_t>(i)].get(); }
  bool is(ObjCfg *stored, int i) const { return stored == at(i); }
  void discard(ObjCfg *handedOut) const { qlxIntlReleaseObjCfg(handedOut); }
  int references(int i) const { return static_cast<int>(at(i)->refCount) - 1; }
  static constexpr bool kCounted = true;
  static constexpr int kCopyAllocations = 0;

  std::array<ObjCfgRef, kCount> configs;
};

struct Classes {
  ObjClass *at(int i) { return &classes[static_cast<size_t>(i)]; }
  bool is(ObjClass *stored, int i) { return stored == at(i); }
  void discard(ObjClass *) const {}
  int references(int) const { return 0; }
  static constexpr bool kCounted = false;
  static constexpr int kCopyAllocations = 0;

  std::array<ObjClass, kCount> classes = {};
};

// Which of them a container holds.
Strings elementsOf(char *);
Parms elementsOf(Parm *);
Objects elementsOf(QlxObject *);
Configs elementsOf(ObjCfg *);
Classes elementsOf(ObjClass *);
template <typename Api>
using Elements = decltype(elementsOf(ValueOf<Api>()));

}  // namespace models

#endif
