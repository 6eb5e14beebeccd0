// A process that is killed before and after each of its system calls while it rolls a shared file
// over, and another one that goes on. What is promised:
//
// - Killed wherever it may be, it leaves all records in the files but those of the oldest
//   generation, and the semaphore free.
// - The next process loses nothing when the active file was emptied already. Otherwise it rolls
//   over again from the beginning and loses what is in the place of the oldest generation then. So
//   a kill can cost one generation more than a rollover does, the one before the oldest, and never
//   a newer one.
// - A record stands twice only in a cut copy: a generation with the beginning or all of the file
//   that was to be emptied.
#include "support/FileHandlerFixture.h"

#include <algorithm>
#include <csignal>
#include <set>
#include <vector>

#include <sys/ptrace.h>
#include <sys/wait.h>
#include <unistd.h>

#include "soak/Records.h"
#include "support/Child.h"
#include "support/SemaphoreKey.h"

namespace {

constexpr int kLimit = 20000;        // more than two steps of the copy
constexpr RecordId kKilled{100, 0};  // the record of the killed process
constexpr RecordId kNext{101, 0};    // and that of the one after it

using Records = std::set<RecordId>;

Records recordsOf(const Findings &found) {
  Records ids;
  for (const auto &[id, times] : found.records) ids.insert(id);
  return ids;
}

Records minus(Records from, const Records &what) {
  for (const RecordId &id : what) from.erase(id);
  return from;
}

class RolloverKillTest : public FileHandlerFixture, public ::testing::WithParamInterface<int> {
 protected:
  RolloverKillTest() : FileHandlerFixture("qlx_multiproc_filehandler") {}

  void SetUp() override {
    FileHandlerFixture::SetUp();
    key.make(1);
    set("MPFileSemKey", key.text());
    set("maxFileBytes", std::to_string(kLimit));
    set("maxFiles", std::to_string(GetParam()));
  }

  int last() const { return GetParam() - 1; }

  std::string nameOf(int generation) const {
    return "app" + (generation == 0 ? "" : std::to_string(generation)) + ".log";
  }

  // Fills every generation; the active file to its limit. Records carry their generation's number.
  void fill() {
    for (int generation = 0; generation <= last(); ++generation) {
      const size_t bytes = generation == 0 ? kLimit : 300;
      std::string text;
      for (uint32_t i = 0; text.size() < bytes; ++i) {
        text += recordText({static_cast<uint32_t>(generation), i}, 60) + "\n";
      }
      dir.write(nameOf(generation), text);
    }
  }

  Records inGeneration(int generation) const {
    Findings found;
    if (dir.has(nameOf(generation))) parseRecords(dir.read(nameOf(generation)), &found);
    return recordsOf(found);
  }

  void logRecord(RecordId id) {
    const std::string text = recordText(id, 60);
    EXPECT_EQ(logged(std::u16string(text.begin(), text.end()).c_str()), kSuccess);
  }

  // Lets a process log and kills it at a stop: before its first system call, after it, before its
  // second and so on. False when it ended before.
  bool logAndKillAt(int stop) {
    Child process([this] {
      ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
      raise(SIGSTOP);
      logRecord(kKilled);
      _exit(0);
    });
    process.awaitStop();
    int status = 0;
    for (int i = 0; i < stop; ++i) {
      EXPECT_EQ(ptrace(PTRACE_SYSCALL, process.id(), nullptr, nullptr), 0);
      EXPECT_EQ(waitpid(process.id(), &status, 0), process.id());
      if (!WIFSTOPPED(status)) {
        EXPECT_EQ(status, 0);
        process.forget();
        return false;
      }
    }
    EXPECT_EQ(process.kill(), -SIGKILL);
    return true;
  }

  // Looks at what the kill left, has another process log, and looks again.
  void judge(const Records &before) {
    const Findings left = lookInto(dir.path(), last());
    const Records oldest = inGeneration(last());
    const bool emptied = dir.read("app.log").size() < kLimit;
    EXPECT_EQ(key.value(), 1);
    EXPECT_EQ(minus(minus(before, recordsOf(left)), firstIn(last())), Records{});
    EXPECT_LE(left.cutCopies, emptied ? 0 : 1);
    EXPECT_EQ(left.fragments, 0);
    EXPECT_EQ(left.repeated(), 0u);

    Child next([this] { logRecord(kNext); });
    EXPECT_EQ(next.end(), 0);
    const Findings now = lookInto(dir.path(), last());
    Records expected = recordsOf(left);
    if (!emptied) expected = minus(expected, oldest);
    if (!emptied && last() == 1) expected.merge(Records(firstIn(0)));  // it lost a cut copy only
    expected.insert(kNext);
    EXPECT_EQ(recordsOf(now), expected);
    EXPECT_LE(now.cutCopies, left.cutCopies);
    EXPECT_EQ(now.fragments, 0);
    EXPECT_EQ(now.repeated(), 0u);
    EXPECT_EQ(key.value(), 1);

    const bool movedOn = !emptied && oldest == firstIn(last() - 1);
    for (int generation = 0; generation < last(); ++generation) {
      const bool mayBeLost = generation == last() - 1 && generation > 0 && movedOn;
      if (mayBeLost) continue;
      EXPECT_EQ(minus(firstIn(generation), recordsOf(now)), Records{}) << generation;
    }
    if (movedOn && last() > 1) ++lostOneMore;
    cutCopies += left.cutCopies;
    emptyings += emptied;
  }

  // The records that a generation began with.
  Records firstIn(int generation) const { return first_.at(static_cast<size_t>(generation)); }

  void remember() {
    first_.clear();
    for (int generation = 0; generation <= last(); ++generation) {
      first_.push_back(inGeneration(generation));
    }
  }

  SemaphoreKey key;
  int lostOneMore = 0, cutCopies = 0, emptyings = 0;  // what the kills came to

 private:
  std::vector<Records> first_;
};

TEST_P(RolloverKillTest, LosesNoMoreThanTheOldestGenerationsWhereverItComes) {
  int stop = 0;
  for (bool killed = true; killed && !HasFailure();) {
    SCOPED_TRACE("stop " + std::to_string(++stop));
    for (const std::string &name : dir.list()) std::filesystem::remove(dir.path(name));
    fill();
    remember();
    Records before;
    for (int generation = 0; generation <= last(); ++generation) {
      before.merge(inGeneration(generation));
    }
    killed = logAndKillAt(stop);
    if (killed) judge(before);
  }
  // All kinds of places were met: a moved generation, a copy, an emptied file.
  EXPECT_GT(stop, 40);
  EXPECT_EQ(lostOneMore > 0, last() > 1);
  EXPECT_GT(cutCopies, 5);
  EXPECT_GT(emptyings, 5);
  RecordProperty("kills", stop - 1);
}

INSTANTIATE_TEST_SUITE_P(MaxFiles, RolloverKillTest, ::testing::Values(2, 3, 5));

}  // namespace
