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

// Four columns at once, each vector of x loaded for all of them.
template <class T>
[[gnu::noinline]] void add_multiples(QtbInt m, const T (&factors)[4], const T *x, T *a, QtbInt lda) {
  const Factor<T> f[] = {Factor<T>(factors[0]), Factor<T>(factors[1]), Factor<T>(factors[2]), Factor<T>(factors[3])};
  T *column[] = {a, a + lda, a + 2 * lda, a + 3 * lda};
  for (; m >= lanes<T>; m -= lanes<T>, x += lanes<T>) {
    const Vec<T> elements = load_unaligned(x);
    repeat<4>([&](auto j) __attribute__((always_inline)) {
      T *&p = column[j.value];
      store_unaligned(p, add(load_unaligned(p), f[j.value].times(elements)));
      p += lanes<T>;
    });
  }
  if (m == 0) return;
  const Vec<T> element = load_repeated(x);
  repeat<4>([&](auto j) __attribute__((always_inline)) {
    T *const p = column[j.value];
    store_lowest(p, add(load_repeated(p), f[j.value].times(element)));
  });
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
    for (; j + 4 <= *n; j += 4) {
      if (skipped(j) || skipped(j + 1) || skipped(j + 2) || skipped(j + 3))
        columns(j, j + 4);
      else
        add_multiples(*m, {factor(j), factor(j + 1), factor(j + 2), factor(j + 3)}, x, a + j * *lda, *lda);
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
