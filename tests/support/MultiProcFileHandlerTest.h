// A test of the multi-process file handler whose system calls may fail.
#ifndef QLX_TESTS_MULTIPROCFILEHANDLERTEST_H
#define QLX_TESTS_MULTIPROCFILEHANDLERTEST_H

#include "support/MultiProcFileHandlerFixture.h"
#include "support/SystemCalls.h"

class MultiProcFileHandlerTest : public MultiProcFileHandlerFixture {
 protected:
  SystemCalls calls;
};

inline bool isLock(const sembuf &operation) {
  return operation.sem_op == -1;
}

#endif
