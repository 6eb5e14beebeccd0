#include "QlxIndex.h"

#include <qlx/memory.h>

static constexpr uint32_t kFirstSlots = 64;

static bool hasRoom(const QlxIndex &index) {
  return uint64_t{index.count} * 4 <= uint64_t{index.capacity} * 3;
}

// The slots for as many nodes, half of them free or more.
static uint32_t capacityFor(uint32_t count) {
  uint32_t capacity = kFirstSlots;
  while (capacity / 2 < count && capacity * 2 > capacity) capacity *= 2;
  return capacity;
}

bool qlxIndexReserve(QlxIndex *index) {
  if (hasRoom(*index)) return true;
  QlxIndex larger = {nullptr, capacityFor(index->count), index->count};
  larger.slots =
      static_cast<QlxIndexSlot *>(OslMemoryCalloc(larger.capacity, sizeof(QlxIndexSlot)));
  for (uint32_t i = 0; larger.slots && i < index->capacity; ++i) {
    const QlxIndexSlot &slot = index->slots[i];
    if (slot.node) qlxIndexAdd(&larger, slot.node, slot.hash);
  }
  qlxIndexDrop(index);
  if (larger.slots) *index = larger;
  return larger.slots;
}

void qlxIndexAdd(QlxIndex *index, void *node, uint32_t hash) {
  const uint32_t mask = index->capacity - 1;
  uint32_t i = hash & mask;
  while (index->slots[i].node) i = (i + 1) & mask;
  index->slots[i] = {node, hash};
}

// The slot of a node, or the capacity. Somebody may have written into the node: then its hash is
// another, and all slots are looked at.
static uint32_t slotOf(const QlxIndex &index, const void *node, uint32_t hash) {
  const uint32_t mask = index.capacity - 1;
  for (uint32_t i = hash & mask; index.slots[i].node; i = (i + 1) & mask) {
    if (index.slots[i].node == node) return i;
  }
  uint32_t i = 0;
  while (i < index.capacity && index.slots[i].node != node) ++i;
  return i;
}

void qlxIndexRemove(QlxIndex *index, const void *node, uint32_t hash) {
  uint32_t hole = slotOf(*index, node, hash);
  if (hole == index->capacity) return;
  // Every later slot of the run moves into the hole unless its own place lies behind the hole.
  const uint32_t mask = index->capacity - 1;
  for (uint32_t i = (hole + 1) & mask; index->slots[i].node; i = (i + 1) & mask) {
    const uint32_t displaced = (i - index->slots[i].hash) & mask;
    if (displaced < ((i - hole) & mask)) continue;
    index->slots[hole] = index->slots[i];
    hole = i;
  }
  index->slots[hole] = {nullptr, 0};
}

void qlxIndexDrop(QlxIndex *index) {
  OslMemoryFree(index->slots);
  index->slots = nullptr;
  index->capacity = 0;
}
