// The oracle of the basic vector routines, in 113-bit arithmetic: a value and its gauge, the sum of the magnitudes that
// went into it, by which errors are judged. Element i of a vector of n stands where the published convention has it.
#pragma once

#include <cstring>

#include "tests/reference/common.h"

namespace qtb::reference {

// Element i of n with an increment, counted from the array's first element.
inline QtbInt place(QtbInt i, QtbInt n, QtbInt inc) { return inc < 0 ? (i - n + 1) * inc : i * inc; }

// An element at any address.
template <class T>
T element(const T *p) {
  T v;
  std::memcpy(&v, p, sizeof v);
  return v;
}

struct Judged {
  QuadComplex value;
  Quad gauge = 0;
};

// The sum of x[i] * y[i], or of conj(x[i]) * y[i].
template <class T>
Judged dot(QtbInt n, const T *x, QtbInt incx, const T *y, QtbInt incy, bool conjugated = false) {
  Judged sum;
  for (QtbInt i = 0; i < n; ++i) {
    QuadComplex a = test::widen(element(x + place(i, n, incx)));
    const QuadComplex b = test::widen(element(y + place(i, n, incy)));
    if (conjugated) a = conjugate(a);
    const QuadComplex term = product(a, b, is_complex<T>);
    sum.value = {sum.value.re + term.re, sum.value.im + term.im};
    sum.gauge += magnitude(a) * magnitude(b);
  }
  return sum;
}

// alpha * x + y of one element.
template <class T>
Judged axpy(T alpha, T x, T y) {
  const QuadComplex a = test::widen(alpha), b = test::widen(x), c = test::widen(y);
  const QuadComplex term = product(a, b, is_complex<T>);
  return {{term.re + c.re, term.im + c.im}, magnitude(a) * magnitude(b) + magnitude(c)};
}

// alpha * x of one element.
template <class T>
Judged scal(T alpha, T x) {
  const QuadComplex a = test::widen(alpha), b = test::widen(x);
  return {product(a, b, is_complex<T>), magnitude(a) * magnitude(b)};
}

}  // namespace qtb::reference
