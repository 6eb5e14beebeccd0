// Many processes on one file, for as long as one likes: writers that each mark what they were told
// is written, and that are killed at random moments if that is asked for. Afterwards every marked
// record is looked for in all generations. Exit status 0 only when all the rules held:
//
// no marked record is missing; none stands there twice, but for what a kill inside a rollover has
// copied; there is at most one fragment and one such copy for each kill; no file is larger than its
// limit and one record; the semaphore ends at 1.
#include <algorithm>
#include <charconv>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <iterator>

#include "Round.h"

static constexpr struct {
  const char *name;
  uint64_t Plan::*value;
} kFlags[] = {
    {"--processes", &Plan::processes},
    {"--records", &Plan::records},
    {"--kills", &Plan::kills},
    {"--bytes", &Plan::bytes},
    {"--generations", &Plan::generations},
    {"--seed", &Plan::seed},
    {"--seconds", &Plan::seconds},
};

static constexpr uint64_t kLimits[] = {512, 4096, 16384, 65536, 262144};  // with --bytes 0

static volatile std::sig_atomic_t interrupted;

static bool readFlag(Plan *plan, const char *name, const char *text) {
  const auto flag = std::find_if(std::begin(kFlags), std::end(kFlags),
                                 [name](const auto &row) { return !std::strcmp(row.name, name); });
  const char *const end = text ? text + std::strlen(text) : nullptr;
  return flag != std::end(kFlags) && text &&
         std::from_chars(text, end, plan->*flag->value).ptr == end;
}

static bool readFlags(Plan *plan, char **argument) {
  for (; *argument; argument += 2) {
    if (!readFlag(plan, argument[0], argument[1])) return false;
  }
  return plan->processes >= 1 && plan->processes <= 64 && plan->generations >= 20;
}

static void print(const char *what, const Outcome &sum, double seconds) {
  std::printf(
      "%s: kills %ju, records %ju, lost %ju, repeated %ju, torn %ju; in %ju copies of cut "
      "rollovers %ju records; rollovers %ju, files too large %ju, failures %ju, "
      "semaphore %d (%ju bad); %.0f s\n",
      what, sum.kills, sum.records, sum.lost, sum.repeated, sum.torn, sum.copies, sum.inCopies,
      sum.rollovers, sum.oversized, sum.failures, sum.semaphore, sum.badSemaphores, seconds);
  std::fflush(stdout);
}

int main(int, char **argv) {
  Plan plan;
  if (!readFlags(&plan, argv + 1)) {
    std::fprintf(stderr, "usage: qlx_soak");
    for (const auto &row : kFlags) std::fprintf(stderr, " [%s N]", row.name);
    std::fprintf(stderr, "\n");
    return 2;
  }
  std::signal(SIGINT, [](int) { interrupted = 1; });
  using Clock = std::chrono::steady_clock;
  const auto start = Clock::now();
  const auto elapsed = [start] {
    return std::chrono::duration<double>(Clock::now() - start).count();
  };

  std::printf("seed %ju\n", plan.seed);
  std::mt19937_64 random(plan.seed);
  Outcome sum;
  uint64_t shown = 0;
  do {
    Plan round = plan;
    if (plan.bytes == 0) round.bytes = kLimits[random() % std::size(kLimits)];
    sum.add(runRound(round, std::min(plan.kills - sum.kills, plan.generations / 2), random));
    if (sum.kills >= shown + 1000 && sum.kills < plan.kills) {
      shown = sum.kills;
      print("so far", sum, elapsed());
    }
  } while (sum.kills < plan.kills && sum.keepsTheRules() && !interrupted &&
           (plan.seconds == 0 || elapsed() < static_cast<double>(plan.seconds)));
  print(sum.keepsTheRules() ? "kept" : "BROKEN", sum, elapsed());
  return sum.keepsTheRules() ? 0 : 1;
}
