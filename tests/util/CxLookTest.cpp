// When to look at the outside again, by a clock of the test's own.
#include "util/CxLook.h"

#include <filesystem>
#include <unistd.h>
#include <fstream>

#include "support/Child.h"
#include "support/Descriptors.h"
#include "support/FileHandlerTest.h"
#include "support/FileSizeLimit.h"
#include "support/TestClock.h"

namespace {

constexpr int kFirstLooks = 1024;
constexpr int kLooksATick = 16;

void lookOften(CxLook *look) {
  for (int i = 0; i < kFirstLooks; ++i) ASSERT_TRUE(cxLookAgain(look)) << i;
}

int looksOf(CxLook *look, int records) {
  int looks = 0;
  for (int i = 0; i < records; ++i) looks += cxLookAgain(look);
  return looks;
}

TEST(Look, IsMadeByEveryRecordOfAProcessThatHasNotLookedOften) {
  const TestClock clock;
  CxLook look = {};
  lookOften(&look);
}

TEST(Look, IsMadeByTheFirstRecordsOfATickAfterThat) {
  const TestClock clock;
  CxLook look = {};
  lookOften(&look);
  for (TestClock::tick = 2; TestClock::tick < 5; ++TestClock::tick)
    EXPECT_EQ(looksOf(&look, 100), kLooksATick);
}

TEST(Look, IsEachThingsOwn) {  // or one that is seldom asked for would share a look of long ago
  const TestClock clock;
  CxLook first = {}, second = {};
  lookOften(&first);
  EXPECT_EQ(looksOf(&first, 100), kLooksATick);
  EXPECT_EQ(looksOf(&second, 100), kLooksATick);
}

TEST(Look, IsMadeAgainByOneThatWasEmptied) {
  const TestClock clock;
  CxLook look = {};
  lookOften(&look);
  looksOf(&look, 100);
  look = {};
  EXPECT_TRUE(cxLookAgain(&look));
}

TEST(Look, IsMadeByEveryRecordAgainInTheChildOfAFork) {
  const TestClock clock;
  QlxAcquireObject(nullptr);  // the first public call registers what follows a fork
  CxLook look = {};
  lookOften(&look);
  EXPECT_EQ(looksOf(&look, 100), kLooksATick);
  Child child([&] { EXPECT_EQ(looksOf(&look, 100), 100); });
  EXPECT_EQ(child.end(), 0);
  EXPECT_EQ(looksOf(&look, 100), 0);
}

TEST(Look, HasAClockThatGoesOn) {
  const int64_t before = cxLookTick();
  while (cxLookTick() == before) {
  }
  EXPECT_GT(cxLookTick(), before);
}

// ---- What the records of a burst share

class BurstTest : public FileHandlerTest {
 protected:
  // So many records that those of this tick share the last look.
  void burst() {
    for (size_t i = 0; i < kBurst; ++i) log(u"looking");
  }
  static constexpr size_t kBurst = 1 + kFirstLooks + kLooksATick;  // the first one opens the file
  static constexpr size_t kBurstBytes = kBurst * 8;

  const TestClock clock;
};

TEST_F(BurstTest, GoesOnInADeletedFileUntilTheNextTick) {
  burst();
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"same tick"), kSuccess);
  EXPECT_FALSE(dir.has("app.log"));
  ++TestClock::tick;
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "next\n");
}

TEST_F(BurstTest, CountsItsOwnBytesAndRollsOverAtTheSameRecord) {
  const size_t most = kBurstBytes + 300;
  set("maxFileBytes", std::to_string(most));
  set("maxFiles", "2");
  burst();
  while (!dir.has("app1.log")) ASSERT_EQ(logged(u"123456789"), kSuccess);
  const size_t bytes = dir.read("app1.log").size();
  EXPECT_GE(bytes, most);
  EXPECT_LT(bytes, most + 10);
}

TEST_F(BurstTest, MeasuresBeforeItRolls) {
  set("maxFileBytes", std::to_string(kBurstBytes + 200));
  burst();
  std::filesystem::resize_file(dir.path("app.log"), 0);  // another program emptied it
  for (int i = 0; i < 30; ++i) log(u"123456789");        // by the count it is full meanwhile
  EXPECT_EQ(dir.read("app.log").size(), 300u);
  EXPECT_FALSE(dir.has("app1.log"));
}

TEST_F(BurstTest, LosesNoRecordWhenItsDescriptorIsClosed) {
  burst();
  ASSERT_EQ(::close(descriptorOf(dir.path("app.log"))), 0);
  EXPECT_EQ(logged(u"same tick"), kSuccess);
  const std::string all = dir.read("app.log");
  EXPECT_EQ(all.substr(all.rfind("looking")), "looking\nsame tick\n");
}

TEST_F(BurstTest, LooksAtOnceAfterAFailure) {
  burst();
  {
    const FileSizeLimit full{1};
    EXPECT_EQ(logged(u"lost"), failure(EFBIG));
  }
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "next\n");
}

TEST_F(BurstTest, LooksAtOnceAfterAChangedSetting) {
  burst();
  set("maxFiles", "4");
  log(u"open");
  std::filesystem::remove(dir.path("app.log"));
  EXPECT_EQ(logged(u"next"), kSuccess);
  EXPECT_EQ(dir.read("app.log"), "next\n");
}

}  // namespace
