// gemm_scale_c: C := beta*C, C m x n with columns ldc apart.
//
// A beta of 0 stores zeros without reading C, a beta of 1 does nothing. Columns are walked in vectors, from a vector
// boundary on where the column is long enough for the step to pay; each complex element is one full complex product.
// No alignment is asked for. Fewer than one row or column: nothing is written.
#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

// f(i) at each vector of a column, g(i) at each element that no vector has.
template <class T, class F, class G>
[[gnu::always_inline]] inline void walk_column(QtbInt m, const T *column, F f, G g) {
  constexpr QtbInt step = lanes<T>, least_to_align = 9;
  QtbInt i = 0;
  if (step > 1 && m >= least_to_align && element_aligned(column))
    for (; phase(column + i) != 0; i++) g(i);
  for (; i + step <= m; i += step) f(i);
  for (; i < m; i++) g(i);
}

template <class T>
QTB_FUNCTION(scale_c, T, scale_c) {
  if (is_one(*beta)) return;
  // Columns without a gap are one long column.
  const bool gapless = *ldc == *m && *n > 0;
  const QtbInt rows = gapless ? *m * *n : *m, columns = gapless ? 1 : *n;
  if (is_zero(*beta)) {
    const Vec<T> zeros = zero<T>();
    for (QtbInt j = 0; j < columns; j++) {
      T *column = c + j * *ldc;
      walk_column(
          rows, column, [&](QtbInt i) { store_unaligned(column + i, zeros); },
          [&](QtbInt i) { store_lowest(column + i, zeros); });
    }
    return;
  }
  const Factor<T> factor(*beta);
  for (QtbInt j = 0; j < columns; j++) {
    T *column = c + j * *ldc;
    walk_column(
        rows, column, [&](QtbInt i) { store_unaligned(column + i, factor.times(load_unaligned(column + i))); },
        [&](QtbInt i) {
          if constexpr (is_complex<T>)
            store_lowest(column + i, factor.times(load_repeated(column + i)));
          else
            store_single(column + i, *beta * load_single(column + i));
        });
  }
}

}  // namespace

QTB_KERNEL(sgemm_scale_c, scale_c, float, scale_c<float>)
QTB_KERNEL(dgemm_scale_c, scale_c, double, scale_c<double>)
QTB_KERNEL(cgemm_scale_c, scale_c, cfloat, scale_c<cfloat>)
QTB_KERNEL(zgemm_scale_c, scale_c, cdouble, scale_c<cdouble>)

}  // namespace qtb::QTB_TIER
