// The parallel products with a symmetric or Hermitian matrix: qtb_blas_<routine>_omp(nthreads, the routine's
// arguments).
//
// m and n are at least 1. A driver asks for nthreads threads and cuts B and C over the team that it gets, anywhere
// (slabs.h of 32e); each thread's slot applies beta to its slab.
#pragma once

#include "blas/shapes.h"
#include "blas/thread/32/level3/symm_decision.h"

extern "C" {
#define QTB_DECLARE_SYMM_OMP(name, T) QTB_HIDDEN void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_symm(T));
QTB_FOR_EACH_SYMM(QTB_DECLARE_SYMM_OMP)
QTB_FOR_EACH_HEMM(QTB_DECLARE_SYMM_OMP)
#undef QTB_DECLARE_SYMM_OMP
}
