// Sparse vectors: nz values x at the one-based positions indx of a full vector y.
//
//   axpyi: y[indx[k]-1] += a * x[k]                 doti, dotui, dotci: sum of x[k] * y[indx[k]-1], dotci conjugating x
//   gthr:  x[k] = y[indx[k]-1]                      gthrz: the same, and that element of y becomes 0
//   sctr:  y[indx[k]-1] = x[k]                      roti: a plane rotation of x[k] and y[indx[k]-1]
//
// Elements are worked on in the order of x, each stored before the next is read, so that a repeated position acts on
// what the one before it left. Positions are not tested. nz below 1 does nothing; a dot is then 0. x and y may stand at
// any address. Every access to y goes to an address of its own, so that vectors would gain nothing.

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// f(0) to f(n - 1), in order, two a pass.
template <class F>
[[gnu::always_inline]] inline void for_each_by_two(QtbInt n, const F &f) {
  QtbInt k = 0;
  for (; k + 2 <= n; k += 2) {
    f(k);
    f(k + 1);
  }
  if (k < n) f(k);
}

template <class T>
void add_scaled(const QtbInt *nz, const T *a, const T *x, const QtbInt *indx, T *y) {
  const QtbInt n = *nz;
  if (n < 1) return;
  const T alpha = load_single(a);
  if (alpha == 0) return;
  for_each_by_two(n, [=](QtbInt k) {
    T *target = y + (indx[k] - 1);
    store_single(target, load_single(target) + alpha * load_single(x + k));
  });
}

template <class T>
void add_scaled_complex(const QtbInt *nz, const T *a, const T *x, const QtbInt *indx, T *y) {
  using R = Real<T>;
  const QtbInt n = *nz;
  if (n < 1) return;
  const R re = load_single(parts(a)), im = load_single(parts(a) + 1);
  if (re == 0 && im == 0) return;
  for (QtbInt k = 0; k < n; ++k) {
    const R xr = load_single(parts(x + k)), xi = load_single(parts(x + k) + 1);
    R *target = parts(y + (indx[k] - 1));
    store_single(target, load_single(target) + (re * xr - im * xi));
    store_single(target + 1, load_single(target + 1) + (re * xi + im * xr));
  }
}

template <class T>
T dot(const QtbInt *nz, const T *x, const QtbInt *indx, const T *y) {
  const QtbInt n = *nz;
  const auto product = [=](QtbInt k) { return load_single(x + k) * load_single(y + (indx[k] - 1)); };
  T first = 0, second = 0;  // two chains of additions
  QtbInt k = 0;
  for (; k + 2 <= n; k += 2) {
    first += product(k);
    second += product(k + 1);
  }
  const T sum = first + second;
  return k < n ? sum + product(k) : sum;
}

template <class T, bool conjugate>
T *dot_complex(T *result, const QtbInt *nz, const T *x, const QtbInt *indx, const T *y) {
  using R = Real<T>;
  const QtbInt n = *nz;
  R re = 0, im = 0;
  for (QtbInt k = 0; k < n; ++k) {
    const R *target = parts(y + (indx[k] - 1));
    const R yr = load_single(target), yi = load_single(target + 1);
    const R xr = load_single(parts(x + k)), imaginary = load_single(parts(x + k) + 1);
    const R xi = conjugate ? 0 - imaginary : imaginary;
    re += xr * yr - xi * yi;
    im += xr * yi + xi * yr;
  }
  store_single(parts(result), re);
  store_single(parts(result) + 1, im);
  return result;
}

// Gathers and scatters move bits, not values: the payload of a NaN arrives as it was.
template <class T>
void gather_elements(const QtbInt *nz, const T *y, T *x, const QtbInt *indx) {
  for_each_by_two(*nz, [=](QtbInt k) { store_bits(x + k, load_bits(y + (indx[k] - 1))); });
}

template <class T>
void gather_and_zero(const QtbInt *nz, T *y, T *x, const QtbInt *indx) {
  for_each_by_two(*nz, [=](QtbInt k) {
    T *source = y + (indx[k] - 1);
    store_bits(x + k, load_bits(source));
    store_single(source, T{});
  });
}

template <class T>
void scatter_elements(const QtbInt *nz, const T *x, const QtbInt *indx, T *y) {
  for_each_by_two(*nz, [=](QtbInt k) { store_bits(y + (indx[k] - 1), load_bits(x + k)); });
}

template <class T>
void rotate(const QtbInt *nz, T *x, const QtbInt *indx, T *y, const T *c, const T *s) {
  const QtbInt n = *nz;
  if (n < 1) return;
  const T cosine = load_single(c), sine = load_single(s);
  if (cosine == 1 && sine == 0) return;
  for (QtbInt k = 0; k < n; ++k) {
    T *target = y + (indx[k] - 1);
    const T u = load_single(x + k), t = load_single(target);
    store_single(target, cosine * t - sine * u);
    store_single(x + k, cosine * u + sine * t);
  }
}

}  // namespace

QTB_KERNEL(saxpyi, axpyi, float, add_scaled)
QTB_KERNEL(daxpyi, axpyi, double, add_scaled)
QTB_KERNEL(caxpyi, axpyi, cfloat, add_scaled_complex)
QTB_KERNEL(zaxpyi, axpyi, cdouble, add_scaled_complex)
QTB_KERNEL(sdoti, doti, float, dot)
QTB_KERNEL(ddoti, doti, double, dot)
QTB_KERNEL(cdotci, cdoti, cfloat, (dot_complex<cfloat, true>))
QTB_KERNEL(cdotui, cdoti, cfloat, (dot_complex<cfloat, false>))
QTB_KERNEL(zdotci, cdoti, cdouble, (dot_complex<cdouble, true>))
QTB_KERNEL(zdotui, cdoti, cdouble, (dot_complex<cdouble, false>))
QTB_KERNEL(sgthr, gthr, float, gather_elements)
QTB_KERNEL(dgthr, gthr, double, gather_elements)
QTB_KERNEL(cgthr, gthr, cfloat, gather_elements)
QTB_KERNEL(zgthr, gthr, cdouble, gather_elements)
QTB_KERNEL(sgthrz, gthrz, float, gather_and_zero)
QTB_KERNEL(dgthrz, gthrz, double, gather_and_zero)
QTB_KERNEL(cgthrz, gthrz, cfloat, gather_and_zero)
QTB_KERNEL(zgthrz, gthrz, cdouble, gather_and_zero)
QTB_KERNEL(ssctr, sctr, float, scatter_elements)
QTB_KERNEL(dsctr, sctr, double, scatter_elements)
QTB_KERNEL(csctr, sctr, cfloat, scatter_elements)
QTB_KERNEL(zsctr, sctr, cdouble, scatter_elements)
QTB_KERNEL(sroti, roti, float, rotate)
QTB_KERNEL(droti, roti, double, rotate)

}  // namespace qtb::QTB_TIER
