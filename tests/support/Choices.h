// The decisions of a random walk, one walk for tests and fuzz targets alike: a test has them from a
// seed, a fuzz target from the bytes it is given. What the walk expects it says by require(); one
// that does not hold ends the walk.
#ifndef QLX_TESTS_CHOICES_H
#define QLX_TESTS_CHOICES_H

#include <cstddef>
#include <cstdint>
#include <random>

struct Mismatch {
  const char *expected, *file;
  int line;
};

#define require(holds) ((holds) ? void() : throw Mismatch{#holds, __FILE__, __LINE__})

class Choices {
 public:
  Choices(uint32_t seed, uint32_t steps) : random_(seed), steps_(steps) {}
  Choices(const uint8_t *bytes, size_t size) : bytes_(bytes), left_(size) {}

  // Whether there is another step.
  bool next() {
    ++step_;
    return bytes_ ? left_ > 0 : step_ <= steps_;
  }

  // One of 0 to n - 1, where n is at most 256.
  uint32_t below(uint32_t n) {
    if (!bytes_) return random_() % n;
    if (left_ == 0) return 0;
    --left_;
    return *bytes_++ % n;
  }

  bool one(uint32_t in) { return below(in) == 0; }
  uint32_t step() const { return step_; }

 private:
  std::mt19937 random_;
  const uint8_t *bytes_ = nullptr;
  size_t left_ = 0;
  uint32_t steps_ = 0, step_ = 0;
};

// Has a container grow to a size, shrink to another one, and so on.
class Sizes {
 public:
  // Whether the next step should add rather than remove.
  bool grows(Choices &choices, size_t size) {
    if (size == wanted_ || choices.one(64)) wanted_ = choices.below(kMost + 1);
    return choices.below(8) < (size < wanted_ ? 7u : 1u);
  }

  static constexpr uint32_t kMost = 64;

 private:
  size_t wanted_ = kMost;
};

#endif
