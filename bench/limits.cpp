// The measured limits of a core: loops of one kind of instruction, with enough independent chains to hide latency.

#include "bench/limits.h"

#include <emmintrin.h>

#include <algorithm>
#include <cmath>
#include <thread>
#include <vector>

#include "bench/timing.h"

namespace qtb::bench {
namespace {

// A limit is what the core does undisturbed: the best of many looks, each shorter than a time slice, so that some fall
// between the slices of other programs.
constexpr double measure_seconds = 0.001;
constexpr int measure_times = 100;
constexpr int copy_times = 7;  // a copy beyond the caches takes longer than any slice

template <class Run>
double best_rate(Run &&run, double work_per_call) {
  const long count = calibrate(run, measure_seconds);
  double best = 1e300;
  for (int i = 0; i < measure_times; ++i) best = std::min(best, seconds_per_call(run, count));
  return work_per_call / best;
}

// Sixteen registers, each its own chain: products and sums in turn, so that both kinds of units are full. All registers
// are zero and stay so, since what they hold is of no matter as long as it is neither subnormal nor NaN.
// clang-format off
#define QTB_PAIR(type, a, b) "mul" type " %%xmm" #a ", %%xmm" #a "\n\tadd" type " %%xmm" #b ", %%xmm" #b "\n\t"
#define QTB_WIDE_PAIR(type, a, b) \
  "vmul" type " %%ymm" #a ", %%ymm" #a ", %%ymm" #a "\n\tvadd" type " %%ymm" #b ", %%ymm" #b ", %%ymm" #b "\n\t"
#define QTB_ARITHMETIC(pair, type) \
  pair(type, 0, 8) pair(type, 1, 9) pair(type, 2, 10) pair(type, 3, 11) \
  pair(type, 4, 12) pair(type, 5, 13) pair(type, 6, 14) pair(type, 7, 15)
#define QTB_CLOBBERED                                                                                                 \
  "xmm0", "xmm1", "xmm2", "xmm3", "xmm4", "xmm5", "xmm6", "xmm7", "xmm8", "xmm9", "xmm10", "xmm11", "xmm12", "xmm13", \
      "xmm14", "xmm15"

constexpr double instructions = 16;  // per pass of each loop

#define QTB_CLEAR(r) "xorps %%xmm" #r ", %%xmm" #r "\n\t"
#define QTB_CLEAR_ALL \
  QTB_CLEAR(0) QTB_CLEAR(1) QTB_CLEAR(2) QTB_CLEAR(3) QTB_CLEAR(4) QTB_CLEAR(5) QTB_CLEAR(6) QTB_CLEAR(7) \
  QTB_CLEAR(8) QTB_CLEAR(9) QTB_CLEAR(10) QTB_CLEAR(11) QTB_CLEAR(12) QTB_CLEAR(13) QTB_CLEAR(14) QTB_CLEAR(15)
// clang-format on

#define QTB_LOOP(body) ".p2align 6\n1:\n\t" body "dec %0\n\tjnz 1b"

void double_loop(long count) {
  asm volatile(QTB_CLEAR_ALL QTB_LOOP(QTB_ARITHMETIC(QTB_PAIR, "pd")) : "+r"(count) : : QTB_CLOBBERED);
}
void single_loop(long count) {
  asm volatile(QTB_CLEAR_ALL QTB_LOOP(QTB_ARITHMETIC(QTB_PAIR, "ps")) : "+r"(count) : : QTB_CLOBBERED);
}
// Upper halves that stay in use would slow the 16-byte instructions behind them.
[[gnu::target("avx")]] void wide_double_loop(long count) {
  asm volatile("vzeroall\n\t" QTB_LOOP(QTB_ARITHMETIC(QTB_WIDE_PAIR, "pd")) "\n\tvzeroupper"
               : "+r"(count)
               :
               : QTB_CLOBBERED);
}
[[gnu::target("avx")]] void wide_single_loop(long count) {
  asm volatile("vzeroall\n\t" QTB_LOOP(QTB_ARITHMETIC(QTB_WIDE_PAIR, "ps")) "\n\tvzeroupper"
               : "+r"(count)
               :
               : QTB_CLOBBERED);
}

alignas(64) char block[256];

#define QTB_LOAD(at, r) "movaps " #at "(%1), %%xmm" #r "\n\t"
#define QTB_STORE(at, r) "movaps %%xmm" #r ", " #at "(%1)\n\t"
#define QTB_BLOCK(move)                                                                                        \
  move(0, 0) move(16, 1) move(32, 2) move(48, 3) move(64, 4) move(80, 5) move(96, 6) move(112, 7) move(128, 8) \
      move(144, 9) move(160, 10) move(176, 11) move(192, 12) move(208, 13) move(224, 14) move(240, 15)

void load_loop(long count) { asm volatile(QTB_LOOP(QTB_BLOCK(QTB_LOAD)) : "+r"(count) : "r"(block) : QTB_CLOBBERED); }
void store_loop(long count) { asm volatile(QTB_LOOP(QTB_BLOCK(QTB_STORE)) : "+r"(count) : "r"(block) : "memory"); }

struct LimitLoop {
  Limit limit;
  void (*run)(long count);
  double amount;      // of a pass
  bool wide = false;  // vectors of 32 bytes
};
constexpr LimitLoop limit_loops[] = {
    {&CoreLimits::double_flops, double_loop, instructions * 2},
    {&CoreLimits::single_flops, single_loop, instructions * 4},
    {&CoreLimits::wide_double_flops, wide_double_loop, instructions * 4, true},
    {&CoreLimits::wide_single_flops, wide_single_loop, instructions * 8, true},
    {&CoreLimits::load_rate, load_loop, instructions},
    {&CoreLimits::store_rate, store_loop, instructions},
};

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

// The arithmetic of the loops above with a few other instructions among it, each ahead of a product whose register it
// writes, so that nothing waits for a chain longer than those above. The block holds zeros.
// clang-format off
#define QTB_DOUBLE(a, b) QTB_PAIR("pd", a, b)
#define QTB_WIDE_DOUBLE(a, b) QTB_WIDE_PAIR("pd", a, b)
#define QTB_MIX(pair, other_0, other_4) \
  other_0 pair(0, 8) pair(1, 9) pair(2, 10) pair(3, 11) other_4 pair(4, 12) pair(5, 13) pair(6, 14) pair(7, 15)
#define QTB_SHUFFLE(r) "pshufd $0x4e, (%1), %%xmm" #r "\n\t"
#define QTB_INSERT(r, from) "vinsertf128 $1, 16(%1), %%ymm" #from ", %%ymm" #r "\n\t"
#define QTB_PAIR_FROM_MEMORY(at, sum, x) \
  "movaps %%xmm15, %%xmm" #x "\n\tmulpd " #at "(%1), %%xmm" #x "\n\taddpd %%xmm" #x ", %%xmm" #sum "\n\t"
#define QTB_THIRTEEN_LOADS \
  QTB_LOAD(0, 15) \
  QTB_PAIR_FROM_MEMORY(16, 0, 12) QTB_PAIR_FROM_MEMORY(32, 1, 13) QTB_PAIR_FROM_MEMORY(48, 2, 14) \
  QTB_PAIR_FROM_MEMORY(64, 3, 12) QTB_PAIR_FROM_MEMORY(80, 4, 13) QTB_PAIR_FROM_MEMORY(96, 5, 14) \
  QTB_PAIR_FROM_MEMORY(112, 6, 12) QTB_PAIR_FROM_MEMORY(128, 7, 13) QTB_PAIR_FROM_MEMORY(144, 8, 14) \
  QTB_PAIR_FROM_MEMORY(160, 9, 12) QTB_PAIR_FROM_MEMORY(176, 10, 13) QTB_PAIR_FROM_MEMORY(192, 11, 14)
// clang-format on
// Several steps to a turn of the loop, as the kernels have them.
constexpr double mix_steps = 4;
#define QTB_STEPS(step) QTB_LOOP(step step step step)
#define QTB_ON_BLOCK(count) : "+r"(count) : "r"(block) : QTB_CLOBBERED

void one_shuffle_loop(long count) {
  asm volatile(QTB_CLEAR_ALL QTB_STEPS(QTB_MIX(QTB_DOUBLE, QTB_SHUFFLE(0), "")) QTB_ON_BLOCK(count));
}
void two_shuffles_loop(long count) {
  asm volatile(QTB_CLEAR_ALL QTB_STEPS(QTB_MIX(QTB_DOUBLE, QTB_SHUFFLE(0), QTB_SHUFFLE(4))) QTB_ON_BLOCK(count));
}
[[gnu::target("avx")]] void two_wide_inserts_loop(long count) {
  asm volatile("vzeroall\n\t" QTB_STEPS(
      QTB_MIX(QTB_WIDE_DOUBLE, QTB_INSERT(0, 8), QTB_INSERT(4, 12))) "\n\tvzeroupper" QTB_ON_BLOCK(count));
}
void thirteen_loads_loop(long count) { asm volatile(QTB_CLEAR_ALL QTB_STEPS(QTB_THIRTEEN_LOADS) QTB_ON_BLOCK(count)); }

}  // namespace

CoreLimits measure_core_limits() {
  const bool has_wide = __builtin_cpu_supports("avx") != 0;
  CoreLimits limits{};
  for (const LimitLoop &loop : limit_loops)
    if (has_wide || !loop.wide) limits.*loop.limit = best_rate(loop.run, loop.amount);
  return limits;
}

void work_at_limit(Limit limit, double amount) {
  for (const LimitLoop &loop : limit_loops)
    if (loop.limit == limit) loop.run(std::max(1L, std::lround(amount / loop.amount)));
}

MixShares measure_mix_shares() {
  MixShares shares{};
  const double rate = best_rate(double_loop, instructions);
  shares.one_shuffle = best_rate(one_shuffle_loop, mix_steps * instructions) / rate;
  shares.two_shuffles = best_rate(two_shuffles_loop, mix_steps * instructions) / rate;
  shares.thirteen_loads = best_rate(thirteen_loads_loop, mix_steps * 24) / rate;
  if (__builtin_cpu_supports("avx") != 0)
    shares.two_wide_inserts =
        best_rate(two_wide_inserts_loop, mix_steps * instructions) / best_rate(wide_double_loop, instructions);
  return shares;
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
  for (int time = 0; time < copy_times; ++time) {
    const double start = now();
    std::vector<std::thread> others;
    for (int t = 1; t < threads; ++t) others.emplace_back(copy_share, t);
    copy_share(0);
    for (std::thread &other : others) other.join();
    best = std::min(best, now() - start);
  }
  return 2.0 * static_cast<double>(from.size() * sizeof(Line)) / best;
}

Bound find_bound(const CoreLimits &limits, double loads, double stores, double flops, bool single) {
  const Limit arithmetic = single ? &CoreLimits::single_flops : &CoreLimits::double_flops;
  const auto seconds = [&](const Bound &bound) { return bound.amount / limits.*bound.limit; };
  return std::max(
      {Bound{&CoreLimits::load_rate, loads}, Bound{&CoreLimits::store_rate, stores}, Bound{arithmetic, flops}},
      [&](const Bound &a, const Bound &b) { return seconds(a) < seconds(b); });
}

}  // namespace qtb::bench
