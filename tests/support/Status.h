// Platform statuses, and what log calls answer, in expectations: EXPECT_EQ(CxFileClose(&file),
// failure(EBADF)).
#ifndef QLX_TESTS_STATUS_H
#define QLX_TESTS_STATUS_H

#include <cerrno>
#include <ostream>

#include <qlx/types.h>

inline constexpr CxStatus kSuccess{'-', 0};

constexpr CxStatus failure(int32_t error) {
  return {'p', error};
}

inline bool operator==(const CxStatus &a, const CxStatus &b) {
  return a.kind == b.kind && a.code == b.code;
}

inline std::ostream &operator<<(std::ostream &out, const CxStatus &status) {
  return out << "{" << status.kind << "," << status.code << "}";
}

inline bool operator==(const QlxLogResult &a, const QlxLogResult &b) {
  return a.statusKind == b.statusKind && a.statusCode == b.statusCode && a.msgStatus == b.msgStatus;
}

inline std::ostream &operator<<(std::ostream &out, const QlxLogResult &result) {
  return out << "{" << result.statusKind << "," << result.statusCode << "," << result.msgStatus
             << "}";
}

#endif
