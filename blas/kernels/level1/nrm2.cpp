// Euclidean norms: sqrt(sum of |x[i]|**2) over n elements. x is read only, at any address. n below 1 gives 0.
//
// The two precisions take different roads to the same safety from overflow and underflow. dnrm2 and dznrm2 have no
// wider type: one pass keeps the largest magnitude as a scale and the sum of squares relative to it, at a division per
// element. snrm2 and scnrm2 square and add in double, where no square of a float leaves the range, and so vectorise.
//
// Increments: every increment reads the elements that its absolute value reads; 0 reads element 0 n times.

#include "blas/kernels/simd/repeat.h"
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
  if (!is_complex<T> && count == 1) return absolute(load_single(parts(x)));
  const QtbInt step = width * (*incx < 0 ? -*incx : *incx);
  const double *p = parts(x);
  ScaledSquares sum;
  for (QtbInt i = 0; i < count; ++i, p += step)
    for (QtbInt k = 0; k < width; ++k) add_scaled_square(sum, load_single(p + k));
  return sum.scale * square_root(sum.ssq);
}

// ---- float: sum of squares in double ----

// Independent chains of additions, enough to hide the latency of one. What works on them is always inlined, so that
// they stay in registers.
constexpr int chains = 8;
using WideSum = __m128d[chains];

// Two neighbouring floats at p, as doubles.
inline __m128d widen_pair(const float *p) {
  return _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i *>(p))));
}
inline __m128d widen_two(const float *p, const float *q) {
  return _mm_cvtps_pd(_mm_unpacklo_ps(_mm_set_ss(load_single(p)), _mm_set_ss(load_single(q))));
}
inline __m128d widen_single(const float *p) { return _mm_set_sd(static_cast<double>(load_single(p))); }

inline void add_square(__m128d &sum, __m128d v) {
  sum = add(sum, mul(v, v));
  keep_in_place(sum);
}

// 2 * pairs neighbouring floats, a pair to each chain in rotation.
template <int pairs>
[[gnu::always_inline]] inline void add_pairs(WideSum &sum, const float *p) {
  repeat<pairs>([&](auto k)
                    __attribute__((always_inline)) { add_square(sum[k.value % chains], widen_pair(p + 2 * k.value)); });
}

// The last n floats at p, as far as they do not fill 4 * pairs: by halves down to a single one.
template <int pairs>
[[gnu::always_inline]] inline void add_remainder(WideSum &sum, QtbInt n, const float *p) {
  if constexpr (pairs == 0) {
    if (n & 1) add_square(sum[0], widen_single(p));
  } else {
    if (n & (2 * pairs)) {
      add_pairs<pairs>(sum, p);
      p += 2 * pairs;
    }
    add_remainder<pairs / 2>(sum, n, p);
  }
}

// n neighbouring floats, 2 * pairs of them a pass.
template <int pairs>
[[gnu::always_inline]] inline void add_contiguous(WideSum &sum, QtbInt n, const float *p) {
  for (; n >= 2 * pairs; n -= 2 * pairs, p += 2 * pairs) add_pairs<pairs>(sum, p);
  add_remainder<pairs / 2>(sum, n, p);
}

inline double root_of(const WideSum &sum) {
  const __m128d joined =
      add(add(add(sum[0], sum[1]), add(sum[2], sum[3])), add(add(sum[4], sum[5]), add(sum[6], sum[7])));
  return square_root(_mm_cvtsd_f64(_mm_add_sd(joined, _mm_unpackhi_pd(joined, joined))));
}

inline bool contiguous(QtbInt inc) { return inc == 1 || inc == -1; }

inline float norm_wide_real(const QtbInt *n, const float *x, const QtbInt *incx) {
  constexpr int pairs_of_pass = 16;
  QtbInt count = *n;
  if (count < 1) return 0.0F;
  const QtbInt inc = *incx;
  WideSum sum = {};
  if (contiguous(inc)) {
    if (element_aligned(x))
      for (; count > 0 && phase(x) != 0; --count, ++x) add_square(sum[0], widen_single(x));
    add_contiguous<pairs_of_pass>(sum, count, x);
  } else {
    const float *p = walk_start(x, count, inc);
    for (; count >= 4; count -= 4, p += 4 * inc) {
      add_square(sum[0], widen_two(p, p + inc));
      add_square(sum[1], widen_two(p + 2 * inc, p + 3 * inc));
    }
    for (; count > 0; --count, p += inc) add_square(sum[0], widen_single(p));
  }
  return static_cast<float>(root_of(sum));
}

// An element is a pair already, so that no boundary needs to be reached.
inline float norm_wide_complex(const QtbInt *n, const cfloat *x, const QtbInt *incx) {
  constexpr int pairs_of_pass = 32;
  QtbInt count = *n;
  if (count < 1) return 0.0F;
  const QtbInt inc = *incx;
  WideSum sum = {};
  if (contiguous(inc)) {
    add_contiguous<pairs_of_pass>(sum, 2 * count, parts(x));
  } else {
    const cfloat *p = walk_start(x, count, inc);
    for (; count >= 4; count -= 4)
      repeat<4>([&](auto k) __attribute__((always_inline)) {
        add_square(sum[k.value], widen_pair(parts(p)));
        p += inc;
      });
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
