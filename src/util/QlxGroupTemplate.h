// The group: elements in the order in which they were added, none twice.
//
// `Elements` names the records (Head, Node), the types (Element, Parameter) and the element
// operations: copyIn makes what is stored, handOut what a caller gets, dispose ends what is stored,
// match compares, hash is the same for what matches.
#ifndef QLX_SRC_QLXGROUPTEMPLATE_H
#define QLX_SRC_QLXGROUPTEMPLATE_H

#include "QlxGroupWalk.h"

template <typename Container, typename Elements,
          typename Walk = QlxGroupWalk<typename Elements::Head, typename Elements::Node>>
using QlxGroupNodes = QlxIndexedNodes<Container, typename Elements::Head, typename Elements::Node,
                                      typename Walk::HeadBlock, typename Walk::NodeBlock>;

template <typename Elements>
struct QlxGroupTemplate : QlxGroupNodes<QlxGroupTemplate<Elements>, Elements> {
  using Head = typename Elements::Head;
  using Node = typename Elements::Node;
  using Element = typename Elements::Element;
  using Parameter = typename Elements::Parameter;
  using Nodes = QlxGroupNodes<QlxGroupTemplate, Elements>;
  using Walk = QlxGroupWalk<Head, Node>;

  static Head *alloc() { return Nodes::newHead(); }

  static void free(Head *group) {
    if (!group) return;
    while (group->head) removeNode(group->head);
    Walk::freed(group);
    OslMemoryFree(group);
  }

  static Node *find(Head *group, Parameter element) { return Nodes::find(group, element); }

  static uint8_t add(Head *group, Parameter element) {
    if (!group || !element || find(group, element)) return 0;
    auto node = Nodes::newNode(group);
    if (!node) return 0;
    node->value = Elements::copyIn(element);
    if (!node->value) return 0;
    Walk::linked(node.get());
    Nodes::linkAtTail(node.release());
    return 1;
  }

  static uint8_t remove(Head *group, Parameter element) {
    Node *node = find(group, element);
    if (!node) return 0;
    removeNode(node);
    return 1;
  }

  // By value: of two nodes made equal behind the group's back the first one goes.
  static Node *removeAt(Node *it) {
    if (!it) return nullptr;
    Node *successor = it->next;
    remove(it->owner, it->value);
    return successor;
  }

  static Element get(Node *it) { return it ? Elements::handOut(it->value) : nullptr; }

  static Parameter keyOf(const Node *node) { return node->value; }
  static uint32_t hashOf(Parameter element) { return Elements::hash(element); }
  static bool equal(Parameter a, Parameter b) { return Elements::match(a, b); }

 private:
  // Out of the chain first: disposing of an element may come back to the group. A walk that has
  // passed the node disposes of it at its end.
  static void removeNode(Node *node) {
    auto removed = Nodes::unlink(node);
    Walk::unlinked(removed);
    if (removed) Elements::dispose(removed->value);
  }
};

#endif
