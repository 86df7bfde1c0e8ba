// Dot products of floats in double: dsdot = sum of x[i] * y[i], sdsdot = sb + that sum rounded once, at the end.
//
// x and y are read only, at any address; a negative increment walks its vector from the far end. A product of two
// floats is exact in double. n below 1 gives 0, or sb.

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

inline double product(const float *x, const float *y) {
  return static_cast<double>(load_single(x)) * static_cast<double>(load_single(y));
}

// start + the sum of *count products, in two chains of additions. Without any, nothing else is read.
inline double sum_of_products(double start, const QtbInt *count, const float *x, const QtbInt *step_x, const float *y,
                              const QtbInt *step_y) {
  QtbInt n = *count;
  if (n < 1) return start;
  const QtbInt incx = *step_x, incy = *step_y;
  x = walk_start(x, n, incx);
  y = walk_start(y, n, incy);
  double first = start, second = 0.0;
  for (; n >= 2; n -= 2, x += 2 * incx, y += 2 * incy) {
    first += product(x, y);
    second += product(x + incx, y + incy);
  }
  const double sum = first + second;
  return n == 0 ? sum : sum + product(x, y);
}

inline double dot_to_double(const QtbInt *n, const float *x, const QtbInt *incx, const float *y, const QtbInt *incy) {
  return sum_of_products(0.0, n, x, incx, y, incy);
}

inline float dot_to_single(const QtbInt *n, const float *sb, const float *x, const QtbInt *incx, const float *y,
                           const QtbInt *incy) {
  return static_cast<float>(sum_of_products(static_cast<double>(*sb), n, x, incx, y, incy));
}

}  // namespace

QTB_KERNEL(dsdot, dsdot, float, dot_to_double)
QTB_KERNEL(sdsdot, sdsdot, float, dot_to_single)

}  // namespace qtb::QTB_TIER
