// The fixture of the tests of watched paths.
#ifndef QLX_TESTS_FILEWATCHTEST_H
#define QLX_TESTS_FILEWATCHTEST_H

#include "QlxFileWatch.h"

#include <atomic>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <thread>

#include <linux/capability.h>
#include <sched.h>
#include <sys/epoll.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "support/Child.h"
#include "support/FileHandlerTest.h"
#include "support/NoticesFlag.h"
#include "support/WorkingDir.h"

namespace fs = std::filesystem;

inline constexpr int kUntilWatched = 12;  // events

// The descriptors of this process that have a kind of anonymous file, such as "inotify".
inline std::vector<int> descriptorsOf(const std::string &kind) {
  std::vector<int> found;
  for (const auto &entry : fs::directory_iterator("/proc/self/fd")) {
    std::error_code gone;
    const std::string target = fs::read_symlink(entry.path(), gone).string();
    if (target.find("anon_inode:" + kind) == 0 || target.find("anon_inode:[" + kind) == 0) {
      found.push_back(std::stoi(entry.path().filename().string()));
    }
  }
  return found;
}

inline size_t openDescriptors() {
  const fs::directory_iterator all("/proc/self/fd");
  return static_cast<size_t>(std::distance(begin(all), end(all)));
}

inline off_t sizeOf(int file) {
  struct stat info {};
  EXPECT_EQ(fstat(file, &info), 0);
  return info.st_size;
}

class FileWatchTest : public FileHandlerTest {
 protected:
  static constexpr const char *kName = "a/b/c/app.log";

  void logTimes(int count) {
    for (int i = 0; i < count; ++i) log(u"steady");
  }

  // Logs to a path until it is watched.
  void watchPath(const std::string &path) {
    set("fileName", path);
    logTimes(kUntilWatched);
    ASSERT_EQ(vars()->watch.watching, 1);
  }
  void watchFile(const std::string &name = kName) { watchPath(dir.path(name)); }

  // The second handler, after the first one, on the same file or another.
  Handle attachSecond(const std::string &name) {
    Handle second = attach("second", "qlx_filehandler");
    format(second);
    QlxSetObjProp(second.get(), "fileName", dir.path(name).c_str());
    return second;
  }
  static QlxFileWatch &watchOf(const Handle &object) {
    return static_cast<QlxFileHandlerVars *>(object->vars)->watch;
  }

  // What the file has after one more event; "-" when there is none.
  std::string next(const std::string &name = kName) {
    log(u"next");
    return fs::is_regular_file(dir.path(name)) ? dir.read(name) : "-";
  }

  // Asks until the answer comes from memory.
  void awaitFlag(const std::string &name = kName) {
    askUntilFlagged([&] { EXPECT_TRUE(finds(name)); });
  }

  bool finds(const std::string &name = kName) {
    const ApiLock lock;
    return qlxFileWatchFindsFile(&vars()->watch, dir.path(name).c_str());
  }
};

#endif
