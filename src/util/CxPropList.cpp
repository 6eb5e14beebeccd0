// The property list. Its array holds plain pointers, so entries move by assignment.
#include "CxPropList.h"

#include <utility>

#include "CxOwned.h"

static constexpr int32_t kFirstCapacity = 32;

static int32_t indexOf(const CxPropList *list, const char *key) {
  if (!list || !key) return -1;
  for (int32_t i = 0; i < list->count; ++i)
    if (OslStringCmp(list->entries[i].key, key) == 0) return i;
  return -1;
}

static uint8_t ensureCapacity(CxPropList *list, int32_t needed) {
  void *entries = list->entries;
  const uint8_t ensured =
      CxListEnsureCapacity(&entries, &list->capacity, &list->count, needed, sizeof(CxPropEntry));
  list->entries = static_cast<CxPropEntry *>(entries);
  return ensured;
}

// One entry always stays spare: the 32nd put finds 32 entries too few.
static uint8_t hasRoomForOne(CxPropList *list) {
  if (!list->entries && !ensureCapacity(list, kFirstCapacity)) return 0;
  return list->count < INT32_MAX - 1 && ensureCapacity(list, list->count + 2);
}

static uint8_t append(CxPropList *list, const char *key, OwnedStr value) {
  if (!hasRoomForOne(list)) return 0;
  char *ownKey = OslStringDup(key);
  if (!ownKey) return 0;
  list->entries[list->count++] = {ownKey, value.release()};
  return 1;
}

uint8_t cxPropListPutAt(CxPropList *list, int32_t index, const char *key, const char *value) {
  OwnedStr copy{OslStringDup(value)};
  if (!copy) return 0;
  if (index < 0) return append(list, key, std::move(copy));
  CxPropEntry &entry = list->entries[index];
  OslMemoryFree(entry.value);
  entry.value = copy.release();
  return 1;
}

uint8_t CxPropListPutStr(CxPropList *list, const char *key, const char *value) {
  return list && key && value ? cxPropListPutAt(list, indexOf(list, key), key, value) : 0;
}

const char *CxPropListPeekStr(const CxPropList *list, const char *key, uint8_t *found) {
  const int32_t index = indexOf(list, key);
  if (found) *found = index >= 0;
  return index >= 0 ? list->entries[index].value : nullptr;
}

char *CxPropListCopyStr(const CxPropList *list, const char *key, uint8_t *found) {
  char *copy = OslStringDup(CxPropListPeekStr(list, key, nullptr));
  if (found) *found = copy != nullptr;
  return copy;
}

uint8_t CxPropListHasKey(const CxPropList *list, const char *key) {
  return indexOf(list, key) >= 0;
}

static void freeEntry(const CxPropEntry &entry) {
  OslMemoryFree(entry.key);
  OslMemoryFree(entry.value);
}

uint8_t CxPropListRemove(CxPropList *list, const char *key) {
  const int32_t index = indexOf(list, key);
  if (index < 0) return 0;
  freeEntry(list->entries[index]);
  list->entries[index] = list->entries[--list->count];
  return 1;
}

void CxPropListDiscard(CxPropList *list) {
  if (!list) return;
  for (int32_t i = 0; i < list->count; ++i) freeEntry(list->entries[i]);
  OslMemoryFree(list->entries);
  *list = {};
}

static const CxPropEntry *currentEntry(const CxPropListIter *iter) {
  if (!iter || !iter->list || iter->index < 0 || iter->index >= iter->list->count) return nullptr;
  return &iter->list->entries[iter->index];
}

CxPropListIter CxPropListIterator(CxPropList *list) {
  return {list, 0};
}

uint8_t CxPropListIterHasNext(const CxPropListIter *iter) {
  return iter && iter->list && iter->index >= 0 && iter->index < iter->list->count - 1;
}

void CxPropListIterNext(CxPropListIter *iter) {
  if (!iter || !iter->list) return;
  if (iter->index < iter->list->count - 1)
    ++iter->index;
  else
    *iter = {nullptr, 0};
}

const char *CxPropListIterPeekKey(const CxPropListIter *iter) {
  const CxPropEntry *entry = currentEntry(iter);
  return entry ? entry->key : nullptr;
}

const char *CxPropListIterPeekVal(const CxPropListIter *iter) {
  const CxPropEntry *entry = currentEntry(iter);
  return entry ? entry->value : nullptr;
}

char *CxPropListIterCopyKey(const CxPropListIter *iter) {
  return OslStringDup(CxPropListIterPeekKey(iter));
}

char *CxPropListIterCopyVal(const CxPropListIter *iter) {
  return OslStringDup(CxPropListIterPeekVal(iter));
}
