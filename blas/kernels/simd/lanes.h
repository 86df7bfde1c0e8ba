// Lanes of one vector or of two in another order, and neighbours taken together: what kernels sort their sums with.
#pragma once

#include "blas/kernels/simd/vec.h"
#if defined(__SSE4_1__)
#include <smmintrin.h>
#endif

namespace qtb::QTB_TIER {
namespace {

// Lanes 0 and 1 exchanged, and lanes 2 and 3.
inline __m128 exchanged(__m128 v) { return swap_parts(v); }
inline __m128d exchanged(__m128d v) { return swap_parts(v); }

// Even lanes of the first, odd lanes of the second.
#if defined(__SSE4_1__)
inline __m128 even_odd(__m128 even, __m128 odd) { return _mm_blend_ps(even, odd, 0b1010); }
inline __m128d even_odd(__m128d even, __m128d odd) { return _mm_blend_pd(even, odd, 0b10); }
#else
inline __m128 even_odd(__m128 even, __m128 odd) {
  const __m128 odd_lanes = _mm_castsi128_ps(_mm_set_epi32(-1, 0, -1, 0));
  return _mm_or_ps(_mm_andnot_ps(odd_lanes, even), _mm_and_ps(odd_lanes, odd));
}
inline __m128d even_odd(__m128d even, __m128d odd) { return _mm_move_sd(odd, even); }
#endif

// Lanes of the first and of the second in turn, from the lower halves and from the upper ones.
inline __m128 interleaved_low(__m128 a, __m128 b) { return _mm_unpacklo_ps(a, b); }
inline __m128d interleaved_low(__m128d a, __m128d b) { return _mm_unpacklo_pd(a, b); }
inline __m128 interleaved_high(__m128 a, __m128 b) { return _mm_unpackhi_ps(a, b); }
inline __m128d interleaved_high(__m128d a, __m128d b) { return _mm_unpackhi_pd(a, b); }

#if defined(__SSE3__)
// Lane 0 less lane 1 and lane 2 less lane 3 of the first and then of the second, and their sums.
inline __m128 neighbour_differences(__m128 a, __m128 b) { return _mm_hsub_ps(a, b); }
inline __m128d neighbour_differences(__m128d a, __m128d b) { return _mm_hsub_pd(a, b); }
inline __m128 neighbour_sums(__m128 a, __m128 b) { return _mm_hadd_ps(a, b); }
inline __m128d neighbour_sums(__m128d a, __m128d b) { return _mm_hadd_pd(a, b); }
#endif

}  // namespace
}  // namespace qtb::QTB_TIER
