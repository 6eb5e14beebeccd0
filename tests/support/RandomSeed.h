// The seed of a test with random steps: always the same, or that of the environment variable
// QLX_SEED. Write it behind the assertions, so that a failure says how to see it again.
#ifndef QLX_TESTS_RANDOMSEED_H
#define QLX_TESTS_RANDOMSEED_H

#include <cstdint>
#include <cstdlib>
#include <ostream>

class RandomSeed {
 public:
  RandomSeed() {
    const char *given = getenv("QLX_SEED");
    value_ = given ? static_cast<uint32_t>(strtoul(given, nullptr, 10)) : 1;
  }
  operator uint32_t() const { return value_; }
  friend std::ostream &operator<<(std::ostream &out, const RandomSeed &seed) {
    return out << "again: QLX_SEED=" << seed.value_;
  }

 private:
  uint32_t value_;
};

#endif
