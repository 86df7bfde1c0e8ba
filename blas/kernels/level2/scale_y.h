// y := beta*y over n elements at any address, the first step of every product with a matrix.
//
// incy counts elements and may be negative. A beta of one does nothing. A beta of zero stores zeros and never reads, so
// that what stood in y vanishes, a NaN too; any other beta keeps the NaNs of y. Four forms: zeros or products, side by
// side or incy apart.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/simd/cursors.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct StoreZero {
  explicit StoreZero(T) {}
  template <class Cursor>
  void vector(Cursor y, int k) const {
    y.store(k, zero<T>());
  }
  void single(T *y) const { store_lowest(y, zero<T>()); }
};

template <class T>
struct MultiplyBy {
  Factor<T> beta;
  explicit MultiplyBy(T b) : beta(b) {}
  template <class Cursor>
  void vector(Cursor y, int k) const {
    y.store(k, beta.times(y.load(k)));
  }
  void single(T *y) const {
    if constexpr (is_complex<T>)
      store_lowest(y, beta.times(load_repeated(y)));
    else
      store_single(y, beta.value * load_single(y));
  }
};

// The length from which on y is brought to a vector boundary: shorter ones are done before that pays.
constexpr QtbInt shortest_scaled_by_vectors = 9;

template <class T, class Work>
void scale_contiguous(QtbInt n, T *y, const Work &work) {
  constexpr QtbInt pass = 8;
  if (n >= shortest_scaled_by_vectors && element_aligned(y)) {
    for (; phase(y) != 0; --n) work.single(y++);
    for (; n >= pass; n -= pass, y += pass)
      repeat<pass / lanes<T>>([&](auto k) __attribute__((always_inline)) { work.vector(Aligned<T>{y}, k.value); });
  }
  for (; n > 0; --n) work.single(y++);
}

template <class T, class Work>
void scale_strided(QtbInt n, T *y, QtbInt incy, const Work &work) {
  for (; n >= 2; n -= 2, y += 2 * incy) {
    work.single(y);
    work.single(y + incy);
  }
  if (n > 0) work.single(y);
}

template <class T, class Work>
[[gnu::noinline]] void scale_by(QtbInt n, T *y, QtbInt incy, const Work &work) {
  if (incy == 1)
    scale_contiguous(n, y, work);
  else
    scale_strided(n, walk_start(y, n, incy), incy, work);
}

template <class T>
void scale_y(QtbInt n, T beta, T *y, QtbInt incy) {
  if (is_one(beta)) return;
  if (is_zero(beta))
    scale_by(n, y, incy, StoreZero<T>(beta));
  else
    scale_by(n, y, incy, MultiplyBy<T>(beta));
}

}  // namespace
}  // namespace qtb::QTB_TIER
