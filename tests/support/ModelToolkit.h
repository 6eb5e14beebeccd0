// What the models of the toolkit's registries share: each opens a toolkit for itself.
#ifndef QLX_TESTS_MODELTOOLKIT_H
#define QLX_TESTS_MODELTOOLKIT_H

#include <algorithm>
#include <string>
#include <vector>

#include <qlx/qlx.h>

#include "support/Choices.h"

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

// Whether these are the names, in that order.
inline bool areNames(const StringGroupNode *it, const Names &names) {
  for (const std::string &name : names) {
    if (!it || name != it->value) return false;
    it = it->next;
  }
  return !it;
}

template <typename T>
bool has(const std::vector<T> &all, const T &one) {
  return std::find(all.begin(), all.end(), one) != all.end();
}
template <typename T>
void addOnce(std::vector<T> &all, const T &one) {
  if (!has(all, one)) all.push_back(one);
}

}  // namespace models

#endif
