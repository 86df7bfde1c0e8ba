// A few columns of B and the triangle's columns on their right, row by row: the core of all kernels from the right.
//
// From the right, op(T) acts on the columns of B. Whatever the form, columns are counted here so that a column takes
// from those before it: RightTriangle has the order and the strides for it, which are negative where op(T) is a lower
// triangle.
#pragma once

#include "blas/kernels/level3/gemm/sums.h"
#include "blas/kernels/level3/triangular/corner.h"
#include "blas/kernels/level3/triangular/form.h"

namespace qtb::QTB_TIER {
namespace {

// Element (l, e) of the triangle, and where the columns of B stand.
template <class T>
struct RightTriangle {
  ByElement<T> t;
  T *b;
  QtbInt ldb;

  RightTriangle(const TriForm &form, QtbInt n, const T *a, QtbInt lda, T *first, QtbInt step)
      : t{a, form.op == Op::none ? 1 : lda, form.op == Op::none ? lda : 1, form.op == Op::conjugate},
        b(first),
        ldb(step) {
    if (is_upper(form)) return;
    t.y += (n - 1) * (1 + lda);
    b += (n - 1) * ldb;
    t.by_depth = -t.by_depth, t.by_element = -t.by_element, ldb = -ldb;
  }
  ByElement<T> corner(QtbInt column) const {
    return {t.y + column * (t.by_depth + t.by_element), t.by_depth, t.by_element, t.conjugated};
  }
};

// vectors of rows of n columns; the last vector holds last elements. depth columns stand before them, from ahead on;
// y is the triangle's element that column 0 of these meets in column 0.
template <bool solves, int n, int vectors, int last, bool has_depth, class T>
[[gnu::always_inline]] inline void right_tile(const Corner<solves, T, n> &corner, QtbInt depth, const T *ahead,
                                              ByElement<T> y, const Factor<T> *alpha, T *b, QtbInt ldb) {
  Sums<vectors, n, last, T> sums;
  if constexpr (has_depth) {
    sums.clear();
    for (QtbInt l = 0; l < depth; l++) sums.add_step(ahead + l * ldb, y.y + l * y.by_depth, y.by_element);
  }
  Vec<T> x[n][vectors];
  repeat<n>([&](auto e) __attribute__((always_inline)) {
    repeat<vectors>([&](auto v) __attribute__((always_inline)) {
      constexpr int count = count_of<vectors, last, T>(v.value);
      x[e.value][v.value] = load_part<count>(static_cast<const T *>(b + e.value * ldb + v.value * lanes<T>));
      if constexpr (has_depth && solves)
        x[e.value][v.value] = sub(x[e.value][v.value], sums.total(v.value, e.value, false, y.conjugated));
    });
  });
  corner.apply(x);
  repeat<n>([&](auto e) __attribute__((always_inline)) {
    repeat<vectors>([&](auto v) __attribute__((always_inline)) {
      constexpr int count = count_of<vectors, last, T>(v.value);
      if constexpr (has_depth && !solves) {
        Vec<T> sum = sums.total(v.value, e.value, false, y.conjugated);
        if (alpha != nullptr) sum = alpha->times(sum);
        x[e.value][v.value] = add(x[e.value][v.value], sum);
      }
      store_part<count>(b + e.value * ldb + v.value * lanes<T>, x[e.value][v.value]);
    });
  });
}

// All m rows of n columns that begin at column of the triangle. alpha: null where it is 1, and in a solve.
template <bool solves, int n, int vectors, bool has_depth, class T>
[[gnu::noinline]] void right_columns(const RightTriangle<T> &r, bool unit, QtbInt m, QtbInt column, const T *alpha) {
  Corner<solves, T, n> corner;
  corner.load(r.corner(column), unit, alpha);
  const Factor<T> factor(alpha != nullptr ? *alpha : T{});
  const Factor<T> *const scale_sums = alpha != nullptr ? &factor : nullptr;
  ByElement<T> y = r.t;
  y.y += column * y.by_element;
  const T *ahead = r.b;
  T *b = r.b + column * r.ldb;
  constexpr int whole = static_cast<int>(lanes<T>);
  const auto take = [&](auto count, auto last) __attribute__((always_inline)) {
    right_tile<solves, n, count.value, last.value, has_depth>(corner, column, ahead, y, scale_sums, b, r.ldb);
    constexpr QtbInt taken = (count.value - 1) * whole + last.value;
    m -= taken, ahead += taken, b += taken;
  };
  while (m >= vectors * whole) take(Constant<vectors>(), Constant<whole>());
  if constexpr (vectors > 1)
    if (m >= whole) take(Constant<1>(), Constant<whole>());
  if constexpr (whole > 1)
    if (m > 0) with_count<whole - 1>(m, [&](auto last) { take(Constant<1>(), last); });
}

}  // namespace
}  // namespace qtb::QTB_TIER
