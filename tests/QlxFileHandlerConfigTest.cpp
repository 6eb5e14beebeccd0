#include "support/FileHandlerTest.h"

#include <sys/stat.h>

#include "support/IcuDefaults.h"

namespace {

// What other programs see of a file's permissions.
uint32_t modeOf(const std::string &path) {
  struct stat info = {};
  EXPECT_EQ(stat(path.c_str(), &info), 0) << path;
  return info.st_mode & 07777;
}

class FileCreationMask {
 public:
  explicit FileCreationMask(mode_t mask) : before_(umask(mask)) {}
  ~FileCreationMask() { umask(before_); }

 private:
  mode_t before_;
};

TEST_F(FileHandlerTest, SetsTheLimitInBytesByEitherKey) {
  set("maxFileSize", "4096");
  EXPECT_EQ(vars()->maxBytes, 4096);
  set("maxFileBytes", "10");
  EXPECT_EQ(vars()->maxBytes, 10);
}

TEST_F(FileHandlerTest, TakesDefaultsForKeysWithoutAReadableValue) {
  for (const char *key : {"maxFileSize", "maxFileBytes"}) {
    set(key, "77");
    changeAbsent(key);
    EXPECT_EQ(vars()->maxBytes, 1024) << key;
    set(key, "77");
    set(key, "many");
    EXPECT_EQ(vars()->maxBytes, 1024) << key;
  }
  set("maxFiles", "77");
  changeAbsent("maxFiles");
  EXPECT_EQ(vars()->maxFiles, 3);
  set("maxFiles", "77");
  set("maxFiles", "many");
  EXPECT_EQ(vars()->maxFiles, 3);
  set("appending", "false");
  EXPECT_EQ(vars()->appending, 0);
  changeAbsent("appending");
  EXPECT_EQ(vars()->appending, 1);
  set("appending", "false");
  set("appending", "yes");
  EXPECT_EQ(vars()->appending, 1);
}

TEST_F(FileHandlerTest, TakesZeroForASemaphoreKeyWithoutAValue) {
  set("MPFileSemKey", "4711");
  EXPECT_EQ(vars()->semKey, 4711);
  changeAbsent("MPFileSemKey");
  EXPECT_EQ(vars()->semKey, 0);
  set("MPFileSemKey", "4711");
  set("MPFileSemKey", "none");
  EXPECT_EQ(vars()->semKey, 0);
}

TEST_F(FileHandlerTest, ReadsAppendingForLogInternalErrs) {
  set("logInternalErrs", "false");
  EXPECT_EQ(vars()->logInternalErrs, 1);  // "appending" is absent
  set("appending", "false");
  EXPECT_EQ(vars()->logInternalErrs, 1);
  set("logInternalErrs", "true");
  EXPECT_EQ(vars()->logInternalErrs, 0);
}

TEST_F(FileHandlerTest, KeepsTheEncodingWithoutUsingIt) {
  const IcuDefaults defaults;
  ucnv_setDefaultName("UTF-8");
  set("fileEncoding", "UTF-16BE");
  EXPECT_STREQ(vars()->encoding, "UTF-16BE");
  log(u"\u00fc");
  EXPECT_EQ(dir.read("app.log"), "\xc3\xbc\n");
  changeAbsent("fileEncoding");
  EXPECT_EQ(vars()->encoding, nullptr);
}

struct PermissionCase {
  const char *text;
  uint32_t mode;  // 0123 is what was there before
};

class Permission : public FileHandlerTest, public ::testing::WithParamInterface<PermissionCase> {};

TEST_P(Permission, IsReadAsUpToFourOctalDigits) {
  vars()->filePermission = vars()->dirPermission = 0123;
  set("filePermission", GetParam().text);
  set("dirPermission", GetParam().text);
  EXPECT_EQ(vars()->filePermission, GetParam().mode);
  EXPECT_EQ(vars()->dirPermission, GetParam().mode);
}

INSTANTIATE_TEST_SUITE_P(Texts, Permission,
                         ::testing::Values(PermissionCase{"644", 0644},
                                           PermissionCase{"0600", 0600}, PermissionCase{"rw", 0123},
                                           PermissionCase{"12345", 01234},
                                           PermissionCase{" \t755", 0755}, PermissionCase{"", 0123},
                                           PermissionCase{"9", 0123}, PermissionCase{"68", 06},
                                           PermissionCase{"00644", 064}, PermissionCase{"7z", 07}));

TEST_F(FileHandlerTest, KeepsItsPermissionsWithoutAText) {
  qlxFileHandlerCfgPerms(handler.get(), nullptr);
  qlxFileHandlerCfgDirPerms(handler.get(), nullptr);
  EXPECT_EQ(vars()->filePermission, 0744u);
  EXPECT_EQ(vars()->dirPermission, 0771u);
}

TEST_F(FileHandlerTest, MakesFilesLessTheMaskAndDirectoriesPastIt) {
  const FileCreationMask mask{027};
  set("filePermission", "666");
  set("dirPermission", "777");
  set("fileName", dir.path("new/app.log"));
  log(u"1");
  EXPECT_EQ(modeOf(dir.path("new/app.log")), 0640u);
  EXPECT_EQ(modeOf(dir.path("new")), 0777u);
}

// Every setting takes effect by opening the file again; two leave it open.
TEST_F(FileHandlerTest, ClosesForEveryKeyButTwo) {
  formatter->trailer = "tail";
  const char *const keys[] = {"fileName",     "maxFileSize",  "maxFileBytes",   "maxFiles",
                              "appending",    "fileEncoding", "filePermission", "dirPermission",
                              "MPFileSemKey", "logging",      "listenerNames",  "formatterName",
                              "description",  "keepFullFile", "followName",     "unknown",
                              "FileName"};
  for (const char *key : keys) {
    set("fileName", dir.path("app.log"));
    log(u"1");
    ASSERT_EQ(vars()->opened, 1) << key;
    QlxSetObjProp(handler.get(), key, "plain");
    EXPECT_EQ(vars()->opened, 0) << key;
    EXPECT_EQ(vars()->file, -1) << key;
  }
}

TEST_F(FileHandlerTest, StaysOpenForLogInternalErrsAndForPermissionsWithoutValue) {
  log(u"1");
  set("logInternalErrs", "true");
  EXPECT_EQ(vars()->opened, 1);
  changeAbsent("logInternalErrs");
  changeAbsent("filePermission");
  changeAbsent("dirPermission");
  EXPECT_EQ(vars()->opened, 1);
}

TEST_F(FileHandlerTest, ClosesWithTheOldFormattersTrailerWhenItGetsAnother) {
  formatter->trailer = "tail\n";
  log(u"1");
  set("formatterName", "nobody");
  EXPECT_EQ(dir.read("app.log"), "1\ntail\n");
  EXPECT_EQ(QlxHandlerGetFormatter(handler.get()), nullptr);
}

TEST_F(FileHandlerTest, GoesOnUnderItsNewName) {
  log(u"1");
  set("fileName", dir.path("other.log"));
  log(u"2");
  EXPECT_EQ(dir.read("app.log"), "1\n");
  EXPECT_EQ(dir.read("other.log"), "2\n");
}

}  // namespace
