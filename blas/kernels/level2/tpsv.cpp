// stpsv, dtpsv, ctpsv, ztpsv: x := op(T)^-1*x, in place, for a packed triangle.
//
// Any address; increments of either sign.
#include "blas/kernels/level2/packed_triangle.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(stpsv, tpmv, float, take_packed<Task::solve>)
QTB_KERNEL(dtpsv, tpmv, double, take_packed<Task::solve>)
QTB_KERNEL(ctpsv, tpmv, cfloat, take_packed<Task::solve>)
QTB_KERNEL(ztpsv, tpmv, cdouble, take_packed<Task::solve>)

}  // namespace qtb::QTB_TIER
