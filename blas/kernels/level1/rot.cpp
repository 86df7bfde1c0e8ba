// Plane rotations: (x[i], y[i]) := (c*x[i] + s*y[i], c*y[i] - s*x[i]) over n element pairs, c and s real.
//
// x and y must not overlap; each may stand at any address. A negative increment walks its vector from the far end. n
// below 1 changes nothing. No value of c or s is special: with c 1 and s 0 the products are still formed.
//
// A complex vector is a stream of twice as many reals, since c and s act on both parts alike.

#include "blas/kernels/level1/pair_walk.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Rotation {
  T c, s;
  Vec<T> vector_c, vector_s;

  Rotation(T cosine, T sine) : c(cosine), s(sine), vector_c(broadcast(cosine)), vector_s(broadcast(sine)) {}

  void operator()(T &x, T &y) const {
    const T rotated = c * x + s * y;
    y = c * y - s * x;
    x = rotated;
  }
  void operator()(Vec<T> &x, Vec<T> &y) const {
    const Vec<T> rotated = add(mul(vector_c, x), mul(vector_s, y));
    y = sub(mul(vector_c, y), mul(vector_s, x));
    x = rotated;
  }
};

// srot and drot; they differ in how y is read where its phase is not x's.
template <class T, Load other_load>
void rotate_real(const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy, const T *c, const T *s) {
  constexpr QtbInt block = 8, strided_block = 2;
  if (*n < 1) return;
  const Rotation<T> rotation(load_single(c), load_single(s));
  if (*incx == 1 && *incy == 1)
    transform_contiguous<block, block, other_load>(*n, x, y, rotation);
  else
    transform_strided<1, strided_block>(*n, x, *incx, y, *incy, rotation);
}

inline void rotate_csrot(const QtbInt *n, cfloat *x, const QtbInt *incx, cfloat *y, const QtbInt *incy, const float *c,
                         const float *s) {
  constexpr QtbInt same_phase = 2 * 24, other_phase = 2 * 16, strided_block = 4;
  if (*n < 1) return;
  const Rotation<float> rotation(load_single(c), load_single(s));
  if (*incx == 1 && *incy == 1)
    transform_contiguous<same_phase, other_phase, Load::unaligned>(2 * *n, parts(x), parts(y), rotation);
  else
    transform_strided<2, strided_block>(*n, parts(x), *incx, parts(y), *incy, rotation);
}

// count reals of neighbouring complex elements. An element fills a vector, so that no phase matters; tier def rotates
// part by part.
template <QtbInt count>
void rotate_elements(double *x, double *y, const Rotation<double> &rotation) {
  if constexpr (this_tier >= tier_sse3)
    transform_block<count, Load::halves, Load::halves>(x, y, rotation);
  else
    for (QtbInt k = 0; k < count; ++k) transform_pair(x + k, y + k, rotation);
}

inline void rotate_zdrot(const QtbInt *n, cdouble *x, const QtbInt *incx, cdouble *y, const QtbInt *incy,
                         const double *c, const double *s) {
  constexpr QtbInt width = 2, block = 4 * width;  // reals of an element, and of a contiguous pass
  QtbInt count = *n;
  if (count < 1) return;
  const Rotation<double> rotation(load_single(c), load_single(s));
  const QtbInt step_x = width * *incx, step_y = width * *incy;
  double *p = walk_start(parts(x), count, step_x), *q = walk_start(parts(y), count, step_y);
  if (step_x == width && step_y == width)
    for (; width * count >= block; count -= block / width, p += block, q += block)
      rotate_elements<block>(p, q, rotation);
  for (; count > 0; --count, p += step_x, q += step_y) rotate_elements<width>(p, q, rotation);
}

}  // namespace

QTB_KERNEL(srot, rot, float, (rotate_real<float, Load::unaligned>))
QTB_KERNEL(drot, rot, double, (rotate_real<double, Load::halves>))
QTB_KERNEL(csrot, rot, cfloat, rotate_csrot)
QTB_KERNEL(zdrot, rot, cdouble, rotate_zdrot)

}  // namespace qtb::QTB_TIER
