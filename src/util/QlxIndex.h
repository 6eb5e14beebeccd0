// The index over a long container: its nodes by the hash of what they are found by, open addressing
// with linear probing. It only speeds lookups up: the chain alone says what is there and in which
// order, and where there is no memory for an index the chain is walked.
#ifndef QLX_SRC_QLXINDEX_H
#define QLX_SRC_QLXINDEX_H

#include <cstdint>

#include <qlx/types.h>

QLX_BEGIN_DECLS

typedef struct QlxIndexSlot {
  void *node;  // null: free
  uint32_t hash;
} QlxIndexSlot;

// All zero is one without slots.
typedef struct QlxIndex {
  QlxIndexSlot *slots;  // owned; null while the container is short or memory is
  uint32_t capacity;    // of the slots: 0 or a power of two; at most three quarters are in use
  uint32_t count;       // nodes in the chain, kept by the container; with slots all are in them
} QlxIndex;

// True when the slots have room for `count` nodes; those that were there may have moved to new
// ones. False when there is no memory for them: then there are none any more.
bool qlxIndexReserve(QlxIndex *index);

// Adds a node; there is room for it.
void qlxIndexAdd(QlxIndex *index, void *node, uint32_t hash);

// Takes a node out, also one whose hash is not the one with which it was added.
void qlxIndexRemove(QlxIndex *index, const void *node, uint32_t hash);

// Frees the slots and keeps the count.
void qlxIndexDrop(QlxIndex *index);

QLX_END_DECLS

// The node of that hash for which `matches` holds, or null.
template <typename Matches>
void *qlxIndexFind(const QlxIndex &index, uint32_t hash, Matches matches) {
  const uint32_t mask = index.capacity - 1;
  for (uint32_t i = hash & mask; index.slots[i].node; i = (i + 1) & mask) {
    if (index.slots[i].hash == hash && matches(index.slots[i].node)) return index.slots[i].node;
  }
  return nullptr;
}

#endif
