#include <gtest/gtest.h>

#include <cerrno>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

#include <qlx/files.h>

#include "support/TempDir.h"

namespace {

CxFilePath pathOf(const std::string &text) {
  CxFilePath path;
  CxInitFilePath(&path, text.c_str());
  return path;
}

TEST(CxFilePathTest, InitTurnsBackslashesAndFindsTheLastSeparator) {
  CxFilePath path;
  EXPECT_EQ(CxInitFilePath(&path, "a\\b/c\\d"), 1);
  EXPECT_STREQ(path.path, "a/b/c/d");
  EXPECT_EQ(path.length, 7);
  EXPECT_EQ(path.lastSep, 5);
}

TEST(CxFilePathTest, InitWithoutASeparator) {
  CxFilePath path;
  EXPECT_EQ(CxInitFilePath(&path, "name"), 1);
  EXPECT_EQ(path.length, 4);
  EXPECT_EQ(path.lastSep, -1);
  EXPECT_EQ(CxInitFilePath(&path, ""), 1);
  EXPECT_EQ(path.length, 0);
  EXPECT_EQ(path.lastSep, -1);
}

TEST(CxFilePathTest, InitTakes255Characters) {
  CxFilePath path;
  const std::string text(255, 'x');
  EXPECT_EQ(CxInitFilePath(&path, text.c_str()), 1);
  EXPECT_EQ(path.length, 255);
  EXPECT_EQ(path.path, text);
}

TEST(CxFilePathTest, InitOf256CharactersIsInvalid) {
  CxFilePath path;
  const std::string text = "a\\" + std::string(254, 'x');
  EXPECT_EQ(CxInitFilePath(&path, text.c_str()), 0);
  EXPECT_EQ(path.length, -1);
  EXPECT_EQ(path.lastSep, 1);
  EXPECT_EQ(std::string(path.path, 256), "a/" + std::string(254, 'x'));
}

TEST(CxFilePathTest, InitRefusesNull) {
  CxFilePath path = pathOf("a/b");
  EXPECT_EQ(CxInitFilePath(&path, nullptr), 0);
  EXPECT_EQ(path.length, -1);
  EXPECT_EQ(path.lastSep, -1);
  EXPECT_STREQ(path.path, "");
  EXPECT_EQ(CxInitFilePath(nullptr, "a"), 0);
}

TEST(CxFilePathTest, IsDirTellsDirectoriesFromTheRest) {
  const TempDir dir;
  dir.write("file", "");
  const CxFilePath folder = pathOf(dir.path());
  const CxFilePath file = pathOf(dir.path("file"));
  const CxFilePath missing = pathOf(dir.path("missing"));
  EXPECT_EQ(CxFilePathIsDir(&folder), 0);
  EXPECT_EQ(CxFilePathIsDir(&file), 20);
  EXPECT_EQ(CxFilePathIsDir(&missing), 2);
}

TEST(CxFilePathTest, ExistsLooksForAnything) {
  const TempDir dir;
  dir.write("file", "");
  const CxFilePath folder = pathOf(dir.path());
  const CxFilePath file = pathOf(dir.path("file"));
  const CxFilePath missing = pathOf(dir.path("missing"));
  EXPECT_EQ(CxFilePathExists(&folder), 0);
  EXPECT_EQ(CxFilePathExists(&file), 0);
  EXPECT_EQ(CxFilePathExists(&missing), 2);
}

TEST(CxFilePathTest, TheLooksRefuseInvalidAndEmptyPaths) {
  const CxFilePath empty = pathOf("");
  const CxFilePath invalid = pathOf(std::string(300, 'x'));
  EXPECT_EQ(CxFilePathIsDir(&empty), 22);
  EXPECT_EQ(CxFilePathIsDir(&invalid), 22);
  EXPECT_EQ(CxFilePathIsDir(nullptr), 22);
  EXPECT_EQ(CxFilePathExists(&empty), 22);
  EXPECT_EQ(CxFilePathExists(&invalid), 22);
  EXPECT_EQ(CxFilePathExists(nullptr), 22);
}

struct Parent {
  const char *path;
  const char *parent;
  int32_t lastSep;
};

class FilePathParent : public ::testing::TestWithParam<Parent> {};

TEST_P(FilePathParent, IsWhatStandsBeforeTheLastSeparator) {
  const CxFilePath path = pathOf(GetParam().path);
  CxFilePath parent;
  ASSERT_EQ(CxFilePathParent(&path, &parent), 1);
  EXPECT_STREQ(parent.path, GetParam().parent);
  EXPECT_EQ(parent.length, static_cast<int32_t>(std::string(GetParam().parent).size()));
  EXPECT_EQ(parent.lastSep, GetParam().lastSep);
}

INSTANTIATE_TEST_SUITE_P(Paths, FilePathParent,
                         ::testing::Values(Parent{"a/b", "a", -1}, Parent{"/a/b/c", "/a/b", 2},
                                           Parent{"/a", "", -1}, Parent{"/", "", -1},
                                           Parent{"a/b/", "a/b", 1}, Parent{"a//b", "a/", 1},
                                           Parent{"a\\b\\c", "a/b", 1}));

TEST(CxFilePathTest, ParentMayBeThePathItself) {
  CxFilePath path = pathOf("a/b/c");
  EXPECT_EQ(CxFilePathParent(&path, &path), 1);
  EXPECT_STREQ(path.path, "a/b");
  EXPECT_EQ(path.lastSep, 1);
}

TEST(CxFilePathTest, ParentNeedsASeparatorAndAValidPath) {
  const CxFilePath plain = pathOf("name");
  const CxFilePath invalid = pathOf("a/" + std::string(300, 'x'));
  const CxFilePath good = pathOf("a/b");
  CxFilePath parent = pathOf("kept");
  EXPECT_EQ(CxFilePathParent(&plain, &parent), 0);
  EXPECT_EQ(CxFilePathParent(&invalid, &parent), 0);
  EXPECT_EQ(CxFilePathParent(nullptr, &parent), 0);
  EXPECT_EQ(CxFilePathParent(&good, nullptr), 0);
  EXPECT_STREQ(parent.path, "kept");
}

class FilePathMkdirs : public ::testing::Test {
 protected:
  int32_t mkdirs(const std::string &name, uint32_t mode = 0700) const {
    const CxFilePath path = pathOf(dir.path(name));
    return CxFilePathMkdirs(&path, mode);
  }

  mode_t modeOf(const std::string &name) const {
    struct stat info {};
    EXPECT_EQ(stat(dir.path(name).c_str(), &info), 0);
    return info.st_mode & 07777;
  }

  const TempDir dir;
};

TEST_F(FilePathMkdirs, MakesMissingParents) {
  EXPECT_EQ(mkdirs("a\\b/c"), 0);
  EXPECT_TRUE(std::filesystem::is_directory(dir.path("a/b/c")));
}

TEST_F(FilePathMkdirs, GivesTheModeWhateverTheMask) {
  const mode_t before = umask(077);
  EXPECT_EQ(mkdirs("a/b", 0755), 0);
  umask(before);
  EXPECT_EQ(modeOf("a"), 0755u);
  EXPECT_EQ(modeOf("a/b"), 0755u);
}

TEST_F(FilePathMkdirs, LeavesAnExistingDirectoryAlone) {
  ASSERT_EQ(mkdir(dir.path("a").c_str(), 0700), 0);
  EXPECT_EQ(mkdirs("a", 0755), 0);
  EXPECT_EQ(modeOf("a"), 0700u);
}

TEST_F(FilePathMkdirs, RefusesAFileInTheWay) {
  dir.write("file", "");
  EXPECT_EQ(mkdirs("file"), 20);
  EXPECT_EQ(mkdirs("file/a/b"), 20);
}

TEST_F(FilePathMkdirs, AcceptsASeparatorAtTheEnd) {
  EXPECT_EQ(mkdirs("a/b/"), 0);
  EXPECT_TRUE(std::filesystem::is_directory(dir.path("a/b")));
}

TEST_F(FilePathMkdirs, AcceptsAPathThatAppearsMeanwhile) {
  // A link to nowhere: a look does not find it, making it does, and changing its mode fails.
  ASSERT_EQ(symlink(dir.path("nowhere").c_str(), dir.path("link").c_str()), 0);
  EXPECT_EQ(mkdirs("link"), 0);
}

TEST_F(FilePathMkdirs, GivesTheErrorOfTheMaking) {
  const std::filesystem::path before = std::filesystem::current_path();
  ASSERT_EQ(mkdirs("gone"), 0);
  std::filesystem::current_path(dir.path("gone"));
  std::filesystem::remove(dir.path("gone"));
  const CxFilePath path = pathOf("child");  // of a directory that is no more
  EXPECT_EQ(CxFilePathMkdirs(&path, 0700), ENOENT);
  std::filesystem::current_path(before);
}

TEST_F(FilePathMkdirs, RefusesAMissingDirectoryDirectlyUnderTheRoot) {
  const CxFilePath path = pathOf("/qlx-test-missing-" + std::to_string(getpid()));
  ASSERT_EQ(CxFilePathExists(&path), ENOENT);
  EXPECT_EQ(CxFilePathMkdirs(&path, 0700), 22);
  EXPECT_EQ(rmdir(path.path), -1) << "it was made";
}

TEST_F(FilePathMkdirs, RefusesNullEmptyAndInvalidPaths) {
  const CxFilePath empty = pathOf("");
  const CxFilePath invalid = pathOf(std::string(300, 'x'));
  EXPECT_EQ(CxFilePathMkdirs(nullptr, 0700), 22);
  EXPECT_EQ(CxFilePathMkdirs(&empty, 0700), 22);
  EXPECT_EQ(CxFilePathMkdirs(&invalid, 0700), 22);
}

}  // namespace
