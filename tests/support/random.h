// Random data for tests, from seeds that stand in the tests.
#pragma once

#include <cmath>
#include <random>
#include <vector>

#include "blas/types.h"

namespace qtb::test {

using RandomBits = std::mt19937_64;

// n elements: signs and mantissas at random, exponents of two at random from least to most.
template <class T>
std::vector<T> random_vector(RandomBits &bits, QtbInt n, int least, int most) {
  std::uniform_real_distribution<double> mantissa(1, 2);
  std::uniform_int_distribution<int> exponent(least, most);
  const auto part = [&] {
    const double v = std::ldexp(mantissa(bits), exponent(bits));
    return static_cast<Real<T>>(bits() % 2 ? v : -v);
  };
  std::vector<T> v(static_cast<std::size_t>(n));
  for (T &e : v) {
    if constexpr (is_complex<T>) {
      e.re = part();
      e.im = part();
    } else {
      e = part();
    }
  }
  return v;
}

}  // namespace qtb::test
