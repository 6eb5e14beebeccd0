// Room in a growable array of elements of any size.
#include <qlx/proplist.h>

#include <qlx/memory.h>

static constexpr int32_t kMinGrownCapacity = 16;
static constexpr int32_t kMaxCapacity = int32_t{1} << 30;

// The bytes of so many elements, or 0 when no block can have them.
static uint32_t bytesOf(int32_t elements, uint32_t elementSize) {
  if (elements <= 0 || elements > kMaxCapacity) return 0;
  const uint64_t bytes = uint64_t{elementSize} * static_cast<uint32_t>(elements);
  return bytes <= UINT32_MAX ? static_cast<uint32_t>(bytes) : 0;
}

static int32_t grownCapacity(int32_t needed) {
  if (needed >= kMaxCapacity) return 0;
  int32_t capacity = kMinGrownCapacity;
  while (capacity <= needed) capacity *= 2;
  return capacity;
}

uint8_t CxListEnsureCapacity(void **array, int32_t *capacity, int32_t *count, int32_t needed,
                             uint32_t elementSize) {
  if (!array || !capacity || !count) return 0;
  const bool isNew = !*array;
  if (!isNew && *capacity >= needed) return 1;
  const int32_t elements = isNew ? needed : grownCapacity(needed);
  void *block = OslMemoryRealloc(*array, bytesOf(elements, elementSize));
  if (!block) return 0;
  *array = block;
  *capacity = elements;
  if (isNew) *count = 0;
  return 1;
}

void CxListDiscard(void **array, int32_t *capacity, int32_t *count) {
  if (array) {
    OslMemoryFree(*array);
    *array = nullptr;
  }
  if (capacity) *capacity = 0;
  if (count) *count = 0;
}
