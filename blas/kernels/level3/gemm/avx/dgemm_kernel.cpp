// The inner kernel of the avx tier in double precision: the one kernel of the library in the wider encoding.
//
// C(0:m, 0:n) += Ap*Bp, m a multiple of 8, kp of 4, n any: packed panels in the format of tiles.h, their micro-panels
// ldap and ldbp elements apart. Panels and stage are on 32-byte boundaries; C is at any address. stage holds 32 bytes
// per k.
//
// A tile is 8 rows by 4 columns: eight accumulators of 4 rows each. Per k the rows of A come in two loads, the columns
// of B by broadcast from a copy of the micro-panel in the stage, where it stays in the nearest cache while all of A
// passes. The upper halves of the registers are clear at the end.
#include <immintrin.h>

#include "blas/kernels/level3/gemm/kernels.h"
#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

constexpr GemmRules rules = rules_of<double>;
constexpr int mr = static_cast<int>(rules.mr), nr = static_cast<int>(rules.nr), ku = static_cast<int>(rules.ku);
constexpr QtbInt vector_length = 4;
constexpr std::uintptr_t wide_vector_bytes = 32;

// Bytes from the panel's current place to where it is fetched ahead, two lines per ku steps of depth, and from the
// first row of a tile in C.
constexpr int prefetch_a_first = 1536, prefetch_a_second = 1664, prefetch_c = 40;

[[gnu::always_inline]] inline void prefetch(const double *p, int bytes) {
  _mm_prefetch(reinterpret_cast<const char *>(p) + bytes, _MM_HINT_T0);
}

template <bool aligned>
[[gnu::always_inline]] inline void update_half_column(double *c, __m256d sum) {
  if constexpr (aligned)
    _mm256_store_pd(c, _mm256_add_pd(sum, _mm256_load_pd(c)));
  else
    _mm256_storeu_pd(c, _mm256_add_pd(sum, _mm256_loadu_pd(c)));
}

// upper += upper_rows*b, lower += lower_rows*b.
//
// In assembly, because compilers gather the loads of several columns ahead of their products, and let sums wander from
// register to register, to meet the loop's end in memory or by copies. A step's 22 instructions, 16 of them arithmetic,
// leave no room for such.
[[gnu::always_inline]] inline void add_column(__m256d &upper, __m256d &lower, __m256d upper_rows, __m256d lower_rows,
                                              const double *b) {
  __m256d factor, product;
  __asm__ volatile(
      "vbroadcastsd %[b], %[f]\n\tvmulpd %[f], %[ur], %[p]\n\tvmulpd %[f], %[lr], %[f]\n\t"
      "vaddpd %[p], %[u], %[u]\n\tvaddpd %[f], %[l], %[l]"
      : [u] "+&x"(upper), [l] "+&x"(lower), [f] "=&x"(factor), [p] "=&x"(product)
      : [ur] "x"(upper_rows), [lr] "x"(lower_rows), [b] "m"(*b));
}

// A tile of C as sums: upper are rows 0 to 3 of its columns, lower rows 4 to 7. All of it is inlined, the lambdas
// first, so that compilers see a tile in registers from their earliest passes on.
template <int width>
struct Tile {
  __m256d upper[width], lower[width];

  [[gnu::always_inline]] void clear() {
    repeat<width>([&](auto j) __attribute__((always_inline)) {
      upper[j.value] = _mm256_setzero_pd();
      lower[j.value] = _mm256_setzero_pd();
    });
  }

  // += kp steps of k.
  [[gnu::always_inline]] void add_panel(QtbInt kp, const double *a, const double *b) {
    for (const double *const end = a + kp * mr; a != end;) {
      prefetch(a, prefetch_a_first);
      prefetch(a, prefetch_a_second);
      repeat<ku>([&](auto) __attribute__((always_inline)) {
        const __m256d upper_rows = _mm256_load_pd(a), lower_rows = _mm256_load_pd(a + vector_length);
        repeat<width>([&](auto j) __attribute__((always_inline)) {
          add_column(upper[j.value], lower[j.value], upper_rows, lower_rows, b + j.value);
        });
        a += mr;
        b += width;
      });
    }
  }

  // C += the tile, column by column.
  template <bool aligned>
  [[gnu::always_inline]] void update(double *c, QtbInt ldc) const {
    repeat<width>([&](auto j) __attribute__((always_inline)) {
      update_half_column<aligned>(c + j.value * ldc, upper[j.value]);
      update_half_column<aligned>(c + j.value * ldc + vector_length, lower[j.value]);
    });
  }
};

// The rows of A against one micro-panel of B.
template <int width, bool aligned>
[[gnu::noinline]] void multiply_micro_panel(QtbInt m, QtbInt kp, const double *ap, QtbInt ldap, const double *bp,
                                            double *c, QtbInt ldc, double *stage) {
  // Rows that pass but once take the micro-panel as it is.
  const bool staged = m > mr;
  for (QtbInt e = 0; staged && e < kp * width; e += ku * width)
    repeat<width>([&](auto v) {
      _mm256_store_pd(stage + e + v.value * vector_length, _mm256_load_pd(bp + e + v.value * vector_length));
    });
  const double *const b = staged ? stage : bp;
  for (; m > 0; m -= mr, ap += ldap, c += mr) {
    for (int j = 0; j < width; j++) prefetch(c + j * ldc, prefetch_c);
    Tile<width> tile;
    tile.clear();
    tile.add_panel(kp, ap, b);
    tile.template update<aligned>(c, ldc);
  }
}

template <bool aligned>
void multiply(QTB_INNER_KERNEL_PARAMS(double)) {
  for (QtbInt width; n > 0; n -= width, bp += ldbp, c += width * ldc) {
    width = panel_width(nr, n);
    switch (width) {
      case 1: multiply_micro_panel<1, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      case 2: multiply_micro_panel<2, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      case 3: multiply_micro_panel<3, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      default: multiply_micro_panel<nr, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
    }
  }
}

}  // namespace

extern "C" void QTB_TIER_NAME(dgemm_kernel)(QTB_INNER_KERNEL_PARAMS(double)) {
  const std::uintptr_t phase = reinterpret_cast<std::uintptr_t>(c) % wide_vector_bytes;
  const std::uintptr_t step = static_cast<std::uintptr_t>(ldc) * sizeof(double) % wide_vector_bytes;
  if (phase + step == 0)
    multiply<true>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);
  else
    multiply<false>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);
  _mm256_zeroupper();
}

}  // namespace qtb::QTB_TIER
