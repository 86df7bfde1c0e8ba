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

#define QTB_FOUR(body) body body body body
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
#define QTB_WIDE_LOAD(at, r) "vmovaps (%1), %%ymm" #r "\n\t"
#define QTB_STORE(at, r) "movaps %%xmm" #r ", " #at "(%1)\n\t"
#define QTB_BLOCK(move)                                                                                        \
  move(0, 0) move(16, 1) move(32, 2) move(48, 3) move(64, 4) move(80, 5) move(96, 6) move(112, 7) move(128, 8) \
      move(144, 9) move(160, 10) move(176, 11) move(192, 12) move(208, 13) move(224, 14) move(240, 15)

void load_loop(long count) { asm volatile(QTB_LOOP(QTB_BLOCK(QTB_LOAD)) : "+r"(count) : "r"(block) : QTB_CLOBBERED); }
void store_loop(long count) { asm volatile(QTB_LOOP(QTB_BLOCK(QTB_STORE)) : "+r"(count) : "r"(block) : "memory"); }

[[gnu::target("avx")]] void wide_load_loop(long count) {
  asm volatile(QTB_LOOP(QTB_BLOCK(QTB_WIDE_LOAD)) "\n\tvzeroupper" : "+r"(count) : "r"(block) : QTB_CLOBBERED);
}

// Of four bytes each, so that nothing but their number counts to those that decode and keep them.
#define QTB_NOTHING "nopl 0(%%rax)\n\t"
#define QTB_NOTHINGS QTB_NOTHING QTB_NOTHING QTB_NOTHING QTB_NOTHING
constexpr double nothings = 64;
void instruction_loop(long count) { asm volatile(QTB_LOOP(QTB_FOUR(QTB_FOUR(QTB_NOTHINGS))) : "+r"(count)); }

// The shuffle writes the register of a product, so that nothing waits for a chain longer than those of arithmetic.
constexpr double shuffled_instructions = 4 * instructions;
void shuffled_loop(long count) {
  asm volatile(QTB_CLEAR_ALL QTB_LOOP(QTB_FOUR("pshufd $0x4e, (%1), %%xmm0\n\t" QTB_ARITHMETIC(QTB_PAIR, "pd")))
               : "+r"(count)
               : "r"(block)
               : QTB_CLOBBERED);
}

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
    {&CoreLimits::wide_load_rate, wide_load_loop, instructions, true},
    {&CoreLimits::instruction_rate, instruction_loop, nothings},
    {&CoreLimits::shuffled_flops, shuffled_loop, shuffled_instructions * 2},
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
