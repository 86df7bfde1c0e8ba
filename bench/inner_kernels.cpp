// inner_kernels: the inner kernels of GEMM alone, beside what their designs allow.
//
// Each kernel of the process's tier multiplies panels with the depth of a block of its family. A row has its rate where
// the panel of A is a whole block, and the shares of the arithmetic rate of a core with the same vectors (CoreLimits)
// that it reaches with such a block, that it reaches with few rows, whose panel lies in the second cache level, and
// that the instructions of its step leave at most (MixShares). What a whole product has less goes to packing, to the
// small path and to the far caches. QTB_DEBUG_CPU_TYPE chooses the tier.

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
using EdgeKernel = void(QtbInt m, QtbInt n, QtbInt k, const double *a, QtbInt lda, const double *b, QtbInt ldb,
                        double *c, QtbInt ldc, const double *alpha, const double *beta_lanes);

// What stands in a step beside so many products and sums, and the share of the arithmetic rate that it leaves.
struct Step {
  const char *text;
  double MixShares::*share;  // null: all of it
  bool wide = false;         // vectors of 32 bytes
};
constexpr Step arithmetic{"arithmetic alone", nullptr}, one_shuffle{"a shuffle beside 16", &MixShares::one_shuffle},
    two_shuffles{"two shuffles beside 16", &MixShares::two_shuffles},
    two_wide_inserts{"two inserts beside 16", &MixShares::two_wide_inserts, true},
    thirteen_loads{"13 loads beside 24", &MixShares::thirteen_loads};

// X(tier, T, family, kernel, step)
// clang-format off
#define QTB_LISTED_KERNELS(X) \
  X(def,   float,   base,  sgemm_kernel_112,      arithmetic) \
  X(def,   double,  base,  dgemm_kernel_128,      thirteen_loads) \
  X(def,   double,  def_a, dgemm_def_kernel,      arithmetic) \
  X(def,   cfloat,  base,  cgemm_kernel_64,       arithmetic) \
  X(def,   cdouble, base,  zgemm_kernel_64,       arithmetic) \
  X(sse3,  float,   base,  sgemm_kernel_112,      arithmetic) \
  X(sse3,  cfloat,  base,  cgemm_kernel_64,       arithmetic) \
  X(sse3,  cdouble, base,  zgemm_kernel_64,       arithmetic) \
  X(ssse3, float,   base,  sgemm_kernel,          arithmetic) \
  X(ssse3, double,  base,  dgemm_kernel,          arithmetic) \
  X(ssse3, cfloat,  base,  cgemm_kernel,          arithmetic) \
  X(ssse3, cdouble, base,  zgemm_kernel,          arithmetic) \
  X(ssse3, float,   sse41, sgemm_kernel_sse41_ca, arithmetic) \
  X(ssse3, double,  sse41, dgemm_kernel_sse41_ca, two_shuffles) \
  X(ssse3, cfloat,  sse41, cgemm_kernel_sse41_ca, arithmetic) \
  X(ssse3, cdouble, sse41, zgemm_kernel_sse41_ca, arithmetic) \
  X(sse42, float,   base,  sgemm_kernel_ca,       one_shuffle) \
  X(sse42, double,  base,  dgemm_kernel_ca,       one_shuffle) \
  X(sse42, cfloat,  base,  cgemm_kernel_ca,       one_shuffle) \
  X(sse42, cdouble, base,  zgemm_kernel_ca,       one_shuffle) \
  X(avx,   float,   base,  sgemm_kernel_ca,       one_shuffle) \
  X(avx,   double,  base,  dgemm_kernel,          two_wide_inserts) \
  X(avx,   cfloat,  base,  cgemm_kernel_ca,       one_shuffle) \
  X(avx,   cdouble, base,  zgemm_kernel_ca,       one_shuffle)
// clang-format on

extern "C" {
#define QTB_DECLARE(tier, T, family, name, step) Kernel<T> qtb_blas_##tier##_##name;
QTB_LISTED_KERNELS(QTB_DECLARE)
#undef QTB_DECLARE
EdgeKernel qtb_blas_sse3_dgemm_kernel_a112;
}

// The one that takes other arguments. It reads neither alpha nor beta.
void sse3_dgemm_kernel_a112(QtbInt m, QtbInt n, QtbInt kp, const double *ap, QtbInt ldap, const double *bp, QtbInt ldbp,
                            double *c, QtbInt ldc, double *) {
  qtb_blas_sse3_dgemm_kernel_a112(m, n, kp, ap, ldap, bp, ldbp, c, ldc, nullptr, nullptr);
}

template <class T>
struct Listed {
  const char *name;
  Kernel<T> *kernel;
  tiles::GemmBlocks blocks;
  const Step &step;
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
void measure(const Listed<T> &listed, const CoreLimits &limits, const MixShares &mixes) {
  const double peak = std::is_same_v<Real<T>, float> ? limits.single_flops
                      : listed.step.wide             ? limits.wide_double_flops
                                                     : limits.double_flops;
  const double most = listed.step.share == nullptr ? 1 : mixes.*listed.step.share;
  const double rate = best_rate(listed, listed.blocks.mb);
  std::printf("%-22s %5lld %5lld %9.1f %7.3f %7.3f %7.3f  %s\n", listed.name, static_cast<long long>(listed.blocks.kb),
              static_cast<long long>(listed.blocks.mb), rate * 1e-9, rate / peak, best_rate(listed, few_rows) / peak,
              most, listed.step.text);
}

}  // namespace
}  // namespace qtb::bench

int main() {
  using namespace qtb::bench;
  const ProcessorTier tier = qtb_serv_cpu_detect();
  const CoreLimits limits = measure_core_limits();
  const MixShares mixes = measure_mix_shares();
  std::printf("%-22s %5s %5s %9s %7s %7s %7s  %s\n", "kernel", "depth", "rows", "GFLOP/s", "share", "few", "at most",
              "by its step");
#define QTB_BLOCKS(tier, T, family) \
  large_blocks(tiles::find_rules(tiles::kind_of<T>, tier_##tier, tiles::Family::family))
#define QTB_MEASURE(listed_tier, T, family, name, step) \
  if (tier == tier_##listed_tier)                       \
    measure<T>({#name, qtb_blas_##listed_tier##_##name, QTB_BLOCKS(listed_tier, T, family), step}, limits, mixes);
  QTB_LISTED_KERNELS(QTB_MEASURE)
  if (tier == tier_sse3)
    measure<double>({"dgemm_kernel_a112", sse3_dgemm_kernel_a112, QTB_BLOCKS(sse3, double, base), arithmetic}, limits,
                    mixes);
}
