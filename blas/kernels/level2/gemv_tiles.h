// y += alpha*op(A)*x by the tier's inner kernels, which see contiguous vectors only.
//
// With other increments A is cut into tiles of 1000 rows and 128 columns, and the pieces of x and y beside a tile are
// gathered into two local blocks and scattered back. Addresses that are no multiples of 8 bytes take a plain path. y
// overlaps neither a nor x, which begin at their first elements.
#pragma once

#include "blas/kernels/level2/gemv_kernels.h"
#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt tile_rows = 1000, tile_columns = 128;

template <class T>
struct TiledProduct {
  Op op;
  QtbInt m, n;
  T alpha;
  const T *a;
  QtbInt lda;
  const T *x;
  QtbInt incx;
  T *y;
  QtbInt incy;
};

inline bool on_8_bytes(const void *a, const void *x, const void *y) {
  const auto address = [](const void *p) { return reinterpret_cast<std::uintptr_t>(p); };
  return ((address(a) | address(x) | address(y)) & 7) == 0;
}

// ---- Blocks ----

template <class T>
void gather_block(QtbInt n, const T *from, QtbInt inc, T *block) {
  for (; n >= 2; n -= 2, from += 2 * inc, block += 2) {
    block[0] = from[0];
    block[1] = from[inc];
  }
  if (n > 0) block[0] = from[0];
}
template <class T>
void scatter_block(QtbInt n, const T *block, T *to, QtbInt inc) {
  for (; n >= 2; n -= 2, to += 2 * inc, block += 2) {
    to[0] = block[0];
    to[inc] = block[1];
  }
  if (n > 0) to[0] = block[0];
}

// Calls f(first, length) for pieces of most elements, the last one shorter.
template <class F>
void in_pieces(QtbInt n, QtbInt most, F f) {
  for (QtbInt first = 0; first < n; first += most) f(first, n - first < most ? n - first : most);
}

template <class T>
[[gnu::noinline]] void product_of_tiles(const TiledProduct<T> &p) {
  GemvKernel<T> *const kernel = gemv_kernel<T>(p.op, p.lda);
  const bool transposed = p.op != Op::none;
  alignas(vector_bytes) T long_block[tile_rows];
  alignas(vector_bytes) T short_block[tile_columns];
  in_pieces(p.n, tile_columns, [&](QtbInt j, QtbInt columns) {
    if (transposed)
      gather_block(columns, p.y + j * p.incy, p.incy, short_block);
    else
      gather_block(columns, p.x + j * p.incx, p.incx, short_block);
    in_pieces(p.m, tile_rows, [&](QtbInt i, QtbInt rows) {
      const T *const tile = p.a + i + j * p.lda;
      if (transposed) {
        gather_block(rows, p.x + i * p.incx, p.incx, long_block);
        kernel(&rows, &columns, &p.alpha, tile, &p.lda, long_block, short_block);
      } else {
        gather_block(rows, p.y + i * p.incy, p.incy, long_block);
        kernel(&rows, &columns, &p.alpha, tile, &p.lda, short_block, long_block);
        scatter_block(rows, long_block, p.y + i * p.incy, p.incy);
      }
    });
    if (transposed) scatter_block(columns, short_block, p.y + j * p.incy, p.incy);
  });
}

// ---- Any address ----

template <class T>
void plain_add(const TiledProduct<T> &p) {
  for (QtbInt j = 0; j < p.n; j++) {
    const T f = p.alpha * load_element(p.x + j * p.incx);
    const T *column = p.a + j * p.lda;
    T *y = p.y;
    const auto add = [&](QtbInt i) {
      store_element(y + i * p.incy, load_element(y + i * p.incy) + f * load_element(column + i));
    };
    QtbInt rows = p.m;
    for (; rows >= 2; rows -= 2, column += 2, y += 2 * p.incy) {
      add(0);
      add(1);
    }
    if (rows > 0) add(0);
  }
}

// A vector of a column that stands on a boundary, or 8 bytes off where single elements cannot bring it there.
template <class T>
Vec<T> load_column(const T *p) {
  if constexpr (lanes<T> == 1)
    return load_halves(parts(p));
  else
    return load_aligned(p);
}

template <class T>
T column_dot(bool conjugated, QtbInt rows, const T *column, const T *x, QtbInt incx) {
  const auto product = [&] {
    const T c = load_element(column);
    return (conjugated ? conjugate(c) : c) * load_element(x);
  };
  const auto next = [&](QtbInt count) {
    column += count;
    x += count * incx;
    rows -= count;
  };
  constexpr QtbInt pass = 8;
  T sum{};
  if (rows > pass && on_8_bytes(column, column, column)) {
    if (lanes < T >> 1 && phase(column) != 0) {
      sum = product();
      next(1);
    }
    ColumnSums<T, 2> sums;
    for (; rows >= pass; next(pass))
      repeat<pass / lanes<T>>([&](auto k) __attribute__((always_inline)) {
        constexpr QtbInt at = k.value * lanes<T>;
        sums.template add_product<k.value % 2>(load_column(column + at), RowFactor<T>(gather(x + at * incx, incx)));
      });
    sums.join_first_two();
    sum = sum + (conjugated ? sums.template total<true>(0) : sums.template total<false>(0));
  }
  for (; rows > 0; next(1)) sum = sum + product();
  return sum;
}

template <class T>
[[gnu::noinline]] void plain_product(const TiledProduct<T> &p) {
  if (p.op == Op::none) return plain_add(p);
  for (QtbInt j = 0; j < p.n; j++) {
    T *const y = p.y + j * p.incy;
    const T sum = column_dot(p.op == Op::conjugate, p.m, p.a + j * p.lda, p.x, p.incx);
    store_element(y, load_element(y) + p.alpha * sum);
  }
}

// Of vectors with increments, or at other addresses: the inner kernels take the rest as it is.
template <class T>
void tiled_product(const TiledProduct<T> &p) {
  if (on_8_bytes(p.a, p.x, p.y))
    product_of_tiles(p);
  else
    plain_product(p);
}

}  // namespace
}  // namespace qtb::QTB_TIER
