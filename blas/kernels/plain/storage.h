// A stored triangle, column by column. column(j)[i] is element (i, j) for the stored rows i; the diagonal is at i = j,
// and the others run from off_begin(j) to off_end(j). Nothing else of a column may be touched.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Triangle {
  T *origin;
  QtbInt ld;
  QtbInt n;
  bool upper;

  T *column(QtbInt j) const { return origin + j * ld; }
  QtbInt off_begin(QtbInt j) const { return upper ? 0 : j + 1; }
  QtbInt off_end(QtbInt j) const { return upper ? j : n; }
};

template <class T>
Triangle<T> triangle(const char *uplo, T *a, QtbInt lda, QtbInt n) {
  return {a, lda, n, is_letter(*uplo, 'U')};
}

}  // namespace
}  // namespace qtb::QTB_TIER
