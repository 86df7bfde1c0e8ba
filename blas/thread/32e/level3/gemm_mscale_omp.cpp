// The scaling pass of a parallel GEMM. See gemm_mscale_omp.h.

#include "blas/thread/32e/level3/gemm_mscale_omp.h"

#include "blas/thread/32e/level3/gemm_share.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/team.h"

namespace qtb {
namespace {

template <class T>
void gemm_mscale(QtbInt nthreads, QTB_PARAMS_scale_c(T)) {
  run_team(nthreads, [&](const Team &team) {
    const GemmRange columns = gemm_range(*n, team.size, team.rank);
    GemmSlots<T>::scale_c(m, &columns.count, beta, c + columns.first * *ldc, ldc);
  });
}

}  // namespace
}  // namespace qtb

extern "C" {
void qtb_blas_sgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(float)) {
  qtb::gemm_mscale<float>(nthreads, QTB_ARGS(scale_c));
}
void qtb_blas_dgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(double)) {
  qtb::gemm_mscale<double>(nthreads, QTB_ARGS(scale_c));
}
void qtb_blas_cgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(cfloat)) {
  qtb::gemm_mscale<cfloat>(nthreads, QTB_ARGS(scale_c));
}
void qtb_blas_zgemm_mscale_omp(QtbInt nthreads, QTB_PARAMS_scale_c(cdouble)) {
  qtb::gemm_mscale<cdouble>(nthreads, QTB_ARGS(scale_c));
}
}
