// stbmv, dtbmv, ctbmv, ztbmv: x := op(T)*x, in place, for a band triangle.
//
// Any address; increments of either sign. The complex routines choose between two forms by tier, order and width of the
// band; the general one has a name of its own.
#include "blas/kernels/level2/band_triangle.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(stbmv, tbmv, float, (take_band<Task::product, 2>))
QTB_KERNEL(dtbmv, tbmv, double, (take_band<Task::product, 2>))
QTB_BAND_KERNELS(ctbmv, cfloat, Task::product)
QTB_BAND_KERNELS(ztbmv, cdouble, Task::product)

}  // namespace qtb::QTB_TIER
