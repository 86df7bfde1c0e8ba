// The block sizes of the base families of the tiers whose parallel drivers cut by them.
#include "blas/kernels/level3/gemm/blocks.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(sgemm_blocks, blocks, float, blocks_of_family<float>)
QTB_KERNEL(dgemm_blocks, blocks, double, blocks_of_family<double>)
QTB_KERNEL(cgemm_blocks, blocks, cfloat, blocks_of_family<cfloat>)
QTB_KERNEL(zgemm_blocks, blocks, cdouble, blocks_of_family<cdouble>)

}  // namespace qtb::QTB_TIER
