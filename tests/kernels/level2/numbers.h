// Numbers for the operands of Level 2.
#pragma once

#include <cstdint>
#include <cstring>
#include <vector>

#include "blas/types.h"

namespace qtb::test {

template <class T>
T element(double re, double im) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}
// Numbers in (-1, 1) that need all digits, the same for the same seed.
template <class T>
std::vector<T> numbers(QtbInt count, unsigned seed) {
  std::vector<T> v(static_cast<std::size_t>(count));
  std::uint64_t state = seed;
  const auto next = [&] {
    state = state * 6364136223846793005U + 1442695040888963407U;
    return static_cast<double>(static_cast<std::int64_t>(state) >> 11) * 0x1p-52;
  };
  for (T &e : v) {
    const double re = next(), im = next();
    e = element<T>(re, im);
  }
  return v;
}

template <class T>
bool same(const std::vector<T> &a, const std::vector<T> &b) {
  return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(T)) == 0;
}

}  // namespace qtb::test
