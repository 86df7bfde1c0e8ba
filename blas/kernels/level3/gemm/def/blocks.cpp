// The block sizes of the def tier's double-precision families with the 4 x 4 tile.
#include "blas/kernels/level3/gemm/blocks.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(dgemm_def_blocks_a, blocks, double, (blocks_of_family<double, Family::def_a>))
QTB_KERNEL(dgemm_def_blocks_b, blocks, double, (blocks_of_family<double, Family::def_b>))

}  // namespace qtb::QTB_TIER
