// The inner kernel of the avx tier in double precision: the one kernel of the library in the wider encoding.
//
// C(0:m, 0:n) += Ap*Bp, m a multiple of 8, kp of 4, n any: packed panels in the format of tiles.h, their micro-panels
// ldap and ldbp elements apart. Panels of A are on 16-byte boundaries, those of B and stage on 32-byte boundaries;
// C is at any address. stage holds 32 bytes per k.
//
// A tile is 8 rows by 4 columns: eight accumulators of 4 rows each. Per k the rows of A come in 16-byte halves, those
// of B by broadcast from a copy of the micro-panel in the stage, where it stays in the nearest cache while all of A
// passes. Multiplication and addition are separate instructions: the products of the last column are carried into the
// next step of depth, which adds them while it multiplies. The upper halves of the registers are clear at the end.
#include <immintrin.h>

#include "blas/kernels/level3/kernels.h"
#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

constexpr GemmRules rules = rules_of<double>;
constexpr int mr = static_cast<int>(rules.mr), nr = static_cast<int>(rules.nr), ku = static_cast<int>(rules.ku);
constexpr QtbInt vector_length = 4, half_length = 2;
constexpr std::uintptr_t wide_vector_bytes = 32;

// Bytes from the panel's current place to where it is fetched ahead, two lines per ku steps of depth, and from the
// first row of a tile in C.
constexpr int prefetch_a_first = 1536, prefetch_a_second = 1664, prefetch_c = 40;

inline void prefetch(const double *p, int bytes) {
  _mm_prefetch(reinterpret_cast<const char *>(p) + bytes, _MM_HINT_T0);
}

[[gnu::always_inline]] inline __m256d load_rows(const double *a) {
  return _mm256_insertf128_pd(_mm256_castpd128_pd256(_mm_load_pd(a)), _mm_load_pd(a + half_length), 1);
}

// The value is computed here: the order of the depth loop is the order in which it is written.
[[gnu::always_inline]] inline void keep_in_order(__m256d &v) { __asm__ volatile("" : "+x"(v)); }

[[gnu::always_inline]] inline void add_to(__m256d &sum, __m256d product) {
  keep_in_order(product);
  sum = _mm256_add_pd(sum, product);
  keep_in_order(sum);
}

template <bool aligned>
[[gnu::always_inline]] inline void update_half_column(double *c, __m256d sum) {
  if constexpr (aligned)
    _mm256_store_pd(c, _mm256_add_pd(sum, _mm256_load_pd(c)));
  else
    _mm256_storeu_pd(c, _mm256_add_pd(sum, _mm256_loadu_pd(c)));
}

// A tile of C as sums: upper are rows 0 to 3 of its columns, lower rows 4 to 7. All of it is inlined, the lambdas
// first, so that compilers see a tile in registers from their earliest passes on.
template <int width>
struct Tile {
  __m256d upper[width], lower[width];
  __m256d carried_upper, carried_lower;  // products of the last column that are not yet in its sums

  [[gnu::always_inline]] void clear() {
    repeat<width>([&](auto j) __attribute__((always_inline)) {
      upper[j.value] = _mm256_setzero_pd();
      lower[j.value] = _mm256_setzero_pd();
    });
    carried_upper = carried_lower = _mm256_setzero_pd();
  }

  [[gnu::always_inline]] void add_carried() {
    add_to(upper[width - 1], carried_upper);
    add_to(lower[width - 1], carried_lower);
  }

  // += ku steps of k, but for the last products. The rows of a step are loaded during the step before.
  [[gnu::always_inline]] void add_turn(const double *a, const double *b) {
    __m256d upper_rows = load_rows(a), lower_rows = load_rows(a + vector_length);
    repeat<ku>([&](auto k) __attribute__((always_inline)) {
      __m256d next_upper = upper_rows, next_lower = lower_rows;
      add_carried();
      repeat<width>([&](auto j) __attribute__((always_inline)) {
        __m256d factor = _mm256_broadcast_sd(b + j.value);
        keep_in_order(factor);
        if constexpr (j.value + 1 < width) {
          add_to(upper[j.value], _mm256_mul_pd(factor, upper_rows));
          add_to(lower[j.value], _mm256_mul_pd(factor, lower_rows));
        } else {
          carried_upper = _mm256_mul_pd(factor, upper_rows);
          carried_lower = _mm256_mul_pd(factor, lower_rows);
        }
        if constexpr (j.value == 0 && k.value + 1 < ku) {
          a += mr;
          next_upper = load_rows(a);
          keep_in_order(next_upper);
          next_lower = load_rows(a + vector_length);
          keep_in_order(next_lower);
        }
      });
      upper_rows = next_upper;
      lower_rows = next_lower;
      b += width;
    });
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
  for (QtbInt e = 0; e < kp * width; e += vector_length) _mm256_store_pd(stage + e, _mm256_load_pd(bp + e));
  for (; m > 0; m -= mr, ap += ldap, c += mr) {
    for (int j = 0; j < width; j++) prefetch(c + j * ldc, prefetch_c);
    Tile<width> tile;
    tile.clear();
    const double *a = ap, *b = stage;
    for (QtbInt k = 0; k < kp; k += ku, a += ku * mr, b += ku * width) {
      prefetch(a, prefetch_a_first);
      prefetch(a, prefetch_a_second);
      tile.add_turn(a, b);
    }
    tile.add_carried();
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
