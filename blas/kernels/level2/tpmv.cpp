// stpmv, dtpmv, ctpmv, ztpmv: x := op(T)*x, in place, for a packed triangle.
//
// Any address; increments of either sign.
#include "blas/kernels/level2/packed_triangle.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(stpmv, tpmv, float, take_packed<Task::product>)
QTB_KERNEL(dtpmv, tpmv, double, take_packed<Task::product>)
QTB_KERNEL(ctpmv, tpmv, cfloat, take_packed<Task::product>)
QTB_KERNEL(ztpmv, tpmv, cdouble, take_packed<Task::product>)

}  // namespace qtb::QTB_TIER
