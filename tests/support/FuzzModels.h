// Random walks over models as a fuzz target: the first byte of the input says over which one, the
// others are the walk.
#ifndef QLX_TESTS_FUZZMODELS_H
#define QLX_TESTS_FUZZMODELS_H

#include <cstdio>
#include <cstdlib>
#include <iterator>

#include "support/Choices.h"

template <typename Model>
void walk(Choices &choices) {
  Model model(choices);
}

template <typename... Models>
int fuzzModels(const uint8_t *data, size_t size) {
  static constexpr void (*kWalks[])(Choices &) = {walk<Models>...};
  if (size == 0) return 0;
  Choices choices(data + 1, size - 1);
  try {
    kWalks[data[0] % std::size(kWalks)](choices);
  } catch (const Mismatch &mismatch) {
    fprintf(stderr, "%s:%d: %s\nin step %u\n", mismatch.file, mismatch.line, mismatch.expected,
            choices.step());
    abort();
  }
  return 0;
}

#endif
