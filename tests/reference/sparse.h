// The oracle of the sparse vectors: dots in 113 bits with their gauge; everything else element by element in the order
// of the compressed vector, in the element's own precision, where a result is judged bit by bit.
#pragma once

#include <cstring>
#include <vector>

#include "tests/support/bounds.h"

namespace qtb::reference {

using test::Quad;
using test::QuadComplex;

struct SparseDot {
  QuadComplex value;
  Quad gauge = 0;
  double roundings = 0;
};

template <class T>
SparseDot doti(const std::vector<T> &x, const std::vector<QtbInt> &indx, const std::vector<T> &y, bool conjugate) {
  SparseDot dot;
  for (std::size_t k = 0; k < x.size(); ++k) {
    QuadComplex u = test::widen(x[k]);
    const QuadComplex v = test::widen(y[static_cast<std::size_t>(indx[k] - 1)]);
    if (conjugate) u.im = -u.im;
    dot.value.re += u.re * v.re - u.im * v.im;
    dot.value.im += u.re * v.im + u.im * v.re;
    dot.gauge += test::magnitude(u) * test::magnitude(v);
  }
  dot.roundings = static_cast<double>(is_complex<T> ? 2 * x.size() : x.size());
  return dot;
}

template <class T>
T product(T a, T x) {
  if constexpr (is_complex<T>)
    return {a.re * x.re - a.im * x.im, a.re * x.im + a.im * x.re};
  else
    return a * x;
}
template <class T>
T sum(T a, T b) {
  if constexpr (is_complex<T>)
    return {a.re + b.re, a.im + b.im};
  else
    return a + b;
}

template <class T>
void axpyi(T a, const std::vector<T> &x, const std::vector<QtbInt> &indx, std::vector<T> &y) {
  for (std::size_t k = 0; k < x.size(); ++k) {
    T &target = y[static_cast<std::size_t>(indx[k] - 1)];
    target = sum(target, product(a, x[k]));
  }
}

template <class T>
void roti(std::vector<T> &x, const std::vector<QtbInt> &indx, std::vector<T> &y, T c, T s) {
  for (std::size_t k = 0; k < x.size(); ++k) {
    T &target = y[static_cast<std::size_t>(indx[k] - 1)];
    const T t = target;
    target = c * t - s * x[k];
    x[k] = c * x[k] + s * t;
  }
}

// Moves of bits: element values are never looked at.
template <class T>
void gthr(const std::vector<T> &y, std::vector<T> &x, const std::vector<QtbInt> &indx) {
  for (std::size_t k = 0; k < x.size(); ++k)
    std::memcpy(static_cast<void *>(&x[k]), &y[static_cast<std::size_t>(indx[k] - 1)], sizeof(T));
}
template <class T>
void gthrz(std::vector<T> &y, std::vector<T> &x, const std::vector<QtbInt> &indx) {
  for (std::size_t k = 0; k < x.size(); ++k) {
    T *source = &y[static_cast<std::size_t>(indx[k] - 1)];
    std::memcpy(static_cast<void *>(&x[k]), source, sizeof(T));
    std::memset(static_cast<void *>(source), 0, sizeof(T));
  }
}
template <class T>
void sctr(const std::vector<T> &x, const std::vector<QtbInt> &indx, std::vector<T> &y) {
  for (std::size_t k = 0; k < x.size(); ++k)
    std::memcpy(static_cast<void *>(&y[static_cast<std::size_t>(indx[k] - 1)]), &x[k], sizeof(T));
}

}  // namespace qtb::reference
