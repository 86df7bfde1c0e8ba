// Elements as the kernels see them: option letters, the arithmetic of one element, strided vectors.
//
// One template for the four element types and all tiers. Nothing here needs alignment or workspace, and nothing reads
// or writes an element that its caller does not name.
#pragma once

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// op(A): A, its transpose or its conjugate transpose.
enum class Op { none, transpose, conjugate };

// For a real type every letter but N is the transpose; for a complex one every letter but N and T the conjugate.
template <class T>
Op read_op(const char *trans) {
  if (is_letter(*trans, 'N')) return Op::none;
  return is_complex<T> && !is_letter(*trans, 'T') ? Op::conjugate : Op::transpose;
}

// ---- Elements ----

template <class R>
Complex<R> operator-(Complex<R> v) {
  return {-v.re, -v.im};
}
template <class R>
Complex<R> operator+(Complex<R> a, Complex<R> b) {
  return {a.re + b.re, a.im + b.im};
}
template <class R>
Complex<R> operator-(Complex<R> a, Complex<R> b) {
  return {a.re - b.re, a.im - b.im};
}
template <class R>
Complex<R> operator*(Complex<R> a, Complex<R> b) {
  return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
}
// A real factor is never widened: its product with an infinite part stays infinite in that part alone.
template <class R>
Complex<R> operator*(R a, Complex<R> b) {
  return {a * b.re, a * b.im};
}
// Scaled by the larger part of the divisor, so that no square overflows.
template <class R>
Complex<R> operator/(Complex<R> a, Complex<R> b) {
  const R re = b.re < 0 ? -b.re : b.re, im = b.im < 0 ? -b.im : b.im;
  if (re >= im) {
    const R ratio = b.im / b.re, divisor = b.re + b.im * ratio;
    return {(a.re + a.im * ratio) / divisor, (a.im - a.re * ratio) / divisor};
  }
  const R ratio = b.re / b.im, divisor = b.im + b.re * ratio;
  return {(a.re * ratio + a.im) / divisor, (a.im * ratio - a.re) / divisor};
}
template <class R>
void operator+=(Complex<R> &a, Complex<R> b) {
  a = a + b;
}
template <class R>
void operator-=(Complex<R> &a, Complex<R> b) {
  a = a - b;
}

template <class T>
Real<T> real_part(T v) {
  if constexpr (is_complex<T>)
    return v.re;
  else
    return v;
}
// A Hermitian diagonal element: the stored imaginary part counts for nothing.
template <class T>
T real_only(T v) {
  if constexpr (is_complex<T>)
    return {v.re, 0};
  else
    return v;
}
template <class T>
T conjugate(T v) {
  if constexpr (is_complex<T>)
    return {v.re, -v.im};
  else
    return v;
}
template <bool conjugated, class T>
T conjugate_if(T v) {
  return conjugated ? conjugate(v) : v;
}

// ---- Vectors ----

// Element i of a vector of the interface, counted along its direction.
template <class T>
struct Vector {
  T *first;
  QtbInt inc;
  T &operator[](QtbInt i) const { return first[i * inc]; }
};

template <class T>
Vector<T> vector(T *x, QtbInt n, QtbInt inc) {
  return {walk_start(x, n, inc), inc};
}

// x := beta*x over n elements. A beta of 0 stores without reading, a beta of 1 does nothing. A complex vector may have
// a real factor.
template <class S, class V>
void scale(QtbInt n, S beta, V x) {
  if (is_one(beta)) return;
  if (is_zero(beta))
    for (QtbInt i = 0; i < n; i++) x[i] = {};
  else
    for (QtbInt i = 0; i < n; i++) x[i] = beta * x[i];
}

}  // namespace
}  // namespace qtb::QTB_TIER
