// Products and solves from the right without packing, for a triangle of any size.
//
// Groups of a few columns, whose sums over the columns before them stay in registers; rows go by some at a time, so
// that these columns stay in the cache while the groups pass. The columns that fill no group are the first, with
// nothing before them. A product takes the groups from the last down, a solve from the first up.
#pragma once

#include "blas/kernels/level3/triangular/lines_at_once.h"
#include "blas/kernels/level3/triangular/right_columns.h"

namespace qtb::QTB_TIER {
namespace {

template <bool solves, class T>
void unblocked_from_right(const TriForm &form, QtbInt m, QtbInt n, const T *alpha, const T *a, QtbInt lda, T *b,
                          QtbInt ldb) {
  constexpr int group = columns_at_once<T>;
  constexpr QtbInt least_rows = 8 * lanes<T>;
  const QtbInt rest = n % group, rows_at_once = m <= least_rows ? m : lines_at_once<T>(n, least_rows);
  for (QtbInt i = 0; i < m; i += rows_at_once) {
    const RightTriangle<T> triangle(form, n, a, lda, b + i, ldb);
    const QtbInt rows = smaller(rows_at_once, m - i);
    const auto take_rest = [&] {
      if (rest > 0)
        with_count<group - 1>(rest, [&](auto count) {
          right_columns<solves, count.value, 2, false>(triangle, form.unit, rows, 0, alpha);
        });
    };
    if (solves) take_rest();
    for (QtbInt done = 0; done < n - rest; done += group)
      right_columns<solves, group, 2, true>(triangle, form.unit, rows, solves ? rest + done : n - group - done, alpha);
    if (!solves) take_rest();
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
