// Euclidean norms: sqrt(sum of |x[i]|**2) over n elements. x is read only, at any address. n below 1 gives 0.
//
// The two precisions take different roads to the same safety from overflow and underflow. dnrm2 and dznrm2 have no
// wider type: one pass keeps the largest magnitude as a scale and the sum of squares relative to it, at a division per
// element. snrm2 and scnrm2 square and add in double, where no square of a float leaves the range, and so vectorise.
//
// Increments: every increment reads the elements that its absolute value reads; 0 reads element 0 n times.

#include "blas/kernels/simd/scalar.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// ---- double: scaled sum of squares ----

// The values so far have a sum of squares of scale**2 * ssq; scale is the largest magnitude among them.
struct ScaledSquares {
  double scale = 0.0;
  double ssq = 1.0;
};

inline void add_scaled_square(ScaledSquares &sum, double v) {
  if (v == 0.0) return;
  const double magnitude = absolute(v);
  if (magnitude > sum.scale) {
    const double ratio = sum.scale / magnitude;
    sum.ssq = 1.0 + sum.ssq * (ratio * ratio);
    sum.scale = magnitude;
  } else {  // a NaN too: it makes the sum one
    const double ratio = magnitude / sum.scale;
    sum.ssq += ratio * ratio;
  }
}

template <class T>
double norm_scaled(const QtbInt *n, const T *x, const QtbInt *incx) {
  constexpr QtbInt width = is_complex<T> ? 2 : 1;  // doubles per element
  const QtbInt count = *n;
  if (count < 1) return 0.0;
  if (!is_complex<T> && count == 1) return absolute(element(parts(x)));
  const QtbInt step = width * (*incx < 0 ? -*incx : *incx);
  const double *p = parts(x);
  ScaledSquares sum;
  for (QtbInt i = 0; i < count; ++i, p += step)
    for (QtbInt k = 0; k < width; ++k) add_scaled_square(sum, element(p + k));
  return sum.scale * square_root(sum.ssq);
}

// ---- float: sum of squares in double ----

// Independent chains of additions, enough to hide the latency of one.
constexpr QtbInt chains = 8;
using WideSum = __m128d[chains];

// Two neighbouring floats at p, as doubles.
inline __m128d widen_pair(const float *p) {
  return _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i *>(p))));
}
inline __m128d widen_single(const float *p) { return _mm_set_sd(static_cast<double>(element(p))); }

inline void add_square(__m128d &sum, __m128d v) { sum = add(sum, mul(v, v)); }

// 2 * pairs neighbouring floats, a pair to each chain in rotation.
template <QtbInt pairs>
void add_pairs(WideSum &sum, const float *p) {
  for (QtbInt k = 0; k < pairs; ++k) add_square(sum[k % chains], widen_pair(p + 2 * k));
}

// What is left of n floats at p below a block of 4 * pairs: by halves down to a single one.
template <QtbInt pairs>
void add_remainder(WideSum &sum, QtbInt n, const float *p) {
  if (n & (2 * pairs)) {
    add_pairs<pairs>(sum, p);
    p += 2 * pairs;
  }
  if constexpr (pairs > 1)
    add_remainder<pairs / 2>(sum, n, p);
  else if (n & 1)
    add_square(sum[0], widen_single(p));
}

// n neighbouring floats, block of them a pass.
template <QtbInt block>
void add_contiguous(WideSum &sum, QtbInt n, const float *p) {
  constexpr QtbInt unit = 2 * chains;  // floats that give every chain one pair
  for (; n >= block; n -= block, p += block)
    for (QtbInt k = 0; k < block; k += unit) add_pairs<chains>(sum, p + k);
  add_remainder<block / 4>(sum, n, p);
}

inline double root_of(const WideSum &sum) {
  const __m128d joined =
      add(add(add(sum[0], sum[1]), add(sum[2], sum[3])), add(add(sum[4], sum[5]), add(sum[6], sum[7])));
  return square_root(_mm_cvtsd_f64(_mm_add_sd(joined, _mm_unpackhi_pd(joined, joined))));
}

inline bool contiguous(QtbInt inc) { return inc == 1 || inc == -1; }

inline float norm_wide_real(const QtbInt *n, const float *x, const QtbInt *incx) {
  constexpr QtbInt block = 32;
  QtbInt count = *n;
  const QtbInt inc = *incx;
  if (count < 1) return 0.0F;
  WideSum sum = {};
  if (contiguous(inc)) {
    if (element_aligned(x))
      for (; count > 0 && phase(x) != 0; --count, ++x) add_square(sum[0], widen_single(x));
    add_contiguous<block>(sum, count, x);
  } else {
    const float *p = walk_start(x, count, inc);
    const auto next = [&p, inc] {
      const float v = element(p);
      p += inc;
      return static_cast<double>(v);
    };
    for (; count >= 4; count -= 4)
      for (QtbInt k = 0; k < 2; ++k) {
        const double first = next();
        add_square(sum[k], _mm_set_pd(next(), first));
      }
    for (; count > 0; --count) add_square(sum[0], _mm_set_sd(next()));
  }
  return static_cast<float>(root_of(sum));
}

// An element is a pair already, so that no boundary needs to be reached.
inline float norm_wide_complex(const QtbInt *n, const cfloat *x, const QtbInt *incx) {
  constexpr QtbInt block = 64;  // 32 elements
  QtbInt count = *n;
  const QtbInt inc = *incx;
  if (count < 1) return 0.0F;
  WideSum sum = {};
  if (contiguous(inc)) {
    add_contiguous<block>(sum, 2 * count, parts(x));
  } else {
    const cfloat *p = walk_start(x, count, inc);
    for (; count >= 4; count -= 4)
      for (QtbInt k = 0; k < 4; ++k, p += inc) add_square(sum[k], widen_pair(parts(p)));
    for (; count > 0; --count, p += inc) add_square(sum[0], widen_pair(parts(p)));
  }
  return static_cast<float>(root_of(sum));
}

}  // namespace

QTB_KERNEL(snrm2, norm, float, norm_wide_real)
QTB_KERNEL(scnrm2, norm, cfloat, norm_wide_complex)
QTB_KERNEL(dnrm2, norm, double, norm_scaled)
QTB_KERNEL(dznrm2, norm, cdouble, norm_scaled)

}  // namespace qtb::QTB_TIER
