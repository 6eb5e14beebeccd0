#include "file/QlxFileNames.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>

#include <sys/stat.h>
#include <unistd.h>

#include <qlx/qlx.h>

#include "support/FailingMemory.h"
#include "support/Take.h"
#include "support/TempDir.h"
#include "support/WorkingDir.h"

namespace {

std::string show(const char *text) {
  return text ? text : "<null>";
}

std::string currentDirectory() {
  return std::filesystem::current_path();
}

struct Names : QlxLogNames {
  Names() : QlxLogNames{} {}
  ~Names() {
    for (char *part : {dirPart, basePart, extPart}) OslMemoryFree(part);
  }
  Names(const Names &) = delete;
  Names &operator=(const Names &) = delete;
};

// ---- The digit before the last dot

struct DigitCase {
  const char *name;
  int32_t place;
};

class TrailingBaseDigit : public ::testing::TestWithParam<DigitCase> {};

TEST_P(TrailingBaseDigit, IsFoundBeforeTheLastDotOfTheWholeName) {
  EXPECT_EQ(qlxFHTrailingBaseDigit(GetParam().name), GetParam().place);
}

INSTANTIATE_TEST_SUITE_P(Names, TrailingBaseDigit,
                         ::testing::Values(DigitCase{nullptr, -1}, DigitCase{"", -1},
                                           DigitCase{".log", -1}, DigitCase{"app.log", -1},
                                           DigitCase{"trace5.log", 5}, DigitCase{"app7", 3},
                                           DigitCase{"7", 0}, DigitCase{"7.", 0},
                                           DigitCase{"app.7", -1}, DigitCase{"a1.b2.c", 4},
                                           DigitCase{"logs1.d/app", 4},
                                           DigitCase{"logs.d/app1", -1}, DigitCase{"logs/1.log", 5},
                                           DigitCase{"app\xb2.log", -1}));

TEST(FileNames, PutAnUnderscoreBehindADigitThatWouldRunIntoTheNumber) {
  EXPECT_EQ(take(qlxFHCloseBaseDigits("trace5.log")), "trace5_.log");
  EXPECT_EQ(take(qlxFHCloseBaseDigits("app7")), "app7_");
  EXPECT_EQ(take(qlxFHCloseBaseDigits("7")), "7_");
  EXPECT_EQ(take(qlxFHCloseBaseDigits("app.log")), "app.log");
  EXPECT_EQ(take(qlxFHCloseBaseDigits("")), "");
  EXPECT_EQ(qlxFHCloseBaseDigits(nullptr), nullptr);
}

// ---- Taking apart; "<cwd>" is the working directory

struct PartsCase {
  const char *name, *dir, *base;
  int32_t generation;
  const char *ext;
};

class FileNameParts : public ::testing::TestWithParam<PartsCase> {};

TEST_P(FileNameParts, AreTakenApart) {
  const PartsCase &wanted = GetParam();
  Names names;
  qlxFHGetFileNameParts(wanted.name, &names);
  const std::string dir = show(names.dirPart);
  EXPECT_EQ(dir == currentDirectory() ? "<cwd>" : dir, wanted.dir);
  EXPECT_EQ(show(names.basePart), wanted.base);
  EXPECT_EQ(names.generation, wanted.generation);
  EXPECT_EQ(show(names.extPart), wanted.ext);
}

INSTANTIATE_TEST_SUITE_P(
    Names, FileNameParts,
    ::testing::Values(
        PartsCase{"app.log", "<cwd>", "app", 0, "log"},       //
        PartsCase{"app", "<cwd>", "app", 0, "<null>"},        //
        PartsCase{"app.", "<cwd>", "app", 0, ""},             //
        PartsCase{".log", "<cwd>", "", 0, "log"},             //
        PartsCase{"", "<cwd>", "", 0, "<null>"},              //
        PartsCase{"logs/app.log", "logs", "/app", 0, "log"},  // the base keeps its separator
        PartsCase{"/app.log", "<cwd>", "/app", 0, "log"},     // directly under the root
        PartsCase{"/var/log/app.log", "/var/log", "/app", 0, "log"},
        PartsCase{"a\\b\\app.log", "a/b", "/app", 0, "log"},
        PartsCase{"logs//app.log", "logs/", "/app", 0, "log"},
        PartsCase{"logs/", "logs", "/", 0, "<null>"},
        PartsCase{"logs.d/app", "<cwd>", "logs", 0, "d/app"},     // a dot in the directory only
        PartsCase{"/x/logs.d/app", "/x", "/logs", 0, "d/app"},    //
        PartsCase{"logs.d/app.log", "logs.d", "/app", 0, "log"},  //
        PartsCase{"app12.log", "<cwd>", "app", 12, "log"},        //
        PartsCase{"logs/007.log", "logs", "/", 7, "log"},         //
        PartsCase{"app0", "<cwd>", "app", 0, "<null>"},
        PartsCase{"a1/b2.c3", "a1", "/b", 2, "c3"}));

TEST(FileNames, LeaveThePartsEmptyForNull) {
  Names names;
  qlxFHGetFileNameParts("logs/app3.log", &names);
  qlxFHGetFileNameParts(nullptr, &names);
  EXPECT_EQ(names.dirPart, nullptr);
  EXPECT_EQ(names.basePart, nullptr);
  EXPECT_EQ(names.extPart, nullptr);
  EXPECT_EQ(names.generation, 0);
}

TEST(FileNames, HaveAtMost256Bytes) {
  Names names;
  const std::string longest = "d/" + std::string(254, 'x');
  qlxFHGetFileNameParts(longest.c_str(), &names);
  EXPECT_EQ(show(names.basePart), "/" + std::string(254, 'x'));
  EXPECT_EQ(show(names.dirPart), "d");
  qlxFHGetFileNameParts((longest + "x").c_str(), &names);
  EXPECT_EQ(names.basePart, nullptr);
  EXPECT_EQ(names.dirPart, nullptr);
}

TEST(FileNames, IgnoreNullVariables) {
  qlxFHGetFileNameParts("app.log", nullptr);
}

TEST(FileNames, HaveNoDirectoryWhenTheWorkingDirectoryIsGone) {
  const TempDir dir;
  const std::string gone = dir.path("gone");
  std::filesystem::create_directory(gone);
  const WorkingDir here{gone};
  std::filesystem::remove(gone);
  Names names;
  qlxFHGetFileNameParts("default.log", &names);
  EXPECT_EQ(names.dirPart, nullptr);
  EXPECT_EQ(take(qlxFHGenerationName(&names, 0)), "default.log");
}

TEST(FileNames, AreAllOrNothingWhenMemoryRunsOut) {
  Names names;
  for (uint64_t nth = 1;; ++nth) {
    qlxFHGetFileNameParts("x1/y2.z3", &names);
    uint64_t failures;
    {
      FailingMemory memory;
      memory.failOnce(nth);
      qlxFHGetFileNameParts("logs/app4.log", &names);
      failures = memory.failures();
    }
    if (failures == 0) {
      EXPECT_EQ(nth, 4u);  // three parts
      break;
    }
    EXPECT_EQ(names.dirPart, nullptr);
    EXPECT_EQ(names.basePart, nullptr);
    EXPECT_EQ(names.extPart, nullptr);
    EXPECT_EQ(names.generation, 0);
    EXPECT_EQ(qlxFHCheckNames(&names).code, ENOMEM);
  }
  EXPECT_EQ(show(names.dirPart), "logs");
  EXPECT_EQ(qlxFHCheckNames(&names).kind, '-');
}

// ---- Putting together

std::string joined(const char *dir, const char *base, int32_t generation, const char *ext) {
  char *name = nullptr;
  qlxSetFileNameParts(&name, dir, base, generation, ext);
  return take(name);
}

TEST(FileNames, ArePutTogether) {
  EXPECT_EQ(joined("dir", "base", 2, "ext"), "dir/base2.ext");
  EXPECT_EQ(joined("dir", "/base", 2, "ext"), "dir//base2.ext");
  EXPECT_EQ(joined("dir", "base", 0, "ext"), "dir/base.ext");
  EXPECT_EQ(joined(nullptr, "base", 0, nullptr), "base");
  EXPECT_EQ(joined("", "base", 0, ""), "/base.");
  EXPECT_EQ(joined("dir", nullptr, 1, "ext"), "<null>");
  EXPECT_EQ(joined(nullptr, "base", INT32_MIN, nullptr), "base-2147483648");
  qlxSetFileNameParts(nullptr, "dir", "base", 1, "ext");
}

TEST(FileNames, LeaveTheOldNameToTheCaller) {
  char old[] = "old";
  char *name = old;
  qlxSetFileNameParts(&name, nullptr, "new", 0, nullptr);
  EXPECT_EQ(take(name), "new");
  name = old;
  qlxSetFileNameParts(&name, nullptr, nullptr, 0, nullptr);
  EXPECT_EQ(name, nullptr);
}

TEST(FileNames, AreMadeNativeInTheirFirst256Bytes) {
  char buffer[257];
  std::fill_n(buffer, sizeof buffer, '#');
  qlxGetNativePath("a\\b/c", buffer);
  EXPECT_STREQ(buffer, "a/b/c");
  qlxGetNativePath(std::string(300, '\\').c_str(), buffer);
  EXPECT_EQ(buffer, std::string(256, '/'));
  qlxGetNativePath(nullptr, buffer);
  EXPECT_STREQ(buffer, "");
  qlxGetNativePath("name", nullptr);
}

}  // namespace
