// The oracle of norms, sums of magnitudes and dot products in double: results in 113 bits, with the gauge and the
// number of roundings of their bounds. Vectors are given by their elements in order; increments are the caller's
// business.
#pragma once

#include <vector>

#include "tests/support/bounds.h"

namespace qtb::reference {

using test::Quad;

// A result, and the bound c * u * gauge of its error.
struct Bounded {
  Quad value = 0, gauge = 0;
  double roundings = 0;
};

// Square root, correct to some 110 bits: Newton's step on the double one, scaled into its range.
inline Quad square_root(Quad v) {
  if (!(v > 0) || v - v != 0) return v;  // 0, NaN, infinity
  Quad scale = 1;
  while (v > Quad(0x1p600)) v *= Quad(0x1p-200), scale *= Quad(0x1p100);
  while (v < Quad(0x1p-600)) v *= Quad(0x1p200), scale *= Quad(0x1p-100);
  Quad root = std::sqrt(static_cast<double>(v));
  for (int step = 0; step < 2; ++step) root = (root + v / root) / 2;
  return root * scale;
}

// Running sums over the first elements of a vector, so that every length is one step from the next.
struct RunningSums {
  Quad squares = 0, magnitudes = 0;

  template <class T>
  void add(T v) {
    const auto w = test::widen(v);
    squares += w.re * w.re + w.im * w.im;
    magnitudes += test::magnitude(w);
  }
};

// nrm2 of n elements. Doubles are scaled as they go, at three roundings for each real; floats are summed in double and
// rounded once, so that the roundings of the sum count in units of double (see ratio_of_rounded).
template <class T>
Bounded nrm2(const RunningSums &sums, QtbInt n) {
  const Quad value = square_root(sums.squares);
  const double reals = static_cast<double>(is_complex<T> ? 2 * n : n);
  return {value, value, sizeof(Real<T>) == sizeof(double) ? 3 * reals + 4 : reals / 2 + 4};
}

template <class T>
Bounded asum(const RunningSums &sums, QtbInt n) {
  return {sums.magnitudes, sums.magnitudes, static_cast<double>(is_complex<T> ? 2 * n : n)};
}

// start + sum of x[i] * y[i] over n pairs of floats.
inline Bounded dot(Quad start, QtbInt n, const std::vector<float> &x, const std::vector<float> &y) {
  Bounded e{start, test::magnitude(start), static_cast<double>(n)};
  for (std::size_t i = 0; i < static_cast<std::size_t>(n); ++i) {
    const Quad p = Quad(x[i]) * Quad(y[i]);
    e.value += p;
    e.gauge += test::magnitude(p);
  }
  return e;
}

// error / bound of a float that was computed in double and rounded once at the end.
inline double ratio_of_rounded(float got, const Bounded &e) {
  const Quad most = Quad(std::numeric_limits<float>::max());
  if (test::magnitude(e.value) > most / 4 || !std::isfinite(got))
    return test::error_ratio(got, e.value, e.value, 1);  // only the class
  const Quad error = test::magnitude(Quad(got) - e.value);
  const Quad u_single = Quad(test::unit_roundoff<float>), u_double = Quad(test::unit_roundoff<double>);
  const Quad before = Quad(e.roundings) * u_double * e.gauge;
  const Quad bound =
      before + u_single * (test::magnitude(e.value) + before) + Quad(std::numeric_limits<float>::denorm_min()) / 2;
  return error == 0 ? 0 : static_cast<double>(error / bound);
}

}  // namespace qtb::reference
