// Puts into a property list whose keys were looked up already, and an index that looks them up for
// one who puts many.
#ifndef QLX_SRC_CXPROPLIST_H
#define QLX_SRC_CXPROPLIST_H

#include <qlx/proplist.h>

QLX_BEGIN_DECLS

// CxPropListPutStr() with the place of the key known: its index, or -1 for a new key.
uint8_t cxPropListPutAt(CxPropList *list, int32_t index, const char *key, const char *value);

// The keys of one list by their hash; all zero is an empty index. It is right as long as the list
// changes only by cxPropIndexPut() with it.
typedef struct CxPropIndex {
  uint32_t *slots;    // owned; index of an entry plus 1, or 0; at most half are in use
  uint32_t capacity;  // of the slots: 0 or a power of two
  int32_t known;      // entries of the list that are in it, the first ones
} CxPropIndex;

// CxPropListPutStr() without its walk over a long list. Neither the list nor the key may be null.
uint8_t cxPropIndexPut(CxPropIndex *index, CxPropList *list, const char *key, const char *value);

// Frees the index, not the list.
void cxPropIndexDiscard(CxPropIndex *index);

QLX_END_DECLS

#endif
