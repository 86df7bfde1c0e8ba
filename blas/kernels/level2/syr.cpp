// ssyr, dsyr, sspr, dspr: A := alpha*x*x^T + A on one triangle of A, full or packed; cher, zher, chpr, zhpr:
// A := alpha*x*x^H + A with a real alpha.
//
// A column whose element of x is zero is skipped (a NaN is not zero), but for the imaginary part of its diagonal, which
// an update of a Hermitian matrix always sets to zero. Any increment and addresses; x does not overlap A.
//
// The columns of a Hermitian matrix are updated by an axpy: of this tier, or, zher and zhpr of the lower tiers, by the
// one that may use threads. Beside a contiguous x four columns at once take the same update.

#include "blas/kernels/level2/syr.h"
#include "blas/kernels/level2/multiples.h"
#include "blas/kernels/level2/sweep.h"
#include "blas/thread/drivers.h"

namespace qtb::QTB_TIER {
namespace {

// column[i] += factor*x[i] for rows elements; x is what a routine of the interface expects.
inline void add_multiple(QtbInt rows, cfloat factor, const cfloat *x, QtbInt incx, cfloat *column) {
  if constexpr (this_tier >= tier_ssse3) {
    const QtbInt one = 1;
    QTB_TIER_NAME(xcaxpy)(&rows, &factor, x, &incx, column, &one);
  } else {
    const OneVector<cfloat> work(factor);
    const From<cfloat> from(x, rows, incx);
    if (incx == 1)
      update_column(rows, column, work, from.cursor<true>(0));
    else
      update_column(rows, column, work, from.cursor<false>(0));
  }
}
inline void add_multiple(QtbInt rows, cdouble factor, const cdouble *x, QtbInt incx, cdouble *column) {
  constexpr auto axpy = this_tier >= tier_ssse3 ? QTB_TIER_NAME(xzaxpy) : qtb_blas_zaxpy;
  const QtbInt one = 1;
  axpy(&rows, &factor, x, &incx, column, &one);
}

// An element of the diagonal keeps no imaginary part.
template <class R>
void update_diagonal(Complex<R> *element, Complex<R> of_column, Complex<R> factor) {
  store_element(element, Complex<R>{load_single(parts(element)) + real_part(of_column * factor), 0});
}

// Four columns at once, beside a contiguous x: their triangle on the diagonal singly, the rows that all have together.
// own is x from the first column's diagonal on, which has so many rows beside it. False, and nothing done, where a
// column takes no update.
template <bool upper, class R>
[[gnu::always_inline]] inline bool update_four(QtbInt rows, const StoredColumns<Complex<R>> &a, R alpha,
                                               const Complex<R> *own) {
  using T = Complex<R>;
  constexpr int count = multiplied_columns;
  T of_column[count], factors[count];
  bool any_zero = false;
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    of_column[j.value] = load_element(own + j.value);
    factors[j.value] = alpha * conjugate(of_column[j.value]);
    any_zero = any_zero || is_zero(of_column[j.value]) || is_zero(factors[j.value]);
  });
  if (any_zero) return false;
  T *diagonal = upper ? a.column + rows : a.column;
  QtbInt step = upper ? a.step + 1 : a.step;
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    const OneVector<T> work(factors[j.value]);
    repeat<upper ? j.value : count - 1 - j.value>([&](auto i) __attribute__((always_inline)) {
      constexpr int beside = upper ? -1 - i.value : 1 + i.value;
      update_element(diagonal + beside, work, own + j.value + beside);
    });
    update_diagonal(diagonal, of_column[j.value], factors[j.value]);
    diagonal += step;
    step += a.growth;
  });
  if constexpr (upper)
    add_multiples(rows, factors, own - rows, a.column, a.step, a.growth);
  else
    add_multiples(rows - (count - 1), factors, own + count, a.column + count, a.step - 1, a.growth);
  return true;
}

// Most columns of a small matrix are so short that what goes on around a call counts: the diagonal is done before it,
// so that nothing is kept across but addresses, and those advance.
template <bool upper, class R>
[[gnu::noinline]] void update_hermitian(QtbInt order, StoredColumns<Complex<R>> a, R alpha, const From<Complex<R>> &x) {
  using T = Complex<R>;
  QtbInt rows = upper ? 0 : order - 1;  // beside the diagonal
  const T *own = x.base, *others = x.argument(upper ? 0 : 1, rows);
  // An argument is the end of the vector that is lowest in memory: it moves where that is the one at the diagonal.
  const QtbInt others_step = upper == (x.inc < 0) ? x.inc : 0;
  const auto advance = [&](int columns) __attribute__((always_inline)) {
    own += columns * x.inc;
    others += columns * others_step;
    rows += upper ? columns : -columns;
    order -= columns;
    for (; columns > 0; --columns) {
      a.column += a.step;
      a.step += a.growth;
    }
  };
  QtbInt singly = 0;  // columns that do not go with others
  while (order > 0) {
    if (x.inc == 1 && singly == 0 && order >= multiplied_columns) {
      if (update_four<upper>(rows, a, alpha, own)) {
        advance(multiplied_columns);
        continue;
      }
      singly = multiplied_columns;
    }
    T *const diagonal = upper ? a.column + rows : a.column;
    const T of_column = load_element(own);
    if (is_zero(of_column)) {
      store_element(diagonal, T{load_single(parts(diagonal)), 0});
    } else {
      const T factor = alpha * conjugate(of_column);
      update_diagonal(diagonal, of_column, factor);
      if (rows > 0) add_multiple(rows, factor, others, x.inc, upper ? a.column : a.column + 1);
    }
    advance(1);
    if (singly > 0) --singly;
  }
}
template <class R>
void update_hermitian(QtbInt order, const StoredColumns<Complex<R>> &a, R alpha, const From<Complex<R>> &x) {
  if (a.ends_on_diagonal())
    update_hermitian<true>(order, a, alpha, x);
  else
    update_hermitian<false>(order, a, alpha, x);
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
