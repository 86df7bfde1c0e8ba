// syrk and herk in every tier, and the bodies that tiers have, by the tiers' own procedures: the sizes around every
// limit of the strips, chunks, slices of depth and tiles, all options, every pair of factors that is treated apart.
// Each on the problems and under the judgement of the surface suites: what may not be read is a signalling NaN or
// traps, what may not be written is compared bit by bit.
#include <string>
#include <vector>

#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/registry.h"
#include "tests/support/finite_only.h"
#include "tests/support/tiers.h"

namespace qtb::surface {
namespace {

constexpr Scalar some = {0.7, -0.9}, other = {-0.9, 0.2}, one = {1, 0}, minus_one = {-1, 0}, none = {0, 0},
                 minus_none = {-0.0, 0};
constexpr Scalar usual_alphas[] = {some, one, minus_one, some}, usual_betas[] = {none, one, other};
constexpr char uplos[] = {'U', 'l'}, transes[] = {'n', 'C'};  // the shape makes a legal letter of it

template <ShapeName shape, class T, class R>
class RankKSweeps {
 public:
  RankKSweeps(const R &routine, const std::string &label) : routine_(routine), label_(label) {}

  // Every order of a few strips with depths around eight, each depth with two of the four forms of an order.
  void small_orders() const {
    Session session(label(), {});
    for (QtbInt n = 0; n <= 40; ++n)
      for (const QtbInt k : {0, 1, 7, 8, 9, 29})
        for (int form = static_cast<int>((n + k) % 2); form < 4; form += is_long() ? 1 : 2)
          if (!try_one(problem(n, k, form), session)) return;
  }
  // Two chunks and more, two tiles and more; each order with two of the four forms, of which every tier takes its own.
  void orders_around_chunks_and_tiles() const {
    Session session(label(), {});
    const int first = static_cast<int>(Draw(seed_of(label(), 0)).bits() % 2);
    for (const QtbInt n : {64, 65, 71, 72, 73, 127, 128, 129, 143, 144, 145})
      for (int form = (first + static_cast<int>(n)) % 2; form < 4; form += is_long() ? 1 : 2)
        if (!try_one(problem(n, 1 + (n + 3 * form) % 9, form), session)) return;
    if (!try_one(problem(73, 75, first), session)) return;
    try_one(problem(257, 2, 3 - first), session);
  }
  // A row of the copy holds 36, 72 or 144 elements of the depth.
  void depths_around_slices() const {
    Session session(label(), {});
    for (const QtbInt k : {35, 36, 37, 71, 72, 73, 107, 108, 109, 143, 144, 145, 289})
      for (const QtbInt n : {4, 5, 6})
        for (int form = 0; form < 4; ++form)
          if (!try_one(problem(n, k, form), session)) return;
  }
  // Factors that are treated apart; a zero of either sign.
  void factors() const {
    Session session(label(), {});
    int form = 0;
    for (const QtbInt n : {3, 4, 5, 11, 12, 19, 20, 21, 73, 129})
      for (const QtbInt k : {0, 1, 9})
        for (const Scalar alpha : {none, minus_none, one, some})
          for (const Scalar beta : {none, minus_none, one, minus_one, other}) {
            if (n > 70 && ++form % 7 != 0 && !is_long()) continue;
            Problem p = problem(n, k, ++form % 4);
            p.alpha = alpha, p.beta = beta;
            if (!try_one(p, session)) return;
          }
  }
  void whole_numbers_are_exact() const {
    Session session(label(), {});
    for (int number = 0; number < times(40); ++number)
      if (!try_one(draw_problem(seed_of(label(), 200000 + number), Values::exact), session)) return;
  }
  // Numbers whose products are just within the range: a lane that holds anything else than an element's own would leave
  // it. The other triangle holds what must not be touched.
  void no_lane_leaves_the_range() const {
    using P = Real<T>;
    constexpr bool single = sizeof(P) == sizeof(float);
    const P largest = single ? P(1e18) : P(1e153);
    // Imaginary parts may cancel but for a last digit, which has to stay in the range as well.
    const P least = is_complex<T> ? (single ? P(1e-15) : P(1e-145)) : (single ? P(1e-18) : P(1e-153));
    for (const P size : {largest, least})
      for (QtbInt n = 1; n <= 13; ++n)
        for (const QtbInt k : {1, 2, 3, 5, 8, 40})
          for (int form = 0; form < 4; ++form) {
            Problem p = problem(n, k, form);
            p.alpha = one, p.beta = form % 2 == 0 ? one : none;
            p.spare[0] = p.spare[1] = p.spare[2] = 0;
            const calls::Description d = calls::describe<shape>(p, routine_.kind());
            std::vector<T> a(static_cast<std::size_t>(d.a.layout.extent())), c(static_cast<std::size_t>(n * n));
            fill(a, size), fill(c, size * size);
            calls::Scalars<T> scalars(d);
            const typename Shape<shape>::Call call(
                scalars.template arguments<shape>(a.data(), nullptr, c.data(), nullptr, nullptr, nullptr));
            const test::FiniteOnly trapping;
            call([&](auto... arguments) { return routine_.call(false, arguments...); });
          }
  }

 private:
  static void fill(std::vector<T> &elements, Real<T> size) {
    int number = 0;
    for (T &e : elements) {
      const Real<T> next = size + size / 8 * static_cast<Real<T>>(++number % 5);
      if constexpr (is_complex<T>)
        e = {next, size};
      else
        e = next;
    }
  }
  const char *label() const { return label_.c_str(); }
  Problem problem(QtbInt n, QtbInt k, int form) const {
    Problem p = draw_problem(seed_of(label(), static_cast<int>(n * 10000 + k * 10) + form), Values::rounding);
    Draw draw(p.seed);
    p.n = n, p.k = k;
    p.uplo = uplos[form % 2], p.transa = transes[form / 2];
    p.alpha = draw.one_of(usual_alphas), p.beta = draw.one_of(usual_betas);
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
void register_procedure(const std::string &name, int tier, Function *procedure) {
  if (!test::processor_runs(tier)) return;
  static std::vector<std::unique_ptr<std::string>> labels;  // outlive the tests
  labels.push_back(std::make_unique<std::string>(name + " " + test::tier_name(tier)));
  const char *label = labels.back()->c_str();
  const Routine<Function> routine(label, calls::kind_of<T>(name), procedure, procedure);
  const RankKSweeps<shape, T, Routine<Function>> sweeps(routine, label);
  register_test("orders_of_a_few_strips_lie_within_the_bound", label, [=] { sweeps.small_orders(); });
  register_test("orders_around_chunks_and_tiles_lie_within_the_bound", label,
                [=] { sweeps.orders_around_chunks_and_tiles(); });
  register_test("depths_around_slices_lie_within_the_bound", label, [=] { sweeps.depths_around_slices(); });
  register_test("factors_that_are_treated_apart_lie_within_the_bound", label, [=] { sweeps.factors(); });
  register_test("results_in_whole_numbers_are_exact", label, [=] { sweeps.whole_numbers_are_exact(); });
  register_test("no_lane_leaves_the_range", label, [=] { sweeps.no_lane_leaves_the_range(); });
}

template <ShapeName shape, class T, class Function>
void register_routine_of_tiers(const char *name, Function *const (&procedures)[tier_count]) {
  for (int tier = 0; tier < tier_count; ++tier) register_procedure<shape, T>(name, tier, procedures[tier]);
}

void register_all() {
#define QTB_RANK_K(X)    \
  X(ssyrk, syrk, float)  \
  X(dsyrk, syrk, double) \
  X(csyrk, syrk, cfloat) X(zsyrk, syrk, cdouble) X(cherk, herk, cfloat) X(zherk, herk, cdouble)
#define QTB_REGISTER(name, shape, T) \
  register_routine_of_tiers<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name, QTB_ALL_TIERS(name));
  QTB_RANK_K(QTB_REGISTER)
#undef QTB_REGISTER
  static_assert(tier_set::PIECES == (tier_set::SSSE3 | tier_set::SSE42 | tier_set::AVX),
                "tests/kernels/level3/rank_k_test.cpp: write the new tier behind ssse3, sse42 and avx");
#define QTB_REGISTER_BODIES(name, shape, T)                                                  \
  register_procedure<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name "_body", tier_ssse3,      \
                                                             qtb_blas_ssse3_x##name##_body); \
  register_procedure<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name "_body", tier_sse42,      \
                                                             qtb_blas_sse42_x##name##_body); \
  register_procedure<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name "_body", tier_avx, qtb_blas_avx_x##name##_body);
  QTB_RANK_K(QTB_REGISTER_BODIES)
#undef QTB_REGISTER_BODIES
#undef QTB_RANK_K
}

}  // namespace
}  // namespace qtb::surface

int main(int argc, char **argv) {
  testing::InitGoogleTest(&argc, argv);
  qtb::surface::register_all();
  std::signal(SIGSEGV, qtb::surface::on_trap);
  std::signal(SIGFPE, qtb::surface::on_trap);
  std::signal(SIGILL, qtb::surface::on_trap);
  const int result = RUN_ALL_TESTS();
  qtb::surface::report();
  return result;
}
