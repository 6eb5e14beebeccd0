// A test with a rolling file handler, "file", behind the logger.
#ifndef QLX_TESTS_FILEHANDLERTEST_H
#define QLX_TESTS_FILEHANDLERTEST_H

#include "support/FileHandlerFixture.h"

class FileHandlerTest : public FileHandlerFixture {
 protected:
  FileHandlerTest() : FileHandlerFixture("qlx_filehandler") {}

  void close() {
    const ApiLock lock;
    QlxFileHandlerFClose(handler.get());
  }
};

#endif
