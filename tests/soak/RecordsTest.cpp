#include "soak/Records.h"

#include <gtest/gtest.h>

#include "support/TempDir.h"

namespace {

Findings parse(const std::string &bytes) {
  Findings found;
  parseRecords(bytes, &found);
  return found;
}

const std::string kOne = recordText({1, 7}, 30) + "\n";
const std::string kTwo = recordText({2, 8}, 5000) + "\n";

TEST(SoakRecordsTest, KnowsWholeRecords) {
  const Findings found = parse(kOne + kTwo);
  EXPECT_EQ(found.records, (std::map<RecordId, int>{{{1, 7}, 1}, {{2, 8}, 1}}));
  EXPECT_EQ(found.fragments, 0);
}

TEST(SoakRecordsTest, KnowsTheRecordBehindAFragment) {
  for (size_t length = 1; length + 2 < kTwo.size(); length += 97) {
    const Findings found = parse(kTwo.substr(0, length) + kOne);
    EXPECT_EQ(found.records.count({1, 7}), 1u) << length;
    EXPECT_EQ(found.records.size(), 1u) << length;
    EXPECT_EQ(found.fragments, 1) << length;
  }
}

TEST(SoakRecordsTest, TakesARecordWithoutItsLineFeedForAFragmentToo) {
  const Findings found = parse(recordText({2, 8}, 10) + kOne);
  EXPECT_EQ(found.records.size(), 2u);
  EXPECT_EQ(found.fragments, 1);
}

TEST(SoakRecordsTest, SeesEveryChangedByte) {
  for (size_t place = 0; place < kOne.size(); ++place) {
    std::string bytes = kOne;
    bytes[place] = bytes[place] == '0' ? '1' : '0';
    EXPECT_GE(parse(bytes).fragments, 1) << place;
  }
}

TEST(SoakRecordsTest, CountsRecordsThatStandTwice) {
  EXPECT_EQ(parse(kOne + kTwo + kOne).repeated(), 1u);
}

TEST(SoakRecordsTest, LeavesCutCopiesOut) {
  const TempDir dir;
  dir.write("app.log", "");
  dir.write("app1.log", kOne + kTwo);
  dir.write("app2.log", "");
  dir.write("app4.log", kOne + kTwo.substr(0, 20));
  dir.write("app5.log", kOne + kTwo);
  const Findings found = lookInto(dir.path(), 5);
  EXPECT_EQ(found.files, 5);
  EXPECT_EQ(found.cutCopies, 3);
  EXPECT_EQ(found.recordsInCutCopies, 3u);
  EXPECT_EQ(found.repeated(), 0u);
  EXPECT_EQ(found.fragments, 0);
  EXPECT_EQ(found.records.size(), 2u);
  EXPECT_EQ(found.largestFile, kOne.size() + kTwo.size());
}

TEST(SoakRecordsTest, SeesACopyThatIsNotCutFromTheNextNewerFile) {
  const TempDir dir;
  dir.write("app.log", kOne + kTwo);
  dir.write("app1.log", kTwo);
  const Findings found = lookInto(dir.path(), 5);
  EXPECT_EQ(found.cutCopies, 0);
  EXPECT_EQ(found.repeated(), 1u);
}

}  // namespace
