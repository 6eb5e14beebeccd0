#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <ctime>
#include <string>
#include <unistd.h>

#include "support/FailingMemory.h"
#include "support/Status.h"
#include "util/CxSystem.h"

namespace {

TEST(CxSystemTest, PartsOfAMillisecondAreDropped) {
  EXPECT_EQ(cxMillisOf(7, 999900), 7999) << "1.9999 seconds end in 999";
  EXPECT_EQ(cxMillisOf(7, 999999), 7999);
  EXPECT_EQ(cxMillisOf(7, 1000), 7001);
  EXPECT_EQ(cxMillisOf(7, 999), 7000);
  EXPECT_EQ(cxMillisOf(0, 0), 0);
}

TEST(CxSystemTest, MillisecondsNeedMoreThan32Bits) {
  EXPECT_EQ(cxMillisOf(4000000000, 1), 4000000000000);
}

TEST(CxSystemTest, TheTimestampIsNowAndWhole) {
  const double before = std::floor(static_cast<double>(time(nullptr))) * 1000 - 1000;
  const double stamp = CxSystemGetTimestamp();
  const double after = (static_cast<double>(time(nullptr)) + 2) * 1000;
  EXPECT_EQ(stamp, std::floor(stamp));
  EXPECT_GE(stamp, before);
  EXPECT_LE(stamp, after);
}

// The host's name from calls that the test makes up.
class HostnameTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ownName = "short";
    official = "short.example.org";
    ownNameResult = resolveResult = 0;
    workNeeded = 0;
    found = true;
    resolvedName.clear();
    buffer.assign(40, '#');
  }

  CxStatus ask(uint32_t length) {
    static constexpr CxHostCalls kCalls{getName, resolve};
    return cxIntlGetFQHostname(buffer.data(), length, &kCalls);
  }

  static int getName(char *into, size_t length) {
    strncpy(into, ownName.c_str(), length);
    return ownNameResult;
  }

  static int resolve(const char *name, hostent *host, char *work, size_t size, hostent **result,
                     int *) {
    resolvedName = name;
    if (size < workNeeded) return ERANGE;
    memset(work, 0, size);
    if (resolveResult != 0) return resolveResult;
    *host = {};
    host->h_name = official.empty() ? nullptr : official.data();
    *result = found ? host : nullptr;
    return 0;
  }

  static inline std::string ownName, official, resolvedName;
  static inline int ownNameResult, resolveResult;
  static inline size_t workNeeded;
  static inline bool found;
  std::string buffer;  // longer than the lengths that are passed, to see what is written beyond
};

TEST_F(HostnameTest, ANameWithADotIsNotResolved) {
  ownName = "own.example.com";
  EXPECT_EQ(ask(39), kSuccess);
  EXPECT_STREQ(buffer.c_str(), "own.example.com");
  EXPECT_EQ(resolvedName, "");
}

TEST_F(HostnameTest, AShortNameIsResolved) {
  EXPECT_EQ(ask(39), kSuccess);
  EXPECT_STREQ(buffer.c_str(), "short.example.org");
  EXPECT_EQ(resolvedName, "short");
}

TEST_F(HostnameTest, AnOfficialNameWithoutADotLeavesTheShortName) {
  official = "other";
  EXPECT_EQ(ask(39), kSuccess);
  EXPECT_STREQ(buffer.c_str(), "short");
}

TEST_F(HostnameTest, NoOfficialNameLeavesTheShortName) {
  official.clear();
  EXPECT_EQ(ask(39), kSuccess);
  EXPECT_STREQ(buffer.c_str(), "short");
}

TEST_F(HostnameTest, AHostWithoutANameFails) {
  ownNameResult = -1;
  EXPECT_EQ(ask(39), failure(38));
  EXPECT_STREQ(buffer.c_str(), "");
  EXPECT_EQ(resolvedName, "");
}

TEST_F(HostnameTest, ANameThatDoesNotFitFailsAndLeavesTheBufferEmpty) {
  ownName = "1234567890";
  EXPECT_EQ(ask(10), failure(38)) << "no room for its terminator";
  EXPECT_STREQ(buffer.c_str(), "");
  EXPECT_EQ(ask(0), failure(38));
}

TEST_F(HostnameTest, ANameThatDoesNotResolveFailsAndStays) {
  resolveResult = ENOENT;
  EXPECT_EQ(ask(39), failure(38));
  EXPECT_STREQ(buffer.c_str(), "short");
}

TEST_F(HostnameTest, AnUnknownNameFailsAndStays) {
  found = false;
  EXPECT_EQ(ask(39), failure(38));
  EXPECT_STREQ(buffer.c_str(), "short");
}

TEST_F(HostnameTest, AnOfficialNameThatFillsTheLengthIsNotTerminated) {
  EXPECT_EQ(ask(10), kSuccess);
  EXPECT_EQ(buffer, "short.exam" + std::string(30, '#'));
}

TEST_F(HostnameTest, ALongAnswerGetsTheRoomItNeeds) {
  workNeeded = 20000;
  EXPECT_EQ(ask(39), kSuccess);
  EXPECT_STREQ(buffer.c_str(), "short.example.org");
}

TEST_F(HostnameTest, AnEndlessAnswerFails) {
  workNeeded = SIZE_MAX;
  const FailingMemory memory;
  EXPECT_EQ(ask(39), failure(38));
  EXPECT_STREQ(buffer.c_str(), "short");
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(HostnameTest, WithoutMemoryTheNameDoesNotResolve) {
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_EQ(ask(39), failure(38));
  EXPECT_STREQ(buffer.c_str(), "short");
}

TEST(CxSystemTest, NoBufferForTheHostsNameIsRefused) {
  EXPECT_EQ(CxSystemGetFQHostname(nullptr, 256), failure(22));
}

TEST(CxSystemTest, TheHostsOwnNameIsWhereTheSearchStarts) {
  char own[257] = "";
  ASSERT_EQ(gethostname(own, 256), 0);
  char buffer[257] = "";
  const CxStatus status = CxSystemGetFQHostname(buffer, 256);
  // Whether it resolves is the machine's business; either way there is a name.
  EXPECT_TRUE(status == kSuccess || status == failure(38)) << status;
  if (strchr(own, '.') || !strchr(buffer, '.')) {
    EXPECT_STREQ(buffer, own);
  }
}

TEST(CxSystemTest, TheHostsNameInTooShortABufferFails) {
  char buffer[2] = "x";
  EXPECT_EQ(CxSystemGetFQHostname(buffer, 1), failure(38));
  EXPECT_STREQ(buffer, "");
}

template <typename Calls>
std::string traced(Calls calls) {
  ::testing::internal::CaptureStderr();
  calls();
  return ::testing::internal::GetCapturedStderr();
}

TEST(CxTraceTest, IndentsWhatHappensInside) {
  EXPECT_EQ(traced([] {
              cxIntlTraceEnter("outer(%d)\n", 1);
              cxIntlTracePoint("at %s\n", "a");
              cxIntlTraceEnter("inner\n");
              cxIntlTracePoint("at b\n");
              cxIntlTraceLeave("inner: %c\n", 'x');
              cxIntlTraceLeave("outer\n");
              cxIntlTracePoint("after\n");
            }),
            "ENTER outer(1)\n"
            "   ... at a\n"
            "   ENTER inner\n"
            "      ... at b\n"
            "   LEAVE inner: x\n"
            "LEAVE outer\n"
            "... after\n");
}

TEST(CxTraceTest, AddsNoLineEnd) {
  EXPECT_EQ(traced([] { cxIntlTracePoint("a"); }), "... a");
}

TEST(CxTraceTest, LeavingTooOftenIndentsNothing) {
  EXPECT_EQ(traced([] {
              cxIntlTraceLeave("a\n");
              cxIntlTracePoint("b\n");
              cxIntlTraceEnter("c\n");
              cxIntlTracePoint("d\n");
            }),
            "LEAVE a\n... b\nENTER c\n... d\n");
}

TEST(CxTraceTest, IgnoresANullFormat) {
  const char *const none = nullptr;
  EXPECT_EQ(traced([=] {
              cxIntlTraceEnter(none);
              cxIntlTracePoint(none);
              cxIntlTracePoint("still at the start\n");
              cxIntlTraceLeave(none);
            }),
            "... still at the start\n");
}

}  // namespace
