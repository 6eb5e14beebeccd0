// Calls that begin at the same time, each in a thread of its own.
#ifndef QLX_TESTS_TOGETHER_H
#define QLX_TESTS_TOGETHER_H

#include <latch>
#include <thread>
#include <vector>

// Returns when all have ended.
template <typename... Calls>
void together(Calls... calls) {
  std::latch start(sizeof...(Calls));
  std::vector<std::thread> threads;
  (threads.emplace_back([&start, calls] {
    start.arrive_and_wait();
    calls();
  }),
   ...);
  for (std::thread &thread : threads) thread.join();
}

#endif
