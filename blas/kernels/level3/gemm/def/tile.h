// The register tile of the GEMM kernels of def and sse3: sums in registers over a depth, and what becomes of them in C.
//
// A tile is seen as real numbers: vectors times columns of accumulators of 16 bytes. Each step of depth loads the
// vectors of A, and for each column one element of B in all lanes, multiplies and adds. Of a complex tile the columns
// are the real and the imaginary parts of two columns of B, in turn: the products with either are summed apart, and are
// combined once, when the depth is done. Two such passes make a tile of four complex columns, whose sums would not fit
// the registers at once.
//
// The steps stand in a row of sixteen, which a loop repeats, with one of four for what is left. Edges of C take a loop
// around each.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/level3/gemm/def/step.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

template <class R, int vectors, int columns>
struct Sums {
  Vec<R> v[columns][vectors];
};

// Where the steps of A and B come from: load(i) is vector i of A, or column i of B in all lanes, at the present step;
// next() goes on to the next step. paced: the address of a step is not known to the compiler before the sums of the
// step before. Left alone, it computes the addresses of all steps of a row ahead of the first and spills them, or asks
// for all lines at once.

// Micro-panels of A: aligned vectors, in the order of the steps. ahead_bytes: how far ahead of its loads the panel is
// asked for, a cache line per step and with the least claim on the caches; 0: it is not.
template <class R, int vectors, int ahead_bytes>
struct PackedA {
  static constexpr bool paced = ahead_bytes != 0;
  const R *at;
  const char *line;
  explicit PackedA(const R *panel) : at(panel), line(reinterpret_cast<const char *>(panel) + ahead_bytes) {}
  [[gnu::always_inline]] Vec<R> load(int v) const { return load_aligned(at + v * lanes<R>); }
  [[gnu::always_inline]] void next() {
    constexpr int line_bytes = 64;
    if constexpr (ahead_bytes != 0) _mm_prefetch(line, _MM_HINT_T2);
    line += line_bytes;
    at += vectors * lanes<R>;
  }
  [[gnu::always_inline]] const char *&pace() { return line; }
};

// The stage of B: a vector per column and step.
template <class R, int columns>
struct StagedB {
  static constexpr bool paced = false;
  const R *at;
  [[gnu::always_inline]] Vec<R> load(int j) const { return load_aligned(at + j * lanes<R>); }
  [[gnu::always_inline]] void next() { at += columns * lanes<R>; }
};

// Step l of a row. Tiles that matter have forms of their own (step.h), chosen by where their factors come from.
template <class R, int vectors, int columns, class A, class B>
[[gnu::always_inline]] inline void add_step(int, Sums<R, vectors, columns> &sums, const A &from_a, const B &from_b) {
  Vec<R> a[vectors];
  for (int v = 0; v < vectors; v++) a[v] = from_a.load(v);
  for (int j = 0; j < columns; j++) {
    Vec<R> b = from_b.load(j);
    keep_in_place(b);
    for (int v = 0; v < vectors; v++) {
      sums.v[j][v] = add(sums.v[j][v], mul(b, a[v]));
      keep_in_place(sums.v[j][v]);
    }
  }
}

QTB_STEP(add_staged, float, QTB_LAST_COLUMN, "ps", "movaps", "movaps")
QTB_STEP(add_staged, double, QTB_LAST_COLUMN, "pd", "movaps", "movaps")

template <class R, int ahead_bytes>
[[gnu::always_inline]] inline void add_step(int, Sums<R, 2, 4> &sums, const PackedA<R, 2, ahead_bytes> &from_a,
                                            const StagedB<R, 4> &from_b) {
  add_staged(sums.v, from_a.at, from_b.at, lanes<R>);
}

// Steps in a row. A loop of fewer loses two cycles per turn to its jump; far more, such as a whole depth, run at
// anything from a third of the speed up, as the code happens to lie in memory.
constexpr int steps_in_row = 16, steps_in_short_row = 4;

template <int count, class R, int vectors, int columns, class A, class B>
[[gnu::always_inline]] inline void add_steps(Sums<R, vectors, columns> &sums, A &a, B &b) {
  QTB_WRITTEN_OUT
  for (int l = 0; l < count; l++) {
    add_step(l, sums, a, b);
    a.next();
    b.next();
    Vec<R> &last = sums.v[columns - 1][vectors - 1];
    if constexpr (A::paced) __asm__("" : "+r"(a.pace()), "+x"(last));
    if constexpr (B::paced) __asm__("" : "+r"(b.pace()), "+x"(last));
  }
}

// What is known of a depth: all of it, that it is a multiple of four, or nothing.
enum class Steps { all, fours, any };

// The sums over a depth. Steps::all takes longest for the depth.
template <class R, int vectors, int columns, Steps steps, int longest, class A, class B>
[[gnu::always_inline]] inline Sums<R, vectors, columns> sums_over(QtbInt depth, A a, B b) {
  Sums<R, vectors, columns> sums;
  for (int j = 0; j < columns; j++)
    for (int v = 0; v < vectors; v++) sums.v[j][v] = zero<R>();
  if constexpr (steps == Steps::all) {
    static_assert(longest % steps_in_row == 0);
    for (int l = 0; l < longest; l += steps_in_row) add_steps<steps_in_row>(sums, a, b);
  } else {
    for (; depth >= steps_in_row; depth -= steps_in_row) add_steps<steps_in_row>(sums, a, b);
    for (; depth >= steps_in_short_row; depth -= steps_in_short_row) add_steps<steps_in_short_row>(sums, a, b);
    if constexpr (steps == Steps::any)
      for (; depth > 0; depth--) add_steps<1>(sums, a, b);
  }
  return sums;
}

// Where a micro-panel of B lies: element (l, j) at first[l*step + j*column].
template <class R>
struct SourceB {
  const R *first;
  QtbInt depth, step, column;
};

// The stage of so many columns, filled up with zeros from the depth to kp.
template <class R, int columns>
void fill_stage(QtbInt kp, SourceB<R> b, R *stage) {
  const R *from = b.first;
  for (QtbInt l = 0; l < b.depth; l++, from += b.step)
    for (int j = 0; j < columns; j++, stage += lanes<R>)
      store_aligned(stage, broadcast(load_single(from + j * b.column)));
  for (QtbInt i = b.depth * columns; i < kp * columns; i++, stage += lanes<R>) store_aligned(stage, zero<R>());
}

// ---- C ----

// What a kernel makes of C before it adds: nothing, no use of it at all, or its product with beta.
enum class Beta { one, zero, other };

template <class T>
Beta beta_of(T beta) {
  return is_zero(beta) ? Beta::zero : is_one(beta) ? Beta::one : Beta::other;
}

// beta as kernels get it: in the lanes of one vector, or of a complex type two.
template <class T>
struct alignas(vector_bytes) BetaLanes {
  Real<T> lane[(is_complex<T> ? 2 : 1) * parts_per_vector<T>];
  explicit BetaLanes(T beta) {
    constexpr int step = static_cast<int>(parts_per_vector<T>);
    for (int i = 0; i < step; i++) {
      lane[i] = real_part(beta);
      if constexpr (is_complex<T>) lane[step + i] = step == 2 && i == 1 ? -beta.im : beta.im;
    }
  }
};

// The sum of the products with the real parts of B and that of those with the imaginary ones.
inline __m128 negate_odd(__m128 v) { return bit_xor(v, alternate(0.0F, -0.0F)); }
inline __m128d negate_odd(__m128d v) { return bit_xor(v, alternate(0.0, -0.0)); }
template <class V>
V combine(V by_real, V by_imaginary) {
  return add(by_real, swap_parts(negate_odd(by_imaginary)));
}

// C, or its product with beta.
template <class T, Beta beta>
[[gnu::always_inline]] inline Vec<T> times_beta(Vec<T> old, const Real<T> *lanes_of_beta) {
  if constexpr (beta == Beta::one) return old;
  const Vec<T> factor = load_aligned(lanes_of_beta);
  if constexpr (is_complex<T>) {
    const Vec<T> cross = mul(old, load_aligned(lanes_of_beta + parts_per_vector<T>));
    // The lanes of a cdouble's beta have the sign that combine would give.
    if constexpr (lanes<T> == 1)
      return add(mul(old, factor), swap_parts(cross));
    else
      return combine(mul(old, factor), cross);
  } else {
    return mul(old, factor);
  }
}

// C where the next tile of these columns begins: it is asked for before the depth, and there by its end.
template <int columns, int rows, class T>
[[gnu::always_inline]] inline void ask_for_c(const T *c, QtbInt ldc) {
  for (int j = 0; j < columns; j++)
    _mm_prefetch(reinterpret_cast<const char *>(reinterpret_cast<std::uintptr_t>(c + j * ldc) + rows * sizeof(T)),
                 _MM_HINT_NTA);
}

// C from the sums of a tile: columns of C, each of vectors.
template <class T, Beta beta, int vectors, int columns>
[[gnu::always_inline]] inline void store_tile(const Sums<Real<T>, vectors, columns> &sums, T *c, QtbInt ldc,
                                              const Real<T> *lanes_of_beta) {
  constexpr int sums_of_column = is_complex<T> ? 2 : 1;
  for (int j = 0; j < columns / sums_of_column; j++, c += ldc)
    for (int v = 0; v < vectors; v++) {
      Vec<T> sum;
      if constexpr (is_complex<T>)
        sum = combine(sums.v[2 * j][v], sums.v[2 * j + 1][v]);
      else
        sum = sums.v[j][v];
      T *to = c + v * lanes<T>;
      if constexpr (beta != Beta::zero) sum = add(times_beta<T, beta>(load_unaligned(to), lanes_of_beta), sum);
      store_unaligned(to, sum);
    }
}

}  // namespace
}  // namespace qtb::QTB_TIER
