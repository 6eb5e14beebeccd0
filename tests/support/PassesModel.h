// The passing of events to listeners that change the group, against a simple model.
#ifndef QLX_TESTS_PASSESMODEL_H
#define QLX_TESTS_PASSESMODEL_H

#include <algorithm>
#include <array>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <qlx/qlx.h>

#include "object/QlxLocked.h"
#include "QlxObject.h"
#include "object/QlxListeners.h"
#include "support/Choices.h"
#include "support/ModelToolkit.h"

namespace models {

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

}  // namespace models

#endif
