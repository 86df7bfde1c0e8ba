// VectorDivisor: what vectors of elements are divided by.
//
// Single complex quotients are computed in double precision, by the squared magnitude, and rounded once. Double complex
// ones are scaled by the larger part of the divisor, so that no square overflows: the ratio of the parts is taken once,
// and each element is divided by one sum.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

inline __m128 div(__m128 a, __m128 b) { return _mm_div_ps(a, b); }
inline __m128d div(__m128d a, __m128d b) { return _mm_div_pd(a, b); }

template <class T>
struct VectorDivisor {
  Vec<T> value;
  void set(T v) { value = broadcast(v); }
  Vec<T> divide(Vec<T> x) const { return div(x, value); }
};

template <>
struct VectorDivisor<cfloat> {
  __m128d re, im, square;
  void set(cfloat v) {
    const double real = v.re, imaginary = v.im;
    re = broadcast(real);
    im = alternate(imaginary, -imaginary);
    square = broadcast(real * real + imaginary * imaginary);
  }
  __m128d quotient(__m128d x) const { return div(add(mul(x, re), mul(swap_parts(x), im)), square); }
  __m128 divide(__m128 x) const {
    const __m128 low = _mm_cvtpd_ps(quotient(_mm_cvtps_pd(x)));
    const __m128 high = _mm_cvtpd_ps(quotient(_mm_cvtps_pd(_mm_movehl_ps(x, x))));
    return _mm_movelh_ps(low, high);
  }
};

// (x*own + swapped(x)*other) / sum, where one of the factors is 1 and the other the ratio of the parts.
template <>
struct VectorDivisor<cdouble> {
  __m128d own, other, sum;
  void set(cdouble v) {
    const double re = v.re < 0 ? -v.re : v.re, im = v.im < 0 ? -v.im : v.im;
    const bool real_is_larger = re >= im;
    const double larger = real_is_larger ? v.re : v.im, smaller = real_is_larger ? v.im : v.re;
    const double ratio = smaller / larger, with_own = real_is_larger ? 1 : ratio,
                 with_other = real_is_larger ? ratio : 1;
    own = broadcast(with_own);
    other = alternate(with_other, -with_other);
    sum = broadcast(larger + smaller * ratio);
  }
  __m128d divide(__m128d x) const { return div(add(mul(x, own), mul(swap_parts(x), other)), sum); }
};

}  // namespace
}  // namespace qtb::QTB_TIER
