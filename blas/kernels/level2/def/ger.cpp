// ger, geru, gerc of def: the contract of ger.h.
//
// Real columns are updated by the AXPY that may use threads elsewhere, and runs serially in this tier; complex ones
// here, four columns at once where all is contiguous.
#include "blas/kernels/level2/ger.h"
#include "blas/thread/drivers.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
void add_multiple(QtbInt m, T factor, const T *x, QtbInt incx, T *column) {
  const ColumnFactors<T, 1> f({factor});
  for (QtbInt i = 0; i < m; i++)
    store_lowest(column + i, f.add_to(load_repeated(column + i), [&](auto) { return load_repeated(x + i * incx); }));
}

template <class T, bool conjugated>
QTB_FUNCTION(ger, T, ger_inline) {
  if (*m <= 0 || *n <= 0 || is_zero(*alpha)) return;
  x = walk_start(x, *m, *incx);
  y = walk_start(y, *n, *incy);
  const auto factor = [&](QtbInt j) { return *alpha * conjugate_if<conjugated>(load_element(y + j * *incy)); };
  const auto skipped = [&](QtbInt j) { return is_zero(load_element(y + j * *incy)); };
  const auto columns = [&](QtbInt j, QtbInt end) {
    for (; j < end; j++)
      if (!skipped(j)) add_multiple(*m, factor(j), x, *incx, a + j * *lda);
  };
  QtbInt j = 0;
  if (*incx == 1 && *incy == 1)
    for (; j + multiplied_columns <= *n; j += multiplied_columns) {
      if (skipped(j) || skipped(j + 1) || skipped(j + 2) || skipped(j + 3))
        columns(j, j + multiplied_columns);
      else
        add_multiples(*m, {factor(j), factor(j + 1), factor(j + 2), factor(j + 3)}, x, a + j * *lda, *lda, 0);
    }
  columns(j, *n);
}
}  // namespace

QTB_KERNEL(sger, ger, float, (ger_by_axpy<float, qtb_blas_saxpy>))
QTB_KERNEL(dger, ger, double, (ger_by_axpy<double, qtb_blas_daxpy>))
QTB_KERNEL(cgeru, ger, cfloat, (ger_inline<cfloat, false>))
QTB_KERNEL(zgeru, ger, cdouble, (ger_inline<cdouble, false>))
QTB_KERNEL(cgerc, ger, cfloat, (ger_inline<cfloat, true>))
QTB_KERNEL(zgerc, ger, cdouble, (ger_inline<cdouble, true>))

}  // namespace qtb::QTB_TIER
