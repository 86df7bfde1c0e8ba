// How much of B goes by a triangle at a time.
#pragma once

#include "blas/kernels/level3/gemm/family.h"

namespace qtb::QTB_TIER {
namespace {

// Rows or columns of B, each of length elements, of which the tiles read again and again what they have been through:
// as many as stay in half of the smallest first-level cache, a multiple of least and at least that.
template <class T>
QtbInt lines_at_once(QtbInt length, QtbInt least) {
  constexpr QtbInt bytes = 16384;
  return larger(bytes / (length * static_cast<QtbInt>(sizeof(T))) / least * least, least);
}

}  // namespace
}  // namespace qtb::QTB_TIER
