// The draws from which problems and the contents of their arrays are made. The same seed gives the same problem on
// every machine.
#pragma once

#include <cstdint>
#include <cstring>
#include <iterator>

#include "calls/problem.h"

namespace qtb::surface {

using calls::Problem;
using calls::Scalar;
using calls::scalar;
using calls::Values;

// A source of numbers: a counter passed through a mixing function, so that any seed is as good as another.
class Draw {
 public:
  explicit Draw(std::uint64_t seed) : state_(seed) {}

  std::uint64_t bits() {
    std::uint64_t z = (state_ += 0x9E3779B97F4A7C15U);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9U;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBU;
    return z ^ (z >> 31);
  }
  QtbInt integer(QtbInt least, QtbInt most) {
    return least + static_cast<QtbInt>(bits() % static_cast<std::uint64_t>(most - least + 1));
  }
  bool one_in(QtbInt n) { return integer(1, n) == 1; }
  // In (-1, 1), with all the digits of a double; a float takes what fits.
  double real() {
    return static_cast<double>(static_cast<std::int64_t>(bits() >> 10) - (std::int64_t{1} << 53)) * 0x1p-53;
  }
  template <class C>
  auto one_of(const C &choices) {
    return std::begin(choices)[integer(0, static_cast<QtbInt>(std::size(choices)) - 1)];
  }
  // One of the letters, in either case.
  char letter(const char *letters) {
    const char upper = letters[integer(0, static_cast<QtbInt>(std::strlen(letters)) - 1)];
    return static_cast<char>(one_in(2) ? upper : upper + ('a' - 'A'));
  }

 private:
  std::uint64_t state_;
};

// Factors: the ones that routines treat apart, in both parts, and others.
inline Scalar draw_scalar(Draw &draw, Values values) {
  static constexpr Scalar special[] = {{0, 0}, {1, 0}, {0, 0}, {1, 0}, {-1, 0}, {0, 1}, {1, 1}, {0, -2}};
  static constexpr Scalar powers_of_two[] = {{0, 0}, {1, 0}, {1, 0}, {-1, 0}, {0, 1}, {0, -2}, {2, 0}, {-4, 0}};
  if (values == Values::exact) return draw.one_of(powers_of_two);
  if (draw.one_in(2)) return draw.one_of(special);
  return {draw.real() * 2, draw.real() * 2};
}

// Sizes of a sweep: mostly tiny, where every edge lies, some around the blocks of the kernels.
inline QtbInt draw_size(Draw &draw) {
  const QtbInt kind = draw.integer(-1, 15);
  if (kind < 0) return 0;
  if (kind < 10) return draw.integer(0, 12);
  if (kind < 15) return draw.integer(13, 40);
  return draw.integer(41, 70);
}

inline Problem draw_problem(std::uint64_t seed, Values values) {
  Draw draw(seed);
  static constexpr QtbInt increments[] = {1, 1, 1, 2, 3, -1, -2, -3};
  Problem p;
  p.seed = draw.bits();
  p.values = values;
  p.m = draw_size(draw), p.n = draw_size(draw), p.k = draw_size(draw);
  p.kl = draw.integer(0, draw.one_in(4) ? 40 : 6), p.ku = draw.integer(0, draw.one_in(4) ? 40 : 6);
  p.incx = draw.one_of(increments), p.incy = draw.one_of(increments);
  for (QtbInt &spare : p.spare) spare = draw.one_in(2) ? 0 : draw.integer(1, 9);
  p.alpha = draw_scalar(draw, values), p.beta = draw_scalar(draw, values);
  p.side = draw.letter("LR"), p.uplo = draw.letter("UL"), p.diag = draw.letter("NU");
  p.transa = draw.letter("NTC"), p.transb = draw.letter("NTC");
  p.upper_name = draw.one_in(2);
  return p;
}

}  // namespace qtb::surface
