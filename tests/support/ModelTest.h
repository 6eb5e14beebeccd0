// A random walk over a model as a test.
#ifndef QLX_TESTS_MODELTEST_H
#define QLX_TESTS_MODELTEST_H

#include <gtest/gtest.h>

#include "support/Choices.h"
#include "support/RandomSeed.h"

template <typename Model>
void walk(uint32_t steps) {
  const RandomSeed seed;
  Choices choices(seed, steps);
  try {
    Model model(choices);
  } catch (const Mismatch &mismatch) {
    FAIL() << mismatch.file << ":" << mismatch.line << ": " << mismatch.expected << "\nin step "
           << choices.step() << ", " << seed;
  }
}

#endif
