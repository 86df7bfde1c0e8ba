// The partition strategies of a parallel GEMM with the kernels that they are made for, on real teams of a made-up
// machine: every plan that its selector comes to, on small matrices and with small blocks, so that each kind of edge of
// blocks, shares and register tiles is there. Each result is judged by the oracle.

#include <set>
#include <tuple>

#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "tests/thread/level3/gemm_machines.h"
#include "tests/thread/level3/gemm_problem.h"

namespace qtb::test {
namespace {

template <class T>
struct Planned {
  GemmPlan<T> plan{};
  GemmPanelSet<T> panels{};

  bool packs_own() const { return panels.acopy_n != nullptr && panels.bcopy_n != nullptr; }
  // Whether the strategy adds to C.
  bool needs_beta_1() const { return plan.kb != 0 || panels.acopy_n != nullptr || panels.bcopy_n != nullptr; }
};

// Completes a plan for the problem and runs it as the region of the driver does.
template <class T>
void run(Planned<T> planned, GemmProblem<T> &p, int team) {
  GemmPlan<T> &plan = planned.plan;
  GemmPanelSet<T> &panels = planned.panels;
  const GemmShape &s = p.shape;
  plan.a_is_n = is_letter(s.transa, 'N'), plan.b_is_n = is_letter(s.transb, 'N');
  plan.a_is_t = is_letter(s.transa, 'T'), plan.b_is_t = is_letter(s.transb, 'T');
  plan.acopy = plan.a_is_n ? panels.acopy_n : plan.a_is_t || !is_complex<T> ? panels.acopy_t : panels.acopy_c;
  plan.bcopy = plan.b_is_n ? panels.bcopy_n : plan.b_is_t || !is_complex<T> ? panels.bcopy_t : panels.bcopy_c;
  panels.a_panel_bytes = panel_bytes<T>(plan.mb, plan.kb);
  panels.b_panel_bytes = panel_bytes<T>(plan.nb, plan.kb);
  void *const a = recorded_malloc(static_cast<std::uint64_t>(plan.a_buffers * panels.a_panel_bytes), 128);
  void *const b = recorded_malloc(static_cast<std::uint64_t>(plan.b_buffers * panels.b_panel_bytes), 128);
  plan.a_shared = align_panel<T>(a);
  plan.b_shared = align_panel<T>(b);
#pragma omp parallel num_threads(team)
  plan.strategy(&s.transa, &s.transb, &s.m, &s.n, &s.k, &p.alpha, p.a.data(), &p.lda, p.b.data(), &p.ldb, &p.beta,
                p.c.data(), &p.ldc, &panels, &plan);
  recorded_free(a);
  recorded_free(b);
  ASSERT_EQ(recorded_memory.faults, 0);
  recorded_memory.forget();
}

template <class T>
struct Selector;
#define QTB_SELECTOR(t, T)                                     \
  template <>                                                  \
  struct Selector<T> {                                         \
    static constexpr auto select = &qtb_blas_##t##gemm_select; \
  };
QTB_FOR_EACH_GEMM(QTB_SELECTOR)

// use(plan, team) for each of the machine's plans, which differ in strategy, kernel, threads or grid.
template <class T, class Use>
void for_each_plan(Use use) {
  constexpr QtbInt shapes[][3] = {{100, 90, 100},    {90, 100, 100},     {300, 20, 100},    {20, 900, 100},
                                  {8000, 3000, 512}, {2000, 2000, 600},  {512, 900, 300},   {1500, 1500, 500},
                                  {800, 801, 160},   {9999, 5001, 2000}, {7001, 3000, 512}, {390, 1000, 1000}};
  std::set<std::tuple<const void *, const void *, QtbInt, QtbInt>> seen;
  std::vector<int> teams = {2, 3, 4, 5, 8, 10};
  if (machine.machine_class == machine_sse41_small_l2) teams.push_back(24);  // the one class that looks for it
  for (const int team : teams)
    for (const auto &shape : shapes) {
      Planned<T> planned;
      planned.plan.nthreads = team;
      planned.plan.machine_class = machine.machine_class;
      qtb_serv_get_cache_sizes(planned.plan.cache);
      Selector<T>::select(&shape[0], &shape[1], &shape[2], &planned.panels, &planned.plan);
      const GemmPlan<T> &plan = planned.plan;
      if (!seen.insert({reinterpret_cast<const void *>(plan.strategy), reinterpret_cast<const void *>(plan.kernel.gemm),
                        plan.nthreads, plan.grid_rows})
               .second)
        continue;
      SCOPED_TRACE(testing::Message() << "as for " << shape[0] << ' ' << shape[1] << ' ' << shape[2] << " on "
                                      << plan.nthreads << " of " << team << " threads, " << plan.grid_rows << " rows");
      ASSERT_NO_FATAL_FAILURE(use(planned, team));
    }
  std::printf("%s: %zu plans\n", machine.name, seen.size());
}

// A problem for a plan, whose blocks may be made a few register tiles.
template <class T>
GemmProblem<T> problem_for(Planned<T> &planned, bool small_blocks, std::uint64_t seed) {
  std::mt19937_64 random(seed);
  const auto pick = [&](std::initializer_list<QtbInt> from) { return from.begin()[random() % from.size()]; };
  GemmPlan<T> &plan = planned.plan;
  const QtbInt t = plan.nthreads, mu = planned.panels.mu;
  GemmShape s;
  s.transa = letters[seed % 6], s.transb = letters[seed / 6 % 6];
  s.m = pick({1, t, 7, 8 * t - 1, 8 * t, 8 * t + 5, 16 * t + 13, 41});
  s.n = pick({1, t, 7, 8 * t - 1, 8 * t, 8 * t + 5, 16 * t + 3, 33});
  s.k = pick({1, 5, 31, 32, 33, 67, 130, 131});
  if (planned.packs_own()) s.m = std::max(s.m, mu * t + pick({0, 1, 15}));  // less is no share
  s.flush = seed % 2 == 0 ? Flush::back : Flush::front;
  s.seed = seed;
  s.whole_numbers = t > 4;  // the oracle takes its time
  const bool beta_is_1 = planned.needs_beta_1();
  if (small_blocks && plan.kb != 0) {
    plan.mb = mu * pick({1, 2, 3});
    plan.nb = planned.panels.nu * (planned.packs_own() ? 1 : pick({2, 3}));
    plan.kb = pick({32, 64});
  }
  const double part = s.whole_numbers ? 1 : 0.25;
  const T beta = beta_is_1 ? number<T>(1) : number<T>(part * static_cast<double>(pick({4, 5})), part);
  return GemmProblem<T>(s, number<T>(5 * part, -2 * part), seed % 3 == 0 && !beta_is_1 ? number<T>(0) : beta);
}

template <class T>
void every_plan() {
  std::uint64_t seed = 0;
  for_each_plan<T>([&](const Planned<T> &selected, int team) {
    for (int i = 0; i < 6; ++i) {
      Planned<T> planned = selected;
      GemmProblem<T> p = problem_for(planned, i % 4 != 3, seed++);
      SCOPED_TRACE(testing::Message() << "blocks " << planned.plan.mb << ' ' << planned.plan.nb << ' '
                                      << planned.plan.kb << ": " << text_of(p.shape));
      ASSERT_NO_FATAL_FAILURE(run(planned, p, team));
      if (p.shape.whole_numbers)
        p.expect_exact();
      else
        p.expect_within_bound();
      ASSERT_FALSE(testing::Test::HasFailure());
    }
    // The same team gives the same bits, whichever thread is the first.
    Planned<T> planned = selected;
    GemmProblem<T> p = problem_for(planned, true, seed++);
    std::vector<T> first;
    for (int i = 0; i < 10; ++i) {
      p.restore();
      ASSERT_NO_FATAL_FAILURE(run(planned, p, team));
      if (i == 0) first.assign(p.c.data(), p.c.data() + p.c.size());
      ASSERT_EQ(std::memcmp(first.data(), p.c.data(), first.size() * sizeof(T)), 0) << "run " << i;
    }
  });
}

TEST(GemmStrategy, EveryPlanInSinglePrecision) { every_plan<float>(); }
TEST(GemmStrategy, EveryPlanInDoublePrecision) { every_plan<double>(); }
TEST(GemmStrategy, EveryPlanInSingleComplex) { every_plan<cfloat>(); }
TEST(GemmStrategy, EveryPlanInDoubleComplex) { every_plan<cdouble>(); }

// As wide as a panel may be, with a depth that fills it: nothing is written behind the panel.
TEST(GemmStrategy, FullPanelsHoldWhatIsPacked) {
  if (machine.machine_class != machine_ssse3) GTEST_SKIP() << "a strategy of another machine";
  for (const QtbInt n : {QtbInt{3001}, QtbInt{3002}, QtbInt{3003}, QtbInt{3004}}) {
    Planned<double> planned;
    planned.plan.nthreads = 2;
    planned.plan.machine_class = machine.machine_class;
    const QtbInt tall = 8000;
    GemmShape s;
    s.m = 40, s.n = n, s.k = 256, s.whole_numbers = true;
    Selector<double>::select(&tall, &s.n, &s.k, &planned.panels, &planned.plan);
    ASSERT_EQ(planned.plan.strategy, &qtb_blas_dgemm_1d_with_copy_0);
    GemmProblem<double> p(s, 2, 1);
    ASSERT_NO_FATAL_FAILURE(run(planned, p, 2));
    p.expect_exact();
  }
}

}  // namespace
}  // namespace qtb::test
