// The parallel rank-2k updates: qtb_blas_<routine>_omp(nthreads, the routine's arguments), by the diagonal and strips
// on every tier (strips.h of 32e).
//
// n is at least 1, nthreads what is asked for; the team that comes may be smaller. A strip gets two products, one
// behind the other: the first applies beta, the second adds.
#pragma once

#include "blas/shapes.h"

// f(name, T): the routines, in two lists.
#define QTB_FOR_EACH_SYR2K(f) f(ssyr2k, float) f(dsyr2k, double) f(csyr2k, cfloat) f(zsyr2k, cdouble)
#define QTB_FOR_EACH_HER2K(f) f(cher2k, cfloat) f(zher2k, cdouble)

extern "C" {
#define QTB_DECLARE_SYR2K_OMP(name, T) QTB_HIDDEN void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_syr2k(T));
#define QTB_DECLARE_HER2K_OMP(name, T) QTB_HIDDEN void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_her2k(T));
QTB_FOR_EACH_SYR2K(QTB_DECLARE_SYR2K_OMP)
QTB_FOR_EACH_HER2K(QTB_DECLARE_HER2K_OMP)
#undef QTB_DECLARE_SYR2K_OMP
#undef QTB_DECLARE_HER2K_OMP
}
