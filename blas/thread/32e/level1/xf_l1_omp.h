// The parallel Level-1 drivers: qtb_blas_<routine>_omp(nthreads, the routine's arguments).
//
// A driver opens one OpenMP region that asks for nthreads threads (at least 1), cuts the vectors over the team that it
// gets, and calls the routine's dispatch slot on each piece. nthreads goes by value and first; in cdotc second, behind
// the result. Vectors that are written must not overlap the other vector.
#pragma once

#include "blas/shapes.h"

#define QTB_OMP_PARAMS_axpy(T) QtbInt nthreads, QTB_PARAMS_axpy(T)
#define QTB_OMP_PARAMS_copy(T) QtbInt nthreads, QTB_PARAMS_copy(T)
#define QTB_OMP_PARAMS_swap(T) QtbInt nthreads, QTB_PARAMS_swap(T)
#define QTB_OMP_PARAMS_rot(T) QtbInt nthreads, QTB_PARAMS_rot(T)
#define QTB_OMP_PARAMS_dot(T) QtbInt nthreads, QTB_PARAMS_dot(T)
#define QTB_OMP_PARAMS_cdot(T) T *result, QtbInt nthreads, QTB_PARAMS_dot(T)

#define QTB_OMP_ARGS_axpy nthreads, QTB_ARGS(axpy)
#define QTB_OMP_ARGS_copy nthreads, QTB_ARGS(copy)
#define QTB_OMP_ARGS_swap nthreads, QTB_ARGS(swap)
#define QTB_OMP_ARGS_rot nthreads, QTB_ARGS(rot)
#define QTB_OMP_ARGS_dot nthreads, QTB_ARGS(dot)
#define QTB_OMP_ARGS_cdot result, nthreads, QTB_ARGS(dot)

#define QTB_OMP_FUNCTION(shape, T, name) QTB_RESULT_##shape(T) qtb_blas_##name##_omp(QTB_OMP_PARAMS_##shape(T))

extern "C" {
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_HIDDEN QTB_OMP_FUNCTION(shape, T, name);
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_HIDDEN QTB_OMP_FUNCTION(shape, T, name);
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}
