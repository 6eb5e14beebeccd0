// What a generator of texts chooses from.
#ifndef QLX_TESTS_RANDOMWORDS_H
#define QLX_TESTS_RANDOMWORDS_H

#include <initializer_list>
#include <random>
#include <string>

template <typename Char>
class RandomWords {
 protected:
  explicit RandomWords(uint32_t seed) : random_(seed) {}

  size_t below(size_t limit) { return random_() % limit; }
  std::basic_string<Char> oneOf(std::initializer_list<const Char *> words) {
    return words.begin()[below(words.size())];
  }

 private:
  std::mt19937 random_;
};

#endif
