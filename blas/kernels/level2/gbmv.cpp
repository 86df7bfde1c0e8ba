// sgbmv, dgbmv, cgbmv, zgbmv: y := alpha*op(A)*x + beta*y for an m x n band matrix with kl diagonals below and ku above
// the main one.
//
// Any address; increments of either sign; x and y do not overlap. Nothing is read of A and x for an alpha of zero, and
// nothing of y for a beta of zero. Columns go in pairs, over the rows that both have at once: updates of y with N, dot
// products with T and C.
#include "blas/kernels/level2/line_vectors.h"
#include "blas/kernels/level2/scale_y.h"

namespace qtb::QTB_TIER {
namespace {

// The diagonals of A are the rows of its array: element (i, j) is origin[i + j*along].
template <class T>
struct GeneralBand {
  const T *origin;
  QtbInt along, m, kl, ku;

  // The rows of columns j to j + count - 1. The top of a column that starts with row 0 is cut.
  template <bool top_cut, int count>
  GroupRows rows(QtbInt j) const {
    constexpr QtbInt right = count - 1;
    const QtbInt first = top_cut ? 0 : j - ku;
    return {first, top_cut ? 0 : first + right, end(j), end(j + right)};
  }
  QtbInt end(QtbInt j) const { return kl < m - j ? j + kl + 1 : m; }
  template <int count>
  Group<count, T> group(QtbInt j) const {
    Group<count, T> g;
    repeat<count>([&](auto q) __attribute__((always_inline)) { g.column[q.value] = origin + (j + q.value) * along; });
    return g;
  }
};

template <class T>
struct AddingColumns {
  GeneralBand<T> a;
  T alpha;
  LineVector<T, const T *> x;
  LineVector<T> y;

  template <bool top_cut, int count>
  [[gnu::always_inline]] void take(QtbInt j) const {
    T factors[count];
    repeat<count>([&](auto q) __attribute__((always_inline)) { factors[q.value] = alpha * x.get(j + q.value); });
    add_group(a.template group<count>(j), a.template rows<top_cut, count>(j), factors, y);
  }
};

template <bool conjugated, class T>
struct DotColumns {
  GeneralBand<T> a;
  T alpha;
  LineVector<T, const T *> x;
  LineVector<T> y;

  template <bool top_cut, int count>
  [[gnu::always_inline]] void take(QtbInt j) const {
    T sums[count] = {};
    dot_group<conjugated>(a.template group<count>(j), a.template rows<top_cut, count>(j), x, sums);
    repeat<count>([&](auto q) __attribute__((always_inline)) {
      y.set(j + q.value, y.get(j + q.value) + alpha * sums[q.value]);
    });
  }
};

// Columns whose top is cut come first. A column past the last row has none at all.
template <class Work>
[[gnu::noinline]] void take_columns(const Work &work, QtbInt n) {
  const QtbInt m = work.a.m, ku = work.a.ku, columns = n - m < ku ? n : m + ku, cut = ku < columns ? ku + 1 : columns;
  QtbInt j = 0;
  for (; cut - j >= 2; j += 2) work.template take<true, 2>(j);
  if (j < cut) work.template take<true, 1>(j++);
  for (; columns - j >= 2; j += 2) work.template take<false, 2>(j);
  if (j < columns) work.template take<false, 1>(j);
}

template <class T>
QTB_FUNCTION(gbmv, T, gbmv) {
  if (*m <= 0 || *n <= 0 || (is_zero(*alpha) && is_one(*beta))) return;
  const Op op = read_op<T>(trans);
  const QtbInt lenx = op == Op::none ? *n : *m, leny = op == Op::none ? *m : *n;
  scale_y(leny, *beta, y, *incy);
  if (is_zero(*alpha)) return;
  const GeneralBand<T> band{a + *ku, *lda - 1, *m, *kl, *ku};
  const bool swept = *incx == 1 && *incy == 1;
  const LineVector<T, const T *> from{walk_start(x, lenx, *incx), *incx, swept};
  const LineVector<T> to{walk_start(y, leny, *incy), *incy, swept};
  switch (op) {
    case Op::none: return take_columns(AddingColumns<T>{band, *alpha, from, to}, *n);
    case Op::transpose: return take_columns(DotColumns<false, T>{band, *alpha, from, to}, *n);
    case Op::conjugate:
      if constexpr (is_complex<T>) take_columns(DotColumns<true, T>{band, *alpha, from, to}, *n);
  }
}

}  // namespace

QTB_KERNEL(sgbmv, gbmv, float, gbmv<float>)
QTB_KERNEL(dgbmv, gbmv, double, gbmv<double>)
QTB_KERNEL(cgbmv, gbmv, cfloat, gbmv<cfloat>)
QTB_KERNEL(zgbmv, gbmv, cdouble, gbmv<cdouble>)

}  // namespace qtb::QTB_TIER
