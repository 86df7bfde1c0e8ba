// Vec<T>: 16 bytes of float or double, the vector width of every tier at Levels 1 and 2.
//
// A thin layer over the intrinsics that all tiers have, so that a kernel is one template over the element type. What a
// tier adds (duplicating loads, add-subtract, horizontal adds, the byte-align instruction) stands at the end, under the
// instruction set that has it.
#pragma once

#include <emmintrin.h>
#if defined(__SSE3__)
#include <pmmintrin.h>
#endif
#if defined(__SSSE3__)
#include <tmmintrin.h>
#endif

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {
namespace {

// The width of a vector, and the boundary that aligned loads ask for.
constexpr QtbInt vector_bytes = 16;

template <class T>
struct VecOf;
template <>
struct VecOf<float> {
  using Type = __m128;
};
template <>
struct VecOf<double> {
  using Type = __m128d;
};
template <class T>
using Vec = typename VecOf<T>::Type;

// Elements of T in a vector.
template <class T>
constexpr QtbInt lanes = vector_bytes / static_cast<QtbInt>(sizeof(T));

inline __m128 load_aligned(const float *p) { return _mm_load_ps(p); }
inline __m128d load_aligned(const double *p) { return _mm_load_pd(p); }
inline __m128 load_unaligned(const float *p) { return _mm_loadu_ps(p); }
inline __m128d load_unaligned(const double *p) { return _mm_loadu_pd(p); }
inline void store_aligned(float *p, __m128 v) { _mm_store_ps(p, v); }
inline void store_aligned(double *p, __m128d v) { _mm_store_pd(p, v); }
inline void store_unaligned(float *p, __m128 v) { _mm_storeu_ps(p, v); }
inline void store_unaligned(double *p, __m128d v) { _mm_storeu_pd(p, v); }

// Two 8-byte loads, for the tiers whose processors read a misaligned vector slowly.
inline __m128 load_halves(const float *p) {
  return _mm_loadh_pi(_mm_loadl_pi(_mm_setzero_ps(), reinterpret_cast<const __m64 *>(p)),
                      reinterpret_cast<const __m64 *>(p + 2));
}
inline __m128d load_halves(const double *p) { return _mm_loadh_pd(_mm_load_sd(p), p + 1); }

inline __m128 broadcast(float v) { return _mm_set1_ps(v); }
inline __m128d broadcast(double v) { return _mm_set1_pd(v); }
inline __m128 add(__m128 a, __m128 b) { return _mm_add_ps(a, b); }
inline __m128d add(__m128d a, __m128d b) { return _mm_add_pd(a, b); }
inline __m128 sub(__m128 a, __m128 b) { return _mm_sub_ps(a, b); }
inline __m128d sub(__m128d a, __m128d b) { return _mm_sub_pd(a, b); }
inline __m128 mul(__m128 a, __m128 b) { return _mm_mul_ps(a, b); }
inline __m128d mul(__m128d a, __m128d b) { return _mm_mul_pd(a, b); }

template <class T>
Vec<T> zero() {
  if constexpr (sizeof(T) == sizeof(float))
    return _mm_setzero_ps();
  else
    return _mm_setzero_pd();
}

// The phase of an address: its distance in bytes above a vector boundary.
inline QtbInt phase(const void *p) {
  return static_cast<QtbInt>(reinterpret_cast<std::uintptr_t>(p) % static_cast<std::uintptr_t>(vector_bytes));
}

// Whether an address is a multiple of the element width, so that peeling elements can reach a vector boundary.
template <class T>
bool element_aligned(const T *p) {
  return reinterpret_cast<std::uintptr_t>(p) % sizeof(T) == 0;
}

// Where a walk over n elements starts: a negative increment starts at the far end, element (1 - n) * inc.
template <class T>
T *walk_start(T *p, QtbInt n, QtbInt inc) {
  return inc < 0 ? p + (1 - n) * inc : p;
}

}  // namespace
}  // namespace qtb::QTB_TIER
