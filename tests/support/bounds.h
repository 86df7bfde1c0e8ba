// Error bounds: how far a result may lie from the oracle's, and how far it did.
//
// An error passes if it is at most c*u*gauge + c*eta*max(1, |alpha|): u the unit roundoff, eta the smallest subnormal,
// gauge the sum of the magnitudes of what was added, and c the number of roundings, derived for any order of summation.
// Where the gauge reaches a quarter of the overflow limit only the class (finite, infinite, NaN) is compared.
#pragma once

#include <bit>
#include <cmath>
#include <cstring>
#include <limits>

#include "blas/types.h"

namespace qtb::test {

using Quad = __float128;  // the oracle's arithmetic: 113 bits

template <class T>
inline constexpr double unit_roundoff = std::numeric_limits<Real<T>>::epsilon() / 2;

inline Quad magnitude(Quad v) { return v < 0 ? -v : v; }
inline bool is_nan(Quad v) { return v != v; }

// A complex number of the oracle; of a real result im is 0.
struct QuadComplex {
  Quad re = 0, im = 0;
};
inline Quad magnitude(QuadComplex v) { return magnitude(v.re) + magnitude(v.im); }

template <class T>
QuadComplex widen(T v) {
  if constexpr (is_complex<T>)
    return {Quad(v.re), Quad(v.im)};
  else
    return {Quad(v), 0};
}

// error / bound of one real result: at most 1 passes. Infinite where the class differs.
template <class R>
double wide_error_ratio(R got, Quad want, Quad gauge, double c, double alpha_magnitude) {
  const double overflow = static_cast<double>(std::numeric_limits<R>::max());
  if (is_nan(gauge) || gauge >= Quad(overflow) / 4 || is_nan(want)) {
    const bool want_nan = is_nan(want), got_nan = std::isnan(got);
    const bool want_finite = !want_nan && magnitude(want) <= Quad(overflow);
    if (want_nan != got_nan) return std::numeric_limits<double>::infinity();
    if (!want_nan && want_finite != static_cast<bool>(std::isfinite(got)))
      return std::numeric_limits<double>::infinity();
    return 0;
  }
  if (!std::isfinite(got)) return std::numeric_limits<double>::infinity();
  const Quad error = magnitude(Quad(got) - want);
  if (error == 0) return 0;
  const Quad eta = Quad(std::numeric_limits<R>::denorm_min());
  const Quad bound =
      Quad(c) * Quad(unit_roundoff<R>) * gauge + Quad(c) * eta * Quad(alpha_magnitude > 1 ? alpha_magnitude : 1);
  return static_cast<double>(error / bound);
}

// A number as two doubles: its leading 53 bits, and the 60 bits behind them, rounded. Cut out of the number as it is
// stored, since its own arithmetic is procedures of the compiler; those do what is near the ends of a double's range.
struct TwoDoubles {
  double high, low;
};
inline TwoDoubles split(Quad v) {
  unsigned __int128 bits;
  static_assert(sizeof bits == sizeof v);
  std::memcpy(&bits, &v, sizeof bits);
  constexpr int bias = 16383, double_bias = 1023, low_bits = 60, fraction = 112, double_fraction = 52, most = 900;
  const int exponent = static_cast<int>(static_cast<std::uint64_t>(bits >> fraction) & 0x7FFF) - bias;
  if (exponent < -most || exponent > most) {
    const double high = static_cast<double>(v);
    return {high, static_cast<double>(v - Quad(high))};
  }
  const std::uint64_t sign = static_cast<std::uint64_t>(bits >> 127) << 63;
  const auto power = [&](int e) { return sign | static_cast<std::uint64_t>(e + double_bias) << double_fraction; };
  const std::uint64_t leading =
      static_cast<std::uint64_t>(bits >> low_bits) & ((std::uint64_t{1} << double_fraction) - 1);
  const std::int64_t rest =
      static_cast<std::int64_t>(static_cast<std::uint64_t>(bits) & ((std::uint64_t{1} << low_bits) - 1));
  return {std::bit_cast<double>(power(exponent) | leading),
          static_cast<double>(rest) * std::bit_cast<double>(power(exponent - fraction))};
}

// The same, in doubles where these decide: neither near the ends of their range nor with a ratio near 1. The difference
// of two doubles, less the part of the expected value beyond a double, is rounded by less than 2^-50 of itself.
template <class R, class Gauge>
double error_ratio(R got, Quad want, Gauge gauge, double c, double alpha_magnitude = 1) {
  constexpr double least = 0x1p-900, doubtful = 0x1p-40;
  constexpr double most = static_cast<double>(std::numeric_limits<R>::max()) / 8;
  const auto [high, low] = split(want);
  const double scale = static_cast<double>(gauge);
  if (scale >= least && scale <= most && std::fabs(high) <= most && std::isfinite(got)) {
    const double error = std::fabs((static_cast<double>(got) - high) - low);
    constexpr double eta = std::numeric_limits<R>::denorm_min();
    const double ratio = error / (c * unit_roundoff<R> * scale + c * eta * (alpha_magnitude > 1 ? alpha_magnitude : 1));
    if (std::fabs(ratio - 1) > doubtful) return ratio;
  }
  return wide_error_ratio(got, want, Quad(gauge), c, alpha_magnitude);
}

// The same for a result of any type: the larger ratio of its parts.
template <class T, class Gauge>
double error_ratio(T got, QuadComplex want, Gauge gauge, double c, double alpha_magnitude = 1) {
  if constexpr (is_complex<T>)
    return std::fmax(error_ratio(got.re, want.re, gauge, c, alpha_magnitude),
                     error_ratio(got.im, want.im, gauge, c, alpha_magnitude));
  else
    return error_ratio(got, want.re, gauge, c, alpha_magnitude);
}

}  // namespace qtb::test
