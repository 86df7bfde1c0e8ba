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

template <class R>
R modulus(Complex<R> v) {
  return square_root(v.re * v.re + v.im * v.im);
}

template <class R>
R square(R v) {
  return v * v;
}

// The precision of what follows the norm: the element's in tier def, double in the others, which shows in the last bit
// of a single result only.
template <class R, bool in_double>
struct PrecisionOf {
  using Type = R;
};
template <class R>
struct PrecisionOf<R, true> {
  using Type = double;
};

template <class R>
void generate_complex(Complex<R> *ca, Complex<R> *cb, R *c, Complex<R> *s) {
  using Work = typename PrecisionOf<R, (this_tier > tier_def)>::Type;
  const Complex<R> a = load_single(ca), b = load_single(cb);
  const R abs_a = modulus(a);
  if (abs_a == 0) {
    store_single(c, R(0));
    store_single(s, Complex<R>{1, 0});
    store_single(ca, b);
    return;
  }
  const R scale = modulus(b) + abs_a;
  const R squares = square(a.re / scale) + square(a.im / scale) + square(b.re / scale) + square(b.im / scale);
  const R norm = scale * square_root(squares);
  const Work length = norm, size = abs_a, br = b.re, bi = b.im;
  const Complex<Work> alpha = {Work(a.re) / size, Work(a.im) / size};
  const Complex<Work> product = {alpha.re * br + alpha.im * bi, alpha.im * br - alpha.re * bi};  // alpha * conj(b)
  store_single(c, abs_a / norm);
  store_single(s, Complex<R>{static_cast<R>(product.re / length), static_cast<R>(product.im / length)});
  store_single(ca, Complex<R>{static_cast<R>(alpha.re * length), static_cast<R>(alpha.im * length)});
}

}  // namespace

QTB_KERNEL(srotg, rotg, float, generate_real)
QTB_KERNEL(drotg, rotg, double, generate_real)
QTB_KERNEL(crotg, rotg, cfloat, generate_complex)
QTB_KERNEL(zrotg, rotg, cdouble, generate_complex)

}  // namespace qtb::QTB_TIER
