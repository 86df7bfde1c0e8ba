// The order in which a team's partial dot products are joined, once more: written out for each type with vector
// instructions, as a model that the drivers' results must equal bit by bit.
#pragma once

#include <emmintrin.h>

#include <cstdint>

#include "blas/types.h"

namespace qtb::test {

inline bool multiple_of(const void *address, std::uintptr_t bytes) {
  return reinterpret_cast<std::uintptr_t>(address) % bytes == 0;
}

inline double model_sum(const double *p, int team) {
  double total = 0.0;
  int done = 0;
  if (team >= 9 && multiple_of(p, 8)) {
    if (!multiple_of(p, 16)) total += p[done++];
    __m128d first = _mm_set_sd(total), second = _mm_setzero_pd();
    while (team - done >= 8) {
      first = _mm_add_pd(first, _mm_load_pd(p + done));
      second = _mm_add_pd(second, _mm_load_pd(p + done + 2));
      first = _mm_add_pd(first, _mm_load_pd(p + done + 4));
      second = _mm_add_pd(second, _mm_load_pd(p + done + 6));
      done += 8;
    }
    first = _mm_add_pd(first, second);
    total = _mm_cvtsd_f64(_mm_add_sd(first, _mm_unpackhi_pd(first, first)));
  }
  while (done < team) total += p[done++];
  return total;
}

inline float model_sum(const float *p, int team) {
  float total = 0.0F;
  int done = 0;
  if (team >= 11 && multiple_of(p, 4)) {
    while (!multiple_of(p + done, 16)) total += p[done++];
    __m128 first = _mm_set_ss(total), second = _mm_setzero_ps();
    while (team - done >= 8) {
      first = _mm_add_ps(first, _mm_load_ps(p + done));
      second = _mm_add_ps(second, _mm_load_ps(p + done + 4));
      done += 8;
    }
    first = _mm_add_ps(first, second);
    first = _mm_add_ps(first, _mm_movehl_ps(first, first));
    total = _mm_cvtss_f32(_mm_add_ss(first, _mm_shuffle_ps(first, first, 1)));
  }
  while (done < team) total += p[done++];
  return total;
}

template <class R>
Complex<R> model_sum(const Complex<R> *p, int team) {
  R re = 0, im = 0;
  for (int i = 0; i < team; ++i) re += p[i].re;
  for (int i = 0; i < team; ++i) im += p[i].im;
  return {re, im};
}

}  // namespace qtb::test
