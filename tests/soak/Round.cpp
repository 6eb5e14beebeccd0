#include "Round.h"

#include <algorithm>
#include <atomic>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <optional>
#include <string>
#include <unistd.h>
#include <vector>

#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>

#include <qlx/qlx.h>

#include "Records.h"
#include "support/PlainFormatter.h"
#include "support/SemaphoreKey.h"

static constexpr uint32_t kMaxWriters = 64;
static constexpr uint32_t kMaxSequence = 1u << 20;
static constexpr size_t kLargestPadding = 6000;
static constexpr uint64_t kLargestRecord = kLargestPadding + 64;
static constexpr unsigned kHangSeconds = 300;  // until a round that hangs ends the program
static constexpr long kMaxNanosecondsBetweenKills = 2000000;

namespace {

// What the processes share: the system keeps it whatever becomes of them.
struct Board {
  std::atomic<bool> stop;
  std::atomic<int64_t> bytesLeft;  // that all generations still have room for
  std::atomic<int64_t> recordsLeft;
  std::atomic<uint32_t> failures;
  std::atomic<uint32_t> next[kMaxWriters];  // sequence numbers
  std::atomic<uint8_t> marked[kMaxWriters][kMaxSequence];

  static Board *make() {
    void *place = mmap(nullptr, sizeof(Board), PROT_READ | PROT_WRITE,
                       MAP_SHARED | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    if (place == MAP_FAILED) std::abort();
    return static_cast<Board *>(place);  // zeros
  }
};

class Folder {
 public:
  Folder() {
    const char *const parent = std::getenv("TMPDIR");
    path_ = std::string(parent && *parent ? parent : "/tmp") + "/qlx-soak-XXXXXX";
    if (!mkdtemp(path_.data())) std::abort();
  }
  ~Folder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
  }
  const std::string &path() const { return path_; }

 private:
  std::string path_;
};

// A pipe at which the writers wait for each other: open when its last writing end is closed.
class Gate {
 public:
  Gate() {
    if (pipe(ends_) != 0) std::abort();
  }
  ~Gate() { closeBoth(); }
  void open() { closeEnd(1); }
  void pass() {
    char token;
    closeEnd(1);
    while (read(ends_[0], &token, 1) == 1) {
    }
    closeBoth();
  }

 private:
  void closeEnd(int end) {
    if (ends_[end] != -1) close(ends_[end]);
    ends_[end] = -1;
  }
  void closeBoth() {
    closeEnd(0);
    closeEnd(1);
  }
  int ends_[2];
};

class Round {
 public:
  Round(const Plan &plan, uint64_t kills, std::mt19937_64 &random)
      : plan_(plan), kills_(kills), random_(random) {}

  Outcome run() {
    alarm(kHangSeconds);
    openLog();
    for (uint32_t slot = 0; slot < plan_.processes; ++slot) spawn(slot);
    gate_.open();
    if (kills_ > 0) killMany();
    if (plan_.records == 0) board_->stop = true;
    for (const pid_t writer : writers_) await(writer, 0);
    QlxReleaseObject(logger_);
    QlxCloseToolkit();
    judge();
    munmap(board_, sizeof *board_);
    return outcome_;
  }

 private:
  // The objects are made before the processes part; file and semaphore are each writer's to open.
  void openLog() {
    const int64_t rollovers = static_cast<int64_t>(plan_.generations - kills_) - 10;
    board_->bytesLeft = std::max<int64_t>(rollovers, 1) * static_cast<int64_t>(plan_.bytes);
    board_->recordsLeft = plan_.records ? static_cast<int64_t>(plan_.records) : INT64_MAX;
    QlxOpenToolkit(nullptr, nullptr);
    formatter_.emplace();
    logger_ = QlxGetObject("log", "qlx_basiclogger");
    QlxObject *handler = QlxGetObject("file", "qlx_multiproc_filehandler");
    QlxObject *format = QlxGetObject("plain", PlainFormatter::kClass);
    QlxHandlerSetFormatter(handler, format);
    QlxSetObjProp(handler, "MPFileSemKey", key_.text().c_str());
    QlxSetObjProp(handler, "maxFileBytes", std::to_string(plan_.bytes).c_str());
    QlxSetObjProp(handler, "maxFiles", std::to_string(plan_.generations).c_str());
    QlxSetObjProp(handler, "fileName", (folder_.path() + "/app.log").c_str());
    QlxAddListener(logger_, handler);
    QlxReleaseObject(format);
    QlxReleaseObject(handler);
  }

  void spawn(uint32_t slot) {
    const uint64_t seed = random_();
    const pid_t parent = getpid();
    const pid_t writer = fork();
    if (writer == -1) std::abort();
    if (writer == 0) {
      prctl(PR_SET_PDEATHSIG, SIGKILL);
      if (getppid() != parent) _exit(1);
      gate_.pass();
      write(slot, seed);
      _exit(0);
    }
    writers_.resize(std::max<size_t>(writers_.size(), slot + 1), -1);
    writers_[slot] = writer;
  }

  // Mostly about 100 bytes; now and then one that needs more than a page.
  static size_t padding(std::mt19937_64 &random) {
    const uint64_t draw = random();
    return draw % 64 == 0 ? (draw >> 8) % kLargestPadding : 40 + (draw >> 8) % 80;
  }

  void write(uint32_t slot, uint64_t seed) {
    std::mt19937_64 random(seed);
    while (!board_->stop && board_->recordsLeft.fetch_sub(1) > 0) {
      const uint32_t sequence = board_->next[slot]++;
      const std::string text = recordText({slot, sequence}, padding(random));
      const auto size = static_cast<int64_t>(text.size() + 1);
      if (sequence >= kMaxSequence || board_->bytesLeft.fetch_sub(size) < size) break;
      const std::u16string wide(text.begin(), text.end());
      const bool written = QlxLogUText(logger_, wide.c_str()).statusKind == '-';
      if (written) board_->marked[slot][sequence] = 1;
      if (!written) ++board_->failures;
    }
  }

  // Kills at random moments; each of the killed comes again. The first kill waits until every
  // writer has written: a maker of the set that dies before it is free leaves it held.
  void killMany() {
    for (uint32_t slot = 0; slot < plan_.processes; ++slot) {
      while (board_->marked[slot][0] == 0 && board_->failures == 0) sched_yield();
    }
    for (; outcome_.kills < kills_ && board_->bytesLeft > 0; ++outcome_.kills) {
      const auto wait = static_cast<long>(random_() % kMaxNanosecondsBetweenKills);
      const timespec moment{0, wait};
      nanosleep(&moment, nullptr);
      const auto slot = static_cast<uint32_t>(random_() % plan_.processes);
      kill(writers_[slot], SIGKILL);
      await(writers_[slot], SIGKILL);
      spawn(slot);
    }
  }

  // A writer ends by the signal, or else by itself when there is no room left.
  void await(pid_t writer, int signal) {
    int status = 0;
    if (waitpid(writer, &status, 0) != writer) std::abort();
    const bool killed = signal != 0 && WIFSIGNALED(status) && WTERMSIG(status) == signal;
    const bool done = WIFEXITED(status) && WEXITSTATUS(status) == 0;
    if (!killed && !done) ++outcome_.failures;
  }

  void judge() {
    const Findings found = lookInto(folder_.path(), static_cast<int>(plan_.generations));
    for (uint32_t slot = 0; slot < plan_.processes; ++slot) {
      for (uint32_t sequence = 0; sequence < kMaxSequence; ++sequence) {
        if (board_->marked[slot][sequence] == 0) continue;
        ++outcome_.records;
        outcome_.lost += found.records.count({slot, sequence}) == 0;
      }
    }
    outcome_.repeated = found.repeated();
    outcome_.copies = static_cast<uint64_t>(found.cutCopies);
    outcome_.inCopies = found.recordsInCutCopies;
    outcome_.torn = static_cast<uint64_t>(found.fragments);
    outcome_.rollovers = static_cast<uint64_t>(std::max(found.files - 1, 0));
    outcome_.oversized = found.largestFile >= plan_.bytes + kLargestRecord;
    outcome_.failures += board_->failures + (outcome_.records < plan_.records);
    outcome_.semaphore = key_.value();
    outcome_.badSemaphores = outcome_.semaphore != 1;
  }

  const Plan &plan_;
  const uint64_t kills_;
  std::mt19937_64 &random_;
  Folder folder_;
  SemaphoreKey key_;
  Board *board_ = Board::make();
  Gate gate_;
  std::optional<PlainFormatter> formatter_;  // until the toolkit is closed
  QlxObject *logger_ = nullptr;
  std::vector<pid_t> writers_;
  Outcome outcome_;
};

}  // namespace

void Outcome::add(const Outcome &round) {
  for (uint64_t Outcome::*sum :
       {&Outcome::records, &Outcome::lost, &Outcome::repeated, &Outcome::inCopies, &Outcome::copies,
        &Outcome::torn, &Outcome::kills, &Outcome::rollovers, &Outcome::oversized,
        &Outcome::failures, &Outcome::badSemaphores}) {
    this->*sum += round.*sum;
  }
  semaphore = round.semaphore;
}

bool Outcome::keepsTheRules() const {
  return records > 0 && lost == 0 && repeated == 0 && copies <= kills && torn <= kills &&
         oversized == 0 && failures == 0 && badSemaphores == 0;
}

Outcome runRound(const Plan &plan, uint64_t kills, std::mt19937_64 &random) {
  return Round(plan, kills, random).run();
}
