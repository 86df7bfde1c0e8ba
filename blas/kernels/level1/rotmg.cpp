// Generation of modified rotations: H with H * (sqrt(d1)*x1; sqrt(d2)*y1) = (r; 0), in the form that rotm takes.
//
// In: d1, d2, x1, y1. Out: param = flag, h11, h21, h12, h22 as far as the flag needs them (-1: all; 0: h21 and h12; 1:
// h11 and h22; -2: none), and the new d1, d2, x1. y1 is only read. d1 and d2 are kept between 1/gam**2 and gam**2 by
// factors of gam, taken into H and x1.
//
// Reference: Lawson, Hanson, Kincaid and Krogh, Basic Linear Algebra Subprograms for Fortran usage, 1979. On its text
// two things are particular here and stay: the multiplier rgam of single precision, which is not exactly 1/gam, and
// what becomes of a large d2 in the zero-flag form (see rescale_d2).

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
constexpr T gam = 4096;
template <class T>
constexpr T gamsq = 16777216;
template <class T>
constexpr T rgamsq = static_cast<T>(5.960464477539e-8);  // 2**-24 in single, and near it in double
template <class T>
constexpr T rgam = 0.000244140625;  // 1 / gam
template <>
constexpr float rgam<float> = 0.000244141F;
template <class T>
constexpr T infinity = static_cast<T>(__builtin_inf());

template <class T>
struct Matrix {
  T flag = 0, h11 = 0, h21 = 0, h12 = 0, h22 = 0;
};

// Makes every element of H explicit, so that rows can be scaled.
template <class T>
void fix(Matrix<T> &h) {
  if (h.flag > 0) {
    h.h12 = 1;
    h.h21 = -1;
  } else if (h.flag == 0) {
    h.h11 = 1;
    h.h22 = 1;
  }
  h.flag = -1;
}

// A d1 that no factor brings into range is left as it is: an infinity, and a value that the rounding of a determinant
// near 0 made negative.
template <class T>
void rescale_d1(T &d1, T &x1, Matrix<T> &h) {
  const auto scale = [&](T of_d1, T of_row) {
    d1 *= of_d1;
    x1 *= of_row;
    h.h11 *= of_row;
    h.h12 *= of_row;
  };
  if (d1 > 0 && d1 <= rgamsq<T>) {
    fix(h);
    do scale(gamsq<T>, rgam<T>);
    while (d1 <= rgamsq<T>);
  }
  if (d1 >= gamsq<T> && d1 < infinity<T>) {
    fix(h);
    do scale(rgamsq<T>, gam<T>);
    while (d1 >= gamsq<T>);
  }
}

// A large d2 that meets H in the zero-flag form goes through one pass of the scaling of a small one. The result is a
// valid H all the same, at another scale.
template <class T>
void rescale_d2(T &d2, Matrix<T> &h) {
  const auto scale = [&](T of_d2, T of_row) {
    d2 *= of_d2;
    h.h21 *= of_row;
    h.h22 *= of_row;
  };
  const bool large = absolute(d2) >= gamsq<T>;
  if ((d2 != 0 && absolute(d2) <= rgamsq<T>) || (large && h.flag == 0)) {
    fix(h);
    do scale(gamsq<T>, rgam<T>);
    while (absolute(d2) <= rgamsq<T>);
  } else if (large && absolute(d2) < infinity<T>) {
    fix(h);
    do scale(rgamsq<T>, gam<T>);
    while (absolute(d2) >= gamsq<T>);
  }
}

template <class T>
void store(const Matrix<T> &h, T *param) {
  if (h.flag != 0) {
    store_single(param + 1, h.h11);
    store_single(param + 4, h.h22);
  }
  if (h.flag <= 0) {
    store_single(param + 2, h.h21);
    store_single(param + 3, h.h12);
  }
  store_single(param, h.flag);
}

template <class T>
void generate(T *d1, T *d2, T *x1, const T *y1, T *param) {
  T vd1 = load_single(d1), vd2 = load_single(d2), vx1 = load_single(x1);
  const T vy1 = load_single(y1);
  const T p2 = vd2 * vy1, q2 = p2 * vy1;
  Matrix<T> h;
  bool reset = vd1 < 0;
  if (!reset) {
    if (p2 == 0) {
      store_single(param, T(-2));
      return;
    }
    const T p1 = vd1 * vx1;
    if (absolute(vx1 * p1) > absolute(q2)) {
      const T t = vy1 / p1;
      h.h21 = -vd1 * t;
      h.h12 = t * vd2;
      const T u = 1 - h.h12 * h.h21;
      const T reciprocal = 1 / u;
      vx1 *= u;
      vd1 *= reciprocal;
      vd2 *= reciprocal;
    } else if (q2 < 0) {
      reset = true;
    } else {
      const T t = vx1 / p2;
      h.flag = 1;
      h.h11 = vd1 * t;
      h.h22 = vd2 * t;
      const T u = h.h11 * h.h22 + 1;
      const T reciprocal = 1 / u;
      const T old_d1 = vd1;
      vx1 = u * vy1;
      vd1 = vd2 * reciprocal;
      vd2 = old_d1 * reciprocal;
    }
  }
  if (reset) {
    h = {-1, 0, 0, 0, 0};
    vd1 = vd2 = vx1 = 0;
  } else {
    rescale_d1(vd1, vx1, h);
    rescale_d2(vd2, h);
  }
  store_single(d1, vd1);
  store_single(d2, vd2);
  store_single(x1, vx1);
  store(h, param);
}

}  // namespace

QTB_KERNEL(srotmg, rotmg, float, generate)
QTB_KERNEL(drotmg, rotmg, double, generate)

}  // namespace qtb::QTB_TIER
