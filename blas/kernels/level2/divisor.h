// Divisor: an element that others are divided by, by true divisions, with all that depends on it alone made beforehand.
//
// A solve divides at every step by what the step before has left. A complex quotient is scaled by the larger part of
// the divisor, so that no square overflows: of
//
//   (a.re + a.im*ratio)/d, (a.im - a.re*ratio)/d    ratio = im/re, d = re + im*ratio    if |re| >= |im|
//   (a.re*ratio + a.im)/d, (a.im*ratio - a.re)/d    ratio = re/im, d = im + re*ratio    otherwise
//
// the ratio and d are made while the step before is still on its way. Products with one are exact, so that with the
// ratio and one as p and q, in the order of the case, both cases end as (a.re*p + a.im*q)/d, (a.im*p - a.re*q)/d.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

// One division for both parts; the upper lanes do the same.
inline cfloat divide_parts(cfloat a, float d) {
  const __m128 v = _mm_unpacklo_ps(_mm_set1_ps(a.re), _mm_set1_ps(a.im)), w = _mm_div_ps(v, _mm_set1_ps(d));
  return {_mm_cvtss_f32(w), _mm_cvtss_f32(_mm_shuffle_ps(w, w, 1))};
}
inline cdouble divide_parts(cdouble a, double d) {
  const __m128d w = _mm_div_pd(_mm_set_pd(a.im, a.re), _mm_set1_pd(d));
  return {_mm_cvtsd_f64(w), _mm_cvtsd_f64(_mm_unpackhi_pd(w, w))};
}

template <class T>
struct Divisor {
  T value;
  explicit Divisor(T v) : value(v) {}
  T divide(T a) const { return a / value; }
};
template <class R>
struct Divisor<Complex<R>> {
  R p, q, d;
  [[gnu::always_inline]] explicit Divisor(Complex<R> v) {
    if (absolute(v.re) >= absolute(v.im)) {
      p = 1;
      q = v.im / v.re;
      d = v.re + v.im * q;
    } else {
      p = v.re / v.im;
      q = 1;
      d = v.im + v.re * p;
    }
  }
  [[gnu::always_inline]] Complex<R> divide(Complex<R> a) const {
    return divide_parts({a.re * p + a.im * q, a.im * p - a.re * q}, d);
  }
};

}  // namespace
}  // namespace qtb::QTB_TIER
