// What triangular products and solves of one tier go through: all their options over ranges of sizes, on the problems
// and under the judgement of the surface suites.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/registry.h"
#include "tests/support/tiers.h"

namespace qtb::surface {

using Sizes = std::vector<QtbInt>;

inline Sizes range(QtbInt first, QtbInt last) {
  Sizes all;
  for (QtbInt n = first; n <= last; ++n) all.push_back(n);
  return all;
}

constexpr Scalar product_alphas[] = {{0.7, -0.9}, {1, 0}, {0, 0}, {-1, 0}, {1, 0}};

template <class T>
using Triangular = QTB_FUNCTION_TYPE(trmm, T);

// What is told of alpha: a kernel is not called with 0, and one that solves has none.
enum class Role { routine, kernel, solving_kernel };

// A procedure of the shape of trmm.
template <class T>
class TriangularSweep {
 public:
  TriangularSweep(const char *label, const char *routine, Triangular<T> *procedure, Role role)
      : label_(label), routine_(routine, calls::kind_of<T>(routine), procedure, procedure), role_(role) {}

  const char *label() const { return label_; }

  // Every option at every pair of sizes; of the pairs one in so many, each run others.
  void all_options(const char *sides, const Sizes &ms, const Sizes &ns, int one_in = 1) const {
    Session session(label_, {});
    int number = 0;
    for (const char *side = sides; *side != '\0'; ++side)
      for (const QtbInt m : ms)
        for (const QtbInt n : ns)
          for (const char uplo : {'U', 'l'})
            for (const char transa : {'n', 'T', 'C'})
              for (const char diag : {'N', 'u'}) {
                Problem p = draw(++number, Values::rounding);
                if (one_in > 1 && !is_long() && Draw(p.seed).integer(1, one_in) > 1) continue;
                p.m = m, p.n = n, p.side = *side, p.uplo = uplo, p.transa = transa, p.diag = diag;
                if (!try_one(p, session)) return;
              }
  }
  // Results that no rounding touches: whole numbers, and in a solve powers of two on the diagonal.
  void whole_numbers(const char *sides, QtbInt most_m, QtbInt most_n) const {
    Session session(label_, {});
    for (int number = 0; number < times(120); ++number) {
      Problem p = draw(1000000 + number, Values::exact);
      Draw draw(p.seed);
      p.side = sides[draw.integer(0, static_cast<QtbInt>(std::strlen(sides)) - 1)];
      p.m = draw.integer(1, most_m), p.n = draw.integer(1, most_n);
      if (!try_one(p, session)) return;
    }
  }

 private:
  Problem draw(int number, Values values) const {
    Problem p = draw_problem(seed_of(label_, number), values);
    if (values == Values::rounding) p.alpha = Draw(p.seed).one_of(product_alphas);
    if (role_ != Role::routine && is_zero(scalar<T>(p.alpha))) p.alpha = {1, 0};
    if (role_ == Role::solving_kernel) p.alpha = {1, 0};
    return p;
  }
  bool try_one(const Problem &p, Session &session) const {
    if (!session.start(p)) return false;
    run<T>(Shape<"trmm">(), routine_, p, session);
    return true;
  }

  const char *label_;
  Routine<Triangular<T>> routine_;
  Role role_;
};

// f(sweep) for a procedure of a tier, if the processor runs it.
template <class T, class F>
void with_sweep(int tier, const char *routine, const char *part, Triangular<T> *procedure, Role role, F f) {
  if (!test::processor_runs(tier)) return;
  static std::map<std::string, std::string> labels;  // outlive the tests
  const std::string label = std::string(routine) + part + " " + test::tier_name(tier);
  const std::string &kept = labels[label] = label;
  f(TriangularSweep<T>(kept.c_str(), routine, procedure, role));
}

inline int run_sweeps(int argc, char **argv, void (*register_all)()) {
  testing::InitGoogleTest(&argc, argv);
  register_all();
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  std::signal(SIGILL, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}

}  // namespace qtb::surface
