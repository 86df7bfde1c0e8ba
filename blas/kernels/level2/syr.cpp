// ssyr, dsyr, sspr, dspr: A := alpha*x*x^T + A on one triangle of A, full or packed; cher, zher, chpr, zhpr:
// A := alpha*x*x^H + A with a real alpha.
//
// A column whose element of x is zero is skipped (a NaN is not zero), but for the imaginary part of its diagonal, which
// an update of a Hermitian matrix always sets to zero. Any increment and addresses; x does not overlap A.
//
// The columns of a Hermitian matrix are updated by an axpy: of this tier, or, zher and zhpr of the lower tiers, by the
// one that may use threads.

#include "blas/kernels/level2/syr.h"
#include "blas/thread/drivers.h"

namespace qtb::QTB_TIER {
namespace {

// column[i] += factor*x[first + i].
inline void add_multiple(QtbInt rows, cfloat factor, const From<cfloat> &x, QtbInt first, cfloat *column) {
  if constexpr (this_tier >= tier_ssse3) {
    const QtbInt one = 1;
    QTB_TIER_NAME(xcaxpy)(&rows, &factor, x.argument(first, rows), &x.inc, column, &one);
  } else {
    const OneVector<cfloat> work(factor);
    if (x.inc == 1)
      update_column(rows, column, work, x.cursor<true>(first));
    else
      update_column(rows, column, work, x.cursor<false>(first));
  }
}
inline void add_multiple(QtbInt rows, cdouble factor, const From<cdouble> &x, QtbInt first, cdouble *column) {
  constexpr auto axpy = this_tier >= tier_ssse3 ? QTB_TIER_NAME(xzaxpy) : qtb_blas_zaxpy;
  const QtbInt one = 1;
  axpy(&rows, &factor, x.argument(first, rows), &x.inc, column, &one);
}

template <class R>
[[gnu::noinline]] void update_hermitian(QtbInt columns, StoredColumns<Complex<R>> a, R alpha, From<Complex<R>> x) {
  using T = Complex<R>;
  for (; columns > 0; --columns, a.advance()) {
    const T of_column = x[a.first + a.diagonal()];
    T *const diagonal = a.column + a.diagonal();
    R real = load_single(diagonal).re;
    if (!is_zero(of_column)) {
      const T factor = alpha * conjugate(of_column);
      const QtbInt off = a.ends_on_diagonal() ? 0 : 1;
      if (a.rows > 1) add_multiple(a.rows - 1, factor, x, a.first + off, a.column + off);
      real += real_part(of_column * factor);
    }
    store_single(diagonal, T{real, 0});
  }
}

template <class T>
QTB_FUNCTION(syr, T, syr) {
  if (*n <= 0 || is_zero(*alpha)) return;
  update(*n, full_triangle(uplo, a, *lda, *n, 0), *alpha, From<T>(x, *n, *incx));
}
template <class T>
QTB_FUNCTION(spr, T, spr) {
  if (*n <= 0 || is_zero(*alpha)) return;
  update(*n, packed_triangle(uplo, ap, *n), *alpha, From<T>(x, *n, *incx));
}
template <class T>
QTB_FUNCTION(her, T, her) {
  if (*n <= 0 || is_zero(*alpha)) return;
  update_hermitian(*n, full_triangle(uplo, a, *lda, *n, 0), *alpha, From<T>(x, *n, *incx));
}
template <class T>
QTB_FUNCTION(hpr, T, hpr) {
  if (*n <= 0 || is_zero(*alpha)) return;
  update_hermitian(*n, packed_triangle(uplo, ap, *n), *alpha, From<T>(x, *n, *incx));
}

}  // namespace

QTB_KERNEL(ssyr, syr, float, syr<float>)
QTB_KERNEL(dsyr, syr, double, syr<double>)
QTB_KERNEL(cher, her, cfloat, her<cfloat>)
QTB_KERNEL(zher, her, cdouble, her<cdouble>)
QTB_KERNEL(sspr, spr, float, spr<float>)
QTB_KERNEL(dspr, spr, double, spr<double>)
QTB_KERNEL(chpr, hpr, cfloat, hpr<cfloat>)
QTB_KERNEL(zhpr, hpr, cdouble, hpr<cdouble>)

}  // namespace qtb::QTB_TIER
