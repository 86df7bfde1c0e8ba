// What parallel drivers call of the sse42 tier alone: dgemm with B in place and with A packed outside.
#include "blas/kernels/level3/gemm/body.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(dgemm_nobcopy, gemm, double, gemm_in_place<double>)
QTB_KERNEL(dgemm_apacked, gemm_apacked, double, gemm_of_packed_a<double>)

}  // namespace qtb::QTB_TIER
