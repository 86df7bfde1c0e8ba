// The block sizes of the ssse3 tier's family for processors with SSE4.1.
#include "blas/kernels/level3/gemm/blocks.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(sgemm_sse41_blocks, blocks, float, (blocks_of_family<float, Family::sse41>))
QTB_KERNEL(dgemm_sse41_blocks, blocks, double, (blocks_of_family<double, Family::sse41>))
QTB_KERNEL(cgemm_sse41_blocks, blocks, cfloat, (blocks_of_family<cfloat, Family::sse41>))
QTB_KERNEL(zgemm_sse41_blocks, blocks, cdouble, (blocks_of_family<cdouble, Family::sse41>))

}  // namespace qtb::QTB_TIER
