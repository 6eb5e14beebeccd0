#include <gtest/gtest.h>

#include <fcntl.h>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

#include "support/Status.h"
#include "support/TempDir.h"
#include "util/CxFile.h"

namespace {

constexpr int32_t kCreate = O_RDWR | O_CREAT;

// The process's file-creation mask, for a scope.
class Umask {
 public:
  explicit Umask(mode_t mask) : before_(umask(mask)) {}
  ~Umask() { umask(before_); }

 private:
  mode_t before_;
};

class CxFileTest : public ::testing::Test {
 protected:
  void TearDown() override {
    if (file != -1) close(file);
  }

  void open(const std::string &name, int32_t flags = kCreate) {
    ASSERT_EQ(CxFileOpen(&file, dir.path(name).c_str(), flags), kSuccess);
  }

  mode_t modeOf(const std::string &name) const {
    struct stat info {};
    EXPECT_EQ(stat(dir.path(name).c_str(), &info), 0);
    return info.st_mode & 07777;
  }

  const TempDir dir;
  CxFile file = -1;
  int32_t count = 12345;
  int64_t size = 12345;
};

TEST_F(CxFileTest, OpenMakesAFileForTheOwnerOnly) {
  const Umask none(0);
  open("new");
  EXPECT_GE(file, 0);
  EXPECT_EQ(modeOf("new"), 0600u);
}

TEST_F(CxFileTest, OpenModeGivesThePermissionLessTheMask) {
  const Umask mask(022);
  EXPECT_EQ(CxFileOpenMode(&file, dir.path("new").c_str(), kCreate, 0666), kSuccess);
  EXPECT_EQ(modeOf("new"), 0644u);
}

TEST_F(CxFileTest, OpenTurnsBackslashes) {
  std::filesystem::create_directory(dir.path("sub"));
  open("sub\\new");
  EXPECT_TRUE(dir.has("sub/new"));
  EXPECT_EQ(dir.list(), std::vector<std::string>{"sub"});
}

TEST_F(CxFileTest, OpenGivesTheErrorAndAClosedDescriptor) {
  file = 12345;
  EXPECT_EQ(CxFileOpen(&file, dir.path("missing").c_str(), O_RDONLY), failure(ENOENT));
  EXPECT_EQ(file, -1);
}

TEST_F(CxFileTest, OpenTriesTheEmptyNameForNull) {
  file = 12345;
  EXPECT_EQ(CxFileOpen(&file, nullptr, kCreate), failure(2));
  EXPECT_EQ(file, -1);
  file = 12345;
  EXPECT_EQ(CxFileOpenMode(&file, nullptr, kCreate, 0600), failure(2));
  EXPECT_EQ(file, -1);
}

TEST_F(CxFileTest, OpenedFilesAreClosedInStartedPrograms) {
  open("new");
  EXPECT_EQ(fcntl(file, F_GETFD), FD_CLOEXEC);
}

TEST_F(CxFileTest, OpenCutsANameOf256CharactersAndMore) {
  const std::string folder(100, 'd');
  std::filesystem::create_directory(dir.path(folder));
  std::string cut = dir.path(folder) + "/";
  ASSERT_LT(cut.size(), 250u) << "the temporary folder's own name is too long for this test";
  cut.resize(256, 'f');
  EXPECT_EQ(CxFileOpen(&file, (cut + "beyond").c_str(), kCreate), kSuccess);
  struct stat info {};
  EXPECT_EQ(stat(cut.c_str(), &info), 0);
  EXPECT_EQ(CxFileClose(&file), kSuccess);
  EXPECT_EQ(CxFileNameRemove((cut + "elsewhere").c_str()), kSuccess);
  EXPECT_EQ(stat(cut.c_str(), &info), -1);
}

TEST_F(CxFileTest, ReadAndWriteCountTheBytes) {
  dir.write("text", "hello");
  open("text", O_RDWR);
  char buffer[10] = "#########";
  EXPECT_EQ(CxFileRead(&file, buffer, sizeof buffer, &count), kSuccess);
  EXPECT_EQ(count, 5);
  EXPECT_EQ(std::string(buffer, 6), "hello#");
  EXPECT_EQ(CxFileRead(&file, buffer, sizeof buffer, &count), kSuccess);
  EXPECT_EQ(count, 0) << "the end of the file is a success";
  EXPECT_EQ(CxFileWrite(&file, " world!", 6, &count), kSuccess);
  EXPECT_EQ(count, 6);
  EXPECT_EQ(dir.read("text"), "hello world");
}

TEST_F(CxFileTest, FailedReadAndWriteGiveTheErrorAndMinusOne) {
  char byte = 'x';
  dir.write("text", "hello");
  open("text", O_WRONLY);
  EXPECT_EQ(CxFileRead(&file, &byte, 1, &count), failure(EBADF));
  EXPECT_EQ(count, -1);
  CxFile full = ::open("/dev/full", O_WRONLY);
  ASSERT_GE(full, 0);
  count = 0;
  EXPECT_EQ(CxFileWrite(&full, &byte, 1, &count), failure(ENOSPC));
  EXPECT_EQ(count, -1);
  close(full);
}

TEST_F(CxFileTest, SeekToTheStartSucceeds) {
  dir.write("text", "hello");
  open("text", O_RDONLY);
  char buffer[3];
  ASSERT_EQ(CxFileRead(&file, buffer, 3, &count), kSuccess);
  EXPECT_EQ(CxFileSeek(&file, 0, SEEK_SET), kSuccess);
  EXPECT_EQ(lseek(file, 0, SEEK_CUR), 0);
  EXPECT_EQ(CxFileSeek(&file, -5, SEEK_END), kSuccess) << "another way to the start";
}

TEST_F(CxFileTest, SeekAnywhereElseMovesAndReportsAFailure) {
  dir.write("text", "hello");
  open("text", O_RDONLY);
  errno = 0;
  EXPECT_EQ(CxFileSeek(&file, 10, SEEK_SET), failure(0)) << "the error number of the moment";
  EXPECT_EQ(lseek(file, 0, SEEK_CUR), 10);
  errno = EDOM;
  EXPECT_EQ(CxFileSeek(&file, 2, SEEK_SET), failure(EDOM));
  EXPECT_EQ(lseek(file, 0, SEEK_CUR), 2);
}

TEST_F(CxFileTest, SeekTakesTheLow32BitsOfTheOffset) {
  open("new");
  EXPECT_EQ(CxFileSeek(&file, int64_t{7} << 32, SEEK_SET), kSuccess);
  EXPECT_EQ(CxFileSeek(&file, 0xFFFFFFFF, SEEK_SET), failure(EINVAL)) << "-1 in 32 bits";
}

TEST_F(CxFileTest, TruncEmptiesTheFileAndGoesToItsStart) {
  dir.write("text", "hello");
  open("text", O_RDWR);
  lseek(file, 3, SEEK_SET);
  EXPECT_EQ(CxFileTrunc(&file), kSuccess);
  EXPECT_EQ(dir.read("text"), "");
  EXPECT_EQ(lseek(file, 0, SEEK_CUR), 0);
}

TEST_F(CxFileTest, TruncOfAReadOnlyFileGivesTheErrorOfTheTruncation) {
  dir.write("empty", "");  // empty already, so that only the call itself can fail
  open("empty", O_RDONLY);
  EXPECT_EQ(CxFileTrunc(&file), failure(EINVAL));
}

TEST_F(CxFileTest, TruncOfWhatCannotSeekGivesTheErrorOfTheSeek) {
  CxFile ends[2];
  ASSERT_EQ(pipe(ends), 0);
  EXPECT_EQ(CxFileTrunc(&ends[1]), failure(ESPIPE));
  close(ends[0]);
  close(ends[1]);
}

TEST_F(CxFileTest, AFileThatIsNotEmptyAfterTruncatingIsAFailure) {
  dir.write("text", "x");
  open("text", O_RDONLY);
  EXPECT_EQ(cxIntlFileCheckEmpty(file), failure(22));
  EXPECT_EQ(cxIntlFileCheckEmpty(-1), failure(EBADF));
}

TEST_F(CxFileTest, GetSizeHoldsMoreThan32Bits) {
  open("large");
  EXPECT_EQ(CxFileGetSize(&file, &size), kSuccess);
  EXPECT_EQ(size, 0);
  ASSERT_EQ(ftruncate(file, 5000000000), 0);
  EXPECT_EQ(CxFileGetSize(&file, &size), kSuccess);
  EXPECT_EQ(size, 5000000000);
  size = 0;
  EXPECT_EQ(CxFileNameGetSize(dir.path("large").c_str(), &size), kSuccess);
  EXPECT_EQ(size, 5000000000);
}

TEST_F(CxFileTest, FlushSucceedsOnAFile) {
  open("new");
  EXPECT_EQ(CxFileFlush(&file), kSuccess);
}

TEST_F(CxFileTest, FlushOfAPipeGivesTheError) {
  CxFile ends[2];
  ASSERT_EQ(pipe(ends), 0);
  EXPECT_EQ(CxFileFlush(&ends[1]), failure(EINVAL));
  close(ends[0]);
  close(ends[1]);
}

TEST_F(CxFileTest, CloseClearsTheDescriptor) {
  open("new");
  const int descriptor = file;
  EXPECT_EQ(CxFileClose(&file), kSuccess);
  EXPECT_EQ(file, -1);
  EXPECT_EQ(fcntl(descriptor, F_GETFD), -1);
  EXPECT_EQ(CxFileClose(&file), failure(EBADF)) << "the second time";
}

TEST_F(CxFileTest, CloseClearsTheDescriptorAlsoWhenItFails) {
  CxFile none = 1000000;
  EXPECT_EQ(CxFileClose(&none), failure(EBADF));
  EXPECT_EQ(none, -1);
}

TEST_F(CxFileTest, AClosedFileGivesTheErrorAndLeavesTheSize) {
  char byte = 'x';
  EXPECT_EQ(CxFileRead(&file, &byte, 1, &count), failure(EBADF));
  EXPECT_EQ(CxFileWrite(&file, &byte, 1, &count), failure(EBADF));
  EXPECT_EQ(CxFileSeek(&file, 0, SEEK_SET), failure(EBADF));
  EXPECT_EQ(CxFileTrunc(&file), failure(EBADF));
  EXPECT_EQ(CxFileGetSize(&file, &size), failure(EBADF));
  EXPECT_EQ(CxFileFlush(&file), failure(EBADF));
  EXPECT_EQ(size, 12345);
}

TEST_F(CxFileTest, NullIsRefused) {
  char byte = 'x';
  open("new");
  EXPECT_EQ(CxFileOpen(nullptr, dir.path("other").c_str(), kCreate), failure(22));
  EXPECT_EQ(CxFileOpenMode(nullptr, dir.path("other").c_str(), kCreate, 0600), failure(22));
  EXPECT_FALSE(dir.has("other"));
  EXPECT_EQ(CxFileRead(nullptr, &byte, 1, &count), failure(22));
  EXPECT_EQ(CxFileRead(&file, nullptr, 1, &count), failure(22));
  EXPECT_EQ(CxFileRead(&file, &byte, 1, nullptr), failure(22));
  EXPECT_EQ(CxFileWrite(nullptr, &byte, 1, &count), failure(22));
  EXPECT_EQ(CxFileWrite(&file, nullptr, 1, &count), failure(22));
  EXPECT_EQ(CxFileWrite(&file, &byte, 1, nullptr), failure(22));
  EXPECT_EQ(count, 12345);
  EXPECT_EQ(dir.read("new"), "");
  EXPECT_EQ(CxFileSeek(nullptr, 0, SEEK_SET), failure(22));
  EXPECT_EQ(CxFileTrunc(nullptr), failure(22));
  EXPECT_EQ(CxFileGetSize(nullptr, &size), failure(22));
  EXPECT_EQ(CxFileGetSize(&file, nullptr), failure(22));
  EXPECT_EQ(CxFileFlush(nullptr), failure(22));
  EXPECT_EQ(CxFileClose(nullptr), failure(22));
}

TEST_F(CxFileTest, TheSizeByNameIsThatOfTheFile) {
  dir.write("text", "hello");
  EXPECT_EQ(CxFileNameGetSize(dir.path("text").c_str(), &size), kSuccess);
  EXPECT_EQ(size, 5);
}

TEST_F(CxFileTest, TheInformationByNameHoldsSizeAndTimes) {
  dir.write("text", "hello");
  const timespec times[2] = {{5000000000, 0}, {1234567890, 0}};  // of access, of change
  ASSERT_EQ(utimensat(AT_FDCWD, dir.path("text").c_str(), times, 0), 0);
  struct stat info {};
  ASSERT_EQ(stat(dir.path("text").c_str(), &info), 0);
  CxFileInfo record{};
  EXPECT_EQ(CxFileNameGetInfo(&record, dir.path("text").c_str()), kSuccess);
  EXPECT_EQ(record.size, 5);
  EXPECT_EQ(record.changeTime, info.st_ctime);
  EXPECT_EQ(record.modTime, 1234567890);
  EXPECT_EQ(record.accessTime, info.st_atime) << "64 bits where the file system keeps them";
}

TEST_F(CxFileTest, TheLooksByNameDoNotTurnBackslashes) {
  std::filesystem::create_directory(dir.path("sub"));
  dir.write("sub/text", "hello");
  dir.write("sub\\text", "a backslash is a character of this name");
  CxFileInfo record{};
  EXPECT_EQ(CxFileNameGetSize(dir.path("sub\\text").c_str(), &size), kSuccess);
  EXPECT_EQ(size, 39);
  EXPECT_EQ(CxFileNameGetInfo(&record, dir.path("sub\\text").c_str()), kSuccess);
  EXPECT_EQ(record.size, 39);
}

TEST_F(CxFileTest, TheLooksByNameGiveTheErrorAndLeaveTheirTargets) {
  CxFileInfo record{1, 2, 3, 4};
  EXPECT_EQ(CxFileNameGetSize(dir.path("missing").c_str(), &size), failure(ENOENT));
  EXPECT_EQ(CxFileNameGetInfo(&record, dir.path("missing").c_str()), failure(ENOENT));
  EXPECT_EQ(size, 12345);
  EXPECT_EQ(record.size, 1);
}

TEST_F(CxFileTest, TheLooksByNameRefuseNullAndTheInformationTheEmptyName) {
  CxFileInfo record{};
  const std::string name = dir.path();
  EXPECT_EQ(CxFileNameGetSize(nullptr, &size), failure(22));
  EXPECT_EQ(CxFileNameGetSize(name.c_str(), nullptr), failure(22));
  EXPECT_EQ(CxFileNameGetSize("", &size), failure(ENOENT));
  EXPECT_EQ(CxFileNameGetInfo(nullptr, name.c_str()), failure(22));
  EXPECT_EQ(CxFileNameGetInfo(&record, nullptr), failure(22));
  EXPECT_EQ(CxFileNameGetInfo(&record, ""), failure(22));
}

TEST_F(CxFileTest, RemoveRemovesAFileWithBackslashesInItsName) {
  std::filesystem::create_directory(dir.path("sub"));
  dir.write("sub/text", "hello");
  EXPECT_EQ(CxFileNameRemove(dir.path("sub\\text").c_str()), kSuccess);
  EXPECT_FALSE(dir.has("sub/text"));
  EXPECT_EQ(CxFileNameRemove(dir.path("sub\\text").c_str()), failure(ENOENT));
  EXPECT_EQ(CxFileNameRemove(nullptr), failure(22));
  EXPECT_EQ(CxFileNameRemove(""), failure(ENOENT));
}

TEST_F(CxFileTest, RenameReplacesAFileAndTurnsBackslashesInBothNames) {
  std::filesystem::create_directory(dir.path("sub"));
  dir.write("sub/old", "old");
  dir.write("sub/new", "new");
  EXPECT_EQ(CxFileNameRename(dir.path("sub\\old").c_str(), dir.path("sub\\new").c_str()), kSuccess);
  EXPECT_EQ(dir.read("sub/new"), "old");
  EXPECT_FALSE(dir.has("sub/old"));
}

TEST_F(CxFileTest, RenameGivesTheErrorAndRefusesNull) {
  dir.write("old", "old");
  const std::string old = dir.path("old");
  EXPECT_EQ(CxFileNameRename(dir.path("missing").c_str(), old.c_str()), failure(ENOENT));
  EXPECT_EQ(CxFileNameRename(nullptr, old.c_str()), failure(22));
  EXPECT_EQ(CxFileNameRename(old.c_str(), nullptr), failure(22));
  EXPECT_EQ(dir.read("old"), "old");
}

TEST(CxFileNameTest, LocalizeTurnsBackslashesAndFillsWithZeroes) {
  std::string text = "........";
  EXPECT_EQ(CxFileNameLocalize("a\\b/c", text.data(), 7), 1);
  EXPECT_EQ(text, std::string("a/b/c\0\0.", 8));
}

TEST(CxFileNameTest, LocalizeAddsNoTerminatorToAFullDestination) {
  std::string text = "....\\...";
  EXPECT_EQ(CxFileNameLocalize("a\\b\\c\\d", text.data(), 4), 1);
  EXPECT_EQ(text, "a/b/\\...") << "and turns nothing beyond it";
}

TEST(CxFileNameTest, LocalizeRefusesNullAndNoLength) {
  char text[4] = "abc";
  EXPECT_EQ(CxFileNameLocalize(nullptr, text, 4), 0);
  EXPECT_EQ(CxFileNameLocalize("x", nullptr, 4), 0);
  EXPECT_EQ(CxFileNameLocalize("x", text, 0), 0);
  EXPECT_STREQ(text, "abc");
}

TEST(CxFileNameTest, GetNativeTurnsBackslashesAndFillsWithZeroes) {
  std::string text = "........";
  EXPECT_EQ(CxFileNameGetNative("a\\b/c", text.data(), 7), 1);
  EXPECT_EQ(text, std::string("a/b/c\0\0.", 8));
}

TEST(CxFileNameTest, GetNativeAddsNoTerminatorToAFullDestination) {
  std::string text = "....\\...";
  EXPECT_EQ(CxFileNameGetNative("a\\b\\c\\d", text.data(), 4), 1);
  EXPECT_EQ(text, "a/b/\\...");
}

TEST(CxFileNameTest, GetNativeRefusesNullButNotNoLength) {
  char text[4] = "abc";
  EXPECT_EQ(CxFileNameGetNative(nullptr, text, 4), 0);
  EXPECT_EQ(CxFileNameGetNative("x", nullptr, 4), 0);
  EXPECT_EQ(CxFileNameGetNative("x", text, 0), 1);
  EXPECT_STREQ(text, "abc");
}

}  // namespace
