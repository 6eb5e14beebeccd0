// What the containers do with their elements: the operations that the .conf files of
// scripts/containers name. The one place where the containers know the modules above them.
#ifndef QLX_SRC_QLXELEMENTS_H
#define QLX_SRC_QLXELEMENTS_H

#include <qlx/class/config.h>
#include <qlx/class/object.h>
#include <qlx/memory.h>
#include <qlx/props.h>

#include "CxHash.h"

inline bool qlxStringsEqual(const char *a, const char *b) {
  return OslStringCmp(a, b) == 0;
}

template <typename T>
bool qlxSame(const T *a, const T *b) {
  return a == b;
}

// Stores and hands out what somebody else owns and keeps alive.
template <typename T>
T *qlxBorrow(T *element) {
  return element;
}

// Disposes of a borrowed element: nothing.
template <typename T>
void qlxLeave(T *) {}

#endif
