// A problem: every number and option that a call of a published routine can need, whatever its shape.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <string_view>

#include "blas/types.h"

namespace qtb::calls {

// What arrays hold: numbers whose sums round, or whole numbers whose sums do not in either precision.
enum class Values { rounding, exact };

struct Scalar {
  double re = 0, im = 0;

  bool is_zero() const { return re == 0 && im == 0; }
};

template <class T>
T scalar(Scalar v) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(v.re), static_cast<Real<T>>(v.im)};
  else
    return static_cast<T>(v.re);
}

struct Problem {
  std::uint64_t seed = 0;  // of the contents
  QtbInt m = 0, n = 0, k = 0, kl = 0, ku = 0;
  QtbInt incx = 1, incy = 1;
  QtbInt spare[3] = {};           // leading dimensions beyond the least legal one: of A, B, C
  const QtbInt *index = nullptr;  // the n one-based positions of a sparse vector
  Scalar alpha, beta;
  char side = 'L', uplo = 'U', transa = 'N', transb = 'N', diag = 'N';
  bool upper_name = false;  // by the upper-case name of the routine
  Values values = Values::rounding;

  QtbInt leading(int which, QtbInt least) const { return std::max<QtbInt>(least, 1) + spare[which]; }

  // By the letters that name what a shape varies (ShapeBase in shapes.h).
  QtbInt &size(char axis) { return axis == 'm' ? m : axis == 'n' ? n : k; }
  char &option(char axis) {
    switch (axis) {
      case 'S': return side;
      case 'U': return uplo;
      case 'A': return transa;
      case 'B': return transb;
      default: return diag;
    }
  }

  void describe(char *text, std::size_t size) const {
    std::snprintf(text, size,
                  "seed %llu m %lld n %lld k %lld kl %lld ku %lld side %c uplo %c transa %c transb %c diag %c "
                  "alpha (%g, %g) beta (%g, %g) incx %lld incy %lld spare %lld %lld %lld%s%s",
                  static_cast<unsigned long long>(seed), static_cast<long long>(m), static_cast<long long>(n),
                  static_cast<long long>(k), static_cast<long long>(kl), static_cast<long long>(ku), side, uplo, transa,
                  transb, diag, alpha.re, alpha.im, beta.re, beta.im, static_cast<long long>(incx),
                  static_cast<long long>(incy), static_cast<long long>(spare[0]), static_cast<long long>(spare[1]),
                  static_cast<long long>(spare[2]), upper_name ? " upper-case name" : "",
                  values == Values::exact ? " whole numbers" : "");
  }
};

// The letters of an option.
inline std::string_view legal_letters(char axis) {
  switch (axis) {
    case 'S': return "LR";
    case 'U': return "UL";
    case 'D': return "NU";
    default: return "NTC";
  }
}

}  // namespace qtb::calls
