// The measured limits of a core: loops of one kind of instruction, with enough independent chains to hide latency.

#include "bench/limits.h"

#include <emmintrin.h>

#include <algorithm>
#include <thread>
#include <vector>

#include "bench/timing.h"

namespace qtb::bench {
namespace {

constexpr double measure_seconds = 0.02;
constexpr int measure_times = 7;  // the best of so many: a limit is what the core does undisturbed

// Keeps a value in a register and hides from the compiler what is done with it.
template <class V>
inline void pin(V &v) {
  asm volatile("" : "+x"(v));
}

template <class Run>
double best_rate(Run &&run, double work_per_call) {
  const long count = calibrate(run, measure_seconds);
  double best = 1e300;
  for (int i = 0; i < measure_times; ++i) best = std::min(best, seconds_per_call(run, count));
  return work_per_call / best;
}

constexpr int chains = 7;  // of each kind: fourteen registers, two left for the operands

void double_loop(long count) {
  __m128d product[chains], sum[chains];
#pragma GCC unroll 8
  for (int i = 0; i < chains; ++i) product[i] = sum[i] = _mm_set1_pd(1.0);
  __m128d factor = _mm_set1_pd(1.0), term = _mm_set1_pd(1e-30);
  for (long n = 0; n < count; ++n) {
    pin(factor);
    pin(term);
#pragma GCC unroll 8
    for (int i = 0; i < chains; ++i) {
      product[i] = _mm_mul_pd(product[i], factor);
      sum[i] = _mm_add_pd(sum[i], term);
      pin(product[i]);
      pin(sum[i]);
    }
  }
}

void single_loop(long count) {
  __m128 product[chains], sum[chains];
#pragma GCC unroll 8
  for (int i = 0; i < chains; ++i) product[i] = sum[i] = _mm_set1_ps(1.0F);
  __m128 factor = _mm_set1_ps(1.0F), term = _mm_set1_ps(1e-30F);
  for (long n = 0; n < count; ++n) {
    pin(factor);
    pin(term);
#pragma GCC unroll 8
    for (int i = 0; i < chains; ++i) {
      product[i] = _mm_mul_ps(product[i], factor);
      sum[i] = _mm_add_ps(sum[i], term);
      pin(product[i]);
      pin(sum[i]);
    }
  }
}

constexpr int block_vectors = 512;  // 8 KiB, well inside any first-level cache
constexpr int unroll = 16;

alignas(64) __m128d block[block_vectors];

void load_loop(long count) {
  for (long n = 0; n < count; ++n) {
    for (int i = 0; i < block_vectors; i += unroll) {
#pragma GCC unroll 16
      for (int j = 0; j < unroll; ++j) {
        __m128d v;
        asm volatile("movaps %1, %0" : "=x"(v) : "m"(block[i + j]));
      }
    }
  }
}

void store_loop(long count) {
  const __m128d v = _mm_setzero_pd();
  for (long n = 0; n < count; ++n) {
    for (int i = 0; i < block_vectors; i += unroll) {
#pragma GCC unroll 16
      for (int j = 0; j < unroll; ++j) asm volatile("movaps %1, %0" : "=m"(block[i + j]) : "x"(v));
    }
  }
}

void copy_vectors(const __m128i *from, __m128i *to, std::size_t count) {
  for (std::size_t i = 0; i < count; i += 4) {
    const __m128i a = _mm_load_si128(from + i), b = _mm_load_si128(from + i + 1);
    const __m128i c = _mm_load_si128(from + i + 2), d = _mm_load_si128(from + i + 3);
    _mm_store_si128(to + i, a);
    _mm_store_si128(to + i + 1, b);
    _mm_store_si128(to + i + 2, c);
    _mm_store_si128(to + i + 3, d);
  }
}

}  // namespace

CoreLimits measure_core_limits() {
  CoreLimits limits{};
  limits.double_flops = best_rate(double_loop, chains * 2.0 * 2.0);
  limits.single_flops = best_rate(single_loop, chains * 2.0 * 4.0);
  limits.load_rate = best_rate(load_loop, block_vectors);
  limits.store_rate = best_rate(store_loop, block_vectors);
  return limits;
}

double measure_copy_bandwidth(std::size_t bytes, int threads) {
  struct alignas(64) Line {
    __m128i part[4];
  };
  const std::size_t share = bytes / sizeof(Line) / static_cast<std::size_t>(threads);  // in lines
  std::vector<Line> from(share * static_cast<std::size_t>(threads)), to(from.size());
  const auto copy_share = [&](int t) {
    const std::size_t first = share * static_cast<std::size_t>(t);
    copy_vectors(from[first].part, to[first].part, share * 4);
  };
  double best = 1e300;
  for (int time = 0; time < measure_times; ++time) {
    const double start = now();
    std::vector<std::thread> others;
    for (int t = 1; t < threads; ++t) others.emplace_back(copy_share, t);
    copy_share(0);
    for (std::thread &other : others) other.join();
    best = std::min(best, now() - start);
  }
  return 2.0 * static_cast<double>(from.size() * sizeof(Line)) / best;
}

double least_seconds(const CoreLimits &limits, double loads, double stores, double flops, bool single) {
  return std::max({loads / limits.load_rate, stores / limits.store_rate,
                   flops / (single ? limits.single_flops : limits.double_flops)});
}

}  // namespace qtb::bench
