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

constexpr bool cxFailed(CxStatus status) {
  return status.kind != '-';
}

// Makes a call that answers a status again while a signal interrupts it. One that is interrupted
// all the time fails at last, since its caller may hold locks.
template <typename Call>
CxStatus cxUntilDone(Call call) {
  constexpr int kMaxCalls = 1000;
  CxStatus status = call();
  for (int calls = 1; status.code == EINTR && calls < kMaxCalls; ++calls) status = call();
  return status;
}

#endif
