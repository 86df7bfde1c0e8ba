// The parallel products of a general matrix and a vector: qtb_blas_<routine>_omp(nthreads, the routine's arguments).
//
// m and n are at least 1. A driver opens one region that asks for nthreads threads (at least 1), cuts y over the team
// that it gets (gemv_share.h), and calls the routine's dispatch slot on each share, which applies beta to it. x and A
// are shared; y must not overlap them.
#pragma once

#include "blas/shapes.h"

extern "C" {
#define QTB_GEMV(name, T, ...) QTB_HIDDEN void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_gemv(T));
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
}
