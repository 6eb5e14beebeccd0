#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <string>
#include <sys/resource.h>
#include <unistd.h>
#include <vector>

#include <qlx/files.h>

#include "support/Status.h"
#include "support/TempDir.h"

namespace {

class CxDirectoryTest : public ::testing::Test {
 protected:
  void TearDown() override {
    if (directory) CxDirectoryClose(&directory);
  }

  void open(const std::string &path) {
    ASSERT_EQ(CxDirectoryOpen(&directory, path.c_str()), kSuccess);
    ASSERT_NE(directory, nullptr);
  }

  int descriptor() const { return dirfd(static_cast<DIR *>(directory)); }

  // All names up to the empty one at the end, sorted.
  std::vector<std::string> names(uint32_t length = 255) {
    std::vector<std::string> found;
    char name[256];
    while (CxDirectoryGetNext(&directory, name, length) == kSuccess && name[0] != '\0') {
      found.push_back(name);
    }
    std::sort(found.begin(), found.end());
    return found;
  }

  const TempDir dir;
  CxDirectory directory = nullptr;
};

TEST_F(CxDirectoryTest, GivesAllNames) {
  dir.write("one", "");
  dir.write("two", "");
  std::filesystem::create_directory(dir.path("sub"));
  open(dir.path());
  EXPECT_EQ(names(), (std::vector<std::string>{".", "..", "one", "sub", "two"}));
}

TEST_F(CxDirectoryTest, TheEndIsASuccessWithTheEmptyName) {
  open(dir.path());
  names();
  char name[10] = "left over";
  errno = EDOM;
  EXPECT_EQ(CxDirectoryGetNext(&directory, name, 9), kSuccess);
  EXPECT_STREQ(name, "");
}

TEST_F(CxDirectoryTest, CutsANameAndTerminatesIt) {
  dir.write("abcdef", "");
  open(dir.path());
  char name[6];
  std::vector<std::string> found;
  do {
    memset(name, '#', sizeof name);
    ASSERT_EQ(CxDirectoryGetNext(&directory, name, 4), kSuccess);
    EXPECT_EQ(name[5], '#');
    found.push_back(name);
  } while (name[0] != '\0');
  std::sort(found.begin(), found.end());
  EXPECT_EQ(found, (std::vector<std::string>{"", ".", "..", "abcd"}));
}

TEST_F(CxDirectoryTest, OpenTurnsBackslashes) {
  std::filesystem::create_directory(dir.path("sub"));
  dir.write("sub/one", "");
  open(dir.path() + "\\sub");
  EXPECT_EQ(names(), (std::vector<std::string>{".", "..", "one"}));
}

TEST_F(CxDirectoryTest, OpenedDirectoriesAreClosedInStartedPrograms) {
  open(dir.path());
  EXPECT_EQ(fcntl(descriptor(), F_GETFD), FD_CLOEXEC);
}

TEST_F(CxDirectoryTest, OpenRefusesWhatIsNoExistingDirectory) {
  dir.write("file", "");
  const std::string tooLong = dir.path() + std::string(256, '/');  // it exists all the same
  ASSERT_EQ(access(tooLong.c_str(), F_OK), 0);
  for (const std::string &path : {dir.path("file"), dir.path("missing"), std::string(), tooLong}) {
    CxDirectory none = &none;
    EXPECT_EQ(CxDirectoryOpen(&none, path.c_str()), failure(22)) << path;
    EXPECT_EQ(none, nullptr);
  }
}

TEST_F(CxDirectoryTest, OpenGivesTheErrorOfTheSystem) {
  const std::string path = dir.path();
  CxDirectory none = &none;
  rlimit before{};
  ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &before), 0);
  const rlimit noFiles{0, before.rlim_max};
  ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &noFiles), 0);
  const CxStatus status = CxDirectoryOpen(&none, path.c_str());
  setrlimit(RLIMIT_NOFILE, &before);
  EXPECT_EQ(status, failure(EMFILE));
  EXPECT_EQ(none, nullptr);
}

TEST_F(CxDirectoryTest, NullIsRefused) {
  char name[10] = "left over";
  CxDirectory none = nullptr;
  EXPECT_EQ(CxDirectoryOpen(nullptr, dir.path().c_str()), failure(22));
  EXPECT_EQ(CxDirectoryOpen(&none, nullptr), failure(22));
  EXPECT_EQ(none, nullptr);
  EXPECT_EQ(CxDirectoryGetNext(&none, name, 9), failure(22));
  EXPECT_STREQ(name, "");
  EXPECT_EQ(CxDirectoryGetNext(nullptr, name, 9), failure(22));
  EXPECT_EQ(CxDirectoryClose(nullptr), failure(22));
  EXPECT_EQ(CxDirectoryClose(&none), failure(22));
  open(dir.path());
  EXPECT_EQ(CxDirectoryGetNext(&directory, nullptr, 9), failure(22));
}

TEST_F(CxDirectoryTest, CloseClearsTheHandle) {
  open(dir.path());
  EXPECT_EQ(CxDirectoryClose(&directory), kSuccess);
  EXPECT_EQ(directory, nullptr);
  EXPECT_EQ(CxDirectoryClose(&directory), failure(22)) << "the second time";
}

TEST_F(CxDirectoryTest, FailedCallsGiveTheErrorAndCloseClearsTheHandleAllTheSame) {
  open(dir.path());
  close(descriptor());  // behind the handle's back
  char name[10] = "left over";
  EXPECT_EQ(CxDirectoryGetNext(&directory, name, 9), failure(EBADF));
  EXPECT_STREQ(name, "");
  EXPECT_EQ(CxDirectoryClose(&directory), failure(EBADF));
  EXPECT_EQ(directory, nullptr);
}

}  // namespace
