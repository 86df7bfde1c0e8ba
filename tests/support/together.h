// Threads that begin a piece of a test at the same moment.
#pragma once

#include <atomic>
#include <thread>
#include <vector>

namespace qtb::test {

// Runs body(0) to body(count - 1), each on a thread of its own, once all threads are there.
template <class Body>
void on_threads(int count, Body body) {
  std::atomic<int> missing{count};
  std::vector<std::thread> threads;
  for (int i = 0; i < count; ++i)
    threads.emplace_back([&, i] {
      for (--missing; missing != 0;) std::this_thread::yield();
      body(i);
    });
  for (std::thread &thread : threads) thread.join();
}

}  // namespace qtb::test
