// The parallel symmetric and triangular Level-2 routines: qtb_blas_<routine>_omp(nthreads, the routine's arguments).
//
// n is at least 1. A driver asks for nthreads threads (at least 1) and cuts the problem over the team that it gets
// (l2_share.h). Every element of the result is one thread's; x and y do not overlap each other or A.
//
// symv: two steps with a barrier between them, and the result depends on the team. syr, syr2: the tier's block slot on
// each thread's columns. trmv: the same on each thread's elements of x, from a copy of the old x; without memory for it
// the dispatch slot does the whole problem on the caller's thread.
#pragma once

#include "blas/shapes.h"

extern "C" {
#define QTB_LEVEL2(name, shape, T, ...) QTB_HIDDEN void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_##shape(T));
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
}
