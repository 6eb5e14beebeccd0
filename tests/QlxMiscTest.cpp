#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>

#include <qlx/memory.h>
#include <qlx/toolkit.h>

#include "object/QlxLocked.h"
#include "support/CaptureStdout.h"
#include "support/FailingMemory.h"
#include "support/Take.h"

namespace {

std::string join(std::vector<const char *> strings, const char *separator) {
  return take(QlxStrACat(static_cast<int32_t>(strings.size()), strings.data(), separator));
}

TEST(StrACatTest, PutsOneSeparatorBetweenEntriesWhenOneBetweenThemIsNull) {
  EXPECT_EQ(join({"first", nullptr, "third"}, ", "), "first, third");
}

TEST(StrACatTest, JoinsDirectlyWithoutASeparator) {
  EXPECT_EQ(join({"first", nullptr, "third"}, nullptr), "firstthird");
}

TEST(StrACatTest, PutsNoSeparatorBeforeTheFirstOrBehindTheLastEntryThatIsThere) {
  EXPECT_EQ(join({nullptr, "a", "b", nullptr}, "-"), "a-b");
}

TEST(StrACatTest, CountsAnEmptyEntryAsOne) {
  EXPECT_EQ(join({"", "", ""}, "-"), "--");
}

TEST(StrACatTest, GivesAnEmptyStringWhenThereIsNothingToJoin) {
  EXPECT_EQ(join({}, "-"), "");
  EXPECT_EQ(join({nullptr, nullptr}, "-"), "");
}

TEST(StrACatTest, LooksAtNoMoreEntriesThanCounted) {
  const char *strings[] = {"a", "b"};
  EXPECT_EQ(take(QlxStrACat(1, strings, "-")), "a");
}

TEST(StrACatTest, ReadsANullArrayAndANegativeCountAsNothing) {
  const char *strings[] = {"a"};
  EXPECT_EQ(take(QlxStrACat(2, nullptr, "-")), "");
  EXPECT_EQ(take(QlxStrACat(-1, strings, "-")), "");
}

TEST(StrACatTest, GivesNullWhenMemoryRanOut) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(join({"a", "b"}, "-"), "<null>");
}

TEST(PlatformErrTest, GivesTheSystemsTextOfASystemErrorAsANewString) {
  char *text = QlxGetPlatformErrStr({'p', ENOENT}), *again = QlxGetPlatformErrStr({'p', ENOENT});
  EXPECT_STREQ(text, strerror(ENOENT));
  EXPECT_NE(text, again);
  OslMemoryFree(text);
  OslMemoryFree(again);
}

TEST(PlatformErrTest, HasATextForANumberThatTheSystemDoesNotKnow) {
  EXPECT_EQ(take(QlxGetPlatformErrStr({'p', 123456})), strerror(123456));
}

TEST(PlatformErrTest, GivesNullForEveryOtherKind) {
  EXPECT_EQ(QlxGetPlatformErrStr({'-', ENOENT}), nullptr);
  EXPECT_EQ(QlxGetPlatformErrStr({'x', ENOENT}), nullptr);
}

TEST(PlatformErrTest, ReportsSilently) {
  CaptureStdout out;
  testing::internal::CaptureStderr();
  QlxReportPlatformErr({'p', ENOENT});
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(out.bytes(), "");
}

TEST(PlatformErrTest, ReportsAndFindsNoTextWhenMemoryRanOut) {
  FailingMemory memory;
  memory.failFrom(1);
  QlxReportPlatformErr({'p', ENOENT});
  EXPECT_EQ(QlxGetPlatformErrStr({'p', ENOENT}), nullptr);
}

// A lock taken here would never come: it is not recursive.
TEST(MiscTest, TakesNoLock) {
  const ApiLock lock;
  ASSERT_TRUE(lock);
  EXPECT_EQ(join({"a", "b"}, "-"), "a-b");
  QlxReportPlatformErr({'p', ENOENT});
  EXPECT_EQ(take(QlxGetPlatformErrStr({'p', ENOENT})), strerror(ENOENT));
}

}  // namespace
