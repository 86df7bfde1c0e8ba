// stbsv, dtbsv, ctbsv, ztbsv: x := op(T)^-1*x, in place, for a band triangle.
//
// Any address; increments of either sign. The complex routines choose between two forms by tier, order and width of the
// band; the general one has a name of its own.
#include "blas/kernels/level2/band_triangle.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(stbsv, tbmv, float, (take_band<Task::solve, 1>))
QTB_KERNEL(dtbsv, tbmv, double, (take_band<Task::solve, 1>))
QTB_BAND_KERNELS(ctbsv, cfloat, Task::solve)
QTB_BAND_KERNELS(ztbsv, cdouble, Task::solve)

}  // namespace qtb::QTB_TIER
