// What every Level-2 routine of a suite goes through in every tier, by the tier's own procedure: all sizes up to 70 and
// some around the limits of the kernels, all options, increments and phases of the addresses, on the problems and under
// the judgement of the surface suites.
//
// A suite says before it includes this file which shapes it tests, by tests_shape(), and brings main().
#pragma once

#include <string>
#include <string_view>

#include "tests/product/surface/level2_shapes.h"
#include "tests/product/surface/registry.h"
#include "tests/support/tiers.h"

namespace qtb::surface {

// Factors: none, one, and others, of which a complex routine takes both parts.
constexpr Scalar tier_alphas[] = {{0.7, -0.9}, {1, 0}, {0.7, -0.9}, {-1, 0}, {0, 0}, {0.7, -0.9}};
constexpr Scalar tier_betas[] = {{0, 0}, {1, 0}, {0.9, -0.2}, {0.9, -0.2}};
constexpr QtbInt tier_increments[] = {1, -1, 2, -3};
constexpr QtbInt bands[] = {0, 1, 2, 3, 4, 7, 8, 9, 10, 11, 12, 16, 17, 33, 70, 100};

template <ShapeName shape, class T, class R>
class TierSweeps {
 public:
  TierSweeps(const R &routine, const std::string &label) : routine_(routine), label_(label) {}

  // Every size in both triangles, contiguous vectors, which the vector paths are for, several times, and all pairs of
  // increments in turn. Beyond the second block of 16 rows little is new.
  void sizes_up_to_70() const {
    Session session(label(), {});
    int number = 0;
    for (QtbInt n = 0; n <= 70; ++n)
      for (const char uplo : {'U', 'l'})
        for (int turn = 0; turn < times(n <= 33 ? 8 : 5); ++turn) {
          ++number;
          const bool contiguous = turn % 8 < 3;
          const QtbInt incx = contiguous ? 1 : tier_increments[number % 4],
                       incy = contiguous ? 1 : tier_increments[number / 4 % 4];
          if (!try_one(problem(number, n, uplo, incx, incy), session)) return;
        }
  }
  void sizes_around_limits() const {
    Session session(label(), {});
    int number = 100000;
    for (const QtbInt n : {127, 128, 129})
      for (const char uplo : {'u', 'L'})
        for (const QtbInt inc : tier_increments)
          if (!try_one(problem(++number, n, uplo, inc, inc), session)) return;
    // Of the large ones, each tier takes its own.
    const std::uint64_t choice = Draw(seed_of(label(), 0)).bits() % 4;
    for (std::uint64_t large = 0; large < 4; ++large) {
      if (!is_long() && large != choice) continue;
      Problem p = problem(++number, 1000 + static_cast<QtbInt>(large % 2), large < 2 ? 'u' : 'L', 1, 1);
      p.alpha = {0.7, -0.9};
      if (!try_one(p, session)) return;
    }
  }
  void whole_numbers_are_exact() const {
    Session session(label(), {});
    for (int number = 0; number < times(60); ++number)
      if (!try_one(draw_problem(seed_of(routine_.name(), 200000 + number), Values::exact), session)) return;
  }
  void random_problems() const {
    Session session(label(), {});
    for (int number = 0; number < times(150); ++number)
      if (!try_one(draw_problem(seed_of(routine_.name(), 300000 + number), Values::rounding), session)) return;
  }

 private:
  const char *label() const { return label_.c_str(); }
  Problem problem(int number, QtbInt n, char uplo, QtbInt incx, QtbInt incy) const {
    Problem p = draw_problem(seed_of(routine_.name(), number), Values::rounding);
    Draw draw(p.seed);
    p.n = n;
    p.uplo = uplo;
    p.incx = incx, p.incy = incy;
    p.alpha = draw.one_of(tier_alphas), p.beta = draw.one_of(tier_betas);
    p.kl = draw.one_of(bands), p.ku = draw.one_of(bands);
    return p;
  }
  bool try_one(const Problem &p, Session &session) const {
    if (!session.start(p)) return false;
    run<T>(Shape<shape>(), routine_, p, session);
    return true;
  }

  R routine_;
  std::string label_;
};

template <ShapeName shape, class T, class Function>
void register_tiers(const char *name, Function *const (&procedures)[tier_count]) {
  if constexpr (tests_shape(shape.text)) {
    test::in_every_tier([&](int tier) {
      static std::map<std::string, std::string> labels;  // outlive the tests
      const std::string label = std::string(name) + " " + test::tier_name(tier);
      labels[label] = label;
      const Routine<Function> routine(name, calls::kind_of<T>(name), procedures[tier], procedures[tier]);
      const TierSweeps<shape, T, Routine<Function>> sweeps(routine, label);
      const char *kept = labels[label].c_str();
      register_test("sizes_up_to_70_lie_within_the_bound", kept, [=] { sweeps.sizes_up_to_70(); });
      register_test("sizes_around_limits_lie_within_the_bound", kept, [=] { sweeps.sizes_around_limits(); });
      register_test("results_in_whole_numbers_are_exact", kept, [=] { sweeps.whole_numbers_are_exact(); });
      register_test("random_problems_lie_within_the_bound", kept, [=] { sweeps.random_problems(); });
    });
  }
}

inline int run_tier_sweeps(int argc, char **argv) {
  testing::InitGoogleTest(&argc, argv);
#define QTB_ROUTINE(name, NAME, shape, T, route) \
  register_tiers<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name, QTB_ALL_TIERS(name));
#include "blas/routines.def"
#undef QTB_ROUTINE
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  std::signal(SIGILL, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}

}  // namespace qtb::surface
