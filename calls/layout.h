// Where a storage form keeps the elements of a matrix, and what the elements are that it does not keep.
#pragma once

#include <algorithm>

#include "blas/types.h"

namespace qtb::calls {

// Where a storage form keeps element (i, j) of a matrix, and which elements it keeps: those at most below under the
// diagonal and at most above over it. A vector is a matrix of one column.
struct Layout {
  enum class Form { full, band, packed_upper, packed_lower, strided, indexed };
  Form form = Form::full;
  QtbInt rows = 0, cols = 0;
  QtbInt below = 0, above = 0;
  QtbInt step = 1;                // leading dimension or increment
  const QtbInt *index = nullptr;  // one-based positions of a sparse vector's elements

  bool stores(QtbInt i, QtbInt j) const { return i - j <= below && j - i <= above; }
  QtbInt position(QtbInt i, QtbInt j) const {
    switch (form) {
      case Form::full: return i + j * step;
      case Form::band: return above + i - j + j * step;
      case Form::packed_upper: return i + j * (j + 1) / 2;
      case Form::packed_lower: return i + j * (2 * rows - j - 1) / 2;
      case Form::strided: return step >= 0 ? i * step : (i - (rows - 1)) * step;
      case Form::indexed: return index[i] - 1;
    }
    return 0;
  }

  // The rows of column j that are kept: from first_row to before end_row.
  QtbInt first_row(QtbInt j) const { return std::max<QtbInt>(j - above, 0); }
  QtbInt end_row(QtbInt j) const { return std::max(std::min(rows, j + below + 1), first_row(j)); }

  // How many elements are kept.
  QtbInt count() const {
    QtbInt sum = 0;
    for (QtbInt j = 0; j < cols; ++j) sum += end_row(j) - first_row(j);
    return sum;
  }
  // The number of elements from the array's first to the last that is kept.
  QtbInt extent() const {
    const bool is_vector = form == Form::strided || form == Form::indexed;  // whose positions go any way
    QtbInt end = 0;
    for (QtbInt j = 0; j < cols; ++j) {
      const QtbInt last = end_row(j);
      for (QtbInt i = is_vector ? 0 : std::max(last - 1, first_row(j)); i < last; ++i)
        end = std::max(end, position(i, j) + 1);
    }
    return end;
  }
};

inline Layout full(QtbInt rows, QtbInt cols, QtbInt ld) { return {Layout::Form::full, rows, cols, rows, cols, ld}; }
inline Layout triangle(char uplo, QtbInt n, QtbInt ld) {
  const bool upper = is_letter(uplo, 'U');
  return {Layout::Form::full, n, n, upper ? 0 : n, upper ? n : 0, ld};
}
inline Layout band(QtbInt rows, QtbInt cols, QtbInt kl, QtbInt ku, QtbInt ld) {
  return {Layout::Form::band, rows, cols, kl, ku, ld};
}
inline Layout band_triangle(char uplo, QtbInt n, QtbInt k, QtbInt ld) {
  const bool upper = is_letter(uplo, 'U');
  return {Layout::Form::band, n, n, upper ? 0 : k, upper ? k : 0, ld};
}
inline Layout packed_triangle(char uplo, QtbInt n) {
  if (is_letter(uplo, 'U')) return {Layout::Form::packed_upper, n, n, 0, n, 0};
  return {Layout::Form::packed_lower, n, n, n, 0, 0};
}
inline Layout strided(QtbInt n, QtbInt increment) { return {Layout::Form::strided, n, 1, n, 1, increment}; }
inline Layout indexed(QtbInt n, const QtbInt *index) { return {Layout::Form::indexed, n, 1, n, 1, 0, index}; }

// What the elements that a storage form does not keep are, and what its diagonal means.
enum class Structure { general, symmetric, hermitian, triangular, unit_triangular };

inline Structure triangular(char diag) {
  return is_letter(diag, 'U') ? Structure::unit_triangular : Structure::triangular;
}

}  // namespace qtb::calls
