// dscal, cscal, zscal (scal.h); csscal, zdscal: the same on complex elements with a real alpha.
#include "blas/kernels/level1/scal.h"

namespace qtb::QTB_TIER {
namespace {

// A complex element times a real number: both parts times that number.
template <class T>
struct PartScaling {
  Real<T> alpha;
  void single(const T *, T *x) const {
    Real<T> *part = parts(x);
    store_single(part, alpha * load_single(part));
    store_single(part + 1, alpha * load_single(part + 1));
  }
};

template <auto real_scal, class T>
void scal_by_real(const QtbInt *n, const Real<T> *alpha, T *x, const QtbInt *incx) {
  if (*n < 1) return;
  if (*incx == 1) {
    const QtbInt part_count = 2 * *n;
    real_scal(&part_count, alpha, parts(x), incx);
    return;
  }
  const QtbInt inc = *incx < 0 ? -*incx : *incx;
  Walk<T, T> walk{*n, x, inc, x, inc};
  PartScaling<T> scaling{*alpha};
  single_passes<1>(walk, scaling);
}

}  // namespace

QTB_KERNEL(dscal, scal, double, scal<row_dscal>)
QTB_KERNEL(cscal, scal, cfloat, scal<row_cscal>)
QTB_KERNEL(zscal, scal, cdouble, scal<row_zscal>)
QTB_KERNEL(csscal, real_scal, cfloat, (scal_by_real<QTB_TIER_NAME(xsscal), cfloat>))
QTB_KERNEL(zdscal, real_scal, cdouble, (scal_by_real<QTB_TIER_NAME(xdscal), cdouble>))

}  // namespace qtb::QTB_TIER
