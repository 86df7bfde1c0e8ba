// Corner: a small triangle on the diagonal and what it does to a few vectors, straight-line for each size.
//
// Vector x[e] is a column of B where the triangle stands on the right, a row of B where it stands on the left; element
// (l, e) of the triangle, l <= e, is what x[l] gives to x[e]. Product: x[e] := sum over l of c(l, e)*x[l], from the
// last e down; solve: x[e] := (x[e] - sum over l < e of c(l, e)*x[l]) / c(e, e), from the first e up.
#pragma once

#include "blas/kernels/level3/gemm/small.h"
#include "blas/kernels/level3/triangular/vector_divisor.h"

namespace qtb::QTB_TIER {
namespace {

// An element of a triangle in all lanes.
template <class T>
struct Coefficient {
  Vec<T> value;
  void set(T v) { value = broadcast(v); }
  Vec<T> times(Vec<T> x) const { return mul(value, x); }
};
template <class R>
struct Coefficient<Complex<R>> {
  Vec<R> re, im;
  void set(Complex<R> v) {
    re = broadcast(v.re);
    im = alternate(-v.im, v.im);
  }
  Vec<R> times(Vec<R> x) const { return add(mul(re, x), mul(im, swap_parts(x))); }
};

// An element at any address, in its parts.
template <class T>
T read_element(const ByElement<T> &t, QtbInt l, QtbInt e) {
  const Real<T> *p = parts(t.y + l * t.by_depth + e * t.by_element);
  if constexpr (is_complex<T>)
    return {load_single(p), t.conjugated ? -load_single(p + 1) : load_single(p + 1)};
  else
    return load_single(p);
}

template <bool solves, class T, int n>
struct Corner;

template <class T, int n>
struct Corner<false, T, n> {
  Coefficient<T> c[n][n];
  bool plain_diagonal;  // of nothing but 1

  // An alpha, unless it is null, goes into the coefficients.
  [[gnu::noinline]] void load(const ByElement<T> &t, bool unit, const T *alpha) {
    plain_diagonal = unit && alpha == nullptr;
    for (int e = 0; e < n; e++)
      for (int l = 0; l <= e; l++) {
        if (unit && l == e) {
          c[e][e].set(alpha != nullptr ? *alpha : T{});
        } else {
          const T v = read_element(t, l, e);
          c[l][e].set(alpha != nullptr ? *alpha * v : v);
        }
      }
  }
  template <int vectors>
  [[gnu::always_inline]] void apply(Vec<T> (&x)[n][vectors]) const {
    repeat<n>([&](auto turn) __attribute__((always_inline)) {
      constexpr int e = n - 1 - turn.value;
      if (!plain_diagonal)
        repeat<vectors>([&](auto v) __attribute__((always_inline)) { x[e][v.value] = c[e][e].times(x[e][v.value]); });
      repeat<e>([&](auto l) __attribute__((always_inline)) {
        repeat<vectors>([&](auto v) __attribute__((always_inline)) {
          x[e][v.value] = add(x[e][v.value], c[l.value][e].times(x[l.value][v.value]));
        });
      });
    });
  }
};

template <class T, int n>
struct Corner<true, T, n> {
  Coefficient<T> c[n][n];
  VectorDivisor<T> divisor[n];
  bool unit;

  [[gnu::noinline]] void load(const ByElement<T> &t, bool unit_diagonal, const T *) {
    unit = unit_diagonal;
    for (int e = 0; e < n; e++) {
      for (int l = 0; l < e; l++) c[l][e].set(read_element(t, l, e));
      if (!unit) divisor[e].set(read_element(t, e, e));
    }
  }
  template <int vectors>
  [[gnu::always_inline]] void apply(Vec<T> (&x)[n][vectors]) const {
    repeat<n>([&](auto column) __attribute__((always_inline)) {
      constexpr int e = column.value;
      repeat<e>([&](auto l) __attribute__((always_inline)) {
        repeat<vectors>([&](auto v) __attribute__((always_inline)) {
          x[e][v.value] = sub(x[e][v.value], c[l.value][e].times(x[l.value][v.value]));
        });
      });
      if (!unit)
        repeat<vectors>([&](auto v)
                            __attribute__((always_inline)) { x[e][v.value] = divisor[e].divide(x[e][v.value]); });
    });
  }
};

}  // namespace
}  // namespace qtb::QTB_TIER
