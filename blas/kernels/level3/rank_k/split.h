// The walk over the strips of a rank-k update (strips.h): GEMM on the rectangles, on the blocks of the diagonal what
// the caller says.
#pragma once

#include "blas/kernels/level3/rank_k/strips.h"
#include "blas/kernels/level3/rank_k/update.h"

namespace qtb::QTB_TIER {
namespace {

template <class Update, class Diagonal>
void split(const Update &u, const strips::Strips &cut, Diagonal diagonal) {
  for (QtbInt i = 0; i < cut.count; i++) {
    if (i > 0) {
      const auto [i0, rows, j0, columns] = strips::beside_diagonal(cut, i, u.upper);
      u.multiply(i0, rows, j0, columns, u.beta, u.at(i0, j0), u.ldc);
    }
    diagonal(u.on_diagonal(cut.begin(i), cut.extent(i)));
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
