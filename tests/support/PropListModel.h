// The property list, and the index over its keys, against a simple model.
#ifndef QLX_TESTS_PROPLISTMODEL_H
#define QLX_TESTS_PROPLISTMODEL_H

#include <algorithm>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include <qlx/memory.h>
#include <qlx/proplist.h>

#include "CxPropList.h"
#include "support/Choices.h"
#include "support/FailingMemory.h"
#include "support/Take.h"

namespace models {

// Puts with the index as long as nobody else changes the list; a removal or a put by the list's own
// function ends that, and the next put begins with an index that is empty.
class PropListModel {
 public:
  explicit PropListModel(Choices &choices) : choices_(choices) {
    while (choices_.next()) {
      const uint32_t kind = choices_.below(64);
      if (kind == 0)
        discard();
      else if (kind == 1)
        copy(choices_.below(kKeys));
      else if (kind < 4)
        putItsOwn();
      else if (size_ == model_.size() || kind == 4)
        size_ = choices_.below(kKeys);
      else if (model_.size() < size_)
        put(keyOf(choices_.below(kKeys)), "v" + std::to_string(choices_.below(8)));
      else
        remove(keyOf(choices_.below(kKeys)));
      check();
    }
  }
  ~PropListModel() { discard(); }
  PropListModel(const PropListModel &) = delete;
  PropListModel &operator=(const PropListModel &) = delete;

 private:
  using Entry = std::pair<std::string, std::string>;
  static constexpr uint32_t kKeys = 256;  // an index begins at 64 entries and grows at 128

  static std::string keyOf(uint32_t i) { return i < 2 ? std::string(i, 'x') : std::to_string(i); }

  std::vector<Entry>::iterator find(const std::string &key) {
    return std::find_if(model_.begin(), model_.end(),
                        [&](auto &entry) { return entry.first == key; });
  }

  void put(const std::string &key, const std::string &value) {
    const bool byIndex = !choices_.one(32);
    if (!byIndex) cxPropIndexDiscard(&index_);
    FailingMemory memory;
    if (choices_.one(16)) memory.failOnce(1 + choices_.below(3));
    const uint8_t stored = byIndex ? cxPropIndexPut(&index_, &list_, key.c_str(), value.c_str())
                                   : CxPropListPutStr(&list_, key.c_str(), value.c_str());
    require((stored == 1) == (memory.failures() == 0));
    if (!stored) return;
    if (const auto known = find(key); known != model_.end())
      known->second = value;
    else
      model_.emplace_back(key, value);
  }

  // What the list itself has as key and value.
  void putItsOwn() {
    if (model_.empty()) return;
    const CxPropEntry entry = list_.entries[choices_.below(static_cast<uint32_t>(model_.size()))];
    const Entry own = {entry.value, entry.key};
    require(cxPropIndexPut(&index_, &list_, entry.value, entry.key) == 1);
    if (const auto known = find(own.first); known != model_.end())
      known->second = own.second;
    else
      model_.push_back(own);
  }

  // The last one takes the place of one that is removed.
  void remove(const std::string &key) {
    cxPropIndexDiscard(&index_);
    const auto known = find(key);
    require(CxPropListRemove(&list_, key.c_str()) == (known != model_.end()));
    if (known == model_.end()) return;
    *known = model_.back();
    model_.pop_back();
  }

  void copy(uint32_t i) {
    const auto known = find(keyOf(i));
    uint8_t found = 7;
    const std::string expected = known == model_.end() ? "<null>" : known->second;
    require(take(CxPropListCopyStr(&list_, keyOf(i).c_str(), &found)) == expected);
    require(found == (known != model_.end()));
  }

  void discard() {
    cxPropIndexDiscard(&index_);
    CxPropListDiscard(&list_);
    model_.clear();
  }

  void check() {
    require(list_.count == static_cast<int32_t>(model_.size()));
    const std::string any = keyOf(choices_.below(kKeys));
    require(CxPropListHasKey(&list_, any.c_str()) == (find(any) != model_.end()));
    if (choices_.step() % 16 != 0 || model_.empty()) return;
    CxPropListIter it = CxPropListIterator(&list_);
    for (size_t i = 0; i < model_.size(); ++i, CxPropListIterNext(&it)) {
      require(model_[i].first == CxPropListIterPeekKey(&it));
      require(model_[i].second == CxPropListIterPeekVal(&it));
      require(CxPropListIterHasNext(&it) == (i + 1 < model_.size()));
    }
    require(!it.list);
  }

  Choices &choices_;
  CxPropList list_ = {};
  CxPropIndex index_ = {};
  std::vector<Entry> model_;
  size_t size_ = 0;
};

}  // namespace models

#endif
