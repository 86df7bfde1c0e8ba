// The walk of TRSV and TRMV over the blocks of a triangle, whose rectangles are left to GEMV.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

// One, as a factor of GEMV.
template <class T>
constexpr T unit_element() {
  if constexpr (is_complex<T>)
    return {1, 0};
  else
    return 1;
}

// Calls f(first, length) for blocks of size elements from one end to the other; the remainder comes last.
template <class F>
void walk_blocks(QtbInt n, QtbInt size, bool forward, F f) {
  for (QtbInt done = 0; done < n; done += size) {
    const QtbInt length = n - done < size ? n - done : size;
    f(forward ? done : n - done - length, length);
  }
}

// The vector argument of a call for length elements of a strided vector, of which p is the first.
template <class T>
T *vector_argument(T *p, QtbInt length, QtbInt inc) {
  return inc < 0 ? p + (length - 1) * inc : p;
}

}  // namespace
}  // namespace qtb::QTB_TIER
