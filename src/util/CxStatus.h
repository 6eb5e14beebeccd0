// The status that platform operations answer, from a system error number. Header only.
#ifndef QLX_SRC_CXSTATUS_H
#define QLX_SRC_CXSTATUS_H

#include <cerrno>

#include <qlx/types.h>

inline constexpr CxStatus kCxSuccess{'-', 0};

constexpr CxStatus cxFailure(int32_t error) {
  return {'p', error};
}

// For calls that answer an error number, 0 on success.
constexpr CxStatus cxStatusOf(int32_t error) {
  return error == 0 ? kCxSuccess : cxFailure(error);
}

// For calls that leave their error number in errno.
inline CxStatus cxStatusOfCall(bool succeeded) {
  return succeeded ? kCxSuccess : cxFailure(errno);
}

#endif
