// inner_kernels: the inner kernels of GEMM alone, beside what their designs allow.
//
// Each kernel of the process's tier multiplies panels with the depth of a block of its family. A row has its rate where
// the panel of A is a whole block, and the shares of the arithmetic rate of a core with the same vectors (CoreLimits)
// that it reaches with such a block, that it reaches with few rows, whose panel lies in the second cache level, and
// that its step leaves at most (the column of kernels.def, beside what the core does in the same time). What a whole
// product has less goes to packing, to the small path and to the far caches. QTB_DEBUG_CPU_TYPE chooses the tier.

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <type_traits>

#include "bench/limits.h"
#include "bench/memory.h"
#include "bench/timing.h"
#include "blas/kernels/level3/gemm/tiles.h"
#include "service/cache.h"
#include "service/cpu.h"

namespace qtb::bench {
namespace {

template <class T>
using Kernel = void(QtbInt m, QtbInt n, QtbInt kp, const T *ap, QtbInt ldap, const T *bp, QtbInt ldbp, T *c, QtbInt ldc,
                    T *stage);
template <class T>
using EdgeKernel = void(QtbInt m, QtbInt n, QtbInt k, const T *a, QtbInt lda, const T *b, QtbInt ldb, T *c, QtbInt ldc,
                        const T *alpha, const T *beta_lanes);

extern "C" {
#define QTB_PARAMS_OF_inner Kernel
#define QTB_PARAMS_OF_edge EdgeKernel
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage, step) Kernel<T> qtb_blas_##tier##_##aligned;
#define QTB_BLOCK_KERNEL(tier, T, family, params, name, step) QTB_PARAMS_OF_##params<T> qtb_blas_##tier##_##name;
#include "blas/kernels/level3/gemm/kernels.def"
}

// A kernel as it is called here. Those for edges read neither alpha nor beta where both are 1.
template <auto kernel, class T>
void call(QtbInt m, QtbInt n, QtbInt kp, const T *ap, QtbInt ldap, const T *bp, QtbInt ldbp, T *c, QtbInt ldc,
          T *stage) {
  if constexpr (std::is_same_v<decltype(kernel), EdgeKernel<T> *>)
    kernel(m, n, kp, ap, ldap, bp, ldbp, c, ldc, nullptr, nullptr);
  else
    kernel(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);
}

// The column of kernels.def.
struct Step {
  int vector_bytes, arithmetic, loads, shuffles, instructions;
};

// The share of the arithmetic rate that a step leaves at most: shuffles take the place of products and sums where a
// processor has no other units for them; loads, and instructions in all, take their time beside those.
double most_share(const Step &step, const CoreLimits &limits) {
  const bool wide = step.vector_bytes == 32;
  constexpr double narrow_doubles = 2, wide_doubles = 4, between_shuffles = 16;
  const double arithmetic_rate = wide ? limits.wide_double_flops / wide_doubles : limits.double_flops / narrow_doubles;
  const double shuffle_seconds =
      between_shuffles * narrow_doubles * std::max(0.0, 1 / limits.shuffled_flops - 1 / limits.double_flops);
  const double arithmetic_seconds = step.arithmetic / arithmetic_rate;
  return arithmetic_seconds / std::max({arithmetic_seconds + step.shuffles * shuffle_seconds,
                                        step.loads / (wide ? limits.wide_load_rate : limits.load_rate),
                                        step.instructions / limits.instruction_rate});
}

template <class T>
struct Listed {
  const char *name;
  Kernel<T> *kernel;
  tiles::GemmBlocks blocks;
  Step step;
};

// The blocks of a large problem on this processor.
tiles::GemmBlocks large_blocks(const tiles::GemmRules &rules) {
  constexpr QtbInt size = 1000;
  std::uint32_t caches[cache_size_entries];
  qtb_serv_get_cache_sizes(caches);
  tiles::GemmBlocks blocks{};
  fill_blocks(rules, size, size, size, caches, blocks);
  return blocks;
}

// Rows that are a multiple of every mr, of which a panel lies in the second cache level, and columns that are a
// multiple of every nr.
constexpr QtbInt few_rows = 96, columns = 48;
constexpr QtbInt largest_stage_bytes = 64 * 1024;

constexpr double turn_seconds = 0.002;
constexpr int turns = 100;

// Flops per second at best on so many rows.
template <class T>
double best_rate(const Listed<T> &listed, QtbInt rows) {
  using R = Real<T>;
  const QtbInt depth = listed.blocks.kb, mr = listed.blocks.mr, nr = listed.blocks.nr;
  const auto elements = [](QtbInt count) { return static_cast<std::size_t>(count) * sizeof(T); };
  const std::size_t a_bytes = elements(rows * depth), b_bytes = elements(columns * depth);
  const Memory a = allocate(a_bytes), b = allocate(b_bytes), c = allocate(elements(rows * columns)),
               stage = allocate(largest_stage_bytes);
  fill<R>(a.get(), a_bytes);
  fill<R>(b.get(), b_bytes);
  std::memset(c.get(), 0, elements(rows * columns));
  const auto run = [&](long count) {
    for (long i = 0; i < count; ++i)
      listed.kernel(rows, columns, depth, static_cast<const T *>(a.get()), mr * depth, static_cast<const T *>(b.get()),
                    nr * depth, static_cast<T *>(c.get()), rows, static_cast<T *>(stage.get()));
  };
  const long count = calibrate(run, turn_seconds);
  double best = 1e300;
  for (int i = 0; i < turns; ++i) best = std::min(best, seconds_per_call(run, count));
  constexpr double flops_per_product = is_complex<T> ? 8 : 2;
  return flops_per_product * static_cast<double>(rows * columns * depth) / best;
}

template <class T>
void measure(const Listed<T> &listed, const CoreLimits &limits) {
  const bool wide = listed.step.vector_bytes == 32;
  const double peak = std::is_same_v<Real<T>, float> ? (wide ? limits.wide_single_flops : limits.single_flops)
                                                     : (wide ? limits.wide_double_flops : limits.double_flops);
  const double rate = best_rate(listed, listed.blocks.mb);
  const Step &step = listed.step;
  std::printf("%-22s %5lld %5lld %9.1f %7.3f %7.3f %7.3f  %d %d %d %d\n", listed.name,
              static_cast<long long>(listed.blocks.kb), static_cast<long long>(listed.blocks.mb), rate * 1e-9,
              rate / peak, best_rate(listed, few_rows) / peak, most_share(step, limits), step.arithmetic, step.loads,
              step.shuffles, step.instructions);
}

void measure_kernels(ProcessorTier tier, const CoreLimits &limits) {
#define QTB_MEASURE(listed_tier, T, family, name, step)                                                             \
  if (tier == tier_##listed_tier)                                                                                   \
    measure<T>(                                                                                                     \
        {#name, call<qtb_blas_##listed_tier##_##name, T>,                                                           \
         large_blocks(tiles::find_rules(tiles::kind_of<T>, tier_##listed_tier, tiles::Family::family)), Step step}, \
        limits);
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage, step) QTB_MEASURE(tier, T, family, aligned, step)
#define QTB_BLOCK_KERNEL(tier, T, family, params, name, step) QTB_MEASURE(tier, T, family, name, step)
#include "blas/kernels/level3/gemm/kernels.def"
#undef QTB_MEASURE
}

}  // namespace
}  // namespace qtb::bench

int main() {
  using namespace qtb::bench;
  const CoreLimits limits = measure_core_limits();
  const double product = limits.double_flops / 2;
  std::printf("in the time of a product or sum of 16 bytes: %.2f loads, %.2f stores, %.2f instructions\n",
              limits.load_rate / product, limits.store_rate / product, limits.instruction_rate / product);
  std::printf("%-22s %5s %5s %9s %7s %7s %7s  %s\n", "kernel", "depth", "rows", "GFLOP/s", "share", "few", "at most",
              "by arithmetic, loads, shuffles, instructions");
  measure_kernels(qtb_serv_cpu_detect(), limits);
}
