// The inner kernels of the sse42 tier, which the avx tier shares in all types but double precision.
//
// C(0:m, 0:n) += Ap*Bp, m a multiple of mr, kp of 4, n any: packed panels in the format of tiles.h, their micro-panels
// ldap and ldbp elements apart and on 16-byte boundaries. C is at any address, or, in the aligned form, on a 16-byte
// boundary with ldc a multiple of 16 bytes. stage is on a 16-byte boundary.
//
// A vector of A holds the mr rows of one k, and a vector of B two columns, both without replication: its product with
// the rows in order holds (a0*b0, a1*b1), the one with the rows exchanged in pairs (a1*b0, a0*b1). The two kinds are
// summed apart over the whole depth, in a direct and a crossed accumulator, and sorted into columns only then. So the
// depth loop holds one shuffle per k. With four lanes, rows 2 and 3 take part as rows 0 and 1 do, and two columns of B
// come twice from an 8-byte load.
//
// The same loop makes the complex product: with real and imaginary parts in the place of the rows and with one column
// of B in the place of two, the direct accumulator holds (ar*br, ai*bi) and the crossed one (ai*br, ar*bi). For this
// the micro-panel of B is first copied to the stage, every element filling a vector.
#pragma once

#include "blas/kernels/level3/gemm/kernels.h"
#include "blas/kernels/simd/lanes.h"
#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// Depth of one turn of the depth loop, and of a panel's unit of depth, which one shorter turn may complete.
constexpr QtbInt turn_depth = 8, unit_depth = 4;

// direct += rows*b, crossed += exchanged*b, b a vector of B: two columns of real elements, or one staged element of a
// complex column.
//
// In assembly, because compilers make one load and a copy of what is loaded twice, and because they let sums wander
// from register to register, to meet the loop's end in memory. Where b is a vector on its boundary the rows are copied
// and multiplied by memory; where it is not it is loaded for each product. Either way a step of 16 products and sums
// has 25 instructions, 8 of them loads, which 2 loads and 6 instructions a cycle just carry; the first form gains 1 to
// 6 parts in a hundred. Tried, and slower by 1 to 20: the exchanged rows by two loads, or by a shuffle from memory. The
// shuffle at another place of the step, or at changing ones, made no difference.
#define QTB_ALIGNED_PAIR(T, mul, add)                                                                             \
  [[gnu::always_inline]] inline void add_aligned_pair(Vec<T> &direct, Vec<T> &crossed, Vec<T> rows,               \
                                                      Vec<T> exchanged_rows, const T *b) {                        \
    Vec<T> product;                                                                                               \
    __asm__ volatile("movaps %[r], %[p]\n\t" mul " %[b], %[p]\n\t" add " %[p], %[d]\n\tmovaps %[e], %[p]\n\t" mul \
                     " %[b], %[p]\n\t" add " %[p], %[c]"                                                          \
                     : [d] "+&x"(direct), [c] "+&x"(crossed), [p] "=&x"(product)                                  \
                     : [r] "x"(rows), [e] "x"(exchanged_rows), [b] "m"(*reinterpret_cast<const Vec<T> *>(b)));    \
  }
QTB_ALIGNED_PAIR(double, "mulpd", "addpd")
QTB_ALIGNED_PAIR(cfloat, "mulps", "addps")
QTB_ALIGNED_PAIR(cdouble, "mulpd", "addpd")
#undef QTB_ALIGNED_PAIR

#define QTB_LOADED_PAIR(T, Loaded, load, mul, add)                                                                 \
  [[gnu::always_inline]] inline void add_loaded_pair(Vec<T> &direct, Vec<T> &crossed, Vec<T> rows,                 \
                                                     Vec<T> exchanged_rows, const T *b) {                          \
    Vec<T> product;                                                                                                \
    __asm__ volatile(load " %[b], %[p]\n\t" mul " %[r], %[p]\n\t" add " %[p], %[d]\n\t" load " %[b], %[p]\n\t" mul \
                          " %[e], %[p]\n\t" add " %[p], %[c]"                                                      \
                     : [d] "+&x"(direct), [c] "+&x"(crossed), [p] "=&x"(product)                                   \
                     : [r] "x"(rows), [e] "x"(exchanged_rows), [b] "m"(*reinterpret_cast<const Loaded *>(b)));     \
  }
QTB_LOADED_PAIR(float, AnyAddress<double>, "movddup", "mulps", "addps")
QTB_LOADED_PAIR(double, __m128d_u, "movupd", "mulpd", "addpd")
#undef QTB_LOADED_PAIR

// The last pair of a step, which overwrites the rows, and loads b once.
#define QTB_LAST_PAIR(T, Loaded, load, mul, add)                                                                  \
  [[gnu::always_inline]] inline void add_last_pair(Vec<T> &direct, Vec<T> &crossed, Vec<T> rows,                  \
                                                   Vec<T> exchanged_rows, const T *b) {                           \
    Vec<T> product;                                                                                               \
    __asm__ volatile(load " %[b], %[p]\n\t" mul " %[p], %[r]\n\t" add " %[r], %[d]\n\t" mul " %[e], %[p]\n\t" add \
                          " %[p], %[c]"                                                                           \
                     : [d] "+&x"(direct), [c] "+&x"(crossed), [r] "+&x"(rows), [p] "=&x"(product)                 \
                     : [e] "x"(exchanged_rows), [b] "m"(*reinterpret_cast<const Loaded *>(b)));                   \
  }
QTB_LAST_PAIR(float, AnyAddress<double>, "movddup", "mulps", "addps")
QTB_LAST_PAIR(double, __m128d_u, "movupd", "mulpd", "addpd")
QTB_LAST_PAIR(cfloat, __m128_u, "movups", "mulps", "addps")
QTB_LAST_PAIR(cdouble, __m128d_u, "movupd", "mulpd", "addpd")
#undef QTB_LAST_PAIR

// Whether the vectors of B lie on their boundaries: those of real micro-panels of an even width do, where they fill a
// vector, and those of the stage.
template <class T, int width>
constexpr bool b_is_aligned = is_complex<T> || (lanes<T> == 2 && width % 2 == 0);

template <class T, int width, bool last>
[[gnu::always_inline]] inline void add_pair(Vec<T> &direct, Vec<T> &crossed, Vec<T> rows, Vec<T> exchanged_rows,
                                            const T *b) {
  if constexpr (last)
    add_last_pair(direct, crossed, rows, exchanged_rows, b);
  else if constexpr (b_is_aligned<T, width>)
    add_aligned_pair(direct, crossed, rows, exchanged_rows, b);
  else
    add_loaded_pair(direct, crossed, rows, exchanged_rows, b);
}

// A tile of C, mr rows and width columns, as sums: of each two real columns or each complex column one of either kind;
// of a real column without a neighbour the direct one alone, which is the column as it stands. All of it is inlined,
// the lambdas first, so that compilers see a tile in registers from their earliest passes on.
template <class T, int width>
struct Tile {
  using V = Vec<T>;
  static constexpr int columns_per_pair = is_complex<T> ? 1 : 2;
  static constexpr int pairs = width / columns_per_pair, singles = width % columns_per_pair;
  // What B holds of a pair, and what one k takes of A and of B, in elements: a staged column fills a vector.
  static constexpr QtbInt pair_step = is_complex<T> ? lanes<T> : 2;
  static constexpr QtbInt a_step = rules_of<T>.mr, b_step = pairs * pair_step + singles;

  V direct[pairs + singles], crossed[pairs + singles];

  [[gnu::always_inline]] void clear() {
    repeat<pairs + singles>([&](auto q) __attribute__((always_inline)) {
      direct[q.value] = zero<T>();
      crossed[q.value] = zero<T>();
    });
  }

  // += depth steps of k. The rows of a step are loaded and exchanged early in the step before.
  template <int depth>
  [[gnu::always_inline]] void add_turn(const T *a, const T *b) {
    V rows = load_aligned(a), exchanged_rows = exchanged(rows);
    repeat<depth>([&](auto k) __attribute__((always_inline)) {
      V next_rows = rows, next_exchanged = exchanged_rows;
      if constexpr (k.value + 1 < depth) {
        a += a_step;
        next_rows = load_aligned(a);
        keep_in_place(next_rows);
        next_exchanged = exchanged(next_rows);
      }
      repeat<pairs>([&](auto q) __attribute__((always_inline)) {
        add_pair<T, width, q.value + 1 == pairs + singles>(direct[q.value], crossed[q.value], rows, exchanged_rows,
                                                           b + q.value * pair_step);
      });
      if constexpr (singles != 0) {
        direct[pairs] = add(direct[pairs], mul(broadcast(b[width - 1]), rows));
        keep_in_place(direct[pairs]);
      }
      rows = next_rows;
      exchanged_rows = next_exchanged;
      b += b_step;
    });
  }

  // C += the tile, column by column.
  template <bool aligned>
  [[gnu::always_inline]] void update(T *c, QtbInt ldc) const {
    if constexpr (is_complex<T>) {
      repeat<(width + 1) / 2>([&](auto q) __attribute__((always_inline)) {
        constexpr int left = 2 * q.value, right = left + 1 < width ? left + 1 : left;
        const V re = neighbour_differences(direct[left], direct[right]);
        const V im = neighbour_sums(crossed[left], crossed[right]);
        update_column<aligned>(c + left * ldc, interleaved_low(re, im));
        if constexpr (right != left) update_column<aligned>(c + right * ldc, interleaved_high(re, im));
      });
    } else {
      repeat<pairs>([&](auto q) __attribute__((always_inline)) {
        const V other = exchanged(crossed[q.value]);
        update_column<aligned>(c + 2 * q.value * ldc, even_odd(direct[q.value], other));
        update_column<aligned>(c + (2 * q.value + 1) * ldc, even_odd(other, direct[q.value]));
      });
      if constexpr (singles != 0) update_column<aligned>(c + (width - 1) * ldc, direct[pairs]);
    }
  }

  template <bool aligned>
  [[gnu::always_inline]] static void update_column(T *c, V sum) {
    if constexpr (!aligned)
      store_unaligned(c, add(sum, load_unaligned(c)));
    else if constexpr (is_complex<T>)
      store_unaligned(c, add(sum, load_aligned(c)));
    else
      store_aligned(c, add(sum, load_aligned(c)));
  }
};

// The rows of A against one micro-panel of B.
template <class T, int width, bool aligned>
[[gnu::noinline]] void multiply_columns(QtbInt m, QtbInt kp, const T *ap, QtbInt ldap, const T *b, T *c, QtbInt ldc) {
  using Block = Tile<T, width>;
  constexpr QtbInt mr = rules_of<T>.mr;
  for (; m > 0; m -= mr, ap += ldap, c += mr) {
    // The rows of the next tile: a tile has 16 bytes of each column.
    for (int j = 0; j < width; j++) _mm_prefetch(reinterpret_cast<const char *>(c + mr + j * ldc), _MM_HINT_T0);
    Block tile;
    tile.clear();
    const T *a = ap, *bk = b;
    for (QtbInt turns = kp / turn_depth; turns > 0; turns--) {
      tile.template add_turn<turn_depth>(a, bk);
      a += turn_depth * Block::a_step;
      bk += turn_depth * Block::b_step;
    }
    if (kp % turn_depth != 0) tile.template add_turn<unit_depth>(a, bk);
    tile.template update<aligned>(c, ldc);
  }
}

// Every element of a micro-panel of B in a vector of its own: what fills one already, as it is. elements is a multiple
// of unit_depth.
template <class T>
void stage_columns(QtbInt elements, const T *bp, T *stage) {
  for (; elements > 0; elements -= unit_depth, bp += unit_depth, stage += unit_depth * lanes<T>)
    repeat<unit_depth>([&](auto e) { store_aligned(stage + e.value * lanes<T>, load_repeated(bp + e.value)); });
}

template <class T, int width, bool aligned>
void multiply_micro_panel(QtbInt m, QtbInt kp, const T *ap, QtbInt ldap, const T *bp, T *c, QtbInt ldc, T *stage) {
  if constexpr (is_complex<T>) {
    stage_columns(kp * width, bp, stage);
    multiply_columns<T, width, aligned>(m, kp, ap, ldap, stage, c, ldc);
  } else {
    multiply_columns<T, width, aligned>(m, kp, ap, ldap, bp, c, ldc);
  }
}

template <class T, bool aligned>
void diagonal_kernel(QTB_INNER_KERNEL_PARAMS(T)) {
  constexpr int nr = rules_of<T>.nr;
  for (QtbInt width; n > 0; n -= width, bp += ldbp, c += width * ldc) {
    width = panel_width(nr, n);
    switch (width) {
      case 1: multiply_micro_panel<T, 1, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      case 2: multiply_micro_panel<T, 2, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      case 3: multiply_micro_panel<T, 3, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      case 4: multiply_micro_panel<T, 4, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
      default: multiply_micro_panel<T, nr, aligned>(m, kp, ap, ldap, bp, c, ldc, stage); break;
    }
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER

// The procedures of a type, by the start of their names.
#define QTB_DIAGONAL_KERNELS(name, T)                                           \
  extern "C" void QTB_TIER_NAME(name##_kernel_cu)(QTB_INNER_KERNEL_PARAMS(T)) { \
    diagonal_kernel<T, false>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);     \
  }                                                                             \
  extern "C" void QTB_TIER_NAME(name##_kernel_ca)(QTB_INNER_KERNEL_PARAMS(T)) { \
    diagonal_kernel<T, true>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);      \
  }
