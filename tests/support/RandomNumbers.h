// Numbers of many kinds: of every size, with few decimal digits and with many, on a tie of rounding
// to thousandths, and just beside one.
#ifndef QLX_TESTS_RANDOMNUMBERS_H
#define QLX_TESTS_RANDOMNUMBERS_H

#include <bit>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <random>

class RandomNumbers {
 public:
  explicit RandomNumbers(uint64_t seed) : random_(seed) {}

  int32_t integer() {
    const auto value = static_cast<int32_t>(random_());
    return value >> (random_() % 32);
  }

  double number() {
    switch (random_() % 7) {
      case 0:
        return uniform() * std::pow(10, static_cast<int>(random_() % 26) - 8);
      case 1:
        return whole() / 1000;
      case 2:
        return whole() / 2000;
      case 3:
        return near(whole() / 2000);
      case 4:
        return whole();
      case 5:
        return whole() / std::pow(10, static_cast<int>(random_() % 10));
      default:
        return std::bit_cast<double>(random_());
    }
  }

 private:
  double uniform() { return std::uniform_real_distribution<double>(-1, 1)(random_); }

  double whole() {
    const auto value = static_cast<int64_t>(random_());
    return static_cast<double>(value >> (10 + random_() % 54));
  }

  // One of the doubles beside a value.
  double near(double value) {
    const double end = random_() % 2 ? DBL_MAX : -DBL_MAX;
    for (uint64_t steps = random_() % 8; steps > 0; --steps) value = std::nextafter(value, end);
    return value;
  }

  std::mt19937_64 random_;
};

#endif
