// Runs a scenario again and again, each time with another of its allocations failing: once that one
// alone, once that one and all after it. Whatever happened, all memory is given back at the end.
#ifndef QLX_TESTS_EVERYFAILURE_H
#define QLX_TESTS_EVERYFAILURE_H

#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "support/FailingMemory.h"

// What a scenario expects of its calls.
class Tries {
 public:
  explicit Tries(const FailingMemory &memory) : memory_(memory) {}

  bool nothingFailed() const { return memory_.failures() == 0; }

  // A call that gives 1 or a block, and 0 or null exactly when one of its own allocations failed.
  template <typename Call>
  auto exactly(Call call) {
    const uint64_t before = memory_.failures();
    const auto result = call();
    EXPECT_EQ(result != decltype(result){}, memory_.failures() == before);
    return result;
  }

  // A result of 1, or a block, while nothing failed; afterwards either that or 0 or null.
  template <typename T>
  T mayFail(T result) {
    if (nothingFailed()) {
      EXPECT_NE(result, T{});
    }
    return result;
  }

 private:
  const FailingMemory &memory_;
};

// Calls scenario(Tries &) with each of its allocations failing, and afterUse() after each. Records
// how many allocations it makes when all succeed.
template <typename Scenario, typename AfterUse>
void withEveryFailure(Scenario scenario, AfterUse afterUse) {
  using Plan = void (FailingMemory::*)(uint64_t);
  FailingMemory memory;
  Tries tries(memory);
  scenario(tries);  // what is made once for the process is made here
  afterUse();
  const int64_t base = memory.live();
  memory.failNone();
  scenario(tries);
  ASSERT_EQ(memory.live(), base) << "without any failure";
  const uint64_t points = memory.attempts();

  for (const Plan plan : {&FailingMemory::failOnce, &FailingMemory::failFrom}) {
    const char *const mode = plan == &FailingMemory::failOnce ? "alone" : "and all after it";
    bool failed = true;
    for (uint64_t n = 1; failed; ++n) {
      SCOPED_TRACE("allocation " + std::to_string(n) + " failed, " + mode);
      (memory.*plan)(n);
      scenario(tries);
      failed = memory.failures() > 0;
      memory.failNone();
      afterUse();
      ASSERT_EQ(memory.live(), base);
      ASSERT_FALSE(::testing::Test::HasFailure());
    }
  }
  ::testing::Test::RecordProperty("allocationPoints", std::to_string(points));
  std::fprintf(stderr, "%lu allocation points\n", static_cast<unsigned long>(points));
}

template <typename Scenario>
void withEveryFailure(Scenario scenario) {
  withEveryFailure(scenario, [] {});
}

#endif
