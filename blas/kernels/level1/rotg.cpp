// Generation of plane rotations: c and s with (c s; -conj(s) c) * (a; b) = (r; 0), c real.
//
// Real: a becomes r and b becomes z, from which c and s can be recovered: s if |a| > |b|, else 1/c, or 1 where c is 0.
// Complex: a becomes r; b is only read. The formulas are evaluated as they stand: real ones are safe from overflow and
// underflow by their scale, complex ones take the moduli of a and b directly. Nothing tests for infinities and NaNs.

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
void generate_real(T *a, T *b, T *c, T *s) {
  const T va = load_single(a), vb = load_single(b);
  const T p = absolute(va), q = absolute(vb);
  const T scale = p + q;
  if (scale == 0) {
    store_single(c, T(1));
    store_single(s, T(0));
    store_single(a, T(0));
    store_single(b, T(0));
    return;
  }
  const T ratio_a = va / scale, ratio_b = vb / scale;
  const T length = scale * square_root(ratio_a * ratio_a + ratio_b * ratio_b);
  const T r = (p > q ? va : vb) < 0 ? -length : length;
  const T cosine = va / r, sine = vb / r;
  T z = p > q ? sine : T(1);
  if (q >= p && cosine != 0) z = T(1) / cosine;
  store_single(c, cosine);
  store_single(s, sine);
  store_single(a, r);
  store_single(b, z);
}

template <class T>
T modulus(Complex<T> v) {
  return square_root(v.re * v.re + v.im * v.im);
}

template <class T>
Complex<T> multiply(Complex<T> u, Complex<T> v) {
  return {u.re * v.re - u.im * v.im, u.re * v.im + u.im * v.re};
}

template <class T>
Complex<T> divide(Complex<T> u, Complex<T> v) {
  const T norm = v.re * v.re + v.im * v.im;
  return {(u.re * v.re + u.im * v.im) / norm, (u.im * v.re - u.re * v.im) / norm};
}

// u / v for a real v. In single precision the tiers above def divide as complex numbers in double and round once more,
// which shows in the last bit only.
template <class T>
Complex<T> divide_by_real(Complex<T> u, T v) {
  if constexpr (sizeof(T) == sizeof(float) && this_tier >= tier_sse3) {
    const cdouble wide = divide(cdouble{double(u.re), double(u.im)}, cdouble{double(v), 0.0});
    return {static_cast<T>(wide.re), static_cast<T>(wide.im)};
  } else {
    return {u.re / v, u.im / v};
  }
}

template <class T>
T square(T v) {
  return v * v;
}

template <class R, class T = Complex<R>>
void generate_complex(T *ca, T *cb, R *c, T *s) {
  const T a = load_single(ca), b = load_single(cb);
  const R abs_a = modulus(a);
  if (abs_a == 0) {
    store_single(c, R(0));
    store_single(s, T{1, 0});
    store_single(ca, b);
    return;
  }
  const R scale = modulus(b) + abs_a;
  const R squares = square(a.re / scale) + square(a.im / scale) + square(b.re / scale) + square(b.im / scale);
  const R norm = scale * square_root(squares);
  const T alpha = divide_by_real(a, abs_a);
  store_single(c, abs_a / norm);
  store_single(s, divide_by_real(multiply(alpha, T{b.re, -b.im}), norm));
  store_single(ca, T{alpha.re * norm, alpha.im * norm});
}

}  // namespace

QTB_KERNEL(srotg, rotg, float, generate_real)
QTB_KERNEL(drotg, rotg, double, generate_real)
QTB_KERNEL(crotg, rotg, cfloat, generate_complex)
QTB_KERNEL(zrotg, rotg, cdouble, generate_complex)

}  // namespace qtb::QTB_TIER
