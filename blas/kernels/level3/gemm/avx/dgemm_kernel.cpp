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

#include "blas/kernels/level3/gemm/kernels.h"
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

  [[gnu::always_inline]] void clear() {
    repeat<width>([&](auto j) __attribute__((always_inline)) {
      upper[j.value] = _mm256_setzero_pd();
      lower[j.value] = _mm256_setzero_pd();
    });
  }

  // += kp steps of k.
  [[gnu::always_inline]] void add_panel(QtbInt kp, const double *a, const double *b) {
    for (; kp > 0; kp -= ku) {
      prefetch(a, prefetch_a_first);
      prefetch(a, prefetch_a_second);
      repeat<ku>([&](auto) __attribute__((always_inline)) {
        const __m256d upper_rows = load_rows(a), lower_rows = load_rows(a + vector_length);
        repeat<width>([&](auto j) __attribute__((always_inline)) {
          const __m256d factor = _mm256_broadcast_sd(b + j.value);
          upper[j.value] = _mm256_add_pd(upper[j.value], _mm256_mul_pd(factor, upper_rows));
          lower[j.value] = _mm256_add_pd(lower[j.value], _mm256_mul_pd(factor, lower_rows));
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

// The full tile's depth loop is in assembly. 18 arithmetic instructions of a step on four units take 4.5 cycles, and
// its 24 instructions in all take 4 to start: there is no room for the copies of registers that compilers make of sums
// and rows which rotate, and their order of the loads leaves a step at 5 cycles where this one comes to 4.7.
//
// A step begins with the rows of the next one. Each column's products are added while the next column's are made, over
// the end of the step and of the turn.
// clang-format off
#define QTB_LOAD_ROWS(k, to)                                         \
  "vmovapd 64*" #k "(%[a]), %x[" to "_u]\n\t"                        \
  "vinsertf128 $1, 64*" #k "+16(%[a]), %[" to "_u], %[" to "_u]\n\t" \
  "vmovapd 64*" #k "+32(%[a]), %x[" to "_l]\n\t"                     \
  "vinsertf128 $1, 64*" #k "+48(%[a]), %[" to "_l], %[" to "_l]\n\t"
// Column j of step k makes the products to; those of the column before it are in from.
#define QTB_COLUMN(k, rows, j, before, to, from)               \
  "vaddpd %[" from "_u], %[u" #before "], %[u" #before "]\n\t" \
  "vbroadcastsd 32*" #k "+8*" #j "(%[b]), %[" to "_l]\n\t"     \
  "vmulpd %[" to "_l], %[" rows "_u], %[" to "_u]\n\t"         \
  "vaddpd %[" from "_l], %[l" #before "], %[l" #before "]\n\t" \
  "vmulpd %[" to "_l], %[" rows "_l], %[" to "_l]\n\t"
#define QTB_STEP(k, rows)                      \
  QTB_COLUMN(k, rows, 0, 3, "made", "carried") \
  QTB_COLUMN(k, rows, 1, 0, "carried", "made") \
  QTB_COLUMN(k, rows, 2, 1, "made", "carried") \
  QTB_COLUMN(k, rows, 3, 2, "carried", "made")
// clang-format on
#define QTB_TURN(rows_of_next_turn)                                                                                \
  __asm__ volatile(QTB_LOAD_ROWS(1, "odd") QTB_STEP(0, "even") QTB_LOAD_ROWS(2, "even") QTB_STEP(1, "odd")         \
                       QTB_LOAD_ROWS(3, "odd") QTB_STEP(2, "even") rows_of_next_turn QTB_STEP(3, "odd")            \
                   : [u0] "+&x"(upper[0]), [u1] "+&x"(upper[1]), [u2] "+&x"(upper[2]), [u3] "+&x"(upper[3]),       \
                     [l0] "+&x"(lower[0]), [l1] "+&x"(lower[1]), [l2] "+&x"(lower[2]), [l3] "+&x"(lower[3]),       \
                     [even_u] "+&x"(even_upper), [even_l] "+&x"(even_lower), [odd_u] "=&x"(odd_upper),             \
                     [odd_l] "=&x"(odd_lower), [carried_u] "+&x"(carried_upper), [carried_l] "+&x"(carried_lower), \
                     [made_u] "=&x"(made_upper), [made_l] "=&x"(made_lower)                                        \
                   : [a] "r"(a), [b] "r"(b)                                                                        \
                   : "memory")
template <>
[[gnu::always_inline]] inline void Tile<nr>::add_panel(QtbInt kp, const double *a, const double *b) {
  static_assert(nr == 4 && mr == 8 && ku == 4);
  if (kp <= 0) return;
  __m256d even_upper = load_rows(a), even_lower = load_rows(a + vector_length), odd_upper, odd_lower;
  __m256d carried_upper = _mm256_setzero_pd(), carried_lower = _mm256_setzero_pd(), made_upper, made_lower;
  for (; kp > ku; kp -= ku, a += ku * mr, b += ku * nr) {
    prefetch(a, prefetch_a_first);
    prefetch(a, prefetch_a_second);
    QTB_TURN(QTB_LOAD_ROWS(4, "even"));
  }
  QTB_TURN("");
  upper[nr - 1] = _mm256_add_pd(upper[nr - 1], carried_upper);
  lower[nr - 1] = _mm256_add_pd(lower[nr - 1], carried_lower);
}
#undef QTB_TURN
#undef QTB_STEP
#undef QTB_COLUMN
#undef QTB_LOAD_ROWS

// The rows of A against one micro-panel of B.
template <int width, bool aligned>
[[gnu::noinline]] void multiply_micro_panel(QtbInt m, QtbInt kp, const double *ap, QtbInt ldap, const double *bp,
                                            double *c, QtbInt ldc, double *stage) {
  for (QtbInt e = 0; e < kp * width; e += ku * width)
    repeat<width>([&](auto v) {
      _mm256_store_pd(stage + e + v.value * vector_length, _mm256_load_pd(bp + e + v.value * vector_length));
    });
  for (; m > 0; m -= mr, ap += ldap, c += mr) {
    for (int j = 0; j < width; j++) prefetch(c + j * ldc, prefetch_c);
    Tile<width> tile;
    tile.clear();
    tile.add_panel(kp, ap, stage);
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
