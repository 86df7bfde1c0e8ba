// C := beta*C for m x n, n at least 1, by a team of nthreads or of what the runtime gives. nthreads goes by value and
// first. One region, whose threads each scale some columns.
#pragma once

#include "blas/shapes.h"

extern "C" {
QTB_HIDDEN void qtb_blas_sgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(float));
QTB_HIDDEN void qtb_blas_dgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(double));
QTB_HIDDEN void qtb_blas_cgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(cfloat));
QTB_HIDDEN void qtb_blas_zgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(cdouble));
}
