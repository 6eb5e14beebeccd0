// A chain of nodes that are found by a key: short ones are walked, long ones have an index, which
// stands behind the head in the head's own block. `Container` says what a node's key is and how
// keys compare: Key keyOf(Node *), uint32_t hashOf(Key), bool equal(Key, Key); no key is null.
// HeadBlock and NodeBlock are what heads and nodes are allocated as; a head's has the index.
#ifndef QLX_SRC_QLXINDEXEDNODES_H
#define QLX_SRC_QLXINDEXEDNODES_H

#include "QlxIndex.h"
#include "QlxNodes.h"

template <typename Head>
struct QlxIndexedHead {
  Head head;
  QlxIndex index;
};

template <typename Container, typename Head, typename Node,
          typename HeadBlock = QlxIndexedHead<Head>, typename NodeBlock = Node>
struct QlxIndexedNodes : QlxNodes<Head, Node, NodeBlock> {
  using Nodes = QlxNodes<Head, Node, NodeBlock>;

  static Head *newHead() {
    return reinterpret_cast<Head *>(
        static_cast<HeadBlock *>(OslMemoryCalloc(1, sizeof(HeadBlock))));
  }

  // The chain's first node with that key. One who writes into nodes behind the back of a long
  // container hides them from it.
  template <typename Key>
  static Node *find(Head *head, Key key) {
    if (!head || !key) return nullptr;
    const QlxIndex &index = indexOf(head);
    const auto matches = [&](const void *node) { return Container::equal(keyOf(node), key); };
    if (!index.slots) return Nodes::firstOf(head, matches);
    return static_cast<Node *>(qlxIndexFind(index, Container::hashOf(key), matches));
  }

  static void linkAtTail(Node *node) {
    Nodes::linkAtTail(node);
    QlxIndex &index = indexOf(node->owner);
    if (++index.count < kIndexedFrom && !index.slots) return;
    const bool fresh = !index.slots;
    if (!qlxIndexReserve(&index)) return;
    for (Node *each = fresh ? node->owner->head : node; each; each = each->next) {
      qlxIndexAdd(&index, each, hashOf(each));
    }
  }

  static typename Nodes::OwnedNode unlink(Node *node) {
    QlxIndex &index = indexOf(node->owner);
    --index.count;
    if (index.slots && index.count < kIndexedFrom / 2) qlxIndexDrop(&index);
    if (index.slots) qlxIndexRemove(&index, node, hashOf(node));
    return Nodes::unlink(node);
  }

 private:
  static constexpr uint32_t kIndexedFrom = 17;  // nodes; fewer are walked as fast

  static QlxIndex &indexOf(Head *head) { return reinterpret_cast<HeadBlock *>(head)->index; }

  static auto keyOf(const void *node) { return Container::keyOf(static_cast<const Node *>(node)); }
  static uint32_t hashOf(const void *node) { return Container::hashOf(keyOf(node)); }
};

#endif
