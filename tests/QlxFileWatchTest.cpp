#include "support/FileWatchTest.h"

// This program's tests are about watches, also those of processes that would have none yet.
static const bool gStartsAtOnce = [] {
  qlxFileWatchFirstLooks = 0;
  return true;
}();

static bool gTellsMounted = true;

// In place of the C library's, for the whole program of the tests: as old systems answer.
extern "C" int statx(int directory, const char *path, int flags, unsigned wanted,
                     struct statx *info) noexcept {
  const long result = syscall(SYS_statx, directory, path, flags, wanted, info);
  if (result != 0 || gTellsMounted) return static_cast<int>(result);
  info->stx_attributes &= ~uint64_t{STATX_ATTR_MOUNT_ROOT};
  info->stx_attributes_mask &= ~uint64_t{STATX_ATTR_MOUNT_ROOT};
  return 0;
}

namespace {

// ---- Changes of where the name leads

struct Change {
  const char *name;
  std::function<void(const TempDir &dir)> make;
};

void move(const TempDir &dir, const char *from, const char *to) {
  fs::rename(dir.path(from), dir.path(to));
}

void exchange(const TempDir &dir, const char *from, const char *to) {
  EXPECT_EQ(
      renameat2(AT_FDCWD, dir.path(from).c_str(), AT_FDCWD, dir.path(to).c_str(), RENAME_EXCHANGE),
      0);
}

const Change kChanges[] = {
    {"Unlink", [](const TempDir &dir) { fs::remove(dir.path("a/b/c/app.log")); }},
    {"RenameOfTheFile", [](const TempDir &dir) { move(dir, "a/b/c/app.log", "a/b/c/old.log"); }},
    {"MoveToAnotherDirectory", [](const TempDir &dir) { move(dir, "a/b/c/app.log", "old.log"); }},
    {"RenameOfItsDirectory", [](const TempDir &dir) { move(dir, "a/b/c", "a/b/old"); }},
    {"RenameOfTheDirectoryAbove", [](const TempDir &dir) { move(dir, "a/b", "a/old"); }},
    {"RenameOfTheTopDirectory", [](const TempDir &dir) { move(dir, "a", "old"); }},
    {"RemovalOfTheTree", [](const TempDir &dir) { fs::remove_all(dir.path("a")); }},
    {"ExchangeOfItsDirectory",
     [](const TempDir &dir) {
       fs::create_directory(dir.path("other"));
       exchange(dir, "a/b/c", "other");
     }},
    {"ExchangeOfADirectoryAbove",
     [](const TempDir &dir) {
       fs::create_directory(dir.path("other"));
       exchange(dir, "other", "a");
     }},
    {"ALinkInPlaceOfItsDirectory",
     [](const TempDir &dir) {
       move(dir, "a/b/c", "old");
       fs::create_directory(dir.path("other"));
       fs::create_directory_symlink(dir.path("other"), dir.path("a/b/c"));
     }},
    {"UnlinkWhileAnotherNameStays",
     [](const TempDir &dir) {
       fs::create_hard_link(dir.path("a/b/c/app.log"), dir.path("other.log"));
       fs::remove(dir.path("a/b/c/app.log"));
     }},
    {"UnlinkInAnotherThread",
     [](const TempDir &dir) {
       std::thread([&] { fs::remove(dir.path("a/b/c/app.log")); }).join();
     }},
    {"UnlinkInAnotherProcess",
     [](const TempDir &dir) {
       Child child([&] { fs::remove(dir.path("a/b/c/app.log")); });
       EXPECT_EQ(child.end(), 0);
     }},
};

class FileWatchChangeTest : public FileWatchTest, public ::testing::WithParamInterface<Change> {};

INSTANTIATE_TEST_SUITE_P(Changes, FileWatchChangeTest, ::testing::ValuesIn(kChanges),
                         [](const auto &tested) { return tested.param.name; });

TEST_P(FileWatchChangeTest, MakesTheVeryNextEventMakeTheFileAgain) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  GetParam().make(dir);
  EXPECT_EQ(next(), "next\n");
}

TEST_P(FileWatchChangeTest, SetsTheFlagAndMakesTheVeryNextEventMakeTheFileAgain) {
  if (!systemHasFlags()) GTEST_SKIP() << "no poll requests on this machine";
  ASSERT_NO_FATAL_FAILURE(watchFile());
  awaitFlag();
  GetParam().make(dir);
  EXPECT_FALSE(isFlagged());
  EXPECT_EQ(next(), "next\n");
}

TEST_P(FileWatchChangeTest, IsNoticedTwiceInARow) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  GetParam().make(dir);
  log(u"again");
  logTimes(kUntilWatched);
  fs::remove(dir.path(kName));
  EXPECT_EQ(next(), "next\n");
}

// Things that take the name and are no regular file.
const Change kReplacements[] = {
    {"ADirectory",
     [](const TempDir &dir) {
       fs::remove(dir.path("a/b/c/app.log"));
       fs::create_directory(dir.path("a/b/c/app.log"));
     }},
    {"AFifo",
     [](const TempDir &dir) {
       EXPECT_EQ(mkfifo(dir.path("fifo").c_str(), 0600), 0);
       move(dir, "fifo", "a/b/c/app.log");
     }},
    {"ALinkToNothing",
     [](const TempDir &dir) {
       fs::create_symlink(dir.path("nothing"), dir.path("link"));
       move(dir, "link", "a/b/c/app.log");
     }},
    {"AnExchangedDirectory",
     [](const TempDir &dir) {
       fs::create_directory(dir.path("other"));
       exchange(dir, "other", "a/b/c/app.log");
     }},
};

class FileWatchReplacedTest : public FileWatchTest, public ::testing::WithParamInterface<Change> {};

INSTANTIATE_TEST_SUITE_P(Replacements, FileWatchReplacedTest, ::testing::ValuesIn(kReplacements),
                         [](const auto &tested) { return tested.param.name; });

TEST_P(FileWatchReplacedTest, EndsTheWritingToTheOldFileWithTheVeryNextEvent) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  const int old = open(dir.path(kName).c_str(), O_RDONLY | O_CLOEXEC);
  GetParam().make(dir);
  const off_t size = sizeOf(old);
  log(u"next");
  EXPECT_EQ(sizeOf(old), size);
  ::close(old);
}

TEST_F(FileWatchTest, GoesOnInTheOpenFileWhenARegularOneTakesItsNameAndSeesThatOneRemoved) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  dir.write("other", "other\n");
  move(dir, "other", kName);
  EXPECT_EQ(next(), "other\n");
  EXPECT_EQ(vars()->watch.watching, 1);
  fs::remove(dir.path(kName));
  EXPECT_EQ(next(), "next\n");
}

TEST_F(FileWatchTest, NoticesWhatHappensToAReplacementThatWasMadeAgainAndAgain) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  for (int i = 0; i < 40; ++i) {
    dir.write("other", "other\n");
    move(dir, "other", kName);
    EXPECT_EQ(next(), "other\n");
    EXPECT_LE(vars()->watch.starts, 16);  // a second; from then on it looks
  }
  move(dir, kName, "old");
  EXPECT_EQ(next(), "next\n");
}

TEST_F(FileWatchTest, NoticesADirectoryThatMayNotBeSearchedAnyMore) {
  Child child([&] {
    if (geteuid() == 0 && chown(dir.path().c_str(), 65534, 65534) != 0) _exit(77);
    if (geteuid() == 0 && setresuid(65534, 65534, 65534) != 0) _exit(77);
    if (access(dir.path().c_str(), W_OK) != 0) _exit(77);
    for (const char *directory : {"a", "a/b", "a/b/c"}) {
      set("dirPermission", "755");
      ASSERT_NO_FATAL_FAILURE(watchFile());
      const std::string before = dir.read(kName);
      for (const bool flagged : {false, true}) {
        if (flagged && systemHasFlags()) awaitFlag();
        ASSERT_EQ(chmod(dir.path(directory).c_str(), 0), 0);
        EXPECT_EQ(logged(u"lost").code, EACCES) << directory;
        ASSERT_EQ(chmod(dir.path(directory).c_str(), 0755), 0);
        EXPECT_EQ(next(), before + (flagged ? "next\nnext\n" : "next\n"));
      }
    }
  });
  const int status = child.end();
  if (status == 77) GTEST_SKIP() << "the folder of the tests is not for other users";
  EXPECT_EQ(status, 0);
}

// ---- Sizes

TEST_F(FileWatchTest, StartsNoWatchBeforeTheProcessHasLookedOften) {
  const auto stop = [](uint32_t looks) {
    const ApiLock lock;
    qlxFileWatchStop();
    qlxFileWatchFirstLooks = looks;
  };
  const auto isWatched = [&] { return vars()->watch.watching == 1; };
  ASSERT_TRUE(gStartsAtOnce);
  stop(30);
  set("fileName", dir.path(kName));
  logTimes(30);
  EXPECT_FALSE(isWatched());
  EXPECT_TRUE(descriptorsOf("inotify").empty());
  fs::remove(dir.path(kName));
  log(u"again");
  EXPECT_EQ(dir.read(kName), "again\n") << "the path is looked at meanwhile";
  logTimes(30);
  EXPECT_TRUE(isWatched());
  set("fileName", dir.path("other.log"));
  logTimes(kUntilWatched);
  EXPECT_TRUE(isWatched()) << "the looks of all files count";
  stop(30);
  logTimes(kUntilWatched);
  EXPECT_FALSE(isWatched()) << "and are counted anew";
  stop(0);
  logTimes(kUntilWatched);
  EXPECT_TRUE(isWatched());
}

TEST_F(FileWatchTest, CountsTheBytesOfOtherWriters) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  Child child([&] { std::ofstream(dir.path(kName), std::ios::app) << "another process\n"; });
  EXPECT_EQ(child.end(), 0);
  log(u"next");
  EXPECT_EQ(vars()->size, dir.read(kName).size());
  EXPECT_EQ(vars()->watch.watching, 1);
}

TEST_F(FileWatchTest, RollsAFileThatOthersFilled) {
  set("maxFileBytes", "1000");
  ASSERT_NO_FATAL_FAILURE(watchFile());
  std::ofstream(dir.path(kName), std::ios::app) << std::string(1000, 'x');
  EXPECT_EQ(next(), "next\n");
  EXPECT_EQ(dir.read("a/b/c/app1.log").size(), kUntilWatched * 7 + 1000U);
}

TEST_F(FileWatchTest, SeesAFileThatWasEmptied) {
  set("maxFileBytes", "1000");
  ASSERT_NO_FATAL_FAILURE(watchFile());
  ASSERT_EQ(truncate(dir.path(kName).c_str(), 0), 0);
  EXPECT_EQ(next(), "next\n");
  EXPECT_EQ(vars()->size, 5U);
  dir.write(kName, "");
  EXPECT_EQ(next(), "next\n");
  EXPECT_EQ(vars()->size, 5U);
}

TEST_F(FileWatchTest, NoticesARemovalAfterEachRollover) {
  set("maxFileBytes", "200");
  ASSERT_NO_FATAL_FAILURE(watchFile());
  for (int i = 0; i < 3; ++i) {
    fs::remove(dir.path("a/b/c/app1.log"));
    logTimes(30);
    ASSERT_TRUE(dir.has("a/b/c/app1.log"));
    logTimes(kUntilWatched);
    ASSERT_EQ(vars()->watch.watching, 1);
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
  }
}

TEST_F(FileWatchTest, RollsWhatAHandlerInAnotherProcessFilled) {
  set("maxFileBytes", "200");
  ASSERT_NO_FATAL_FAILURE(watchFile());
  Child child([&] { logTimes(kUntilWatched + 5); });  // to 203 bytes
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(next(), "next\n");
  EXPECT_EQ(dir.read("a/b/c/app1.log").size(), 203U);
}

// ---- Two handlers

TEST_F(FileWatchTest, TellsEachOfTwoHandlersWhenTheOtherTakesTheNotice) {
  const Handle second = attachSecond("a/b/second.log");
  ASSERT_NO_FATAL_FAILURE(watchFile());
  ASSERT_EQ(watchOf(second).watching, 1);
  fs::remove(dir.path(kName));
  fs::remove(dir.path("a/b/second.log"));
  EXPECT_EQ(next(), "next\n");
  EXPECT_EQ(dir.read("a/b/second.log"), "next\n");
}

TEST_F(FileWatchTest, StaysWithOneHandlerWhenAnotherOnTheSameFileCloses) {
  const Handle second = attachSecond(kName);
  ASSERT_NO_FATAL_FAILURE(watchFile());
  ASSERT_EQ(watchOf(second).watching, 1);
  QlxRemListener(logger.get(), second.get());
  QlxSetObjProp(second.get(), "maxFiles", "9");  // closes the file
  ASSERT_EQ(watchOf(second).watching, 0);
  logTimes(3);
  EXPECT_EQ(vars()->watch.watching, 1);
  fs::remove(dir.path(kName));
  EXPECT_EQ(next(), "next\n");
}

TEST_F(FileWatchTest, StaysWithADirectoryThatTakesTheNameOfAnothersFile) {
  const Handle second = attachSecond("a/name");
  logTimes(kUntilWatched);
  ASSERT_EQ(watchOf(second).watching, 1);
  QlxRemListener(logger.get(), second.get());
  fs::remove(dir.path("a/name"));
  ASSERT_NO_FATAL_FAILURE(watchFile("a/name/b/c/app.log"));
  ASSERT_EQ(qlxFileWatchFindsFile(&watchOf(second), dir.path("a/name").c_str()), false);
  move(dir, "a/name/b", "old");
  EXPECT_EQ(next("a/name/b/c/app.log"), "next\n");
}

TEST_F(FileWatchTest, NoticesWhatWasLostInTooManyNotices) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  std::ifstream limit("/proc/sys/fs/inotify/max_queued_events");
  int most = 0;
  limit >> most;
  if (most == 0 || most > 100000) GTEST_SKIP() << "no small limit of notices";
  for (const char *name : {"x", "y"}) dir.write(std::string("a/") + name, "");
  for (int i = 0; i <= most / 2; ++i) {  // a notice for each of two names
    move(dir, "a/x", "a/z");
    move(dir, "a/y", "a/x");
    move(dir, "a/z", "a/y");
  }
  fs::remove(dir.path(kName));
  EXPECT_EQ(next(), "next\n");
  EXPECT_EQ(vars()->watch.watching, 0);  // a new file
}

TEST_F(FileWatchTest, GivesBackWatchesThatNobodyNeeds) {
  QlxFileWatch watch{};
  for (int i = 0; i < 600; ++i) {
    const std::string name = "many/" + std::to_string(i) + "/own/app.log";
    fs::create_directories(fs::path(dir.path(name)).parent_path());
    dir.write(name, "");
    const ApiLock lock;
    for (int look = 0; look < kUntilWatched; ++look) {
      ASSERT_TRUE(qlxFileWatchFindsFile(&watch, dir.path(name).c_str()));
    }
    ASSERT_EQ(watch.watching, 1);
    if (i < 599) qlxFileWatchEnd(&watch);
  }
  const std::vector<int> notices = descriptorsOf("inotify");
  ASSERT_EQ(notices.size(), 1U);
  std::ifstream info("/proc/self/fdinfo/" + std::to_string(notices[0]));
  const std::string all{std::istreambuf_iterator<char>(info), {}};
  size_t watches = 0;
  for (size_t at = 0; (at = all.find("inotify wd:", at)) != std::string::npos; ++at) ++watches;
  EXPECT_GT(watches, 2U);
  EXPECT_LT(watches, 500U);
  const ApiLock lock;
  move(dir, "many/599", "old");
  EXPECT_FALSE(qlxFileWatchFindsFile(&watch, dir.path("many/599/own/app.log").c_str()));
  qlxFileWatchEnd(&watch);
}

TEST_F(FileWatchTest, GivesWatchesBackAgainAtOnceAfterItWasStopped) {
  const std::string path = dir.write("app.log", "");
  const ApiLock lock;
  for (int round = 0; round < 2; ++round) {
    int32_t number = 0;
    for (int i = 0; i < 1100; ++i) {
      QlxFileWatch watch{};
      for (int look = 0; look < kUntilWatched; ++look) qlxFileWatchFindsFile(&watch, path.c_str());
      ASSERT_EQ(watch.watching, 1);
      number = watch.watchNumber;
      qlxFileWatchEnd(&watch);
    }
    EXPECT_LT(number, 500);  // they begin again
    qlxFileWatchStop();
  }
}

// To give them up again and again would cost far more than to look at all of the files.
TEST_F(FileWatchTest, StaysWithMoreWatchesThanItUsuallyKeeps) {
  constexpr int kFiles = 1100;
  std::vector<std::string> paths;
  for (int i = 0; i < kFiles; ++i) paths.push_back(dir.write(std::to_string(i), ""));
  std::vector<QlxFileWatch> watches(kFiles);
  const auto countWatching = [&] {
    const ApiLock lock;
    for (int i = 0; i < kFiles; ++i) {
      EXPECT_TRUE(qlxFileWatchFindsFile(&watches[i], paths[i].c_str()));
    }
    return std::count_if(watches.begin(), watches.end(),
                         [](const QlxFileWatch &watch) { return watch.watching == 1; });
  };
  const auto latest = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  while (countWatching() < kFiles && std::chrono::steady_clock::now() < latest) continue;
  EXPECT_EQ(countWatching(), kFiles);
  fs::remove(paths.back());
  const ApiLock lock;
  EXPECT_FALSE(qlxFileWatchFindsFile(&watches.back(), paths.back().c_str()));
  for (QlxFileWatch &watch : watches) qlxFileWatchEnd(&watch);
}

TEST_F(FileWatchTest, KeepsNoWatchOfFilesThatWereMovedAway) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  const auto watches = [] {
    std::ifstream info("/proc/self/fdinfo/" + std::to_string(descriptorsOf("inotify").at(0)));
    const std::string all{std::istreambuf_iterator<char>(info), {}};
    return std::count(all.begin(), all.end(), '\n');
  };
  const auto before = watches();
  for (int i = 0; i < 5; ++i) {
    move(dir, kName, ("old" + std::to_string(i)).c_str());
    logTimes(kUntilWatched);
    ASSERT_EQ(vars()->watch.watching, 1);
  }
  for (int i = 5; i < 10; ++i) {  // with another at once in its place
    move(dir, kName, ("old" + std::to_string(i)).c_str());
    dir.write(kName, "");
    log(u"steady");
    ASSERT_EQ(vars()->watch.watching, 1);
  }
  EXPECT_EQ(watches(), before);
}

// ---- Paths

TEST_F(FileWatchTest, TakesPathsWithDotsAndRepeatedSeparators) {
  for (const char *name : {"a/b/../b/c/app.log", "a//b///c//app.log", "a/./b/c/./app.log",
                           "a/b/c/d/../../c/app.log"}) {
    SCOPED_TRACE(name);
    fs::create_directories(dir.path("a/b/c/d"));
    ASSERT_NO_FATAL_FAILURE(watchFile(name));
    fs::remove(dir.path(kName));
    EXPECT_EQ(next(), "next\n");
    logTimes(kUntilWatched);
    ASSERT_EQ(vars()->watch.watching, 1);
    move(dir, "a/b", "old");
    fs::create_directories(dir.path("a/b/c/d"));
    EXPECT_EQ(next(), "next\n");
    fs::remove_all(dir.path("old"));
    fs::remove_all(dir.path("a"));
  }
}

TEST_F(FileWatchTest, NoticesWhenADirectoryThatAPathOnlyPassesIsGone) {
  fs::create_directories(dir.path("x/y"));
  ASSERT_NO_FATAL_FAILURE(watchFile("x/y/../app.log"));
  const int inUse = open(dir.path("x/y").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  ASSERT_EQ(rmdir(dir.path("x/y").c_str()), 0);
  EXPECT_FALSE(finds("x/y/../app.log"));
  ::close(inUse);
}

TEST_F(FileWatchTest, LooksAtARelativePathEveryTime) {
  fs::create_directory(dir.path("one"));
  fs::create_directory(dir.path("two"));
  dir.write("one/app.log", "");
  const WorkingDir back(dir.path("one"));
  const ApiLock lock;
  QlxFileWatch watch{};
  for (int i = 0; i < kUntilWatched; ++i) EXPECT_TRUE(qlxFileWatchFindsFile(&watch, "app.log"));
  EXPECT_EQ(watch.watching, 0);
  ASSERT_EQ(chdir(dir.path("two").c_str()), 0);
  EXPECT_FALSE(qlxFileWatchFindsFile(&watch, "app.log"));
}

TEST_F(FileWatchTest, KeepsToTheDirectoryInWhichARelativeNameWasSet) {
  fs::create_directory(dir.path("one"));
  fs::create_directory(dir.path("two"));
  const WorkingDir back(dir.path("one"));
  ASSERT_NO_FATAL_FAILURE(watchPath("app.log"));
  ASSERT_EQ(chdir(dir.path("two").c_str()), 0);
  log(u"steady");
  EXPECT_FALSE(dir.has("two/app.log"));
  fs::remove(dir.path("one/app.log"));
  EXPECT_EQ(next("one/app.log"), "next\n");
}

TEST_F(FileWatchTest, LooksAtAPathWithALinkEveryTime) {
  fs::create_directories(dir.path("one/sub"));
  fs::create_directories(dir.path("two/sub"));
  fs::create_directory_symlink(dir.path("one"), dir.path("link"));
  set("fileName", dir.path("link/sub/app.log"));
  logTimes(kUntilWatched);
  EXPECT_EQ(vars()->watch.watching, 0);
  fs::create_directory_symlink(dir.path("two"), dir.path("new"));
  move(dir, "new", "link");
  EXPECT_EQ(next("two/sub/app.log"), "next\n");
}

TEST_F(FileWatchTest, LooksAtALinkToAFileEveryTime) {
  dir.write("one.log", "");
  fs::create_symlink(dir.path("one.log"), dir.path("app.log"));
  set("fileName", dir.path("app.log"));
  logTimes(kUntilWatched);
  EXPECT_EQ(vars()->watch.watching, 0);
  fs::create_symlink(dir.path("two.log"), dir.path("new"));
  move(dir, "new", "app.log");
  EXPECT_EQ(next("two.log"), "next\n");
}

TEST_F(FileWatchTest, IsNotWorthTheSetUpForAFewEvents) {
  logTimes(8);
  EXPECT_EQ(vars()->watch.watching, 0);
  EXPECT_TRUE(descriptorsOf("inotify").empty());
}

// A file system of the child's own; false where the system does not allow that.
bool mountOwn(const std::string &directory) {
  const uid_t user = geteuid();
  const gid_t group = getegid();
  if (unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) return false;
  std::ofstream("/proc/self/setgroups") << "deny";
  std::ofstream("/proc/self/uid_map") << "0 " << user << " 1";
  std::ofstream("/proc/self/gid_map") << "0 " << group << " 1";
  return mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
         mount("own", directory.c_str(), "tmpfs", 0, "mode=755") == 0;
}

TEST_F(FileWatchTest, NoticesChangesOfAFileInTheRootItself) {
  Child child([&] {
    if (!mountOwn(dir.path()) || chroot(dir.path().c_str()) != 0) _exit(77);
    ASSERT_NO_FATAL_FAILURE(watchPath("/app.log"));
    ASSERT_EQ(unlink("/app.log"), 0);
    log(u"next");
    const int file = open("/app.log", O_RDONLY | O_CLOEXEC);
    ASSERT_NE(file, -1);
    EXPECT_EQ(sizeOf(file), 5);
  });
  const int status = child.end();
  if (status == 77) GTEST_SKIP() << "no file system of its own";
  EXPECT_EQ(status, 0);
}

class FileWatchMountTest : public FileWatchTest, public ::testing::WithParamInterface<bool> {};

INSTANTIATE_TEST_SUITE_P(Systems, FileWatchMountTest, ::testing::Bool(), [](const auto &tested) {
  return tested.param ? "ThatTellMountedDirectories" : "ThatDoNot";
});

TEST_P(FileWatchMountTest, NoticesChangesOfADirectoryThatIsMounted) {
  Child child([&] {
    if (!mountOwn(dir.path())) _exit(77);
    gTellsMounted = GetParam();
    ASSERT_NO_FATAL_FAILURE(watchFile("app.log"));
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    const __user_cap_data_struct none[2] = {};
    ASSERT_EQ(syscall(SYS_capset, &header, none), 0);  // rights count now
    ASSERT_EQ(chmod(dir.path().c_str(), 0), 0);
    EXPECT_EQ(logged(u"lost").code, EACCES);
  });
  const int status = child.end();
  if (status == 77) GTEST_SKIP() << "no file system of its own";
  EXPECT_EQ(status, 0);
}

// ---- Time

TEST_F(FileWatchTest, LooksOnceASecondWhereNoNoticeComes) {
  ASSERT_NO_FATAL_FAILURE(watchFile());
  fs::remove(dir.path(kName));
  std::array<char, 4096> stolen;
  ASSERT_GT(read(descriptorsOf("inotify").at(0), stolen.data(), stolen.size()), 0);
  vars()->watch.lastLook -= 1;
  EXPECT_EQ(next(), "next\n");
}

}  // namespace
