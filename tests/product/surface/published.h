// The grids of the published testers of Levels 2 and 3: every combination of their sizes, options, increments and
// factors, as far as a shape has them. The grids are large, so that a run takes a part of each, spread evenly over it,
// and all of it with QTB_TEST_LONG=1.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "tests/product/surface/registry.h"

namespace qtb::surface {

// The values of one tester.
struct Grid {
  std::vector<QtbInt> sizes, bands, increments;
  std::vector<Scalar> alphas, betas;
};
inline const Grid level2_grid = {
    {0, 1, 2, 3, 5, 9}, {0, 1, 2, 4}, {1, 2, -1, -2}, {{0, 0}, {1, 0}, {0.7, -0.9}}, {{0, 0}, {1, 0}, {0.9, -0.2}}};
inline const Grid level3_grid = {
    {0, 1, 2, 3, 5, 9, 35, 65}, {}, {}, {{0, 0}, {1, 0}, {0.7, -0.9}}, {{0, 0}, {1, 0}, {1.3, -1.1}}};

// The combination of a number, in mixed radix over the axes of a shape.
class Combination {
 public:
  Combination(std::string_view axes, const Grid &grid) : axes_(axes), grid_(grid) {}

  long count() const {
    long product = 1;
    for (const char axis : axes_) product *= length(axis);
    return product;
  }
  Problem problem(long number) const {
    Problem p;
    p.seed = static_cast<std::uint64_t>(number);
    p.upper_name = number % 2 == 1;
    p.spare[0] = p.spare[1] = p.spare[2] = 1;  // leading dimensions one larger than needed
    for (const char axis : axes_) {
      set(p, axis, static_cast<std::size_t>(number % length(axis)));
      number /= length(axis);
    }
    return p;
  }

 private:
  long length(char axis) const {
    const Grid &g = grid_;
    switch (axis) {
      case 'm':
      case 'n':
      case 'k': return static_cast<long>(g.sizes.size());
      case 'l': return static_cast<long>(g.bands.size() * g.bands.size());
      case 'b': return static_cast<long>(g.bands.size());
      case 'x':
      case 'y': return static_cast<long>(g.increments.size());
      case '+': return static_cast<long>(g.alphas.size());
      case '*': return static_cast<long>(g.betas.size());
      case 'A':
      case 'B': return 3;
      default: return 2;
    }
  }
  void set(Problem &p, char axis, std::size_t i) const {
    const Grid &g = grid_;
    switch (axis) {
      case 'm': p.m = g.sizes[i]; break;
      case 'n': p.n = g.sizes[i]; break;
      case 'k': p.k = g.sizes[i]; break;
      case 'l': p.kl = g.bands[i % g.bands.size()], p.ku = g.bands[i / g.bands.size()]; break;
      case 'b': p.kl = g.bands[i]; break;
      case 'x': p.incx = g.increments[i]; break;
      case 'y': p.incy = g.increments[i]; break;
      case '+': p.alpha = g.alphas[i]; break;
      case '*': p.beta = g.betas[i]; break;
      case 'A': p.transa = "NTC"[i]; break;
      case 'B': p.transb = "NTC"[i]; break;
      case 'S': p.side = "LR"[i]; break;
      case 'U': p.uplo = "UL"[i]; break;
      case 'D': p.diag = "UN"[i]; break;
    }
  }
  std::string_view axes_;
  const Grid &grid_;
};

template <ShapeName shape, class T, class R>
void run_grid(const R &routine) {
  constexpr long most = 900;
  const Combination combination(Shape<shape>::axes, Shape<shape>::level == 2 ? level2_grid : level3_grid);
  const long count = combination.count();
  const double step = is_long() || count <= most ? 1 : static_cast<double>(count) / most;
  Session session(routine.name(), {});
  for (double number = 0; number < static_cast<double>(count); number += step) {
    const Problem p = combination.problem(static_cast<long>(number));
    if (!session.start(p)) return;
    run<T>(Shape<shape>(), routine, p, session);
  }
}

template <ShapeName shape, class T, class R>
void register_routine(const R &routine) {
  if constexpr (requires(Problem p, Session s) { run<T>(Shape<shape>(), routine, p, s); })
    register_test("the_published_tester_passes", routine.name(), [=] { run_grid<shape, T>(routine); });
}

}  // namespace qtb::surface
