// How Level 2 stores a matrix: for each column where it lies and which rows it has.
//
// Full, band and packed storage differ only in that. column(j)[i] is element (i, j) for begin(j) <= i < end(j); nothing
// else of a column may be touched.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

// A general m-row matrix, full or with kl diagonals below and ku above the main one.
template <class T>
struct General {
  T *origin;
  QtbInt step;  // elements from one column to the next within a row
  QtbInt m, kl, ku;

  T *column(QtbInt j) const { return origin + j * step; }
  QtbInt begin(QtbInt j) const { return j > ku ? j - ku : 0; }
  QtbInt end(QtbInt j) const { return kl < m - j ? j + kl + 1 : m; }
};

template <class T>
General<T> general(T *a, QtbInt lda, QtbInt m, QtbInt n) {
  return {a, lda, m, m, n};
}

// Columns first to first + columns - 1 of a triangle of order n with k diagonals beside the main one. Only a piece of a
// triangle has other columns than 0 to n - 1.
template <class T>
struct Triangle {
  T *origin;
  QtbInt step;    // elements from one column to the next within a row, at the first column
  QtbInt growth;  // by how much that step grows from column to column
  QtbInt n, k;
  bool upper;
  QtbInt first, columns;

  T *column(QtbInt j) const {
    const QtbInt c = j - first;
    return origin + c * step + growth * (c * (c - 1) / 2);
  }
  QtbInt begin(QtbInt j) const { return upper ? off_begin(j) : j; }
  QtbInt end(QtbInt j) const { return upper ? j + 1 : off_end(j); }
  // The rows of column j without the diagonal.
  QtbInt off_begin(QtbInt j) const { return !upper ? j + 1 : j > k ? j - k : 0; }
  QtbInt off_end(QtbInt j) const { return upper ? j : k < n - j ? j + k + 1 : n; }
};

template <class T>
Triangle<T> triangle(const char *uplo, T *a, QtbInt lda, QtbInt n) {
  return {a, lda, 0, n, n, is_letter(*uplo, 'U'), 0, n};
}
// The main diagonal is the last row of an upper band and the first of a lower one.
template <class T>
Triangle<T> triangle_band(const char *uplo, T *a, QtbInt lda, QtbInt n, QtbInt k) {
  const bool upper = is_letter(*uplo, 'U');
  return {upper ? a + k : a, lda - 1, 0, n, k, upper, 0, n};
}
// Packed columns follow one another: an upper one is one element longer than the last, a lower one shorter.
template <class T>
Triangle<T> triangle_packed(const char *uplo, T *ap, QtbInt n) {
  const bool upper = is_letter(*uplo, 'U');
  return {ap, upper ? 1 : n - 1, upper ? 1 : -1, n, n, upper, 0, n};
}
// len columns of a triangle with a rectangle of other rows above ("U") or below ("L").
template <class T>
Triangle<T> triangle_piece(const char *uplo, T *a, QtbInt lda, QtbInt len, QtbInt other) {
  const bool upper = is_letter(*uplo, 'U');
  return {a, lda, 0, len + other, len + other, upper, upper ? other : 0, len};
}

}  // namespace
}  // namespace qtb::QTB_TIER
