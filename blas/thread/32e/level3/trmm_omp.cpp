// The parallel triangular products. See trmm_omp.h.

#include "blas/thread/32e/level3/trmm_omp.h"
#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level3/trmm_slabs.h"

extern "C" {
#define QTB_DEFINE_TRMM_OMP(name, T)                                                  \
  void qtb_blas_##name##_omp(const qtb::TrmmDecision *decision, QTB_PARAMS_trmm(T)) { \
    qtb::trmm_by_slabs<T, &qtb_blas_x##name>(*decision, QTB_ARGS(trmm));              \
  }
QTB_FOR_EACH_TRMM(QTB_DEFINE_TRMM_OMP)
}
