// The chain under every container: nodes linked both ways in the order of insertion; heads and
// nodes are blocks of their own. A template looks a node up only in its `find`, and changes the
// chain only by linkAtTail and unlink.
#ifndef QLX_SRC_QLXNODES_H
#define QLX_SRC_QLXNODES_H

#include <qlx/types.h>

#include "CxOwned.h"

// Block is what a node is allocated as: the node, and behind it what hosts do not see.
template <typename Head, typename Node, typename Block = Node>
struct QlxNodes {
  using OwnedNode = Owned<Node, OslMemoryFree>;

  static Head *newHead() { return static_cast<Head *>(OslMemoryCalloc(1, sizeof(Head))); }

  // A node of that owner, not linked yet.
  static OwnedNode newNode(Head *owner) {
    OwnedNode node{static_cast<Node *>(OslMemoryCalloc(1, sizeof(Block)))};
    if (node) node->owner = owner;
    return node;
  }

  static void linkAtTail(Node *node) {
    Head *owner = node->owner;
    node->next = nullptr;
    node->prev = owner->tail;
    (owner->tail ? owner->tail->next : owner->head) = node;
    owner->tail = node;
  }

  static OwnedNode unlink(Node *node) {
    Head *owner = node->owner;
    (node->prev ? node->prev->next : owner->head) = node->next;
    (node->next ? node->next->prev : owner->tail) = node->prev;
    return OwnedNode{node};
  }

  static Node *first(Head *head) { return head ? head->head : nullptr; }
  static Node *next(Node *node) { return node ? node->next : nullptr; }
  static uint8_t hasNode(Node *node) { return node != nullptr; }

  // The first node for which `matches` holds, from the head on.
  template <typename Matches>
  static Node *firstOf(Head *head, Matches matches) {
    Node *node = first(head);
    while (node && !matches(node)) node = node->next;
    return node;
  }
};

#endif
