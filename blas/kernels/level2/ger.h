// ger, geru, gerc: A := alpha*x*y^T + A, or alpha*x*y^H + A, for a full m x n matrix, column by column.
//
// Any address, increments of either sign; x and y do not overlap A. A column whose element of y is zero, in both parts
// if complex, is skipped: it is not read, and a NaN in x does not reach it. A NaN in y is not zero. The other columns
// are updates by AXPY, to which four columns beside a contiguous x come at once.
#pragma once

#include "blas/kernels/level2/multiples.h"
#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

// axpy is the one that updates a column.
template <class T, auto axpy, bool conjugated = false>
QTB_FUNCTION(ger, T, ger_by_axpy) {
  if (*m <= 0 || *n <= 0 || is_zero(*alpha)) return;
  const QtbInt unit = 1;
  y = walk_start(y, *n, *incy);
  const auto column = [&](QtbInt j) {
    const T element = load_element(y + j * *incy);
    if (is_zero(element)) return;
    const T factor = *alpha * conjugate_if<conjugated>(element);
    axpy(m, &factor, x, incx, a + j * *lda, &unit);
  };
  QtbInt j = 0;
  if (*incx == 1)
    for (; j + multiplied_columns <= *n; j += multiplied_columns) {
      T factors[multiplied_columns];
      bool any_zero = false;
      repeat<multiplied_columns>([&](auto k) __attribute__((always_inline)) {
        const T element = load_element(y + (j + k.value) * *incy);
        factors[k.value] = *alpha * conjugate_if<conjugated>(element);
        // A product may be zero where its factors are not: AXPY, too, then leaves the column alone.
        any_zero = any_zero || is_zero(element) || is_zero(factors[k.value]);
      });
      if (any_zero)
        for (int k = 0; k < multiplied_columns; k++) column(j + k);
      else
        add_multiples(*m, factors, x, a + j * *lda, *lda, 0);
    }
  for (; j < *n; j++) column(j);
}

}  // namespace
}  // namespace qtb::QTB_TIER
