// The partition strategies of a parallel GEMM with the kernels that they are made for, on real teams: with plans by
// the selectors, for pretended machine classes and teams, and with plans by hand, whose blocks are small, so that small
// matrices have every kind of edge. Each result is judged by the oracle.
//
// The table of outcomes takes up what the file has of length: it stands apart from the selectors', as their check.

#include <gtest/gtest.h>
#include <omp.h>

#include <algorithm>
#include <cstdio>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "tests/thread/checked_memory.h"
#include "tests/thread/gemm_machines.h"
#include "tests/thread/gemm_problem.h"

namespace qtb::test {
namespace {

const GemmMachine &machine = named_machine();

std::map<std::string, long> runs;
std::map<std::string, double> worst;

void note(const std::string &what, double ratio) {
  ++runs[what];
  worst[what] = std::fmax(worst[what], ratio);
}

class Machine : public testing::Environment {
  void SetUp() override {
    become(machine);
    use_checked_memory();
  }
  void TearDown() override {
    for (const auto &[what, count] : runs)
      std::printf("%-16s %-28s runs %ld; worst error/bound %.3f\n", machine.name, what.c_str(), count, worst[what]);
    EXPECT_EQ(checked_memory.outstanding, 0);
    EXPECT_EQ(checked_memory.overruns, 0);
  }
};
const testing::Environment *const machine_environment = testing::AddGlobalTestEnvironment(new Machine);

// ---- A strategy on a team ----

template <class T>
struct Planned {
  GemmPlan<T> plan{};
  GemmPanelSet<T> panels{};
};

bool is_letter(char given, char upper) { return given == upper || given == upper + ('a' - 'A'); }

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
  void *const a =
      plan.a_buffers > 0 ? checked_malloc(static_cast<std::size_t>(plan.a_buffers * panels.a_panel_bytes)) : nullptr;
  void *const b =
      plan.b_buffers > 0 ? checked_malloc(static_cast<std::size_t>(plan.b_buffers * panels.b_panel_bytes)) : nullptr;
  plan.a_shared = align_panel<T>(a);
  plan.b_shared = align_panel<T>(b);
#pragma omp parallel num_threads(team)
  {
    const GemmPlan<T> own_plan = plan;
    const GemmPanelSet<T> own_panels = panels;
    plan.strategy(&s.transa, &s.transb, &s.m, &s.n, &s.k, &p.alpha, p.a.data(), &p.lda, p.b.data(), &p.ldb, &p.beta,
                  p.c.data(), &p.ldc, &own_panels, &own_plan);
  }
  if (a != nullptr) checked_free(a);
  if (b != nullptr) checked_free(b);
}

// ---- The outcomes that a machine's kernels allow, with plans by hand ----

template <class T>
struct Outcome {
  std::string name;
  bool needs_beta_1;
  Planned<T> (*plan)(QtbInt t, QtbInt rows);
};

template <class T>
struct Named;
#define QTB_NAMED(t, T)                                     \
  template <>                                               \
  struct Named<T> {                                         \
    static constexpr auto row = &qtb_blas_##t##gemm_1d_row; \
    static constexpr auto col = &qtb_blas_##t##gemm_1d_col; \
    static constexpr auto own = &qtb_blas_##t##gemm_2d_abcopy_abx_m_km_par_p;
#define QTB_NAMED_REAL(t, T)                                     \
  QTB_NAMED(t, T)                                                \
  static constexpr auto grid = &qtb_blas_##t##gemm_2d_grid;      \
  static constexpr auto blocks = &qtb_blas_##t##gemm_2d_xgemm_p; \
  }                                                              \
  ;
#define QTB_NAMED_COMPLEX(t, T)                               \
  QTB_NAMED(t, T)                                             \
  static constexpr auto pairs = &qtb_blas_##t##gemm_2d_bcopy; \
  }                                                           \
  ;
QTB_NAMED_REAL(s, float)
QTB_NAMED_REAL(d, double)
QTB_NAMED_COMPLEX(c, cfloat)
QTB_NAMED_COMPLEX(z, cdouble)

template <class T>
Planned<T> on_grid(QtbInt t, QtbInt rows) {
  Planned<T> p;
  p.plan.nthreads = t;
  p.plan.grid_rows = rows;
  p.plan.grid_cols = t / rows;
  return p;
}

template <class T>
Planned<T> in_pairs(QtbInt t, QtbInt rows) {
  Planned<T> p = on_grid<T>(t, rows);
  p.plan.strategy = Named<T>::pairs;
  p.plan.b_buffers = static_cast<std::int32_t>(t);
  p.plan.nb = 16;
  return p;
}

template <class T>
std::vector<Outcome<T>> outcomes() {
  using Slots = GemmSlots<T>;
  std::vector<Outcome<T>> all;
  all.push_back({"rows", false, [](QtbInt t, QtbInt rows) {
                   Planned<T> p = on_grid<T>(t, rows);
                   p.plan.strategy = Named<T>::row;
                   p.plan.kernel.gemm = Slots::gemm;
                   return p;
                 }});
  all.push_back({"columns", false, [](QtbInt t, QtbInt rows) {
                   Planned<T> p = on_grid<T>(t, rows);
                   p.plan.strategy = Named<T>::col;
                   p.plan.kernel.gemm = Slots::gemm;
                   return p;
                 }});
  const bool ssse3 = machine.tier == tier_ssse3, sse42 = machine.tier == tier_sse42;
  if constexpr (!is_complex<T>) {
    if (ssse3 || sse42)
      all.push_back({"grid in place", false, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = Named<T>::grid;
                       p.plan.kernel.gemm = Slots::nobcopy;
                       p.panels.blocks = Slots::blocks;
                       return p;
                     }});
    if (ssse3) {
      all.push_back({"grid", false, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = Named<T>::grid;
                       p.plan.kernel.gemm = Slots::sse41;
                       p.panels.blocks = Slots::sse41_blocks;
                       return p;
                     }});
      all.push_back({"blocks", true, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = Named<T>::blocks;
                       p.plan.kernel.gemm = Slots::gemm;
                       p.panels.blocks = Slots::sse41_blocks;
                       p.plan.mb = 24, p.plan.nb = 20, p.plan.kb = 32;
                       return p;
                     }});
    }
  }
  if (ssse3)
    all.push_back({"own panels", true, [](QtbInt t, QtbInt rows) {
                     Planned<T> p = on_grid<T>(t, rows);
                     p.plan.strategy = Named<T>::own;
                     p.plan.kernel.packed = Slots::sse41_packed;
                     p.panels.blocks = Slots::sse41_blocks;
                     p.panels.acopy_n = Slots::sse41_acopy_n;
                     p.panels.acopy_t = Slots::sse41_acopy_t;
                     p.panels.acopy_c = Slots::sse41_acopy_c;
                     p.panels.bcopy_n = Slots::sse41_bcopy_n;
                     p.panels.bcopy_t = Slots::sse41_bcopy_t;
                     p.panels.bcopy_c = Slots::sse41_bcopy_c;
                     p.plan.mb = 16, p.plan.nb = 8;
                     return p;
                   }});
  if constexpr (is_complex<T>) {
    if (ssse3 || sse42)
      all.push_back({"pairs", true, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = in_pairs<T>(t, rows);
                       p.plan.kernel.bpacked = Slots::bpacked;
                       p.panels.blocks = Slots::blocks;
                       p.panels.bcopy_n = Slots::bcopy_n;
                       p.panels.bcopy_t = Slots::bcopy_t;
                       p.panels.bcopy_c = Slots::bcopy_c;
                       return p;
                     }});
    if (ssse3)
      all.push_back({"pairs sse41", true, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = in_pairs<T>(t, rows);
                       p.plan.kernel.bpacked = Slots::sse41;
                       p.panels.blocks = Slots::sse41_blocks;
                       p.panels.bcopy_n = Slots::sse41_bcopy_n;
                       p.panels.bcopy_t = Slots::sse41_bcopy_t;
                       p.panels.bcopy_c = Slots::sse41_bcopy_c;
                       return p;
                     }});
  }
  if constexpr (std::is_same_v<T, double>) {
    if (ssse3)
      all.push_back({"shared B", true, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = &qtb_blas_dgemm_1d_with_copy_0;
                       p.plan.kernel.bpacked = &qtb_blas_xdgemm_bpacked;
                       p.panels.blocks = &qtb_blas_xdgemm_blocks;
                       p.panels.bcopy_n = &qtb_blas_xdgemm_bcopy_n;
                       p.panels.bcopy_t = &qtb_blas_xdgemm_bcopy_t;
                       p.plan.b_buffers = 1;
                       p.plan.mb = 12, p.plan.nb = 24;
                       return p;
                     }});
    if (sse42)
      all.push_back({"shared A", true, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = &qtb_blas_dgemm_2d_acopy_n;
                       p.plan.kernel.apacked = &qtb_blas_xdgemm_apacked;
                       p.panels.blocks = &qtb_blas_xdgemm_blocks;
                       p.panels.acopy_n = &qtb_blas_xdgemm_acopy_n;
                       p.panels.acopy_t = &qtb_blas_xdgemm_acopy_t;
                       p.plan.a_buffers = static_cast<std::int32_t>(rows);
                       p.plan.mb = 32, p.plan.nb = 10000;
                       return p;
                     }});
    if (machine.tier == tier_def) {
      all.push_back({"grid a", false, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = Named<T>::grid;
                       p.plan.kernel.gemm = &qtb_blas_xdgemm_def_run_a;
                       p.panels.blocks = &qtb_blas_xdgemm_def_blocks_a;
                       return p;
                     }});
      all.push_back({"grid b", false, [](QtbInt t, QtbInt rows) {
                       Planned<T> p = on_grid<T>(t, rows);
                       p.plan.strategy = Named<T>::grid;
                       p.plan.kernel.gemm = &qtb_blas_xdgemm_def_run_b;
                       p.panels.blocks = &qtb_blas_xdgemm_def_blocks_b;
                       return p;
                     }});
    }
  }
  return all;
}

constexpr char letters[] = {'N', 'T', 'C', 'n', 't', 'c'};
constexpr int teams[] = {2, 3, 4, 5, 8};

template <class T>
constexpr const char *prefix = "?";
template <>
constexpr const char *prefix<float> = "s";
template <>
constexpr const char *prefix<double> = "d";
template <>
constexpr const char *prefix<cfloat> = "c";
template <>
constexpr const char *prefix<cdouble> = "z";

// The rows of threads that a strategy may be given with t threads.
std::vector<QtbInt> rows_of_grids(const std::string &name, QtbInt t) {
  if (name.starts_with("grid")) return t % 4 == 0 ? std::vector<QtbInt>{1, 2, 4, t} : std::vector<QtbInt>{1, t};
  if (name == "shared A" && t % 4 == 0) return {2, 4};
  return {2};
}

template <class T>
void by_hand() {
  if (!stands_for_its_tier(machine)) GTEST_SKIP() << "these depend on the tier alone";
  std::mt19937_64 random(7);
  const auto pick = [&](std::initializer_list<QtbInt> from) { return from.begin()[random() % from.size()]; };
  std::uint64_t seed = 0;
  for (const Outcome<T> &outcome : outcomes<T>()) {
    const std::string name = std::string(prefix<T>) + " " + outcome.name;
    const bool any_team = outcome.name == "rows" || outcome.name == "columns";
    for (const int team : teams)
      for (const QtbInt rows : rows_of_grids(outcome.name, any_team ? team : team / 2 * 2))
        for (int i = 0; i < 12; ++i) {
          const QtbInt t = any_team ? team : team / 2 * 2;
          GemmShape s;
          s.transa = letters[seed % 6];
          s.transb = letters[seed / 6 % 6];
          s.m = pick({1, t, 7, 8 * t - 1, 8 * t, 8 * t + 5, 16 * t + 13, 41});
          s.n = pick({1, t, 7, 8 * t - 1, 8 * t, 8 * t + 5, 16 * t + 3, 33});
          s.k = pick({1, 5, 31, 32, 33, 67, 130, 131});
          if (outcome.name == "own panels") s.m = std::max(s.m, 8 * t + pick({0, 1, 15}));
          s.flush = seed % 2 == 0 ? Flush::back : Flush::front;
          s.seed = seed++;
          const T alpha = number<T>(1.25, -0.5);
          const T beta = outcome.needs_beta_1 ? number<T>(1) : number<T>(pick({0, 1, 2}), 0.5);
          GemmProblem<T> p(s, alpha, s.seed % 3 == 0 && !outcome.needs_beta_1 ? number<T>(0) : beta);
          Planned<T> planned = outcome.plan(t, rows);
          if (planned.panels.blocks != nullptr) {
            if (i % 2 == 0 && planned.plan.kb == 0) planned.plan.kb = 32;
            if (i % 4 == 3) planned.plan.mb = planned.plan.nb = 0;
            if (i % 4 == 3 && outcome.name == "own panels") planned.plan.nb = 8;
            planned.panels.blocks(&s.m, &s.n, &s.k, &planned.plan.mb, &planned.plan.nb, &planned.plan.kb,
                                  &planned.panels.mu, &planned.panels.nu, &planned.panels.ku);
          }
          SCOPED_TRACE(name + " on " + std::to_string(t) + " of " + std::to_string(team) + " threads in " +
                       std::to_string(rows) + " rows, blocks " + std::to_string(planned.plan.mb) + " " +
                       std::to_string(planned.plan.nb) + " " + std::to_string(planned.plan.kb));
          run(planned, p, team);
          note(name, p.expect_within_bound());
          if (testing::Test::HasFailure()) return;
        }
  }
}

TEST(GemmStrategy, PlansByHandInSinglePrecision) { by_hand<float>(); }
TEST(GemmStrategy, PlansByHandInDoublePrecision) { by_hand<double>(); }
TEST(GemmStrategy, PlansByHandInSingleComplex) { by_hand<cfloat>(); }
TEST(GemmStrategy, PlansByHandInDoubleComplex) { by_hand<cdouble>(); }

// The same team gives the same bits, whichever thread is the first.
template <class T>
void same_bits_again() {
  if (!stands_for_its_tier(machine)) GTEST_SKIP() << "these depend on the tier alone";
  for (const Outcome<T> &outcome : outcomes<T>()) {
    GemmShape s;
    s.m = 67, s.n = 53, s.k = 77;
    s.transb = 'T';
    GemmProblem<T> p(s, number<T>(1.25, -0.5), number<T>(1));
    Planned<T> planned = outcome.plan(4, 2);
    if (planned.panels.blocks != nullptr) {
      if (planned.plan.kb == 0) planned.plan.kb = 32;
      planned.panels.blocks(&s.m, &s.n, &s.k, &planned.plan.mb, &planned.plan.nb, &planned.plan.kb, &planned.panels.mu,
                            &planned.panels.nu, &planned.panels.ku);
    }
    std::vector<T> first;
    for (int i = 0; i < 100; ++i) {
      p.restore();
      run(planned, p, 5);
      if (i == 0) {
        p.expect_within_bound();
        first.assign(p.c.data(), p.c.data() + p.c.size());
      }
      ASSERT_EQ(std::memcmp(first.data(), p.c.data(), first.size() * sizeof(T)), 0) << outcome.name << ", run " << i;
    }
  }
}

TEST(GemmStrategy, SameTeamGivesTheSameBitsInSinglePrecision) { same_bits_again<float>(); }
TEST(GemmStrategy, SameTeamGivesTheSameBitsInDoublePrecision) { same_bits_again<double>(); }
TEST(GemmStrategy, SameTeamGivesTheSameBitsInSingleComplex) { same_bits_again<cfloat>(); }
TEST(GemmStrategy, SameTeamGivesTheSameBitsInDoubleComplex) { same_bits_again<cdouble>(); }

// ---- Plans by the selector ----

template <class T>
struct Selector;
#define QTB_SELECTOR(t, T)                                     \
  template <>                                                  \
  struct Selector<T> {                                         \
    static constexpr auto select = &qtb_blas_##t##gemm_select; \
  };
QTB_FOR_EACH_GEMM(QTB_SELECTOR)

template <class T>
std::string name_of(GemmStrategy<T> *strategy) {
#define QTB_COMPARE(name, type)          \
  if constexpr (std::is_same_v<type, T>) \
    if (strategy == &qtb_blas_##name) return #name;
  QTB_FOR_EACH_GEMM_STRATEGY(QTB_COMPARE)
  return "?";
}

template <class T>
void selected(const GemmShape &s, int team, bool exact) {
  Planned<T> planned;
  planned.plan.nthreads = team;
  planned.plan.machine_class = machine.machine_class;
  qtb_serv_get_cache_sizes(planned.plan.cache);
  Selector<T>::select(&s.m, &s.n, &s.k, &planned.panels, &planned.plan);
  const std::string name = "selected " + name_of<T>(planned.plan.strategy);
  SCOPED_TRACE(name + " on " + std::to_string(team) + " threads");
  GemmProblem<T> p(s, exact ? number<T>(2, 1) : number<T>(1.25, -0.5), number<T>(1));
  run(planned, p, team);
  double ratio = 0;
  if (exact)
    p.expect_exact();
  else
    ratio = p.expect_within_bound();
  note(name, ratio);
}

template <class T>
void by_selector() {
  const QtbInt sizes[][3] = {{6, 100, 33},  {7, 9, 300},    {40, 40, 40},   {33, 150, 17},
                             {150, 33, 70}, {129, 65, 257}, {260, 130, 20}, {256, 130, 40},
                             {5, 260, 64},  {300, 3, 9},    {65, 520, 12},  {210, 210, 100}};
  std::uint64_t seed = 100;
  for (const int team : {2, 3, 4, 5, 7, 8, 16, 24, 25})
    for (const auto &size : sizes) {
      if (team > 8 && size[0] * size[1] * size[2] > 1000000) continue;
      GemmShape s;
      s.m = size[0], s.n = size[1], s.k = size[2];
      s.transa = letters[seed % 6];
      s.transb = letters[seed / 6 % 6];
      s.flush = seed % 2 == 0 ? Flush::back : Flush::front;
      s.seed = seed++;
      selected<T>(s, team, false);
      if (testing::Test::HasFailure()) return;
    }
}

TEST(GemmStrategy, PlansByTheSelectorInSinglePrecision) { by_selector<float>(); }
TEST(GemmStrategy, PlansByTheSelectorInDoublePrecision) { by_selector<double>(); }
TEST(GemmStrategy, PlansByTheSelectorInSingleComplex) { by_selector<cfloat>(); }
TEST(GemmStrategy, PlansByTheSelectorInDoubleComplex) { by_selector<cdouble>(); }

// Sizes at which the selectors turn to the strategies for large problems, in whole numbers, exactly.
TEST(GemmStrategy, LargeProblemsAreExact) {
  std::uint64_t seed = 900;
  const auto shape = [&](QtbInt m, QtbInt n, QtbInt k) {
    GemmShape s;
    s.m = m, s.n = n, s.k = k;
    s.transa = letters[seed % 3];
    s.transb = letters[seed / 3 % 3];
    s.whole_numbers = true;
    s.seed = seed++;
    return s;
  };
  switch (machine.machine_class) {
    case machine_sse41_large_l2:
    case machine_sse41_small_l2:
      for (const int team : {2, 3, 4, 7}) {
        selected<double>(shape(1005, 1001, 153), team, true);
        selected<cfloat>(shape(803, 805, 151), team, true);
        selected<cdouble>(shape(403, 401, 201), team, true);
        selected<cfloat>(shape(257, 128, 40), team, true);
      }
      selected<double>(shape(3003, 1200, 130), 24, true);
      selected<double>(shape(601, 500, 260), 24, true);
      selected<double>(shape(601, 520, 260), 25, true);
      selected<float>(shape(2051, 2049, 515), 3, true);
      selected<float>(shape(705, 703, 513), 24, true);
      break;
    case machine_sse42:
      for (const int team : {2, 4, 8, 9, 12}) {
        selected<double>(shape(1003, 301, 203), team, true);
        selected<double>(shape(512, 301, 203), team, true);
        selected<double>(shape(203, 200, 701), team, true);
        selected<cdouble>(shape(401, 403, 405), team, true);
        selected<cfloat>(shape(203, 405, 65), team, true);
      }
      selected<double>(shape(2031, 129, 260), 8, true);
      break;
    default:
      for (const int team : {2, 3, 8}) {
        selected<double>(shape(403, 1601, 130), team, true);
        selected<double>(shape(1003, 703, 130), team, true);
        selected<float>(shape(403, 401, 330), team, true);
        selected<cdouble>(shape(403, 401, 130), team, true);
      }
      break;
  }
}

// Tall over a short depth, where the selector has one thing more to offer.
TEST(GemmStrategy, TallProductsShareOnePackedB) {
  if (machine.machine_class != machine_ssse3) GTEST_SKIP() << "a strategy of another machine";
  for (const int team : {2, 3}) {
    GemmShape s;
    s.m = 8001, s.n = 3001, s.k = team == 2 ? 5 : 9;
    s.transb = team == 2 ? 'N' : 'T';
    s.whole_numbers = true;
    selected<double>(s, team, true);
  }
}

// As wide as a panel may be, with a depth that fills it: nothing is written behind the panel.
TEST(GemmStrategy, FullPanelsHoldWhatIsPacked) {
  if (machine.machine_class != machine_ssse3) GTEST_SKIP() << "a strategy of another machine";
  for (const QtbInt n : {QtbInt{3001}, QtbInt{3002}, QtbInt{3003}, QtbInt{3004}}) {
    for (const Outcome<double> &outcome : outcomes<double>()) {
      if (outcome.name != "shared B") continue;
      GemmShape s;
      s.m = 40, s.n = n, s.k = 256, s.whole_numbers = true;
      GemmProblem<double> p(s, 2, 1);
      Planned<double> planned = outcome.plan(2, 1);
      planned.plan.mb = 512, planned.plan.nb = 0;
      planned.panels.blocks(&s.m, &s.n, &s.k, &planned.plan.mb, &planned.plan.nb, &planned.plan.kb, &planned.panels.mu,
                            &planned.panels.nu, &planned.panels.ku);
      run(planned, p, 2);
      p.expect_exact();
      EXPECT_EQ(checked_memory.overruns, 0) << "n " << n << " nb " << planned.plan.nb;
    }
  }
}

}  // namespace
}  // namespace qtb::test
