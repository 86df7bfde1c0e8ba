// Multiples of one vector added to four columns: column j's element i += factor[j]*x[i], 0 <= i < rows.
//
// The second column stands step elements behind the first, and that distance grows by growth from column to column.
// Columns and x are contiguous, at any address; x overlaps no column. An element's bits are those that the tier's AXPY
// gives it, with a factor other than zero: they depend on the element alone. Each vector of x is loaded once for all
// four, and a short column costs no call of its own.
#pragma once

#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

constexpr int multiplied_columns = 4;

template <class T>
[[gnu::noinline]] void add_multiples(QtbInt rows, const T (&factors)[multiplied_columns], const T *x, T *first,
                                     QtbInt step, QtbInt growth) {
  const Factor<T> f[] = {Factor<T>(factors[0]), Factor<T>(factors[1]), Factor<T>(factors[2]), Factor<T>(factors[3])};
  T *column[multiplied_columns];
  repeat<multiplied_columns>([&](auto j) __attribute__((always_inline)) {
    column[j.value] = first;
    first += step;
    step += growth;
  });
  const auto pass = [&](auto vectors) __attribute__((always_inline)) {
    repeat<vectors.value>([&](auto k) __attribute__((always_inline)) {
      Vec<T> elements = load_unaligned(x + k.value * lanes<T>);
      keep_in_place(elements);  // or each column would load it
      repeat<multiplied_columns>([&](auto j) __attribute__((always_inline)) {
        T *const p = column[j.value] + k.value * lanes<T>;
        store_unaligned(p, add(load_unaligned(p), f[j.value].times(elements)));
      });
    });
    x += vectors.value * lanes<T>;
    repeat<multiplied_columns>([&](auto j)
                                   __attribute__((always_inline)) { column[j.value] += vectors.value * lanes<T>; });
  };
  for (; rows >= 2 * lanes<T>; rows -= 2 * lanes<T>) pass(Constant<2>());
  if (rows >= lanes<T>) {
    pass(Constant<1>());
    rows -= lanes<T>;
  }
  for (; rows > 0; --rows, ++x) {
    const auto add_element = [&](auto j) __attribute__((always_inline)) {
      T *const p = column[j.value]++;
      if constexpr (is_complex<T>)
        store_lowest(p, add(load_repeated(p), f[j.value].times(load_repeated(x))));
      else
        store_single(p, load_single(p) + f[j.value].value * load_single(x));
    };
    repeat<multiplied_columns>(add_element);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
