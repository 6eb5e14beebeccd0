// The map: values by string key, in the order in which the keys were first put, no key twice.
//
// `Elements` names the records (Head, Node), the types (Element, Parameter) and the operations on
// values: copyIn makes what is stored, handOut what a caller gets, dispose ends what is stored.
// None of them sees a null value. kCopiesFirst tells in which order a value is replaced.
#ifndef QLX_SRC_QLXMAPTEMPLATE_H
#define QLX_SRC_QLXMAPTEMPLATE_H

#include <utility>

#include "CxHash.h"
#include "QlxIndexedNodes.h"

template <typename Elements>
struct QlxMapTemplate
    : QlxIndexedNodes<QlxMapTemplate<Elements>, typename Elements::Head, typename Elements::Node> {
  using Head = typename Elements::Head;
  using Node = typename Elements::Node;
  using Element = typename Elements::Element;
  using Parameter = typename Elements::Parameter;
  using Nodes = QlxIndexedNodes<QlxMapTemplate, Head, Node>;

  static Head *alloc() { return Nodes::newHead(); }

  static void free(Head *map) {
    if (!map) return;
    while (map->head) removeNode(map, map->head);
    OslMemoryFree(map);
  }

  static Head *copy(Head *source) {
    Head *map = source ? alloc() : nullptr;
    if (!map) return nullptr;
    for (Node *node = source->head; node; node = node->next) put(map, node->key, node->value);
    return map;
  }

  static Node *find(Head *map, const char *key) { return Nodes::find(map, key); }

  static uint8_t put(Head *map, const char *key, Parameter value) {
    if (!map || !key) return 0;
    Node *node = find(map, key);
    if (!node) return putNew(map, key, value);
    if (Elements::kCopiesFirst) return replace(node, copyIn(value));
    // While the old value is disposed of, which may come back to the map, no node shows it. It may
    // also have removed the node or stored another value by then.
    dispose(std::exchange(node->value, nullptr));
    node = find(map, key);
    return node ? replace(node, copyIn(value)) : putNew(map, key, value);
  }

  static Element get(Head *map, const char *key) { return getValue(find(map, key)); }

  static void remove(Head *map, const char *key) { removeNode(map, find(map, key)); }

  // Out of the chain first: disposing of a value may come back to the map.
  static void removeNode(Head *map, Node *node) {
    if (!map || !node || node->owner != map) return;
    const auto removed = Nodes::unlink(node);
    dispose(removed->value);
    OslMemoryFree(removed->key);
  }

  static uint8_t hasKey(Head *map, const char *key) { return find(map, key) != nullptr; }

  static char *getKey(Node *it) { return it ? OslStringDup(it->key) : nullptr; }

  static Element getValue(Node *it) {
    return it && it->value ? Elements::handOut(it->value) : nullptr;
  }

  static const char *keyOf(const Node *node) { return node->key; }
  static uint32_t hashOf(const char *key) { return cxHashText(key); }
  static bool equal(const char *a, const char *b) { return *a == *b && OslStringCmp(a, b) == 0; }

 private:
  static uint8_t putNew(Head *map, const char *key, Parameter value) {
    auto node = Nodes::newNode(map);
    if (!node) return 0;
    node->key = OslStringDup(key);
    if (!node->key) return 0;
    node->value = copyIn(value);
    Nodes::linkAtTail(node.release());
    return 1;
  }

  static uint8_t replace(Node *node, Element stored) {
    dispose(std::exchange(node->value, stored));
    return 1;
  }

  static Element copyIn(Parameter value) { return value ? Elements::copyIn(value) : nullptr; }

  static void dispose(Element value) {
    if (value) Elements::dispose(value);
  }
};

#endif
