// Every container against a simple model: a std::vector of the numbers of its elements. Each check
// makes a walk of random operations and compares the whole chain after each of them.
#ifndef QLX_TESTS_CONTAINERMODELS_H
#define QLX_TESTS_CONTAINERMODELS_H

#include <algorithm>
#include <array>
#include <cstring>
#include <memory>
#include <vector>

#include "support/Choices.h"
#include "support/ContainerApis.h"
#include "support/FailingMemory.h"
#include "support/ModelElements.h"
#include "support/Take.h"
#include "support/WantedLeak.h"

namespace models {

// ---- What the three have in common

constexpr int kRarely = 16;  // steps between looks at everything

// Frees a container at the end of the walk, also of one that ended by a mismatch.
template <typename Api>
struct Free {
  void operator()(typename Api::Head *container) const { Api::free(container); }
};
template <typename Api>
using Container = std::unique_ptr<typename Api::Head, Free<Api>>;

// The chain, compared with the numbers; `matches` compares a node.
template <typename Head, typename Entries, typename Matches>
void requireChain(Head *container, const Entries &entries, Matches matches) {
  const decltype(container->head) none = nullptr;
  auto *node = container->head, *last = none;
  for (const auto &entry : entries) {
    require(node);
    require(node->owner == container);
    require(node->prev == last);
    require(matches(node, entry));
    last = node;
    node = node->next;
  }
  require(!node);
  require(container->tail == last);
}

template <typename Api, typename Iterator = decltype(Api::iterator(nullptr))>
Iterator iteratorAt(typename Api::Head *container, size_t place) {
  Iterator it = Api::iterator(container);
  while (place-- > 0) {
    require(Api::hasNext(it) == 1);
    it = Api::next(it);
  }
  require(Api::hasNext(it) == 1);
  return it;
}

// Now and then the memory runs out, at some allocation or from there on. True when the operation
// had to fail, which needs as many allocations itself; an index that cannot be made does no harm.
class Shortage {
 public:
  Shortage(Choices &choices, bool rare) {
    if (!choices.one(rare ? 64 : 8)) return;
    nth_ = 1 + choices.below(4);
    choices.one(2) ? memory_.failFrom(nth_) : memory_.failOnce(nth_);
  }
  bool fails(uint32_t needed) const { return nth_ > 0 && nth_ <= needed; }

 private:
  FailingMemory memory_;
  uint32_t nth_ = 0;
};

inline int anyNumber(Choices &choices) {
  return static_cast<int>(choices.below(kCount));
}

template <typename Entries>
size_t anyPlace(Choices &choices, const Entries &entries) {
  return choices.below(static_cast<uint32_t>(entries.size()));
}

template <typename Entries>
void eraseAt(Entries &entries, size_t place) {
  entries.erase(entries.begin() + static_cast<std::ptrdiff_t>(place));
}

inline bool contains(const std::vector<int> &numbers, int i) {
  return std::find(numbers.begin(), numbers.end(), i) != numbers.end();
}

template <typename Kind, typename Numbers>
void requireReferences(Kind &elements, const Numbers &held) {
  if (!Kind::kCounted) return;
  std::array<int, kCount> expected = {};
  for (const int i : held) ++expected[static_cast<size_t>(i)];
  for (int i = 0; i < kCount; ++i) {
    require(elements.references(i) == expected[static_cast<size_t>(i)]);
  }
}

// The elements of a group or a list.
template <typename Head, typename Kind>
void requireElements(Head *container, Kind &elements, const std::vector<int> &numbers) {
  requireChain(container, numbers,
               [&](const auto *node, int i) { return elements.is(node->value, i); });
}

// What was handed out is an element; it is given back.
template <typename Kind, typename Element>
void requireElement(Kind &elements, Element *handedOut, int i) {
  require(elements.is(handedOut, i));
  elements.discard(handedOut);
}

// ---- Groups

template <typename Api>
class GroupModel {
 public:
  static constexpr auto &kName = Api::kName;

  explicit GroupModel(Choices &choices) : choices_(choices) {
    while (choices_.next()) {
      const uint32_t kind = choices_.below(64);
      if (kind == 0)
        startAgain();
      else if (kind == 1)
        removeSome();
      else if (kind < 8)
        refuseNull();
      else if (sizes_.grows(choices_, model_.size()))
        add(anyNumber(choices_));
      else
        remove();
      check();
    }
    group_.reset();
    requireReferences(elements_, std::vector<int>{});
  }

 private:
  void add(int i) {
    const Shortage shortage(choices_, false);
    const bool isNew = !contains(model_, i);
    const bool added = isNew && !shortage.fails(1 + Elements<Api>::kCopyAllocations);
    require(Api::add(group_.get(), elements_.at(i)) == added);
    if (added) model_.push_back(i);
  }

  void remove() {
    if (model_.empty() || choices_.one(4)) {
      const int i = anyNumber(choices_);
      require(Api::rem(group_.get(), elements_.at(i)) == contains(model_, i));
      std::erase(model_, i);
    } else {
      removeAt(anyPlace(choices_, model_));
    }
  }

  void removeAt(size_t place) {
    auto *it = iteratorAt<Api>(group_.get(), place);
    auto *successor = it->next;
    require(Api::iterRem(it) == successor);
    eraseAt(model_, place);
  }

  // In one go over the iterator.
  void removeSome() {
    const uint32_t one = 1 + choices_.below(3);
    size_t place = 0;
    for (auto *it = Api::iterator(group_.get()); Api::hasNext(it);) {
      if (!choices_.one(one)) {
        it = Api::next(it);
        ++place;
      } else {
        it = Api::iterRem(it);
        eraseAt(model_, place);
      }
    }
    require(place == model_.size());
  }

  void refuseNull() {
    require(Api::add(group_.get(), nullptr) == 0);
    require(Api::rem(group_.get(), nullptr) == 0);
    require(Api::getLink(group_.get(), nullptr) == nullptr);
    require(Api::iterRem(nullptr) == nullptr);
  }

  void startAgain() {
    group_.reset(Api::alloc());
    model_.clear();
  }

  void check() {
    requireElements(group_.get(), elements_, model_);
    auto *node = group_->head;
    for (const int i : model_) {
      require(Api::getLink(group_.get(), elements_.at(i)) == node);
      node = node->next;
    }
    const int other = anyNumber(choices_);
    require((Api::getLink(group_.get(), elements_.at(other)) != nullptr) ==
            contains(model_, other));
    requireReferences(elements_, model_);
    if (model_.empty()) return;
    const size_t place = anyPlace(choices_, model_);
    requireElement(elements_, Api::get(iteratorAt<Api>(group_.get(), place)), model_[place]);
  }

  Choices &choices_;
  Sizes sizes_;
  Elements<Api> elements_;
  Container<Api> group_{Api::alloc()};
  std::vector<int> model_;
};

// ---- Lists

template <typename Api>
class ListModel {
 public:
  static constexpr auto &kName = Api::kName;

  explicit ListModel(Choices &choices) : choices_(choices) {
    while (choices_.next()) {
      const uint32_t kind = choices_.below(64);
      if (kind == 0)
        startAgain();
      else if (kind == 1)
        sort();
      else if (kind == 2)
        copy();
      else if (kind < 8)
        refuse();
      else if (sizes_.grows(choices_, model_.size()))
        append(anyNumber(choices_));
      else
        remove();
      check();
    }
  }

 private:
  void append(int i) {
    const Shortage shortage(choices_, false);
    const bool added = !shortage.fails(1 + Elements<Api>::kCopyAllocations);
    require(Api::append(list_.get(), elements_.at(i)) == added);
    if (added) model_.push_back(i);
  }

  void remove() {
    if (model_.empty()) return;
    const size_t place = anyPlace(choices_, model_);
    auto *it = iteratorAt<Api>(list_.get(), place);
    auto *successor = it->next;
    if (choices_.one(2))
      require(Api::iterRem(it) == successor);
    else
      Api::remLink(list_.get(), it);
    eraseAt(model_, place);
  }

  void sort() {
    const WantedLeak kept;
    Api::sort(list_.get(), &Elements<Api>::compare);
    std::stable_sort(model_.begin(), model_.end(),
                     [&](int a, int b) { return elements_.isBefore(a, b); });
  }

  // The copy goes on, or the original.
  void copy() {
    Container<Api> copied{Api::copy(list_.get())};
    if (choices_.one(2)) std::swap(copied, list_);
    requireElements(copied.get(), elements_, model_);
    Api::remLink(list_.get(), copied->head);  // another list's: left alone
  }

  void refuse() {
    require(Api::append(list_.get(), nullptr) == 0);
    require(Api::getLink(list_.get(), nullptr) == nullptr);
    require(Api::getIndex(list_.get(), -1) == nullptr);
    require(Api::getIndex(list_.get(), list_->count) == nullptr);
    Api::sort(list_.get(), nullptr);
    Api::remLink(list_.get(), nullptr);
  }

  void startAgain() {
    list_.reset(Api::alloc());
    model_.clear();
  }

  void check() {
    require(list_->count == static_cast<int32_t>(model_.size()));
    requireElements(list_.get(), elements_, model_);
    const int i = anyNumber(choices_);
    auto *link = Api::getLink(list_.get(), elements_.at(i));
    const auto first = std::find(model_.begin(), model_.end(), i);
    require((link != nullptr) == (first != model_.end()));
    if (link) require(link == iteratorAt<Api>(list_.get(), size_t(first - model_.begin())));
    if (model_.empty()) return;
    const size_t place = anyPlace(choices_, model_);
    auto *it = iteratorAt<Api>(list_.get(), place);
    require(Api::getIndex(list_.get(), static_cast<int32_t>(place)) == it->value);
    requireElement(elements_, Api::get(it), model_[place]);
  }

  Choices &choices_;
  Sizes sizes_;
  Elements<Api> elements_;
  Container<Api> list_{Api::alloc()};
  std::vector<int> model_;
};

// ---- Maps

template <typename Api>
class MapModel {
 public:
  static constexpr auto &kName = Api::kName;

  explicit MapModel(Choices &choices) : choices_(choices) {
    while (choices_.next()) {
      const uint32_t kind = choices_.below(64);
      if (kind == 0)
        startAgain();
      else if (kind == 1)
        copy();
      else if (kind < 6)
        refuse();
      else if (sizes_.grows(choices_, model_.size()))
        put(anyNumber(choices_), anyNumber(choices_));
      else
        remove();
      check();
    }
    map_.reset();
    requireReferences(elements_, std::vector<int>{});
  }

 private:
  struct Entry {
    int key, value;
  };
  using Place = typename std::vector<Entry>::iterator;
  static constexpr bool kCopies = Elements<Api>::kCopyAllocations > 0;

  Place placeOf(int key) {
    return std::find_if(model_.begin(), model_.end(), [&](Entry e) { return e.key == key; });
  }

  void put(int key, int value) {
    if (choices_.one(16)) value = kNull;
    const Shortage shortage(choices_, false);
    const Place there = placeOf(key);
    const bool isNew = there == model_.end();
    // A new one needs a node and a key. A value that cannot be copied is stored as null.
    const bool stored = !isNew || !shortage.fails(2);
    const bool copied = !kCopies || value == kNull || isMade(shortage, isNew ? 3 : 1);
    require(Api::put(map_.get(), text(key), valueAt(value)) == stored);
    if (!stored) return;
    if (!copied) value = kNull;
    if (isNew)
      model_.push_back({key, value});
    else
      there->value = value;
  }

  // Whether that allocation of the operation succeeds.
  static bool isMade(const Shortage &shortage, uint32_t nth) { return !shortage.fails(nth); }

  auto valueAt(int value) -> decltype(std::declval<Elements<Api> &>().at(0)) {
    return value == kNull ? nullptr : elements_.at(value);
  }

  bool isValue(decltype(Api::getVal(nullptr)) stored, int value) {
    return value == kNull ? stored == nullptr : elements_.is(stored, value);
  }

  void remove() {
    if (model_.empty() || choices_.one(4)) {
      const int key = anyNumber(choices_);
      Api::rem(map_.get(), text(key));
      if (const Place there = placeOf(key); there != model_.end()) model_.erase(there);
    } else {
      const size_t place = anyPlace(choices_, model_);
      Api::remNode(map_.get(), iteratorAt<Api>(map_.get(), place));
      eraseAt(model_, place);
    }
  }

  // The copy goes on, or the original.
  void copy() {
    Container<Api> copied{Api::copy(map_.get())};
    if (choices_.one(2)) std::swap(copied, map_);
    checkChain(copied.get());
    Api::remNode(map_.get(), copied->head);  // another map's: left alone
  }

  void refuse() {
    require(Api::put(map_.get(), nullptr, nullptr) == 0);
    require(Api::get(map_.get(), nullptr) == nullptr);
    require(Api::hasKey(map_.get(), nullptr) == 0);
    Api::rem(map_.get(), nullptr);
    Api::remNode(map_.get(), nullptr);
  }

  void startAgain() {
    map_.reset(Api::alloc());
    model_.clear();
  }

  void checkChain(typename Api::Head *map) {
    requireChain(map, model_, [&](const auto *node, Entry entry) {
      return strcmp(text(entry.key), node->key) == 0 && isValue(node->value, entry.value);
    });
  }

  void check() {
    checkChain(map_.get());
    if (choices_.step() % kRarely == 0) lookEachUp();
    const int key = anyNumber(choices_);
    const Place there = placeOf(key);
    require(Api::hasKey(map_.get(), text(key)) == (there != model_.end()));
    auto *value = Api::get(map_.get(), text(key));
    require(isValue(value, there == model_.end() ? kNull : there->value));
    elements_.discard(value);
    if (model_.empty()) return;
    const size_t place = anyPlace(choices_, model_);
    auto *it = iteratorAt<Api>(map_.get(), place);
    require(take(Api::getKey(it)) == text(model_[place].key));
    value = Api::getVal(it);
    require(isValue(value, model_[place].value));
    elements_.discard(value);
  }

  void lookEachUp() {
    auto *node = map_->head;
    std::vector<int> values;
    for (const Entry entry : model_) {
      require(Api::getNode(map_.get(), text(entry.key)) == node);
      node = node->next;
      if (entry.value != kNull) values.push_back(entry.value);
    }
    requireReferences(elements_, values);
  }

  Choices &choices_;
  Sizes sizes_;
  Elements<Api> elements_;
  Container<Api> map_{Api::alloc()};
  std::vector<Entry> model_;
};

}  // namespace models

#endif
