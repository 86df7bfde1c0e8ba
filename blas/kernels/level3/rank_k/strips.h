// Into which strips of rows and columns a rank-k update cuts the triangle of C.
//
// Strip i has a block on the diagonal and, from the second one on, a rectangle between that block and the edge of the
// triangle: above it in the upper triangle, left of it in the lower one. The same in every tier's build and outside of
// them.
#pragma once

#include "blas/types.h"

namespace qtb::strips {
namespace {

// n rows in count strips of size rows each, but for the last one, which has the rest.
struct Strips {
  QtbInt count, size, n;
  constexpr QtbInt begin(QtbInt i) const { return i * size; }
  constexpr QtbInt extent(QtbInt i) const { return i + 1 < count ? size : n - begin(i); }
};

// Wide strips keep the blocks of GEMM large, the narrow ones inside of them the blocks on the diagonal small. Sizes are
// multiples of the least rows of a strip.
constexpr QtbInt least_strip = 4, wide_strips = 5, narrow_strips = 3;

constexpr Strips equal_strips(QtbInt n, QtbInt count) {
  if (n < count * least_strip) return {1, n, n};
  return {count, n / count / least_strip * least_strip, n};
}

// Chunks of the blocks on the diagonal, which are summed on the stack.
constexpr QtbInt chunk_rows = 72;
constexpr Strips chunks(QtbInt n) { return {(n + chunk_rows - 1) / chunk_rows, chunk_rows, n}; }

struct Rectangle {
  QtbInt i0, rows, j0, columns;
};
constexpr Rectangle beside_diagonal(const Strips &strips, QtbInt i, bool upper) {
  const QtbInt begin = strips.begin(i), extent = strips.extent(i);
  return upper ? Rectangle{0, begin, begin, extent} : Rectangle{begin, extent, 0, begin};
}

}  // namespace
}  // namespace qtb::strips
