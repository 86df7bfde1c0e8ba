// The parallel rank-k updates. n is at least 1, nthreads what is asked for; the team that comes may be smaller.
//
// qtb_blas_<routine>_omp(nthreads, the routine's arguments): tiles, on tiers with building blocks; n is at least
// syrk_rows_per_thread for each of the nthreads. Every tile is one thread's, which applies beta to it.
//
// qtb_blas_<routine>_strips_omp(nthreads, the routine's arguments): the diagonal and strips, on the others.
#pragma once

#include "blas/shapes.h"
#include "blas/thread/32e/level3/syrk_decision.h"

extern "C" {
#define QTB_DECLARE_SYRK_OMP(name, shape, T)                                     \
  QTB_HIDDEN void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_##shape(T)); \
  QTB_HIDDEN void qtb_blas_##name##_strips_omp(QtbInt nthreads, QTB_PARAMS_##shape(T));
QTB_FOR_EACH_SYRK(QTB_DECLARE_SYRK_OMP)
#undef QTB_DECLARE_SYRK_OMP
}
