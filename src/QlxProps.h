// What the library's own readers of properties use beside qlx/props.h: a look at a value, not a
// copy.
#ifndef QLX_SRC_QLXPROPS_H
#define QLX_SRC_QLXPROPS_H

#include <qlx/class/props.h>
#include <qlx/props.h>

QLX_BEGIN_DECLS

// The stored value of a key, the map's own until the key changes; null for an absent key, a null
// value, a null map or a null key.
const char *qlxPeekMapProp(const StringToStringMap *map, const char *key);

QLX_END_DECLS

#endif
