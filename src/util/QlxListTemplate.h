// The list: elements in the order in which they were appended, counted, the same one perhaps twice.
//
// `Elements` names the records (Head, Node), the types (Element, Parameter) and the element
// operations: copyIn makes what is stored, handOut what a caller gets, dispose ends what is stored,
// match compares.
#ifndef QLX_SRC_QLXLISTTEMPLATE_H
#define QLX_SRC_QLXLISTTEMPLATE_H

#include <cstdlib>

#include "QlxNodes.h"

template <typename Elements>
struct QlxListTemplate : QlxNodes<typename Elements::Head, typename Elements::Node> {
  using Head = typename Elements::Head;
  using Node = typename Elements::Node;
  using Element = typename Elements::Element;
  using Parameter = typename Elements::Parameter;
  using Nodes = QlxNodes<Head, Node>;

  static Head *alloc() { return Nodes::newHead(); }

  static void free(Head *list) {
    if (!list) return;
    while (list->head) removeNode(list, list->head);
    OslMemoryFree(list);
  }

  static Head *copy(Head *source) {
    Head *list = source ? alloc() : nullptr;
    if (!list) return nullptr;
    for (Node *node = source->head; node; node = node->next) append(list, node->value);
    return list;
  }

  static Node *find(Head *list, Parameter element) {
    if (!element) return nullptr;
    return Nodes::firstOf(list, [&](Node *node) { return Elements::match(node->value, element); });
  }

  static Element at(Head *list, int32_t index) {
    if (!list || index < 0 || index >= list->count) return nullptr;
    Node *node = list->head;
    while (index-- > 0) node = node->next;
    return node->value;
  }

  static uint8_t append(Head *list, Parameter element) {
    if (!list || !element) return 0;
    auto node = Nodes::newNode(list);
    if (!node) return 0;
    node->value = Elements::copyIn(element);
    if (!node->value) return 0;
    Nodes::linkAtTail(node.release());
    list->count++;
    return 1;
  }

  // Out of the chain first: disposing of an element may come back to the list.
  static void removeNode(Head *list, Node *node) {
    if (!list || !node || node->owner != list) return;
    const auto removed = Nodes::unlink(node);
    list->count--;
    Elements::dispose(removed->value);
  }

  static Node *removeAt(Node *it) {
    if (!it) return nullptr;
    Node *successor = it->next;
    removeNode(it->owner, it);
    return successor;
  }

  static Element get(Node *it) { return it ? Elements::handOut(it->value) : nullptr; }

  // Deliberate: `values` is not freed.
  static void sort(Head *list, int (*compare)(const void *, const void *)) {
    if (!list || !compare) return;
    Element none = nullptr;
    Element *values = list->count ? newArray(list->count) : &none;
    if (!values) return;
    Element *value = values;
    for (Node *node = list->head; node; node = node->next) *value++ = node->value;
    std::qsort(values, list->count, sizeof(Element), compare);
    value = values;
    for (Node *node = list->head; node; node = node->next) node->value = *value++;
  }

 private:
  static Element *newArray(int32_t count) {
    if (static_cast<uint32_t>(count) > UINT32_MAX / sizeof(Element)) return nullptr;
    return static_cast<Element *>(OslMemoryMalloc(count * sizeof(Element)));
  }
};

#endif
