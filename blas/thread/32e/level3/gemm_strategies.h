// The partition strategies of a parallel GEMM: qtb_blas_<type>gemm_<the shape of the cut>.
//
// Every thread of a team calls the strategy with the same arguments and an equal plan of its own; the plan's nthreads
// is at most the team. m, n and k are at least 1. C is whole at the team's next barrier, which is the end of its
// region: a barrier more would cost half as much as the region itself.
//
//   1d_row           each thread a slab of rows of C, by a serial GEMM
//   1d_col           each thread a slab of columns
//   1d_with_copy_0   rows; op(B) is packed once, by all threads together
//   2d_grid          each thread one tile of a grid of threads, by one call
//   2d_xgemm_p       the same, in blocks, by a serial GEMM for each
//   2d_acopy_n       groups of threads share a packed block of op(A) and split the columns
//   2d_bcopy         pairs of threads share a packed block of op(B) and split the rows
//   2d_abcopy_abx_m_km_par_p   rows; each thread packs op(A) and op(B) for itself and walks C in an order of its own
#pragma once

#include "blas/thread/32e/level3/gemm_plan.h"

// f(name, T): the strategies that there are.
#define QTB_FOR_EACH_GEMM_STRATEGY(f)                                                                                 \
  f(sgemm_1d_row, float) f(dgemm_1d_row, double) f(cgemm_1d_row, cfloat) f(zgemm_1d_row, cdouble)                     \
      f(sgemm_1d_col, float) f(dgemm_1d_col, double) f(cgemm_1d_col, cfloat) f(zgemm_1d_col, cdouble)                 \
          f(dgemm_1d_with_copy_0, double) f(sgemm_2d_grid, float) f(dgemm_2d_grid, double) f(sgemm_2d_xgemm_p, float) \
              f(dgemm_2d_xgemm_p, double) f(dgemm_2d_acopy_n, double) f(cgemm_2d_bcopy, cfloat)                       \
                  f(zgemm_2d_bcopy, cdouble) f(sgemm_2d_abcopy_abx_m_km_par_p, float)                                 \
                      f(dgemm_2d_abcopy_abx_m_km_par_p, double) f(cgemm_2d_abcopy_abx_m_km_par_p, cfloat)             \
                          f(zgemm_2d_abcopy_abx_m_km_par_p, cdouble)

extern "C" {
#define QTB_DECLARE_GEMM_STRATEGY(name, T) QTB_HIDDEN void qtb_blas_##name(QTB_PARAMS_GEMM_STRATEGY(T));
QTB_FOR_EACH_GEMM_STRATEGY(QTB_DECLARE_GEMM_STRATEGY)
#undef QTB_DECLARE_GEMM_STRATEGY
}
