// What a clean run under the thread sanitizer is worth.
//
//   race_detector sown      two threads add to one counter with nothing between them: the detector must report it
//   race_detector ordered   what this library relies on (the end of a region, barrier, single, relaxed atomics) orders
//                           all accesses: the detector must be silent
#include <omp.h>

#include <atomic>
#include <cstdio>
#include <cstring>

namespace {

constexpr int threads = 2, rounds = 1000;

int sown() {
  int counter = 0;
#pragma omp parallel num_threads(threads) shared(counter)
  for (int i = 0; i < rounds; i++) counter++;
  return counter;
}

int ordered() {
  int partial[threads] = {}, shared = 0, total = 0;
  std::atomic<int> cell{0};
#pragma omp parallel num_threads(threads) shared(partial, shared, cell)
  {
    cell.store(1, std::memory_order_relaxed);
    for (int i = 0; i < rounds; i++) {
      const int here = omp_get_thread_num();
      partial[here]++;
#pragma omp barrier
      partial[threads - 1 - here]++;
#pragma omp single
      shared++;
#pragma omp barrier
    }
  }
  for (const int value : partial) total += value;
  return total + shared + cell.load(std::memory_order_relaxed);
}

}  // namespace

int main(int count, char **arguments) {
  const int sum = count == 2 && std::strcmp(arguments[1], "sown") == 0 ? sown() : ordered();
  std::printf("sum %d on at most %d threads\n", sum, threads);
  return 0;
}
