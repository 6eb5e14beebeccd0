// The index over a property list: open addressing, filled when a key is looked for. A file of
// 100,000 keys takes a minute without it.
#include "CxPropList.h"

#include <qlx/memory.h>

#include "CxHash.h"

static constexpr int32_t kMinIndexedEntries = 64;  // a shorter list is walked as fast
static constexpr uint32_t kFirstSlots = 256;

// The slot that has the key, or else the free one where it belongs.
static uint32_t *slotOf(const CxPropIndex *index, const CxPropList *list, const char *key) {
  const uint32_t mask = index->capacity - 1;
  uint32_t place = cxHashText(key) & mask;
  while (index->slots[place] && OslStringCmp(list->entries[index->slots[place] - 1].key, key) != 0)
    place = (place + 1) & mask;
  return &index->slots[place];
}

// Twice the slots, all free: the entries are to be added anew.
static bool grow(CxPropIndex *index) {
  const uint32_t capacity = index->capacity ? index->capacity * 2 : kFirstSlots;
  auto *slots = static_cast<uint32_t *>(OslMemoryCalloc(capacity, sizeof(uint32_t)));
  if (!slots) return false;
  OslMemoryFree(index->slots);
  *index = {slots, capacity, 0};
  return true;
}

static bool addNewEntries(CxPropIndex *index, const CxPropList *list) {
  while (index->known < list->count) {
    if (static_cast<uint32_t>(index->known) * 2 >= index->capacity && !grow(index)) return false;
    uint32_t *slot = slotOf(index, list, list->entries[index->known].key);
    ++index->known;
    if (!*slot) *slot = static_cast<uint32_t>(index->known);  // of equal keys the first one counts
  }
  return true;
}

uint8_t cxPropIndexPut(CxPropIndex *index, CxPropList *list, const char *key, const char *value) {
  if (list->count < kMinIndexedEntries) return CxPropListPutStr(list, key, value);
  if (!addNewEntries(index, list)) return 0;
  return cxPropListPutAt(list, static_cast<int32_t>(*slotOf(index, list, key)) - 1, key, value);
}

void cxPropIndexDiscard(CxPropIndex *index) {
  OslMemoryFree(index->slots);
  *index = {};
}
