// Single elements: access at any address, magnitude, square root.
//
// Kernels take vectors at addresses that are no multiple of the element width. A plain access would promise the
// compiler such a multiple, and a loop that it vectorises on that promise would trap; these accesses promise nothing.
#pragma once

#include <emmintrin.h>

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {
namespace {

// A copy of *p, bit by bit.
template <class T>
T element(const T *p) {
  T v;
  __builtin_memcpy(&v, p, sizeof v);
  return v;
}

template <class T>
void set_element(T *p, T v) {
  __builtin_memcpy(p, &v, sizeof v);
}

// The two parts of complex element x, as an array.
template <class T>
const Real<T> *parts(const T *x) {
  return reinterpret_cast<const Real<T> *>(x);
}
template <class T>
Real<T> *parts(T *x) {
  return reinterpret_cast<Real<T> *>(x);
}

// |v| by clearing the sign bit: exact, and the absolute value of a NaN is that NaN without a sign.
inline float absolute(float v) { return __builtin_fabsf(v); }
inline double absolute(double v) { return __builtin_fabs(v); }

inline float square_root(float v) { return _mm_cvtss_f32(_mm_sqrt_ss(_mm_set_ss(v))); }
inline double square_root(double v) {
  const __m128d w = _mm_set_sd(v);
  return _mm_cvtsd_f64(_mm_sqrt_sd(w, w));
}

}  // namespace
}  // namespace qtb::QTB_TIER
