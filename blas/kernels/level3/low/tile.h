// The register tile of the GEMM kernels of def and sse3: sums in registers over a depth, and what becomes of them in C.
//
// A tile is seen as real numbers: vectors times columns of accumulators of 16 bytes. Each step of depth loads the
// vectors of A, and for each column one element of B in all lanes, multiplies and adds. Of a complex tile the columns
// are the real and the imaginary parts of two columns of B, in turn: the products with either are summed apart, and are
// combined once, when the depth is done. Two such passes make a tile of four complex columns, whose sums would not fit
// the registers at once.
//
// The depth is written out in full, as far as a panel of these tiers can reach: once for panels of exactly that depth,
// and once with a test after each step. Edges of C take a loop.
#pragma once

#include "blas/kernels/plain/plain.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

template <class R, int vectors, int columns>
struct Sums {
  Vec<R> v[columns][vectors];
};

// Where the steps of A and B come from: load(i) is vector i of A, or column i of B in all lanes, at the present step,
// or times(a, i) its product with a; next() goes on to the next step. paced: the address of a step is not known to the
// compiler before the sums of the step before. Left alone, it computes the addresses of all steps ahead of the first
// and spills them, or asks for all lines of a panel at once.

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
  static constexpr bool paced = false, is_operand = false;
  const R *at;
  [[gnu::always_inline]] Vec<R> load(int j) const { return load_aligned(at + j * lanes<R>); }
  [[gnu::always_inline]] void next() { at += columns * lanes<R>; }
};

// The same where a column serves a single product: its vector stays a memory operand of the multiplication. Compilers
// load it into a register first, and such loads compete with the products and sums; operands do not.
[[gnu::always_inline]] inline __m128d times_at(__m128d a, const double *at) {
  __asm__("mulpd %1, %0" : "+x"(a) : "m"(*reinterpret_cast<const __m128d *>(at)));
  return a;
}
template <int columns>
struct OperandB {
  static constexpr bool paced = true, is_operand = true;
  const double *at;
  [[gnu::always_inline]] __m128d times(__m128d a, int j) const { return times_at(a, at + j * lanes<double>); }
  [[gnu::always_inline]] void next() { at += columns * lanes<double>; }
  [[gnu::always_inline]] const double *&pace() { return at; }
};

template <class R, int vectors, int columns, class A, class B>
[[gnu::always_inline]] inline void add_step(Sums<R, vectors, columns> &sums, A &from_a, B &from_b) {
  Vec<R> a[vectors];
  for (int v = 0; v < vectors; v++) a[v] = from_a.load(v);
  for (int j = 0; j < columns; j++) {
    const auto add_products = [&](auto product) __attribute__((always_inline)) {
      for (int v = 0; v < vectors; v++) {
        sums.v[j][v] = add(sums.v[j][v], product(a[v]));
        keep_in_place(sums.v[j][v]);
      }
    };
    if constexpr (B::is_operand) {
      add_products([&](Vec<R> x) __attribute__((always_inline)) { return from_b.times(x, j); });
    } else {
      Vec<R> b = from_b.load(j);
      keep_in_place(b);
      add_products([&](Vec<R> x) __attribute__((always_inline)) { return mul(b, x); });
    }
  }
  from_a.next();
  from_b.next();
  Vec<R> &last = sums.v[columns - 1][vectors - 1];
  if constexpr (A::paced) __asm__("" : "+r"(from_a.pace()), "+x"(last));
  if constexpr (B::paced) __asm__("" : "+r"(from_b.pace()), "+x"(last));
}

// How the steps of a depth are written: all of longest steps, up to longest with a test after each, all of longest in a
// loop of four steps per turn, any depth in such a loop, or in one of a step per turn.
enum class Steps { all, some, all_by_fours, fours, any };

// The sums over a depth of at least one step. Steps::all and Steps::all_by_fours take longest for the depth.
template <class R, int vectors, int columns, Steps steps, int longest, class A, class B>
[[gnu::always_inline]] inline Sums<R, vectors, columns> sums_over(QtbInt depth, A a, B b) {
  Sums<R, vectors, columns> sums;
  for (int j = 0; j < columns; j++)
    for (int v = 0; v < vectors; v++) sums.v[j][v] = zero<R>();
  if constexpr (steps == Steps::any) {
    for (QtbInt l = 0; l < depth; l++) add_step(sums, a, b);
  } else if constexpr (steps == Steps::fours || steps == Steps::all_by_fours) {
    const QtbInt end = steps == Steps::all_by_fours ? longest : depth;
    for (QtbInt l = 0; l < end; l += 4) {
      add_step(sums, a, b);
      add_step(sums, a, b);
      add_step(sums, a, b);
      add_step(sums, a, b);
    }
  } else {
    for (;; depth -= longest) {
      QTB_WRITTEN_OUT
      for (int l = 0; l < longest; l++) {
        add_step(sums, a, b);
        if (steps == Steps::some && l + 1 == depth) return sums;
      }
      if constexpr (steps == Steps::all) return sums;
    }
  }
  if constexpr (steps != Steps::all && steps != Steps::some) return sums;
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
