// Threads of this process: some that begin a piece of a test at the same moment, and how many there are.
#pragma once

#include <atomic>
#include <cstdio>
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

inline int threads_of_this_process() {
  int threads = 0;
  char line[256];
  std::FILE *const status = std::fopen("/proc/self/status", "r");
  while (status != nullptr && std::fgets(line, sizeof line, status) != nullptr)
    std::sscanf(line, "Threads: %d", &threads);
  if (status != nullptr) std::fclose(status);
  return threads;
}

}  // namespace qtb::test
