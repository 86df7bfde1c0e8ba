// sscal, dscal, cscal, zscal: x[i] := alpha * x[i] over n elements; csscal, zdscal: the same with a real alpha.
//
// Increments in elements, of either sign: a negative one touches the same elements as its absolute value. With a zero
// increment one element is multiplied n times. Addresses of any alignment. An alpha of zero multiplies like any other:
// NaN and infinity in x become NaN. Some tiers return at once for an alpha of one. An element's bits depend on the
// element alone.

#include "blas/kernels/level1/walk.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Scaling {
  static constexpr bool gathers = true, updates = true;
  Factor<T> alpha;
  explicit Scaling(T a) : alpha(a) {}

  template <int k, class X, class Y>
  void vector(X &, Y &x) {
    x.store(k, alpha.times(x.load(k)));
  }
  void single(const T *, T *x) const {
    if constexpr (is_complex<T>)
      store_lowest(x, alpha.times(load_repeated(x)));
    else
      store_single(x, alpha.value * load_single(x));
  }
};

template <Row row, class T>
void scal(const QtbInt *n, const T *alpha, T *x, const QtbInt *incx) {
  if (*n < 1) return;
  if constexpr (returns_for_one<row>)
    if (is_one(*alpha)) return;
  const QtbInt inc = *incx < 0 ? -*incx : *incx;
  elementwise<row, Scaling<T>>(inc == 1, *n, x, inc, x, inc, alpha);
}

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

// The two upper tiers share one sscal.
#if QTB_TIER_IS(avx)
extern "C" QTB_HIDDEN QTB_FUNCTION(scal, float, QTB_TIER_NAME(xsscal));
#else
QTB_KERNEL(sscal, scal, float, scal<row_sscal>)
#endif
#if QTB_TIER_IS(sse42)
QTB_KERNEL_SHARED(avx, sscal, scal, float)
#endif
QTB_KERNEL(dscal, scal, double, scal<row_dscal>)
QTB_KERNEL(cscal, scal, cfloat, scal<row_cscal>)
QTB_KERNEL(zscal, scal, cdouble, scal<row_zscal>)
QTB_KERNEL(csscal, real_scal, cfloat, (scal_by_real<QTB_TIER_NAME(xsscal), cfloat>))
QTB_KERNEL(zdscal, real_scal, cdouble, (scal_by_real<QTB_TIER_NAME(xdscal), cdouble>))

}  // namespace qtb::QTB_TIER
