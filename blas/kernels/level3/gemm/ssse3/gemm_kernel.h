// The inner kernels of the ssse3 tier's two families.
//
// C(0:m, 0:n) += Ap*Bp, m a multiple of mr, kp of ku, n any: packed panels in the format of tiles.h, their micro-panels
// ldap and ldbp elements apart and on 16-byte boundaries. C is at any address, or, in the aligned form, on a 16-byte
// boundary with ldc a multiple of 16 bytes. stage is on a 16-byte boundary.
//
// In all types a step of depth has two vectors of A, the mr rows, and at most four vectors of real parts of B. A scheme
// says how B becomes the operands of the products, and how the sums become columns of C:
//
//   Replicated    (base family) every real part of B fills a vector of the stage. A sum of a real type is a column; of
//                 a complex type there are two per column, a*br and a*bi, which one add-subtract joins.
//   StagedPairs   (SSE4.1 family, s c z) B is not replicated within a pair of lanes. Of columns b0 and b1 the stage
//                 holds (b0, b1) and (b1, b0), whose products with the rows are summed apart and sorted into columns
//                 after the last step. Complex products are made the same way, with (br, bi) and (bi, br): the
//                 difference of neighbours in the first sum and their total in the second are the parts.
//   CrossedPairs  (SSE4.1 family, d, an even number of columns) the same pairs. A vector of the panel is (b0, b1) as it
//                 is, so that the stage holds (b1, b0) alone.
//   ShuffledPairs (SSE4.1 family, d, otherwise) pairs from the panel, with the rows exchanged by a shuffle, and a last
//                 column without a neighbour by itself.
//
// On processors whose shuffles run in the pipes of the additions and multiplications, the two shuffles of a step cost
// what two of these 16 cost; so where columns pair up they are made once per column group, if enough rows pass.
#pragma once

#include "blas/kernels/level3/gemm/kernels.h"
#include "blas/kernels/simd/lanes.h"
#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// Real parts in a vector, as the offset of one vector from the next, and vectors of A in one step of depth.
template <class T>
constexpr int vector_step = static_cast<int>(parts_per_vector<T>);
constexpr int row_vectors = 2;
template <class T>
constexpr int parts_of = is_complex<T> ? 2 : 1;

constexpr QtbInt line_bytes = 64;

template <auto hint, class T>
[[gnu::always_inline]] inline void prefetch(const T *p, QtbInt bytes_ahead) {
  _mm_prefetch(
      reinterpret_cast<const char *>(reinterpret_cast<std::uintptr_t>(p) + static_cast<std::uintptr_t>(bytes_ahead)),
      hint);
}

// The 4-byte lanes of a vector in another order. The integer shuffle writes another register than it reads.
template <int order>
__m128 reordered(__m128 v) {
  return _mm_castsi128_ps(_mm_shuffle_epi32(_mm_castps_si128(v), order));
}
template <int order>
__m128d reordered(__m128d v) {
  return _mm_castsi128_pd(_mm_shuffle_epi32(_mm_castpd_si128(v), order));
}

// v *= the vector at p, a multiple of 16 bytes, and sum += v. Told in the instructions' own words: compilers load a
// vector that is used twice into a register of its own, and add to whichever operand they like and copy the sum back.
[[gnu::always_inline]] inline void multiply_by_memory(__m128 &v, const float *p) {
  __asm__("mulps %1, %0" : "+x"(v) : "m"(*reinterpret_cast<const __m128 *>(p)));
}
[[gnu::always_inline]] inline void multiply_by_memory(__m128d &v, const double *p) {
  __asm__("mulpd %1, %0" : "+x"(v) : "m"(*reinterpret_cast<const __m128d *>(p)));
}
[[gnu::always_inline]] inline void add_to(__m128 &sum, __m128 v) { __asm__("addps %1, %0" : "+x"(sum) : "x"(v)); }
[[gnu::always_inline]] inline void add_to(__m128d &sum, __m128d v) { __asm__("addpd %1, %0" : "+x"(sum) : "x"(v)); }

// ---- Schemes ----
//
// width       columns of the tile
// operands    vectors of B per step
// orders      of each vector of the panel, the lane orders that go to the stage, if it is staged
// operand     where one lies, by its step, in the panel or the stage: real parts from one step's to the next are
//             panel_step and stage_step, 0 of what no operand is read from
// in_memory(j) whether operand j stays in memory: see multiply_add_line
// products(j) how many of the row forms meet operand j: the first of them
// finish      the sums, by operand and row form, into the columns, by column and row vector

// Vectors by operand and row form, or by column and row vector.
template <class T, int count, int forms>
struct Grid {
  Vec<T> at[count][forms];
};
template <class T, int forms>
struct RowVectors {
  Vec<T> at[forms];
};

template <class R>
struct Orders;
template <>
struct Orders<float> {
  static constexpr int each_lane[] = {0x00, 0x55, 0xAA, 0xFF}, pairs_both_ways[] = {0x44, 0x11, 0xEE, 0xBB};
};
template <>
struct Orders<double> {
  static constexpr int each_lane[] = {0x44, 0xEE}, pairs_both_ways[] = {0xE4, 0x4E}, pairs_crossed[] = {0x4E};
};

template <class T, int columns>
struct StagedOperands {
  using V = Vec<T>;
  static constexpr int width = columns, operands = columns * parts_of<T>, row_forms = row_vectors;
  static constexpr bool staged = true;
  static constexpr QtbInt panel_step = 0, stage_step = operands * vector_step<T>;
  static constexpr int products(int) { return row_vectors; }
  static constexpr bool in_memory(int j) { return j % 2 != 0; }

  template <int j>
  static const Real<T> *operand(int k, const Real<T> *, const Real<T> *stage) {
    return stage + k * stage_step + j * vector_step<T>;
  }
  template <int j>
  static V load_b(const Real<T> *b) {
    return load_aligned(b);
  }
  static RowVectors<T, row_forms> load_rows(const Real<T> *a) {
    return {load_aligned(a), load_aligned(a + vector_step<T>)};
  }
};

template <class T, int columns>
struct Replicated : StagedOperands<T, columns> {
  using V = Vec<T>;
  static constexpr const auto &orders = Orders<Real<T>>::each_lane;

  static void finish(const Grid<T, columns * parts_of<T>, row_vectors> &sums, Grid<T, columns, row_vectors> &c) {
    repeat<columns>([&](auto j) {
      repeat<row_vectors>([&](auto i) {
        if constexpr (is_complex<T>)
          c.at[j.value][i.value] =
              add_subtract(sums.at[2 * j.value][i.value], exchanged(sums.at[2 * j.value + 1][i.value]));
        else
          c.at[j.value][i.value] = sums.at[j.value][i.value];
      });
    });
  }
};

template <class T, int columns>
struct StagedPairs : StagedOperands<T, columns> {
  using V = Vec<T>;
  static constexpr const auto &orders = Orders<Real<T>>::pairs_both_ways;

  static void finish(const Grid<T, columns * parts_of<T>, row_vectors> &sums, Grid<T, columns, row_vectors> &c) {
    if constexpr (is_complex<T>) {
      repeat<columns>([&](auto j) {
        const V re = neighbour_differences(sums.at[2 * j.value][0], sums.at[2 * j.value][1]);
        const V im = neighbour_sums(sums.at[2 * j.value + 1][0], sums.at[2 * j.value + 1][1]);
        c.at[j.value][0] = interleaved_low(re, im);
        c.at[j.value][1] = interleaved_high(re, im);
      });
    } else {
      repeat<columns / 2>([&](auto q) {
        repeat<row_vectors>([&](auto i) {
          const V direct = sums.at[2 * q.value][i.value], crossed = sums.at[2 * q.value + 1][i.value];
          c.at[2 * q.value][i.value] = even_odd(direct, crossed);
          c.at[2 * q.value + 1][i.value] = even_odd(crossed, direct);
        });
      });
    }
  }
};

template <int columns>
struct CrossedPairs : StagedPairs<double, columns> {
  static constexpr const auto &orders = Orders<double>::pairs_crossed;
  static constexpr QtbInt panel_step = columns, stage_step = columns;

  template <int j>
  static const double *operand(int k, const double *panel, const double *stage) {
    return (j % 2 == 0 ? panel : stage) + k * columns + j / 2 * vector_step<double>;
  }
};

// A last column without a neighbour fills a vector and meets the rows in their own order alone.
template <int columns>
struct ShuffledPairs {
  using V = __m128d;
  static constexpr int width = columns, pairs = columns / 2, operands = (columns + 1) / 2, row_forms = 2 * row_vectors;
  static constexpr bool staged = false;
  static constexpr QtbInt panel_step = columns, stage_step = 0;
  static constexpr int products(int j) { return j < pairs ? row_forms : row_vectors; }
  static constexpr bool in_memory(int j) { return columns % 2 == 0 && j % 2 != 0; }

  template <int j>
  static const double *operand(int k, const double *panel, const double *) {
    return panel + k * panel_step + j * vector_step<double>;
  }
  template <int j>
  static V load_b(const double *b) {
    if constexpr (j == pairs)
      return broadcast(*b);
    else if constexpr (columns % 2 == 0)
      return load_aligned(b);
    else
      return load_unaligned(b);
  }
  static RowVectors<double, row_forms> load_rows(const double *a) {
    const V upper = load_aligned(a), lower = load_aligned(a + 2);
    return {upper, lower, exchanged(upper), exchanged(lower)};
  }
  static void finish(const Grid<double, operands, row_forms> &sums, Grid<double, columns, row_vectors> &c) {
    repeat<row_vectors>([&](auto i) {
      repeat<pairs>([&](auto q) {
        const V direct = sums.at[q.value][i.value], crossed = exchanged(sums.at[q.value][row_vectors + i.value]);
        c.at[2 * q.value][i.value] = even_odd(direct, crossed);
        c.at[2 * q.value + 1][i.value] = even_odd(crossed, direct);
      });
      if constexpr (pairs < operands) c.at[columns - 1][i.value] = sums.at[pairs][i.value];
    });
  }
};

// The scheme of a type, family and width. An odd number of single precision columns is not paired.
template <class T, Family family, int columns>
struct SchemeOf : Replicated<T, columns> {};
template <>
struct SchemeOf<float, Family::sse41, 4> : StagedPairs<float, 4> {};
template <>
struct SchemeOf<float, Family::sse41, 2> : StagedPairs<float, 2> {};
template <int columns>
struct SchemeOf<double, Family::sse41, columns> : ShuffledPairs<columns> {};
template <class R, int columns>
struct SchemeOf<Complex<R>, Family::sse41, columns> : StagedPairs<Complex<R>, columns> {};

// The one for so many rows that a stage pays which a few do without: it saves the tile of each four rows a sixteenth at
// best, and costs what a third of a tile does.
constexpr QtbInt rows_for_stage = 64;
template <class T, Family family, int columns>
struct SchemeOfMany : SchemeOf<T, family, columns> {};
template <int columns>
requires(columns % 2 == 0) struct SchemeOfMany<double, Family::sse41, columns> : CrossedPairs<columns> {
};

// ---- The stage ----

// What a pass over a micro-panel of B asks for ahead of itself: the panel, which is not needed again, and the stage.
constexpr QtbInt panel_ahead_bytes = 512, stage_ahead_bytes = 1024;

// A whole micro-panel, each vector of it in all orders; count real parts.
template <const auto &orders, class R>
void stage_panel(QtbInt count, const R *bp, R *stage) {
  constexpr int step = static_cast<int>(lanes<R>), vectors_per_line = static_cast<int>(line_bytes / vector_bytes);
  constexpr int copies = static_cast<int>(sizeof(orders) / sizeof(orders[0]));
  const auto stage_vector = [&](QtbInt e) {
    const auto v = load_aligned(bp + e);
    repeat<copies>([&](auto s) { store_aligned(stage + e * copies + s.value * step, reordered<orders[s.value]>(v)); });
  };
  QtbInt e = 0;
  for (; e + vectors_per_line * step <= count; e += vectors_per_line * step) {
    prefetch<_MM_HINT_NTA>(bp + e, panel_ahead_bytes);
    for (int line = 0; line < copies; line++)
      prefetch<_MM_HINT_T0>(stage + e * copies, stage_ahead_bytes + line * line_bytes);
    repeat<vectors_per_line>([&](auto v) { stage_vector(e + v.value * step); });
  }
  for (; e < count; e += step) stage_vector(e);
}

// The same from op(B) as it lies in memory, for a real type: element (l, j) is at l*row_step + j*column_step.
template <int width, class R>
void stage_in_place(QtbInt depth, QtbInt kp, const R *b, QtbInt row_step, QtbInt column_step, R *stage) {
  constexpr int step = static_cast<int>(lanes<R>);
  for (QtbInt l = 0; l < depth; l++, b += row_step, stage += width * step)
    repeat<width>(
        [&](auto j) { store_aligned(stage + j.value * step, broadcast(load_single(b + j.value * column_step))); });
  for (QtbInt i = depth * width; i < kp * width; i++, stage += step) store_aligned(stage, zero<R>());
}

// ---- Tiles ----

// How far ahead of its reads the depth loop asks for A, and a tile for the rows of C below it, by family.
constexpr QtbInt rows_ahead_bytes = 1536;
template <Family family>
constexpr QtbInt c_ahead_bytes = family == Family::sse41 ? 32 : 40;

// sums += two steps of depth, whose rows are one cache line.
//
// 16 products and sums in as few instructions as the two-operand form allows: a product destroys a factor, a copy of it
// unless this is its last use. Operands in registers cost an instruction for the load and one for the copy, operands in
// memory two loads within the multiplications. By turns they fill neither the six places per cycle that a processor has
// for such instructions, nor its two loads.
template <class Scheme, int line, class R, class T, int operands, int forms>
[[gnu::always_inline]] inline void multiply_add_line(const R *a, const R *panel, const R *stage,
                                                     Grid<T, operands, forms> &sums) {
  constexpr int step = static_cast<int>(lanes<R>);
  prefetch<_MM_HINT_T0>(a, rows_ahead_bytes);
  repeat<2>([&](auto k) __attribute__((always_inline)) {
    const RowVectors<T, forms> rows = Scheme::load_rows(a + k.value * row_vectors * step);
    repeat<operands>([&](auto j) __attribute__((always_inline)) {
      constexpr bool in_memory = Scheme::in_memory(j.value);
      const R *const b = Scheme::template operand<j.value>(2 * line + k.value, panel, stage);
      Vec<T> operand;
      if constexpr (!in_memory) {
        operand = Scheme::template load_b<j.value>(b);
        keep_in_place(operand);
      }
      repeat<Scheme::products(j.value)>([&](auto i) __attribute__((always_inline)) {
        Vec<T> product = rows.at[i.value];
        if constexpr (in_memory)
          multiply_by_memory(product, b);
        else
          product = mul(operand, product);
        add_to(sums.at[j.value][i.value], product);
      });
    });
  });
}

// The address waits for a sum of the line before, so that compilers keep lines of depth in their order. Left alone they
// gather the prefetches of straight-line code at its start, and mix two lines into a worse order than either has.
template <class R, class V>
[[gnu::always_inline]] inline void keep_apart(const R *&address, V &sum) {
  __asm__("" : "+r"(address), "+x"(sum));
}

// The rows of A against one micro-panel, by what a scheme reads of it and of its stage. fixed_lines > 0: of that many
// lines, in straight-line code; otherwise each turn takes the least depth that kp is a multiple of.
template <class T, Family family, class Scheme, bool aligned, int fixed_lines>
[[gnu::noinline, gnu::flatten]] void multiply_rows(QtbInt m, QtbInt kp, const T *ap, QtbInt ldap, const Real<T> *panel,
                                                   const Real<T> *stage, T *c, QtbInt ldc) {
  using R = Real<T>;
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr int width = Scheme::width;
  constexpr int lines_per_turn = static_cast<int>(rules.ku) / 2, step = static_cast<int>(lanes<R>);
  constexpr QtbInt line = line_bytes / static_cast<QtbInt>(sizeof(R));
  for (; m > 0; m -= rules.mr, ap += ldap, c += rules.mr) {
    repeat<width>([&](auto j) __attribute__((always_inline)) {
      prefetch<(family == Family::sse41 ? _MM_HINT_NTA : _MM_HINT_T0)>(c + j.value * ldc, c_ahead_bytes<family>);
    });
    Grid<T, Scheme::operands, Scheme::row_forms> sums;
    repeat<Scheme::operands>([&](auto j) __attribute__((always_inline)) {
      repeat<Scheme::products(j.value)>([&](auto i)
                                            __attribute__((always_inline)) { sums.at[j.value][i.value] = zero<T>(); });
    });
    const R *a = parts(ap), *direct = panel, *staged = stage;
    if constexpr (fixed_lines > 0) {
      QTB_WRITTEN_OUT
      for (int l = 0; l < fixed_lines; l++) {
        multiply_add_line<Scheme, 0>(a, direct, staged, sums);
        // Offsets of one byte: the speed of straight-line code is that at which it can be fetched.
        a += line;
        staged += 2 * Scheme::stage_step;
        keep_apart(a, sums.at[0][0]);
        keep_apart(staged, sums.at[0][0]);
      }
    } else {
      for (QtbInt left = kp; left > 0; left -= rules.ku) {
        repeat<lines_per_turn>([&](auto l) __attribute__((always_inline)) {
          multiply_add_line<Scheme, l.value>(a + l.value * line, direct, staged, sums);
          keep_apart(a, sums.at[0][0]);
        });
        a += lines_per_turn * line;
        direct += lines_per_turn * 2 * Scheme::panel_step;
        staged += lines_per_turn * 2 * Scheme::stage_step;
      }
    }
    Grid<T, width, row_vectors> columns;
    Scheme::finish(sums, columns);
    repeat<width>([&](auto j) __attribute__((always_inline)) {
      R *column = parts(c + j.value * ldc);
      repeat<row_vectors>([&](auto i) __attribute__((always_inline)) {
        R *p = column + i.value * step;
        if constexpr (!aligned)
          store_unaligned(p, add(columns.at[j.value][i.value], load_unaligned(p)));
        else if constexpr (is_complex<T>)
          store_unaligned(p, add(columns.at[j.value][i.value], load_aligned(p)));
        else
          store_aligned(p, add(columns.at[j.value][i.value], load_aligned(p)));
      });
    });
  }
}

// ---- Column groups ----

// f(Constant<w>()) for the width w of panel_width, at most nr.
template <int nr, class F>
[[gnu::always_inline]] inline void with_width(QtbInt width, F &&f) {
  if constexpr (nr > 1)
    if (width < nr) return with_width<nr - 1>(width, f);
  f(Constant<nr>());
}

template <class T, Family family, bool aligned, int fixed_lines = 0>
void multiply_panels(QTB_INNER_KERNEL_PARAMS(T)) {
  constexpr int nr = static_cast<int>(rules_of<T, family>.nr);
  for (QtbInt width; n > 0; n -= width, bp += ldbp, c += width * ldc) {
    width = panel_width(nr, n);
    with_width<nr>(width, [&](auto w) {
      const auto multiply_by = [&]<class Scheme>(Scheme) {
        if constexpr (Scheme::staged) stage_panel<Scheme::orders>(kp * w.value * parts_of<T>, parts(bp), parts(stage));
        multiply_rows<T, family, Scheme, aligned, fixed_lines>(m, kp, ap, ldap, parts(bp), parts(stage), c, ldc);
      };
      using Few = SchemeOf<T, family, w.value>;
      using Many = SchemeOfMany<T, family, w.value>;
      if constexpr (Few::staged)
        multiply_by(Few());
      else if (m < rows_for_stage || stage == nullptr)
        multiply_by(Few());
      else
        multiply_by(Many());
    });
  }
}

template <class T, bool aligned>
void multiply_in_place(QTB_IN_PLACE_KERNEL_PARAMS(T)) {
  constexpr GemmRules rules = rules_of<T, Family::base>;
  constexpr int nr = static_cast<int>(rules.nr);
  const QtbInt kp = round_up(depth, rules.ku), row_step = transb ? ldb : 1, column_step = transb ? 1 : ldb;
  for (QtbInt width; n > 0; n -= width, b += width * column_step, c += width * ldc) {
    width = panel_width(nr, n);
    with_width<nr>(width, [&](auto w) {
      stage_in_place<w.value>(depth, kp, b, row_step, column_step, stage);
      multiply_rows<T, Family::base, SchemeOf<T, Family::base, w.value>, aligned, 0>(m, kp, ap, ldap, nullptr, stage, c,
                                                                                     ldc);
    });
  }
}

// Whether C and all its columns are on 16-byte boundaries.
template <class T>
bool is_aligned(const T *c, QtbInt ldc) {
  return phase(c) == 0 && ldc * static_cast<QtbInt>(sizeof(T)) % vector_bytes == 0;
}

}  // namespace
}  // namespace qtb::QTB_TIER
