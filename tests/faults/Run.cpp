#include "Run.h"

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <set>

#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include "Board.h"
#include "Writer.h"
#include "support/SemaphoreKey.h"

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

static constexpr std::chrono::seconds kHang{20};
static constexpr const char *kMarkCall = "getppid";
static constexpr const char *kSleepCalls = "?nanosleep,clock_nanosleep";
static constexpr int32_t kCutBytes = 30;  // of a record, when the variant cuts
static constexpr useconds_t kLook = 300;  // microseconds between two looks

namespace {

std::string makeRoot() {
  const char *const parent = std::getenv("TMPDIR");
  std::string path = std::string(parent && *parent ? parent : "/tmp") + "/qlx-faults-XXXXXX";
  if (!mkdtemp(path.data())) std::abort();
  return path;
}

std::multiset<std::string> descriptorsOf(pid_t process) {
  std::multiset<std::string> targets;
  std::error_code gone;
  for (const auto &entry :
       fs::directory_iterator("/proc/" + std::to_string(process) + "/fd", gone)) {
    targets.insert(fs::read_symlink(entry.path(), gone).string());
  }
  return targets;
}

class Run {
 public:
  Run(const Variant &variant, const Fault &fault, bool keeps)
      : variant_(variant), fault_(fault), keeps_(keeps) {
    const bool traced = !fault.isCut() && (keeps || !fault.isNone());
    plan_ = {&variant, folder_, root_ + "/warm", key_.text(), traced, {}, kCutBytes};
    if (fault.isCut()) plan_.cutBytes = std::atoi(fault.error.c_str());
    const char *const cut = fault.isCut() ? fault.when.c_str() : variant.cutWhen;
    if (cut && !When::read(cut, &plan_.cut)) std::abort();
  }
  ~Run() {
    munmap(board_, sizeof *board_);
    std::error_code ignored;
    if (!keeps_) fs::remove_all(root_, ignored);
  }

  Verdict run() {
    prepareFolder(variant_, root_, folder_);
    for (uint32_t slot = 0; slot < variant_.writers; ++slot) spawn(slot);
    const bool finished = logUnderFaults() && logAfter();
    if (!finished) ++verdict_.hangs;
    if (finished) countLeaks();
    for (const pid_t writer : writers_) end(writer);
    judgeFolder(variant_, root_, folder_, *board_, &verdict_);
    judgeProcesses();
    if (keeps_) writeAnswers();
    return verdict_;
  }
  const std::string &root() const { return root_; }

 private:
  void spawn(uint32_t slot) {
    const pid_t writer = fork();
    if (writer == -1) std::abort();
    if (writer == 0) runWriter(plan_, slot, board_);
    writers_.push_back(writer);
  }

  // False when it took too long, or a writer died.
  bool awaitAll(Step step) {
    const auto deadline = Clock::now() + kHang;
    for (;;) {
      bool all = true;
      for (uint32_t slot = 0; slot < variant_.writers; ++slot) {
        all = all && board_->writers[slot].step.load() >= step;
      }
      if (all) return true;
      if (anyDied() || Clock::now() > deadline) return false;
      usleep(kLook);
    }
  }

  bool anyDied() const {
    for (const pid_t writer : writers_) {
      siginfo_t info = {};
      waitid(P_PID, static_cast<id_t>(writer), &info, WEXITED | WNOHANG | WNOWAIT);
      if (info.si_pid != 0) return true;
    }
    return false;
  }

  // ---- With and without faults

  bool logUnderFaults() {
    if (!awaitAll(Step::kWarm)) return false;
    for (const pid_t writer : writers_) before_.push_back(descriptorsOf(writer));
    if (plan_.traced) startTracer();
    board_->until = Step::kTraced;
    const bool begun = awaitAll(Step::kTraced);
    verdict_.note(!begun, "strace does not come to its processes");
    const bool logged = begun && awaitAll(Step::kLogged);
    if (plan_.traced) endTracer();
    verdict_.injected = plan_.traced ? countInjected() : board_->cuts.load();
    return logged;
  }

  bool logAfter() {
    board_->until = Step::kFinished;
    return awaitAll(Step::kFinished);
  }

  // Sleeps take no time: the retries of a lock would take longer than all the rest.
  std::vector<std::string> tracerArguments() const {
    std::vector<std::string> all = {"strace", "-f", "-qqq", "-e", "signal=none", "-o", callLog()};
    const std::string call = fault_.isNone() ? "all" : fault_.call;
    const auto add = [&all](const std::string &expression) {
      all.push_back("-e");
      all.push_back(expression);
    };
    add("trace=" + (keeps_ ? "all" : call + "," + kMarkCall + "," + kSleepCalls));
    add(std::string("inject=") + kMarkCall + ":retval=" + std::to_string(kTracedMark));
    add(std::string("inject=") + kSleepCalls + ":retval=0");
    if (!fault_.isNone()) {
      add("inject=" + call + ":error=" + fault_.error + ":when=" + fault_.when);
    }
    for (const pid_t writer : writers_) {
      all.push_back("-p");
      all.push_back(std::to_string(writer));
    }
    return all;
  }

  void startTracer() {
    std::vector<std::string> words = tracerArguments();
    std::vector<char *> arguments;
    for (std::string &word : words) arguments.push_back(word.data());
    arguments.push_back(nullptr);
    tracer_ = fork();
    if (tracer_ == -1) std::abort();
    if (tracer_ != 0) return;
    execvp(arguments[0], arguments.data());
    std::perror("strace");
    _exit(127);
  }

  void endTracer() {
    kill(tracer_, SIGINT);  // it lets go of its processes
    waitpid(tracer_, nullptr, 0);
  }

  std::string callLog() const { return root_ + "/calls"; }

  // The mark is none of them.
  uint64_t countInjected() const {
    std::ifstream log(callLog());
    uint64_t count = 0;
    for (std::string line; std::getline(log, line);) {
      count += line.find("(INJECTED)") != line.npos && line.find(kMarkCall) == line.npos &&
               line.find("nanosleep") == line.npos;
    }
    return count;
  }

  // ---- Afterwards

  // A close that is made to fail is not made at all.
  void countLeaks() {
    if (fault_.call == "close") return;
    for (size_t i = 0; i < writers_.size(); ++i) {
      const std::multiset<std::string> after = descriptorsOf(writers_[i]);
      if (after != before_[i]) {
        verdict_.leaked += after.size() > before_[i].size() ? after.size() - before_[i].size() : 1;
      }
    }
  }

  void end(pid_t writer) {
    siginfo_t info = {};
    waitid(P_PID, static_cast<id_t>(writer), &info, WEXITED | WNOHANG | WNOWAIT);
    if (info.si_pid != 0) ++verdict_.crashes;
    kill(writer, SIGKILL);
    waitpid(writer, nullptr, 0);
  }

  void judgeProcesses() {
    if (verdict_.crashes != 0) verdict_.hangs = 0;  // the others were not waited for
    verdict_.note(verdict_.leaked, "descriptors leaked");
    verdict_.note(verdict_.crashes, "crashes");
    if (verdict_.hangs != 0) verdict_.note(1, "hang in " + stepOfTheSlowest());
    const int semaphore = key_.value();
    if (semaphore > 1) verdict_.note(1, "semaphore above 1");
  }

  std::string stepOfTheSlowest() const {
    uint32_t least = kMaxRecords;
    for (uint32_t slot = 0; slot < variant_.writers; ++slot) {
      least = std::min(least, board_->writers[slot].count.load());
    }
    return "record " + std::to_string(least);
  }

  void writeAnswers() const {
    std::ofstream file(root_ + "/answers");
    for (uint32_t slot = 0; slot < variant_.writers; ++slot) {
      for (uint32_t number = 0; number < board_->writers[slot].count; ++number) {
        const Answer &answer = board_->writers[slot].answers[number];
        const char kind = answer.kind;
        file << slot << ' ' << number << ' ' << (kind ? kind : '?') << ' ' << answer.code << '\n';
      }
    }
  }

  const Variant &variant_;
  const Fault &fault_;
  const bool keeps_;
  const std::string root_ = makeRoot();
  const std::string folder_ = root_ + (variant_.freshFolder ? "/new/logs" : "/logs");
  SemaphoreKey key_;
  Board *const board_ = Board::make();
  WriterPlan plan_;
  std::vector<pid_t> writers_;
  std::vector<std::multiset<std::string>> before_;
  pid_t tracer_ = -1;
  Verdict verdict_;
};

}  // namespace

Verdict runOnce(const Variant &variant, const Fault &fault, std::string *keptFolder) {
  Run run(variant, fault, keptFolder != nullptr);
  if (keptFolder) *keptFolder = run.root();
  return run.run();
}
