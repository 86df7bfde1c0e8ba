// What the memory allows, and what a parallel region costs, on a team of the OpenMP runtime.

#include <emmintrin.h>

#include <algorithm>
#include <cstring>

#include "bench/memory.h"
#include "bench/traffic.h"

namespace qtb::bench {
namespace {

constexpr std::size_t line = 64;  // bytes, of four vectors

void read_line(char *at) {
  asm volatile("movaps (%0), %%xmm0\n\tmovaps 16(%0), %%xmm1\n\tmovaps 32(%0), %%xmm2\n\tmovaps 48(%0), %%xmm3"
               :
               : "r"(at)
               : "xmm0", "xmm1", "xmm2", "xmm3");
}
void write_line(char *at) {
  const __m128i value = _mm_setzero_si128();
  for (int i = 0; i < 4; ++i) _mm_store_si128(reinterpret_cast<__m128i *>(at) + i, value);
}
void update_line(char *at) {
  const __m128i one = _mm_set1_epi8(1);
  __m128i *vector = reinterpret_cast<__m128i *>(at);
  for (int i = 0; i < 4; ++i) _mm_store_si128(vector + i, _mm_add_epi8(_mm_load_si128(vector + i), one));
}

// One line after the other is what a cache that holds them gives at best. A processor asks the memory for more at a
// time where several streams are read at once and asked for ahead: four streams, sixteen lines ahead, gave a third more
// than one on the processor where this was tried, and more of either gave nothing.
template <void (*move_line)(char *)>
void move_lines(char *first, std::size_t lines) {
  constexpr std::size_t far = (std::size_t{1} << 20) / line, streams = 4, ahead = 16 * line;
  std::size_t rest = 0;
  if (lines >= far) {
    const std::size_t part = lines / streams;
    for (std::size_t i = 0; i < part; ++i)
      for (std::size_t stream = 0; stream < streams; ++stream) {
        char *at = first + (stream * part + i) * line;
        __builtin_prefetch(at + ahead);
        move_line(at);
      }
    rest = part * streams;
  }
  for (; rest < lines; ++rest) move_line(first + rest * line);
}

}  // namespace

class Sweep {
 public:
  Sweep(const Traffic &traffic, int threads)
      : threads_(threads), read_(traffic.read), written_(traffic.written), updated_(traffic.updated) {}

  void run() {
    if (threads_ == 1) {
      run_share(0);
      return;
    }
#pragma omp parallel for num_threads(threads_) schedule(static, 1)
    for (int i = 0; i < threads_; ++i) run_share(i);
  }

 private:
  struct Array {
    explicit Array(double bytes)
        : lines((static_cast<std::size_t>(bytes) + line - 1) / line), memory(allocate(lines * line)) {
      std::memset(memory.get(), 0, lines * line);
    }
    char *share(int i, int of, std::size_t &count) const {
      const std::size_t first = lines * static_cast<std::size_t>(i) / static_cast<std::size_t>(of);
      count = lines * static_cast<std::size_t>(i + 1) / static_cast<std::size_t>(of) - first;
      return static_cast<char *>(memory.get()) + first * line;
    }
    std::size_t lines;
    Memory memory;
  };

  void run_share(int i) const {
    std::size_t count = 0;
    char *at = read_.share(i, threads_, count);
    move_lines<read_line>(at, count);
    at = written_.share(i, threads_, count);
    move_lines<write_line>(at, count);
    at = updated_.share(i, threads_, count);
    move_lines<update_line>(at, count);
  }

  int threads_;
  Array read_, written_, updated_;
};

extern "C" {

[[gnu::visibility("default")]] Sweep *qtb_bench_make_sweep(const Traffic *traffic, int threads) {
  return new Sweep(*traffic, threads);
}
[[gnu::visibility("default")]] void qtb_bench_sweep(Sweep *sweep, long count) {
  for (long i = 0; i < count; ++i) sweep->run();
}
[[gnu::visibility("default")]] void qtb_bench_empty_regions(int threads, long count) {
  for (long i = 0; i < count; ++i) {
#pragma omp parallel num_threads(threads)
    asm volatile("" : : : "memory");  // so that the region stays
  }
}

}  // extern "C"
}  // namespace qtb::bench
