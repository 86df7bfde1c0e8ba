// A := alpha*x*x^T + A on columns of a triangle: syr, spr and their pieces.
//
// A column whose element of x is zero is skipped (a NaN is not zero). Any increment and addresses; x does not overlap
// A.
#pragma once

#include "blas/kernels/level2/rank_update.h"

namespace qtb::QTB_TIER {
namespace {

// Contiguous and strided vectors have a loop each, so that neither saves the registers that the other needs.
template <bool contiguous, class T>
[[gnu::noinline]] void update_columns(QtbInt columns, StoredColumns<T> a, T alpha, From<T> x) {
  if constexpr (contiguous) x.inc = 1;
  for (; columns > 0; --columns, a.advance()) {
    const T of_column = x[a.first + a.diagonal()];
    if (is_zero(of_column)) continue;
    update_column(a.rows, a.column, OneVector<T>(alpha * of_column), x.template cursor<contiguous>(a.first));
  }
}
template <class T>
void update(QtbInt columns, const StoredColumns<T> &a, T alpha, const From<T> &x) {
  if (x.inc == 1)
    update_columns<true>(columns, a, alpha, x);
  else
    update_columns<false>(columns, a, alpha, x);
}

}  // namespace
}  // namespace qtb::QTB_TIER
