// A test with a multi-process file handler, "file", behind the logger, and a semaphore of its own.
#ifndef QLX_TESTS_MULTIPROCFILEHANDLERFIXTURE_H
#define QLX_TESTS_MULTIPROCFILEHANDLERFIXTURE_H

#include "QlxMultiProcFileHandler.h"

#include <fcntl.h>
#include <sched.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include "support/CaptureStdout.h"
#include "support/Child.h"
#include "support/FailingMemory.h"
#include "support/FileHandlerFixture.h"
#include "support/FileSizeLimit.h"
#include "support/SemaphoreKey.h"
#include "support/WorkingDir.h"

inline constexpr const char *kClass = "qlx_multiproc_filehandler";

class MultiProcFileHandlerFixture : public FileHandlerFixture {
 protected:
  MultiProcFileHandlerFixture() : FileHandlerFixture(kClass) {}

  void SetUp() override {
    FileHandlerFixture::SetUp();
    set("MPFileSemKey", key.text());
  }

  void open() {
    const ApiLock lock;
    EXPECT_EQ(QlxMultiProcFileHandlerFOpenWithErr(handler.get()), kSuccess);
  }
  void close() {
    const ApiLock lock;
    QlxMultiProcFileHandlerFClose(handler.get());
  }

  // Rolls over whatever the active file holds, into so many generations.
  void rollAlways(const char *maxFiles) {
    set("maxFileBytes", "1");
    set("maxFiles", maxFiles);
  }

  // Something that is in the way of a generation: neither removed nor opened nor replaced.
  void obstruct(const std::string &name) {
    std::filesystem::create_directory(dir.path(name));
    dir.write(name + "/inside", "");
  }

  ino_t activeInode() {
    struct stat info = {};
    EXPECT_EQ(stat(dir.path("app.log").c_str(), &info), 0);
    return info.st_ino;
  }

  // Puts something else behind the descriptor of the open active file.
  void replaceDescriptor(int with) {
    ASSERT_NE(with, -1);
    ASSERT_EQ(dup2(with, vars()->file), vars()->file);
    ::close(with);
  }

  bool semaphoreIsFree() { return key.value() == 1; }

  SemaphoreKey key;
};

#endif
