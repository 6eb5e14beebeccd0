// A walk over a group that may change meanwhile, in its order: it comes to each element that is
// there when its turn comes, also to those added meanwhile, and to none twice. It allocates
// nothing, and needs no memory to remember whom it has passed: a node that is removed behind it
// goes to the walk, with its element, until the walk ends.
//
// There is one walk over a group at a time. Whoever has one ends it with takePassed().
#ifndef QLX_SRC_QLXGROUPWALK_H
#define QLX_SRC_QLXGROUPWALK_H

#include <utility>

#include "QlxIndexedNodes.h"

template <typename Head, typename Node>
class QlxGroupWalk {
 public:
  using OwnedNode = typename QlxNodes<Head, Node>::OwnedNode;

  // What stands behind a group's head, and behind its nodes.
  struct HeadBlock {
    Head head;
    QlxIndex index;
    QlxGroupWalk *walk;
    uint64_t added;  // elements since the group was made
  };
  struct NodeBlock {
    Node node;
    uint64_t number;  // of the element among the added ones: later ones have larger numbers
  };

  QlxGroupWalk() = default;
  ~QlxGroupWalk() { leave(); }
  QlxGroupWalk(const QlxGroupWalk &) = delete;
  QlxGroupWalk &operator=(const QlxGroupWalk &) = delete;

  // The next node, null at the end. A group that took the place of one that was freed meanwhile is
  // one of added elements.
  Node *step(Head *group) {
    if (group != group_) enter(group);
    while (Node *node = next_) {
      next_ = node->next;
      if (numberOf(node) <= old_) return node;
      if (reached_ == kMostAdded) return nullptr;
      if (hasPassed(node)) continue;
      ++reached_;
      return node;
    }
    return nullptr;
  }

  // Takes out a node that was removed behind the walk; its element is to be disposed of. Null:
  // there is none left.
  OwnedNode takePassed() {
    leave();
    Node *node = passed_;
    if (node) passed_ = node->next;
    return OwnedNode{node};
  }

  // ---- What a group tells of its changes

  static void linked(Node *node) {
    HeadBlock *group = blockOf(node->owner);
    reinterpret_cast<NodeBlock *>(node)->number = ++group->added;
    if (group->walk && !group->walk->next_) group->walk->next_ = node;
  }

  // May keep the node, which is no longer linked.
  static void unlinked(OwnedNode &node) {
    if (QlxGroupWalk *walk = blockOf(node->owner)->walk) walk->lose(node);
  }

  static void freed(Head *group) {
    if (QlxGroupWalk *walk = blockOf(group)->walk) walk->leave();
  }

 private:
  // One that always adds another would have the walk go on for ever.
  static constexpr uint32_t kMostAdded = 10000;

  static HeadBlock *blockOf(Head *group) { return reinterpret_cast<HeadBlock *>(group); }
  static uint64_t numberOf(Node *node) { return reinterpret_cast<NodeBlock *>(node)->number; }

  void enter(Head *group) {
    leave();
    if (!group) return;
    HeadBlock *block = blockOf(group);
    block->walk = this;
    group_ = group;
    next_ = group->head;
    old_ = std::exchange(inFirst_, false) ? block->added : 0;
  }

  void leave() {
    if (group_) blockOf(group_)->walk = nullptr;
    group_ = nullptr;
    next_ = nullptr;
  }

  void lose(OwnedNode &node) {
    if (node.get() == next_) {
      next_ = node->next;
    } else if (!next_ || numberOf(node.get()) < numberOf(next_)) {
      node->next = passed_;
      passed_ = node.release();
    }
  }

  bool hasPassed(const Node *added) const {
    const Node *node = passed_;
    while (node && node->value != added->value) node = node->next;
    return node;
  }

  Head *group_ = nullptr;  // where the walk is; null before it begins, and when the group was freed
  Node *next_ = nullptr;   // null while the walk is behind the last one
  Node *passed_ = nullptr;  // owned, linked by `next`: removed after the walk had passed them
  uint64_t old_ = 0;        // numbers up to this one were there when the walk began
  uint32_t reached_ = 0;    // added ones that the walk came to
  bool inFirst_ = true;     // no group was entered
};

#endif
