// Sums of magnitudes: sum of |x[i]|, for complex elements of |re| + |im|. x is read only, at any address. n below 1
// gives 0.
//
// Contiguous vectors (increments 1 and -1) go by vectors whose sign bits are masked off, in four accumulators in
// rotation. Other increments go one element at a time from the start of the walk; 0 adds element 0 n times.

#include "blas/kernels/level1/tuning.h"
#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// Elements of the main loop per pass, by column of tuning.h: def sse3 ssse3 sse42
constexpr QtbInt dasum_block[] = {16, 16, 32, 32};
constexpr QtbInt sasum_block[] = {32, 32, 32, 64};
static_assert(sizeof dasum_block / sizeof *dasum_block == column_count &&
                  sizeof sasum_block / sizeof *sasum_block == column_count,
              "blas/kernels/level1/asum.cpp: write the elements per pass of every column of tuning.h");
template <class T>
constexpr QtbInt asum_block = sizeof(T) == sizeof(double) ? dasum_block[this_column] : sasum_block[this_column];

// Whether this tier's processors want vectors on their boundary; the others read them wherever they are.
constexpr bool peels = this_column < column_sse42;

constexpr QtbInt accumulators = 4;

// Whether x takes the vector loop: an address that peeling cannot bring to the boundary goes one element at a time, and
// so do in every tier doubles that straddle their own width.
template <class T>
bool takes_vectors(const T *x) {
  return element_aligned(x) || !(peels || sizeof(T) == sizeof(double));
}

// All bits but the sign. Doubles go through the single-precision instructions, which handle the same bits and are a
// byte shorter each.
inline __m128 load_masked(const float *p, __m128i mask) {
  return _mm_and_ps(peels ? load_aligned(p) : load_unaligned(p), _mm_castsi128_ps(mask));
}
inline __m128 load_magnitudes(const float *p) { return load_masked(p, _mm_set1_epi32(0x7FFFFFFF)); }
inline __m128d load_magnitudes(const double *p) {
  return _mm_castps_pd(load_masked(reinterpret_cast<const float *>(p), _mm_set1_epi64x(0x7FFFFFFFFFFFFFFF)));
}

// Lanes by neighbours, in the one instruction for it, in the tiers that have it.
inline float join_lanes(__m128 v) {
#if defined(__SSE3__)
  v = _mm_hadd_ps(v, v);
  return _mm_cvtss_f32(_mm_hadd_ps(v, v));
#else
  return sum_lanes(v);
#endif
}
inline double join_lanes(__m128d v) {
#if defined(__SSE3__)
  return _mm_cvtsd_f64(_mm_hadd_pd(v, v));
#else
  return sum_lanes(v);
#endif
}

// Two vectors at a time: both are masked before either is added, so that the loads run ahead.
template <QtbInt count, class T>
[[gnu::always_inline]] inline void add_vectors(Vec<T> (&sum)[accumulators], const T *x) {
  constexpr int vectors = static_cast<int>(count / lanes<T>);
  constexpr int together = vectors < 2 ? vectors : 2;
  repeat<vectors / together>([&](auto group) __attribute__((always_inline)) {
    Vec<T> magnitudes[together];
    repeat<together>([&](auto k) __attribute__((always_inline)) {
      magnitudes[k.value] = load_magnitudes(x + (group.value * together + k.value) * lanes<T>);
      keep_in_place(magnitudes[k.value]);
    });
    repeat<together>([&](auto k) __attribute__((always_inline)) {
      Vec<T> &accumulator = sum[(group.value * together + k.value) % accumulators];
      accumulator = add(accumulator, magnitudes[k.value]);
      keep_in_place(accumulator);
    });
  });
}

// The last n elements at x, as far as they do not fill 2 * half: by halves as long as these are vectors. Returns where
// they end.
template <QtbInt half, class T>
[[gnu::always_inline]] inline const T *add_remainder(Vec<T> (&sum)[accumulators], QtbInt n, const T *x) {
  if constexpr (half < lanes<T>) {
    return x;
  } else {
    if (n & half) {
      add_vectors<half>(sum, x);
      x += half;
    }
    return add_remainder<half / 2>(sum, n, x);
  }
}

template <class T>
T sum_contiguous(QtbInt n, const T *x) {
  constexpr QtbInt block = asum_block<T>;
  T singles = 0;
  if constexpr (peels)
    for (; n > 0 && phase(x) != 0; --n, ++x) singles += absolute(load_single(x));
  Vec<T> sum[accumulators] = {zero<T>(), zero<T>(), zero<T>(), zero<T>()};
  for (n -= block; n >= 0; n -= block, x += block) add_vectors<block>(sum, x);
  n += block;
  x = add_remainder<block / 2>(sum, n, x);
  for (n %= lanes<T>; n > 0; --n, ++x) singles += absolute(load_single(x));
  return join_lanes(add(add(add(sum[0], sum[1]), sum[2]), sum[3])) + singles;
}

template <class T>
T sum_strided(QtbInt n, const T *x, QtbInt inc) {
  T sum = 0;
  for (x = walk_start(x, n, inc); n > 0; --n, x += inc) sum += absolute(load_single(x));
  return sum;
}

template <class T>
T sum_real(const QtbInt *n, const T *x, const QtbInt *incx) {
  if (*n < 1) return 0;
  const QtbInt inc = *incx;
  if (inc != 1 && inc != -1) return sum_strided(*n, x, inc);
  return takes_vectors(x) ? sum_contiguous(*n, x) : sum_strided(*n, x, 1);
}

template <class T>
Real<T> sum_complex(const QtbInt *n, const T *x, const QtbInt *incx) {
  using R = Real<T>;
  QtbInt count = *n;
  if (count < 1) return 0;
  const QtbInt inc = *incx;
  if (inc == 1) {
    const QtbInt reals = 2 * count;
    return sum_real(&reals, parts(x), incx);
  }
  const R *p = parts(walk_start(x, count, inc));
  const QtbInt step = 2 * inc;
  R first = 0, second = 0;  // two chains of additions
  for (; count >= 2; count -= 2, p += 2 * step) {
    first += absolute(load_single(p));
    first += absolute(load_single(p + 1));
    second += absolute(load_single(p + step)) + absolute(load_single(p + step + 1));
  }
  R sum = first + second;
  if (count != 0) {
    sum += absolute(load_single(p));
    sum += absolute(load_single(p + 1));
  }
  return sum;
}

}  // namespace

QTB_KERNEL(sasum, norm, float, sum_real)
QTB_KERNEL(dasum, norm, double, sum_real)
QTB_KERNEL(scasum, norm, cfloat, sum_complex)
QTB_KERNEL(dzasum, norm, cdouble, sum_complex)

}  // namespace qtb::QTB_TIER
