// What a log call may answer while memory fails.
#ifndef QLX_TESTS_FAILURERESULT_H
#define QLX_TESTS_FAILURERESULT_H

#include <gtest/gtest.h>

#include <unicode/utypes.h>

#include <qlx/types.h>

#include "support/EveryFailure.h"
#include "support/Status.h"

// A result tells that nothing failed, or that memory was short.
inline void expectResult(const Tries &tries, QlxLogResult result) {
  const CxStatus status{result.statusKind, result.statusCode};
  EXPECT_TRUE(status == kSuccess || status == failure(ENOMEM)) << status;
  EXPECT_TRUE(result.msgStatus == 0 || result.msgStatus == U_MEMORY_ALLOCATION_ERROR)
      << result.msgStatus;
  if (tries.nothingFailed()) {
    EXPECT_EQ(status, kSuccess);
    EXPECT_EQ(result.msgStatus, 0);
  }
}

#endif
