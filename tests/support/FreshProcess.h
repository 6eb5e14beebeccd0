// A process of its own for what can be seen only once in one: the first call, or the last.
#ifndef QLX_TESTS_FRESHPROCESS_H
#define QLX_TESTS_FRESHPROCESS_H

#include <gtest/gtest.h>

#include <cstdlib>

// Runs `use` in a fresh process in which nothing has made the API lock yet, and ends that process
// as a host's main() ends it. Where memory fails in there, the lock cannot be made.
template <typename Use>
void inFreshProcess(Use use) {
  ::testing::GTEST_FLAG(death_test_style) = "threadsafe";
  const auto useAndExit = [use] {
    use();
    std::exit(::testing::Test::HasFailure() ? 1 : 0);
  };
  EXPECT_EXIT(useAndExit(), ::testing::ExitedWithCode(0), "");
}

#endif
